// The tight box of a cubic, from the extremes of the curve itself rather
// than of its control points.
#include <tessarine/curves.h>

#include <cmath>

namespace {

constexpr double kEps = 1e-8;

// s = (1 - t) / t for a forward root, t / (1 - t) for a reverse one.
struct Root {
    double s;
    bool reverse;
};

int CandidateRoots(double d1, double d2, double d3, Root *roots) {
    const double D = d2 * d2 - d1 * d3;
    const bool d1Small = -kEps < d1 && d1 < kEps;
    if (d1Small) {
        if (-kEps < d3 && d3 <= kEps) return 0;
        if (d3 > kEps && d2 < -kEps) return roots[0] = Root{-2 * d2 / d3, true}, 1;
        if (d3 <= -kEps && d2 > kEps) return roots[0] = Root{-2 * d2 / d3, true}, 1;
        return 0;
    }
    auto both = [&] {
        const double s1 = (std::sqrt(D) - d2) / d1;
        roots[0] = Root{s1, false};
        roots[1] = Root{d3 / (s1 * d1), false};
        return 2;
    };
    if (d1 <= -kEps) {
        if (d3 > kEps) return D > kEps ? (roots[0] = Root{(-std::sqrt(D) - d2) / d1, false}, 1) : 0;
        if (-kEps < d3 && d3 <= kEps) return d2 > kEps ? (roots[0] = Root{-2 * d2 / d1, false}, 1) : 0;
        if (d3 <= -kEps) return d2 > kEps && D > kEps ? both() : 0;
        return 0;
    }
    if (d1 >= kEps) {
        if (-kEps <= d3 && d3 < kEps) return d2 < -kEps ? (roots[0] = Root{-2 * d2 / d1, false}, 1) : 0;
        if (d3 < -kEps) return D > kEps ? (roots[0] = Root{(std::sqrt(D) - d2) / d1, false}, 1) : 0;
        if (d3 >= kEps) return d2 < -kEps && D > kEps ? both() : 0;
    }
    return 0;
}

}  // namespace

extern "C" {

TESSARINE_API void TOV_CalcComponentExt(double c0, double c1, double c2, double c3, double *min,
                                        double *max) {
    const bool asGiven = c0 < c3;
    const double q0 = asGiven ? c0 : c3;
    const double q1 = asGiven ? c1 : c2;
    const double q2 = asGiven ? c2 : c1;
    const double q3 = asGiven ? c3 : c0;
    *min = q0;
    *max = q3;
    Root roots[2];
    const int n = CandidateRoots(q1 - q0, q2 - q1, q3 - q2, roots);
    for (int i = 0; i < n; ++i) {
        const double s = roots[i].s;
        double value;
        double w;
        if (roots[i].reverse) {
            value = ((s * q3 + 3 * q2) * s + 3 * q1) * s + q0;
            w = 1 - s / (s + 1);
        } else {
            value = ((s * q0 + 3 * q1) * s + 3 * q2) * s + q3;
            w = 1 / (s + 1);
        }
        value = value * (w * w * w);
        if (value > *max) {
            *max = value;
        } else if (value < *min) {
            *min = value;
        }
    }
}

TESSARINE_API void CalcCurvePathExtent(double x0, double y0, double x1, double y1, double x2,
                                       double y2, double x3, double y3, double *xmin,
                                       double *ymin, double *xmax, double *ymax) {
    TOV_CalcComponentExt(x0, x1, x2, x3, xmin, xmax);
    TOV_CalcComponentExt(y0, y1, y2, y3, ymin, ymax);
}

}  // extern "C"
