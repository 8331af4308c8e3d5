// Builders and sentinels shared by the geometry tests.
#pragma once

#include <gtest/gtest.h>

#include <cmath>

#include <tessarine/geometry.h>

#include "geometry/kernel.h"

namespace gtest_geometry {

inline constexpr double kPi = 3.141592653589793;
inline constexpr double kTurn = 6.283185307179586;
// Pre-filled into outs that must stay untouched.
inline constexpr double kSentinel = -12345.678;
inline constexpr int16_t kSentinel16 = 777;

inline BZ_Point Pt(double x, double y) { return BZ_Point{x, y}; }

inline BZ_Point OnCircle(double cx, double cy, double r, double angle) {
    return BZ_Point{cx + r * std::cos(angle), cy + r * std::sin(angle)};
}

// A consistent arc: every field derived from centre, radius and angles.
inline BZ_Arc MakeArc(double cx, double cy, double r, double startAngle, double sweep) {
    BZ_Arc a;
    a.centre = Pt(cx, cy);
    a.startAngle = startAngle;
    a.sweep = sweep;
    a.start = OnCircle(cx, cy, r, startAngle);
    a.mid = OnCircle(cx, cy, r, startAngle + 0.5 * sweep);
    a.end = OnCircle(cx, cy, r, startAngle + sweep);
    return a;
}

inline BZ_Line Ln(double x0, double y0, double x1, double y1) {
    return BZ_Line{{x0, y0}, {x1, y1}};
}

inline BZ_Point SentinelPoint() { return BZ_Point{kSentinel, kSentinel}; }

inline void ExpectSentinel(const BZ_Point &p) {
    EXPECT_EQ(p.x, kSentinel);
    EXPECT_EQ(p.y, kSentinel);
}

}  // namespace gtest_geometry
