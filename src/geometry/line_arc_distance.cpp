// Line to arc: the perpendicular from the centre, then the four ends.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::Failed;
using tessarine::kOk;
using tessarine::geometry::ArcRadius;
using tessarine::geometry::kFarAway;

namespace tessarine::geometry {

int32_t BZ_LineArcPerpProbe(const BZ_Line *line, const BZ_Arc *arc, BZ_Point * /*onLine*/,
                            double * /*lineT*/, BZ_Point *onArc, double *arcT, double *distance) {
    const BZ_Point c = arc->centre;
    const double r = BZ_Distptpts(c.x, c.y, arc->start.x, arc->start.y);
    BZ_Point f;
    double t = 0.0;
    double d = 0.0;
    BZ_Mindistsqpt2line(c.x, c.y, line->start.x, line->start.y, line->end.x, line->end.y, &f, &t,
                        &d);
    // Only a line that passes outside the circle, with the foot on it.
    if (!(t >= 0 && t <= 1 && r <= d)) return kOk;
    const BZ_Line perpendicular{c, f};
    BZ_Point p[2];
    double lt[2];
    double at[2];
    int16_t count = 0;
    int16_t code = 0;
    const int32_t status = BZ_BoundLineArcInt(&perpendicular, arc, p, lt, at, &count, &code);
    if (code == 0 || count > 1) return status;
    *onArc = p[0];
    *arcT = at[0];
    *distance = BZ_Distptpt(p[0].x, p[0].y, f.x, f.y);
    return status;
}

}  // namespace tessarine::geometry

extern "C" TESSARINE_API int32_t BZ_MindistLineArc(const BZ_Line *line, const BZ_Arc *arc,
                                                   BZ_Point *onLine, double *lineT,
                                                   BZ_Point *onArc, double *arcT,
                                                   double *distance) {
    // The probe's answer is never kept: the ends below always overwrite it.
    int32_t status = tessarine::geometry::BZ_LineArcPerpProbe(line, arc, onLine, lineT, onArc,
                                                              arcT, distance);
    if (Failed(status)) return status;
    double best = kFarAway;
    const double r = ArcRadius(*arc);
    const BZ_Line &l = *line;
    const BZ_Arc &a = *arc;
    auto lineEnd = [&](const BZ_Point &p, double t) {
        BZ_Point foot;
        double at = 0.0;
        double d = 0.0;
        const int32_t s =
            MindistPt2arc(p.x, p.y, a.centre.x, a.centre.y, r, a.startAngle, a.sweep, a.start.x,
                          a.start.y, a.end.x, a.end.y, &foot, &at, &d);
        if (!Failed(s) && d < best) {
            best = d;
            *onLine = p;
            *lineT = t;
            *onArc = foot;
            *arcT = at;
            *distance = d;
        }
        return s;
    };
    auto arcEnd = [&](const BZ_Point &p, double t) {
        BZ_Point foot;
        double lt = 0.0;
        double dsq = 0.0;
        const int32_t s = BZ_Mindistsqpt2line(p.x, p.y, l.start.x, l.start.y, l.end.x, l.end.y,
                                              &foot, &lt, &dsq);
        const double d = std::sqrt(dsq);
        if (!Failed(s) && d < best) {
            best = d;
            *onArc = p;
            *arcT = t;
            *onLine = foot;
            *lineT = lt;
            *distance = d;
        }
        return s;
    };
    if (Failed(status = lineEnd(l.start, 0.0))) return status;
    if (Failed(status = lineEnd(l.end, 1.0))) return status;
    if (Failed(status = arcEnd(a.start, 0.0))) return status;
    if (Failed(status = arcEnd(a.end, 1.0))) return status;
    return kOk;
}
