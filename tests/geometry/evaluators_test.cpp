// Line, arc and cubic evaluators and the curve forms.
#include <cmath>

#include "geometry_test_util.h"

using namespace gtest_geometry;

TEST(GeometryLineEval, Modes) {
    BZ_Point p = SentinelPoint();
    EXPECT_EQ(BZ_LineEval(1, 1, 3, 5, 0.25, 0, &p), 10);
    EXPECT_EQ(p.x, 1 + (3 - 1) * 0.25);
    EXPECT_EQ(p.y, 1 + (5 - 1) * 0.25);
    EXPECT_EQ(BZ_LineEval(0, 0, 3, 4, 0.25, 1, &p), 10);
    EXPECT_DOUBLE_EQ(p.x, 0.6);
    EXPECT_DOUBLE_EQ(p.y, 0.8);
    p = SentinelPoint();
    EXPECT_EQ(BZ_LineEval(0, 0, 3, 4, 0.25, 2, &p), 10);
    EXPECT_EQ(p.x, 0.0);
    EXPECT_EQ(p.y, 0.0);
}

TEST(GeometryLineEval, BadModeWritesNothing) {
    BZ_Point p = SentinelPoint();
    EXPECT_EQ(BZ_LineEval(0, 0, 1, 1, 0.5, 3, &p), -4);
    ExpectSentinel(p);
    EXPECT_EQ(BZ_LineEval(0, 0, 1, 1, 0.5, -1, &p), -4);
    ExpectSentinel(p);
}

TEST(GeometryLineEval, DegenerateLine) {
    BZ_Point p = SentinelPoint();
    EXPECT_EQ(BZ_LineEval(2, 2, 2, 2, 0.5, 2, &p), 10);
    EXPECT_EQ(p.x, 0.0);
    p = SentinelPoint();
    EXPECT_EQ(BZ_LineEval(2, 2, 2, 2, 0.5, 1, &p), -3);
    EXPECT_EQ(p.x, 0.0);
    EXPECT_EQ(p.y, 0.0);
    // Mode 0 does not look at coincident ends.
    EXPECT_EQ(BZ_LineEval(2, 2, 2, 2, 0.5, 0, &p), 10);
    EXPECT_EQ(p.x, 2.0);
    // 2e-8 apart in x only: EqualPoints fails, BZ_Normvec fails, and the
    // result is 10 with the zero vector.
    p = SentinelPoint();
    EXPECT_EQ(BZ_LineEval(0, 0, 2e-8, 0, 0.5, 1, &p), 10);
    EXPECT_EQ(p.x, 0.0);
    EXPECT_EQ(p.y, 0.0);
}

TEST(GeometryArcEval, PointTangentNormal) {
    double x = kSentinel, y = kSentinel;
    EXPECT_EQ(BZ_ArcEval(1, 2, 3, 0.5, 1.0, 0.5, 0, &x, &y), 10);
    double s, c;
    GetSinCos(1.0 * 0.5 + 0.5, &s, &c);
    EXPECT_EQ(x, c * 3 + 1);
    EXPECT_EQ(y, s * 3 + 2);
    // Normal at the start of a circle about the origin: towards the centre.
    EXPECT_EQ(BZ_ArcEval(0, 0, 2, 0, 1, 0, 2, &x, &y), 10);
    EXPECT_EQ(x, -1.0);
    EXPECT_EQ(y, 0.0);
}

TEST(GeometryArcEval, TangentFollowsTravel) {
    double x = kSentinel, y = kSentinel;
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0, 1.0, 0, 1, &x, &y), 10);
    EXPECT_EQ(x, 0.0);
    EXPECT_EQ(y, 1.0);
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0, -1.0, 0, 1, &x, &y), 10);
    EXPECT_EQ(x, 0.0);
    EXPECT_EQ(y, -1.0);
    // A sweep of exactly 0 counts as clockwise.
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0, 0.0, 0, 1, &x, &y), 10);
    EXPECT_EQ(x, 0.0);
    EXPECT_EQ(y, -1.0);
}

TEST(GeometryArcEval, ParameterMarginAndSnap) {
    double x = kSentinel, y = kSentinel;
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0.3, 1.0, -0.00005, 0, &x, &y), 10);
    double x0, y0;
    BZ_ArcEval(0, 0, 1, 0.3, 1.0, 0.0, 0, &x0, &y0);
    EXPECT_EQ(x, x0);
    EXPECT_EQ(y, y0);
    // Near 1: snapped to exactly 1.
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0.3, 1.0, 1.00005, 0, &x, &y), 10);
    double x1, y1;
    BZ_ArcEval(0, 0, 1, 0.3, 1.0, 1.0, 0, &x1, &y1);
    EXPECT_EQ(x, x1);
    EXPECT_EQ(y, y1);
    x = y = kSentinel;
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0.3, 1.0, -0.0002, 0, &x, &y), -4);
    EXPECT_EQ(x, kSentinel);
    EXPECT_EQ(y, kSentinel);
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0.3, 1.0, 1.0002, 0, &x, &y), -4);
    EXPECT_EQ(x, kSentinel);
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0.3, 1.0, 0.5, 3, &x, &y), -4);
    EXPECT_EQ(x, kSentinel);
}

