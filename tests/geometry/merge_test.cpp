// Merging of adjacent lines and arcs, the cubic that is an arc, and the
// mirror of a point.
#include <cmath>
#include <cstring>

#include "geometry_test_util.h"

using namespace gtest_geometry;

namespace {

constexpr double kDeg = kPi / 180;

BZ_Arc SentinelArc() {
    BZ_Arc a;
    double *f = reinterpret_cast<double *>(&a);
    for (int i = 0; i < 10; ++i) f[i] = kSentinel;
    return a;
}

void ExpectSentinelArc(const BZ_Arc &a) {
    const double *f = reinterpret_cast<const double *>(&a);
    for (int i = 0; i < 10; ++i) EXPECT_EQ(f[i], kSentinel) << "field " << i;
}

void ExpectSameArc(const BZ_Arc &a, const BZ_Arc &b) {
    EXPECT_EQ(std::memcmp(&a, &b, sizeof a), 0);
}

struct Merge {
    BZ_Arc out = SentinelArc();
    int16_t asLine = kSentinel16;
    int16_t outcome = kSentinel16;
    int32_t status = 0;
    // A merged line is written into the head of the out record.
    BZ_Line Line() const {
        BZ_Line line;
        std::memcpy(&line, &out, sizeof line);
        return line;
    }
};

Merge LnArc(const void *first, const void *second, int16_t order, double tol, bool wantLine) {
    Merge m;
    m.status = Mergelnarc(first, second, order, tol, wantLine ? &m.asLine : nullptr, &m.out,
                          &m.outcome);
    return m;
}

Merge ArcArc(const BZ_Arc &a, const BZ_Arc &b, double tol, bool wantLine) {
    Merge m;
    m.status = Mergearcarc(&a, &b, tol, wantLine ? &m.asLine : nullptr, &m.out, &m.outcome);
    return m;
}

// Two halves of one arc.
void Halves(double cx, double cy, double r, double start, double sweep, BZ_Arc *a, BZ_Arc *b) {
    *a = MakeArc(cx, cy, r, start, 0.5 * sweep);
    *b = MakeArc(cx, cy, r, start + 0.5 * sweep, 0.5 * sweep);
}

}  // namespace

// ---- Mergelnln ------------------------------------------------------------------

TEST(GeometryMergeLines, CollinearMergeAtZeroTolerance) {
    const BZ_Line a = Ln(0, 0, 1, 0), b = Ln(1, 0, 3, 0);
    BZ_Line out = Ln(kSentinel, kSentinel, kSentinel, kSentinel);
    int16_t outcome = kSentinel16;
    EXPECT_EQ(Mergelnln(&a, &b, 0.0, &out, &outcome), 10);
    EXPECT_EQ(outcome, 10);
    EXPECT_EQ(out.start.x, 0.0);
    EXPECT_EQ(out.end.x, 3.0);
    EXPECT_EQ(out.end.y, 0.0);
}

TEST(GeometryMergeLines, JointAngleDecides) {
    // 174.9 degrees at the joint: no merge however large the tolerance.
    const double turn = (180 - 174.9) * kDeg;
    const BZ_Line a = Ln(-1, 0, 0, 0), b = Ln(0, 0, std::cos(turn), std::sin(turn));
    BZ_Line out = Ln(kSentinel, kSentinel, kSentinel, kSentinel);
    int16_t outcome = kSentinel16;
    EXPECT_EQ(Mergelnln(&a, &b, 1e6, &out, &outcome), 10);
    EXPECT_EQ(outcome, -1);
    EXPECT_EQ(out.start.x, kSentinel);
    const double turn2 = (180 - 175.1) * kDeg;
    const BZ_Line c = Ln(0, 0, std::cos(turn2), std::sin(turn2));
    EXPECT_EQ(Mergelnln(&a, &c, 1e6, &out, &outcome), 10);
    EXPECT_EQ(outcome, 10);
    // Going out and coming back: joint angle 0.
    const BZ_Line back = Ln(0, 0, -1, 0);
    out = Ln(kSentinel, kSentinel, kSentinel, kSentinel);
    EXPECT_EQ(Mergelnln(&a, &back, 1e6, &out, &outcome), 10);
    EXPECT_EQ(outcome, -1);
    EXPECT_EQ(out.end.x, kSentinel);
}

