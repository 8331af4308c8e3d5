// Three-point arc, angular classification, line and arc intersections.
#include <cmath>

#include "geometry_test_util.h"

using namespace gtest_geometry;
using tessarine::geometry::BZ_ArcParamOfAngle;
using tessarine::geometry::BZ_SameCircleArcInt;

namespace {

struct ThreePoint {
    BZ_Point centre = SentinelPoint();
    double radius = kSentinel, start = kSentinel, sweep = kSentinel, length = kSentinel;
    int16_t outcome = kSentinel16;
    int32_t status = 0;
};

ThreePoint Run3pt(double x0, double y0, double x1, double y1, double x2, double y2) {
    ThreePoint r;
    r.status = BZ_3ptarcinfo(x0, y0, x1, y1, x2, y2, &r.centre, &r.radius, &r.start, &r.sweep,
                             &r.length, &r.outcome);
    return r;
}

void ExpectNothingElse(const ThreePoint &r) {
    ExpectSentinel(r.centre);
    EXPECT_EQ(r.radius, kSentinel);
    EXPECT_EQ(r.start, kSentinel);
    EXPECT_EQ(r.sweep, kSentinel);
    EXPECT_EQ(r.length, kSentinel);
}

struct Hits {
    BZ_Point p[2] = {SentinelPoint(), SentinelPoint()};
    double t1[2] = {kSentinel, kSentinel};
    double t2[2] = {kSentinel, kSentinel};
    int16_t count = kSentinel16;
    int16_t code = kSentinel16;
};

Hits LineArc(const BZ_Line &l, const BZ_Arc &a) {
    Hits h;
    EXPECT_EQ(BZ_LineArcInt(&l, &a, h.p, h.t1, h.t2, &h.count, &h.code), 10);
    return h;
}
Hits BoundLineArc(const BZ_Line &l, const BZ_Arc &a) {
    Hits h;
    EXPECT_EQ(BZ_BoundLineArcInt(&l, &a, h.p, h.t1, h.t2, &h.count, &h.code), 10);
    return h;
}
Hits ArcArc(const BZ_Arc &a, const BZ_Arc &b) {
    Hits h;
    EXPECT_EQ(BZ_ArcArcInt(&a, &b, h.p, h.t1, h.t2, &h.count, &h.code), 10);
    return h;
}
Hits BoundArcArc(const BZ_Arc &a, const BZ_Arc &b) {
    Hits h;
    EXPECT_EQ(BZ_BoundArcArcInt(&a, &b, h.p, h.t1, h.t2, &h.count, &h.code), 10);
    return h;
}

void ExpectArraysUntouched(const Hits &h) {
    for (int i = 0; i < 2; ++i) {
        ExpectSentinel(h.p[i]);
        EXPECT_EQ(h.t1[i], kSentinel);
        EXPECT_EQ(h.t2[i], kSentinel);
    }
}

int16_t Area(double s, double m, double e, double a) {
    int16_t area = kSentinel16;
    EXPECT_EQ(BZ_PtOnWhichAreaofArc(s, m, e, a, &area), 10);
    return area;
}

double Param(double start, double sweep, double angle) {
    double t = kSentinel;
    EXPECT_EQ(BZ_ArcParamOfAngle(start, sweep, angle, &t), 10);
    return t;
}

}  // namespace

TEST(GeometryThreePoint, HalfCircles) {
    ThreePoint r = Run3pt(1, 0, 0, 1, -1, 0);
    EXPECT_EQ(r.status, 10);
    EXPECT_EQ(r.outcome, 10);
    EXPECT_NEAR(r.centre.x, 0, 1e-15);
    EXPECT_NEAR(r.centre.y, 0, 1e-15);
    EXPECT_NEAR(r.radius, 1, 1e-15);
    EXPECT_NEAR(r.start, 0, 1e-15);
    EXPECT_NEAR(r.sweep, kPi, 1e-15);
    EXPECT_NEAR(r.length, kPi, 1e-15);
    r = Run3pt(1, 0, 0, -1, -1, 0);
    EXPECT_EQ(r.outcome, 10);
    EXPECT_NEAR(r.sweep, -kPi, 1e-15);
    EXPECT_NEAR(r.length, kPi, 1e-15);
}

