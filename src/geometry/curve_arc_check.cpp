// Whether a cubic is an arc in disguise: a circle through its ends and its
// middle that also holds its quarter points and its end tangents.
#include <cmath>
#include <initializer_list>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::Failed;
using tessarine::kOk;

namespace {

constexpr double kLargestSweep = 2.827433388;
constexpr double kDirectionError = 0.087266462;

}  // namespace

extern "C" TESSARINE_API int32_t Chkcv2arc(double x0, double y0, double x1, double y1, double x2,
                                           double y2, double x3, double y3, double tolerance,
                                           double leastRadius, BZ_Point *centre, BZ_Point *mid,
                                           double *radius, double *startAngle, double *sweep,
                                           int16_t *isArc) {
    *isArc = 0;
    BZ_CurveCoef k;
    Bezier_Coef(x0, y0, x1, y1, x2, y2, x3, y3, &k);
    BZ_Point m;
    BZ_beziereval(&k, 0.5, 0, &m.x, &m.y);
    BZ_Point c;
    double r = 0.0, a0 = 0.0, s = 0.0;
    int16_t outcome = 0;
    BZ_3ptarcinfo(x0, y0, m.x, m.y, x3, y3, &c, &r, &a0, &s, nullptr, &outcome);
    if (outcome != kOk) return kOk;
    // Unlike the merges, a sweep equal to the limit passes here.
    if (r < leastRadius || std::fabs(s) > kLargestSweep) return kOk;
    for (double t : {0.25, 0.75}) {
        BZ_Point q;
        BZ_beziereval(&k, t, 0, &q.x, &q.y);
        if (!(std::fabs(r - BZ_Distptpt(c.x, c.y, q.x, q.y)) <= tolerance)) return kOk;
    }
    for (double t : {0.0, 1.0}) {
        BZ_Point curveDir;
        int32_t status =
            BZ_CurveEval(x0, y0, x1, y1, x2, y2, x3, y3, &k, t, 1, &curveDir.x, &curveDir.y);
        if (Failed(status)) return status;
        BZ_Point arcDir;
        status = BZ_ArcEval(c.x, c.y, r, a0, s, t, 1, &arcDir.x, &arcDir.y);
        if (Failed(status)) return status;
        if (!(std::fabs(BZminanglev1v2(curveDir.x, curveDir.y, arcDir.x, arcDir.y)) <=
              kDirectionError))
            return kOk;
    }
    *isArc = 1;
    *centre = c;
    *radius = r;
    *startAngle = a0;
    *sweep = s;
    *mid = tessarine::geometry::PointOnCircle(c.x, c.y, r, a0 + 0.5 * s);
    return kOk;
}
