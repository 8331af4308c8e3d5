// Properties over many random cases with a fixed seed.
#include <cmath>
#include <random>

#include "geometry_test_util.h"

using namespace gtest_geometry;

namespace {

constexpr int kCases = 20000;

class Random {
  public:
    explicit Random(uint64_t seed) : engine_(seed) {}
    double Uniform(double lo, double hi) { return std::uniform_real_distribution<double>(lo, hi)(engine_); }
    bool Coin() { return Uniform(0, 1) < 0.5; }
    BZ_Point Point(double extent) { return Pt(Uniform(-extent, extent), Uniform(-extent, extent)); }
    // Start angles in 0 to a turn, as the kernel writes them; `anywhere`
    // also gives negative ones.
    BZ_Arc Arc(double extent, bool anywhere = false) {
        const BZ_Point c = Point(extent);
        const double r = Uniform(0.05, extent);
        const double sweep = (Coin() ? 1 : -1) * Uniform(0.05, kTurn - 0.05);
        return MakeArc(c.x, c.y, r, anywhere ? Uniform(-kTurn, kTurn) : Uniform(0, kTurn), sweep);
    }

  private:
    std::mt19937_64 engine_;
};

double Radius(const BZ_Arc &a) { return BZ_Distptpt(a.centre.x, a.centre.y, a.start.x, a.start.y); }

double OffCircle(const BZ_Arc &a, const BZ_Point &p) {
    return std::fabs(BZ_Distptpt(a.centre.x, a.centre.y, p.x, p.y) - Radius(a));
}

double OffCarrier(const BZ_Line &l, const BZ_Point &p) {
    const double dx = l.end.x - l.start.x, dy = l.end.y - l.start.y;
    return std::fabs(dx * (p.y - l.start.y) - dy * (p.x - l.start.x)) / std::hypot(dx, dy);
}

// Whether p (on the circle) lies within the arc's angular span, with a
// little slack for the angle of a computed point.
bool WithinSpan(const BZ_Arc &a, const BZ_Point &p, double slack) {
    double d = std::atan2(p.y - a.centre.y, p.x - a.centre.x) - a.startAngle;
    if (a.sweep < 0) d = -d;
    d = std::fmod(d, kTurn);
    if (d < 0) d += kTurn;
    return d <= std::fabs(a.sweep) + slack || d >= kTurn - slack;
}

BZ_Point ArcSample(const BZ_Arc &a, double u) {
    return OnCircle(a.centre.x, a.centre.y, Radius(a), a.startAngle + u * a.sweep);
}

bool AngleNear(double a, double b, double tol) { return std::fabs(std::remainder(a - b, kTurn)) <= tol; }

}  // namespace

TEST(GeometryProperties, LineArcPointsLieOnBothCarriers) {
    Random rnd(0x5EED0001);
    int met = 0;
    for (int i = 0; i < kCases; ++i) {
        const BZ_Arc a = rnd.Arc(10, true);
        const BZ_Line l{rnd.Point(15), rnd.Point(15)};
        BZ_Point p[2];
        double lt[2], at[2];
        int16_t count = -1, code = -1;
        ASSERT_EQ(BZ_LineArcInt(&l, &a, p, lt, at, &count, &code), 10);
        if (code == 0) {
            EXPECT_EQ(count, 0);
            continue;
        }
        ASSERT_EQ(code, 1);
        ASSERT_EQ(count, 2);
        ++met;
        const double r = Radius(a);
        for (int k = 0; k < 2; ++k) {
            EXPECT_LE(OffCircle(a, p[k]), 1e-9 * r) << "case " << i;
            EXPECT_LE(OffCarrier(l, p[k]), 1e-9 * r) << "case " << i;
        }
        EXPECT_LE(lt[0], lt[1]);
    }
    EXPECT_GT(met, kCases / 10);
}

