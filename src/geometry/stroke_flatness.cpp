// When a cubic is flat enough to stand for its chord.
#include <tessarine/curves.h>

#include <cmath>

#include "geometry/stroke.h"

namespace tessarine::geometry {

void SplitCurveInHalf(const BZ_Curve &c, BZ_Curve *left, BZ_Curve *right) {
    left->p0 = c.p0;
    right->p3 = c.p3;
    SubDivideBezier(c.p0.x, c.p0.y, c.p1.x, c.p1.y, c.p2.x, c.p2.y, c.p3.x, c.p3.y, 0.5,
                    &left->p1.x, &left->p1.y, &right->p2.x, &right->p2.y, &left->p2.x,
                    &left->p2.y, &left->p3.x, &left->p3.y, &right->p1.x, &right->p1.y);
    right->p0 = left->p3;
}

int32_t VC_FlatByPolygon(const BZ_Curve &c, double tolerance) {
    BZ_Point v{c.p0.x - c.p3.x, c.p0.y - c.p3.y};
    const BZ_Point v1{c.p0.x - c.p1.x, c.p0.y - c.p1.y};
    const BZ_Point v2{c.p3.x - c.p2.x, c.p3.y - c.p2.y};
    const double length = std::sqrt(v.x * v.x + v.y * v.y);
    if (length > 1e-8) {
        v.x /= length;
        v.y /= length;
    } else {
        v = BZ_Point{1, 0};
    }
    const double d1 = v.x * v1.y - v.y * v1.x;
    const double d2 = v2.x * v.y - v2.y * v.x;
    const double m = std::fmax(std::fabs(d1), std::fabs(d2));
    // A negative product puts both handles on one side of the chord; that
    // case takes the smaller factor, and the pairing stays as it always was.
    const double factor = d1 * d2 <= -0.0001 ? 0.4444444444444444 : 0.75;
    return factor * m <= tolerance ? 1 : 0;
}

int32_t VC_FlatByChord(const BZ_Curve &c, double tolerance) {
    BZ_Curve left;
    BZ_Curve right;
    SplitCurveInHalf(c, &left, &right);
    const BZ_Point m = left.p3;
    const double limit = tolerance * tolerance;
    return DistanceSQ(c.p0.x, c.p0.y, m.x, m.y) <= limit &&
                   DistanceSQ(c.p3.x, c.p3.y, m.x, m.y) <= limit &&
                   DistanceSQ(c.p0.x, c.p0.y, c.p3.x, c.p3.y) <= limit
               ? 1
               : 0;
}

int32_t VC_CurveIsFlat(int16_t method, const BZ_Curve &c, double tolerance) {
    return method == 0 ? VC_FlatByPolygon(c, tolerance) : VC_FlatByChord(c, tolerance);
}

}  // namespace tessarine::geometry
