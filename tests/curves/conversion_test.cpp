// Arc to node runs, the interpolating spline, extents, splits and evaluation.
#include <cmath>
#include <limits>

#include "curves/toolkit.h"
#include "curves_test_util.h"
#include "platform/test_hooks.h"

using namespace gtest_curves;

namespace {

constexpr double kK = 0.552276388;

struct Nodes {
    BZ_Point p[18];
    int16_t count = kSentinel16;
    Nodes() {
        for (BZ_Point &q : p) q = Pt(kSentinel, kSentinel);
    }
};

Nodes Arc(double r, double cx, double cy, double start, double sweep) {
    Nodes n;
    ConvertArcToBezier(r, cx, cy, start, sweep, n.p, &n.count);
    return n;
}

// The triple the text builds: three points on the vertical through
// (cx + r, cy), rotated about the centre by the node's angle.
void ExpectTriple(const Nodes &n, int k, double r, double cx, double cy, double h, double angle) {
    double s = 0, c = 0;
    GetSinCos(angle, &s, &c);
    const double ys[3] = {cy - h, cy, cy + h};
    for (int i = 0; i < 3; ++i) {
        double x = cx + r, y = ys[i];
        RotatePoint(&x, &y, cx, cy, s, c);
        EXPECT_EQ(n.p[k + i].x, x) << "element " << k + i;
        EXPECT_EQ(n.p[k + i].y, y) << "element " << k + i;
    }
}

}  // namespace

TEST(CurveArcNodes, SweepZeroGivesTwoTriplesWithHandlesOnTheNode) {
    const Nodes n = Arc(2, 1, 1, 0.3, 0);
    ASSERT_EQ(n.count, 6);
    for (int k : {0, 3}) {
        EXPECT_EQ(n.p[k].x, n.p[k + 1].x);
        EXPECT_EQ(n.p[k].y, n.p[k + 1].y);
        EXPECT_EQ(n.p[k + 2].x, n.p[k + 1].x);
        EXPECT_EQ(n.p[k + 2].y, n.p[k + 1].y);
    }
    EXPECT_EQ(n.p[6].x, kSentinel) << "nothing beyond the count";
}

TEST(CurveArcNodes, FullCircleGivesFiveTriplesEndingOnTheStart) {
    const Nodes n = Arc(3, 0, 0, 0, kTurn);
    ASSERT_EQ(n.count, 15);
    EXPECT_NEAR(n.p[13].x, n.p[1].x, 1e-12);
    EXPECT_NEAR(n.p[13].y, n.p[1].y, 1e-12);
    for (int k = 0; k < 15; k += 3) ExpectTriple(n, k, 3, 0, 0, 3 * kK, k / 3 * kQuarter);
    EXPECT_EQ(n.p[15].x, kSentinel);
}

TEST(CurveArcNodes, RadiusZeroGivesOnePiece) {
    const Nodes n = Arc(0, 5, 5, 0, 3.0);
    EXPECT_EQ(n.count, 6);
}

TEST(CurveArcNodes, QuarterAndABitHasShortHandlesAtTheJunction) {
    const double r = 10;
    const Nodes n = Arc(r, 0, 0, 0, 2.0);
    ASSERT_EQ(n.count, 9);
    const double rest = 2.0 - kQuarter;
    const double shortH = rest * 0.6366197723675814 * r * kK;
    ExpectTriple(n, 0, r, 0, 0, r * kK, 0);
    ExpectTriple(n, 3, r, 0, 0, shortH, kQuarter);
    ExpectTriple(n, 6, r, 0, 0, shortH, kQuarter + rest);
    // Both handles of the junction node are short.
    EXPECT_NEAR(Dist(n.p[3], n.p[4]), shortH, 1e-12);
    EXPECT_NEAR(Dist(n.p[5], n.p[4]), shortH, 1e-12);
}

TEST(CurveArcNodes, ExactQuarterIsOnePieceWithTheFullHandle) {
    const Nodes n = Arc(4, 0, 0, 0, kQuarter);
    ASSERT_EQ(n.count, 6);
    ExpectTriple(n, 0, 4, 0, 0, 4 * kK, 0);
    ExpectTriple(n, 3, 4, 0, 0, 4 * kK, kQuarter);
}