TEST(GeometryProperties, ArcArcPointsLieOnBothCircles) {
    Random rnd(0x5EED0002);
    int met = 0;
    for (int i = 0; i < kCases; ++i) {
        const BZ_Arc a = rnd.Arc(10, true);
        const BZ_Arc b = rnd.Arc(10, true);
        BZ_Point p[2];
        double t1[2], t2[2];
        int16_t count = -1, code = -1;
        ASSERT_EQ(BZ_ArcArcInt(&a, &b, p, t1, t2, &count, &code), 10);
        if (code != 1) continue;
        ++met;
        const double r = std::min(Radius(a), Radius(b));
        for (int k = 0; k < count; ++k) {
            EXPECT_LE(OffCircle(a, p[k]), 1e-9 * r) << "case " << i;
            EXPECT_LE(OffCircle(b, p[k]), 1e-9 * r) << "case " << i;
        }
    }
    EXPECT_GT(met, kCases / 10);
}

TEST(GeometryProperties, BoundIntersectionsLieOnTheSegments) {
    Random rnd(0x5EED0003);
    for (int i = 0; i < kCases; ++i) {
        const BZ_Arc a = rnd.Arc(10);
        const BZ_Arc b = rnd.Arc(10);
        const BZ_Line l{rnd.Point(15), rnd.Point(15)};
        BZ_Point p[2];
        double t1[2], t2[2];
        int16_t count = -1, code = -1;
        BZ_BoundLineArcInt(&l, &a, p, t1, t2, &count, &code);
        for (int k = 0; k < count; ++k) {
            EXPECT_GE(t1[k], -1e-8);
            EXPECT_LE(t1[k], 1.00000001);
            EXPECT_TRUE(WithinSpan(a, p[k], 1e-6)) << "case " << i;
        }
        BZ_BoundArcArcInt(&a, &b, p, t1, t2, &count, &code);
        for (int k = 0; k < count; ++k) {
            EXPECT_TRUE(t1[k] >= 0 && t1[k] <= 1 && t2[k] >= 0 && t2[k] <= 1);
            if (code == 1) {
                EXPECT_TRUE(WithinSpan(a, p[k], 1e-9)) << "case " << i;
                EXPECT_TRUE(WithinSpan(b, p[k], 1e-9)) << "case " << i;
            }
        }
    }
}

TEST(GeometryProperties, ThreePointArcRecoversCircleAndDirection) {
    Random rnd(0x5EED0004);
    for (int i = 0; i < kCases; ++i) {
        const BZ_Point c = rnd.Point(100);
        const double r = rnd.Uniform(0.01, 100);
        const double start = rnd.Uniform(-kTurn, kTurn);
        const double sweep = (rnd.Coin() ? 1 : -1) * rnd.Uniform(0.05, kTurn - 0.05);
        const double through = rnd.Uniform(0.1, 0.9);
        const BZ_Point p0 = OnCircle(c.x, c.y, r, start);
        const BZ_Point p1 = OnCircle(c.x, c.y, r, start + through * sweep);
        const BZ_Point p2 = OnCircle(c.x, c.y, r, start + sweep);
        BZ_Point centre;
        double radius, a0, s, length;
        int16_t outcome = 0;
        ASSERT_EQ(BZ_3ptarcinfo(p0.x, p0.y, p1.x, p1.y, p2.x, p2.y, &centre, &radius, &a0, &s,
                                &length, &outcome),
                  10);
        ASSERT_EQ(outcome, 10) << "case " << i;
        EXPECT_NEAR(centre.x, c.x, 1e-7 * (r + 100)) << "case " << i;
        EXPECT_NEAR(centre.y, c.y, 1e-7 * (r + 100)) << "case " << i;
        EXPECT_NEAR(radius, r, 1e-7 * (r + 100)) << "case " << i;
        EXPECT_GE(a0, 0.0);
        EXPECT_LT(a0, kTurn);
        EXPECT_TRUE(AngleNear(a0, start, 1e-6)) << "case " << i;
        EXPECT_EQ(s > 0, sweep > 0) << "case " << i;  // the direction of travel
        EXPECT_NEAR(s, sweep, 1e-6) << "case " << i;
        EXPECT_NEAR(length, std::fabs(s) * radius, 1e-12 * length);
    }
}

