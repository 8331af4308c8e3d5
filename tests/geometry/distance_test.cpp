// Minimum distances between points, lines and arcs.
#include <cmath>

#include "geometry_test_util.h"

using namespace gtest_geometry;
using tessarine::geometry::BZ_AnglesOverlap;
using tessarine::geometry::BZ_ArcPairCentreDist;
using tessarine::geometry::BZ_ArcPairClass;
using tessarine::geometry::BZ_ArcPairEndDist;
using tessarine::geometry::BZ_LineArcPerpProbe;

namespace {

struct PairOut {
    BZ_Point p1 = SentinelPoint();
    double t1[2] = {kSentinel, kSentinel};
    BZ_Point p2 = SentinelPoint();
    double t2[2] = {kSentinel, kSentinel};
    double d = kSentinel;
    int32_t status = kSentinel16;
};

PairOut ArcArc(const BZ_Arc &a, const BZ_Arc &b) {
    PairOut o;
    o.status = BZ_MindistArcArc(&a, &b, &o.p1, o.t1, &o.p2, o.t2, &o.d);
    return o;
}

PairOut LineArc(const BZ_Line &l, const BZ_Arc &a) {
    PairOut o;
    o.status = BZ_MindistLineArc(&l, &a, &o.p1, o.t1, &o.p2, o.t2, &o.d);
    return o;
}

struct ArcOut {
    BZ_Point foot = SentinelPoint();
    double t = kSentinel, d = kSentinel;
};

ArcOut PtArc(double px, double py, const BZ_Arc &a) {
    ArcOut o;
    const double r = BZ_Distptpt(a.centre.x, a.centre.y, a.start.x, a.start.y);
    EXPECT_EQ(MindistPt2arc(px, py, a.centre.x, a.centre.y, r, a.startAngle, a.sweep, a.start.x,
                            a.start.y, a.end.x, a.end.y, &o.foot, &o.t, &o.d),
              10);
    return o;
}

// Arcs that face each other across the x axis: arc 1 about the origin
// facing +x, arc 2 about (cx, 0) facing -x.
BZ_Arc FacingRight() { return MakeArc(0, 0, 1, -0.5, 1); }
BZ_Arc FacingLeft(double cx) { return MakeArc(cx, 0, 1, kPi - 0.4, 1); }

}  // namespace

TEST(GeometryLineDistance, Carrier) {
    double d = kSentinel, t = kSentinel;
    BZ_Point f = SentinelPoint();
    EXPECT_EQ(BZ_Mindistpt2ln(3, 4, 0, 0, 1, 0, &d, &t, &f), 10);
    EXPECT_EQ(d, 4.0);
    EXPECT_EQ(t, 3.0);  // not limited
    EXPECT_EQ(f.x, 3.0);
    EXPECT_EQ(f.y, 0.0);
    EXPECT_EQ(BZ_Mindistsq2ln(0, 0, 1, 0, 3, 4, &d, &t, &f), 10);
    EXPECT_EQ(d, 16.0);
    EXPECT_EQ(t, 3.0);
    EXPECT_EQ(BZ_Mindistpt2ln(3, 4, 0, 0, 1, 0, nullptr, nullptr, nullptr), 10);
    EXPECT_EQ(BZ_Mindistsq2ln(0, 0, 1, 0, 3, 4, nullptr, nullptr, nullptr), 10);
    // On the carrier: 0.
    EXPECT_EQ(BZ_Mindistpt2ln(0.5, 0, 0, 0, 1, 0, &d, nullptr, nullptr), 10);
    EXPECT_EQ(d, 0.0);
}

TEST(GeometryLineDistance, DegenerateLineMeasuresToB) {
    double d = kSentinel, t = kSentinel;
    BZ_Point f = SentinelPoint();
    EXPECT_EQ(BZ_Mindistpt2ln(3, 4, 0, 0, 1e-7, 0, &d, &t, &f), 10);
    EXPECT_EQ(t, 1.0);
    EXPECT_EQ(f.x, 1e-7);
    EXPECT_EQ(f.y, 0.0);
    EXPECT_EQ(d, BZ_Distptpt(3, 4, 1e-7, 0));
    EXPECT_EQ(BZ_Mindistsq2ln(2, 2, 2, 2, 5, 6, &d, &t, &f), 10);
    EXPECT_EQ(d, 25.0);
    EXPECT_EQ(t, 1.0);
}