TEST(CurveArcNodes, NegativeSweepIsOnePieceWithReversedHandles) {
    const double sweep = -4.0;
    const Nodes n = Arc(2, 0, 0, 0, sweep);
    ASSERT_EQ(n.count, 6);
    ExpectTriple(n, 0, 2, 0, 0, sweep * 0.6366197723675814 * 2 * kK, 0);
    ExpectTriple(n, 3, 2, 0, 0, sweep * 0.6366197723675814 * 2 * kK, sweep);
}

TEST(CurveArcNodes, TurnsAboveOneCircleAreDropped) {
    const Nodes a = Arc(1, 0, 0, 0.5, 1.0 + 2 * kTurn);
    double sweep = 1.0 + 2 * kTurn;
    while (sweep - kTurn > 1e-8) sweep -= kTurn;
    const Nodes b = Arc(1, 0, 0, 0.5, sweep);
    ASSERT_EQ(a.count, b.count);
    for (int i = 0; i < a.count; ++i) {
        EXPECT_EQ(a.p[i].x, b.p[i].x);
        EXPECT_EQ(a.p[i].y, b.p[i].y);
    }
}

TEST(CurveArcNodes, ALeftoverShorterThanTheToleranceAddsNoPiece) {
    // radius x rest = 0.5e-8: below the length test.
    const Nodes n = Arc(1, 0, 0, 0, kQuarter + 0.5e-8);
    EXPECT_EQ(n.count, 6);
    const Nodes m = Arc(1000, 0, 0, 0, kQuarter + 0.5e-8);
    EXPECT_EQ(m.count, 9) << "the same angle on a large radius is long enough";
}

TEST(CurveArcNodes, NonFiniteInputWritesNothing) {
    const double bad[] = {std::numeric_limits<double>::quiet_NaN(),
                          std::numeric_limits<double>::infinity(),
                          -std::numeric_limits<double>::infinity()};
    for (double v : bad) {
        for (int which = 0; which < 3; ++which) {
            Nodes n;
            ConvertArcToBezier(which == 0 ? v : 1, 0, 0, which == 1 ? v : 0, which == 2 ? v : 1,
                               n.p, &n.count);
            EXPECT_EQ(n.count, 0);
            EXPECT_EQ(n.p[0].x, kSentinel);
        }
    }
    Nodes endless;
    ConvertArcToBezier(-2, 0, 0, 0, -1, endless.p, &endless.count);
    EXPECT_EQ(endless.count, 0) << "a negative radius and sweep never pass the length test";
    EXPECT_EQ(endless.p[0].x, kSentinel);
    Nodes once;
    ConvertArcToBezier(-2, 0, 0, 0, 3, once.p, &once.count);
    EXPECT_EQ(once.count, 6) << "a negative radius with a sweep above a quarter stops at once";
    Nodes small;
    ConvertArcToBezier(-2, 0, 0, 0, 1, small.p, &small.count);
    EXPECT_EQ(small.count, 0) << "below a quarter the rest is negative: endless again";
    Nodes huge;
    ConvertArcToBezier(1, 0, 0, 0, 1e300, huge.p, &huge.count);
    EXPECT_EQ(huge.count, 0) << "a sweep that whole turns cannot bring down";
}

// ---- ArcToBezier -------------------------------------------------------------

namespace {

struct Spline {
    double *x = reinterpret_cast<double *>(0x10);
    double *y = reinterpret_cast<double *>(0x20);
    int16_t count = kSentinel16;
    int32_t status = 0;
    ~Spline() {
        if (x != reinterpret_cast<double *>(0x10) && x) MEM_FreeHdl(x);
        if (y != reinterpret_cast<double *>(0x20) && y) MEM_FreeHdl(y);
    }
};

void RunSpline(Spline &s, const double *x, const double *y, int16_t n, double stx = 0,
               double sty = 0, double etx = 0, double ety = 0) {
    s.status = ArcToBezier(x, y, n, stx, sty, etx, ety, &s.x, &s.y, &s.count);
}

}  // namespace

