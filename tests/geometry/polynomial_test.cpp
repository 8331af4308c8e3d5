// Quadratic and cubic roots, and the parameter of a point on a line.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>

#include "core/status.h"
#include "geometry_test_util.h"

using namespace gtest_geometry;

namespace {

TEST(FindRootDegree2, LinearEquationGivesItsRootTwice) {
    double r1 = kSentinel, r2 = kSentinel;
    EXPECT_EQ(FindRootDegree2(0, 2, -1, &r1, &r2), 10);
    EXPECT_EQ(r1, 0.5);
    EXPECT_EQ(r2, 0.5);
}

TEST(FindRootDegree2, NoLinearOrQuadraticTermHasNoRoot) {
    double r1 = kSentinel, r2 = kSentinel;
    EXPECT_EQ(FindRootDegree2(0, 0, 3, &r1, &r2), -7);
    EXPECT_EQ(r1, kSentinel);
    EXPECT_EQ(r2, kSentinel);
}

TEST(FindRootDegree2, NegativeDiscriminantWritesNothing) {
    double r1 = kSentinel, r2 = kSentinel;
    EXPECT_EQ(FindRootDegree2(1, 0, 1, &r1, &r2), -7);
    EXPECT_EQ(r1, kSentinel);
    EXPECT_EQ(r2, kSentinel);
}

TEST(FindRootDegree2, ZeroDiscriminantGivesTwoEqualRoots) {
    double r1 = 0, r2 = 0;
    EXPECT_EQ(FindRootDegree2(1, -4, 4, &r1, &r2), 10);
    EXPECT_EQ(r1, 2);
    EXPECT_EQ(r2, 2);
}

TEST(FindRootDegree2, FirstRootTakesThePlusSign) {
    double r1 = 0, r2 = 0;
    // 2 (x - 3)(x + 1) = 2 x x - 4 x - 6
    EXPECT_EQ(FindRootDegree2(2, -4, -6, &r1, &r2), 10);
    EXPECT_EQ(r1, 3);
    EXPECT_EQ(r2, -1);
    // With a negative a the plus sign gives the smaller root.
    EXPECT_EQ(FindRootDegree2(-2, 4, 6, &r1, &r2), 10);
    EXPECT_EQ(r1, -1);
    EXPECT_EQ(r2, 3);
}

TEST(FindRootDegree2, BuiltInRootsAreFound) {
    std::mt19937_64 rng(47);
    std::uniform_real_distribution<double> u(-10, 10);
    for (int i = 0; i < 2000; ++i) {
        const double a = u(rng), x1 = u(rng), x2 = u(rng);
        if (std::fabs(a) < 0.01) continue;
        double r1 = 0, r2 = 0;
        ASSERT_EQ(FindRootDegree2(a, -a * (x1 + x2), a * x1 * x2, &r1, &r2), 10);
        const double lo = std::min(x1, x2), hi = std::max(x1, x2);
        EXPECT_NEAR(std::min(r1, r2), lo, 1e-6 * (1 + std::fabs(lo)));
        EXPECT_NEAR(std::max(r1, r2), hi, 1e-6 * (1 + std::fabs(hi)));
    }
}

struct Cubic3 {
    double roots[3] = {kSentinel, kSentinel, kSentinel};
    int16_t count = kSentinel16;
    int16_t flag = kSentinel16;
    int32_t status = 0;
};

Cubic3 Solve(double a, double b, double c, double d, double tol) {
    Cubic3 r;
    r.status = CL_Solv3orderEq(a, b, c, d, tol, r.roots, &r.count, &r.flag);
    return r;
}

TEST(CL_Solv3orderEq, OneRealRootInRange) {
    // (x - 0.5)(x x + 1) = x^3 - 0.5 x^2 + x - 0.5
    const Cubic3 r = Solve(1, -0.5, 1, -0.5, 0.001);
    EXPECT_EQ(r.status, 10);
    EXPECT_EQ(r.count, 1);
    EXPECT_EQ(r.flag, 1);
    EXPECT_NEAR(r.roots[0], 0.5, 1e-6);
}

TEST(CL_Solv3orderEq, RootOutsideTheRangeIsCountedOutButKept) {
    // (x - 1.2)(x x + 1)
    const Cubic3 r = Solve(1, -1.2, 1, -1.2, 0.001);
    EXPECT_EQ(r.status, 10);
    EXPECT_EQ(r.count, 0);
    EXPECT_EQ(r.flag, 1);
    EXPECT_NEAR(r.roots[0], 1.2, 1e-6);
}

TEST(CL_Solv3orderEq, ThreeRootsComeInCandidateOrder) {
    // (x - 0.2)(x - 0.5)(x - 0.8) = x^3 - 1.5 x^2 + 0.66 x - 0.08
    const Cubic3 r = Solve(1, -1.5, 0.66, -0.08, 0.001);
    EXPECT_EQ(r.status, 10);
    EXPECT_EQ(r.count, 3);
    EXPECT_EQ(r.flag, 1);
    // 2C + shift is the largest; shift - (S + C) the smallest.
    EXPECT_NEAR(r.roots[0], 0.8, 1e-7);
    EXPECT_NEAR(r.roots[1], 0.2, 1e-7);
    EXPECT_NEAR(r.roots[2], 0.5, 1e-7);
}

TEST(CL_Solv3orderEq, RejectedCandidateIsOverwrittenByTheNextAccepted) {
    // (x + 0.5)(x - 0.25)(x - 0.75): the candidates are 0.75, -0.5, 0.25.
    const Cubic3 r = Solve(1, -0.5, -0.3125, 0.09375, 0.001);
    EXPECT_EQ(r.count, 2);
    EXPECT_NEAR(r.roots[0], 0.75, 1e-7);
    EXPECT_NEAR(r.roots[1], 0.25, 1e-7);
    EXPECT_EQ(r.roots[2], kSentinel);
}

TEST(CL_Solv3orderEq, RejectedLastCandidateIsLeftBehindTheAcceptedOnes) {
    // (x - 0.25)(x - 1.5)(x - 2): the candidates are 2, 0.25, 1.5.
    const Cubic3 r = Solve(1, -3.75, 3.875, -0.75, 0.001);
    EXPECT_EQ(r.count, 1);
    EXPECT_NEAR(r.roots[0], 0.25, 1e-7);
    EXPECT_NEAR(r.roots[1], 1.5, 1e-7);
    EXPECT_EQ(r.roots[2], kSentinel);
}

TEST(CL_Solv3orderEq, DoubleRootCountsAsOne) {
    // (x - 0.5)^2 (x - 0.5) = (x - 0.5)^3: D is 0.
    const Cubic3 r = Solve(1, -1.5, 0.75, -0.125, 0.001);
    EXPECT_EQ(r.count, 1);
    EXPECT_NEAR(r.roots[0], 0.5, 1e-6);
}

TEST(CL_Solv3orderEq, SmallLeadingCoefficientIsScaledUp) {
    // The same roots whatever the scale of the equation.
    const double s = 1e-7;
    const Cubic3 r = Solve(s, -1.5 * s, 0.66 * s, -0.08 * s, 0.001);
    EXPECT_EQ(r.count, 3);
    EXPECT_NEAR(r.roots[0], 0.8, 1e-6);
}

TEST(CL_Solv3orderEq, BuiltInRootsInTheUnitRangeAreFound) {
    std::mt19937_64 rng(3);
    std::uniform_real_distribution<double> u(0.02, 0.98);
    int checked = 0;
    for (int i = 0; i < 2000; ++i) {
        double x[3] = {u(rng), u(rng), u(rng)};
        std::sort(x, x + 3);
        // Roots close together make the discriminant vanish within the
        // solver's tolerance, and then it reports one root.
        const double spread = (x[1] - x[0]) * (x[2] - x[1]) * (x[2] - x[0]);
        if (spread * spread / 108 < 1e-6) continue;
        const double b = -(x[0] + x[1] + x[2]);
        const double c = x[0] * x[1] + x[0] * x[2] + x[1] * x[2];
        const double d = -x[0] * x[1] * x[2];
        const Cubic3 r = Solve(1, b, c, d, 0.001);
        ASSERT_EQ(r.count, 3) << i;
        double got[3] = {r.roots[0], r.roots[1], r.roots[2]};
        std::sort(got, got + 3);
        for (int k = 0; k < 3; ++k) EXPECT_NEAR(got[k], x[k], 1e-6);
        ++checked;
    }
    EXPECT_GT(checked, 200);
}

TEST(GetparONln, PointJustPastTheEndIsClampedWhenOnTheLine) {
    double t = kSentinel;
    EXPECT_EQ(GetparONln(0, 0, 1, 0, 1.00005, 0.0001, 0.001, &t), 10);
    EXPECT_EQ(t, 1);
}

TEST(GetparONln, PointTooFarFromTheLineGivesTheFootParameter) {
    double t = kSentinel;
    EXPECT_EQ(GetparONln(0, 0, 2, 0, 0.5, 1, 0.001, &t), -1);
    EXPECT_EQ(t, 0.25);
}

TEST(GetparONln, PointBeyondTheMarginKeepsItsParameter) {
    double t = kSentinel;
    EXPECT_EQ(GetparONln(0, 0, 1, 0, 1.5, 0, 0.001, &t), -1);
    EXPECT_EQ(t, 1.5);
    EXPECT_EQ(GetparONln(0, 0, 1, 0, -0.0002, 0, 0.001, &t), -1);
    EXPECT_NEAR(t, -0.0002, 1e-18);
}

TEST(GetparONln, ParameterJustBelowZeroIsClampedEvenWhenOffTheLine) {
    double t = kSentinel;
    EXPECT_EQ(GetparONln(0, 0, 1, 0, -0.00005, 5, 0.001, &t), -1);
    EXPECT_EQ(t, 0);
}

}  // namespace
