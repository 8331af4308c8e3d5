// Boxes of segments, point tests, outcodes, and the contact tests of lines,
// arcs and cubics with a box.
#include <gtest/gtest.h>

#include <cmath>
#include <random>

#include "core/status.h"
#include "geometry_test_util.h"
#include "test_support.h"

using namespace gtest_geometry;

namespace {

class BoxTest : public tstest::Sandbox {};

TEST_F(BoxTest, AssignCopiesWithoutOrdering) {
    BZ_Point a = SentinelPoint(), b = SentinelPoint();
    AssigXQ2DBox(5, 6, 1, 2, &a, &b);
    EXPECT_EQ(a.x, 5);
    EXPECT_EQ(a.y, 6);
    EXPECT_EQ(b.x, 1);
    EXPECT_EQ(b.y, 2);
}

TEST_F(BoxTest, LineBoxIsOrdered) {
    BZ_Point lo, hi;
    EXPECT_EQ(FindLineMinmaxBox(5, 1, 2, 7, &lo, &hi), 10);
    EXPECT_EQ(lo.x, 2);
    EXPECT_EQ(lo.y, 1);
    EXPECT_EQ(hi.x, 5);
    EXPECT_EQ(hi.y, 7);
}

TEST_F(BoxTest, CurveBoxIsTheExactOne) {
    BZ_Point lo, hi;
    EXPECT_EQ(BZ_FindCurveMinmaxBox(0, 0, 0, 3, 4, 3, 4, 0, &lo, &hi), 10);
    EXPECT_EQ(lo.x, 0);
    EXPECT_EQ(lo.y, 0);
    EXPECT_EQ(hi.x, 4);
    EXPECT_EQ(hi.y, 2.25);
}

TEST_F(BoxTest, ArcBoxTurnsANegativeSweepRound) {
    BZ_Point lo, hi, lo2, hi2;
    const BZ_Arc ccw = MakeArc(1, 1, 2, 0.2, kPi);
    const BZ_Arc cw = MakeArc(1, 1, 2, 0.2 + kPi, -kPi);
    EXPECT_EQ(BZ_FindArcMinmaxBox(ccw, &lo, &hi), 10);
    EXPECT_EQ(BZ_FindArcMinmaxBox(cw, &lo2, &hi2), 10);
    EXPECT_NEAR(hi.y, 3, 1e-12);
    EXPECT_NEAR(lo.x, -1, 1e-12);
    EXPECT_NEAR(lo2.x, lo.x, 1e-12);
    EXPECT_NEAR(hi2.y, hi.y, 1e-12);
    EXPECT_NEAR(lo2.y, lo.y, 1e-12);
    EXPECT_NEAR(hi2.x, hi.x, 1e-12);
}

TEST_F(BoxTest, PointInBoxCountsTheGrownEdges) {
    const BZ_Point lo{0, 0}, hi{10, 10};
    const BZ_Point on{10.5, 0}, off{10.50001, 0};
    EXPECT_EQ(BZ_IsPtInBBox(&on, &lo, &hi, 0.5), 1);
    EXPECT_EQ(BZ_IsPtInBBox(&off, &lo, &hi, 0.5), 0);
}

TEST_F(BoxTest, OutcodeOfAPointOnAnEdgeIsZero) {
    EXPECT_EQ(GetOutCode(0, 0, 10, 10, 10, 5), 0);
    EXPECT_EQ(GetOutCode(0, 0, 10, 10, 0, 0), 0);
    EXPECT_EQ(GetOutCode(0, 0, 10, 10, -1, 11), 1 | 8);
    EXPECT_EQ(GetOutCode(0, 0, 10, 10, 11, -1), 2 | 4);
    // A turned box: 8 is tested before 4 and 2 before 1.
    EXPECT_EQ(GetOutCode(10, 10, 0, 0, 5, 5), 8 | 2);
}

TEST_F(BoxTest, DistanceToABox) {
    EXPECT_EQ(BZ_Mindistsqpt2BBox(0, 0, 0, 0, 10, 10), 0);
    EXPECT_EQ(BZ_Mindistsqpt2BBox(5, 5, 0, 0, 10, 10), 0);
    EXPECT_EQ(BZ_Mindistsqpt2BBox(-3, -4, 0, 0, 10, 10), 25);
    EXPECT_EQ(BZ_Maxdistsqpt2BBox(-3, -4, 0, 0, 10, 10), 13 * 13 + 14 * 14);
    EXPECT_EQ(BZ_Maxdistsqpt2BBox(2, 9, 0, 0, 10, 10), 8 * 8 + 9 * 9);
    EXPECT_EQ(BZ_Maxdistsqpt2BBox(12, 11, 0, 0, 10, 10), 12 * 12 + 11 * 11);
}

// ---- BZ_LNboxintersected -------------------------------------------------------------

TEST_F(BoxTest, LineWithBothEndsAboveSharesABitAndGivesZero) {
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, -5, 12, 15, 20), 0);
}