TEST(GeometryArcEval, NoRadiusHasNoTangent) {
    double x = kSentinel, y = kSentinel;
    EXPECT_EQ(BZ_ArcEval(1, 1, 0, 0, 1, 0.5, 1, &x, &y), -3);
    EXPECT_EQ(x, kSentinel);
    EXPECT_EQ(BZ_ArcEval(1, 1, 0, 0, 1, 0.5, 2, &x, &y), -3);
    EXPECT_EQ(y, kSentinel);
    EXPECT_EQ(BZ_ArcEval(1, 1, 0, 0, 1, 0.5, 0, &x, &y), 10);
    EXPECT_EQ(x, 1.0);
}

TEST(GeometryCurveEval, PointAndDerivatives) {
    const double c[8] = {0, 0, 1, 2, 3, 2, 4, 0};
    double x, y;
    EXPECT_EQ(BZ_CurveEval(0, 0, 1, 2, 3, 2, 4, 0, nullptr, 0.5, 0, &x, &y), 10);
    double k[8];
    Bezier(c, k);
    EXPECT_EQ(x, ((k[0] * 0.5 + k[2]) * 0.5 + k[4]) * 0.5 + k[6]);
    EXPECT_EQ(y, ((k[1] * 0.5 + k[3]) * 0.5 + k[5]) * 0.5 + k[7]);
    EXPECT_EQ(BZ_CurveEval(0, 0, 1, 2, 3, 2, 4, 0, nullptr, 0.25, 2, &x, &y), 10);
    EXPECT_EQ(x, 2 * (3 * k[0] * 0.25 + k[2]));
    EXPECT_EQ(y, 2 * (3 * k[1] * 0.25 + k[3]));
    EXPECT_EQ(BZ_CurveEval(0, 0, 1, 2, 3, 2, 4, 0, nullptr, 0.0, 1, &x, &y), 10);
    EXPECT_DOUBLE_EQ(x, 1 / std::sqrt(5.0));
    EXPECT_DOUBLE_EQ(y, 2 / std::sqrt(5.0));
}

TEST(GeometryCurveEval, GivenCoefficientsWin) {
    // The control values then serve only the degenerate tangent.
    BZ_CurveCoef k;
    Bezier_Coef(0, 0, 0, 0, 0, 0, 0, 0, &k);
    k.d = Pt(5, 6);
    double x, y;
    EXPECT_EQ(BZ_CurveEval(0, 0, 1, 1, 2, 2, 3, 3, &k, 0.3, 0, &x, &y), 10);
    EXPECT_EQ(x, 5.0);
    EXPECT_EQ(y, 6.0);
}

TEST(GeometryCurveEval, BadModeWritesNothing) {
    double x = kSentinel, y = kSentinel;
    EXPECT_EQ(BZ_CurveEval(0, 0, 1, 1, 2, 2, 3, 3, nullptr, 0.3, 5, &x, &y), -4);
    EXPECT_EQ(x, kSentinel);
    EXPECT_EQ(y, kSentinel);
}