TEST(GeometryLineDistance, EqualEndsGiveB) {
    double d = kSentinel, t = kSentinel;
    BZ_Point f = SentinelPoint();
    EXPECT_EQ(BZ_Mindistpt2ln(4, 5, 1, 1, 1, 1, &d, &t, &f), 10);
    EXPECT_EQ(t, 1.0);
    EXPECT_EQ(f.x, 1.0);
    EXPECT_EQ(f.y, 1.0);
    EXPECT_EQ(d, 5.0);
}

TEST(GeometryLineDistance, BoundedWithMargin) {
    double d = kSentinel, t = kSentinel;
    BZ_Point f = SentinelPoint();
    EXPECT_EQ(BZ_Mindistpt2Bln(0, 0, 1, 0, -0.00005, 1, &d, &t, &f), 10);
    EXPECT_EQ(t, -0.00005);  // within the margin: as it is
    EXPECT_EQ(f.x, -0.00005);
    EXPECT_EQ(d, 1.0);
    EXPECT_EQ(BZ_Mindistpt2Bln(0, 0, 1, 0, -0.0001, 1, &d, &t, &f), 10);
    EXPECT_EQ(t, 0.0);
    EXPECT_EQ(f.x, 0.0);
    EXPECT_EQ(f.y, 0.0);
    EXPECT_EQ(d, BZ_Distptpt(-0.0001, 1, 0, 0));
    EXPECT_EQ(BZ_Mindistpt2Bln(0, 0, 1, 0, 1.00005, 1, &d, &t, &f), 10);
    EXPECT_EQ(t, 1.00005);
    EXPECT_EQ(BZ_Mindistpt2Bln(0, 0, 1, 0, 3, 4, &d, &t, &f), 10);
    EXPECT_EQ(t, 1.0);
    EXPECT_EQ(f.x, 1.0);
    EXPECT_EQ(d, BZ_Distptpt(3, 4, 1, 0));
}

TEST(GeometryLineDistance, SegmentWithoutMargin) {
    BZ_Point f = SentinelPoint();
    double t = kSentinel, d = kSentinel;
    EXPECT_EQ(BZ_Mindistsqpt2line(-0.00005, 1, 0, 0, 1, 0, &f, &t, &d), 10);
    EXPECT_EQ(t, 0.0);
    EXPECT_EQ(f.x, 0.0);
    EXPECT_EQ(f.y, 0.0);
    EXPECT_EQ(d, BZ_Distptpts(-0.00005, 1, 0, 0));
    EXPECT_EQ(BZ_Mindistsqpt2line(3, 4, 0, 0, 1, 0, &f, &t, &d), 10);
    EXPECT_EQ(t, 1.0);
    EXPECT_EQ(f.x, 1.0);
    EXPECT_EQ(d, 20.0);
    EXPECT_EQ(BZ_Mindistsqpt2line(0.25, 2, 0, 0, 1, 0, &f, &t, &d), 10);
    EXPECT_EQ(t, 0.25);
    EXPECT_EQ(d, 4.0);
    EXPECT_EQ(BZ_Mindistsqpt2line(0.25, 2, 0, 0, 1, 0, nullptr, nullptr, nullptr), 10);
}

TEST(GeometryArcDistance, AtTheCentre) {
    const BZ_Arc a = MakeArc(1, 1, 2, 0.5, 1);
    ArcOut o = PtArc(1, 1, a);
    EXPECT_EQ(o.t, 0.0);
    EXPECT_EQ(o.d, BZ_Distptpt(1, 1, a.start.x, a.start.y));
    EXPECT_EQ(o.foot.x, a.start.x);
    EXPECT_EQ(o.foot.y, a.start.y);
}

TEST(GeometryArcDistance, InSpanAndBeyond) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, kPi / 2);
    ArcOut o = PtArc(2 * std::cos(0.3), 2 * std::sin(0.3), a);
    EXPECT_NEAR(o.d, 1.0, 1e-15);
    EXPECT_NEAR(o.t, 0.3 / (kPi / 2), 1e-15);
    EXPECT_NEAR(o.foot.x, std::cos(0.3), 1e-15);
    EXPECT_NEAR(o.foot.y, std::sin(0.3), 1e-15);
    // Inside the circle too.
    o = PtArc(0.5 * std::cos(1.0), 0.5 * std::sin(1.0), a);
    EXPECT_NEAR(o.d, 0.5, 1e-15);
    // Beyond the end, on its side: the end point and the distance to it.
    o = PtArc(-1, 0.5, a);
    EXPECT_EQ(o.t, 1.0);
    EXPECT_EQ(o.foot.x, a.end.x);
    EXPECT_EQ(o.foot.y, a.end.y);
    EXPECT_EQ(o.d, BZ_Distptpt(-1, 0.5, a.end.x, a.end.y));
    // Beyond the start.
    o = PtArc(0.5, -1, a);
    EXPECT_EQ(o.t, 0.0);
    EXPECT_EQ(o.foot.x, a.start.x);
    EXPECT_EQ(o.d, BZ_Distptpt(0.5, -1, a.start.x, a.start.y));
}

