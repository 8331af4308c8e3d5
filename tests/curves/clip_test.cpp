// Where two cubics meet, touch or run together.
#include <cmath>

#include "curves/clip.h"
#include "curves_test_util.h"
#include "platform/test_hooks.h"

using namespace gtest_curves;
namespace tt = tessarine::testing;

namespace {

const Cubic kArch{{0, 0, 1, 2, 3, 2, 4, 0}};
const Cubic kDip{{0, 1, 1, -1, 3, -1, 4, 1}};

// A curve close beside the arch, not on it: the pairs pile up.
Cubic Beside(double offset) {
    const Cubic w{{0, 0, 1, 3, 3, -3, 4, 0}};
    Cubic c = w;
    for (int i = 1; i < 8; i += 2) c.v[i] += offset;
    return c;
}

void ExpectOnBoth(const Hits &h, const Cubic &a, const Cubic &b, double within) {
    for (int i = 0; i < h.count; ++i) {
        EXPECT_LE(DistanceToCurve(a, h.pts[i]), within) << "entry " << i;
        EXPECT_LE(DistanceToCurve(b, h.pts[i]), within) << "entry " << i;
    }
}

}  // namespace

class CurveClip : public CurveTest {};

TEST_F(CurveClip, IdenticalCurvesEndedByTheBigStackTestKeepTheirKind) {
    const Hits h = CurvePair(kArch, kArch, 1e-6);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.kind, 0) << "the kind it had: no leaf was reached";
    ASSERT_EQ(h.count, 2);
    EXPECT_EQ(h.tA[0], 0);
    EXPECT_EQ(h.tA[1], 1);
    EXPECT_EQ(h.tB[0], 0);
    EXPECT_EQ(h.tB[1], 1);
    EXPECT_EQ(h.pts[0].x, 0);
    EXPECT_EQ(h.pts[1].x, 4);
}

TEST_F(CurveClip, IdenticalCurvesSettledByALeafAreKindThree) {
    const Hits h = CurvePair(kArch, kArch, 0.01);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.kind, 3);
    ASSERT_EQ(h.count, 2);
    EXPECT_EQ(h.tA[0], 0);
    EXPECT_EQ(h.tA[1], 1);
    EXPECT_EQ(h.tB[0], 0);
    EXPECT_EQ(h.tB[1], 1);
}

TEST_F(CurveClip, ACurveAndItsReverseRunOppositeWays) {
    const Hits h = CurvePair(kArch, kArch.Reversed(), 1e-6);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.kind, 3);
    ASSERT_EQ(h.count, 2);
    EXPECT_EQ(h.tA[0], 0);
    EXPECT_EQ(h.tA[1], 1);
    EXPECT_EQ(h.tB[0], 1);
    EXPECT_EQ(h.tB[1], 0);
}

TEST_F(CurveClip, SharedMiddleStretchIsOneStretchOfKindFour) {
    const Cubic a = SubCurve(kArch, 0, 0.6), b = SubCurve(kArch, 0.4, 1);
    const Hits h = CurvePair(a, b, 1e-6);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.kind, 4);
    ASSERT_EQ(h.count, 2);
    EXPECT_NEAR(h.tA[0], 0.4 / 0.6, 1e-6);
    EXPECT_EQ(h.tA[1], 1);
    EXPECT_EQ(h.tB[0], 0);
    EXPECT_NEAR(h.tB[1], 0.2 / 0.6, 1e-6);
    EXPECT_EQ(h.pts[0].x, b.v[0]) << "B's first point";
    EXPECT_EQ(h.pts[1].x, a.v[6]) << "A's last point";
}

TEST_F(CurveClip, ASubCurveReportsItsRange) {
    const Hits h = CurvePair(kArch, SubCurve(kArch, 0.25, 0.75), 1e-6);
    EXPECT_EQ(h.kind, 4);
    ASSERT_EQ(h.count, 2);
    EXPECT_NEAR(h.tA[0], 0.25, 1e-6);
    EXPECT_NEAR(h.tA[1], 0.75, 1e-6);
    EXPECT_EQ(h.tB[0], 0);
    EXPECT_EQ(h.tB[1], 1);
    // And reversed: tB falls.
    const Hits r = CurvePair(kArch, SubCurve(kArch, 0.25, 0.75).Reversed(), 1e-6);
    EXPECT_EQ(r.kind, 4);
    ASSERT_EQ(r.count, 2);
    EXPECT_EQ(r.tB[0], 1);
    EXPECT_EQ(r.tB[1], 0);
}

