// Side of a directed line on which a point lies. The tolerance is on the sine
// of the angle between the two directions, not a distance.
#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kErrDegenerate;

extern "C" TESSARINE_API int32_t BZ_PtOnWhichSideofLine(double tolerance, double x0, double y0,
                                                        double x1, double y1, double px,
                                                        double py) {
    BZ_Point ua;
    BZ_Point ub;
    if (BZ_GetNormVector(x0, y0, x1, y1, &ua) == kErrDegenerate) return kErrDegenerate;
    if (BZ_GetNormVector(x0, y0, px, py, &ub) == kErrDegenerate) return kErrDegenerate;
    const double c = BZ_Crossp(ua.x, ua.y, ub.x, ub.y);
    if (c > tolerance) return 0;   // left
    if (c < -tolerance) return 1;  // right
    return 2;                      // on the line
}
