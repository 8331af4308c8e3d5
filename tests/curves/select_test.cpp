// The pick question: a coarse and fine scan, Newton's method, the implicit
// rejection and the end shortcut.
#include <cmath>

#include "curves/toolkit.h"
#include "curves_test_util.h"

using namespace gtest_curves;

namespace {

struct Pick {
    double dist = kSentinel, t = kSentinel, x = kSentinel, y = kSentinel;
    int32_t hit = -1;
};

Pick Sarn(const Cubic &c, double px, double py, double limit, double eps) {
    Pick p;
    p.hit = SarnSelectCurveTo(c.v[0], c.v[1], c.v[2], c.v[3], c.v[4], c.v[5], c.v[6], c.v[7],
                              &p.dist, &p.t, &p.x, &p.y, px, py, limit, eps);
    return p;
}

Pick Port(const Cubic &c, double px, double py, double limit, double eps, double reject) {
    Pick p;
    p.hit = SelectCurveTo_port(c.v[0], c.v[1], c.v[2], c.v[3], c.v[4], c.v[5], c.v[6], c.v[7],
                               &p.dist, &p.t, &p.x, &p.y, px, py, limit, eps, reject);
    return p;
}

const Cubic kArch{{0, 0, 1, 2, 3, 2, 4, 0}};
const Cubic kStraight{{0, 0, 1, 0, 2, 0, 3, 0}};

}  // namespace

TEST(CurveSelect, PickOnAnEndOfACurvedCubicAnswersAtOnce) {
    const Pick s = Port(kArch, 0, 0, 0.01, 1e-9, 0.01);
    EXPECT_EQ(s.hit, 1);
    EXPECT_EQ(s.t, 0);
    EXPECT_EQ(s.dist, 0);
    EXPECT_EQ(s.x, 0);
    const Pick e = Port(kArch, 4, 0, 0.01, 1e-9, 0.01);
    EXPECT_EQ(e.hit, 1);
    EXPECT_EQ(e.t, 1);
    EXPECT_EQ(e.x, 4);
    EXPECT_EQ(e.y, 0);
}

TEST(CurveSelect, JustBeyondTheEndIsAcceptedUpToOnePlusEps) {
    // Along the end tangent 3 (P3 - P2) = (3, -6).
    const double d = 1e-4 / std::sqrt(5.0);
    const Pick p = Sarn(kArch, 4 + d, -2 * d, 1e-3, 1e-4);
    ASSERT_EQ(p.hit, 1);
    EXPECT_GT(p.t, 1.0);
    EXPECT_LE(p.t, 1.0 + 1e-4);
    const Pick q = Sarn(kArch, 4 + 100 * d, -200 * d, 1e-1, 1e-6);
    EXPECT_EQ(q.hit, 0) << "beyond 1 + eps";
}

TEST(CurveSelect, LowestCoarseSampleAtTheEndScansTheLastQuarter) {
    // The pick point lies nearer to t = 1 than to every other coarse sample.
    const BZ_Point q = PointAt(kArch, 0.97);
    for (int i = 0; i < 8; ++i)
        ASSERT_LT(Dist(q, PointAt(kArch, 1.0)), Dist(q, PointAt(kArch, i * 0.125)));
    const Pick p = Sarn(kArch, q.x, q.y, 1e-6, 1e-12);
    ASSERT_EQ(p.hit, 1);
    EXPECT_NEAR(p.t, 0.97, 1e-9);
}

TEST(CurveSelect, EqualCoarseSamplesKeepTheEarlier) {
    using tessarine::curves::LowestSample;
    const double S[9] = {5, 4, 2, 3, 2, 2, 6, 7, 0};
    EXPECT_EQ(LowestSample(S), 2);
    const double T[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};
    EXPECT_EQ(LowestSample(T), 0);
    // A straight line with the pick point halfway between samples 0.5 and
    // 0.625: the two samples tie exactly, and the answer is the same.
    const Pick p = Sarn(kStraight, 1.6875, 1, 2, 1e-12);
    ASSERT_EQ(p.hit, 1);
    EXPECT_EQ(p.t, 0.5625);
}

TEST(CurveSelect, LimitZeroAcceptsOnlyDistanceZero) {
    const Pick on = Sarn(kStraight, 1.5, 0, 0, 1e-9);
    EXPECT_EQ(on.hit, 1);
    EXPECT_EQ(on.dist, 0);
    const Pick off = Sarn(kStraight, 1.5, 1e-3, 0, 1e-9);
    EXPECT_EQ(off.hit, 0);
    EXPECT_EQ(off.dist, 0) << "dist stays cleared on a miss";
    EXPECT_EQ(off.x, 1.5) << "x and y keep the point";
    EXPECT_EQ(off.y, 0);
    EXPECT_EQ(off.t, kSentinel);
}

TEST(CurveSelect, StraightEquallySpacedConvergesAtOnce) {
    const Pick p = Sarn(kStraight, 1.5, 0.7, 1, 1e-12);
    ASSERT_EQ(p.hit, 1);
    EXPECT_EQ(p.t, 0.5);
    EXPECT_EQ(p.x, 1.5);
    EXPECT_EQ(p.dist, Distance(1.5, 0, 1.5, 0.7));
}

TEST(CurveSelect, StraightCubicSkipsTheEndShortcut) {
    // The determinant form vanishes: the full search answers, through Newton.
    const Pick p = Port(kStraight, 3, 0, 0.5, 1e-12, 1e-12);
    ASSERT_EQ(p.hit, 1);
    EXPECT_NEAR(p.t, 1, 1e-12);
}

TEST(CurveSelect, FarPointIsRejectedWithoutASearch) {
    const Pick p = Port(kArch, 2, 10, 0.01, 1e-9, 0.01);
    EXPECT_EQ(p.hit, 0);
    EXPECT_EQ(p.dist, kSentinel) << "no search ran, nothing cleared";
    EXPECT_EQ(p.x, kSentinel);
}

TEST(CurveSelect, PointOnTheCurveIsFound) {
    for (double t : {0.1, 0.3, 0.5, 0.77, 0.95}) {
        const BZ_Point q = PointAt(kArch, t);
        const Pick p = Port(kArch, q.x, q.y, 1e-6, 1e-10, 1e-6);
        ASSERT_EQ(p.hit, 1) << t;
        EXPECT_NEAR(p.t, t, 1e-8);
        EXPECT_LE(p.dist, 1e-6);
    }
}

TEST(CurveSelect, NonFiniteInputMisses) {
    const double nan = std::nan("");
    const Pick p = Port(kArch, nan, 0, 1, 1e-9, 1);
    EXPECT_EQ(p.hit, 0);
    const Cubic bad{{0, 0, nan, 2, 3, 2, 4, 0}};
    EXPECT_EQ(Sarn(bad, 1, 1, 1, 1e-9).hit, 0);
    EXPECT_EQ(Sarn(kArch, 1, 1, 1, nan).hit, 0);
}
