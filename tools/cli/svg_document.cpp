#include "svg_document.h"

#include <libxml/parser.h>
#include <libxml/tree.h>

#include <cerrno>
#include <cmath>
#include <cstring>
#include <fstream>
#include <sstream>
#include <sys/stat.h>

#include "failure.h"
#include "svg_path.h"

namespace tessarine::cli {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr double kMmPerPx = 25.4 / 96.0;
// Beyond a kilometre a number is no drawing a cutter can follow.
constexpr double kLargestMm = 1e6;
constexpr int kDeepest = 200;
constexpr size_t kLargestFile = size_t(256) << 20;

struct XmlText {
    xmlChar *text = nullptr;
    XmlText(xmlNode *node, const char *name) : text(xmlGetProp(node, reinterpret_cast<const xmlChar *>(name))) {}
    ~XmlText() { xmlFree(text); }
    XmlText(const XmlText &) = delete;
    XmlText &operator=(const XmlText &) = delete;
    bool Has() const { return text != nullptr; }
    std::string_view View() const { return text ? std::string_view(reinterpret_cast<const char *>(text)) : std::string_view(); }
};

Segment Make(Segment::Kind kind, std::initializer_list<Point> points) {
    Segment s{};
    s.kind = kind;
    size_t i = 0;
    for (const Point &p : points) s.p[i++] = p;
    return s;
}

struct XmlDoc {
    xmlDoc *doc = nullptr;
    ~XmlDoc() { xmlFreeDoc(doc); }
};

void Silent(void *, const char *, ...) {}
void SilentStructured(void *, xmlError *) {}

class SvgReader {
  public:
    explicit SvgReader(const std::string &name) : name_(name) {}

    Drawing Read(const std::string &text) {
        if (text.size() > kLargestFile) throw Failure(name_, "file too large for an SVG drawing");
        xmlSetGenericErrorFunc(nullptr, Silent);
        xmlSetStructuredErrorFunc(nullptr, SilentStructured);
        xmlResetLastError();
        XmlDoc doc;
        doc.doc = xmlReadMemory(text.data(), int(text.size()), name_.c_str(), nullptr,
                                XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING);
        if (doc.doc == nullptr) {
            const xmlError *e = xmlGetLastError();
            std::string what = e && e->message ? e->message : "not well-formed";
            while (!what.empty() && (what.back() == '\n' || what.back() == ' ')) what.pop_back();
            throw Failure(name_, "XML error" + (e ? " at line " + std::to_string(e->line) : std::string()) +
                                     ": " + what);
        }
        xmlNode *root = xmlDocGetRootElement(doc.doc);
        if (root == nullptr || !Is(root, "svg")) throw Failure(name_, "not an SVG document (no svg element)");
        const Affine page = PageTransform(root);
        Walk(root, page, 0);
        return std::move(drawing_);
    }

  private:
    static bool Is(xmlNode *node, const char *name) {
        return node->type == XML_ELEMENT_NODE && std::strcmp(reinterpret_cast<const char *>(node->name), name) == 0;
    }

    [[noreturn]] void Bad(xmlNode *node, const std::string &what) {
        throw Failure(name_, "line " + std::to_string(xmlGetLineNo(node)) + ": " + what);
    }

    // A length in user units (px); units mm, cm, in, pt, pc, px.
    double Length(xmlNode *node, const char *attribute, double fallback, bool required = false) {
        XmlText value(node, attribute);
        if (!value.Has()) {
            if (required) Bad(node, std::string("<") + reinterpret_cast<const char *>(node->name) + "> has no " + attribute);
            return fallback;
        }
        std::string_view v = value.View();
        while (!v.empty() && (v.back() == ' ' || v.back() == '\t' || v.back() == '\n')) v.remove_suffix(1);
        double scale = 1.0;
        struct Unit {
            const char *name;
            double px;
        };
        static constexpr Unit kUnits[] = {{"mm", 96.0 / 25.4}, {"cm", 96.0 / 2.54}, {"in", 96.0},
                                          {"pt", 96.0 / 72.0}, {"pc", 16.0},        {"px", 1.0}};
        for (const Unit &u : kUnits) {
            if (v.size() > 2 && v.substr(v.size() - 2) == u.name) {
                scale = u.px;
                v.remove_suffix(2);
                break;
            }
        }
        if (!v.empty() && v.back() == '%') Bad(node, std::string(attribute) + ": percentages are not supported");
        std::vector<double> numbers;
        PathError error;
        if (!ParseNumberList(v, numbers, error) || numbers.size() != 1)
            Bad(node, std::string(attribute) + ": bad length '" + std::string(value.View()) + "'" +
                          (error.what.empty() ? "" : " (" + error.what + ")"));
        const double length = numbers[0] * scale;
        if (!std::isfinite(length) || std::fabs(length) * kMmPerPx > kLargestMm)
            Bad(node, std::string(attribute) + ": number out of range");
        return length;
    }