TEST(GeometryThreePoint, StartAngleInOneTurnAndSweepSign) {
    // Start at angle 300 degrees, clockwise through 200 to 100 degrees.
    const double d = kPi / 180;
    const BZ_Point p0 = OnCircle(2, 3, 5, 300 * d), p1 = OnCircle(2, 3, 5, 200 * d),
                   p2 = OnCircle(2, 3, 5, 100 * d);
    ThreePoint r = Run3pt(p0.x, p0.y, p1.x, p1.y, p2.x, p2.y);
    EXPECT_EQ(r.outcome, 10);
    EXPECT_NEAR(r.start, 300 * d, 1e-12);
    EXPECT_NEAR(r.sweep, -200 * d, 1e-12);
    EXPECT_NEAR(r.length, 200 * d * 5, 1e-11);
    EXPECT_NEAR(r.radius, 5, 1e-12);
}

TEST(GeometryThreePoint, DegenerateAndStraight) {
    ThreePoint r = Run3pt(1, 0, 0, 1, 1, 0);  // p0 = p2
    EXPECT_EQ(r.status, 10);
    EXPECT_EQ(r.outcome, -3);
    ExpectNothingElse(r);
    r = Run3pt(1, 0, 1, 0, -1, 0);  // p1 = p0
    EXPECT_EQ(r.outcome, -3);
    ExpectNothingElse(r);
    r = Run3pt(1, 0, -1, 0, -1, 0);  // p1 = p2
    EXPECT_EQ(r.outcome, -3);
    ExpectNothingElse(r);
    r = Run3pt(0, 0, 1, 1, 2, 2);  // p1 between
    EXPECT_EQ(r.status, 10);
    EXPECT_EQ(r.outcome, 101);
    ExpectNothingElse(r);
    r = Run3pt(0, 0, 2, 2, 1, 1);  // p2 between p0 and p1: angle 0, cross 0
    EXPECT_EQ(r.outcome, 101);
    ExpectNothingElse(r);
}

TEST(GeometryThreePoint, NearlyStraightTurn) {
    // A turn of 0.03 degree at p1 is straight; 0.1 degree is not.
    const double d = kPi / 180;
    ThreePoint r = Run3pt(-1, 0, 0, 0, std::cos(0.03 * d), std::sin(0.03 * d));
    EXPECT_EQ(r.outcome, 101);
    r = Run3pt(-1, 0, 0, 0, std::cos(0.1 * d), std::sin(0.1 * d));
    EXPECT_EQ(r.outcome, 10);
}

TEST(GeometryThreePoint, NullAddresses) {
    int16_t outcome = kSentinel16;
    EXPECT_EQ(BZ_3ptarcinfo(1, 0, 0, 1, -1, 0, nullptr, nullptr, nullptr, nullptr, nullptr,
                            &outcome),
              10);
    EXPECT_EQ(outcome, 10);
    EXPECT_EQ(BZ_3ptarcinfo(1, 0, 0, 1, -1, 0, nullptr, nullptr, nullptr, nullptr, nullptr,
                            nullptr),
              10);
    // Only the centre and radius wanted: the angles are not computed.
    BZ_Point c = SentinelPoint();
    double radius = kSentinel;
    EXPECT_EQ(BZ_3ptarcinfo(1, 0, 0, 1, -1, 0, &c, &radius, nullptr, nullptr, nullptr, &outcome),
              10);
    EXPECT_NEAR(radius, 1, 1e-15);
    EXPECT_NEAR(c.x, 0, 1e-15);
    double sweep = kSentinel;
    EXPECT_EQ(BZ_3ptarcinfo(1, 0, 0, 1, -1, 0, nullptr, nullptr, nullptr, &sweep, nullptr,
                            &outcome),
              10);
    EXPECT_NEAR(sweep, kPi, 1e-15);
}

