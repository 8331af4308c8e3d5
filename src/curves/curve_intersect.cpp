// The family's curve entry points: a box test in front of the clipping
// method, and a line taken as a straight cubic.
#include "core/status.h"
#include "curves/clip.h"

using tessarine::kErrGeneral;
using tessarine::kOk;

namespace {

bool IsDot(double minX, double maxX, double minY, double maxY, double tol) {
    return maxX - minX <= tol && maxY - minY <= tol;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t NewCurveCurveIntersect(const double *curveA, const double *curveB, double *tA,
                                             double *tB, BZ_Point *pts, uint16_t *count, double tol,
                                             int16_t *kind) {
    *count = 0;
    *kind = 0;
    double axMin, axMax, ayMin, ayMax, bxMin, bxMax, byMin, byMax;
    TOV_BoundingBox(curveA[0], curveA[2], curveA[4], curveA[6], &axMin, &axMax);
    TOV_BoundingBox(curveA[1], curveA[3], curveA[5], curveA[7], &ayMin, &ayMax);
    TOV_BoundingBox(curveB[0], curveB[2], curveB[4], curveB[6], &bxMin, &bxMax);
    TOV_BoundingBox(curveB[1], curveB[3], curveB[5], curveB[7], &byMin, &byMax);
    // The box test has its own slack and does not use tol.
    if (ExtentIntExtent(axMin, ayMin, axMax, ayMax, bxMin, byMin, bxMax, byMax)) {
        // The clipping method works in its curves: hand it copies.
        double a[8], b[8];
        for (int i = 0; i < 8; ++i) {
            a[i] = curveA[i];
            b[i] = curveB[i];
        }
        return TOV_Bezier_Clip(a, b, tA, tB, pts, count, tol, kind);
    }
    if (IsDot(axMin, axMax, ayMin, ayMax, tol) || IsDot(bxMin, bxMax, byMin, byMax, tol)) {
        *kind = 2;
        return kErrGeneral;
    }
    *kind = 0;
    return kOk;
}

TESSARINE_API int32_t NewLineCurveIntersect(double x0, double y0, double x1, double y1,
                                            const double *curve, double *tA, double *tB,
                                            BZ_Point *pts, uint16_t *count, double tol,
                                            int16_t *kind) {
    *count = 0;
    *kind = 0;
    const double dx = (x1 - x0) * 0.3333333333333333;
    const double dy = (y1 - y0) * 0.3333333333333333;
    const double line[8] = {x0, y0, x0 + dx, y0 + dy, x1 - dx, y1 - dy, x1, y1};
    return NewCurveCurveIntersect(line, curve, tA, tB, pts, count, tol, kind);
}

}  // extern "C"
