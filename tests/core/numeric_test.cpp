// Tolerant comparisons, rounding, values, distances and the planar helpers.
#include <cmath>
#include <cstdint>
#include <limits>

#include <gtest/gtest.h>

#include <tessarine/core.h>

namespace {

const double kNaN = std::numeric_limits<double>::quiet_NaN();
const double kInf = std::numeric_limits<double>::infinity();

TEST(Compare, FeqBoundIsInclusive) {
    EXPECT_EQ(FEQ(1, 1.5, 0.5), 1);
    EXPECT_EQ(FEQ(1, 1.6, 0.5), 0);
    EXPECT_EQ(FEQ(1.5, 1, 0.5), 1);
}

TEST(Compare, EqUsesDefaultTolerance) {
    EXPECT_EQ(EQ(0, 1e-8), 1);
    EXPECT_EQ(EQ(0, 2e-8), 0);
    EXPECT_EQ(EQ(1e-8, 0), 1);
}

TEST(Compare, FgtIsStrictOnSignedDifference) {
    EXPECT_EQ(FGT(2, 1, 1), 0);
    EXPECT_EQ(FGT(2.1, 1, 1), 1);
    EXPECT_EQ(FGT(1, 2, 0), 0);
    EXPECT_EQ(FGT(1, 2, 5), 0);
    // A negative tolerance is taken as it stands.
    EXPECT_EQ(FGT(1, 1, -1), 1);
    EXPECT_EQ(FGT(1, 1.5, -1), 1);
}

TEST(Compare, LeqAndGeqWithinTolerance) {
    EXPECT_EQ(LEQ(1 + 5e-9, 1), 1);
    EXPECT_EQ(LEQ(1 + 5e-8, 1), 0);
    EXPECT_EQ(LEQ(0.5, 1), 1);
    EXPECT_EQ(GEQ(1, 1 + 5e-9), 1);
    EXPECT_EQ(GEQ(1, 1 + 5e-8), 0);
    EXPECT_EQ(GEQ(2, 1), 1);
}

TEST(Compare, PlainComparisonWinsOverNegativeTolerance) {
    EXPECT_EQ(FLEQ(1, 2, -1), 1);
    EXPECT_EQ(FLEQ(2, 1, -1), 0);
    EXPECT_EQ(FLEQ(1, 1, -1), 0);
    EXPECT_EQ(FGEQ(2, 1, -1), 1);
    EXPECT_EQ(FGEQ(1, 2, -1), 0);
    EXPECT_EQ(FLEQ(1.25, 1, 0.25), 1);
    EXPECT_EQ(FGEQ(1, 1.25, 0.25), 1);
}

TEST(Compare, NaNMakesEveryMemberFalse) {
    for (double other : {0.0, 1.0, kNaN}) {
        EXPECT_EQ(FEQ(kNaN, other, 1e300), 0);
        EXPECT_EQ(FEQ(other, kNaN, 1e300), 0);
        EXPECT_EQ(EQ(kNaN, other), 0);
        EXPECT_EQ(FGT(kNaN, other, -1e300), 0);
        EXPECT_EQ(FGT(other, kNaN, -1e300), 0);
        EXPECT_EQ(LEQ(kNaN, other), 0);
        EXPECT_EQ(LEQ(other, kNaN), 0);
        EXPECT_EQ(FLEQ(kNaN, other, 1e300), 0);
        EXPECT_EQ(GEQ(kNaN, other), 0);
        EXPECT_EQ(GEQ(other, kNaN), 0);
        EXPECT_EQ(FGEQ(other, kNaN, 1e300), 0);
    }
    EXPECT_EQ(FEQ(1, 1, kNaN), 0);
}

TEST(Rounding, ShortRoundHalves) {
    EXPECT_EQ(ShortRound(-0.5), 0);
    EXPECT_EQ(ShortRound(-0.6), -1);
    EXPECT_EQ(ShortRound(0.5), 1);
    EXPECT_EQ(ShortRound(2.5), 3);
    EXPECT_EQ(ShortRound(-2.5), -2);
    EXPECT_EQ(ShortRound(-0.0), 0);
    EXPECT_EQ(ShortRound(0.4999999995), 0);
}

TEST(Rounding, LongRoundBiasIsTenTimesLarger) {
    EXPECT_EQ(LongRound(0.4999999995), 1);
    EXPECT_EQ(LongRound(2.5), 3);
    EXPECT_EQ(LongRound(-2.5), -2);
    EXPECT_EQ(LongRound(-0.5), 0);
    EXPECT_EQ(LongRound(-0.6), -1);
    EXPECT_EQ(LongRound(-0.0), 0);
    EXPECT_EQ(LongRound(7.0), 7);
    EXPECT_EQ(LongRound(-7.0), -7);
}

TEST(Rounding, NotReducedToSixteenBits) {
    EXPECT_EQ(ShortRound(70000.2), 70000);
    EXPECT_EQ(ShortRound(-70000.7), -70001);
}

TEST(Rounding, OutOfRangeAndNaNGiveIntMin) {
    for (double v : {kNaN, kInf, -kInf, 3e9, -3e9, 2147483647.6, -2147483648.6}) {
        EXPECT_EQ(ShortRound(v), INT32_MIN) << v;
        EXPECT_EQ(LongRound(v), INT32_MIN) << v;
    }
    EXPECT_EQ(LongRound(2147483647.0), INT32_MAX);
    EXPECT_EQ(LongRound(-2147483648.0), INT32_MIN);
    EXPECT_EQ(ShortRound(-2147483648.4), -2147483648LL);
}

TEST(Values, Swaps) {
    double a = 1.5, b = -2.5;
    FloatSwap(&a, &b);
    EXPECT_EQ(a, -2.5);
    EXPECT_EQ(b, 1.5);
    int16_t s = 3, t = -4;
    ShortSwap(&s, &t);
    EXPECT_EQ(s, -4);
    EXPECT_EQ(t, 3);
    int32_t l = 100000, m = -7;
    LongSwap(&l, &m);
    EXPECT_EQ(l, -7);
    EXPECT_EQ(m, 100000);
}

TEST(Values, AbsoluteValues) {
    EXPECT_EQ(LongABS(-5), 5);
    EXPECT_EQ(LongABS(5), 5);
    EXPECT_EQ(LongABS(INT32_MAX), INT32_MAX);
    EXPECT_EQ(LongABS(-INT32_MAX), INT32_MAX);
    EXPECT_EQ(LongABS(INT32_MIN), INT32_MIN);  // wraps as the hardware does
    EXPECT_EQ(ShortABS(-32768), 32768);
    EXPECT_EQ(ShortABS(-3), 3);
    EXPECT_EQ(ShortABS(32767), 32767);
    EXPECT_EQ(ABSfloat(-1.25f), 1.25f);
    EXPECT_EQ(FloatABS(-1.25), 1.25);
    EXPECT_FALSE(std::signbit(FloatABS(-0.0)));
}

TEST(Values, SquareAndAngles) {
    EXPECT_EQ(Square(-3), 9);
    EXPECT_EQ(RadToDegree(1), 57.29577951308232);
    EXPECT_EQ(DegreeToRad(1), 0.017453292519943295);
    EXPECT_EQ(DegreeToRad(180), 180 * 0.017453292519943295);
}

TEST(Distances, DistanceHasThreshold) {
    EXPECT_EQ(Distance(0, 0, 1e-9, 0), 0.0);
    EXPECT_EQ(Distance(0, 0, 3, 4), 5.0);
    EXPECT_EQ(Distance(1, 1, 1, 1), 0.0);
    EXPECT_GT(Distance(0, 0, 2e-8, 0), 0.0);
}

TEST(Distances, DistanceSquaredHasNone) {
    EXPECT_EQ(DistanceSQ(0, 0, 1e-9, 0), 1e-9 * 1e-9);
    EXPECT_DOUBLE_EQ(DistanceSQ(0, 0, 1e-9, 0), 1e-18);
    EXPECT_NE(DistanceSQ(0, 0, 1e-9, 0), 0.0);
    EXPECT_EQ(DistanceSQ(0, 0, 3, 4), 25.0);
    EXPECT_EQ(BZ_Distptpts(1, 2, 4, 6), 25.0);
    EXPECT_EQ(BZ_Distptpts(0, 0, 1e-9, 0), DistanceSQ(0, 0, 1e-9, 0));
}

TEST(Planar, EqualPointsIsABoxTest) {
    EXPECT_EQ(EqualPoints(0, 0, 1e-8, 1e-8), 1);
    EXPECT_EQ(EqualPoints(0, 0, 2e-8, 0), 0);
    EXPECT_EQ(EqualPoints(0, 0, 0, -2e-8), 0);
}

TEST(Planar, ExtentIntExtentWidensBoxes) {
    EXPECT_EQ(ExtentIntExtent(0, 0, 1, 1, 1.00005, 0, 2, 1), 1);
    EXPECT_EQ(ExtentIntExtent(1.00005, 0, 2, 1, 0, 0, 1, 1), 1);
    EXPECT_EQ(ExtentIntExtent(0, 0, 1, 1, 1.001, 0, 2, 1), 0);
    EXPECT_EQ(ExtentIntExtent(0, 0, 1, 1, 0, 1.001, 1, 2), 0);
    EXPECT_EQ(ExtentIntExtent(0, 0, 1, 1, 1, 1, 2, 2), 1);
    EXPECT_EQ(ExtentIntExtent(0, 0, 4, 4, 1, 1, 2, 2), 1);
}

TEST(Planar, TwoLineIntersectCrossing) {
    double x = 0, y = 0, t = 0, u = 0;
    EXPECT_EQ(TwoLineIntersect(0, 0, 2, 2, 0, 2, 2, 0, &x, &y, &t, &u), 0);
    EXPECT_DOUBLE_EQ(x, 1);
    EXPECT_DOUBLE_EQ(y, 1);
    EXPECT_DOUBLE_EQ(t, 0.5);
    EXPECT_DOUBLE_EQ(u, 0.5);
    // The lines are infinite: parameters outside 0 to 1 are reported.
    EXPECT_EQ(TwoLineIntersect(0, 0, 1, 0, 3, -1, 3, 1, &x, &y, &t, &u), 0);
    EXPECT_DOUBLE_EQ(x, 3);
    EXPECT_DOUBLE_EQ(y, 0);
    EXPECT_DOUBLE_EQ(t, 3);
}

TEST(Planar, TwoLineIntersectMatchesWrittenFormula) {
    const double x1 = 0.1, y1 = 0.7, x2 = 3.3, y2 = -1.9, x3 = -2.2, y3 = 0.3, x4 = 5.1, y4 = 1.7;
    const double dx1 = x2 - x1, dy1 = y2 - y1, dx2 = x4 - x3, dy2 = y4 - y3;
    const double det = dx2 * dy1 - dy2 * dx1;
    const double et = ((y3 - y1) * dx2 - (x3 - x1) * dy2) * (1 / det);
    const double eu = ((y3 - y1) * dx1 - (x3 - x1) * dy1) * (1 / det);
    double x, y, t, u;
    ASSERT_EQ(TwoLineIntersect(x1, y1, x2, y2, x3, y3, x4, y4, &x, &y, &t, &u), 0);
    EXPECT_EQ(t, et);
    EXPECT_EQ(u, eu);
    EXPECT_EQ(x, dx1 * et + x1);
    EXPECT_EQ(y, dy1 * et + y1);
}

TEST(Planar, TwoLineIntersectParallelLeavesOutputs) {
    double x = 11, y = 12, t = 13, u = 14;
    EXPECT_EQ(TwoLineIntersect(0, 0, 1, 1, 0, 1, 1, 2, &x, &y, &t, &u), 1);
    EXPECT_EQ(x, 11);
    EXPECT_EQ(y, 12);
    EXPECT_EQ(t, 13);
    EXPECT_EQ(u, 14);
    // The threshold is on the unnormalised determinant: short segments at an
    // angle count as parallel.
    EXPECT_EQ(TwoLineIntersect(0, 0, 1e-4, 0, 0, 0, 0, 1e-4, &x, &y, &t, &u), 1);
    EXPECT_EQ(x, 11);
}

TEST(Planar, PointProjectToLine) {
    double x = 0, y = 0;
    EXPECT_EQ(PointProjectToLine(1, 5, 0, 0, 2, 0, &x, &y), 1);
    EXPECT_DOUBLE_EQ(x, 1);
    EXPECT_DOUBLE_EQ(y, 0);
    // Not clamped to the segment.
    EXPECT_EQ(PointProjectToLine(7, 1, 0, 0, 2, 0, &x, &y), 1);
    EXPECT_DOUBLE_EQ(x, 7);
}

TEST(Planar, PointProjectToShortLineIsDegenerate) {
    double x = 21, y = 22;
    EXPECT_EQ(PointProjectToLine(1, 1, 0, 0, 1e-5, 0, &x, &y), 0);
    EXPECT_EQ(x, 21);
    EXPECT_EQ(y, 22);
    EXPECT_EQ(PointProjectToLine(1, 1, 0, 0, 0, 0, &x, &y), 0);
    EXPECT_EQ(PointProjectToLine(1, 1, 0, 0, 2e-4, 0, &x, &y), 1);
}

TEST(Planar, RotatePointUsesEntryValues) {
    double x = 2, y = 1;
    RotatePoint(&x, &y, 1, 1, 1, 0);  // 90 degrees about (1, 1)
    EXPECT_DOUBLE_EQ(x, 1);
    EXPECT_DOUBLE_EQ(y, 2);
    double px = 3.5, py = -1.25;
    const double s = std::sin(0.3), c = std::cos(0.3);
    const double a = px - 0.5, b = py - 0.25;
    RotatePoint(&px, &py, 0.5, 0.25, s, c);
    EXPECT_EQ(px, a * c - b * s + 0.5);
    EXPECT_EQ(py, b * c + a * s + 0.25);
}

TEST(Planar, BezierCoefficients) {
    const double control[8] = {0, 0, 1, 2, 3, 2, 4, 0};
    double k[8];
    Bezier(control, k);
    EXPECT_EQ(k[0], 3 * (1 - 3) + 4 - 0);
    EXPECT_EQ(k[1], 3 * (2 - 2) + 0 - 0);
    EXPECT_EQ(k[2], 3 * (0 - 2 * 1 + 3));
    EXPECT_EQ(k[3], 3 * (0 - 2 * 2 + 2));
    EXPECT_EQ(k[4], 3);
    EXPECT_EQ(k[5], 6);
    EXPECT_EQ(k[6], 0);
    EXPECT_EQ(k[7], 0);
    // The polynomial meets the end points.
    EXPECT_EQ(k[0] + k[2] + k[4] + k[6], 4);
    EXPECT_EQ(k[1] + k[3] + k[5] + k[7], 0);
}

}  // namespace