TEST(GeometryArcDistance, ClockwiseArcAndNullOuts) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, -kPi / 2);  // 0 down to -90 degrees
    ArcOut o = PtArc(2 * std::cos(-0.5), 2 * std::sin(-0.5), a);
    EXPECT_NEAR(o.t, 0.5 / (kPi / 2), 1e-15);
    EXPECT_NEAR(o.d, 1.0, 1e-15);
    // Without a parameter the foot comes from the unnormalised angle.
    BZ_Point f = SentinelPoint();
    double d = kSentinel;
    EXPECT_EQ(MindistPt2arc(2 * std::cos(-0.5), 2 * std::sin(-0.5), 0, 0, 1, 0, -kPi / 2, a.start.x,
                            a.start.y, a.end.x, a.end.y, &f, nullptr, &d),
              10);
    EXPECT_NEAR(f.x, o.foot.x, 1e-15);
    EXPECT_NEAR(f.y, o.foot.y, 1e-15);
    EXPECT_EQ(MindistPt2arc(5, 5, 0, 0, 1, 0, 1, 1, 0, 0, 1, nullptr, nullptr, nullptr), 10);
}

TEST(GeometryAnglesOverlap, StrictAndUnwrapped) {
    EXPECT_EQ(BZ_AnglesOverlap(0, 1, 1, 1), 0);    // touching
    EXPECT_EQ(BZ_AnglesOverlap(0, 1, 6.5, 0.5), 0);  // 6.5 to 7, a turn away
    EXPECT_EQ(BZ_AnglesOverlap(0, 1, 0.5, 1), 1);
    EXPECT_EQ(BZ_AnglesOverlap(0.5, 1, 0, 1), 1);
    EXPECT_EQ(BZ_AnglesOverlap(0, 2, 0.5, 0.5), 1);  // inside
    EXPECT_EQ(BZ_AnglesOverlap(1, -1, 0.5, 1), 1);  // bounds in either order
    EXPECT_EQ(BZ_AnglesOverlap(0, 1, 0, 1), 0);     // identical ranges: nothing strictly between
    EXPECT_EQ(BZ_AnglesOverlap(0, 1, 2, 1), 0);
}

TEST(GeometryArcPairClass, Classes) {
    EXPECT_EQ(BZ_ArcPairClass(&static_cast<const BZ_Arc &>(FacingRight()),
                              &static_cast<const BZ_Arc &>(FacingLeft(4))),
              1);
    const BZ_Arc a = FacingRight();
    const BZ_Arc b4 = FacingLeft(1.5);
    EXPECT_EQ(BZ_ArcPairClass(&a, &b4), 4);
    const BZ_Arc behind = MakeArc(4, 0, 1, 0, 1);
    EXPECT_EQ(BZ_ArcPairClass(&a, &behind), 2);
    const BZ_Arc away = MakeArc(-4, 0, 1, kPi - 0.4, 1);
    EXPECT_EQ(BZ_ArcPairClass(&a, &away), 3);
    const BZ_Arc same = MakeArc(0, 0, 1, 0, 1);
    const BZ_Arc over = MakeArc(0, 0, 2, 0.5, 1);
    EXPECT_EQ(BZ_ArcPairClass(&same, &over), 5);
    const BZ_Arc apart = MakeArc(0, 0, 2, 2, 1);
    EXPECT_EQ(BZ_ArcPairClass(&same, &apart), 3);
    EXPECT_EQ(BZ_ArcPairClass(&same, &same), 3);
}

TEST(GeometryArcArcDistance, OneCentreOverlappingHasNoAnswer) {
    PairOut o = ArcArc(MakeArc(0, 0, 1, 0, 1), MakeArc(0, 0, 2, 0.5, 1));
    EXPECT_EQ(o.status, 0);
    ExpectSentinel(o.p1);
    ExpectSentinel(o.p2);
    EXPECT_EQ(o.t1[0], kSentinel);
    EXPECT_EQ(o.t2[0], kSentinel);
    EXPECT_EQ(o.d, kSentinel);
}