class CurveSpline : public CurveTest {};

TEST_F(CurveSpline, TwoPointsWithoutTangentsGiveAStraightLineWithThirds) {
    const double x[] = {1, 7}, y[] = {2, 5};
    Spline s;
    RunSpline(s, x, y, 2);
    ASSERT_EQ(s.status, 10);
    ASSERT_EQ(s.count, 4);
    EXPECT_EQ(s.x[0], 1);
    EXPECT_EQ(s.x[1], (2 * 1.0 + 7) / 3);
    EXPECT_EQ(s.x[2], (2 * 7.0 + 1) / 3);
    EXPECT_EQ(s.x[3], 7);
    EXPECT_EQ(s.y[1], (2 * 2.0 + 5) / 3);
    EXPECT_EQ(s.y[2], (2 * 5.0 + 2) / 3);
    EXPECT_EQ(s.x[4], 0) << "the blocks are zero-filled, room for 3n";
    EXPECT_EQ(s.x[5], 0);
}

TEST_F(CurveSpline, TwoPointsStartTangentIsWipedWhenTheEndHasNone) {
    const double x[] = {3, 10}, y[] = {4, 4};
    Spline s;
    RunSpline(s, x, y, 2, 0, 1, 0, 0);
    ASSERT_EQ(s.status, 10);
    EXPECT_EQ(s.x[1], (2 * 3.0 + 10) / 3);
    EXPECT_EQ(s.y[1], 4);
}

TEST_F(CurveSpline, TwoPointsBothTangentsTakeTheStartLengthFromTheOrigin) {
    // W[2] is still zero when the start is laid: |W[2] - W[0]| = |(3, 4)| = 5.
    const double x[] = {3, 10}, y[] = {4, 4};
    Spline s;
    RunSpline(s, x, y, 2, 2, 0, 1, 0);
    ASSERT_EQ(s.status, 10);
    EXPECT_EQ(s.x[1], 3 + 1.0 * 0.3 * 5);
    EXPECT_EQ(s.y[1], 4);
    EXPECT_EQ(s.x[2], 10 - 1.0 * 0.3 * Distance(4.5, 4, 10, 4));
    EXPECT_EQ(s.y[2], 4);
}

TEST_F(CurveSpline, BackwardStartTangentIsTurnedRound) {
    const double x[] = {0, 4, 8}, y[] = {0, 3, 0};
    Spline fwd, back;
    RunSpline(fwd, x, y, 3, 1, 1, 0, 0);
    RunSpline(back, x, y, 3, -1, -1, 0, 0);
    ASSERT_EQ(fwd.status, 10);
    ASSERT_EQ(back.status, 10);
    for (int i = 0; i < 7; ++i) {
        EXPECT_EQ(fwd.x[i], back.x[i]);
        EXPECT_EQ(fwd.y[i], back.y[i]);
    }
    EXPECT_GT(fwd.x[1], 0) << "the handle points along the first chord";
    EXPECT_GT(fwd.y[1], 0);
}

TEST_F(CurveSpline, InterpolatesItsPointsAndJoinsSmoothly) {
    const double x[] = {0, 2, 5, 6, 9, 10}, y[] = {0, 3, 1, 4, 4, 0};
    Spline s;
    RunSpline(s, x, y, 6);
    ASSERT_EQ(s.status, 10);
    ASSERT_EQ(s.count, 16);
    for (int i = 0; i < 6; ++i) {
        EXPECT_NEAR(s.x[3 * i], x[i], 1e-9) << i;
        EXPECT_NEAR(s.y[3 * i], y[i], 1e-9) << i;
    }
    for (int i = 1; i < 5; ++i) {
        // The node lies on the segment between its two handles.
        const double cross = (s.x[3 * i] - s.x[3 * i - 1]) * (s.y[3 * i + 1] - s.y[3 * i - 1]) -
                             (s.y[3 * i] - s.y[3 * i - 1]) * (s.x[3 * i + 1] - s.x[3 * i - 1]);
        EXPECT_NEAR(cross, 0, 1e-9) << i;
    }
}

