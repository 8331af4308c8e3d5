// Closed-form roots of quadratics and cubics. The cubic solver serves curve
// parameters: it keeps only roots near 0 to 1.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;

namespace {

// The cube root as the library has always taken it: a power with a truncated
// exponent.
constexpr double kCubeRootExponent = 0.33333333;

double Sign(double v) { return v >= 0 ? 1.0 : -1.0; }

bool NearUnitRange(double root, double T) { return -T <= root && root <= 1 + T; }

}  // namespace

namespace tessarine::geometry {

void CL_ThreeRealRoots(double p, double q, double D, double shift, double T, double *roots,
                       int16_t *count) {
    const double r = std::sqrt(std::fabs(p / 3));
    const double th = BZ_atan2z(std::sqrt(std::fabs(D)), -q / 2, 0);
    const double C = std::cos(th / 3) * r;
    const double S = std::sin(th / 3) * r * 1.732050808;
    const double candidates[3] = {2 * C + shift, shift - (S + C), shift + (S - C)};
    for (double candidate : candidates) {
        roots[*count] = candidate;
        if (NearUnitRange(candidate, T)) ++*count;
    }
}

}  // namespace tessarine::geometry

extern "C" {

TESSARINE_API int32_t FindRootDegree2(double a, double b, double c, double *first,
                                      double *second) {
    const double D = b * b - 4 * a * c;
    if (D < 0) return tessarine::kErrNoRealRoot;
    if (FEQ(2 * a, 0, 1e-13)) {
        if (FEQ(b, 0, 1e-13)) return tessarine::kErrNoRealRoot;
        *first = -c / b;
        *second = -c / b;
        return kOk;
    }
    const double s = std::sqrt(D);
    *first = (s - b) / (2 * a);
    *second = (-b - s) / (2 * a);
    return kOk;
}

TESSARINE_API int32_t CL_Solv3orderEq(double a, double b, double c, double d, double tolerance,
                                      double *roots, int16_t *count, int16_t *flag) {
    const double T = tolerance * 0.01;
    const double E = T * 0.01;
    if (std::fabs(a) < 1000 * tolerance) {
        a *= 1000;
        b *= 1000;
        c *= 1000;
        d *= 1000;
    }
    *count = 0;
    const double k = b / a;
    const double p = c / a - k * k / 3;
    const double q = d / a + (2.0 / 27.0) * k * k * k - (c / a) * k / 3;
    const double D = q * q / 4 + p * p * p / 27;
    const double shift = -(b / (3 * a));
    *flag = 1;
    double root;
    if (D > E) {
        const double A = std::sqrt(D) - q / 2;
        const double B = -q / 2 - std::sqrt(D);
        root = Sign(B) * std::pow(std::fabs(B), kCubeRootExponent) +
               Sign(A) * std::pow(std::fabs(A), kCubeRootExponent) + shift;
    } else if (D <= -E) {
        tessarine::geometry::CL_ThreeRealRoots(p, q, D, shift, T, roots, count);
        return kOk;
    } else {
        root = 2 * Sign(-q / 2) * std::pow(std::fabs(q / 2), kCubeRootExponent) + shift;
    }
    roots[0] = root;
    *count = NearUnitRange(root, T) ? 1 : 0;
    return kOk;
}

}  // extern "C"
