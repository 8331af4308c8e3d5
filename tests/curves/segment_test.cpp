// Two straight segments: crossing, dots, collinear overlap.
#include <cmath>

#include "curves_test_util.h"

using namespace gtest_curves;

namespace {

struct Seg {
    double tA[2] = {kSentinel, kSentinel}, tB[2] = {kSentinel, kSentinel};
    BZ_Point pts[2] = {{kSentinel, kSentinel}, {kSentinel, kSentinel}};
    uint16_t count = 999;
    int16_t kind = kSentinel16;
    int32_t status = 0;
};

Seg Segs(double x0, double y0, double x1, double y1, double x2, double y2, double x3, double y3,
         double tol, int16_t overlap = 1, double a0 = 0, double a1 = 1, double b0 = 0,
         double b1 = 1) {
    Seg s;
    s.status = NewLineSegSegIntersect(x0, y0, x1, y1, x2, y2, x3, y3, a0, a1, b0, b1, overlap, s.tA,
                                      s.tB, s.pts, &s.count, tol, &s.kind);
    return s;
}

}  // namespace

TEST(CurveSegments, PlainCrossingMapsIntoTheRanges) {
    const Seg s = Segs(0, 0, 2, 2, 0, 2, 2, 0, 1e-8, 1, 0.5, 0.75, 0.2, 0.4);
    EXPECT_EQ(s.status, 10);
    ASSERT_EQ(s.kind, 1);
    ASSERT_EQ(s.count, 1);
    EXPECT_EQ(s.tA[0], (0.75 - 0.5) * 0.5 + 0.5);
    EXPECT_EQ(s.tB[0], (0.4 - 0.2) * 0.5 + 0.2);
    EXPECT_EQ(s.pts[0].x, 1);
    EXPECT_EQ(s.pts[0].y, 1);
}

TEST(CurveSegments, SharedEndGivesOneEntry) {
    const Seg s = Segs(0, 0, 1, 1, 1, 1, 2, 0, 1e-8);
    ASSERT_EQ(s.kind, 1);
    ASSERT_EQ(s.count, 1);
    EXPECT_EQ(s.tA[0], 1);
    EXPECT_EQ(s.tB[0], 0);
    EXPECT_EQ(s.pts[0].x, 1);
    EXPECT_EQ(s.pts[0].y, 1);
}

TEST(CurveSegments, CrossingJustBeyondAnEndIsPulledOntoIt) {
    // The second segment crosses the first's carrier at x = 1.00005.
    const Seg s = Segs(0, 0, 1, 0, 1.00005, -1, 1.00005, 1, 1e-4);
    ASSERT_EQ(s.kind, 1);
    ASSERT_EQ(s.count, 1);
    EXPECT_EQ(s.tA[0], 1);
    EXPECT_EQ(s.pts[0].x, 1);
    EXPECT_EQ(s.pts[0].y, 0);
}

TEST(CurveSegments, BeyondAnEndInXFailsTheDifferenceOfSquaresButInYAlwaysPasses) {
    // Along x: p = 0.005, q = 0, p^2 - q^2 = 2.5e-5 > tol^2 = 9e-6.
    const Seg x = Segs(0, 0, 100, 0, 99, -50, 101.01, 50, 0.003);
    EXPECT_EQ(x.kind, 0);
    EXPECT_EQ(x.count, 0);
    // The same figure turned a quarter: p = 0, q = 0.005, p^2 - q^2 < 0.
    const Seg y = Segs(0, 0, 0, 100, 50, 99, -50, 101.01, 0.003);
    ASSERT_EQ(y.kind, 1);
    ASSERT_EQ(y.count, 1);
    EXPECT_EQ(y.tA[0], 1);
    EXPECT_EQ(y.pts[0].x, 0);
    EXPECT_EQ(y.pts[0].y, 100);
}

TEST(CurveSegments, CollinearWithAGapWiderThanTheBoxSlackGivesNothing) {
    const Seg s = Segs(0, 0, 1, 0, 1.5, 0, 3, 0, 0.1);
    EXPECT_EQ(s.status, 10);
    EXPECT_EQ(s.kind, 0);
    EXPECT_EQ(s.count, 0);
    const Seg t = Segs(0, 0, 1, 0, 1.05, 0, 3, 0, 0.1);
    EXPECT_EQ(t.kind, 4) << "within the slack the boxes meet";
}

TEST(CurveSegments, SmallAnglesAreCollinearOnlyWithinTheThreshold) {
    const double a05 = 0.05 * 3.141592653589793 / 180, a02 = 0.2 * 3.141592653589793 / 180;
    // 0.05 degrees, the far end 0.0044 off the carrier: thr = 10 x tol x 6.
    const Seg in = Segs(0, 0, 10, 0, 2, 0, 2 + 5 * std::cos(a05), 5 * std::sin(a05), 1e-3);
    EXPECT_EQ(in.kind, 4);
    EXPECT_EQ(in.count, 2);
    const Seg out = Segs(0, 0, 10, 0, 2, 0, 2 + 5 * std::cos(a05), 5 * std::sin(a05), 1e-4);
    EXPECT_EQ(out.kind, 1) << "outside thr: the crossing path";
    // 0.2 degrees: the crossing path even with both ends inside thr.
    const Seg wide = Segs(0, 0, 10, 0, 2, 0, 2 + 5 * std::cos(a02), 5 * std::sin(a02), 1e-2);
    EXPECT_EQ(wide.kind, 1);
    EXPECT_EQ(wide.count, 1);
}

