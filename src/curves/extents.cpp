// Boxes of a line and of a circular arc.
#include "curves/toolkit.h"

namespace tessarine::curves {

int32_t QuadrantOfAngle(double angle) {
    // One fold each way and no more: callers keep angles within a turn.
    if (angle > kFullTurn) angle -= kFullTurn;
    if (angle < 0) angle += kFullTurn;
    if (angle <= kQuarterTurn) return 1;
    if (angle <= kHalfTurn) return 2;
    if (angle <= kThreeQuarterTurn) return 3;
    return 4;
}

}  // namespace tessarine::curves

namespace {

using tessarine::curves::QuadrantOfAngle;

constexpr unsigned kXMin = 1, kYMin = 2, kXMax = 4, kYMax = 8;
constexpr unsigned kAll = kXMin | kYMin | kXMax | kYMax;

// Extremes of the circle that an arc from quadrant q0 to quadrant q1 passes,
// counted counter-clockwise; a negative sweep reads the same table.
constexpr unsigned kPassedExtremes[4][4] = {
    {kAll, kYMax, kYMax | kXMin, kYMax | kXMin | kYMin},
    {kXMin | kYMin | kXMax, kAll, kXMin, kXMin | kYMin},
    {kYMin | kXMax, kYMin | kXMax | kYMax, kAll, kYMin},
    {kXMax, kXMax | kYMax, kXMax | kYMax | kXMin, kAll},
};

}  // namespace

extern "C" {

TESSARINE_API void LineExtent(double x0, double y0, double x1, double y1, double *xmin,
                              double *ymin, double *xmax, double *ymax) {
    if (x0 < x1) {
        if (x0 < *xmin) *xmin = x0;
        if (x1 > *xmax) *xmax = x1;
    } else {
        if (x1 < *xmin) *xmin = x1;
        if (x0 > *xmax) *xmax = x0;
    }
    if (y0 < y1) {
        if (y0 < *ymin) *ymin = y0;
        if (y1 > *ymax) *ymax = y1;
    } else {
        if (y1 < *ymin) *ymin = y1;
        if (y0 > *ymax) *ymax = y0;
    }
}

TESSARINE_API void CalcArcExtent(double width, double *xmin, double *ymin, double *xmax,
                                 double *ymax, double centreX, double centreY, double radius,
                                 double startAngle, double sweep) {
    // A width at or below -1e-8 asks for the bare arc.
    if (width > -1e-8) radius += width * 0.5;
    const double endAngle = startAngle + sweep;
    const int32_t q0 = QuadrantOfAngle(startAngle);
    const int32_t q1 = QuadrantOfAngle(endAngle);
    double s = 0.0, c = 0.0;
    GetSinCos(startAngle, &s, &c);
    const double startX = centreX + radius * c;
    const double startY = centreY + radius * s;
    GetSinCos(endAngle, &s, &c);
    const double endX = centreX + radius * c;
    const double endY = centreY + radius * s;

    *xmin = 400000000.0;
    *ymin = 400000000.0;
    *xmax = -400000000.0;
    *ymax = -400000000.0;
    if (!(q0 == q1 && sweep < tessarine::curves::kQuarterTurn)) {
        const unsigned passed = kPassedExtremes[q0 - 1][q1 - 1];
        if (passed & kXMin) *xmin = centreX - radius;
        if (passed & kXMax) *xmax = centreX + radius;
        if (passed & kYMin) *ymin = centreY - radius;
        if (passed & kYMax) *ymax = centreY + radius;
    }
    LineExtent(startX, startY, endX, endY, xmin, ymin, xmax, ymax);
}

}  // extern "C"