    Affine PageTransform(xmlNode *root) {
        XmlText viewBox(root, "viewBox");
        double vx = 0, vy = 0, vw = 0, vh = 0;
        bool hasBox = false;
        if (viewBox.Has()) {
            std::vector<double> box;
            PathError error;
            if (!ParseNumberList(viewBox.View(), box, error) || box.size() != 4 || box[2] <= 0 || box[3] <= 0)
                Bad(root, "bad viewBox");
            vx = box[0], vy = box[1], vw = box[2], vh = box[3];
            hasBox = true;
        }
        const double width = Length(root, "width", hasBox ? vw : 0);
        const double height = Length(root, "height", hasBox ? vh : 0);
        if (width < 0 || height < 0) Bad(root, "negative page size");
        drawing_.widthMm = width * kMmPerPx;
        drawing_.heightMm = height * kMmPerPx;
        Affine page;
        if (hasBox) {
            // The default aspect rule: uniform scale, centred.
            const double sx = width > 0 ? width / vw : 1.0, sy = height > 0 ? height / vh : 1.0;
            const double s = std::min(sx, sy);
            page.a = page.d = s;
            page.e = -vx * s + (width > 0 ? (width - vw * s) / 2 : 0);
            page.f = -vy * s + (height > 0 ? (height - vh * s) / 2 : 0);
        }
        // Pixels to millimetres, and y turned up from the bottom of the page.
        Affine toCutter{kMmPerPx, 0, 0, -kMmPerPx, 0, drawing_.heightMm};
        return page.Then(toCutter);
    }

    Affine ParseTransform(xmlNode *node) {
        Affine result;
        XmlText value(node, "transform");
        if (!value.Has()) return result;
        std::string_view s = value.View();
        size_t i = 0;
        auto skip = [&] {
            while (i < s.size() && (s[i] == ' ' || s[i] == '\t' || s[i] == '\n' || s[i] == '\r' || s[i] == ','))
                ++i;
        };
        // The list applies right to left: the last transform acts first.
        std::vector<Affine> parts;
        skip();
        while (i < s.size()) {
            const size_t nameStart = i;
            while (i < s.size() && std::isalpha(static_cast<unsigned char>(s[i]))) ++i;
            const std::string_view name = s.substr(nameStart, i - nameStart);
            while (i < s.size() && (s[i] == ' ' || s[i] == '\t' || s[i] == '\n' || s[i] == '\r')) ++i;
            if (i >= s.size() || s[i] != '(') Bad(node, "bad transform '" + std::string(s) + "'");
            const size_t close = s.find(')', i);
            if (close == std::string_view::npos) Bad(node, "bad transform: no ')'");
            std::vector<double> v;
            PathError error;
            if (!ParseNumberList(s.substr(i + 1, close - i - 1), v, error))
                Bad(node, "bad transform: " + error.what);
            i = close + 1;
            Affine t;
            const size_t n = v.size();
            if (name == "matrix" && n == 6) {
                t = {v[0], v[1], v[2], v[3], v[4], v[5]};
            } else if (name == "translate" && (n == 1 || n == 2)) {
                t.e = v[0];
                t.f = n == 2 ? v[1] : 0;
            } else if (name == "scale" && (n == 1 || n == 2)) {
                t.a = v[0];
                t.d = n == 2 ? v[1] : v[0];
            } else if (name == "rotate" && (n == 1 || n == 3)) {
                const double r = v[0] * kPi / 180, c = std::cos(r), sn = std::sin(r);
                const double cx = n == 3 ? v[1] : 0, cy = n == 3 ? v[2] : 0;
                t = {c, sn, -sn, c, cx - c * cx + sn * cy, cy - sn * cx - c * cy};
            } else if (name == "skewX" && n == 1) {
                t.c = std::tan(v[0] * kPi / 180);
            } else if (name == "skewY" && n == 1) {
                t.b = std::tan(v[0] * kPi / 180);
            } else {
                Bad(node, "bad transform '" + std::string(name) + "' with " + std::to_string(n) + " numbers");
            }
            parts.push_back(t);
            skip();
        }
        for (auto it = parts.rbegin(); it != parts.rend(); ++it) result = result.Then(*it);
        return result;
    }

