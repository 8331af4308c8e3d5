// Properties of the curve intersection over many random curve pairs.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <initializer_list>
#include <random>

#include "curves_test_util.h"

using namespace gtest_curves;

namespace {

Cubic RandomCubic(std::mt19937_64 &rng, double size) {
    std::uniform_real_distribution<double> u(0, size);
    Cubic c;
    for (double &v : c.v) v = u(rng);
    return c;
}

BZ_Point Tangent(const Cubic &c, double t) {
    const double s = 1 - t;
    return BZ_Point{3 * s * s * (c.v[2] - c.v[0]) + 6 * s * t * (c.v[4] - c.v[2]) +
                        3 * t * t * (c.v[6] - c.v[4]),
                    3 * s * s * (c.v[3] - c.v[1]) + 6 * s * t * (c.v[5] - c.v[3]) +
                        3 * t * t * (c.v[7] - c.v[5])};
}

double SineBetween(BZ_Point u, BZ_Point v) {
    return std::fabs(u.x * v.y - u.y * v.x) / (std::hypot(u.x, u.y) * std::hypot(v.x, v.y));
}

}  // namespace

TEST(CurveClipProperty, ReportedPointsLieOnBothCurves) {
    std::mt19937_64 rng(15);
    const double tol = 1e-6;
    int withPoints = 0;
    for (int i = 0; i < 400; ++i) {
        const Cubic a = RandomCubic(rng, 10), b = RandomCubic(rng, 10);
        const Hits h = CurvePair(a, b, tol);
        ASSERT_TRUE(h.status == 10 || h.status == -1) << i << ": " << h.status;
        if (h.status != 10) continue;
        ASSERT_LE(h.count, 14);
        if (h.count > 0) ++withPoints;
        for (int k = 0; k < h.count; ++k) {
            EXPECT_LE(DistanceToCurve(a, h.pts[k]), 20 * tol) << "pair " << i << " entry " << k;
            EXPECT_LE(DistanceToCurve(b, h.pts[k]), 20 * tol) << "pair " << i << " entry " << k;
            EXPECT_GE(h.tA[k], 0);
            EXPECT_LE(h.tA[k], 1);
            EXPECT_GE(h.tB[k], 0);
            EXPECT_LE(h.tB[k], 1);
        }
    }
    EXPECT_GT(withPoints, 100);
}

// A cubic whose control points rise in x (or in y, turned): such pairs cross
// cleanly, without loops.
Cubic RisingCubic(std::mt19937_64 &rng, bool inY) {
    std::uniform_real_distribution<double> u(0, 10);
    double rise[4] = {u(rng), u(rng), u(rng), u(rng)};
    std::sort(rise, rise + 4);
    Cubic c;
    for (int i = 0; i < 4; ++i) {
        c.v[2 * i + (inY ? 1 : 0)] = rise[i];
        c.v[2 * i + (inY ? 0 : 1)] = u(rng);
    }
    return c;
}

TEST(CurveClipProperty, PairsBuiltToCrossReportTheirPoint) {
    std::mt19937_64 rng(16);
    std::uniform_real_distribution<double> param(0.05, 0.95);
    const double tol = 1e-7;
    int built = 0, missed = 0;
    while (built < 300) {
        const Cubic a = RisingCubic(rng, false);
        Cubic b = RisingCubic(rng, true);
        const double ta = param(rng), tb = param(rng);
        const BZ_Point p = PointAt(a, ta), q = PointAt(b, tb);
        for (int i = 0; i < 8; i += 2) {
            b.v[i] += p.x - q.x;
            b.v[i + 1] += p.y - q.y;
        }
        // A clear crossing, not a graze.
        if (SineBetween(Tangent(a, ta), Tangent(b, tb)) < 0.2) continue;
        ++built;
        const Hits h = CurvePair(a, b, tol);
        ASSERT_EQ(h.status, 10) << built;
        // Results closer than 0.001 in tA merge, and only the first of them
        // stays: the crossing may be represented by a neighbour.
        int at = -1;
        for (int k = 0; k < h.count; ++k) {
            if (std::fabs(h.tA[k] - ta) <= 0.001 + 1e-5 &&
                (at < 0 || Dist(h.pts[k], p) < Dist(h.pts[at], p)))
                at = k;
        }
        if (at < 0) {
            ++missed;
            continue;
        }
        if (std::fabs(h.tA[at] - ta) > 1e-4) continue;  // merged into a neighbour
        EXPECT_LE(Dist(h.pts[at], p), 50 * tol) << "pair " << built;
        EXPECT_NEAR(h.tB[at], tb, 1e-4) << "pair " << built;
    }
    // The frames' along band is narrower than the curve's on purpose; now
    // and then it drops the pair that holds a crossing.
    EXPECT_LE(missed, 2);
}