TEST(GeometryCurveEval, DegenerateTangentChords) {
    double x, y;
    // p0 = p1: the direction from p0 to p2.
    EXPECT_EQ(BZ_CurveEval(0, 0, 0, 0, 0, 2, 5, 5, nullptr, 0.0, 1, &x, &y), 10);
    EXPECT_EQ(x, 0.0);
    EXPECT_EQ(y, 1.0);
    // p0 = p1 = p2: the direction from p0 to p3.
    EXPECT_EQ(BZ_CurveEval(1, 1, 1, 1, 1, 1, 4, 5, nullptr, 0.0, 1, &x, &y), 10);
    EXPECT_DOUBLE_EQ(x, 0.6);
    EXPECT_DOUBLE_EQ(y, 0.8);
    // All four equal: zero and -3.
    x = y = kSentinel;
    EXPECT_EQ(BZ_CurveEval(2, 2, 2, 2, 2, 2, 2, 2, nullptr, 0.0, 1, &x, &y), -3);
    EXPECT_EQ(x, 0.0);
    EXPECT_EQ(y, 0.0);
    x = y = kSentinel;
    EXPECT_EQ(BZ_CurveEval(2, 2, 2, 2, 2, 2, 2, 2, nullptr, 0.3, 1, &x, &y), -3);
    EXPECT_EQ(x, 0.0);
    x = y = kSentinel;
    EXPECT_EQ(BZ_CurveEval(2, 2, 2, 2, 2, 2, 2, 2, nullptr, 0.7, 1, &x, &y), -3);
    EXPECT_EQ(x, 0.0);
    x = y = kSentinel;
    EXPECT_EQ(BZ_CurveEval(2, 2, 2, 2, 2, 2, 2, 2, nullptr, 1.0, 1, &x, &y), -3);
    EXPECT_EQ(y, 0.0);
    // At the end with p2 = p3: the chord from p2 fails, the one from p1 holds.
    EXPECT_EQ(BZ_CurveEval(0, 0, 3, 0, 5, 5, 5, 5, nullptr, 1.0, 1, &x, &y), 10);
    EXPECT_DOUBLE_EQ(x, 2 / std::sqrt(29.0));
    EXPECT_DOUBLE_EQ(y, 5 / std::sqrt(29.0));
    // p1 = p2 = p3 at the end: from p0.
    EXPECT_EQ(BZ_CurveEval(0, 0, 5, 5, 5, 5, 5, 5, nullptr, 1.0, 1, &x, &y), 10);
    EXPECT_DOUBLE_EQ(x, std::sqrt(0.5));
}

TEST(GeometryCurveEval, CuspChordsInTheMiddle) {
    // A cusp at t = 0.5: x' = 3 (2t - 1)^2 and y' = 3 (1 - 2t).
    double x, y;
    EXPECT_EQ(BZ_CurveEval(0, 0, 1, 1, 0, 1, 1, 0, nullptr, 0.5, 1, &x, &y), 10);
    // 0.5 takes p1 to P: P = (0.5, 0.75).
    EXPECT_DOUBLE_EQ(x, -0.5 / std::sqrt(0.25 + 0.0625));
    EXPECT_DOUBLE_EQ(y, -0.25 / std::sqrt(0.25 + 0.0625));
    // At 0.4999 the speed (about 6e-4) still counts and is normalised.
    EXPECT_EQ(BZ_CurveEval(0, 0, 1, 1, 0, 1, 1, 0, nullptr, 0.4999, 1, &x, &y), 10);
    EXPECT_GT(x, 0.0);
    EXPECT_NEAR(y, 1.0, 1e-6);
    // At 0.49999 its square is below 1e-8: the chord from P to p2.
    EXPECT_EQ(BZ_CurveEval(0, 0, 1, 1, 0, 1, 1, 0, nullptr, 0.49999, 1, &x, &y), 10);
    EXPECT_LT(x, 0.0);
    EXPECT_GT(y, 0.0);
    EXPECT_NEAR(x, -0.5 / std::sqrt(0.25 + 0.0625), 1e-4);
}

TEST(GeometryBeziereval, Modes) {
    BZ_CurveCoef k;
    EXPECT_EQ(Bezier_Coef(0, 0, 1, 2, 3, 2, 4, 0, &k), 10);
    double x = kSentinel, y = kSentinel;
    EXPECT_EQ(BZ_beziereval(&k, 0.5, 0, &x, &y), 10);
    EXPECT_EQ(x, ((k.a.x * 0.5 + k.b.x) * 0.5 + k.c.x) * 0.5 + k.d.x);
    EXPECT_EQ(BZ_beziereval(&k, 0.5, 1, &x, &y), 10);
    EXPECT_EQ(x, 3 * k.a.x * 0.5 * 0.5 + 2 * k.b.x * 0.5 + k.c.x);
    EXPECT_EQ(y, 3 * k.a.y * 0.5 * 0.5 + 2 * k.b.y * 0.5 + k.c.y);
    EXPECT_EQ(BZ_beziereval(&k, 0.5, 2, &x, &y), 10);
    EXPECT_EQ(x, 2 * (3 * k.a.x * 0.5 + k.b.x));
    x = y = kSentinel;
    EXPECT_EQ(BZ_beziereval(&k, 0.5, 3, &x, &y), -4);
    EXPECT_EQ(x, kSentinel);
    EXPECT_EQ(y, kSentinel);
    // Not normalised, even when zero.
    BZ_CurveCoef z;
    Bezier_Coef(1, 1, 1, 1, 1, 1, 1, 1, &z);
    EXPECT_EQ(BZ_beziereval(&z, 0.0, 1, &x, &y), 10);
    EXPECT_EQ(x, 0.0);
}

