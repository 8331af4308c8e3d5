// tessarine cut: the outlines of an SVG drawing as cutter commands. Curves
// become chords by the library's stroking, or with --arcs lines and arcs by
// its Bezier-to-arc fit; arcs that stay circular go out as arcs directly.
#include <algorithm>
#include <cmath>
#include <fstream>
#include <ostream>

#include <tessarine/tessarine.h>

#include "commands.h"
#include "failure.h"
#include "hpgl_writer.h"
#include "output_file.h"
#include "svg_document.h"

namespace tessarine::cli {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr int kDeepestSplit = 24;

struct Cubic {
    Point p[4];
};

// Halves a cubic with the library's split.
void Halve(const Cubic &c, Cubic &left, Cubic &right) {
    double l1x, l1y, r2x, r2y, l2x, l2y, mx, my, r1x, r1y;
    SubDivideBezier(c.p[0].x, c.p[0].y, c.p[1].x, c.p[1].y, c.p[2].x, c.p[2].y, c.p[3].x, c.p[3].y, 0.5,
                    &l1x, &l1y, &r2x, &r2y, &l2x, &l2y, &mx, &my, &r1x, &r1y);
    left = {{c.p[0], {l1x, l1y}, {l2x, l2y}, {mx, my}}};
    right = {{{mx, my}, {r1x, r1y}, {r2x, r2y}, c.p[3]}};
}

// The heap side of the library's two-tier sample output, freed on every exit.
struct SampleBuffers {
    int32_t count = 0;
    int16_t onHeap = 0;
    int32_t capacity = 0;
    BZ_Point fixed[256];
    BZ_Point *heap = nullptr;
    ~SampleBuffers() {
        if (heap != nullptr) MEM_FreeHdl(heap);
    }
    const BZ_Point *Points() const { return onHeap ? heap : fixed; }
};

class Cutter {
  public:
    Cutter(HpglWriter &hpgl, double tolerance, bool arcs, const std::string &file)
        : hpgl_(hpgl), arcs_(arcs), file_(file),
          chordTolerance_(std::max(tolerance - kPointRounding, tolerance / 4)),
          // The fit and the cubic standing in for an ellipse share what the
          // rounding of centre and start leaves.
          fitTolerance_(std::max(tolerance - kArcRounding, tolerance / 5) * 0.6),
          ellipseTolerance_(std::max(tolerance - kArcRounding, tolerance / 5) * 0.3) {}

    void Cut(const Outline &outline) {
        hpgl_.MoveTo(outline.segments.front().Start());
        for (const Segment &s : outline.segments) {
            switch (s.kind) {
                case Segment::Line: hpgl_.LineTo(s.p[1]); break;
                case Segment::Cubic: CutCubic({{s.p[0], s.p[1], s.p[2], s.p[3]}}, 0); break;
                case Segment::EllipseArc: CutEllipseArc(s); break;
            }
            // Whatever a step left out, the pen ends where the segment does.
            hpgl_.LineTo(s.End());
        }
    }

  private:
    void CutCubic(const Cubic &c, int depth) {
        if (arcs_) return FitCubic(c, depth);
        // The stroking's flatness test gives handles on one side of the chord
        // the factor 4/9, where such a curve strays up to 3/4 of the handle
        // height: the tolerance asked for is scaled down by that ratio.
        const VC_StrokeSpec spec{0, chordTolerance_ * (0.4444444444444444 / 0.75), 0, 0};
        int32_t count = 0;
        BZ_Point *points = nullptr;
        const int32_t s = VC_StrokeBezierCurve(spec, c.p[0].x, c.p[0].y, c.p[1].x, c.p[1].y, c.p[2].x,
                                               c.p[2].y, c.p[3].x, c.p[3].y, &count, &points, nullptr);
        if (TS_STATUS(s) == -56 && depth < kDeepestSplit) {
            Cubic left, right;
            Halve(c, left, right);
            CutCubic(left, depth + 1);
            CutCubic(right, depth + 1);
            return;
        }
        Check(s, file_, "stroke a curve");
        for (int32_t i = 1; i < count; ++i) hpgl_.LineTo({points[i].x, points[i].y});
        if (points != nullptr) MEM_FreePtr(points);
    }

    void FitCubic(const Cubic &c, int depth) {
        ArcFitEntry entries[101];
        int16_t count = 0;
        const int32_t fitted = BezierToArc(fitTolerance_, c.p[0].x, c.p[0].y, c.p[1].x, c.p[1].y, c.p[2].x,
                                           c.p[2].y, c.p[3].x, c.p[3].y, entries, &count);
        if (!fitted) {
            if (depth >= kDeepestSplit) throw Failure(file_, "a curve cannot be fitted with arcs");
            Cubic left, right;
            Halve(c, left, right);
            FitCubic(left, depth + 1);
            FitCubic(right, depth + 1);
            return;
        }
        for (int16_t i = 0; i < count; ++i) {
            const ArcFitEntry &e = entries[i];
            if (!e.isArc) {
                hpgl_.LineTo({e.a, e.b});
                hpgl_.LineTo({e.c, e.d});
                continue;
            }
            const double r = std::fabs(e.c);
            hpgl_.LineTo({e.a + r * std::cos(e.d), e.b + r * std::sin(e.d)});
            hpgl_.ArcAround({e.a, e.b}, e.e);
        }
        hpgl_.LineTo(c.p[3]);
    }