TEST(GeometryProperties, LineDistanceFeetAndExactness) {
    Random rnd(0x5EED0005);
    for (int i = 0; i < kCases / 4; ++i) {
        const BZ_Point a = rnd.Point(10), b = rnd.Point(10), p = rnd.Point(20);
        const BZ_Line l{a, b};
        double d, t;
        BZ_Point f;
        // Carrier: the foot lies on it and no point of it is nearer.
        BZ_Mindistpt2ln(p.x, p.y, a.x, a.y, b.x, b.y, &d, &t, &f);
        EXPECT_LE(OffCarrier(l, f), 1e-9);
        // Segment with margin and without: the foot lies on the segment.
        BZ_Mindistpt2Bln(a.x, a.y, b.x, b.y, p.x, p.y, &d, &t, &f);
        EXPECT_GE(t, -0.0001);
        EXPECT_LE(t, 1.0001);
        double dsq, u;
        BZ_Point g;
        BZ_Mindistsqpt2line(p.x, p.y, a.x, a.y, b.x, b.y, &g, &u, &dsq);
        EXPECT_GE(u, 0.0);
        EXPECT_LE(u, 1.0);
        EXPECT_LE(OffCarrier(l, g), 1e-9);
        for (int k = 0; k <= 200; ++k) {
            const double s = k / 200.0;
            const BZ_Point q = Pt(a.x + (b.x - a.x) * s, a.y + (b.y - a.y) * s);
            const double e = BZ_Distptpts(p.x, p.y, q.x, q.y);
            EXPECT_GE(e, dsq - 1e-9) << "case " << i;
            EXPECT_GE(std::sqrt(e), d - 1e-9) << "case " << i;
        }
    }
}

// Exact for arcs whose start angle lies in 0 to a turn (the parameter on the
// span is measured from the start angle as it stands) and whose sweep is at
// most half a turn (beyond it the three marks of the area test can all lie
// on one side of the tested angle; see GeometryArcArea.LongArcFarSide).
TEST(GeometryProperties, PointArcDistanceIsExact) {
    Random rnd(0x5EED0006);
    for (int i = 0; i < kCases / 4; ++i) {
        BZ_Arc a = rnd.Arc(10);
        a = MakeArc(a.centre.x, a.centre.y, Radius(a), a.startAngle, std::remainder(a.sweep, kTurn));
        const BZ_Point p = rnd.Point(20);
        BZ_Point f;
        double t, d;
        MindistPt2arc(p.x, p.y, a.centre.x, a.centre.y, Radius(a), a.startAngle, a.sweep,
                      a.start.x, a.start.y, a.end.x, a.end.y, &f, &t, &d);
        EXPECT_LE(OffCircle(a, f), 1e-9 * Radius(a)) << "case " << i;
        EXPECT_TRUE(WithinSpan(a, f, 1e-9)) << "case " << i;
        EXPECT_GE(t, -1e-9);
        EXPECT_LE(t, 1 + 1e-9);
        EXPECT_NEAR(BZ_Distptpt(p.x, p.y, f.x, f.y), d, 1e-9);
        for (int k = 0; k <= 200; ++k) {
            const BZ_Point q = ArcSample(a, k / 200.0);
            ASSERT_GE(BZ_Distptpt(p.x, p.y, q.x, q.y), d - 1e-9)
                << "case " << i << " start " << a.startAngle << " sweep " << a.sweep << " p "
                << p.x << "," << p.y << " c " << a.centre.x << "," << a.centre.y << " t " << t;
        }
    }
}