    void Walk(xmlNode *node, const Affine &outer, int depth) {
        if (depth > kDeepest) Bad(node, "elements nested too deep");
        for (xmlNode *child = node->children; child != nullptr; child = child->next) {
            if (child->type != XML_ELEMENT_NODE) continue;
            XmlText display(child, "display");
            if (display.Has() && display.View() == "none") continue;
            const Affine ctm = ParseTransform(child).Then(outer);
            if (!std::isfinite(ctm.a) || !std::isfinite(ctm.b) || !std::isfinite(ctm.c) ||
                !std::isfinite(ctm.d) || !std::isfinite(ctm.e) || !std::isfinite(ctm.f))
                Bad(child, "transform out of range");
            if (Is(child, "g") || Is(child, "a")) Walk(child, ctm, depth + 1);
            else if (Is(child, "path")) PathElement(child, ctm);
            else if (Is(child, "line")) LineElement(child, ctm);
            else if (Is(child, "polyline")) PolyElement(child, ctm, false);
            else if (Is(child, "polygon")) PolyElement(child, ctm, true);
            else if (Is(child, "rect")) RectElement(child, ctm);
            else if (Is(child, "circle")) EllipseElement(child, ctm, true);
            else if (Is(child, "ellipse")) EllipseElement(child, ctm, false);
        }
    }

    // ---- building outlines ----------------------------------------------------

    void Begin(Point p) {
        current_ = {};
        start_ = pen_ = p;
        open_ = true;
    }
    void Finish(bool closed) {
        if (open_ && !current_.segments.empty()) {
            current_.closed = closed;
            drawing_.outlines.push_back(std::move(current_));
        }
        current_ = {};
        open_ = false;
    }
    void Add(xmlNode *node, Segment s) {
        for (const Point &p : s.p)
            if (!std::isfinite(p.x) || !std::isfinite(p.y) || std::fabs(p.x) > kLargestMm || std::fabs(p.y) > kLargestMm)
                Bad(node, "coordinates out of range");
        current_.segments.push_back(s);
        pen_ = s.End();
    }
    void LineTo(xmlNode *node, const Affine &m, Point to) {
        Segment s = Make(Segment::Line, {m.Apply(pen_user_), m.Apply(to)});
        pen_user_ = to;
        Add(node, s);
    }
    void CubicTo(xmlNode *node, const Affine &m, Point c1, Point c2, Point to) {
        Segment s = Make(Segment::Cubic, {m.Apply(pen_user_), m.Apply(c1), m.Apply(c2), m.Apply(to)});
        pen_user_ = to;
        Add(node, s);
    }
    void ArcTo(xmlNode *node, const Affine &m, double rx, double ry, double rotation, bool large, bool sweep, Point to) {
        Affine unit;
        double theta = 0, delta = 0;
        bool isLine = false;
        if (!ArcCentreForm(pen_user_, rx, ry, rotation, large, sweep, to, unit, theta, delta, isLine)) {
            if (pen_user_.x == to.x && pen_user_.y == to.y) return; // an arc to itself draws nothing
            Bad(node, "arc out of range");
        }
        if (isLine) return LineTo(node, m, to);
        Segment s = Make(Segment::EllipseArc, {m.Apply(pen_user_), {}, {}, m.Apply(to)});
        s.circle = unit.Then(m);
        s.theta = theta;
        s.sweep = delta;
        const Affine &c = s.circle;
        if (!std::isfinite(c.a + c.b + c.c + c.d + c.e + c.f)) Bad(node, "arc out of range");
        pen_user_ = to;
        Add(node, s);
    }
    void MoveTo(const Affine &m, Point to) {
        pen_user_ = start_user_ = to;
        Begin(m.Apply(to));
    }

