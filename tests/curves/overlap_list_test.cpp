// The list of met points and stretches, frames, quartering and the
// coincidence tests of the clipping method.
#include <cmath>
#include <vector>

#include "curves/clip.h"
#include "curves_test_util.h"

using namespace gtest_curves;
using namespace tessarine::curves;

namespace {

OverlapRec *Point(double a, double b = 0.5, double x = 1, double y = 2) {
    OverlapRec *r = NewOverlapRec();
    r->a0 = r->a1 = a;
    r->b0 = r->b1 = b;
    r->x0 = r->x1 = x;
    r->y0 = r->y1 = y;
    r->isRange = 0;
    return r;
}

OverlapRec *Stretch(double a0, double a1, double b0, double b1) {
    OverlapRec *r = NewOverlapRec();
    r->a0 = a0;
    r->a1 = a1;
    r->b0 = b0;
    r->b1 = b1;
    r->x0 = a0;
    r->x1 = a1;
    r->isRange = 1;
    return r;
}

struct Flat {
    double a0, a1;
    int16_t isRange;
};

std::vector<Flat> Walk(ListNode *head) {
    std::vector<Flat> v;
    if (head == nullptr) return v;
    ListNode *n = head;
    do {
        const OverlapRec *r = reinterpret_cast<const OverlapRec *>(n);
        v.push_back({r->a0, r->a1, r->isRange});
        EXPECT_EQ(n->next->prev, n);
        n = n->next;
    } while (n != head);
    return v;
}

struct Out {
    double tA[16], tB[16];
    BZ_Point pts[16];
    uint16_t count = 999;
    ClipResult Result() { return ClipResult{tA, tB, pts, &count}; }
};

}  // namespace

class CurveOverlapList : public CurveTest {
  protected:
    void TearDown() override {
        FreeEntireList(&head);
        CurveTest::TearDown();
    }
    ListNode *head = nullptr;
};

TEST_F(CurveOverlapList, FarApartRecordsStayInAscendingOrder) {
    InsertOverlapRec(&head, Point(0.5), 0.001);
    InsertOverlapRec(&head, Point(0.2), 0.001);  // before the head: new head
    InsertOverlapRec(&head, Point(0.9), 0.001);  // after the last
    InsertOverlapRec(&head, Point(0.7), 0.001);  // between
    const auto v = Walk(head);
    ASSERT_EQ(v.size(), 4u);
    EXPECT_EQ(v[0].a0, 0.2);
    EXPECT_EQ(v[1].a0, 0.5);
    EXPECT_EQ(v[2].a0, 0.7);
    EXPECT_EQ(v[3].a0, 0.9);
}

TEST_F(CurveOverlapList, CloseToTheHeadMergesIntoIt) {
    InsertOverlapRec(&head, Point(0.5), 0.001);
    InsertOverlapRec(&head, Point(0.4995), 0.001);
    const auto v = Walk(head);
    ASSERT_EQ(v.size(), 1u);
    EXPECT_EQ(v[0].a0, 0.4995) << "the head takes the start of the new record";
    EXPECT_EQ(v[0].a1, 0.5);
    EXPECT_EQ(v[0].isRange, 0);
}

TEST_F(CurveOverlapList, AListOfOneMergesWithoutABridge) {
    InsertOverlapRec(&head, Point(0.5, 0.25, 7, 8), 0.001);
    InsertOverlapRec(&head, Point(0.5005, 0.75, 9, 10), 0.001);
    const auto v = Walk(head);
    ASSERT_EQ(v.size(), 1u) << "R stays, the new record merged into it";
    EXPECT_EQ(v[0].a0, 0.5);
    EXPECT_EQ(v[0].a1, 0.5005);
    EXPECT_EQ(v[0].isRange, 0);
    const OverlapRec *r = reinterpret_cast<const OverlapRec *>(head);
    EXPECT_EQ(r->b1, 0.75);
    EXPECT_EQ(r->x1, 9);
    // Both results survive the merge: the point record writes its start only.
    Out o;
    EXPECT_EQ(OverlapRecsToResult(&head, o.Result()), 10);
    ASSERT_EQ(o.count, 1);
    EXPECT_EQ(o.tA[0], 0.5);
    EXPECT_EQ(o.tB[0], 0.25);
    EXPECT_EQ(o.pts[0].x, 7);
}