TEST_F(CurveClip, CurvesThatTouchInOnePointGiveCountOne) {
    const Cubic top{{0, 1.5, 1, 1.5, 3, 1.5, 4, 1.5}};
    const Hits h = CurvePair(kArch, top, 1e-6);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.kind, 1);
    ASSERT_EQ(h.count, 1);
    EXPECT_NEAR(h.pts[0].x, 2, 1e-3);
    EXPECT_NEAR(h.pts[0].y, 1.5, 1e-6);
}

TEST_F(CurveClip, TwoCrossingsFarApartAreTwoRecordsInRisingTA) {
    const int64_t live = tt::LiveBlocks();
    tt::ResetInjection();
    const Hits h = CurvePair(kArch, kDip, 1e-6);
    // The stack and one record a crossing: the leaf that moves the run to
    // the list does not insert its own entry a second time.
    EXPECT_EQ(tt::AllocationCount(), 3);
    EXPECT_EQ(tt::LiveBlocks(), live);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.kind, 1);
    ASSERT_EQ(h.count, 2);
    EXPECT_LT(h.tA[0] + 0.001, h.tA[1]);
    // y = 6t(1 - t) = 0.5 on both.
    const double t0 = (1 - std::sqrt(1 - 4.0 / 6 * 0.5)) / 2;
    EXPECT_NEAR(h.tA[0], t0, 1e-5);
    EXPECT_NEAR(h.tA[1], 1 - t0, 1e-5);
    ExpectOnBoth(h, kArch, kDip, 5e-6);
}

TEST_F(CurveClip, AStretchThatMovesTheRunToTheListIsInsertedOnce) {
    // Straight curves of different speed: one leaf, a stretch that no
    // coincidence test confirms, one record.
    const Cubic a{{0, 0, 1, 0, 2, 0, 3, 0}}, b{{1, 0, 1.1, 0, 1.2, 0, 5, 0}};
    tt::ResetInjection();
    const Hits h = CurvePair(a, b, 1e-6);
    EXPECT_EQ(tt::AllocationCount(), 2);
    EXPECT_EQ(h.kind, 4);
    ASSERT_EQ(h.count, 2);
    EXPECT_NEAR(h.tA[0], 1.0 / 3, 1e-12);
    EXPECT_EQ(h.tA[1], 1);
    EXPECT_EQ(h.tB[0], 0);
    EXPECT_EQ(h.tB[1], 0.5) << "leaf parameters are chord parameters";
}

TEST_F(CurveClip, NearbyCurvesGiveStretchesOnBoth) {
    const Cubic w = Beside(0), w2 = Beside(0.002);
    const Hits h = CurvePair(w, w2, 1e-3);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.kind, 4);
    EXPECT_GE(h.count, 2);
    EXPECT_LE(h.count, 14);
    ExpectOnBoth(h, w, w2, 0.01);
}

TEST_F(CurveClip, LineAgainstCurveGivesParametersOnTheLine) {
    Hits h;
    h.status =
        NewLineCurveIntersect(-1, 1, 5, 1, kArch.v, h.tA, h.tB, h.pts, &h.count, 1e-7, &h.kind);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.kind, 1);
    ASSERT_EQ(h.count, 2);
    for (int i = 0; i < 2; ++i) {
        EXPECT_NEAR(h.pts[i].y, 1, 1e-6);
        EXPECT_NEAR(h.tA[i], (h.pts[i].x + 1) / 6, 1e-6);
        EXPECT_NEAR(PointAt(kArch, h.tB[i]).x, h.pts[i].x, 1e-5);
    }
}

TEST_F(CurveClip, ShortLineAwayFromTheCurveIsADot) {
    Hits h;
    h.status = NewLineCurveIntersect(10, 10, 10, 10 + 1e-9, kArch.v, h.tA, h.tB, h.pts, &h.count,
                                     1e-6, &h.kind);
    EXPECT_EQ(h.status, -1);
    EXPECT_EQ(h.kind, 2);
    EXPECT_EQ(h.count, 0);
}