    void PathElement(xmlNode *node, const Affine &m) {
        XmlText d(node, "d");
        if (!d.Has()) return;
        std::vector<PathCommand> commands;
        PathError error;
        if (!ParsePathData(d.View(), commands, error))
            Bad(node, "bad path data at character " + std::to_string(error.offset + 1) + ": " + error.what);
        for (const PathCommand &c : commands) {
            const double *v = c.v;
            switch (c.kind) {
                case PathCommand::Move:
                    Finish(false);
                    MoveTo(m, {v[0], v[1]});
                    break;
                case PathCommand::Line: LineTo(node, m, {v[0], v[1]}); break;
                case PathCommand::Cubic: CubicTo(node, m, {v[0], v[1]}, {v[2], v[3]}, {v[4], v[5]}); break;
                case PathCommand::Quad: {
                    // A quadratic is a cubic with its handles two thirds of the way to the control point.
                    const Point p0 = pen_user_, q{v[0], v[1]}, p3{v[2], v[3]};
                    CubicTo(node, m, {p0.x + 2.0 / 3 * (q.x - p0.x), p0.y + 2.0 / 3 * (q.y - p0.y)},
                            {p3.x + 2.0 / 3 * (q.x - p3.x), p3.y + 2.0 / 3 * (q.y - p3.y)}, p3);
                    break;
                }
                case PathCommand::Arc: ArcTo(node, m, v[0], v[1], v[2], v[3] != 0, v[4] != 0, {v[5], v[6]}); break;
                case PathCommand::Close: {
                    if (pen_user_.x != start_user_.x || pen_user_.y != start_user_.y) LineTo(node, m, start_user_);
                    Finish(true);
                    // A path may go on from the point it closed at.
                    MoveTo(m, start_user_);
                    break;
                }
            }
        }
        Finish(false);
    }

    void LineElement(xmlNode *node, const Affine &m) {
        const Point a{Length(node, "x1", 0), Length(node, "y1", 0)}, b{Length(node, "x2", 0), Length(node, "y2", 0)};
        MoveTo(m, a);
        LineTo(node, m, b);
        Finish(false);
    }

    void PolyElement(xmlNode *node, const Affine &m, bool closed) {
        XmlText points(node, "points");
        std::vector<double> v;
        PathError error;
        if (!ParseNumberList(points.View(), v, error)) Bad(node, "bad points: " + error.what);
        if (v.size() % 2 != 0) Bad(node, "bad points: an odd count of numbers");
        if (v.size() < 4) return;
        for (double n : v)
            if (std::fabs(n) * kMmPerPx > kLargestMm) Bad(node, "points: number out of range");
        MoveTo(m, {v[0], v[1]});
        for (size_t i = 2; i + 1 < v.size(); i += 2) LineTo(node, m, {v[i], v[i + 1]});
        if (closed && (v[0] != pen_user_.x || v[1] != pen_user_.y)) LineTo(node, m, {v[0], v[1]});
        Finish(closed);
    }

    void RectElement(xmlNode *node, const Affine &m) {
        const double x = Length(node, "x", 0), y = Length(node, "y", 0);
        const double w = Length(node, "width", 0, true), h = Length(node, "height", 0, true);
        if (w < 0 || h < 0) Bad(node, "negative rectangle size");
        if (w == 0 || h == 0) return;
        XmlText rxText(node, "rx"), ryText(node, "ry");
        double rx = Length(node, "rx", -1), ry = Length(node, "ry", -1);
        if (rx < 0 && ry < 0) rx = ry = 0;
        else if (rx < 0) rx = ry;
        else if (ry < 0) ry = rx;
        rx = std::min(rx, w / 2);
        ry = std::min(ry, h / 2);
        if (rx <= 0 || ry <= 0) {
            MoveTo(m, {x, y});
            LineTo(node, m, {x + w, y});
            LineTo(node, m, {x + w, y + h});
            LineTo(node, m, {x, y + h});
            LineTo(node, m, {x, y});
            Finish(true);
            return;
        }
        MoveTo(m, {x + rx, y});
        LineTo(node, m, {x + w - rx, y});
        ArcTo(node, m, rx, ry, 0, false, true, {x + w, y + ry});
        LineTo(node, m, {x + w, y + h - ry});
        ArcTo(node, m, rx, ry, 0, false, true, {x + w - rx, y + h});
        LineTo(node, m, {x + rx, y + h});
        ArcTo(node, m, rx, ry, 0, false, true, {x, y + h - ry});
        LineTo(node, m, {x, y + ry});
        ArcTo(node, m, rx, ry, 0, false, true, {x + rx, y});
        Finish(true);
    }