TEST_F(CurveOverlapList, MergeIntoThePredecessorBridgesToTheNext) {
    InsertOverlapRec(&head, Stretch(0.1, 0.2, 0.1, 0.2), 0.001);
    InsertOverlapRec(&head, Stretch(0.2015, 0.3, 0.2, 0.3), 0.001);
    ASSERT_EQ(Walk(head).size(), 2u);
    // Starts at the first's end, ends at the second's start.
    InsertOverlapRec(&head, Point(0.2005), 0.001);
    const auto v = Walk(head);
    ASSERT_EQ(v.size(), 2u) << "0.2015 - 0.2005 is within the gap of the point, not of 0.2";
    InsertOverlapRec(&head, Stretch(0.2, 0.201, 0.2, 0.201), 0.001);
    const auto w = Walk(head);
    ASSERT_EQ(w.size(), 1u);
    EXPECT_EQ(w[0].a0, 0.1);
    EXPECT_EQ(w[0].a1, 0.3);
    EXPECT_EQ(w[0].isRange, 1);
}

TEST_F(CurveOverlapList, CloseToTheNextButNotThePreviousTakesItsStartWithoutTest) {
    InsertOverlapRec(&head, Point(0.2), 0.001);
    InsertOverlapRec(&head, Stretch(0.5, 0.6, 0, 0), 0.001);
    // Ends within the gap of 0.5 and starts below it.
    InsertOverlapRec(&head, Stretch(0.3, 0.4995, 0, 0), 0.001);
    const auto v = Walk(head);
    ASSERT_EQ(v.size(), 2u);
    EXPECT_EQ(v[1].a0, 0.3);
    EXPECT_EQ(v[1].a1, 0.6);
}

TEST_F(CurveOverlapList, EmptyListGivesNoEntries) {
    Out o;
    EXPECT_EQ(OverlapRecsToResult(&head, o.Result()), 10);
    EXPECT_EQ(o.count, 0);
}

TEST_F(CurveOverlapList, EightRecordsAreRemergedWithADoubledGap) {
    // 0.00015 apart: the first re-merge (gap 0.0002) joins them all.
    for (int i = 0; i < 8; ++i) InsertOverlapRec(&head, Point(0.5 + i * 0.00015), 0.0001);
    ASSERT_EQ(Walk(head).size(), 8u);
    Out o;
    EXPECT_EQ(OverlapRecsToResult(&head, o.Result()), 10);
    EXPECT_EQ(o.count, 1);
    EXPECT_EQ(o.tA[0], 0.5);
}

TEST_F(CurveOverlapList, MoreThanEightRecordsThatWillNotMergeGiveMinusOne) {
    for (int i = 0; i < 9; ++i) InsertOverlapRec(&head, Point(i * 0.11), 0.001);
    Out o;
    EXPECT_EQ(OverlapRecsToResult(&head, o.Result()), -1);
    EXPECT_EQ(o.count, 0);
}

TEST_F(CurveOverlapList, StretchEnds) {
    // Both ends inside: both written.
    InsertOverlapRec(&head, Stretch(0.3, 0.4, 0.3, 0.4), 0.001);
    Out a;
    EXPECT_EQ(OverlapRecsToResult(&head, a.Result()), 10);
    EXPECT_EQ(a.count, 2);
    FreeEntireList(&head);
    // Start at the curve's start, a short stretch: the start alone.
    InsertOverlapRec(&head, Stretch(0.0, 0.01, 0.5, 0.51), 0.001);
    Out b;
    OverlapRecsToResult(&head, b.Result());
    ASSERT_EQ(b.count, 1);
    EXPECT_EQ(b.tA[0], 0.0);
    FreeEntireList(&head);
    // End at the other curve's end, a long stretch: both.
    InsertOverlapRec(&head, Stretch(0.4, 0.6, 0.5, 1.0), 0.001);
    Out c;
    OverlapRecsToResult(&head, c.Result());
    EXPECT_EQ(c.count, 2);
    FreeEntireList(&head);
    // Both ends at curve ends: both.
    InsertOverlapRec(&head, Stretch(0.0, 1.0, 1.0, 0.0), 0.001);
    Out d;
    OverlapRecsToResult(&head, d.Result());
    EXPECT_EQ(d.count, 2);
}

