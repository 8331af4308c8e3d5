// The arc that starts at p0, passes through p1 and ends at p2.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kErrDegenerate;
using tessarine::kOk;

namespace {

// The turn at p1 is within about 0.05 degree of straight.
constexpr int16_t kStraight = 101;

}  // namespace

extern "C" TESSARINE_API int32_t BZ_3ptarcinfo(double x0, double y0, double x1, double y1,
                                               double x2, double y2, BZ_Point *centre,
                                               double *radius, double *startAngle,
                                               double *sweep, double *length,
                                               int16_t *outcome) {
    auto report = [outcome](int32_t value) {
        if (outcome != nullptr) *outcome = static_cast<int16_t>(value);
        return kOk;
    };
    BZ_Point u;
    BZ_Point v;
    const int32_t su = BZ_GetNormVector(x1, y1, x0, y0, &u);
    const int32_t sv = BZ_GetNormVector(x1, y1, x2, y2, &v);
    if (su == kErrDegenerate || sv == kErrDegenerate) return report(kErrDegenerate);
    // A closed loop has no unique circle by three points.
    if (BZ_Distptpts(x0, y0, x2, y2) < 1e-13) return report(kErrDegenerate);
    if (std::fabs(BZminanglev1v2(u.x, u.y, v.x, v.y)) > 3.140719989) return report(kStraight);
    const double c = BZ_Crossp(u.x, u.y, v.x, v.y);
    if (FEQ(c, 0.0, 1e-13)) return report(kStraight);

    const double wx = x2 - x0;
    const double wy = y2 - y0;
    const double k = (wx * v.x + wy * v.y) / (2.0 * c);
    const BZ_Point o{(x1 + x0) * 0.5 - u.y * k, (y0 + y1) * 0.5 + u.x * k};
    const double r = BZ_Distptpt(o.x, o.y, x0, y0);
    if (r < 1e-8) return report(kErrDegenerate);

    double a0 = 0.0;
    double s = 0.0;
    double len = 0.0;
    if (startAngle != nullptr || sweep != nullptr || length != nullptr) {
        a0 = BZccwdir(std::atan2(y0 - o.y, x0 - o.x));
        const double a1 = BZccwdir(std::atan2(y1 - o.y, x1 - o.x));
        const double a2 = BZccwdir(std::atan2(y2 - o.y, x2 - o.x));
        s = BZccwdir(BZonerevol(a2 - a0));
        const double m = BZccwdir(BZonerevol(a1 - a0));
        // Passing p1 after p2 counter-clockwise means the way is clockwise.
        if (m > s) s = BZcomp(s);
        len = std::fabs(s) * r;
    }
    if (centre != nullptr) *centre = o;
    if (radius != nullptr) *radius = r;
    if (startAngle != nullptr) *startAngle = a0;
    if (sweep != nullptr) *sweep = s;
    if (length != nullptr) *length = len;
    return report(kOk);
}