    // The arc's map of the unit circle is a similarity: the arc stays circular.
    static bool IsCircular(const Affine &m) {
        const double u = m.a * m.a + m.b * m.b, v = m.c * m.c + m.d * m.d, w = m.a * m.c + m.b * m.d;
        return std::fabs(u - v) <= 1e-9 * (u + v) && std::fabs(w) <= 1e-9 * (u + v);
    }

    void CutEllipseArc(const Segment &s) {
        const Affine &m = s.circle;
        const double det = m.a * m.d - m.b * m.c;
        if (IsCircular(m)) {
            const Point centre{m.e, m.f};
            const double radius = std::sqrt(std::fabs(det));
            const double sweep = det < 0 ? -s.sweep : s.sweep;
            if (arcs_) {
                hpgl_.LineTo(s.p[0]);
                hpgl_.ArcAround(centre, sweep);
                return;
            }
            const double start = std::atan2(s.p[0].y - centre.y, s.p[0].x - centre.x);
            return StrokeCircle(centre, radius, start, sweep, Affine{}, chordTolerance_);
        }
        if (!arcs_) {
            // Stroke the unit circle finely enough that no stretch of the map
            // takes a chord further than the tolerance.
            const double stretch = std::sqrt(std::max(m.a * m.a + m.b * m.b, m.c * m.c + m.d * m.d) +
                                             std::fabs(m.a * m.c + m.b * m.d));
            return StrokeCircle({0, 0}, 1.0, s.theta, s.sweep, m, chordTolerance_ / stretch);
        }
        EllipseAsCubics(s);
    }

    void StrokeCircle(Point centre, double radius, double start, double sweep, const Affine &map, double tolerance) {
        BZ_Arc arc;
        auto on = [&](double angle) { return BZ_Point{centre.x + radius * std::cos(angle), centre.y + radius * std::sin(angle)}; };
        arc.start = on(start);
        arc.mid = on(start + sweep / 2);
        arc.centre = {centre.x, centre.y};
        arc.startAngle = start;
        arc.sweep = sweep;
        arc.end = on(start + sweep);
        const VC_StrokeSpec spec{0, tolerance, 0, 0};
        SampleBuffers samples;
        const int32_t st = VC_SkArc(spec, arc, &samples.count, &samples.onHeap, &samples.capacity, samples.fixed,
                                    nullptr, &samples.heap, nullptr);
        Check(st, file_, "stroke an arc");
        const BZ_Point *points = samples.Points();
        for (int32_t i = 1; i < samples.count; ++i) hpgl_.LineTo(map.Apply({points[i].x, points[i].y}));
    }

    // An elliptical arc as cubics from the library's arc conversion, in pieces
    // short enough for its handle rule, then fitted like any cubic.
    void EllipseAsCubics(const Segment &s) {
        const Affine &m = s.circle;
        const double reach = std::sqrt(std::max(m.a * m.a + m.b * m.b, m.c * m.c + m.d * m.d)) + 1e-300;
        const double span = std::fabs(s.sweep);
        // The conversion's handles stray from the ellipse by about 0.01 r t^2 on a piece of t radians.
        const double longest = std::min(kPi / 2, std::sqrt(ellipseTolerance_ / (0.01 * reach)));
        const int pieces = int(std::min(4096.0, std::ceil(span / longest)));
        const double step = s.sweep / std::max(1, pieces);
        for (int i = 0; i < pieces; ++i) {
            const double a0 = s.theta + step * i;
            BZ_Point nodes[18];
            int16_t count = 0;
            const bool backwards = step < 0;
            ConvertArcToBezier(1.0, 0.0, 0.0, backwards ? a0 + step : a0, std::fabs(step), nodes, &count);
            if (count < 6) continue;
            Cubic c{{{nodes[1].x, nodes[1].y}, {nodes[2].x, nodes[2].y}, {nodes[3].x, nodes[3].y}, {nodes[4].x, nodes[4].y}}};
            if (backwards) std::reverse(std::begin(c.p), std::end(c.p));
            for (Point &p : c.p) p = m.Apply(p);
            FitCubic(c, 0);
        }
    }

    HpglWriter &hpgl_;
    bool arcs_;
    std::string file_;
    double chordTolerance_;
    double fitTolerance_;
    double ellipseTolerance_;
};

}  // namespace

void RunCut(const CutOptions &options, std::ostream &out) {
    if (!(options.tolerance >= 0.05) || !std::isfinite(options.tolerance))
        throw UsageFailure("--tolerance must be at least 0.05 mm");
    const Drawing drawing = ReadSvg(options.input);
    PendingOutput pending(options.output);
    int64_t moves = 0, lines = 0, arcs = 0;
    {
        std::ofstream file(pending.TempPath(), std::ios::binary);
        if (!file) throw Failure(options.output, "cannot write");
        HpglWriter hpgl(file);
        hpgl.Begin();
        Cutter cutter(hpgl, options.tolerance, options.arcs, options.input);
        for (const Outline &outline : drawing.outlines) {
            cutter.Cut(outline);
            if (!file) break;
        }
        hpgl.End();
        file.flush();
        file.close();
        if (file.fail()) throw Failure(options.output, "cannot write (the disk may be full)");
        moves = hpgl.Moves();
        lines = hpgl.Lines();
        arcs = hpgl.Arcs();
    }
    pending.Commit();
    out << options.input << " -> " << options.output << ": " << drawing.outlines.size() << " outlines; "
        << moves << " PU moves, " << lines << " PD lines, " << arcs << " AA arcs\n";
}

}  // namespace tessarine::cli