TEST_F(CurveSpline, ThreePointEndRuleUsesTwoThirdsAsWritten) {
    // Points where 2.0 / 3.0 x v and 2 v / 3 round apart in both x and y.
    const double x[] = {5.2, 7.4, 6.7}, y[] = {0.6, 7.6, 5.9};
    Spline s;
    RunSpline(s, x, y, 3);
    ASSERT_EQ(s.status, 10);
    // Knots and the start rule, from the text.
    const double c0 = Distance(x[0], y[0], x[1], y[1]), c1 = Distance(x[1], y[1], x[2], y[2]);
    const double r = std::sqrt(c0 / c1);
    const double u2 = ((r + 1) * 1.0 - 0.0) / r;
    const double alpha = (u2 - 1.0) / (u2 - 0.0), beta = 1 - alpha;
    auto rule = [&](double A, double B, double C) {
        const double q = (B - alpha * alpha * A - beta * beta * C) / (2 * alpha * beta);
        return A / 3 + 2.0 / 3.0 * (beta * q + alpha * A);
    };
    EXPECT_EQ(s.x[1], rule(x[0], x[1], x[2]));
    EXPECT_EQ(s.y[1], rule(y[0], y[1], y[2]));
    auto other = [&](double A, double B, double C) {
        const double q = (B - alpha * alpha * A - beta * beta * C) / (2 * alpha * beta);
        return A / 3 + 2 * (beta * q + alpha * A) / 3;
    };
    EXPECT_NE(s.x[1], other(x[0], x[1], x[2])) << "the data tells the two roundings apart";
}

TEST_F(CurveSpline, LengthsAreDistancesThatVanishBelowTheTolerance) {
    // |W[2] - W[0]| runs to the origin here and is below 1e-8: Distance gives
    // 0, so the start handle lies on the start point.
    const double x[] = {1e-9, 5}, y[] = {0, 0};
    Spline s;
    RunSpline(s, x, y, 2, 1, 0, 1, 0);
    ASSERT_EQ(s.status, 10);
    EXPECT_EQ(s.x[1], 1e-9);
    EXPECT_EQ(s.y[1], 0);
}

TEST_F(CurveSpline, ZeroFirstOrLastChordGivesZeroAndWritesNothing) {
    const double x1[] = {1, 1, 5}, y1[] = {2, 2, 5};
    Spline a;
    RunSpline(a, x1, y1, 3);
    EXPECT_EQ(TS_STATUS(a.status), 0);
    EXPECT_EQ(a.x, reinterpret_cast<double *>(0x10));
    EXPECT_EQ(a.count, kSentinel16);
    const double x2[] = {1, 4, 4 + 1e-7}, y2[] = {2, 5, 5};
    Spline b;
    const int64_t live = tessarine::testing::LiveBlocks();
    RunSpline(b, x2, y2, 3);
    EXPECT_EQ(TS_STATUS(b.status), 0);
    EXPECT_EQ(b.y, reinterpret_cast<double *>(0x20));
    EXPECT_EQ(tessarine::testing::LiveBlocks(), live) << "nothing allocated";
}

TEST_F(CurveSpline, AZeroKnotSumGivesMinusFourAndLeavesTheBlocksWithTheCaller) {
    // A huge first chord over a tiny second one makes the middle knot
    // intervals vanish: r = sqrt(1e20 / 1e-7).
    const double x[] = {0, 1e20, 1e20, 1e20, 1e20}, y[] = {0, 0, 1e-7, 2e-7, 10};
    Spline s;
    RunSpline(s, x, y, 5);
    EXPECT_EQ(s.status, -4);
    EXPECT_NE(s.x, nullptr);
    EXPECT_NE(s.x, reinterpret_cast<double *>(0x10));
    EXPECT_NE(s.y, reinterpret_cast<double *>(0x20));
    EXPECT_EQ(s.count, kSentinel16);
}