TEST_F(CurveClip, BoxesApartWithoutADotGiveNothing) {
    Cubic far = kArch;
    for (int i = 0; i < 8; i += 2) far.v[i] += 10;
    const Hits h = CurvePair(kArch, far, 1e-6);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.kind, 0);
    EXPECT_EQ(h.count, 0);
    const Cubic dot{{9, 9, 9, 9, 9, 9, 9, 9}};
    const Hits d = CurvePair(kArch, dot, 1e-6);
    EXPECT_EQ(d.status, -1);
    EXPECT_EQ(d.kind, 2);
    const Hits e = CurvePair(dot, kArch, 1e-6);
    EXPECT_EQ(e.status, -1);
    EXPECT_EQ(e.kind, 2);
}

TEST_F(CurveClip, BoxesWithinTheFixedSlackGoToTheClipping) {
    // 0.00005 apart: the box test's own slack of 0.0001 lets them through,
    // whatever tol is.
    Cubic near = kArch;
    for (int i = 0; i < 8; i += 2) near.v[i] += 4.00005;
    const Hits h = CurvePair(kArch, near, 1e-9);
    EXPECT_EQ(h.status, 10);
    EXPECT_EQ(h.count, 0);
}

TEST_F(CurveClip, ADotInsideTheOtherBoxIsLeftToTheClipping) {
    const Cubic dot{{2, 1.5, 2, 1.5, 2, 1.5, 2, 1.5}};
    const Hits h = CurvePair(dot, kArch, 1e-6);
    EXPECT_EQ(h.status, 10);
    EXPECT_NE(h.kind, 2);
}

TEST_F(CurveClip, TinyChordsThatCannotBeNormalisedEndTheRunWithMinusThree) {
    const Cubic a{{0, 0, 1e-7, 1e-7, 2e-7, 0, 3e-7, 1e-7}};
    const Cubic b{{0, 1e-7, 1e-7, 0, 2e-7, 1e-7, 3e-7, 0}};
    const Hits h = CurvePair(a, b, 1e-9);
    EXPECT_EQ(h.status, -3);
}

TEST_F(CurveClip, TheClipWorksInItsCurvesAndTheEntryPointPassesCopies) {
    Cubic a = kArch, b = kDip;
    const Hits h = CurvePair(a, b, 1e-6);
    EXPECT_EQ(h.count, 2);
    for (int i = 0; i < 8; ++i) {
        EXPECT_EQ(a.v[i], kArch.v[i]);
        EXPECT_EQ(b.v[i], kDip.v[i]);
    }
    Hits d;
    d.kind = 0;
    d.count = 0;
    d.status = TOV_Bezier_Clip(a.v, b.v, d.tA, d.tB, d.pts, &d.count, 1e-6, &d.kind);
    EXPECT_EQ(d.status, 10);
    EXPECT_EQ(d.count, 2);
    bool changed = false;
    for (int i = 0; i < 8; ++i) changed |= a.v[i] != kArch.v[i];
    EXPECT_TRUE(changed) << "the first curve comes back changed";
}

TEST_F(CurveClip, TolerancesThatNeverSeparateEndWithAStatus) {
    for (double tol : {-1.0, std::nan("")}) {
        const Hits h = CurvePair(kArch, kDip, tol);
        EXPECT_TRUE(h.status == -56 || h.status == 10) << tol << " gave " << h.status;
    }
    const double nan = std::nan("");
    const Cubic bad{{0, 0, nan, 2, 3, 2, 4, 0}};
    const Hits n = CurvePair(bad, kDip, 1e-6);
    EXPECT_LE(n.count, 14);
}

TEST_F(CurveClip, EveryAllocationFailureGivesMinusFiveAndFreesAll) {
    // The stack grows once and the list takes hundreds of records.
    const Cubic w = Beside(0), w2 = Beside(2e-6);
    const Hits whole = CurvePair(w, w2, 1e-6);
    ASSERT_EQ(whole.status, 10);
    int rescued = 0;
    const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
        const Hits h = CurvePair(w, w2, 1e-6);
        if (tt::AllocationFailureHit() && h.status == 10) {
            // Only the stack's resize in place may fail alone: the heap
            // then moves the block, and the run goes on unchanged.
            ++rescued;
            EXPECT_EQ(h.count, whole.count);
        } else if (tt::AllocationFailureHit()) {
            EXPECT_EQ(h.status, -5);
        } else {
            EXPECT_EQ(h.status, 10);
        }
    });
    EXPECT_EQ(rescued, 1);
    EXPECT_GT(made, 200);
}