TEST(GeometryArcArea, CounterClockwise) {
    // Arc 0 to 1 rad.
    EXPECT_EQ(Area(0, 0.5, 1, 0.5), 4);
    EXPECT_EQ(Area(0, 0.5, 1, 2), 5);
    EXPECT_EQ(Area(0, 0.5, 1, -0.5), 3);
    EXPECT_EQ(Area(0, 0.5, 1, 5.9), 3);
    EXPECT_EQ(Area(0, 0.5, 1, 3.6), 5);  // just before the opposite of the middle
    EXPECT_EQ(Area(0, 0.5, 1, 3.7), 3);  // just after it
}

TEST(GeometryArcArea, ClockwiseAndWrapping) {
    // Arc from 0.5 clockwise to -0.5 (mid 0).
    EXPECT_EQ(Area(0.5, 0, -0.5, 0.1), 4);
    EXPECT_EQ(Area(0.5, 0, -0.5, 1.0), 3);
    EXPECT_EQ(Area(0.5, 0, -0.5, -1.0), 5);
    // An arc across angle 0 given with angles above a turn.
    EXPECT_EQ(Area(6.0, 6.5, 7.0, 0.2), 4);
    EXPECT_EQ(Area(6.0, 6.5, 7.0, 1.0), 5);
}

TEST(GeometryArcArea, LongArcFarSide) {
    // A clockwise arc of 343 degrees from 5.838 to -0.152 leaves a gap of 17
    // degrees, with the three marks in it. From a tested angle whose
    // differences to the marks all have one sign the rule picks two
    // neighbouring marks of the cluster, not the span: 2.49 and 4.0 lie on
    // the span and give 5 and 3. Kept as the rule gives it.
    const double s = 5.83815474249921, w = -5.9901575688634603;
    EXPECT_EQ(Area(s, s + 0.5 * w, s + w, 2.49), 5);
    EXPECT_EQ(Area(s, s + 0.5 * w, s + w, 4.0), 3);
    // Where the differences change sign the answer is the geometric one.
    EXPECT_EQ(Area(s, s + 0.5 * w, s + w, 2.858), 4);  // opposite the gap
    EXPECT_EQ(Area(s, s + 0.5 * w, s + w, 5.9), 3);    // in the gap, start side
    EXPECT_EQ(Area(s, s + 0.5 * w, s + w, 6.1), 5);    // in the gap, end side
}

TEST(GeometryArcParam, Paths) {
    EXPECT_EQ(Param(0, 1e-9, 2.0), 0.0);  // no sweep
    EXPECT_EQ(Param(0, -1e-8, 2.0), 0.0);
    EXPECT_DOUBLE_EQ(Param(0, 2, 1), 0.5);
    EXPECT_DOUBLE_EQ(Param(0, 2, 3), 1.5);  // beyond the end
    EXPECT_NEAR(Param(0, 2, -0.5), -0.25, 1e-15);  // beyond the start, negative
    EXPECT_DOUBLE_EQ(Param(1, -2, 0), 0.5);  // clockwise
    EXPECT_NEAR(Param(1, -2, 1.5), -0.25, 1e-15);
    EXPECT_NEAR(Param(1, -2, -1.5), 1.25, 1e-15);
    EXPECT_NEAR(Param(-0.5, 1, 0.0), 0.5, 1e-15);  // negative start angle
}