// ---- Frames and quarters ------------------------------------------------------------------

TEST(CurveFrames, ClosedCurveLeansOnTheXAxis) {
    const BZ_Curve c{{0, 0}, {1, 1}, {-1, 2}, {0, 0}};
    const ClipFrame f = BuildClipFrame(c);
    EXPECT_EQ(f.dir.x, 1);
    EXPECT_EQ(f.dir.y, 0);
    EXPECT_LE(f.dmin, f.dmax);
    EXPECT_LE(f.smin, f.smax);
    EXPECT_TRUE(FrameTouchesCurve(f, c));
}

TEST(CurveFrames, BandsFollowTheInnerPoints) {
    // Both inner points on one side.
    const ClipFrame up = BuildClipFrame(BZ_Curve{{0, 0}, {1, -2}, {3, -1}, {4, 0}});
    EXPECT_EQ(up.dmin, 0);
    EXPECT_EQ(up.dmax, 0.75 * 2);
    const ClipFrame down = BuildClipFrame(BZ_Curve{{0, 0}, {1, 2}, {3, 1}, {4, 0}});
    EXPECT_EQ(down.dmin, 0.75 * -2);
    EXPECT_EQ(down.dmax, 0);
    const ClipFrame both = BuildClipFrame(BZ_Curve{{0, 0}, {1, 2}, {3, -1}, {4, 0}});
    EXPECT_EQ(both.dmin, 0.444444444 * -2);
    EXPECT_EQ(both.dmax, 0.444444444 * 1);
    // The along band: the first inner point only when behind the origin.
    const ClipFrame along = BuildClipFrame(BZ_Curve{{0, 0}, {-1, 1}, {5, 1}, {4, 0}});
    EXPECT_EQ(along.smin, -1);
    EXPECT_EQ(along.smax, 5);
}

TEST(CurveFrames, TheAlongBandIsNarrowerThanTheCurveOnPurpose) {
    // The first inner point reaches furthest along the chord, but only the
    // second and the end count for smax: the curve reaches x = 4.5 or so,
    // the band stops at 4.
    const BZ_Curve c{{0, 0}, {10, 1}, {2, 1}, {4, 0}};
    const ClipFrame f = BuildClipFrame(c);
    EXPECT_EQ(f.smin, 0);
    EXPECT_EQ(f.smax, 4);
    const Cubic curve{{0, 0, 10, 1, 2, 1, 4, 0}};
    EXPECT_GT(PointAt(curve, 0.25).x, 4.3);
    // A piece across the curve at x = 4.3 is judged apart.
    const BZ_Curve across{{4.3, -1}, {4.3, 0}, {4.3, 1}, {4.3, 2}};
    EXPECT_FALSE(FrameTouchesCurve(f, across));
}

TEST(CurveFrames, FramesApartDoNotTouch) {
    const BZ_Curve a{{0, 0}, {1, 1}, {2, 1}, {3, 0}};
    const BZ_Curve far{{0, 5}, {1, 6}, {2, 6}, {3, 5}};
    EXPECT_FALSE(FrameTouchesCurve(BuildClipFrame(a), far));
    const BZ_Curve beyond{{10, 0}, {11, 1}, {12, 1}, {13, 0}};
    EXPECT_FALSE(FrameTouchesCurve(BuildClipFrame(a), beyond));
    const BZ_Curve across{{1.5, -1}, {1.5, 0}, {1.5, 1}, {1.5, 2}};
    EXPECT_TRUE(FrameTouchesCurve(BuildClipFrame(a), across));
}

TEST(CurveFrames, QuartersFollowTheCurveAndItsRange) {
    const Cubic c{{0, 0, 1, 2, 3, 2, 4, 0}};
    ClipPiece p{{{0, 0}, {1, 2}, {3, 2}, {4, 0}}, 0.2, 0.6};
    ClipPiece q[4];
    SplitIntoQuarters(p, q);
    const double step = (0.6 - 0.2) * 0.25;
    const double ends[5] = {0.2, 0.2 + step, 0.2 + 2 * step, 0.2 + 3 * step, 0.6};
    for (int i = 0; i < 4; ++i) {
        EXPECT_EQ(q[i].t0, ends[i]);
        EXPECT_EQ(q[i].t1, ends[i + 1]);
        const Cubic ref = SubCurve(c, i * 0.25, (i + 1) * 0.25);
        EXPECT_NEAR(q[i].curve.p1.x, ref.v[2], 1e-12);
        EXPECT_NEAR(q[i].curve.p2.y, ref.v[5], 1e-12);
        EXPECT_NEAR(q[i].curve.p3.x, ref.v[6], 1e-12);
    }
    EXPECT_EQ(q[3].t1, 0.6);
    EXPECT_EQ(q[0].curve.p3.x, 0.140625 * 3 + 0.015625 * 4 + 0.421875 * (0.0 + 1));
}

