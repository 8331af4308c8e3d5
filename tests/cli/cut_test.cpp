// cut: the HPGL written is read back as a plotter would follow it, and every
// point it cuts lies within the tolerance of the SVG's path, and every point
// of the path within the tolerance of the cut, with and without --arcs.
#include <cmath>
#include <functional>
#include <sstream>
#include <unordered_map>

#include "cli_test_support.h"

namespace clitest {
namespace {

constexpr double kPi = 3.14159265358979323846;

struct P {
    double x, y;
};

// Points spaced at most `step` apart, keyed by cells of a grid.
class PointCloud {
  public:
    explicit PointCloud(double cell) : cell_(cell) {}
    void Add(P p) { cells_[Key(std::floor(p.x / cell_), std::floor(p.y / cell_))].push_back(p); }
    // True when a point lies within r (r at most the cell size).
    bool Within(P p, double r) const {
        const long cx = long(std::floor(p.x / cell_)), cy = long(std::floor(p.y / cell_));
        const double r2 = r * r;
        for (long dx = -1; dx <= 1; ++dx)
            for (long dy = -1; dy <= 1; ++dy) {
                auto it = cells_.find(Key(double(cx + dx), double(cy + dy)));
                if (it == cells_.end()) continue;
                for (const P &q : it->second)
                    if ((p.x - q.x) * (p.x - q.x) + (p.y - q.y) * (p.y - q.y) <= r2) return true;
            }
        return false;
    }
    size_t Size() const {
        size_t n = 0;
        for (const auto &c : cells_) n += c.second.size();
        return n;
    }
    template <class F> void ForEach(F f) const {
        for (const auto &c : cells_)
            for (const P &p : c.second) f(p);
    }