TEST(GeometryMergeLines, DistanceOfTheJoint) {
    const BZ_Line a = Ln(0, 0, 10, 0.3), b = Ln(10, 0.3, 20, 0);
    BZ_Line out = Ln(kSentinel, kSentinel, kSentinel, kSentinel);
    int16_t outcome = kSentinel16;
    EXPECT_EQ(Mergelnln(&a, &b, 0.2, &out, &outcome), 10);
    EXPECT_EQ(outcome, -1);
    EXPECT_EQ(out.start.x, kSentinel);
    EXPECT_EQ(Mergelnln(&a, &b, 0.3, &out, &outcome), 10);
    EXPECT_EQ(outcome, 10);
    EXPECT_EQ(out.end.x, 20.0);
}

TEST(GeometryMergeLines, Gap) {
    BZ_Line out = Ln(kSentinel, kSentinel, kSentinel, kSentinel);
    int16_t outcome = kSentinel16;
    const BZ_Line a = Ln(0, 0, 1, 0), far = Ln(1 + 1e-6, 0, 2, 0), near = Ln(1 + 1e-7, 0, 2, 0);
    EXPECT_EQ(Mergelnln(&a, &far, 1.0, &out, &outcome), -4);
    EXPECT_EQ(outcome, -1);
    EXPECT_EQ(out.start.x, kSentinel);
    EXPECT_EQ(Mergelnln(&a, &near, 1.0, &out, &outcome), 10);
    EXPECT_EQ(outcome, 10);
}

TEST(GeometryMergeLines, LineOfNoLengthAlwaysMerges) {
    BZ_Line out;
    int16_t outcome = kSentinel16;
    const BZ_Line dot = Ln(1, 1, 1, 1), b = Ln(1, 1, -5, 7);
    EXPECT_EQ(Mergelnln(&dot, &b, 0.0, &out, &outcome), 10);
    EXPECT_EQ(outcome, 10);
    EXPECT_EQ(out.start.x, 1.0);
    EXPECT_EQ(out.end.x, -5.0);
    EXPECT_EQ(out.end.y, 7.0);
    EXPECT_EQ(Mergelnln(&b, &static_cast<const BZ_Line &>(Ln(-5, 7, -5, 7)), 0.0, &out, &outcome),
              10);
    EXPECT_EQ(outcome, 10);
    EXPECT_EQ(out.start.x, 1.0);
}

// ---- Mergelnarc ----------------------------------------------------------------

TEST(GeometryMergeLineArc, Gap) {
    const BZ_Arc arc = MakeArc(0, 0, 1, kPi / 2, -1);
    const BZ_Line line = Ln(-0.1, 1, -1e-6, 1);
    Merge m = LnArc(&line, &arc, 1, 1.0, true);
    EXPECT_EQ(m.status, -4);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
    // Arc first: its end against the line's start.
    const BZ_Line after = Ln(arc.end.x + 1e-6, arc.end.y, 5, 5);
    m = LnArc(&arc, &after, 0, 1.0, false);
    EXPECT_EQ(m.status, -4);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, kSentinel16);
}

TEST(GeometryMergeLineArc, LineThenArcOnOneCircle) {
    const BZ_Arc arc = MakeArc(0, 0, 1, kPi / 2, -1);
    const BZ_Point a = OnCircle(0, 0, 1, kPi / 2 + 0.01);
    const BZ_Line line = Ln(a.x, a.y, arc.start.x, arc.start.y);
    Merge m = LnArc(&line, &arc, 1, 1e-3, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, 10);
    EXPECT_EQ(m.asLine, 0);
    EXPECT_EQ(m.out.start.x, a.x);
    EXPECT_EQ(m.out.start.y, a.y);
    EXPECT_EQ(m.out.end.x, arc.end.x);
    EXPECT_EQ(m.out.end.y, arc.end.y);
    EXPECT_NEAR(m.out.centre.x, 0, 1e-12);
    EXPECT_NEAR(m.out.centre.y, 0, 1e-12);
    EXPECT_NEAR(m.out.sweep, -1.01, 1e-12);
    EXPECT_NEAR(m.out.startAngle, kPi / 2 + 0.01, 1e-12);
    double mx, my;
    const double r = BZ_Distptpt(m.out.centre.x, m.out.centre.y, a.x, a.y);
    BZ_ArcEval(m.out.centre.x, m.out.centre.y, r, m.out.startAngle, m.out.sweep, 0.5, 0, &mx, &my);
    EXPECT_EQ(m.out.mid.x, mx);
    EXPECT_EQ(m.out.mid.y, my);
}