TEST(GeometryCurveForms, BezierCoefAndPoints) {
    BZ_CurveCoef k;
    EXPECT_EQ(Bezier_Coef(1, 2, 3, 5, 7, 11, 13, 17, &k), 10);
    EXPECT_EQ(k.a.x, 3 * (3.0 - 7) - 1 + 13);
    EXPECT_EQ(k.a.y, 3 * (5.0 - 11) - 2 + 17);
    EXPECT_EQ(k.b.x, 3 * (1 - 2 * 3.0 + 7));
    EXPECT_EQ(k.b.y, 3 * (2 - 2 * 5.0 + 11));
    EXPECT_EQ(k.c.x, 3 * (3.0 - 1));
    EXPECT_EQ(k.c.y, 3 * (5.0 - 2));
    EXPECT_EQ(k.d.x, 1.0);
    EXPECT_EQ(k.d.y, 2.0);
    BZ_Curve c;
    EXPECT_EQ(GetBZpts(1, 2, 3, 5, 7, 11, 13, 17, &c), 10);
    EXPECT_EQ(c.p0.x, 1.0);
    EXPECT_EQ(c.p1.y, 5.0);
    EXPECT_EQ(c.p2.x, 7.0);
    EXPECT_EQ(c.p3.y, 17.0);
}

TEST(GeometryRecords, Layout) {
    static_assert(sizeof(BZ_Point) == 16);
    static_assert(sizeof(BZ_Line) == 32);
    static_assert(sizeof(BZ_Arc) == 80);
    static_assert(offsetof(BZ_Arc, startAngle) == 48);
    static_assert(offsetof(BZ_Arc, sweep) == 56);
    static_assert(offsetof(BZ_Arc, end) == 64);
    static_assert(sizeof(BZ_Curve) == 64);
    static_assert(sizeof(BZ_CurveCoef) == 64);
    static_assert(sizeof(XQ2DBox) == 32);
    static_assert(offsetof(BZ_SortEntry, tag) == 8);
    SUCCEED();
}

TEST(GeometryCurveEval, ChordTableBoundaries) {
    // A curve 1e-5 across: its speed stays below 1e-4, so every tangent comes
    // from a chord, and the chords of the four ranges of t point differently.
    const double s = 1e-5;
    const double c[8] = {0, 0, s, 0, s, s, 0, s};
    double k[8];
    Bezier(c, k);
    auto point = [&](double t) {
        return Pt(((k[0] * t + k[2]) * t + k[4]) * t + k[6],
                  ((k[1] * t + k[3]) * t + k[5]) * t + k[7]);
    };
    auto chord = [](const BZ_Point &from, const BZ_Point &to) {
        BZ_Point v;
        EXPECT_EQ(BZ_GetNormVector(from.x, from.y, to.x, to.y, &v), 10);
        return v;
    };
    const BZ_Point p1{s, 0}, p2{s, s};
    struct Case {
        double t;
        BZ_Point from, to;
    };
    const Case cases[] = {
        {0.00009, point(0.00009), p1},  // below 0.0001: P to p1
        {0.0001, point(0.0001), p2},    // from 0.0001: P to p2
        {0.49999, point(0.49999), p2},
        {0.5, p1, point(0.5)},          // from 0.5: p1 to P
        {0.9999, p1, point(0.9999)},    // 0.9999 still belongs to it
        {0.99991, p2, point(0.99991)},  // above 0.9999: p2 to P
    };
    for (const Case &cs : cases) {
        double x = kSentinel, y = kSentinel;
        EXPECT_EQ(BZ_CurveEval(c[0], c[1], c[2], c[3], c[4], c[5], c[6], c[7], nullptr, cs.t, 1,
                               &x, &y),
                  10)
            << "t " << cs.t;
        const BZ_Point v = chord(cs.from, cs.to);
        EXPECT_EQ(x, v.x) << "t " << cs.t;
        EXPECT_EQ(y, v.y) << "t " << cs.t;
    }
}

TEST(GeometryArcEval, MarginBoundsAreInclusiveAndSnapIsStrict) {
    // t = -0.0001 is not below -0.0001: accepted, and not snapped to 0.
    double x = kSentinel, y = kSentinel;
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0.3, 1.0, -0.0001, 0, &x, &y), 10);
    double s, c;
    GetSinCos(1.0 * -0.0001 + 0.3, &s, &c);
    EXPECT_EQ(x, c * 1 + 0);
    EXPECT_EQ(y, s * 1 + 0);
    // t = 0.0001 is not below 0.0001 in magnitude: evaluated as it is.
    EXPECT_EQ(BZ_ArcEval(0, 0, 1, 0.3, 1.0, 0.0001, 0, &x, &y), 10);
    GetSinCos(1.0 * 0.0001 + 0.3, &s, &c);
    EXPECT_EQ(x, c);
    EXPECT_EQ(y, s);
}