  private:
    static long long Key(double x, double y) { return (long long)(x) * 1000003LL + (long long)(y); }
    double cell_;
    std::unordered_map<long long, std::vector<P>> cells_;
};

constexpr double kStep = 0.004;    // mm between samples of the true path
constexpr double kCutStep = 0.02;  // mm between samples of the cut

void SampleCurve(PointCloud &cloud, const std::function<P(double)> &at, double length) {
    const int n = std::max(2, int(std::ceil(length / kStep)));
    for (int i = 0; i <= n; ++i) cloud.Add(at(double(i) / n));
}
// The drawing is in user units of 1 mm with y down on a page 100 mm high.
P Up(P p) { return {p.x, 100.0 - p.y}; }
void Line(PointCloud &c, P a, P b) {
    SampleCurve(c, [&](double t) { return Up({a.x + (b.x - a.x) * t, a.y + (b.y - a.y) * t}); },
                std::hypot(b.x - a.x, b.y - a.y));
}
void Cubic(PointCloud &c, P a, P b, P d, P e) {
    SampleCurve(c, [&](double t) {
        const double s = 1 - t;
        return Up({s * s * s * a.x + 3 * s * s * t * b.x + 3 * s * t * t * d.x + t * t * t * e.x,
                   s * s * s * a.y + 3 * s * s * t * b.y + 3 * s * t * t * d.y + t * t * t * e.y});
    }, 400);
}
void Quad(PointCloud &c, P a, P b, P e) {
    SampleCurve(c, [&](double t) {
        const double s = 1 - t;
        return Up({s * s * a.x + 2 * s * t * b.x + t * t * e.x, s * s * a.y + 2 * s * t * b.y + t * t * e.y});
    }, 400);
}
// An ellipse about `centre` with radii rx, ry turned by `rotation` radians,
// from angle a0 through `sweep`.
P EllipsePoint(P centre, double rx, double ry, double rotation, double angle) {
    const double x = rx * std::cos(angle), y = ry * std::sin(angle);
    return {centre.x + x * std::cos(rotation) - y * std::sin(rotation),
            centre.y + x * std::sin(rotation) + y * std::cos(rotation)};
}
void Ellipse(PointCloud &c, P centre, double rx, double ry, double rotation, double a0, double sweep) {
    SampleCurve(c, [&](double t) { return Up(EllipsePoint(centre, rx, ry, rotation, a0 + sweep * t)); },
                std::max(rx, ry) * std::fabs(sweep));
}

std::string Num(double v) {
    std::ostringstream s;
    s.precision(17);
    s << v;
    return s.str();
}

// The drawing, and its true path sampled.
struct TestDrawing {
    std::string svg;
    std::function<void(PointCloud &)> reference;
};

TestDrawing MakeDrawing() {
    // An elliptical arc given by its centre, written in SVG's end-point form.
    const P ec{30, 40};
    const double erx = 20, ery = 9, erot = 30 * kPi / 180, ea0 = 200 * kPi / 180, esweep = 250 * kPi / 180;
    const P es = EllipsePoint(ec, erx, ery, erot, ea0), ee = EllipsePoint(ec, erx, ery, erot, ea0 + esweep);
    std::string svg =
        "<svg xmlns='http://www.w3.org/2000/svg' width='200mm' height='100mm' viewBox='0 0 200 100'>\n"
        " <path d='M10 10 L60 10 C70 10 80 20 80 30 Q80 50 60 50 A20 20 0 0 1 40 30 z'/>\n"
        " <path d='M" + Num(es.x) + "," + Num(es.y) + "A" + Num(erx) + " " + Num(ery) + " 30 1 1 " +
        Num(ee.x) + " " + Num(ee.y) + "'/>\n"
        " <circle cx='120' cy='50' r='30'/>\n"
        " <ellipse cx='170' cy='50' rx='20' ry='10' transform='rotate(20 170 50)'/>\n"
        " <rect x='100' y='5' width='40' height='20' rx='5'/>\n"
        " <g transform='translate(0,60)'><g transform='scale(1.5,1)'><circle cx='20' cy='20' r='10'/></g></g>\n"
        " <polygon points='150,80 190,80 170,95'/>\n"
        " <path d='m10 90 c10 -20 30 20 40 0 s20 -20 30 0 t20 0 h5 v-3'/>\n"
        "</svg>\n";
    auto reference = [=](PointCloud &c) {
        Line(c, {10, 10}, {60, 10});
        Cubic(c, {60, 10}, {70, 10}, {80, 20}, {80, 30});
        Quad(c, {80, 30}, {80, 50}, {60, 50});
        Ellipse(c, {60, 30}, 20, 20, 0, kPi / 2, kPi / 2);
        Line(c, {40, 30}, {10, 10});
        Ellipse(c, ec, erx, ery, erot, ea0, esweep);
        Ellipse(c, {120, 50}, 30, 30, 0, 0, 2 * kPi);
        Ellipse(c, {170, 50}, 20, 10, 20 * kPi / 180, 0, 2 * kPi);
        Line(c, {105, 5}, {135, 5});
        Line(c, {140, 10}, {140, 20});
        Line(c, {135, 25}, {105, 25});
        Line(c, {100, 20}, {100, 10});
        Ellipse(c, {135, 10}, 5, 5, 0, -kPi / 2, kPi / 2);
        Ellipse(c, {135, 20}, 5, 5, 0, 0, kPi / 2);
        Ellipse(c, {105, 20}, 5, 5, 0, kPi / 2, kPi / 2);
        Ellipse(c, {105, 10}, 5, 5, 0, kPi, kPi / 2);
        Ellipse(c, {30, 80}, 15, 10, 0, 0, 2 * kPi);
        Line(c, {150, 80}, {190, 80});
        Line(c, {190, 80}, {170, 95});
        Line(c, {170, 95}, {150, 80});
        Cubic(c, {10, 90}, {20, 70}, {40, 110}, {50, 90});
        Cubic(c, {50, 90}, {60, 70}, {70, 70}, {80, 90});
        Line(c, {80, 90}, {100, 90}); // T with no quadratic before it
        Line(c, {100, 90}, {105, 90});
        Line(c, {105, 90}, {105, 87});
    };
    return {svg, reference};
}

struct Cut {
    PointCloud drawn{0.1};
    int ups = 0, downs = 0, arcs = 0;
    bool ok = true;
    std::string problem;
};

// Follows the commands as a plotter: 40 units to the millimetre.
Cut FollowHpgl(const std::string &text, double cell) {
    Cut cut;
    cut.drawn = PointCloud(cell);
    double px = 0, py = 0;
    bool down = false;
    std::string command;
    std::istringstream in(text);
    while (std::getline(in, command, ';')) {
        while (!command.empty() && (command[0] == '\n' || command[0] == ' ')) command.erase(0, 1);
        if (command.empty()) continue;
        const std::string name = command.substr(0, 2);
        std::vector<double> v;
        std::istringstream args(command.substr(2));
        std::string item;
        while (std::getline(args, item, ',')) v.push_back(std::stod(item));
        auto to = [&](double x, double y) {
            if (down) {
                const double length = std::hypot(x - px, y - py) / 40;
                const int n = std::max(1, int(length / kCutStep));
                for (int i = 0; i <= n; ++i)
                    cut.drawn.Add({(px + (x - px) * i / n) / 40, (py + (y - py) * i / n) / 40});
            }
            px = x;
            py = y;
        };
        if (name == "IN" || name == "SP" || name == "PA") continue;
        if (name == "PU" || name == "PD") {
            down = name == "PD";
            (down ? cut.downs : cut.ups) += v.empty() ? 0 : 1;
            for (size_t i = 0; i + 1 < v.size(); i += 2) to(v[i], v[i + 1]);
        } else if (name == "AA" && v.size() == 3) {
            ++cut.arcs;
            const double cx = v[0], cy = v[1], turn = v[2] * kPi / 180;
            const double r = std::hypot(px - cx, py - cy), a0 = std::atan2(py - cy, px - cx);
            const int n = std::max(1, int(r / 40 * std::fabs(turn) / kCutStep));
            for (int i = 0; i <= n; ++i) {
                const double a = a0 + turn * i / n;
                cut.drawn.Add({(cx + r * std::cos(a)) / 40, (cy + r * std::sin(a)) / 40});
            }
            px = cx + r * std::cos(a0 + turn);
            py = cy + r * std::sin(a0 + turn);
        } else {
            cut.ok = false;
            cut.problem = "unknown command " + command;
        }
    }
    return cut;
}

class CutSvg : public CliSandbox, public ::testing::WithParamInterface<std::tuple<bool, double>> {};

TEST_P(CutSvg, EveryPointWithinTheTolerance) {
    const bool arcs = std::get<0>(GetParam());
    const double tolerance = std::get<1>(GetParam());
    const TestDrawing drawing = MakeDrawing();
    const std::string svg = Made("drawing.svg"), plt = Made("drawing.plt");
    WriteFile(svg, drawing.svg);
    std::vector<std::string> args{"cut", svg, plt, "--tolerance", Num(tolerance)};
    if (arcs) args.push_back("--arcs");
    const RunResult r = Cli(args);
    ASSERT_EQ(r.code, 0) << r.err;
    const std::string text = ReadFile(plt);
    ASSERT_EQ(text.rfind("IN;\nSP1;\nPA;\n", 0), 0u);
    const Cut cut = FollowHpgl(text, tolerance + kCutStep);
    ASSERT_TRUE(cut.ok) << cut.problem;
    EXPECT_NE(r.out.find(std::to_string(cut.downs) + " PD lines"), std::string::npos) << r.out;
    EXPECT_NE(r.out.find(std::to_string(cut.arcs) + " AA arcs"), std::string::npos) << r.out;
    EXPECT_NE(r.out.find(std::to_string(cut.ups) + " PU moves"), std::string::npos) << r.out;
    EXPECT_EQ(cut.ups, 8); // one per outline
    if (arcs) EXPECT_GT(cut.arcs, 10);
    else EXPECT_EQ(cut.arcs, 0);

    PointCloud path(tolerance + kCutStep);
    drawing.reference(path);
    // The samples of the true path are kStep apart: half of that is slack.
    const double allowed = tolerance + kStep;
    int off = 0, uncut = 0;
    P at{}, coverAt{};
    cut.drawn.ForEach([&](P p) {
        if (!path.Within(p, allowed)) ++off, at = p;
    });
    // The cut is sampled more coarsely: its spacing is slack on this side.
    path.ForEach([&](P p) {
        if (!cut.drawn.Within(p, allowed + kCutStep / 2)) ++uncut, coverAt = p;
    });
    EXPECT_EQ(off, 0) << "cut point (" << at.x << ", " << at.y << ") is off the path";
    EXPECT_EQ(uncut, 0) << "path point (" << coverAt.x << ", " << coverAt.y << ") is not cut";
}

INSTANTIATE_TEST_SUITE_P(LinesAndArcs, CutSvg,
                         ::testing::Combine(::testing::Bool(), ::testing::Values(0.05, 0.1, 0.5)));

}  // namespace
}  // namespace clitest
