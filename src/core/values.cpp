// Swaps, absolute values and the small conversions.
#include <cmath>
#include <utility>

#include <tessarine/core.h>

extern "C" {

TESSARINE_API void FloatSwap(double *a, double *b) {
    std::swap(*a, *b);
}

TESSARINE_API void ShortSwap(int16_t *a, int16_t *b) {
    std::swap(*a, *b);
}

TESSARINE_API void LongSwap(int32_t *a, int32_t *b) {
    std::swap(*a, *b);
}

// Negated in unsigned arithmetic: INT32_MIN comes back as itself.
TESSARINE_API int32_t LongABS(int32_t x) {
    const uint32_t u = static_cast<uint32_t>(x);
    return static_cast<int32_t>(x < 0 ? 0u - u : u);
}

TESSARINE_API int32_t ShortABS(int16_t x) {
    const int32_t wide = x;
    return wide < 0 ? -wide : wide;
}

TESSARINE_API float ABSfloat(float x) {
    return std::fabs(x);
}

TESSARINE_API double FloatABS(double x) {
    return std::fabs(x);
}

TESSARINE_API double Square(double x) {
    return x * x;
}

TESSARINE_API double RadToDegree(double r) {
    return r * 57.29577951308232;
}

TESSARINE_API double DegreeToRad(double d) {
    return d * 0.017453292519943295;
}

}  // extern "C"
