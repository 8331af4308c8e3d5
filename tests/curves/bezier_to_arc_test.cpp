// The cubic-to-lines-and-arcs fit: its edge cases, its limits, and the chain
// staying on the curve.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include "core/status.h"
#include "curve_test_util.h"
#include "test_support.h"

using namespace gtest_curves;

namespace {

struct Fit {
    int32_t result = -1;
    int16_t count = -1;
    ArcFitEntry entries[101];
};

Fit FitCurve(double tol, const Cubic &c) {
    Fit f;
    std::memset(f.entries, 0xAB, sizeof f.entries);
    f.result = BezierToArc(tol, c.v[0], c.v[1], c.v[2], c.v[3], c.v[4], c.v[5], c.v[6], c.v[7],
                           f.entries, &f.count);
    return f;
}

BZ_Point OnEntry(const ArcFitEntry &e, double s) {
    if (e.isArc == 0) return BZ_Point{e.a + (e.c - e.a) * s, e.b + (e.d - e.b) * s};
    const double r = std::fabs(e.c);
    const double angle = e.d + e.e * s;
    return BZ_Point{e.a + r * std::cos(angle), e.b + r * std::sin(angle)};
}

// Largest distance from the chain to the curve, sampled densely.
double ChainDeviation(const Fit &f, const Cubic &c) {
    double worst = 0;
    for (int i = 0; i < f.count; ++i)
        for (int k = 0; k <= 24; ++k)
            worst = std::fmax(worst, DistanceToCurve(c, OnEntry(f.entries[i], k / 24.0)));
    return worst;
}

const Cubic kQuarter{{1, 0, 1, kKappa, kKappa, 1, 0, 1}};

TEST(BezierToArc, StraightCubicWithHandlesOnTheChordGivesOneLine) {
    const Fit f = FitCurve(0.01, Cubic{{0, 0, 1, 1, 2, 2, 3, 3}});
    ASSERT_EQ(f.result, 1);
    ASSERT_EQ(f.count, 1);
    EXPECT_EQ(f.entries[0].isArc, 0);
    EXPECT_EQ(f.entries[0].a, 0);
    EXPECT_EQ(f.entries[0].b, 0);
    EXPECT_EQ(f.entries[0].c, 3);
    EXPECT_EQ(f.entries[0].d, 3);
    EXPECT_EQ(f.entries[0].e, 0);
}

TEST(BezierToArc, HandlePointingBackwardsAlongTheChordGivesOneLine) {
    const Fit f = FitCurve(0.01, Cubic{{0, 0, -1, 0, 2, 0, 3, 0}});
    ASSERT_EQ(f.result, 1);
    ASSERT_EQ(f.count, 1);
    EXPECT_EQ(f.entries[0].isArc, 0);
    EXPECT_EQ(f.entries[0].c, 3);
    EXPECT_EQ(f.entries[0].e, 0);
}

TEST(BezierToArc, QuarterCircleIsHalvedIntoTwoArcsThatDoNotMerge) {
    const Fit f = FitCurve(0.001, kQuarter);
    ASSERT_EQ(f.result, 1);
    ASSERT_EQ(f.count, 2);
    double total = 0;
    for (int i = 0; i < 2; ++i) {
        const ArcFitEntry &e = f.entries[i];
        EXPECT_EQ(e.isArc, 1);
        // The cubic is not quite a circle: the circle through three of its
        // points sits a little off the unit circle.
        EXPECT_NEAR(e.a, 0, 1e-2);
        EXPECT_NEAR(e.b, 0, 1e-2);
        // Counter-clockwise: the radius is negative, the sweep positive.
        EXPECT_LT(e.c, 0);
        EXPECT_NEAR(std::fabs(e.c), 1, 1e-2);
        EXPECT_GT(e.e, 0);
        EXPECT_LE(std::fabs(e.e), 1.2217304763960306);
        EXPECT_GE(e.d, 0);
        EXPECT_LT(e.d, kTurn);
        total += e.e;
    }
    EXPECT_NEAR(total, kPi / 2, 1e-2);
    EXPECT_LE(ChainDeviation(f, kQuarter), 1.5 * 0.001);
}

TEST(BezierToArc, ClockwiseArcKeepsAPositiveRadius) {
    const Cubic cw{{0, 1, kKappa, 1, 1, kKappa, 1, 0}};
    const Fit f = FitCurve(0.001, cw);
    ASSERT_EQ(f.result, 1);
    ASSERT_GE(f.count, 1);
    for (int i = 0; i < f.count; ++i) {
        EXPECT_EQ(f.entries[i].isArc, 1);
        EXPECT_GT(f.entries[i].c, 0);
        EXPECT_LT(f.entries[i].e, 0);
    }
}

TEST(BezierToArc, ClosedCurveWithEqualEndsIsOneZeroLengthLine) {
    // The handle height of a chord of no length is 0, and the straightness
    // limit is 0 as well: the algorithm appends one line before any halving.
    const Fit f = FitCurve(0.01, Cubic{{0, 0, 5, 5, -5, 5, 0, 0}});
    EXPECT_EQ(f.result, 1);
    ASSERT_EQ(f.count, 1);
    EXPECT_EQ(f.entries[0].isArc, 0);
    EXPECT_EQ(f.entries[0].a, 0);
    EXPECT_EQ(f.entries[0].c, 0);
    EXPECT_EQ(f.entries[0].e, 0);
}

TEST(BezierToArc, NearlyClosedCurveIsHalvedAndFollowsTheCurve) {
    const Cubic loop{{0, 0, 5, 5, -5, 5, 1e-9, 0}};
    const Fit f = FitCurve(0.01, loop);
    ASSERT_EQ(f.result, 1);
    EXPECT_GT(f.count, 2);
    EXPECT_LE(ChainDeviation(f, loop), 1.5 * 0.01);
}

TEST(BezierToArc, AllFourPointsEqualGiveAZeroLengthLine) {
    const Fit f = FitCurve(0.01, Cubic{{2, 3, 2, 3, 2, 3, 2, 3}});
    EXPECT_EQ(f.result, 1);
    ASSERT_EQ(f.count, 1);
    EXPECT_EQ(f.entries[0].isArc, 0);
    EXPECT_EQ(f.entries[0].a, 2);
    EXPECT_EQ(f.entries[0].d, 3);
}

TEST(BezierToArc, SShapedCurveIsHalved) {
    const Cubic s{{0, 0, 3, 4, -1, 4, 2, 0}};
    const Fit f = FitCurve(0.01, s);
    ASSERT_EQ(f.result, 1);
    EXPECT_GE(f.count, 2);
    EXPECT_LE(ChainDeviation(f, s), 1.5 * 0.01);
}

TEST(BezierToArc, ZeroToleranceRunsOutOfStackOrCountAndEndsWithZero) {
    const Fit f = FitCurve(0, kQuarter);
    EXPECT_EQ(f.result, 0);
    EXPECT_GE(f.count, 0);
    EXPECT_LE(f.count, 101);
}

TEST(BezierToArc, MoreThanAHundredElementsEndWithZeroAndKeepThem) {
    // A long wavy curve at a fine tolerance: many elements, shallow halving.
    const Cubic wave{{0, 0, 3000, 9000, -2000, -9000, 1000, 0}};
    const Fit f = FitCurve(1e-6, wave);
    EXPECT_EQ(f.result, 0);
    EXPECT_EQ(f.count, 101);
    for (int i = 0; i < f.count; ++i) EXPECT_TRUE(f.entries[i].isArc == 0 || f.entries[i].isArc == 1);
}

TEST(BezierToArc, StackThatCannotBeAllocatedGivesZeroAndLeavesTheCount) {
    tstest::ForEachAllocationFailure([](int64_t) {
        ArcFitEntry entries[101];
        int16_t count = 555;
        const int32_t r = BezierToArc(0.01, 1, 0, 1, kKappa, kKappa, 1, 0, 1, entries, &count);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(r, 0);
            EXPECT_EQ(count, 555);
        } else {
            EXPECT_EQ(r, 1);
        }
    });
}

TEST(BezierToArc, EveryElementStaysNearTheCurve) {
    Random rnd(16);
    int checked = 0;
    for (int i = 0; i < 150; ++i) {
        const Cubic c = rnd.Curve(10);
        const double tol = rnd.Uniform(0.002, 0.05);
        const Fit f = FitCurve(tol, c);
        if (f.result != 1) continue;
        ++checked;
        ASSERT_LE(ChainDeviation(f, c), 1.5 * tol) << "case " << i;
    }
    EXPECT_GT(checked, 120);
}

}  // namespace