TEST(GeometryLineLine, Crossing) {
    int16_t code = kSentinel16;
    double t1 = kSentinel, t2 = kSentinel;
    BZ_Point p = SentinelPoint();
    EXPECT_EQ(BZ_LinelineInt(0, 0, 2, 0, 1, -1, 1, 3, &code, &t1, &t2, &p), 10);
    EXPECT_EQ(code, 1);
    EXPECT_DOUBLE_EQ(t1, 0.5);
    EXPECT_DOUBLE_EQ(t2, 0.25);
    EXPECT_DOUBLE_EQ(p.x, 1);
    EXPECT_DOUBLE_EQ(p.y, 0);
    // Not limited to the segments.
    EXPECT_EQ(BZ_LinelineInt(0, 0, 1, 0, 3, 1, 3, 2, &code, &t1, &t2, &p), 10);
    EXPECT_EQ(code, 1);
    EXPECT_DOUBLE_EQ(t1, 3);
    EXPECT_DOUBLE_EQ(t2, -1);
    EXPECT_EQ(BZ_LinelineInt(0, 0, 2, 0, 1, -1, 1, 3, nullptr, nullptr, nullptr, nullptr), 10);
}

TEST(GeometryLineLine, ParallelDefaultsToZero) {
    int16_t code = kSentinel16;
    double t1 = kSentinel, t2 = kSentinel;
    BZ_Point p = SentinelPoint();
    EXPECT_EQ(BZ_LinelineInt(0, 0, 1, 0, 0, 1e-9, 1, 1e-9, &code, &t1, &t2, &p), 10);
    EXPECT_EQ(code, 7);
    EXPECT_EQ(t1, 0.0);
    EXPECT_EQ(t2, 0.0);
    EXPECT_EQ(p.x, 0.0);
    EXPECT_EQ(p.y, 0.0);
    EXPECT_EQ(BZ_LinelineInt(0, 0, 1, 0, 0, 1e-7, 1, 1e-7, &code, &t1, &t2, &p), 10);
    EXPECT_EQ(code, 6);
    EXPECT_EQ(BZ_LinelineInt(0, 0, 1, 0, 5, 3, 7, 3, &code, nullptr, nullptr, nullptr), 10);
    EXPECT_EQ(code, 6);
    // Very short lines always count as parallel: crossing at right angles,
    // 1e-5 long, the determinant is 1e-10.
    EXPECT_EQ(BZ_LinelineInt(0, 0, 1e-5, 0, 5e-6, -5e-6, 5e-6, 5e-6, &code, &t1, &t2, &p), 10);
    EXPECT_EQ(code, 6);
}

TEST(GeometryLineArc, Secant) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, kPi / 2);
    Hits h = LineArc(Ln(-2, 0.5, 2, 0.5), a);
    EXPECT_EQ(h.code, 1);
    EXPECT_EQ(h.count, 2);
    EXPECT_LT(h.t1[0], h.t1[1]);
    const double x = std::sqrt(0.75);
    EXPECT_NEAR(h.p[0].x, -x, 1e-15);
    EXPECT_NEAR(h.p[1].x, x, 1e-15);
    EXPECT_NEAR(h.p[0].y, 0.5, 1e-15);
    EXPECT_NEAR(h.t1[0], (2 - x) / 4, 1e-15);
    // Angle 30 degrees is 1/3 of the arc; 150 degrees is past its end.
    EXPECT_NEAR(h.t2[1], 1.0 / 3, 1e-14);
    EXPECT_NEAR(h.t2[0], 5.0 / 3, 1e-14);
}

TEST(GeometryLineArc, TangentGivesTwoEqualSolutions) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, kPi);
    Hits h = LineArc(Ln(-2, 1, 2, 1), a);
    EXPECT_EQ(h.code, 1);
    EXPECT_EQ(h.count, 2);
    EXPECT_EQ(h.t1[0], h.t1[1]);
    EXPECT_EQ(h.p[0].x, h.p[1].x);
    EXPECT_EQ(h.p[0].y, h.p[1].y);
    EXPECT_EQ(h.t1[0], 0.5);
    EXPECT_NEAR(h.t2[0], 0.5, 1e-15);
}