// ---- Coincidence -----------------------------------------------------------------------

TEST(CurveCoincidence, ShortRangesAreScreened) {
    const BZ_Curve c{{0, 0}, {1, 2}, {3, 2}, {4, 0}};
    BZ_Curve out;
    EXPECT_EQ(ExtractSubCurve(c, 0.5, 0.5 + 1e-9, &out), -4);
    EXPECT_EQ(ExtractSubCurve(c, 1 - 1e-9, 1, &out), -4);
    EXPECT_EQ(ExtractSubCurve(c, 0.25, 0.75, &out), 10);
    int32_t way = 7;
    EXPECT_EQ(CurvesCoincide(c, 0.5, 0.5, c, 0, 1, 1e-6, &way), 0);
    EXPECT_EQ(CurvesCoincide(c, 0, 1, c, 1, 1, 1e-6, &way), 0);
    EXPECT_EQ(way, 7);
}

TEST(CurveCoincidence, DirectionAndTheNineTimesRule) {
    const BZ_Curve c{{0, 0}, {1, 2}, {3, 2}, {4, 0}};
    const BZ_Curve r{{4, 0}, {3, 2}, {1, 2}, {0, 0}};
    int32_t way = 7;
    EXPECT_EQ(CurvesCoincide(c, 0, 1, c, 0, 1, 1e-6, &way), 1);
    EXPECT_EQ(way, 1);
    EXPECT_EQ(CurvesCoincide(c, 0, 1, r, 0, 1, 1e-6, &way), 1);
    EXPECT_EQ(way, 0);
    // Ends equal, inner points 8 x tol apart in all: within nine times.
    const double tol = 0.01;
    const BZ_Curve bent{{0, 0}, {1, 2 + 4 * tol}, {3, 2 + 4 * tol}, {4, 0}};
    EXPECT_EQ(CurvesCoincide(c, 0, 1, bent, 0, 1, tol, &way), 1);
    const BZ_Curve bent2{{0, 0}, {1, 2 + 5 * tol}, {3, 2 + 5 * tol}, {4, 0}};
    EXPECT_EQ(CurvesCoincide(c, 0, 1, bent2, 0, 1, tol, &way), 0);
}

TEST(CurveCoincidence, DistancesBelowTheToleranceOfDistanceAreZero) {
    // 5e-9 apart everywhere, a tolerance of 1e-12: Distance makes every gap 0.
    const BZ_Curve c{{0, 0}, {1, 2}, {3, 2}, {4, 0}};
    const BZ_Curve d{{0, 5e-9}, {1, 2 + 5e-9}, {3, 2 + 5e-9}, {4, 5e-9}};
    int32_t way = 7;
    EXPECT_EQ(CurvesCoincide(c, 0, 1, d, 0, 1, 1e-12, &way), 1);
    EXPECT_EQ(way, 1);
}

TEST(CurveCoincidence, WholeCurvesWriteTwoEntries) {
    const BZ_Curve c{{0, 0}, {1, 2}, {3, 2}, {4, 0}};
    const BZ_Curve r{{4, 0}, {3, 2}, {1, 2}, {0, 0}};
    Out o;
    EXPECT_EQ(WholeCurvesCoincide(c, r, 1e-6, o.Result()), 1);
    ASSERT_EQ(o.count, 2);
    EXPECT_EQ(o.tB[0], 1);
    EXPECT_EQ(o.tB[1], 0);
    EXPECT_EQ(o.pts[1].x, 4);
    const BZ_Curve other{{0, 1}, {1, 3}, {3, 3}, {4, 1}};
    Out p;
    EXPECT_EQ(WholeCurvesCoincide(c, other, 1e-6, p.Result()), 0);
    EXPECT_EQ(p.count, 0) << "cleared first";
}
