// The rounding rules shared by the numeric helpers and the matrix code.
#pragma once

#include <cstdint>

namespace tessarine::detail {

// Truncation toward zero as the hardware does it: a value outside int32, or
// NaN, gives INT32_MIN instead of undefined behaviour.
inline int32_t TruncateToInt32(double v) {
    if (v > -2147483649.0 && v < 2147483648.0) return static_cast<int32_t>(v);
    return INT32_MIN;
}

// Half away from zero above 0, toward zero below it; -0.0 is not below 0.
inline int32_t LongRoundRule(double x) {
    return TruncateToInt32(x < 0 ? x - 0.499999999 : x + 0.500000001);
}

inline int32_t ShortRoundRule(double x) {
    return TruncateToInt32(x < 0 ? x - 0.4999999999 : x + 0.5000000001);
}

}  // namespace tessarine::detail