TEST_F(CurveSpline, FewerThanTwoPointsIsRefused) {
    const double x[] = {1}, y[] = {1};
    Spline s;
    RunSpline(s, x, y, 1);
    EXPECT_EQ(s.status, -4);
    EXPECT_EQ(s.x, reinterpret_cast<double *>(0x10));
}

TEST_F(CurveSpline, CoincidentMiddlePointsGiveNotANumberWithoutHarm) {
    const double x[] = {0, 1, 1, 3}, y[] = {0, 1, 1, 0};
    Spline s;
    RunSpline(s, x, y, 4);
    EXPECT_TRUE(s.status == 10 || s.status == -4);
}

TEST_F(CurveSpline, EveryAllocationFailureGivesMinusFive) {
    const double x[] = {0, 2, 5, 6}, y[] = {0, 3, 1, 4};
    const int64_t made = tstest::ForEachAllocationFailure([&](int64_t n) {
        double *ox = reinterpret_cast<double *>(0x10), *oy = reinterpret_cast<double *>(0x20);
        int16_t count = kSentinel16;
        const int32_t st = ArcToBezier(x, y, 4, 0, 0, 0, 0, &ox, &oy, &count);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(st, -5);
            EXPECT_EQ(count, kSentinel16);
            // Both out pointers were stored; a failed one is null. What was
            // obtained stays with the caller.
            if (n == 1) {
                EXPECT_EQ(ox, nullptr);
            } else if (n == 2) {
                EXPECT_EQ(oy, nullptr);
            } else {
                EXPECT_NE(ox, nullptr);
                EXPECT_NE(oy, nullptr);
            }
        } else {
            EXPECT_EQ(st, 10);
        }
        if (ox) MEM_FreeHdl(ox);
        if (oy) MEM_FreeHdl(oy);
    });
    EXPECT_EQ(made, 3);
}

// ---- Extents --------------------------------------------------------------------

TEST(CurveExtent, LineExtentOnlyWidens) {
    double x0 = 0, y0 = 0, x1 = 1, y1 = 1;
    LineExtent(0.5, 0.7, 0.2, 0.3, &x0, &y0, &x1, &y1);
    EXPECT_EQ(x0, 0);
    EXPECT_EQ(y0, 0);
    EXPECT_EQ(x1, 1);
    EXPECT_EQ(y1, 1);
    LineExtent(3, -2, -1, 4, &x0, &y0, &x1, &y1);
    EXPECT_EQ(x0, -1);
    EXPECT_EQ(y0, -2);
    EXPECT_EQ(x1, 3);
    EXPECT_EQ(y1, 4);
}

TEST(CurveExtent, FullCircleFromZeroGivesTheWholeCircle) {
    using tessarine::curves::QuadrantOfAngle;
    EXPECT_EQ(QuadrantOfAngle(0), 1);
    EXPECT_EQ(QuadrantOfAngle(kTurn), 4);
    double a = 0, b = 0, c = 0, d = 0;
    CalcArcExtent(-1, &a, &b, &c, &d, 2, 3, 5, 0, kTurn);
    EXPECT_EQ(a, 2 - 5.0);
    EXPECT_EQ(b, 3 - 5.0);
    EXPECT_EQ(c, 2 + 5.0);
    EXPECT_EQ(d, 3 + 5.0);
}

TEST(CurveExtent, ShortArcGivesTheBoxOfItsEnds) {
    double a = 0, b = 0, c = 0, d = 0;
    CalcArcExtent(-1, &a, &b, &c, &d, 0, 0, 1, 0, 0.1);
    EXPECT_EQ(a, std::cos(0.1));
    EXPECT_EQ(b, 0);
    EXPECT_EQ(c, 1);
    EXPECT_EQ(d, std::sin(0.1));
}

