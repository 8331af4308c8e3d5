// Intersection of two infinite lines, with the parallel cases told apart.
#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;

extern "C" TESSARINE_API int32_t BZ_LinelineInt(double x0, double y0, double x1, double y1,
                                                double x2, double y2, double x3, double y3,
                                                int16_t *code, double *t1, double *t2,
                                                BZ_Point *point) {
    if (code != nullptr) *code = 0;
    if (t1 != nullptr) *t1 = 0.0;
    if (t2 != nullptr) *t2 = 0.0;
    if (point != nullptr) *point = BZ_Point{0.0, 0.0};
    double x = 0.0, y = 0.0, t = 0.0, u = 0.0;
    if (TwoLineIntersect(x0, y0, x1, y1, x2, y2, x3, y3, &x, &y, &t, &u) == 0) {
        if (code != nullptr) *code = 1;
        if (t1 != nullptr) *t1 = t;
        if (t2 != nullptr) *t2 = u;
        if (point != nullptr) *point = BZ_Point{x, y};
        return kOk;
    }
    // Parallel by the unnormalised determinant: on one carrier or apart.
    double d = 0.0;
    BZ_Mindistpt2ln(x2, y2, x0, y0, x1, y1, &d, nullptr, nullptr);
    if (code != nullptr) *code = d < 1e-8 ? 7 : 6;
    return kOk;
}