TEST_F(BoxTest, LineEndsInsideGiveFiveSixSeven) {
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, 5, 5, 20, 5), 5);
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, 20, 5, 5, 5), 6);
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, 1, 1, 9, 9), 7);
}

TEST_F(BoxTest, LineCrossingTheBoxGivesFour) {
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, -5, 5, 15, 5), 4);
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, 5, -5, 5, 15), 4);
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, -5, 20, 20, -5), 4);
}

TEST_F(BoxTest, LineMissingTheBoxAcrossTwoRegionsGivesZero) {
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, -5, 8, 2, 30), 0);
}

TEST_F(BoxTest, ExactDiagonalThroughTheCornersGivesZero) {
    // Along the diagonal the crossings fall exactly on the corners, and the
    // strict comparisons reject them.
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, -5, -5, 15, 15), 0);
    EXPECT_EQ(BZ_LNboxintersected(0, 0, 10, 10, -5, -4.9, 15, 15.1), 4);
}

// ---- BZ_CVboxintersected -------------------------------------------------------------

TEST_F(BoxTest, CurveWhollyInsideGivesSeven) {
    const BZ_Curve c{{1, 1}, {2, 8}, {8, 8}, {9, 1}};
    EXPECT_EQ(BZ_CVboxintersected(0, 0, 10, 10, &c), 7);
}

TEST_F(BoxTest, CurveWithOneEndInsideGivesFiveOrSix) {
    const BZ_Curve c{{5, 5}, {8, 8}, {12, 8}, {15, 5}};
    EXPECT_EQ(BZ_CVboxintersected(0, 0, 10, 10, &c), 5);
    const BZ_Curve r{{15, 5}, {12, 8}, {8, 8}, {5, 5}};
    EXPECT_EQ(BZ_CVboxintersected(0, 0, 10, 10, &r), 6);
}

TEST_F(BoxTest, CurveWhoseBoxIsApartGivesZero) {
    const BZ_Curve c{{20, 20}, {21, 25}, {27, 25}, {29, 20}};
    EXPECT_EQ(BZ_CVboxintersected(0, 0, 10, 10, &c), 0);
}

TEST_F(BoxTest, CurveCrossingWithBothEndsOutsideGivesFour) {
    // Dips into the box from above through its top edge.
    const BZ_Curve c{{-2, 12}, {2, 4}, {8, 4}, {12, 12}};
    EXPECT_EQ(BZ_CVboxintersected(0, 0, 10, 10, &c), 4);
}

TEST_F(BoxTest, CurveWhoseBoxOverlapsButWhichMissesGivesZero) {
    // Passes the corner (10, 10) outside.
    const BZ_Curve c{{8, 14}, {10, 11}, {11, 10}, {14, 8}};
    EXPECT_EQ(BZ_CVboxintersected(0, 0, 10, 10, &c), 0);
}

TEST_F(BoxTest, CurveContactTestAllocationFailureCountsAsContact) {
    const BZ_Curve c{{8, 14}, {10, 11}, {11, 10}, {14, 8}};
    tstest::ForEachAllocationFailure([&](int64_t) {
        const int16_t r = BZ_CVboxintersected(0, 0, 10, 10, &c);
        EXPECT_EQ(r, tessarine::testing::AllocationFailureHit() ? 4 : 0);
    });
}

// ---- BZ_ARCboxintersected -----------------------------------------------------------

TEST_F(BoxTest, ArcWithAPointInsideGivesOne) {
    EXPECT_EQ(BZ_ARCboxintersected(0, 0, 10, 10, 5, 5, 2, 0, 1), 1);
}

TEST_F(BoxTest, ArcFarAwayGivesZero) {
    EXPECT_EQ(BZ_ARCboxintersected(0, 0, 10, 10, 50, 50, 2, 0, kPi), 0);
}