TEST(CurveClipProperty, ACurveAgainstItselfAndItsReverse) {
    std::mt19937_64 rng(17);
    for (int i = 0; i < 200; ++i) {
        const Cubic a = RandomCubic(rng, 10);
        const double tol = i % 2 ? 1e-6 : 1e-3;
        const Hits same = CurvePair(a, a, tol);
        ASSERT_EQ(same.status, 10) << i;
        ASSERT_EQ(same.count, 2) << i;
        EXPECT_EQ(same.tA[0], 0);
        EXPECT_EQ(same.tA[1], 1);
        EXPECT_EQ(same.tB[0], 0);
        EXPECT_EQ(same.tB[1], 1);
        EXPECT_NE(same.kind, 2);
        const Hits rev = CurvePair(a, a.Reversed(), tol);
        ASSERT_EQ(rev.status, 10) << i;
        ASSERT_EQ(rev.count, 2) << i;
        EXPECT_EQ(rev.tA[0], 0);
        EXPECT_EQ(rev.tA[1], 1);
        EXPECT_EQ(rev.tB[0], 1);
        EXPECT_EQ(rev.tB[1], 0);
    }
}

TEST(CurveClipProperty, ASubCurveReportsKindFourWithItsRange) {
    std::mt19937_64 rng(18);
    std::uniform_real_distribution<double> start(0.05, 0.45), length(0.25, 0.5);
    int checked = 0;
    for (int i = 0; i < 200; ++i) {
        // Without loops, so that the sub-curve crosses its curve nowhere else.
        const Cubic a = RisingCubic(rng, i % 2 == 1);
        const double u0 = start(rng), u1 = u0 + length(rng);
        const Hits h = CurvePair(a, SubCurve(a, u0, u1), 1e-6);
        ASSERT_EQ(h.status, 10) << i;
        ++checked;
        EXPECT_EQ(h.kind, 4) << i;
        ASSERT_EQ(h.count, 2) << i;
        EXPECT_NEAR(h.tA[0], u0, 1e-4) << i;
        EXPECT_NEAR(h.tA[1], u1, 1e-4) << i;
        EXPECT_NEAR(h.tB[0], 0, 1e-6) << i;
        EXPECT_NEAR(h.tB[1], 1, 1e-6) << i;
    }
    EXPECT_EQ(checked, 200);
}

TEST(CurveClipProperty, EveryCallEndsInBoundedTime) {
    std::mt19937_64 rng(19);
    auto timed = [](const Cubic &a, const Cubic &b, double tol) {
        const auto t0 = std::chrono::steady_clock::now();
        const Hits h = CurvePair(a, b, tol);
        const double seconds =
            std::chrono::duration<double>(std::chrono::steady_clock::now() - t0).count();
        EXPECT_LE(h.count, 14);
        EXPECT_TRUE(h.status == 10 || h.status == -1 || h.status == -3 || h.status == -56)
            << h.status;
        EXPECT_LT(seconds, 60.0) << "tol " << tol;
        return h.status;
    };
    // Tolerances that frames never get below: the pair bound ends the run.
    const Cubic arch{{0, 0, 1, 2, 3, 2, 4, 0}}, dip{{0, 1, 1, -1, 3, -1, 4, 1}};
    EXPECT_EQ(timed(arch, dip, 0), -56);
    EXPECT_EQ(timed(arch, dip, -1), -56);
    for (int i = 0; i < 20; ++i) {
        const Cubic a = RandomCubic(rng, 10), b = RandomCubic(rng, 10);
        for (double tol : {1e-15, 1e-12, 1e300}) timed(a, b, tol);
        Cubic huge = a;
        for (double &v : huge.v) v *= 1e300;
        timed(huge, b, 1e-6);
    }
}