TEST(GeometryLineArc, MissAndDegenerate) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, kPi);
    Hits h = LineArc(Ln(-2, 1.5, 2, 1.5), a);
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
    ExpectArraysUntouched(h);
    h = LineArc(Ln(0.5, 0, 0.5, 0), a);  // no length
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
    ExpectArraysUntouched(h);
    BZ_Arc dot = a;
    dot.start = dot.centre;
    h = LineArc(Ln(-2, 0, 2, 0), dot);  // no radius
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
    ExpectArraysUntouched(h);
}

TEST(GeometryArcArc, CrossingCircles) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, kPi);
    const BZ_Arc b = MakeArc(1, 0, 1, kPi / 2, kPi);
    Hits h = ArcArc(a, b);
    EXPECT_EQ(h.code, 1);
    EXPECT_EQ(h.count, 2);
    const double y = std::sqrt(0.75);
    EXPECT_NEAR(h.p[0].x, 0.5, 1e-15);
    EXPECT_NEAR(h.p[0].y, y, 1e-15);
    EXPECT_NEAR(h.p[1].x, 0.5, 1e-15);
    EXPECT_NEAR(h.p[1].y, -y, 1e-15);
    EXPECT_NEAR(h.t1[0], 1.0 / 3, 1e-14);   // 60 degrees on a half circle
    EXPECT_NEAR(h.t2[0], 1.0 / 6, 1e-14);   // 120 degrees from 90
    EXPECT_NEAR(h.t1[1], -1.0 / 3, 1e-14);  // -60 degrees: before the start
    EXPECT_NEAR(h.t2[1], 5.0 / 6, 1e-14);   // 240 degrees from 90
}

TEST(GeometryArcArc, TangentCirclesGiveTwoPoints) {
    Hits h = ArcArc(MakeArc(0, 0, 1, 0, 1), MakeArc(2, 0, 1, 2, 1));
    EXPECT_EQ(h.code, 1);
    EXPECT_EQ(h.count, 2);
    EXPECT_EQ(h.p[0].x, h.p[1].x);
    EXPECT_EQ(h.p[0].y, h.p[1].y);
    EXPECT_EQ(h.p[0].x, 1.0);
}

TEST(GeometryArcArc, NoMeeting) {
    Hits h = ArcArc(MakeArc(0, 0, 1, 0, 1), MakeArc(3, 0, 1, 0, 1));  // apart
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
    ExpectArraysUntouched(h);
    h = ArcArc(MakeArc(0, 0, 3, 0, 1), MakeArc(0.5, 0, 1, 0, 1));  // one inside the other
    EXPECT_EQ(h.code, 0);
    ExpectArraysUntouched(h);
    BZ_Arc dot = MakeArc(0.5, 0, 1, 0, 1);
    dot.start = dot.centre;
    h = ArcArc(MakeArc(0, 0, 1, 0, 1), dot);
    EXPECT_EQ(h.code, 0);
    ExpectArraysUntouched(h);
}

TEST(GeometryArcArc, NearlyConcentric) {
    // Centres 1e-9 apart, equal radii: one circle.
    BZ_Arc a = MakeArc(0, 0, 1, 0, 1);
    BZ_Arc b = a;
    b.centre.x += 1e-9;
    b.start = Pt(1e-9, 1);
    b.startAngle = kPi / 2;
    b.sweep = 1;
    b.end = OnCircle(1e-9, 0, 1, kPi / 2 + 1);
    Hits h = ArcArc(a, b);
    EXPECT_EQ(h.code, 8);
    EXPECT_EQ(h.count, 0);
    // Exactly equal centres, radii 1e-9 apart: D is below the difference.
    BZ_Arc c = MakeArc(0, 0, 1, 0, 1);
    c.start = Pt(1 + 1e-9, 0);
    h = ArcArc(a, c);
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
}