TEST(CurveExtent, WidthMinusOneLeavesTheRadiusAndTwoAddsOne) {
    double a = 0, b = 0, c = 0, d = 0;
    CalcArcExtent(-1, &a, &b, &c, &d, 0, 0, 3, 0, kTurn);
    EXPECT_EQ(c, 3);
    CalcArcExtent(2, &a, &b, &c, &d, 0, 0, 3, 0, kTurn);
    EXPECT_EQ(c, 4);
    EXPECT_EQ(a, -4);
    CalcArcExtent(-1e-9, &a, &b, &c, &d, 0, 0, 3, 0, kTurn);
    EXPECT_EQ(c, 3 + -1e-9 * 0.5) << "a width just above -1e-8 still counts";
}

TEST(CurveExtent, QuarterTurnStartLiesInQuadrantOne) {
    using tessarine::curves::QuadrantOfAngle;
    EXPECT_EQ(QuadrantOfAngle(kQuarter), 1);
    EXPECT_EQ(QuadrantOfAngle(kHalf), 2);
    EXPECT_EQ(QuadrantOfAngle(4.71238898038469), 3);
    EXPECT_EQ(QuadrantOfAngle(-0.1), 4);
    EXPECT_EQ(QuadrantOfAngle(kTurn + 0.1), 1);
    EXPECT_EQ(QuadrantOfAngle(-kTurn - 0.1), 1) << "one fold only: stays negative, below a quarter";
}

TEST(CurveExtent, TableCasesAndNegativeSweep) {
    double a, b, c, d;
    // From quadrant 2 to quadrant 4 passes xmin and ymin.
    CalcArcExtent(-1, &a, &b, &c, &d, 0, 0, 1, 2.0, 3.0);
    EXPECT_EQ(a, -1);
    EXPECT_EQ(b, -1);
    EXPECT_EQ(c, std::fmax(std::cos(2.0), std::cos(5.0)));
    EXPECT_EQ(d, std::fmax(std::sin(2.0), std::sin(5.0)));
    // A negative sweep reads the same table: from quadrant 2 down into 1 is
    // "xmin, ymin, xmax" although the arc passes ymax.
    CalcArcExtent(-1, &a, &b, &c, &d, 0, 0, 1, 2.0, -1.0);
    EXPECT_EQ(a, -1);
    EXPECT_EQ(b, -1);
    EXPECT_EQ(c, 1);
    EXPECT_EQ(d, std::fmax(std::sin(2.0), std::sin(1.0)));
}

// ---- Splits, evaluation, reversal -----------------------------------------------

TEST(CurveSplit, SubDivideBezierWritesTheHalvesInItsOrder) {
    double v[10];
    SubDivideBezier(0, 0, 1, 2, 3, 2, 4, 0, 0.25, &v[0], &v[1], &v[2], &v[3], &v[4], &v[5], &v[6],
                    &v[7], &v[8], &v[9]);
    auto lerp = [](double a, double b, double t) { return (b - a) * t + a; };
    const double l1x = lerp(0, 1, 0.25), qx = lerp(1, 3, 0.25), r2x = lerp(3, 4, 0.25);
    const double l2x = lerp(l1x, qx, 0.25), r1x = lerp(qx, r2x, 0.25);
    EXPECT_EQ(v[0], l1x);
    EXPECT_EQ(v[2], r2x);
    EXPECT_EQ(v[4], l2x);
    EXPECT_EQ(v[6], lerp(l2x, r1x, 0.25));
    EXPECT_EQ(v[8], r1x);
    const BZ_Point m = PointAt(Cubic{{0, 0, 1, 2, 3, 2, 4, 0}}, 0.25);
    EXPECT_NEAR(v[6], m.x, 1e-14);
    EXPECT_NEAR(v[7], m.y, 1e-14);
}

TEST(CurveSplit, SubDivideLine) {
    double x = 0, y = 0;
    SubDivideLine(1, 2, 5, 10, 0.25, &x, &y);
    EXPECT_EQ(x, 2);
    EXPECT_EQ(y, 4);
}

