// Planar building blocks under the geometry kernel. The expressions keep their
// written order: results must match bit for bit across machines.
#include <cmath>

#include <tessarine/core.h>

namespace {

constexpr double kTolerance = 1e-8;
constexpr double kExtentSlack = 0.0001;

}  // namespace

extern "C" {

// A box test on each axis, not a distance.
TESSARINE_API int32_t EqualPoints(double x1, double y1, double x2, double y2) {
    return std::fabs(x1 - x2) <= kTolerance && std::fabs(y1 - y2) <= kTolerance ? 1 : 0;
}

TESSARINE_API int32_t ExtentIntExtent(double minX1, double minY1, double maxX1, double maxY1,
                                      double minX2, double minY2, double maxX2, double maxY2) {
    const double e = kExtentSlack;
    return minX2 <= maxX1 + e && minX1 <= maxX2 + e && minY2 <= maxY1 + e && minY1 <= maxY2 + e ? 1
                                                                                                : 0;
}

// 0 when an intersection was computed, 1 for parallel lines (outputs untouched).
// The threshold is on the unnormalised determinant.
TESSARINE_API int32_t TwoLineIntersect(double x1, double y1, double x2, double y2, double x3,
                                       double y3, double x4, double y4, double *x, double *y,
                                       double *t, double *u) {
    const double dx1 = x2 - x1;
    const double dy1 = y2 - y1;
    const double dx2 = x4 - x3;
    const double dy2 = y4 - y3;
    const double det = dx2 * dy1 - dy2 * dx1;
    if (std::fabs(det) <= kTolerance) return 1;
    const double r = 1 / det;
    const double tt = ((y3 - y1) * dx2 - (x3 - x1) * dy2) * r;
    const double uu = ((y3 - y1) * dx1 - (x3 - x1) * dy1) * r;
    *t = tt;
    *u = uu;
    *x = dx1 * tt + x1;
    *y = dy1 * tt + y1;
    return 0;
}

// The degenerate test is on the squared length: lines shorter than 1e-4 fail.
TESSARINE_API int32_t PointProjectToLine(double px, double py, double x1, double y1, double x2,
                                         double y2, double *x, double *y) {
    const double dx = x2 - x1;
    const double dy = y2 - y1;
    const double s = dx * dx + dy * dy;
    if (s < kTolerance) return 0;
    const double t = (dy * py + dx * px - dx * x1 - dy * y1) / s;
    *x = t * dx + x1;
    *y = t * dy + y1;
    return 1;
}

TESSARINE_API void RotatePoint(double *x, double *y, double cx, double cy, double sine,
                               double cosine) {
    const double a = *x - cx;
    const double b = *y - cy;
    *x = a * cosine - b * sine + cx;
    *y = b * cosine + a * sine + cy;
}

TESSARINE_API void Bezier(const double *control, double *coefficients) {
    const double x0 = control[0], y0 = control[1], x1 = control[2], y1 = control[3];
    const double x2 = control[4], y2 = control[5], x3 = control[6], y3 = control[7];
    coefficients[0] = 3 * (x1 - x2) + x3 - x0;
    coefficients[1] = 3 * (y1 - y2) + y3 - y0;
    coefficients[2] = 3 * (x0 - 2 * x1 + x2);
    coefficients[3] = 3 * (y0 - 2 * y1 + y2);
    coefficients[4] = 3 * (x1 - x0);
    coefficients[5] = 3 * (y1 - y0);
    coefficients[6] = x0;
    coefficients[7] = y0;
}

}  // extern "C"