TEST_F(BoxTest, ArcCrossingThroughAnEdgeGivesOne) {
    // A big arc around the box whose end points and probe are outside, but
    // which cuts through the box's top-left region.
    EXPECT_EQ(BZ_ARCboxintersected(0, 0, 10, 10, -6, 16, 10, -0.3, -1.0), 1);
}

TEST_F(BoxTest, ArcAroundTheBoxWithoutTouchingGivesZero) {
    // A circle of radius 20 about the box's centre: its box holds the tested
    // box, no point is inside, and no edge meets it.
    EXPECT_EQ(BZ_ARCboxintersected(0, 0, 10, 10, 5, 5, 20, 0, kPi), 0);
}

// ---- BZ_LineBBoxInt ------------------------------------------------------------------

TEST_F(BoxTest, VerticalLineFarToTheRightAtTheBoxHeightGivesOne) {
    const BZ_Point lo{0, 0}, hi{10, 10}, a{100, 2}, b{100, 8};
    EXPECT_EQ(BZ_LineBBoxInt(&a, &b, &lo, &hi, 0.01), 1);
    const BZ_Point c{100, 20}, d{100, 30};
    EXPECT_EQ(BZ_LineBBoxInt(&c, &d, &lo, &hi, 0.01), 0);
}

TEST_F(BoxTest, HorizontalLineFarAboveAtTheBoxWidthGivesOne) {
    const BZ_Point lo{0, 0}, hi{10, 10}, a{-2, 100}, b{15, 100};
    EXPECT_EQ(BZ_LineBBoxInt(&a, &b, &lo, &hi, 0.01), 1);
    const BZ_Point c{20, 100}, d{30, 100};
    EXPECT_EQ(BZ_LineBBoxInt(&c, &d, &lo, &hi, 0.01), 0);
}

TEST_F(BoxTest, SlantedLineThroughTheBoxGivesOne) {
    const BZ_Point lo{0, 0}, hi{10, 10}, a{-5, 2}, b{15, 8};
    EXPECT_EQ(BZ_LineBBoxInt(&a, &b, &lo, &hi, 0), 1);
    const BZ_Point c{-5, 20}, d{15, 28};
    EXPECT_EQ(BZ_LineBBoxInt(&c, &d, &lo, &hi, 0), 0);
    // Passing above the top edge within the tolerance.
    const BZ_Point e{-5, 10.05}, f{15, 10.06};
    EXPECT_EQ(BZ_LineBBoxInt(&e, &f, &lo, &hi, 0), 0);
    EXPECT_EQ(BZ_LineBBoxInt(&e, &f, &lo, &hi, 0.1), 1);
}

TEST_F(BoxTest, SteepLineCrossingTopAndBottomGivesOne) {
    const BZ_Point lo{0, 0}, hi{10, 10}, a{4, -5}, b{6, 15};
    EXPECT_EQ(BZ_LineBBoxInt(&a, &b, &lo, &hi, 0), 1);
}

TEST_F(BoxTest, EndPointInTheGrownBoxGivesOne) {
    const BZ_Point lo{0, 0}, hi{10, 10}, a{10.05, 20}, b{10.05, 10.05};
    EXPECT_EQ(BZ_LineBBoxInt(&a, &b, &lo, &hi, 0.1), 1);
}

// ---- BZ_CurveBBoxInt ----------------------------------------------------------------

int32_t CurveContact(const double *v, double xmin, double ymin, double xmax, double ymax,
                     double tol, int32_t *status) {
    const BZ_Point lo{xmin, ymin}, hi{xmax, ymax};
    int32_t result = 77;
    *status = BZ_CurveBBoxInt(v[0], v[1], v[2], v[3], v[4], v[5], v[6], v[7], &lo, &hi, tol, &result);
    return result;
}

TEST_F(BoxTest, CurveEnteringAndLeavingBetweenSubdivisionPointsIsFound) {
    // The arch's top clips a small box near (2, 1.44), between the curve's
    // end points and away from its middle point (2, 1.5).
    const double v[8] = {0, 0, 0, 2, 4, 2, 4, 0};
    int32_t status = 0;
    EXPECT_EQ(CurveContact(v, 0.9, 1.3, 1.1, 1.4, 0.0001, &status), 1);
    EXPECT_EQ(status, 10);
    EXPECT_EQ(CurveContact(v, 1.8, 1.6, 2.2, 1.7, 0.0001, &status), 0);
    EXPECT_EQ(status, 10);
}