TEST(CurveSplit, ReverseCoord) {
    BZ_Point one[1] = {{1, 2}};
    ReverseCoord(one, 1);
    EXPECT_EQ(one[0].x, 1);
    EXPECT_EQ(one[0].y, 2);
    BZ_Point odd[3] = {{1, 1}, {2, 2}, {3, 3}};
    ReverseCoord(odd, 3);
    EXPECT_EQ(odd[0].x, 3);
    EXPECT_EQ(odd[1].x, 2);
    EXPECT_EQ(odd[2].x, 1);
    BZ_Point even[4] = {{1, 0}, {2, 0}, {3, 0}, {4, 0}};
    ReverseCoord(even, 4);
    EXPECT_EQ(even[0].x, 4);
    EXPECT_EQ(even[3].x, 1);
    ReverseCoord(even, 0);
    ReverseCoord(even, -3);
    EXPECT_EQ(even[0].x, 4);
}

TEST(CurveEval, StartWithCoincidentFirstPointsFallsBackOnTheNext) {
    const BZ_Point p[4] = {{1, 1}, {1, 1}, {4, 3}, {6, 0}};
    BZ_Point out{kSentinel, kSentinel};
    EXPECT_EQ(CubicBezEval(p, 0, 1, &out), 10);
    EXPECT_EQ(out.x, (4.0 - 1) * 3 / (1 - 0.0));
    EXPECT_EQ(out.y, (3.0 - 1) * 3 / (1 - 0.0));
}

TEST(CurveEval, EndGivesTheLastPointAndAnUndividedTangent) {
    const BZ_Point p[4] = {{0, 0}, {1, 2}, {3, 3}, {5, 1}};
    BZ_Point out{kSentinel, kSentinel};
    EXPECT_EQ(CubicBezEval(p, 1, 0, &out), 10);
    EXPECT_EQ(out.x, 5);
    EXPECT_EQ(out.y, 1);
    EXPECT_EQ(CubicBezEval(p, 1 - 1e-9, 1, &out), 10);
    // Reversed points: (w0 - w1) x 3 = (P3 - P2) x 3.
    EXPECT_EQ(out.x, (5.0 - 3) * 3);
    EXPECT_EQ(out.y, (1.0 - 3) * 3);
}

TEST(CurveEval, GeneralCaseMatchesTheDerivative) {
    const Cubic c{{0, 0, 1, 2, 3, 3, 5, 1}};
    const BZ_Point p[4] = {c.P(0), c.P(1), c.P(2), c.P(3)};
    BZ_Point pt, tan;
    EXPECT_EQ(CubicBezEval(p, 0.3, 0, &pt), 10);
    EXPECT_EQ(CubicBezEval(p, 0.3, 1, &tan), 10);
    const BZ_Point ref = PointAt(c, 0.3);
    EXPECT_NEAR(pt.x, ref.x, 1e-13);
    EXPECT_NEAR(pt.y, ref.y, 1e-13);
    const double h = 1e-6;
    const BZ_Point a = PointAt(c, 0.3 - h), b = PointAt(c, 0.3 + h);
    EXPECT_NEAR(tan.x, (b.x - a.x) / (2 * h), 1e-6);
    EXPECT_NEAR(tan.y, (b.y - a.y) / (2 * h), 1e-6);
}

TEST(CurveEval, OrderOutsideZeroAndOneIsRefused) {
    const BZ_Point p[4] = {{0, 0}, {1, 2}, {3, 3}, {5, 1}};
    BZ_Point out{kSentinel, kSentinel};
    EXPECT_EQ(CubicBezEval(p, 0.5, 2, &out), -4);
    EXPECT_EQ(CubicBezEval(p, 0.5, -1, &out), -4);
    EXPECT_EQ(out.x, kSentinel);
}

TEST(CurveEval, AllPointsEqualGivesMinusThreeWithTheLastTry) {
    const BZ_Point p[4] = {{2, 2}, {2, 2}, {2, 2}, {2, 2}};
    BZ_Point out{kSentinel, kSentinel};
    EXPECT_EQ(CubicBezEval(p, 0, 1, &out), -3);
    EXPECT_EQ(out.x, 0);
    EXPECT_EQ(out.y, 0);
    EXPECT_EQ(CubicBezEval(p, 0, 0, &out), 10) << "a point is always there";
}