TEST(GeometryArcArcDistance, ArcWithItselfIsClassThree) {
    // The strict overlap test does not see identical ranges as overlapping,
    // so the pair is measured by its ends: status 10 and distance 0.
    const BZ_Arc a = MakeArc(1, 1, 2, 0.3, 1.2);
    PairOut o = ArcArc(a, a);
    EXPECT_EQ(o.status, 10);
    EXPECT_EQ(o.d, 0.0);
    EXPECT_EQ(o.p1.x, a.start.x);
    EXPECT_EQ(o.t1[0], 0.0);
}

TEST(GeometryArcArcDistance, OneCircleApartMeasuresNearestEnds) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, 1);
    const BZ_Arc b = MakeArc(0, 0, 1, kPi, 0.5);
    EXPECT_EQ(BZ_ArcPairClass(&a, &b), 3);
    PairOut o = ArcArc(a, b);
    EXPECT_EQ(o.status, 10);
    EXPECT_EQ(o.d, BZ_Distptpt(a.end.x, a.end.y, b.start.x, b.start.y));
    EXPECT_EQ(o.p1.x, a.end.x);
    EXPECT_EQ(o.t1[0], 1.0);
    EXPECT_EQ(o.p2.x, b.start.x);
    EXPECT_EQ(o.t2[0], 0.0);
}

TEST(GeometryArcArcDistance, BehindAndOverlappingCirclesUseEnds) {
    const BZ_Arc a = FacingRight();
    const BZ_Arc behind = MakeArc(4, 0, 1, 0, 1);
    PairOut o = ArcArc(a, behind);
    PairOut e;
    EXPECT_EQ(BZ_ArcPairEndDist(&a, &behind, &e.p1, e.t1, &e.p2, e.t2, &e.d), 10);
    EXPECT_EQ(o.status, 10);
    EXPECT_EQ(o.d, e.d);
    EXPECT_EQ(o.p1.x, e.p1.x);
    EXPECT_EQ(o.p2.y, e.p2.y);
    const BZ_Arc b4 = FacingLeft(1.5);
    o = ArcArc(a, b4);
    EXPECT_EQ(BZ_ArcPairEndDist(&a, &b4, &e.p1, e.t1, &e.p2, e.t2, &e.d), 10);
    EXPECT_EQ(o.d, e.d);
}

TEST(GeometryArcArcDistance, LineOfCentresMixesTheParameters) {
    const BZ_Arc a = FacingRight();
    const BZ_Arc b = FacingLeft(4);
    PairOut o = ArcArc(a, b);
    EXPECT_EQ(o.status, 10);
    // The smaller line parameter first: (-1, 0) on arc 1's circle, (3, 0) on
    // arc 2's.
    EXPECT_NEAR(o.p1.x, -1, 1e-15);
    EXPECT_NEAR(o.p1.y, 0, 1e-15);
    EXPECT_NEAR(o.p2.x, 3, 1e-15);
    EXPECT_NEAR(o.d, 4, 1e-15);
    // Arc 1's address holds the line parameters of the second run, arc 2's
    // the parameter on arc 1 and then arc 2's second arc parameter.
    EXPECT_NEAR(o.t1[0], 0.75, 1e-15);
    EXPECT_NEAR(o.t1[1], 1.25, 1e-15);
    double onArc1 = 0;
    tessarine::geometry::BZ_ArcParamOfAngle(a.startAngle, a.sweep, kPi, &onArc1);
    EXPECT_EQ(o.t2[0], onArc1);
    double second = 0;
    tessarine::geometry::BZ_ArcParamOfAngle(b.startAngle, b.sweep, 0.0, &second);
    EXPECT_NEAR(o.t2[1], second, 1e-12);
}

TEST(GeometryArcArcDistance, CentreDistFallsBackOnEnds) {
    // An arc of no radius: the line of centres meets nothing.
    const BZ_Arc a = FacingRight();
    BZ_Arc dot = FacingLeft(4);
    dot.start = dot.centre;
    PairOut o, e;
    EXPECT_EQ(BZ_ArcPairCentreDist(&a, &dot, &o.p1, o.t1, &o.p2, o.t2, &o.d), 10);
    EXPECT_EQ(BZ_ArcPairEndDist(&a, &dot, &e.p1, e.t1, &e.p2, e.t2, &e.d), 10);
    EXPECT_EQ(o.d, e.d);
    EXPECT_EQ(o.p2.x, e.p2.x);
    PairOut o2, e2;
    EXPECT_EQ(BZ_ArcPairCentreDist(&dot, &a, &o2.p1, o2.t1, &o2.p2, o2.t2, &o2.d), 10);
    EXPECT_EQ(BZ_ArcPairEndDist(&dot, &a, &e2.p1, e2.t1, &e2.p2, e2.t2, &e2.d), 10);
    EXPECT_EQ(o2.d, e2.d);
}

