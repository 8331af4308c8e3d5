// Point to arc: the circle within the arc's span, the nearer end outside it.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kErrDegenerate;
using tessarine::kOk;
using tessarine::geometry::PointOnCircle;

extern "C" TESSARINE_API int32_t MindistPt2arc(double px, double py, double centreX,
                                               double centreY, double radius, double startAngle,
                                               double sweep, double startX, double startY,
                                               double endX, double endY, BZ_Point *foot,
                                               double *t, double *distance) {
    BZ_Point v;
    if (BZ_GetNormVector(centreX, centreY, px, py, &v) == kErrDegenerate) {
        // At the centre every point of the circle is as near; take the start.
        if (t != nullptr) *t = 0.0;
        if (distance != nullptr) *distance = radius;
        if (foot != nullptr) *foot = BZ_Point{startX, startY};
        return kOk;
    }
    double a = std::atan2(v.y, v.x);
    int16_t area = 0;
    BZ_PtOnWhichAreaofArc(startAngle, startAngle + 0.5 * sweep, startAngle + sweep, a, &area);
    if (area == 3) {
        if (t != nullptr) *t = 0.0;
        if (distance != nullptr) *distance = BZ_Distptpt(px, py, startX, startY);
        if (foot != nullptr) *foot = BZ_Point{startX, startY};
    } else if (area == 4) {
        if (t != nullptr) {
            // The normalised angle also serves the foot below.
            a = BZonerevol(BZccwdir(a));
            *t = sweep > 0 ? BZccwdir(a - startAngle) / sweep : BZcwdir(a - startAngle) / sweep;
        }
        if (distance != nullptr)
            *distance = std::fabs(radius - BZ_Distptpt(centreX, centreY, px, py));
        if (foot != nullptr) *foot = PointOnCircle(centreX, centreY, radius, a);
    } else {
        if (t != nullptr) *t = 1.0;
        if (distance != nullptr) *distance = BZ_Distptpt(px, py, endX, endY);
        if (foot != nullptr) *foot = BZ_Point{endX, endY};
    }
    return kOk;
}