TEST_F(CurveClip, AStackThatCannotGrowGivesMinusFive) {
    const Cubic w = Beside(0), w2 = Beside(2e-6);
    tt::ResetInjection();
    CurvePair(w, w2, 1e-6);
    const int64_t made = tt::AllocationCount();
    int failures = 0;
    for (int64_t n = 1; n <= made; ++n) {
        const int64_t live = tt::LiveBlocks();
        tt::FailAllocationsFrom(n);
        const Hits h = CurvePair(w, w2, 1e-6);
        const bool hit = tt::AllocationFailureHit();
        tt::ResetInjection();
        ASSERT_TRUE(hit);
        EXPECT_EQ(h.status, -5) << n;
        EXPECT_EQ(tt::LiveBlocks(), live) << n;
        ++failures;
    }
    EXPECT_EQ(failures, made);
}

// ---- The small services -------------------------------------------------------------

TEST(CurveServices, FindBezierPointTakesTheFirstFormAtAHalf) {
    double x = 0, y = 0;
    TOV_FindBezierPoint(0, 0, 1, 2, 3, 2, 4, 0, 0.5, &x, &y);
    const double s = 0.5 / (1 - 0.5), u = 1 - 0.5;
    EXPECT_EQ(x, (((4 * s + 3 * 3.0) * s + 3 * 1.0) * s + 0) * (u * u * u));
    EXPECT_EQ(y, (((0 * s + 3 * 2.0) * s + 3 * 2.0) * s + 0) * (u * u * u));
    TOV_FindBezierPoint(0, 0, 1, 2, 3, 2, 4.25, -0.5, 1, &x, &y);
    EXPECT_EQ(x, 4.25);
    EXPECT_EQ(y, -0.5);
    TOV_FindBezierPoint(0.5, 0.25, 1, 2, 3, 2, 4, 0, 0, &x, &y);
    EXPECT_EQ(x, 0.5);
    EXPECT_EQ(y, 0.25);
    for (double t : {0.1, 0.4, 0.6, 0.9}) {
        TOV_FindBezierPoint(0, 0, 1, 2, 3, 2, 4, 0, t, &x, &y);
        const BZ_Point p = PointAt(Cubic{{0, 0, 1, 2, 3, 2, 4, 0}}, t);
        EXPECT_NEAR(x, p.x, 1e-13);
        EXPECT_NEAR(y, p.y, 1e-13);
    }
}

TEST(CurveServices, BoundingBox) {
    double lo = 0, hi = 0;
    TOV_BoundingBox(3, -1, 7, 2, &lo, &hi);
    EXPECT_EQ(lo, -1);
    EXPECT_EQ(hi, 7);
}

TEST(CurveServices, AreaOfAStraightCubicEqualsThatOfItsLine) {
    double s[5] = {0, 0, 0, 0, 0}, line = 0;
    TOV_GetBezierArea(1, 2, 2, 3, 3, 4, 4, 5, &s[0], &s[1], &s[2], &s[3], &s[4]);
    TOV_GetLineSegArea(1, 2, 4, 5, &line);
    const double curve = s[0] / 2 + 3 * s[1] / 10 + s[2] / 5 + 3 * s[3] / 20 + s[4] / 20;
    EXPECT_NEAR(curve, line / 2, 1e-12);
    // The terms add to what is there.
    double t[5] = {1, 1, 1, 1, 1};
    TOV_GetBezierArea(1, 2, 2, 3, 3, 4, 4, 5, &t[0], &t[1], &t[2], &t[3], &t[4]);
    for (int i = 0; i < 5; ++i) EXPECT_EQ(t[i], s[i] + 1);
}

TEST(CurveServices, AreaOfAClosedPathIsItsArea) {
    // The unit circle as four arcs, then y dx around it, counter-clockwise.
    BZ_Point n[18];
    int16_t count = 0;
    ConvertArcToBezier(1, 0, 0, 0, kTurn, n, &count);
    ASSERT_EQ(count, 15);
    double s[5] = {0, 0, 0, 0, 0};
    for (int j = 0; j < 4; ++j) {
        const BZ_Point *p = n + 3 * j + 1;
        TOV_GetBezierArea(p[0].x, p[0].y, p[1].x, p[1].y, p[2].x, p[2].y, p[3].x, p[3].y, &s[0],
                          &s[1], &s[2], &s[3], &s[4]);
    }
    const double area = s[0] / 2 + 3 * s[1] / 10 + s[2] / 5 + 3 * s[3] / 20 + s[4] / 20;
    EXPECT_NEAR(-area, 3.141592653589793, 2e-3);
}