TEST(GeometryArcArc, ArcWithItself) {
    const BZ_Arc a = MakeArc(1, 2, 3, 0.5, 1.5);
    Hits h = ArcArc(a, a);
    EXPECT_EQ(h.code, 3);
    EXPECT_EQ(h.count, 2);
    EXPECT_EQ(h.p[0].x, a.start.x);
    EXPECT_EQ(h.p[0].y, a.start.y);
    EXPECT_EQ(h.p[1].x, a.end.x);
    EXPECT_EQ(h.p[1].y, a.end.y);
    EXPECT_EQ(h.t1[0], 0.0);
    EXPECT_EQ(h.t1[1], 1.0);
    EXPECT_EQ(h.t2[0], 0.0);
    EXPECT_EQ(h.t2[1], 1.0);
}

TEST(GeometryArcArc, SameCircleReversedSnapsToNearerEnd) {
    // Arc 2 runs the other way over arc 1: arc 1's start is arc 2's end.
    const BZ_Arc a = MakeArc(0, 0, 1, 0.5, 1.0);
    const BZ_Arc b = MakeArc(0, 0, 1, 1.5, -1.0);
    Hits h = ArcArc(a, b);
    EXPECT_EQ(h.code, 3);
    EXPECT_EQ(h.count, 2);
    EXPECT_EQ(h.t1[0], 0.0);
    EXPECT_EQ(h.t2[0], 1.0);
    EXPECT_EQ(h.t1[1], 1.0);
    EXPECT_EQ(h.t2[1], 0.0);
}

TEST(GeometryArcArc, SameCircleTouchingAtAnEnd) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, 1);
    const BZ_Arc b = MakeArc(0, 0, 1, 1, 1);
    Hits h = ArcArc(a, b);
    EXPECT_EQ(h.code, 4);
    EXPECT_EQ(h.count, 2);
    EXPECT_EQ(h.p[0].x, a.end.x);
    EXPECT_EQ(h.p[0].y, a.end.y);
    EXPECT_EQ(h.p[1].x, b.start.x);
    EXPECT_EQ(h.p[1].y, b.start.y);
    EXPECT_EQ(h.t1[0], 1.0);
    EXPECT_EQ(h.t2[0], 0.0);
    EXPECT_EQ(h.t1[1], 1.0);
    EXPECT_EQ(h.t2[1], 0.0);
}

TEST(GeometryArcArc, SameCirclePartialOverlapAndApart) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, 1);
    const BZ_Arc b = MakeArc(0, 0, 1, 0.5, 1);
    Hits h = ArcArc(a, b);
    EXPECT_EQ(h.code, 4);
    EXPECT_EQ(h.count, 2);
    // arc 1's end lies on arc 2, then arc 2's start on arc 1.
    EXPECT_EQ(h.t1[0], 1.0);
    EXPECT_NEAR(h.t2[0], 0.5, 1e-15);
    EXPECT_NEAR(h.t1[1], 0.5, 1e-15);
    EXPECT_EQ(h.t2[1], 0.0);
    // Arc 2 inside arc 1: both of its ends, found after none of arc 1's.
    h = ArcArc(MakeArc(0, 0, 1, 0, 2), MakeArc(0, 0, 1, 0.5, 1));
    EXPECT_EQ(h.code, 4);
    EXPECT_EQ(h.count, 2);
    EXPECT_NEAR(h.t1[0], 0.25, 1e-15);
    EXPECT_EQ(h.t2[0], 0.0);
    EXPECT_NEAR(h.t1[1], 0.75, 1e-15);
    EXPECT_EQ(h.t2[1], 1.0);
    // Radii computed equal (start points (1, 0) and (-1, 1.2e-16)).
    h = ArcArc(MakeArc(0, 0, 1, 0, 1), MakeArc(0, 0, 1, kPi, 1));
    EXPECT_EQ(h.code, 8);
    EXPECT_EQ(h.count, 0);
    ExpectArraysUntouched(h);
}

