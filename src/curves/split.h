// A cubic record split at a parameter into its two halves, through the
// exported de Casteljau split and its order of out values.
#pragma once

#include <tessarine/curves.h>

namespace tessarine::curves {

inline void SplitCurveAt(const BZ_Curve &c, double t, BZ_Curve *left, BZ_Curve *right) {
    left->p0 = c.p0;
    right->p3 = c.p3;
    SubDivideBezier(c.p0.x, c.p0.y, c.p1.x, c.p1.y, c.p2.x, c.p2.y, c.p3.x, c.p3.y, t,
                    &left->p1.x, &left->p1.y, &right->p2.x, &right->p2.y, &left->p2.x,
                    &left->p2.y, &left->p3.x, &left->p3.y, &right->p1.x, &right->p1.y);
    right->p0 = left->p3;
}

}  // namespace tessarine::curves