TEST(GeometryProperties, LineArcDistanceFeetOnTheSegments) {
    // Not exact by design (ends only): the feet lie on their segments and the
    // distance is the one between them.
    Random rnd(0x5EED0007);
    for (int i = 0; i < kCases / 4; ++i) {
        const BZ_Arc a = rnd.Arc(10);
        const BZ_Line l{rnd.Point(15), rnd.Point(15)};
        BZ_Point pl, pa;
        double tl, ta, d;
        ASSERT_EQ(BZ_MindistLineArc(&l, &a, &pl, &tl, &pa, &ta, &d), 10);
        EXPECT_GE(tl, 0.0);
        EXPECT_LE(tl, 1.0);
        EXPECT_LE(OffCarrier(l, pl), 1e-9);
        EXPECT_LE(OffCircle(a, pa), 1e-9 * Radius(a));
        EXPECT_TRUE(WithinSpan(a, pa, 1e-9)) << "case " << i;
        EXPECT_NEAR(BZ_Distptpt(pl.x, pl.y, pa.x, pa.y), d, 1e-9);
    }
}

TEST(GeometryProperties, ArcArcDistanceFeet) {
    // The line of centres (class 1) gives points on the circles; the ends
    // (classes 2 to 4) points on the arcs.
    Random rnd(0x5EED0008);
    for (int i = 0; i < kCases / 4; ++i) {
        const BZ_Arc a = rnd.Arc(10);
        const BZ_Arc b = rnd.Arc(10);
        const int32_t cls = tessarine::geometry::BZ_ArcPairClass(&a, &b);
        BZ_Point p1, p2;
        double t1[2], t2[2], d;
        const int32_t s = BZ_MindistArcArc(&a, &b, &p1, t1, &p2, t2, &d);
        if (cls == 5) {
            EXPECT_EQ(s, 0);
            continue;
        }
        ASSERT_EQ(s, 10);
        EXPECT_LE(OffCircle(a, p1), 1e-9 * Radius(a));
        EXPECT_LE(OffCircle(b, p2), 1e-9 * Radius(b));
        EXPECT_NEAR(BZ_Distptpt(p1.x, p1.y, p2.x, p2.y), d, 1e-9);
        if (cls != 1) {
            EXPECT_TRUE(WithinSpan(a, p1, 1e-9)) << "case " << i;
            EXPECT_TRUE(WithinSpan(b, p2, 1e-9)) << "case " << i;
        }
    }
}

TEST(GeometryProperties, MergingTheHalvesOfAnArcGivesItBack) {
    Random rnd(0x5EED0009);
    for (int i = 0; i < kCases; ++i) {
        const BZ_Point c = rnd.Point(100);
        const double r = rnd.Uniform(0.01, 100);
        const double start = rnd.Uniform(-kTurn, kTurn);
        const double sweep = (rnd.Coin() ? 1 : -1) * rnd.Uniform(0.05, 2.82);
        const BZ_Arc whole = MakeArc(c.x, c.y, r, start, sweep);
        BZ_Arc first = MakeArc(c.x, c.y, r, start, 0.5 * sweep);
        BZ_Arc second = MakeArc(c.x, c.y, r, start + 0.5 * sweep, 0.5 * sweep);
        BZ_Arc out;
        int16_t asLine = -1, outcome = 0;
        ASSERT_EQ(Mergearcarc(&first, &second, 1e-6 * r, &asLine, &out, &outcome), 10);
        ASSERT_EQ(outcome, 10) << "case " << i;
        EXPECT_EQ(asLine, 0);
        EXPECT_EQ(out.start.x, whole.start.x);
        EXPECT_EQ(out.start.y, whole.start.y);
        EXPECT_EQ(out.end.x, second.end.x);
        EXPECT_EQ(out.end.y, second.end.y);
        EXPECT_NEAR(out.centre.x, c.x, 1e-7 * (r + 100)) << "case " << i;
        EXPECT_NEAR(out.centre.y, c.y, 1e-7 * (r + 100)) << "case " << i;
        EXPECT_NEAR(out.sweep, sweep, 1e-7) << "case " << i;
        EXPECT_TRUE(AngleNear(out.startAngle, start, 1e-7)) << "case " << i;
        EXPECT_NEAR(out.mid.x, whole.mid.x, 1e-7 * (r + 100));
        EXPECT_NEAR(out.mid.y, whole.mid.y, 1e-7 * (r + 100));
    }
}