TEST(GeometryArcArc, OneCentreRadiiApartByRoundingMeetNowhere) {
    // With equal centres D is 0, and any difference of the computed radii,
    // however small, is above it.
    const BZ_Arc a = MakeArc(0, 0, 1, 0, 1);
    const BZ_Arc b = MakeArc(0, 0, 1, 3, 1);
    const double r1 = BZ_Distptpt(0, 0, a.start.x, a.start.y);
    const double r2 = BZ_Distptpt(0, 0, b.start.x, b.start.y);
    Hits h = ArcArc(a, b);
    EXPECT_EQ(h.code, r1 == r2 ? 8 : 0);
    EXPECT_EQ(h.count, 0);
}

TEST(GeometryArcArc, SameCircleInternalDirect) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, 1);
    Hits h;
    EXPECT_EQ(BZ_SameCircleArcInt(&a, &a, h.p, h.t1, h.t2, &h.count, &h.code), 10);
    EXPECT_EQ(h.code, 3);
    EXPECT_EQ(h.count, 2);
}

TEST(GeometryBoundLineArc, KeepsOnlyPointsOnBoth) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, kPi / 2);
    Hits h = BoundLineArc(Ln(-2, 0.5, 2, 0.5), a);
    EXPECT_EQ(h.code, 1);
    EXPECT_EQ(h.count, 1);
    EXPECT_NEAR(h.p[0].x, std::sqrt(0.75), 1e-15);
    EXPECT_NEAR(h.t2[0], 1.0 / 3, 1e-14);
    EXPECT_EQ(h.p[1].x, kSentinel);
    // Crossing the circle but off the segment.
    h = BoundLineArc(Ln(-2, 0.5, -1.5, 0.5), a);
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
    ExpectArraysUntouched(h);
    // The plain result has no meeting.
    h = BoundLineArc(Ln(-2, 3, 2, 3), a);
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
    ExpectArraysUntouched(h);
}

TEST(GeometryBoundLineArc, ParameterJustPastTheEndGoesToInscribedAngle) {
    // A radial line from the centre through the point at angle 1 + 5e-9.
    const BZ_Point p = OnCircle(0, 0, 1, 1 + 5e-9);
    const BZ_Arc a = MakeArc(0, 0, 1, 0, 1);
    const BZ_Line radial = Ln(0, 0, 2 * p.x, 2 * p.y);
    Hits plain = LineArc(radial, a);
    ASSERT_EQ(plain.code, 1);
    EXPECT_GT(plain.t2[1], 1.000000001);
    EXPECT_LE(plain.t2[1], 1.00000001);
    // Seen from just past the end the chord's dot product is about 4e-9,
    // within 1e-8: kept. The other solution lies before the line's start.
    Hits h = BoundLineArc(radial, a);
    EXPECT_EQ(h.code, 1);
    ASSERT_EQ(h.count, 1);
    EXPECT_EQ(h.t2[0], plain.t2[1]);
    EXPECT_EQ(h.t1[0], plain.t1[1]);
    // The same angle on a circle of radius 100: the dot product is above
    // 1e-8 and the solution is dropped.
    const BZ_Point q = OnCircle(0, 0, 100, 1 + 5e-9);
    const BZ_Arc big = MakeArc(0, 0, 100, 0, 1);
    plain = LineArc(Ln(0, 0, 2 * q.x, 2 * q.y), big);
    ASSERT_EQ(plain.code, 1);
    EXPECT_GT(plain.t2[1], 1.0);
    h = BoundLineArc(Ln(0, 0, 2 * q.x, 2 * q.y), big);
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
    // Beyond the outer margin: dropped at once.
    const BZ_Point r = OnCircle(0, 0, 1, 1 + 1e-6);
    h = BoundLineArc(Ln(0, 0, 2 * r.x, 2 * r.y), a);
    EXPECT_EQ(h.count, 0);
    // Inside the span but within 0.01 of the end on a short arc: the chord
    // is seen obtuse and the solution is kept.
    const BZ_Point u = OnCircle(0, 0, 1, 0.995);
    h = BoundLineArc(Ln(0, 0, 2 * u.x, 2 * u.y), a);
    EXPECT_EQ(h.count, 1);
}

