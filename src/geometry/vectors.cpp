// Vector arithmetic on plain components. A vector shorter than about 3.2e-7
// (squared length at or below 1e-13) counts as no vector.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kErrDegenerate;
using tessarine::kOk;
using tessarine::geometry::kPi;

extern "C" {

TESSARINE_API double BZ_Crossp(double x1, double y1, double x2, double y2) {
    return x1 * y2 - x2 * y1;
}

TESSARINE_API double BZ_Dotp(double x1, double y1, double x2, double y2) {
    return x1 * x2 + y1 * y2;
}

TESSARINE_API double BZ_Magsvec(double x, double y) { return x * x + y * y; }

TESSARINE_API double BZ_Magvec(double x, double y) {
    const double s = x * x + y * y;
    return s > 0 ? std::sqrt(s) : 0.0;
}

TESSARINE_API double BZ_Distptpt(double x0, double y0, double x1, double y1) {
    const double dx = x1 - x0;
    const double dy = y1 - y0;
    const double s = dx * dx + dy * dy;
    return s > 0 ? std::sqrt(s) : 0.0;
}

TESSARINE_API int32_t BZ_GetVector(double x0, double y0, double x1, double y1, BZ_Point *out) {
    out->x = x1 - x0;
    out->y = y1 - y0;
    return kOk;
}

TESSARINE_API int32_t BZ_Normvec(BZ_Point *vector) {
    const double s = vector->x * vector->x + vector->y * vector->y;
    if (s <= 1e-13) {
        vector->x = 0.0;
        vector->y = 0.0;
        return kErrDegenerate;
    }
    const double inverse = 1.0 / std::sqrt(s);
    vector->x *= inverse;
    vector->y *= inverse;
    return kOk;
}

TESSARINE_API int32_t BZ_GetNormVector(double x0, double y0, double x1, double y1, BZ_Point *out) {
    BZ_Point v{x1 - x0, y1 - y0};
    const int32_t status = BZ_Normvec(&v);
    *out = v;
    return status;
}

TESSARINE_API int32_t BZ_Rotatevec(double angle, BZ_Point *vector) {
    const double c = std::cos(angle);
    const double s = std::sin(angle);
    const double x = vector->x;
    const double y = vector->y;
    vector->x = x * c - y * s;
    vector->y = x * s + y * c;
    return kOk;
}

TESSARINE_API int32_t BZ_vecequal(int16_t allowOpposite, double x1, double y1, double x2,
                                  double y2, int16_t *status) {
    BZ_Point u{x1, y1};
    BZ_Point v{x2, y2};
    int32_t s = BZ_Normvec(&u);
    if (s == kErrDegenerate) {
        *status = static_cast<int16_t>(s);
        return 0;
    }
    s = BZ_Normvec(&v);
    if (s == kErrDegenerate) {
        *status = static_cast<int16_t>(s);
        return 0;
    }
    *status = static_cast<int16_t>(kOk);
    const double d = u.x * v.x + u.y * v.y;
    if (std::fabs(1.0 - d) < 0.0001) return 1;
    if (allowOpposite != 0 && std::fabs(-1.0 - d) < 0.0001) return 2;
    return 0;
}

TESSARINE_API int32_t rotateDir(double x1, double y1, double x2, double y2, double tolerance) {
    const double cross = x1 * y2 - y1 * x2;
    if (!FEQ(cross, 0.0, tolerance)) return 3;
    return x1 * x2 + y1 * y2 >= 0 ? 1 : 2;
}

TESSARINE_API void BZ_Polar2Cart(double angle, double radius, double *x, double *y) {
    *x = std::cos(angle) * radius;
    *y = std::sin(angle) * radius;
}

TESSARINE_API double BZ_sqrt(double x) { return x > 0 ? std::sqrt(x) : 0.0; }

TESSARINE_API double BZ_acos(double x) {
    if (x >= 1) return 0.0;
    if (x <= -1) return kPi;
    return std::acos(x);
}

TESSARINE_API double BZ_atan2z(double y, double x, double fallback) {
    if (x * x + y * y < 2e-13) return fallback;
    return std::atan2(y, x);
}

TESSARINE_API double BZminanglev1v2(double x1, double y1, double x2, double y2) {
    const double a2 = BZ_atan2z(y2, x2, 0.0);
    const double a1 = BZ_atan2z(y1, x1, 0.0);
    double d = BZonerevol(a2 - a1);
    if (std::fabs(d) > kPi) d = d < 0 ? d + tessarine::geometry::kFullTurn
                                      : d - tessarine::geometry::kFullTurn;
    return d;
}

}  // extern "C"