TEST(GeometryArcArcDistance, EndDistKeepsEarlierOnTie) {
    // Arc 2's ends are mirror images in the x axis and equally near arc 1.
    const BZ_Arc a = MakeArc(0, 0, 1, -kPi / 2, kPi);
    BZ_Arc b;
    b.centre = Pt(3, 0);
    b.start = Pt(2.5, 0.8);
    b.end = Pt(2.5, -0.8);
    b.startAngle = std::atan2(0.8, -0.5);
    b.sweep = 2 * (kPi - b.startAngle);
    b.mid = Pt(3 - std::sqrt(0.89), 0);
    PairOut o;
    EXPECT_EQ(BZ_ArcPairEndDist(&a, &b, &o.p1, o.t1, &o.p2, o.t2, &o.d), 10);
    EXPECT_EQ(o.p2.x, b.start.x);  // arc 2's start, before its end
    EXPECT_EQ(o.p2.y, b.start.y);
    EXPECT_EQ(o.t2[0], 0.0);
    EXPECT_EQ(o.d, std::fabs(1 - BZ_Distptpt(0, 0, 2.5, 0.8)));
}

TEST(GeometryLineArcDistance, TangentAtTheMiddleTakesTheEnds) {
    const BZ_Arc a = MakeArc(0, 0, 1, kPi / 4, kPi / 2);
    PairOut o = LineArc(Ln(-0.2, 1, 0.2, 1), a);
    EXPECT_EQ(o.status, 10);
    // Not 0: the line's start against the arc wins (its end ties).
    EXPECT_NEAR(o.d, std::sqrt(1.04) - 1, 1e-15);
    EXPECT_EQ(o.p1.x, -0.2);
    EXPECT_EQ(o.t1[0], 0.0);
    EXPECT_GT(o.t2[0], 0.5);
}

TEST(GeometryLineArcDistance, ArcEndsAgainstTheLine) {
    // A long line below a small arc: the arc's ends are nearest.
    const BZ_Arc a = MakeArc(0, 2, 1, -kPi / 4 - kPi / 2, kPi / 2);  // bottom quarter, end at -45
    PairOut o = LineArc(Ln(-5, 0, 5, 0), a);
    EXPECT_EQ(o.status, 10);
    // The arc's start and end are at the same height; the start comes first.
    EXPECT_EQ(o.p2.x, a.start.x);
    EXPECT_EQ(o.t2[0], 0.0);
    EXPECT_NEAR(o.p1.x, a.start.x, 1e-15);
    EXPECT_EQ(o.p1.y, 0.0);
    EXPECT_NEAR(o.t1[0], (a.start.x + 5) / 10, 1e-15);
    EXPECT_NEAR(o.d, a.start.y, 1e-15);
}

TEST(GeometryLineArcDistance, PerpendicularProbe) {
    const BZ_Arc a = MakeArc(0, 0, 1, kPi / 4, kPi / 2);
    PairOut o;
    EXPECT_EQ(BZ_LineArcPerpProbe(&static_cast<const BZ_Line &>(Ln(-1, 2, 1, 2)), &a, &o.p1, o.t1,
                                  &o.p2, o.t2, &o.d),
              10);
    EXPECT_NEAR(o.p2.x, 0, 1e-15);
    EXPECT_NEAR(o.p2.y, 1, 1e-15);
    EXPECT_NEAR(o.t2[0], 0.5, 1e-15);
    EXPECT_NEAR(o.d, 1, 1e-15);
    ExpectSentinel(o.p1);  // the probe names only the point on the arc
    EXPECT_EQ(o.t1[0], kSentinel);
    // A line that crosses the circle: nothing found, nothing written.
    PairOut n;
    const BZ_Line crossing = Ln(-1, 0.5, 1, 0.5);
    EXPECT_EQ(BZ_LineArcPerpProbe(&crossing, &a, &n.p1, n.t1, &n.p2, n.t2, &n.d), 10);
    ExpectSentinel(n.p2);
    EXPECT_EQ(n.d, kSentinel);
    // The perpendicular misses the arc (the arc faces the other way).
    const BZ_Arc down = MakeArc(0, 0, 1, -3 * kPi / 4, kPi / 2);
    const BZ_Line above = Ln(-1, 2, 1, 2);
    EXPECT_EQ(BZ_LineArcPerpProbe(&above, &down, &n.p1, n.t1, &n.p2, n.t2, &n.d), 10);
    ExpectSentinel(n.p2);
    EXPECT_EQ(n.t2[0], kSentinel);
}