TEST_F(BoxTest, CurveWithAnEndInTheBoxGivesOne) {
    const double v[8] = {5, 5, 8, 9, 12, 9, 20, 5};
    int32_t status = 0;
    EXPECT_EQ(CurveContact(v, 0, 0, 10, 10, 0, &status), 1);
    EXPECT_EQ(status, 10);
}

TEST_F(BoxTest, FlatCurveIsTestedAsItsChord) {
    const double v[8] = {-5, 5, 0, 5, 10, 5, 15, 5};
    int32_t status = 0;
    EXPECT_EQ(CurveContact(v, 0, 0, 10, 10, 0.01, &status), 1);
    const double w[8] = {-5, 15, 0, 15.75, 10, 17.25, 15, 18};
    EXPECT_EQ(CurveContact(w, 0, 0, 10, 10, 0.01, &status), 0);
    // A horizontal chord compares only its own axis.
    const double h[8] = {-5, 15, 0, 15, 10, 15, 15, 15};
    EXPECT_EQ(CurveContact(h, 0, 0, 10, 10, 0.01, &status), 1);
}

TEST_F(BoxTest, CurveThatNeverFlattensOverflowsTheStack) {
    // An arch whose top is at the origin, and a tiny box just under the top:
    // at a zero tolerance no piece is flat, and the pieces beside the top
    // keep overlapping the box for more than 64 halvings.
    const double v[8] = {-2, -1.5, -2, 0.5, 2, 0.5, 2, -1.5};
    int32_t status = 0;
    const int32_t r = CurveContact(v, -1e-30, -2e-45, 1e-30, -1e-45, 0, &status);
    EXPECT_EQ(status, -56);
    EXPECT_EQ(r, 0);
}

TEST_F(BoxTest, CurveContactAgreesWithDenseSampling) {
    std::mt19937_64 rng(42);
    std::uniform_real_distribution<double> u(-10, 10);
    int agree = 0, total = 0;
    for (int i = 0; i < 400; ++i) {
        double v[8];
        for (double &x : v) x = u(rng);
        const double x0 = u(rng), y0 = u(rng);
        const double x1 = x0 + std::fabs(u(rng)) / 3, y1 = y0 + std::fabs(u(rng)) / 3;
        int32_t status = 0;
        const int32_t r = CurveContact(v, x0, y0, x1, y1, 1e-6, &status);
        ASSERT_EQ(status, 10);
        bool hit = false;
        double nearest = 1e300;
        for (int k = 0; k <= 20000; ++k) {
            const double t = k / 20000.0, s = 1 - t;
            const double px = s * s * s * v[0] + 3 * s * s * t * v[2] + 3 * s * t * t * v[4] + t * t * t * v[6];
            const double py = s * s * s * v[1] + 3 * s * s * t * v[3] + 3 * s * t * t * v[5] + t * t * t * v[7];
            const double d = BZ_Mindistsqpt2BBox(px, py, x0, y0, x1, y1);
            nearest = std::fmin(nearest, d);
            if (d == 0) hit = true;
        }
        // Near misses and grazes are left out: the answer there rests on the
        // tolerance of the flatness test.
        if (!hit && nearest < 1e-4) continue;
        ++total;
        if ((r == 1) == hit) ++agree;
        else ADD_FAILURE() << "case " << i << " result " << r << " sampled " << hit;
    }
    EXPECT_EQ(agree, total);
    EXPECT_GT(total, 350);
}

}  // namespace

namespace {

TEST_F(BoxTest, CurveOfTinyValuesEndsWithinItsHalvingBound) {
    // A curve that shrinks from 1 to values near the smallest doubles keeps
    // a whole tree of unflat pieces beside the box without passing 64
    // pending ones; the work still ends, with -56.
    const double v[8] = {1.0, 0.0, -4.1861829451057006e-203, -2.3534370769818398e-185,
                         1.7709328094115e-310, 6.212759e-317, -2.3534373745633116e-185,
                         8.34402750790665e-310};
    int32_t status = 0;
    const int32_t r = CurveContact(v, -4.1614403441363077e+160, 0, 0, 0, 0, &status);
    EXPECT_EQ(status, -56);
    EXPECT_EQ(r, 0);
}

}  // namespace
