// Cutting a cubic by a rectangle, and the tight box of a cubic.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "core/status.h"
#include "curve_fit_test_util.h"

using namespace gtest_curves;

namespace {

class ClipTest : public CurveTest {};

struct Clip {
    int32_t status = 0;
    int16_t count = kSentinel16;
    BZ_Curve pieces[13];
};

Clip ClipBy(double xmin, double ymin, double xmax, double ymax, const Cubic &c) {
    Clip r;
    r.status = ClipBezierCV(xmin, ymin, xmax, ymax, c.v[0], c.v[1], c.v[2], c.v[3], c.v[4],
                            c.v[5], c.v[6], c.v[7], &r.count, r.pieces);
    return r;
}

Cubic AsCubic(const BZ_Curve &p) {
    return Cubic{{p.p0.x, p.p0.y, p.p1.x, p.p1.y, p.p2.x, p.p2.y, p.p3.x, p.p3.y}};
}

void ExpectSameCurve(const BZ_Curve &p, const Cubic &c) {
    const Cubic q = AsCubic(p);
    for (int i = 0; i < 8; ++i) EXPECT_EQ(q.v[i], c.v[i]);
}

TEST_F(ClipTest, CurveWhollyInsideComesBackWhole) {
    const Cubic c{{1, 1, 2, 8, 7, 9, 9, 2}};
    const Clip r = ClipBy(0, 0, 10, 10, c);
    ASSERT_EQ(r.status, 10);
    ASSERT_EQ(r.count, 1);
    ExpectSameCurve(r.pieces[0], c);
}

TEST_F(ClipTest, CurveWhollyOutsideGivesNothing) {
    const Clip r = ClipBy(0, 0, 10, 10, Cubic{{20, 20, 21, 25, 27, 25, 29, 20}});
    EXPECT_EQ(r.status, 10);
    EXPECT_EQ(r.count, 0);
}

TEST_F(ClipTest, CurveCrossingOneEdgeOnceKeepsThePartInside) {
    const Cubic c{{5, 5, 8, 7, 12, 7, 15, 5}};
    const Clip r = ClipBy(0, 0, 10, 10, c);
    ASSERT_EQ(r.status, 10);
    ASSERT_EQ(r.count, 1);
    EXPECT_EQ(r.pieces[0].p0.x, 5);
    EXPECT_NEAR(r.pieces[0].p3.x, 10, 1e-6);
}

TEST_F(ClipTest, CurveTouchingAnEdgeAtItsStartIsJudgedWhole) {
    const Cubic c{{0, 5, 3, 8, 6, 8, 9, 5}};
    const Clip r = ClipBy(0, 0, 10, 10, c);
    ASSERT_EQ(r.status, 10);
    ASSERT_EQ(r.count, 1);
    ExpectSameCurve(r.pieces[0], c);
}

TEST_F(ClipTest, CurveThroughACornerIsCutOnce) {
    // A straight cubic through the corner (0, 0): two edges report the same
    // point and the cleaning keeps one of them.
    const Cubic c{{-5, -5, -2, -2, 2, 2, 5, 5}};
    const Clip r = ClipBy(0, 0, 10, 10, c);
    ASSERT_EQ(r.status, 10);
    ASSERT_EQ(r.count, 1);
    EXPECT_NEAR(r.pieces[0].p0.x, 0, 1e-6);
    EXPECT_NEAR(r.pieces[0].p0.y, 0, 1e-6);
    EXPECT_EQ(r.pieces[0].p3.x, 5);
}

TEST_F(ClipTest, CurveAlongAnEdgeTreatsTheStretchEndsAsCuts) {
    // Along the bottom edge from outside to inside: the stretch from the
    // edge's corner on is cut off from the part outside.
    const Cubic c{{-4, 0, 0, 0, 4, 0, 8, 0}};
    const Clip r = ClipBy(0, 0, 10, 10, c);
    ASSERT_EQ(r.status, 10);
    ASSERT_EQ(r.count, 1);
    EXPECT_NEAR(r.pieces[0].p0.x, 0, 1e-6);
    EXPECT_EQ(r.pieces[0].p3.x, 8);
}

TEST_F(ClipTest, CurveLeavingAndComingBackGivesTwoPieces) {
    // Out through the top edge and back in.
    const Cubic c{{2, 5, 3, 20, 7, 20, 8, 5}};
    const Clip r = ClipBy(0, 0, 10, 10, c);
    ASSERT_EQ(r.status, 10);
    ASSERT_EQ(r.count, 2);
    EXPECT_EQ(r.pieces[0].p0.x, 2);
    EXPECT_NEAR(r.pieces[0].p3.y, 10, 1e-6);
    EXPECT_NEAR(r.pieces[1].p0.y, 10, 1e-6);
    EXPECT_EQ(r.pieces[1].p3.x, 8);
}

TEST_F(ClipTest, RectangleTurnedInsideOutHoldsNothing) {
    const Clip r = ClipBy(10, 10, 0, 0, Cubic{{1, 1, 2, 8, 7, 9, 9, 2}});
    EXPECT_EQ(r.status, 10);
    EXPECT_EQ(r.count, 0);
}

TEST_F(ClipTest, CurveDoublingBackAlongAnEdgeGivesAStatusOrPiecesNeverAnOverrun) {
    const Clip r = ClipBy(0, 0, 10, 10, Cubic{{0, 0, 30, 0, -20, 0, 5, 0}});
    EXPECT_TRUE(r.status == 10 || r.status == -21) << r.status;
    EXPECT_GE(r.count, 0);
    EXPECT_LE(r.count, 13);
}

TEST_F(ClipTest, AllocationFailureIsPassedUpWithNoPieces) {
    const Cubic c{{2, 5, 3, 20, 7, 20, 8, 5}};
    tstest::ForEachAllocationFailure([&](int64_t) {
        const Clip r = ClipBy(0, 0, 10, 10, c);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(r.status, -5);
            EXPECT_EQ(r.count, 0);
        } else {
            EXPECT_EQ(r.status, 10);
            EXPECT_EQ(r.count, 2);
        }
    });
}

