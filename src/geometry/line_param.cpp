// The parameter of a point that is to lie on a line segment.
#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;

extern "C" {

TESSARINE_API int32_t GetparONln(double ax, double ay, double bx, double by, double px, double py,
                                 double tolerance, double *t) {
    double d = 0;
    double u = 0;
    BZ_Mindistpt2ln(px, py, ax, ay, bx, by, &d, &u, nullptr);
    *t = u;
    if (u < -0.0001 || u - 1 > 0.0001) return tessarine::kErrGeneral;
    if (u < 0) u = 0;
    if (u > 1) u = 1;
    *t = u;
    return d <= tolerance ? kOk : tessarine::kErrGeneral;
}

}  // extern "C"
