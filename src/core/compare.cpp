// Comparisons with a tolerance. Every bound is inclusive except FGT's; a NaN
// on either side makes every member false.
#include <cmath>

#include <tessarine/core.h>

namespace {

constexpr double kTolerance = 1e-8;

int32_t Within(double a, double b, double t) {
    return std::fabs(a - b) <= t ? 1 : 0;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t FEQ(double a, double b, double t) {
    return Within(a, b, t);
}

TESSARINE_API int32_t EQ(double a, double b) {
    return Within(a, b, kTolerance);
}

TESSARINE_API int32_t FGT(double a, double b, double t) {
    return a - b > t ? 1 : 0;
}

// The plain comparison comes first, so a negative tolerance cannot undo it.
TESSARINE_API int32_t LEQ(double a, double b) {
    return a < b ? 1 : Within(a, b, kTolerance);
}

TESSARINE_API int32_t FLEQ(double a, double b, double t) {
    return a < b ? 1 : Within(a, b, t);
}

TESSARINE_API int32_t GEQ(double a, double b) {
    return a > b ? 1 : Within(a, b, kTolerance);
}

TESSARINE_API int32_t FGEQ(double a, double b, double t) {
    return a > b ? 1 : Within(a, b, t);
}

}  // extern "C"