TEST(GeometryMergeLineArc, NeitherArcNorLine) {
    // On one circle, but the line's middle is off it by more than the
    // tolerance, and the joint is far from the chord.
    const BZ_Arc arc = MakeArc(0, 0, 1, kPi / 2, -1);
    const BZ_Point a = OnCircle(0, 0, 1, kPi / 2 + 0.01);
    const BZ_Line line = Ln(a.x, a.y, arc.start.x, arc.start.y);
    Merge m = LnArc(&line, &arc, 1, 1e-7, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
    // Sweep above the limit and a loose tolerance: the distances pass for a
    // line, the directions do not.
    const BZ_Arc big = MakeArc(0, 0, 1, kPi / 2, -2.9);
    m = LnArc(&line, &big, 1, 10.0, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
    // Coming back to the start: the chord from A to E has no length.
    BZ_Arc back = MakeArc(0, 0, 1, kPi / 2, -(kTurn - 0.01));
    back.end = a;
    m = LnArc(&line, &back, 1, 100.0, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
}

TEST(GeometryMergeLineArc, ArcThenLineComparesTheArcsEndTangent) {
    // The line continues the arc along its end tangent. The merged circle's
    // start tangent is compared with the arc's end tangent, which turns by
    // the whole sweep: refused, even though the three points are on the arc.
    const BZ_Arc arc = MakeArc(0, 0, 1, 0, 0.5);
    const BZ_Point e = OnCircle(0, 0, 1, 0.51);
    const BZ_Line line = Ln(arc.end.x, arc.end.y, e.x, e.y);
    Merge m = LnArc(&arc, &line, 0, 1e-3, false);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    ExpectSentinelArc(m.out);
    // A small sweep stays within 5 degrees and merges.
    const BZ_Arc small = MakeArc(0, 0, 1, 0, 0.05);
    const BZ_Point e2 = OnCircle(0, 0, 1, 0.06);
    const BZ_Line line2 = Ln(small.end.x, small.end.y, e2.x, e2.y);
    m = LnArc(&small, &line2, 0, 1e-3, false);
    EXPECT_EQ(m.outcome, 10);
    EXPECT_NEAR(m.out.sweep, 0.06, 1e-12);
    EXPECT_EQ(m.out.start.x, small.start.x);
    EXPECT_EQ(m.out.end.x, e2.x);
}

TEST(GeometryMergeLineArc, NearlyStraightToLine) {
    // A flat arc (radius 1000, sweep 0.001) after a line along its start
    // tangent: the turn at the joint is too small for a circle.
    const BZ_Arc arc = MakeArc(0, -1000, 1000, kPi / 2, -0.001);
    const BZ_Line line = Ln(-1, 0, arc.start.x, arc.start.y);
    Merge m = LnArc(&line, &arc, 1, 1e-3, false);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    ExpectSentinelArc(m.out);
    m = LnArc(&line, &arc, 1, 1e-3, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, 10);
    EXPECT_EQ(m.asLine, 1);
    EXPECT_EQ(m.Line().start.x, -1.0);
    EXPECT_EQ(m.Line().end.x, arc.end.x);
    EXPECT_EQ(m.Line().end.y, arc.end.y);
    EXPECT_EQ(m.out.centre.x, kSentinel);  // only the head is written
    // A tolerance below the arc's sag: no line either.
    m = LnArc(&line, &arc, 1, 1e-6, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
}

TEST(GeometryMergeLineArc, DegenerateArc) {
    BZ_Arc dot = MakeArc(2, 2, 1, 0, 1);
    dot.start = dot.centre;
    dot.mid = dot.centre;
    dot.end = dot.centre;
    const BZ_Line line = Ln(0, 0, 2, 2);
    Merge m = LnArc(&line, &dot, 1, 1e-3, false);
    EXPECT_EQ(m.status, -3);
    EXPECT_EQ(m.outcome, -1);
    ExpectSentinelArc(m.out);
    m = LnArc(&line, &dot, 1, 1e-3, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, 10);
    EXPECT_EQ(m.asLine, 1);
    EXPECT_EQ(m.Line().start.x, 0.0);
    EXPECT_EQ(m.Line().end.x, 2.0);
    EXPECT_EQ(m.out.centre.x, kSentinel);
}

TEST(GeometryMergeLineArc, DegenerateLine) {
    const BZ_Arc arc = MakeArc(0, 0, 1, 0, 1);
    const BZ_Line before = Ln(1 + 1e-8, 0, arc.start.x, arc.start.y);
    Merge m = LnArc(&before, &arc, 1, 1e-3, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, 10);
    EXPECT_EQ(m.asLine, 0);
    BZ_Arc expect = arc;
    expect.start = before.start;
    ExpectSameArc(m.out, expect);
    const BZ_Line after = Ln(arc.end.x, arc.end.y, arc.end.x, arc.end.y + 1e-8);
    m = LnArc(&arc, &after, 0, 1e-3, false);
    EXPECT_EQ(m.outcome, 10);
    expect = arc;
    expect.end = after.end;
    ExpectSameArc(m.out, expect);
}

TEST(GeometryMergeLineArc, BothDegenerateTestedInRecordOrder) {
    BZ_Arc dot = MakeArc(0, 0, 1, 0, 1);
    dot.start = dot.centre;
    dot.mid = dot.centre;
    dot.end = dot.centre;
    const BZ_Line point = Ln(0, 0, 0, 0);
    // Line first: the line is tested first and the arc is the result.
    Merge m = LnArc(&point, &dot, 1, 1e-3, false);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, 10);
    ExpectSameArc(m.out, dot);
    // Arc first: the arc is tested first; without asLine that is -3.
    m = LnArc(&dot, &point, 0, 1e-3, false);
    EXPECT_EQ(m.status, -3);
    EXPECT_EQ(m.outcome, -1);
    m = LnArc(&dot, &point, 0, 1e-3, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.asLine, 1);
}

TEST(GeometryMergeLineArc, ClosedArcFailsTheJointVector) {
    // A full circle first: its start is its end, so J to A has no length.
    const BZ_Arc full = MakeArc(0, 0, 1, 0, kTurn);
    const BZ_Line line = Ln(full.end.x, full.end.y, 2, 0.5);
    Merge m = LnArc(&full, &line, 0, 1e-3, true);
    EXPECT_EQ(m.status, -3);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
}

// ---- Mergearcarc ----------------------------------------------------------------

TEST(GeometryMergeArcs, HalvesOf120DegreesFromAngleZero) {
    BZ_Arc a, b;
    Halves(0, 0, 1, 0, 120 * kDeg, &a, &b);
    Merge m = ArcArc(a, b, 1e-9, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, 10);
    EXPECT_EQ(m.asLine, 0);
    EXPECT_EQ(m.out.start.x, a.start.x);
    EXPECT_EQ(m.out.end.x, b.end.x);
    EXPECT_NEAR(m.out.sweep, 120 * kDeg, 1e-12);
    // The start angle lies in 0 to a full turn: 0 may come back as a turn.
    EXPECT_NEAR(std::remainder(m.out.startAngle, kTurn), 0, 1e-12);
    EXPECT_NEAR(m.out.centre.x, 0, 1e-12);
    EXPECT_NEAR(m.out.mid.x, std::cos(60 * kDeg), 1e-12);
    EXPECT_NEAR(m.out.mid.y, std::sin(60 * kDeg), 1e-12);
}

TEST(GeometryMergeArcs, RotatedStartAngleStillOnTheCircle) {
    BZ_Arc a, b;
    Halves(3, -2, 2, 5.5, -120 * kDeg, &a, &b);
    Merge m = ArcArc(a, b, 1e-9, false);
    EXPECT_EQ(m.outcome, 10);
    EXPECT_NEAR(m.out.sweep, -120 * kDeg, 1e-12);
    EXPECT_NEAR(m.out.startAngle, 5.5, 1e-12);
}

TEST(GeometryMergeArcs, GapLeavesOutcomeAlone) {
    BZ_Arc a, b;
    Halves(0, 0, 1, 0, 1, &a, &b);
    b.start.x += 1e-6;
    Merge m = ArcArc(a, b, 1e-3, true);
    EXPECT_EQ(m.status, -4);
    EXPECT_EQ(m.outcome, kSentinel16);  // the gap is tested first here
    EXPECT_EQ(m.asLine, kSentinel16);
    ExpectSentinelArc(m.out);
}

TEST(GeometryMergeArcs, ArcsOfNoRadius) {
    BZ_Arc a, b;
    Halves(0, 0, 1, 0, 1, &a, &b);
    BZ_Arc dot = a;
    dot.centre = dot.start;
    dot.start = b.start;  // the dot sits at the joint
    dot.end = b.start;
    dot.centre = b.start;
    Merge m = ArcArc(dot, b, 1e-3, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, 10);
    EXPECT_EQ(m.asLine, 0);
    BZ_Arc expect = b;
    expect.start = dot.start;
    ExpectSameArc(m.out, expect);
    BZ_Arc dot2 = b;
    dot2.start = a.end;
    dot2.end = a.end;
    dot2.centre = a.end;
    m = ArcArc(a, dot2, 1e-3, false);
    EXPECT_EQ(m.outcome, 10);
    expect = a;
    expect.end = dot2.end;
    ExpectSameArc(m.out, expect);
}

TEST(GeometryMergeArcs, TinyRadiusFailsTheTangent) {
    // Radius 1e-7: above 1e-8, but too short a normal for a tangent.
    BZ_Arc a, b;
    Halves(0, 0, 1e-7, 0, 1, &a, &b);
    Merge m = ArcArc(a, b, 1e-3, true);
    EXPECT_EQ(m.status, -3);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
}

TEST(GeometryMergeArcs, OppositeCurvatureMergesOnlyToALine) {
    // An S of two flat arcs: first bulging up, then down.
    const double r = 100, half = 0.02;
    const BZ_Arc a = MakeArc(0, -r * std::cos(half), r, kPi / 2 + half, -2 * half);
    BZ_Arc b = MakeArc(2 * a.end.x, r * std::cos(half), r, -kPi / 2 - half, 2 * half);
    b.start = a.end;
    Merge m = ArcArc(a, b, 0.05, false);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    ExpectSentinelArc(m.out);
    m = ArcArc(a, b, 0.05, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, 10);
    EXPECT_EQ(m.asLine, 1);
    EXPECT_EQ(m.Line().start.x, a.start.x);
    EXPECT_EQ(m.Line().end.x, b.end.x);
    EXPECT_EQ(m.out.centre.x, kSentinel);
    // A tolerance below the sag of the arcs: no line.
    m = ArcArc(a, b, 1e-4, true);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
}

TEST(GeometryMergeArcs, LineRefusedByDirection) {
    // An S of two arcs of 0.4 rad: within a loose tolerance of the chord,
    // but their end tangents are 0.2 rad off it.
    const BZ_Arc a = MakeArc(0, -std::cos(0.2), 1, kPi / 2 + 0.2, -0.4);
    BZ_Arc b = MakeArc(2 * a.end.x, std::cos(0.2), 1, -kPi / 2 - 0.2, 0.4);
    b.start = a.end;
    Merge m = ArcArc(a, b, 1.0, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
}

TEST(GeometryMergeArcs, ClosedFirstArcFailsTheJointVector) {
    // A full circle first: the corrected joint falls on A.
    const BZ_Arc a = MakeArc(0, 0, 1, 0, kTurn);
    BZ_Arc b = MakeArc(0, 0, 1, kTurn, 1);
    b.start = a.end;
    Merge m = ArcArc(a, b, 1e-3, true);
    EXPECT_EQ(m.status, -3);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
}

TEST(GeometryMergeArcs, SweepOfExactlyTheLimitIsRefused) {
    // The model of the joint correction, to find an end whose merged sweep
    // is exactly 2.827433388.
    const double h = 1.4;
    const BZ_Arc a = MakeArc(0, 0, 1, 0, h);
    auto second = [&](double endAngle) {
        BZ_Arc b;
        b.centre = Pt(0, 0);
        b.start = a.end;
        b.startAngle = h;
        b.sweep = endAngle - h;
        b.mid = OnCircle(0, 0, 1, h + 0.5 * b.sweep);
        b.end = OnCircle(0, 0, 1, endAngle);
        return b;
    };
    auto mergedSweep = [&](const BZ_Arc &b) {
        double t1x, t1y, t2x, t2y;
        BZ_ArcEval(0, 0, 1, a.startAngle, a.sweep, 1, 1, &t1x, &t1y);
        BZ_ArcEval(0, 0, BZ_Distptpt(0, 0, b.start.x, b.start.y), b.startAngle, b.sweep, 0, 1,
                   &t2x, &t2y);
        double w = BZ_Crossp(t1x, t1y, t2x, t2y);
        if (w > 0.7) w = 0.7;
        const BZ_Point j{(1 - w) * b.start.x + w * (a.mid.x + b.mid.x) / 2,
                         (1 - w) * b.start.y + w * (a.mid.y + b.mid.y) / 2};
        double sweep = 0;
        int16_t outcome = 0;
        BZ_3ptarcinfo(a.start.x, a.start.y, j.x, j.y, b.end.x, b.end.y, nullptr, nullptr, nullptr,
                      &sweep, nullptr, &outcome);
        return outcome == 10 ? sweep : 0.0;
    };
    bool found = false;
    BZ_Arc b{};
    for (int i = -4000; i <= 4000 && !found; ++i) {
        b = second(2.827433388 + i * 1e-16);
        found = mergedSweep(b) == 2.827433388;
    }
    ASSERT_TRUE(found);
    Merge m = ArcArc(a, b, 1e-6, false);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    ExpectSentinelArc(m.out);
    m = ArcArc(a, second(2.8274), 1e-6, false);
    EXPECT_EQ(m.outcome, 10);
}

TEST(GeometryMergeArcs, DifferentCirclesDoNotMerge) {
    // A kinked joint of two arcs of different radii.
    const BZ_Arc a = MakeArc(0, 0, 1, 0, 1);
    BZ_Arc b = MakeArc(0, 0, 2, 1, 1);
    const double dx = a.end.x - b.start.x, dy = a.end.y - b.start.y;
    b = MakeArc(dx, dy, 2, 1, 1);
    Merge m = ArcArc(a, b, 1e-3, true);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    EXPECT_EQ(m.asLine, 0);
    ExpectSentinelArc(m.out);
}

TEST(GeometryMergeArcs, SweepLimitIsExclusive) {
    // Halves of an arc of just under and just over 162 degrees.
    BZ_Arc a, b;
    Halves(0, 0, 1, 0.3, 2.8274, &a, &b);
    EXPECT_EQ(ArcArc(a, b, 1e-9, false).outcome, 10);
    Halves(0, 0, 1, 0.3, 2.8275, &a, &b);
    EXPECT_EQ(ArcArc(a, b, 1e-9, false).outcome, -1);
}

TEST(GeometryMergeLineArc, SweepOfExactlyTheLimitIsRefused) {
    // Find an end point whose three-point sweep is exactly 2.827433388.
    const BZ_Point a = OnCircle(0, 0, 1, 0);
    const BZ_Point j = OnCircle(0, 0, 1, 0.02);
    bool found = false;
    BZ_Point e{};
    for (int i = -4000; i <= 4000 && !found; ++i) {
        e = OnCircle(0, 0, 1, 2.827433388 + i * 1e-16);
        double sweep = 0;
        int16_t outcome = 0;
        BZ_3ptarcinfo(a.x, a.y, j.x, j.y, e.x, e.y, nullptr, nullptr, nullptr, &sweep, nullptr,
                      &outcome);
        found = outcome == 10 && sweep == 2.827433388;
    }
    ASSERT_TRUE(found);
    const double aj = std::atan2(e.y, e.x);
    BZ_Arc arc;
    arc.centre = Pt(0, 0);
    arc.start = j;
    arc.end = e;
    arc.startAngle = 0.02;
    arc.sweep = aj - 0.02;
    arc.mid = OnCircle(0, 0, 1, 0.02 + 0.5 * arc.sweep);
    const BZ_Line line = Ln(a.x, a.y, j.x, j.y);
    Merge m = LnArc(&line, &arc, 1, 1e-3, false);
    EXPECT_EQ(m.status, 10);
    EXPECT_EQ(m.outcome, -1);
    // One step shorter passes.
    arc.end = OnCircle(0, 0, 1, 2.8274);
    arc.sweep = 2.8274 - 0.02;
    arc.mid = OnCircle(0, 0, 1, 0.02 + 0.5 * arc.sweep);
    m = LnArc(&line, &arc, 1, 1e-3, false);
    EXPECT_EQ(m.outcome, 10);
}

// ---- Chkcv2arc -------------------------------------------------------------------

namespace {

struct CurveCheck {
    BZ_Point centre = SentinelPoint();
    BZ_Point mid = SentinelPoint();
    double radius = kSentinel, start = kSentinel, sweep = kSentinel;
    int16_t isArc = kSentinel16;
    int32_t status = 0;
    void ExpectUntouched() const {
        ExpectSentinel(centre);
        ExpectSentinel(mid);
        EXPECT_EQ(radius, kSentinel);
        EXPECT_EQ(start, kSentinel);
        EXPECT_EQ(sweep, kSentinel);
    }
};

CurveCheck Check(const double c[8], double tol, double least) {
    CurveCheck k;
    k.status = Chkcv2arc(c[0], c[1], c[2], c[3], c[4], c[5], c[6], c[7], tol, least, &k.centre,
                         &k.mid, &k.radius, &k.start, &k.sweep, &k.isArc);
    return k;
}

// The usual cubic of a circular arc: handles along the end tangents.
void ArcCubic(double cx, double cy, double r, double start, double sweep, double c[8]) {
    const double h = 4.0 / 3 * std::tan(sweep / 4) * r;
    const double e = start + sweep;
    c[0] = cx + r * std::cos(start);
    c[1] = cy + r * std::sin(start);
    c[2] = c[0] - h * std::sin(start);
    c[3] = c[1] + h * std::cos(start);
    c[6] = cx + r * std::cos(e);
    c[7] = cy + r * std::sin(e);
    c[4] = c[6] + h * std::sin(e);
    c[5] = c[7] - h * std::cos(e);
}

}  // namespace

TEST(GeometryCurveToArc, QuarterCircle) {
    double c[8];
    ArcCubic(1, 2, 3, 0.2, kPi / 2, c);
    CurveCheck k = Check(c, 1e-3, 0.5);
    EXPECT_EQ(k.status, 10);
    EXPECT_EQ(k.isArc, 1);
    EXPECT_NEAR(k.centre.x, 1, 1e-9);
    EXPECT_NEAR(k.centre.y, 2, 1e-9);
    EXPECT_NEAR(k.radius, 3, 1e-9);
    EXPECT_NEAR(k.start, 0.2, 1e-9);
    EXPECT_NEAR(k.sweep, kPi / 2, 1e-9);
    const BZ_Point m = tessarine::geometry::PointOnCircle(k.centre.x, k.centre.y, k.radius,
                                                          k.start + 0.5 * k.sweep);
    EXPECT_EQ(k.mid.x, m.x);
    EXPECT_EQ(k.mid.y, m.y);
    // Clockwise.
    ArcCubic(0, 0, 1, 1, -kPi / 2, c);
    k = Check(c, 1e-3, 0);
    EXPECT_EQ(k.isArc, 1);
    EXPECT_NEAR(k.sweep, -kPi / 2, 1e-9);
}

TEST(GeometryCurveToArc, RefusedPaths) {
    const double straight[8] = {0, 0, 1, 1, 2, 2, 3, 3};
    CurveCheck k = Check(straight, 1, 0);
    EXPECT_EQ(k.status, 10);
    EXPECT_EQ(k.isArc, 0);
    k.ExpectUntouched();
    double c[8];
    ArcCubic(0, 0, 3, 0, kPi / 2, c);
    k = Check(c, 1e-3, 3.5);  // radius below the least
    EXPECT_EQ(k.isArc, 0);
    k.ExpectUntouched();
    k = Check(c, 1e-9, 0);  // quarter points off the circle by more than the tolerance
    EXPECT_EQ(k.status, 10);
    EXPECT_EQ(k.isArc, 0);
    k.ExpectUntouched();
    ArcCubic(0, 0, 1, 0, 170 * kDeg, c);  // too much sweep
    k = Check(c, 1e-2, 0);
    EXPECT_EQ(k.isArc, 0);
    k.ExpectUntouched();
    // Handles that leave the ends at 20 degrees off the circle's tangents;
    // a loose tolerance lets the quarter points pass.
    ArcCubic(0, 0, 1, 0, kPi / 2, c);
    c[2] = c[0] - 0.3;
    k = Check(c, 0.5, 0);
    EXPECT_EQ(k.status, 10);
    EXPECT_EQ(k.isArc, 0);
    k.ExpectUntouched();
}

TEST(GeometryCurveToArc, SweepOfExactlyTheLimitIsAccepted) {
    double c[8];
    bool found = false;
    CurveCheck k;
    for (int i = -3000; i <= 3000 && !found; ++i) {
        ArcCubic(0, 0, 1, 0, 2.827433388, c);
        c[6] = std::cos(2.827433388 + i * 1e-16);
        c[7] = std::sin(2.827433388 + i * 1e-16);
        k = Check(c, 0.05, 0);
        found = k.isArc == 1 && k.sweep == 2.827433388;
    }
    EXPECT_TRUE(found);
}

TEST(GeometryCurveToArc, FailedArcTangentReturnsItsStatus) {
    // A circle of radius 3e-7: the three points are far enough apart for a
    // circle, but its normal is too short for BZ_Normvec.
    const double r = 3e-7;
    const BZ_Point p0 = OnCircle(0, 0, r, 0), m = OnCircle(0, 0, r, 75 * kDeg),
                   p3 = OnCircle(0, 0, r, 150 * kDeg);
    // p1 = p2 = q with the curve's middle at m.
    const BZ_Point q{(m.x - (p0.x + p3.x) / 8) / 0.75, (m.y - (p0.y + p3.y) / 8) / 0.75};
    const double c[8] = {p0.x, p0.y, q.x, q.y, q.x, q.y, p3.x, p3.y};
    CurveCheck k = Check(c, 1.0, 0);
    EXPECT_EQ(k.status, -3);
    EXPECT_EQ(k.isArc, 0);
    k.ExpectUntouched();
}

// ---- BZ_MirrorPt --------------------------------------------------------------------

TEST(GeometryMirror, ReflectsInTheLine) {
    const BZ_Point a{0, 0}, b{1, 0};
    BZ_Point p{2, 1};
    EXPECT_EQ(BZ_MirrorPt(&a, &b, &p), 10);
    EXPECT_EQ(p.x, 2.0);
    EXPECT_EQ(p.y, -1.0);
    const BZ_Point c{1, 1};
    p = Pt(3, 0);
    EXPECT_EQ(BZ_MirrorPt(&a, &c, &p), 10);
    EXPECT_DOUBLE_EQ(p.x, 0);
    EXPECT_DOUBLE_EQ(p.y, 3);
}

TEST(GeometryMirror, LineOfNoLengthReflectsThroughItsSecondPoint) {
    const BZ_Point a{1, 1}, b{1, 1};
    BZ_Point p{0, 0};
    EXPECT_EQ(BZ_MirrorPt(&a, &b, &p), 10);
    EXPECT_EQ(p.x, 2.0);
    EXPECT_EQ(p.y, 2.0);
}
