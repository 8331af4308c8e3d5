// Small services on a cubic's control values: a point by the Bernstein form,
// the range of four values, and the terms of the area under a path.
#include <initializer_list>

#include "curves/toolkit.h"

extern "C" {

// The Bernstein form by a ratio, which avoids powers of t.
TESSARINE_API void TOV_FindBezierPoint(double x0, double y0, double x1, double y1, double x2,
                                       double y2, double x3, double y3, double t, double *x,
                                       double *y) {
    if (t <= 0.5) {
        const double s = t / (1 - t);
        const double u = 1 - t;
        const double scale = u * u * u;
        *x = (((x3 * s + 3 * x2) * s + 3 * x1) * s + x0) * scale;
        *y = (((y3 * s + 3 * y2) * s + 3 * y1) * s + y0) * scale;
    } else {
        const double s = (1 - t) / t;
        const double scale = t * t * t;
        *x = (((x0 * s + 3 * x1) * s + 3 * x2) * s + x3) * scale;
        *y = (((y0 * s + 3 * y1) * s + 3 * y2) * s + y3) * scale;
    }
}

TESSARINE_API void TOV_BoundingBox(double v0, double v1, double v2, double v3, double *min,
                                   double *max) {
    double lo = v0, hi = v0;
    for (double v : {v1, v2, v3}) {
        if (v < lo) lo = v;
        if (v > hi) hi = v;
    }
    *min = lo;
    *max = hi;
}

// The integral of y dx over the curve is s1/2 + 3 s2/10 + s3/5 + 3 s4/20 +
// s5/20; the terms are kept apart so that a path sums them before weighing.
TESSARINE_API void TOV_GetBezierArea(double x0, double y0, double x1, double y1, double x2,
                                     double y2, double x3, double y3, double *s1, double *s2,
                                     double *s3, double *s4, double *s5) {
    const double d1 = x1 - x0, d2 = x2 - x1, d3 = x3 - x2;
    *s1 += d1 * y0 + d3 * y3;
    *s2 += (d1 + d2) * y1 + (d2 + d3) * y2;
    *s3 += d2 * (y0 + y3);
    *s4 += d1 * y2 + d3 * y1;
    *s5 += d1 * y3 + d3 * y0;
}

// Shares the weight of s1.
TESSARINE_API void TOV_GetLineSegArea(double x0, double y0, double x1, double y1, double *s) {
    *s += (y0 + y1) * (x1 - x0);
}

}  // extern "C"
