// Line with arc: the carriers (infinite line, whole circle) and the bounded
// form that keeps only solutions on both segments.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;
using tessarine::geometry::BZ_ArcParamOfAngle;
using tessarine::geometry::kPi;

namespace {

bool Within(double v, double lo, double hi) { return v >= lo && v <= hi; }

// Near an end of the arc the parameter is not trusted, because a small error
// in the angle moves it across the end; the chord's inscribed angle decides.
bool OnArc(const BZ_Arc &arc, const BZ_Point &p, double lineT, double arcT) {
    if (!Within(lineT, -1e-8, 1.00000001) || !Within(arcT, -1e-8, 1.00000001)) return false;
    if (Within(arcT, 0.01, 0.99)) return true;
    const double span = std::fabs(arc.sweep);
    // Almost a half circle: the inscribed angle is near a right angle and
    // says nothing.
    if (std::fabs(span - kPi) < 0.087) return Within(arcT, 0.0, 1.0);
    const double dot = BZ_Dotp(arc.start.x - p.x, arc.start.y - p.y, arc.end.x - p.x,
                               arc.end.y - p.y);
    if (span < kPi) return dot <= 1e-8;   // short arc: the chord is seen obtuse
    if (span > kPi) return dot >= -1e-8;  // long arc: seen acute
    return false;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BZ_LineArcInt(const BZ_Line *line, const BZ_Arc *arc, BZ_Point *points,
                                    double *lineT, double *arcT, int16_t *count, int16_t *code) {
    *count = 0;
    *code = 0;
    const BZ_Point s = line->start;
    const BZ_Point c = arc->centre;
    const double a = BZ_Distptpts(s.x, s.y, line->end.x, line->end.y);
    const double r = BZ_Distptpts(c.x, c.y, arc->start.x, arc->start.y);
    if (a < 1e-13 || r < 1e-13) return kOk;
    const BZ_Point d{line->end.x - s.x, line->end.y - s.y};
    const double b = BZ_Dotp(d.x, d.y, s.x - c.x, s.y - c.y);
    const double cc = BZ_Distptpts(s.x, s.y, c.x, c.y);
    const double disc = b * b - (cc - r) * a;
    if (disc < 0) return kOk;
    // A tangent line gives two equal solutions.
    const double root = std::sqrt(disc);
    const double t[2] = {(-b - root) / a, (root - b) / a};
    for (int i = 0; i < 2; ++i) {
        const BZ_Point p{s.x + d.x * t[i], s.y + d.y * t[i]};
        points[i] = p;
        lineT[i] = t[i];
        BZ_ArcParamOfAngle(arc->startAngle, arc->sweep, std::atan2(p.y - c.y, p.x - c.x),
                           &arcT[i]);
    }
    *count = 2;
    *code = 1;
    return kOk;
}

TESSARINE_API int32_t BZ_BoundLineArcInt(const BZ_Line *line, const BZ_Arc *arc,
                                         BZ_Point *points, double *lineT, double *arcT,
                                         int16_t *count, int16_t *code) {
    *code = 0;
    *count = 0;
    BZ_Point p[2];
    double lt[2];
    double at[2];
    int16_t n = 0;
    int16_t plain = 0;
    const int32_t status = BZ_LineArcInt(line, arc, p, lt, at, &n, &plain);
    if (plain == 0) return status;
    for (int i = 0; i < 2; ++i) {
        if (!OnArc(*arc, p[i], lt[i], at[i])) continue;
        points[*count] = p[i];
        lineT[*count] = lt[i];
        arcT[*count] = at[i];
        ++*count;
        *code = 1;
    }
    return status;
}

}  // extern "C"