    void EllipseElement(xmlNode *node, const Affine &m, bool circle) {
        const double cx = Length(node, "cx", 0), cy = Length(node, "cy", 0);
        const double rx = circle ? Length(node, "r", 0, true) : Length(node, "rx", 0, true);
        const double ry = circle ? rx : Length(node, "ry", 0, true);
        if (rx < 0 || ry < 0) Bad(node, "negative radius");
        if (rx == 0 || ry == 0) return;
        // One whole turn, starting at the right and turning as SVG draws it.
        const Affine unit{rx, 0, 0, ry, cx, cy};
        MoveTo(m, {cx + rx, cy});
        Segment s = Make(Segment::EllipseArc, {m.Apply({cx + rx, cy}), {}, {}, m.Apply({cx + rx, cy})});
        s.circle = unit.Then(m);
        s.theta = 0;
        s.sweep = 2 * kPi;
        Add(node, s);
        Finish(true);
    }

    std::string name_;
    Drawing drawing_;
    Outline current_;
    bool open_ = false;
    Point start_{}, pen_{};
    Point pen_user_{}, start_user_{};
};

}  // namespace

Affine Affine::Then(const Affine &o) const {
    return {o.a * a + o.c * b, o.b * a + o.d * b, o.a * c + o.c * d, o.b * c + o.d * d,
            o.a * e + o.c * f + o.e, o.b * e + o.d * f + o.f};
}

bool ArcCentreForm(Point from, double rx, double ry, double rotationDegrees, bool large, bool sweep,
                   Point to, Affine &unitCircle, double &theta, double &delta, bool &isLine) {
    isLine = false;
    if (from.x == to.x && from.y == to.y) return false;
    rx = std::fabs(rx);
    ry = std::fabs(ry);
    if (rx == 0 || ry == 0) {
        isLine = true;
        return true;
    }
    const double phi = std::fmod(rotationDegrees, 360.0) * kPi / 180;
    const double cs = std::cos(phi), sn = std::sin(phi);
    const double dx = (from.x - to.x) / 2, dy = (from.y - to.y) / 2;
    const double x1 = cs * dx + sn * dy, y1 = -sn * dx + cs * dy;
    const double lambda = (x1 * x1) / (rx * rx) + (y1 * y1) / (ry * ry);
    if (lambda > 1) {
        rx *= std::sqrt(lambda);
        ry *= std::sqrt(lambda);
    }
    const double rx2 = rx * rx, ry2 = ry * ry;
    const double den = rx2 * y1 * y1 + ry2 * x1 * x1;
    double coef = den > 0 ? std::sqrt(std::max(0.0, (rx2 * ry2 - den) / den)) : 0;
    if (large == sweep) coef = -coef;
    const double cxp = coef * rx * y1 / ry, cyp = -coef * ry * x1 / rx;
    const double cx = cs * cxp - sn * cyp + (from.x + to.x) / 2;
    const double cy = sn * cxp + cs * cyp + (from.y + to.y) / 2;
    const double ux = (x1 - cxp) / rx, uy = (y1 - cyp) / ry;
    const double vx = (-x1 - cxp) / rx, vy = (-y1 - cyp) / ry;
    theta = std::atan2(uy, ux);
    delta = std::atan2(ux * vy - uy * vx, ux * vx + uy * vy);
    if (!sweep && delta > 0) delta -= 2 * kPi;
    if (sweep && delta < 0) delta += 2 * kPi;
    unitCircle = {cs * rx, sn * rx, -sn * ry, cs * ry, cx, cy};
    return std::isfinite(theta) && std::isfinite(delta) && std::isfinite(cx) && std::isfinite(cy) &&
           std::isfinite(rx) && std::isfinite(ry);
}

Drawing ParseSvg(const std::string &text, const std::string &name) { return SvgReader(name).Read(text); }

Drawing ReadSvg(const std::string &path) {
    struct stat st {};
    if (stat(path.c_str(), &st) != 0) throw Failure(path, std::strerror(errno));
    if (S_ISDIR(st.st_mode)) throw Failure(path, "is a folder");
    std::ifstream in(path, std::ios::binary);
    if (!in) throw Failure(path, std::strerror(errno));
    std::ostringstream text;
    text << in.rdbuf();
    if (in.bad()) throw Failure(path, "cannot read the file");
    return ParseSvg(text.str(), path);
}

}  // namespace tessarine::cli
