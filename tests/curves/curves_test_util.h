// Builders, sentinels and a heap-checking fixture shared by the curve tests.
#pragma once

#include <gtest/gtest.h>

#include <cmath>

#include <tessarine/curves.h>

#include "test_support.h"

namespace gtest_curves {

inline constexpr double kQuarter = 1.5707963267948966;
inline constexpr double kHalf = 3.141592653589793;
inline constexpr double kTurn = 6.283185307179586;
// Pre-filled into outs that must stay untouched.
inline constexpr double kSentinel = -12345.678;
inline constexpr int16_t kSentinel16 = 777;

inline BZ_Point Pt(double x, double y) {
    return BZ_Point{x, y};
}

// Curves as the eight doubles the intersection entry points take.
struct Cubic {
    double v[8];
    BZ_Point P(int i) const { return BZ_Point{v[2 * i], v[2 * i + 1]}; }
    Cubic Reversed() const { return Cubic{{v[6], v[7], v[4], v[5], v[2], v[3], v[0], v[1]}}; }
};

// The point at t by de Casteljau, written out independently of the library.
inline BZ_Point PointAt(const Cubic &c, double t) {
    const double s = 1 - t;
    const double b0 = s * s * s, b1 = 3 * s * s * t, b2 = 3 * s * t * t, b3 = t * t * t;
    return BZ_Point{b0 * c.v[0] + b1 * c.v[2] + b2 * c.v[4] + b3 * c.v[6],
                    b0 * c.v[1] + b1 * c.v[3] + b2 * c.v[5] + b3 * c.v[7]};
}

// The sub-curve over (t0, t1), by the standard blossom, independently.
inline Cubic SubCurve(const Cubic &c, double t0, double t1) {
    auto blossom = [&](double a, double b, double d) {
        double px[4], py[4];
        for (int i = 0; i < 4; ++i) {
            px[i] = c.v[2 * i];
            py[i] = c.v[2 * i + 1];
        }
        const double ts[3] = {a, b, d};
        for (int level = 0; level < 3; ++level)
            for (int i = 0; i < 3 - level; ++i) {
                px[i] = px[i] + (px[i + 1] - px[i]) * ts[level];
                py[i] = py[i] + (py[i + 1] - py[i]) * ts[level];
            }
        return BZ_Point{px[0], py[0]};
    };
    const BZ_Point q0 = blossom(t0, t0, t0), q1 = blossom(t0, t0, t1), q2 = blossom(t0, t1, t1),
                   q3 = blossom(t1, t1, t1);
    return Cubic{{q0.x, q0.y, q1.x, q1.y, q2.x, q2.y, q3.x, q3.y}};
}

inline double Dist(BZ_Point a, BZ_Point b) {
    return std::hypot(a.x - b.x, a.y - b.y);
}

// Least distance from p to the curve, by dense sampling and a local polish.
inline double DistanceToCurve(const Cubic &c, BZ_Point p) {
    double best = 1e300, bestT = 0;
    for (int i = 0; i <= 2000; ++i) {
        const double t = i / 2000.0;
        const double d = Dist(PointAt(c, t), p);
        if (d < best) best = d, bestT = t;
    }
    double lo = std::fmax(0, bestT - 1 / 2000.0), hi = std::fmin(1, bestT + 1 / 2000.0);
    for (int i = 0; i < 100; ++i) {
        const double m1 = lo + (hi - lo) / 3, m2 = hi - (hi - lo) / 3;
        if (Dist(PointAt(c, m1), p) < Dist(PointAt(c, m2), p))
            hi = m2;
        else
            lo = m1;
    }
    return std::fmin(best, Dist(PointAt(c, 0.5 * (lo + hi)), p));
}

// The sandbox checks heap blocks left behind after every test.
class CurveTest : public tstest::Sandbox {};

}  // namespace gtest_curves

namespace gtest_curves {

// The result arrays of a curve pair, pre-filled with sentinels.
struct Hits {
    double tA[14], tB[14];
    BZ_Point pts[14];
    uint16_t count = 999;
    int16_t kind = kSentinel16;
    int32_t status = 0;
    Hits() {
        for (int i = 0; i < 14; ++i) {
            tA[i] = tB[i] = kSentinel;
            pts[i] = Pt(kSentinel, kSentinel);
        }
    }
};

inline Hits CurvePair(const Cubic &a, const Cubic &b, double tol) {
    Hits h;
    h.status = NewCurveCurveIntersect(a.v, b.v, h.tA, h.tB, h.pts, &h.count, tol, &h.kind);
    return h;
}

}  // namespace gtest_curves