bool Inside(BZ_Point p, double xmin, double ymin, double xmax, double ymax, double slack) {
    return xmin - slack <= p.x && p.x <= xmax + slack && ymin - slack <= p.y && p.y <= ymax + slack;
}

TEST_F(ClipTest, PiecesLieInsideAndCoverTheInsidePart) {
    Random rnd(56);
    int checked = 0;
    for (int i = 0; i < 150; ++i) {
        const Cubic c = rnd.Curve(10);
        const double x0 = rnd.Uniform(-8, 2), y0 = rnd.Uniform(-8, 2);
        const double x1 = x0 + rnd.Uniform(2, 10), y1 = y0 + rnd.Uniform(2, 10);
        const Clip r = ClipBy(x0, y0, x1, y1, c);
        if (r.status == -21) continue;
        ASSERT_EQ(r.status, 10) << i;
        ++checked;
        std::vector<BZ_Point> kept;
        for (int k = 0; k < r.count; ++k)
            for (int j = 0; j <= 200; ++j) {
                const BZ_Point p = PointAt(AsCubic(r.pieces[k]), j / 200.0);
                ASSERT_TRUE(Inside(p, x0, y0, x1, y1, 1e-4)) << i << " piece " << k;
                kept.push_back(p);
            }
        for (int j = 0; j <= 1000; ++j) {
            const BZ_Point p = PointAt(c, j / 1000.0);
            if (!Inside(p, x0 + 1e-3, y0 + 1e-3, x1 - 1e-3, y1 - 1e-3, 0)) continue;
            double best = 1e300;
            for (const BZ_Point &q : kept) best = std::fmin(best, Dist(p, q));
            ASSERT_LT(best, 0.2) << "case " << i << " sample " << j;
        }
    }
    EXPECT_GT(checked, 140);
}

// ---- extents ---------------------------------------------------------------------

TEST(ComponentExtent, FourEqualValuesGiveThatValue) {
    double lo = 0, hi = 0;
    TOV_CalcComponentExt(3.5, 3.5, 3.5, 3.5, &lo, &hi);
    EXPECT_EQ(lo, 3.5);
    EXPECT_EQ(hi, 3.5);
}

TEST(ComponentExtent, OvershootingHandlesGiveTheMiddleExtreme) {
    double lo = 0, hi = 0;
    TOV_CalcComponentExt(0, 3, 3, 0, &lo, &hi);
    EXPECT_EQ(lo, 0);
    EXPECT_EQ(hi, 2.25);
    TOV_CalcComponentExt(0, -3, -3, 0, &lo, &hi);
    EXPECT_EQ(lo, -2.25);
    EXPECT_EQ(hi, 0);
}

TEST(ComponentExtent, MonotonicCoordinatesGiveTheEnds) {
    double lo = 0, hi = 0;
    TOV_CalcComponentExt(1, 2, 3, 4, &lo, &hi);
    EXPECT_EQ(lo, 1);
    EXPECT_EQ(hi, 4);
    TOV_CalcComponentExt(4, 3, 2, 1, &lo, &hi);
    EXPECT_EQ(lo, 1);
    EXPECT_EQ(hi, 4);
}

TEST(ComponentExtent, FlatStartWithAReverseRoot) {
    // d1 = 0: the extreme comes from the reverse root.
    double lo = 0, hi = 0;
    TOV_CalcComponentExt(0, 0, 4, 1, &lo, &hi);
    double best = 1;
    for (int i = 0; i <= 100000; ++i) {
        const double t = i / 100000.0, s = 1 - t;
        best = std::fmax(best, 3 * s * t * t * 4 + t * t * t);
    }
    EXPECT_NEAR(hi, best, 1e-9);
    EXPECT_EQ(lo, 0);
}

TEST(ComponentExtent, PathExtentEqualsTheBoxOfADenseSampling) {
    Random rnd(7);
    for (int i = 0; i < 2000; ++i) {
        const Cubic c = rnd.Curve(10);
        double box[4];
        CalcCurvePathExtent(c.v[0], c.v[1], c.v[2], c.v[3], c.v[4], c.v[5], c.v[6], c.v[7],
                            &box[0], &box[1], &box[2], &box[3]);
        for (int axis = 0; axis < 2; ++axis) {
            auto at = [&](double t) { return axis == 0 ? PointAt(c, t).x : PointAt(c, t).y; };
            for (int sign = -1; sign <= 1; sign += 2) {
                double bestT = 0, best = sign * at(0);
                for (int k = 1; k <= 1000; ++k)
                    if (sign * at(k / 1000.0) > best) best = sign * at(k / 1000.0), bestT = k / 1000.0;
                double lo = std::fmax(0, bestT - 0.001), hi = std::fmin(1, bestT + 0.001);
                for (int k = 0; k < 80; ++k) {
                    const double m1 = lo + (hi - lo) * 0.381966, m2 = hi - (hi - lo) * 0.381966;
                    if (sign * at(m1) > sign * at(m2)) hi = m2; else lo = m1;
                }
                best = std::fmax(best, sign * at((lo + hi) / 2));
                const double expected = sign * best;
                const double got = sign > 0 ? box[axis + 2] : box[axis];
                ASSERT_NEAR(got, expected, 1e-9) << "case " << i << " axis " << axis << " sign " << sign;
            }
        }
    }
}

}  // namespace