TEST(GeometryBoundLineArc, AlmostHalfCircle) {
    // Sweep 3.1: a solution at parameter 0 is kept.
    const BZ_Arc a = MakeArc(0, 0, 1, 0, 3.1);
    Hits h = BoundLineArc(Ln(1, -1, 1, 1), a);
    EXPECT_EQ(h.code, 1);
    EXPECT_EQ(h.count, 2);
    EXPECT_EQ(h.t2[0], 0.0);
    // At about -5e-9 it is dropped by the half-circle rule.
    const BZ_Point p = OnCircle(0, 0, 1, -5e-9 * 3.1);
    const BZ_Line radial = Ln(0, 0, 2 * p.x, 2 * p.y);
    Hits plain = LineArc(radial, a);
    ASSERT_EQ(plain.code, 1);
    EXPECT_LT(plain.t2[1], 0.0);
    EXPECT_GE(plain.t2[1], -1e-8);
    h = BoundLineArc(radial, a);
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
}

TEST(GeometryBoundLineArc, LongArcUsesAcuteTest) {
    // A long arc (sweep 4) crossed near its end, inside the span.
    const BZ_Arc a = MakeArc(0, 0, 1, 0, 4);
    const double angle = 4 * 0.995;
    const BZ_Point p = OnCircle(0, 0, 1, angle);
    Hits h = BoundLineArc(Ln(0, 0, 2 * p.x, 2 * p.y), a);
    EXPECT_EQ(h.code, 1);
    ASSERT_EQ(h.count, 1);
    EXPECT_NEAR(h.t2[0], 0.995, 1e-12);
    // A short arc near its end: the obtuse test keeps it.
    const BZ_Arc s = MakeArc(0, 0, 1, 0, 2);
    const BZ_Point q = OnCircle(0, 0, 1, 2 * 0.995);
    h = BoundLineArc(Ln(0, 0, 2 * q.x, 2 * q.y), s);
    EXPECT_EQ(h.count, 1);
    EXPECT_NEAR(h.t2[0], 0.995, 1e-12);
}

TEST(GeometryBoundArcArc, KeepsBothOnlyInside) {
    const BZ_Arc a = MakeArc(0, 0, 1, 0, kPi);
    const BZ_Arc b = MakeArc(1, 0, 1, kPi / 2, kPi);
    Hits h = BoundArcArc(a, b);
    EXPECT_EQ(h.code, 1);
    EXPECT_EQ(h.count, 1);
    EXPECT_NEAR(h.p[0].y, std::sqrt(0.75), 1e-15);
    EXPECT_EQ(h.p[1].x, kSentinel);
    // Same circle apart: code 8 gives nothing.
    h = BoundArcArc(MakeArc(0, 0, 1, 0, 1), MakeArc(0, 0, 1, kPi, 1));
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
    ExpectArraysUntouched(h);
    // Code 4 is copied.
    h = BoundArcArc(MakeArc(0, 0, 1, 0, 1), MakeArc(0, 0, 1, 0.5, 1));
    EXPECT_EQ(h.code, 4);
    EXPECT_EQ(h.count, 2);
    // Circles that cross outside both arcs: code 0.
    h = BoundArcArc(MakeArc(0, 0, 1, kPi, 0.5), MakeArc(1, 0, 1, 0, 0.5));
    EXPECT_EQ(h.code, 0);
    EXPECT_EQ(h.count, 0);
    ExpectArraysUntouched(h);
}