TEST(CurveSegments, VerticalPairWorksInY) {
    const Seg s = Segs(0, 0, 0, 10, 0, 2, 0, 5, 1e-8, 1, 0, 1, 0, 1);
    ASSERT_EQ(s.kind, 4);
    ASSERT_EQ(s.count, 2);
    EXPECT_EQ(s.tA[0], 0.2);
    EXPECT_EQ(s.tA[1], 0.5);
    EXPECT_EQ(s.tB[0], 0);
    EXPECT_EQ(s.tB[1], 1);
    EXPECT_EQ(s.pts[0].y, 2);
    EXPECT_EQ(s.pts[1].y, 5);
}

TEST(CurveSegments, HorizontalPairWorksInXAndReportsOppositeWays) {
    const Seg s = Segs(0, 0, 10, 0, 12, 0, 3, 0, 1e-8);
    ASSERT_EQ(s.kind, 4);
    ASSERT_EQ(s.count, 2);
    EXPECT_EQ(s.tA[0], 0.3);
    EXPECT_EQ(s.tA[1], 1);
    EXPECT_EQ(s.tB[0], (3 - 12) / -9.0);
    EXPECT_EQ(s.tB[1], (10 - 12) / -9.0);
    EXPECT_GT(s.tB[0], s.tB[1]) << "tB falls: the pieces run opposite ways";
}

TEST(CurveSegments, StretchIsReportedWithTARising) {
    // The first segment runs right to left: entry 0 is its second end.
    const Seg s = Segs(10, 0, 0, 0, 2, 0, 5, 0, 1e-8, 1, 0.5, 1, 0, 1);
    ASSERT_EQ(s.kind, 4);
    EXPECT_LT(s.tA[0], s.tA[1]);
    EXPECT_EQ(s.tA[0], (1 - 0.5) * 0.5 + 0.5);
    EXPECT_EQ(s.pts[0].x, 5);
}

TEST(CurveSegments, OverlapFlagZeroGivesNothingForCollinear) {
    const Seg s = Segs(0, 0, 2, 0, 2, 0, 3, 0, 1e-8, 0);
    EXPECT_EQ(s.status, 10);
    EXPECT_EQ(s.kind, 0);
    EXPECT_EQ(s.count, 0);
    EXPECT_EQ(s.tA[0], kSentinel);
}

TEST(CurveSegments, DotsAnswerInRawParameters) {
    // First a dot on the second segment, ranges ignored.
    const Seg a = Segs(1, 0, 1, 1e-9, 0, 0, 4, 0, 1e-6, 1, 0.5, 0.6, 0.5, 0.6);
    ASSERT_EQ(a.kind, 1);
    EXPECT_EQ(a.tA[0], 0);
    EXPECT_EQ(a.tB[0], 0.25);
    EXPECT_EQ(a.pts[0].x, 1);
    // Both dots.
    const Seg b = Segs(1, 1, 1, 1, 1, 1 + 5e-7, 1, 1 + 5e-7, 1e-6, 1, 0.5, 0.6, 0.5, 0.6);
    ASSERT_EQ(b.kind, 1);
    EXPECT_EQ(b.tA[0], 0);
    EXPECT_EQ(b.tB[0], 0);
    const Seg far = Segs(1, 1, 1, 1, 1, 1 + 2e-6, 1, 1 + 2e-6, 1e-6);
    EXPECT_EQ(far.kind, 0);
    // Second a dot on the first segment.
    const Seg c = Segs(0, 0, 0, 8, 0, 2, 0, 2, 1e-6, 1, 0.5, 0.6, 0.5, 0.6);
    ASSERT_EQ(c.kind, 1);
    EXPECT_EQ(c.tA[0], 0.25);
    EXPECT_EQ(c.tB[0], 0);
    // A dot off the segment's span gives nothing.
    const Seg off = Segs(5, 0, 5, 0, 0, 0, 4, 0, 1e-6);
    EXPECT_EQ(off.kind, 0);
}

TEST(CurveSegments, ADirectionThatCannotBeNormalisedGivesMinusThree) {
    // Longer than tol, shorter than the normaliser accepts.
    const Seg s = Segs(0, 0, 1e-7, 0, 0, -1, 0, 1, 1e-9);
    EXPECT_EQ(s.status, -3);
    EXPECT_EQ(s.kind, 0);
    EXPECT_EQ(s.count, 0);
    EXPECT_EQ(s.tA[0], kSentinel);
}

TEST(CurveSegments, NonFiniteInputGivesAStatus) {
    const double nan = std::nan(""), inf = INFINITY;
    const double vals[] = {nan, inf, -inf, 1e308, -1e308, 0};
    for (double v : vals) {
        Seg s = Segs(v, 0, 1, 1, 0, 1, 1, v, 1e-6);
        EXPECT_LE(s.count, 2);
        s = Segs(0, 0, 1, 1, 0, 1, 1, 0, v);
        EXPECT_LE(s.count, 2);
    }
}
