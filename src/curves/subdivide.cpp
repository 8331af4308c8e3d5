// Splitting a line or a cubic at a parameter, evaluating a cubic's point or
// tangent, and reversing a point array.
#include "core/status.h"
#include "curves/toolkit.h"

using tessarine::kErrArgument;
using tessarine::kErrDegenerate;
using tessarine::kOk;

namespace {

// Every step of the split has this one shape, so that all callers agree bit
// for bit.
inline double Lerp(double a, double b, double t) {
    return (b - a) * t + a;
}

}  // namespace

extern "C" {

TESSARINE_API void SubDivideLine(double x0, double y0, double x1, double y1, double t, double *x,
                                 double *y) {
    *x = Lerp(x0, x1, t);
    *y = Lerp(y0, y1, t);
}

TESSARINE_API void SubDivideBezier(double x0, double y0, double x1, double y1, double x2, double y2,
                                   double x3, double y3, double t, double *l1x, double *l1y,
                                   double *r2x, double *r2y, double *l2x, double *l2y, double *mx,
                                   double *my, double *r1x, double *r1y) {
    const double L1x = Lerp(x0, x1, t), L1y = Lerp(y0, y1, t);
    const double Qx = Lerp(x1, x2, t), Qy = Lerp(y1, y2, t);
    const double R2x = Lerp(x2, x3, t), R2y = Lerp(y2, y3, t);
    const double L2x = Lerp(L1x, Qx, t), L2y = Lerp(L1y, Qy, t);
    const double R1x = Lerp(Qx, R2x, t), R1y = Lerp(Qy, R2y, t);
    const double Mx = Lerp(L2x, R1x, t), My = Lerp(L2y, R1y, t);
    *l1x = L1x;
    *l1y = L1y;
    *r2x = R2x;
    *r2y = R2y;
    *l2x = L2x;
    *l2y = L2y;
    *mx = Mx;
    *my = My;
    *r1x = R1x;
    *r1y = R1y;
}

TESSARINE_API void ReverseCoord(BZ_Point *points, int16_t n) {
    for (int i = 0, j = n - 1; i < j; ++i, --j) {
        const BZ_Point swap = points[i];
        points[i] = points[j];
        points[j] = swap;
    }
}

TESSARINE_API int32_t CubicBezEval(const BZ_Point *points, double t, int16_t order, BZ_Point *out) {
    if (order < 0 || order > 1) return kErrArgument;
    enum Case { kStart, kEnd, kGeneral };
    Case where;
    BZ_Point w[4];
    if (FEQ(t, 0.0, 1e-8)) {
        where = kStart;
        for (int i = 0; i < 4; ++i) w[i] = points[i];
    } else if (FEQ(t, 1.0, 1e-8)) {
        where = kEnd;
        for (int i = 0; i < 4; ++i) w[i] = points[3 - i];
    } else {
        // The right half at t: M, R1, R2 and P3, which the differences need.
        where = kGeneral;
        BZ_Point l1, l2;
        SubDivideBezier(points[0].x, points[0].y, points[1].x, points[1].y, points[2].x,
                        points[2].y, points[3].x, points[3].y, t, &l1.x, &l1.y, &w[2].x, &w[2].y,
                        &l2.x, &l2.y, &w[0].x, &w[0].y, &w[1].x, &w[1].y);
        w[3] = points[3];
    }
    if (order == 0) {
        *out = w[0];
        return kOk;
    }
    // Coinciding control points make a zero difference; the next one is tried.
    for (int i = 1; i <= 3; ++i) {
        BZ_Point tangent;
        if (where == kEnd) {
            tangent = BZ_Point{(w[i - 1].x - w[i].x) * 3, (w[i - 1].y - w[i].y) * 3};
        } else {
            tangent =
                BZ_Point{(w[i].x - w[i - 1].x) * 3 / (1 - t), (w[i].y - w[i - 1].y) * 3 / (1 - t)};
        }
        *out = tangent;
        if (!EqualPoints(tangent.x, tangent.y, 0.0, 0.0)) return kOk;
    }
    return kErrDegenerate;
}

}  // extern "C"
