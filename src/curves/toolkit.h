// Constants and internal operations of the curve toolkit. Nothing here is
// exported.
#pragma once

#include <tessarine/curves.h>

#include <cstdint>

namespace tessarine::curves {

inline constexpr double kQuarterTurn = 1.5707963267948966;
inline constexpr double kHalfTurn = 3.141592653589793;
inline constexpr double kThreeQuarterTurn = 4.71238898038469;
inline constexpr double kFullTurn = 6.283185307179586;

// 1 to 4, after folding the angle by at most one turn each way.
int32_t QuadrantOfAngle(double angle);

// Index of the lowest of S[0] to S[7]; the earliest of equal samples stays.
int LowestSample(const double S[9]);

// Nearest point of the power-form cubic ((a t + b) t + c) t + d to (px, py);
// 1 for a hit within limit. dist, x and y are cleared first.
int32_t NearestOnCubic(const BZ_CurveCoef &coef, double px, double py, double *dist, double *t,
                       double *x, double *y, double limit, double eps);

}  // namespace tessarine::curves
