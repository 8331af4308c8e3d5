// Vectors, angles, directions, frames, sorting, side and box tests.
#include <cmath>
#include <limits>

#include "geometry_test_util.h"

using namespace gtest_geometry;

TEST(GeometryVectors, CrossDotMagnitudes) {
    EXPECT_EQ(BZ_Crossp(1, 2, 3, 4), 1.0 * 4 - 3.0 * 2);
    EXPECT_EQ(BZ_Dotp(1, 2, 3, 4), 11.0);
    EXPECT_EQ(BZ_Magsvec(3, 4), 25.0);
    EXPECT_EQ(BZ_Magvec(3, 4), 5.0);
    EXPECT_EQ(BZ_Magvec(0, 0), 0.0);
    EXPECT_EQ(BZ_Magvec(std::nan(""), 0), 0.0);  // a sum that is not above 0
    EXPECT_EQ(BZ_Distptpt(1, 1, 4, 5), 5.0);
    EXPECT_EQ(BZ_Distptpt(1, 1, 1, 1), 0.0);
    // Unlike Distance, no threshold: 1e-9 apart is 1e-9.
    EXPECT_DOUBLE_EQ(BZ_Distptpt(0, 0, 1e-9, 0), 1e-9);
    EXPECT_EQ(BZ_Distptpts(0, 0, 3, 4), 25.0);
}

TEST(GeometryVectors, GetVector) {
    BZ_Point v = SentinelPoint();
    EXPECT_EQ(BZ_GetVector(1, 2, 4, 6, &v), 10);
    EXPECT_EQ(v.x, 3.0);
    EXPECT_EQ(v.y, 4.0);
}

TEST(GeometryVectors, NormvecEdges) {
    BZ_Point v{0, 0};
    EXPECT_EQ(BZ_Normvec(&v), -3);
    EXPECT_EQ(v.x, 0.0);
    EXPECT_EQ(v.y, 0.0);
    v = Pt(1e-7, 1e-7);
    EXPECT_EQ(BZ_Normvec(&v), -3);
    EXPECT_EQ(v.x, 0.0);
    EXPECT_EQ(v.y, 0.0);
    v = Pt(1e-6, 0);
    EXPECT_EQ(BZ_Normvec(&v), 10);
    EXPECT_EQ(v.x, 1.0);
    EXPECT_EQ(v.y, 0.0);
    v = Pt(3, 4);
    EXPECT_EQ(BZ_Normvec(&v), 10);
    EXPECT_DOUBLE_EQ(v.x, 0.6);
    EXPECT_DOUBLE_EQ(v.y, 0.8);
}

TEST(GeometryVectors, GetNormVectorWritesZeroOnDegenerate) {
    BZ_Point v = SentinelPoint();
    EXPECT_EQ(BZ_GetNormVector(2, 2, 2, 2, &v), -3);
    EXPECT_EQ(v.x, 0.0);
    EXPECT_EQ(v.y, 0.0);
    EXPECT_EQ(BZ_GetNormVector(1, 1, 1, 3, &v), 10);
    EXPECT_EQ(v.x, 0.0);
    EXPECT_EQ(v.y, 1.0);
}

TEST(GeometryVectors, Rotatevec) {
    BZ_Point v{1, 0};
    EXPECT_EQ(BZ_Rotatevec(kPi / 2, &v), 10);
    EXPECT_NEAR(v.x, 0.0, 1e-15);
    EXPECT_NEAR(v.y, 1.0, 1e-15);
    v = Pt(2, 1);
    BZ_Rotatevec(0.3, &v);
    EXPECT_EQ(v.x, 2 * std::cos(0.3) - 1 * std::sin(0.3));
    EXPECT_EQ(v.y, 2 * std::sin(0.3) + 1 * std::cos(0.3));
}

TEST(GeometryVectors, Vecequal) {
    int16_t status = kSentinel16;
    EXPECT_EQ(BZ_vecequal(0, 1, 0, 5, 0, &status), 1);
    EXPECT_EQ(status, 10);
    status = kSentinel16;
    EXPECT_EQ(BZ_vecequal(0, 1, 0, -5, 0, &status), 0);
    EXPECT_EQ(status, 10);
    EXPECT_EQ(BZ_vecequal(1, 1, 0, -5, 0, &status), 2);
    EXPECT_EQ(status, 10);
    EXPECT_EQ(BZ_vecequal(1, 1, 0, 0, 1, &status), 0);
    EXPECT_EQ(status, 10);
    // Within 0.0001 of the dot product 1.
    EXPECT_EQ(BZ_vecequal(0, 1, 0, 1, 0.01, &status), 1);
    EXPECT_EQ(BZ_vecequal(0, 1, 0, 1, 0.02, &status), 0);
    status = kSentinel16;
    EXPECT_EQ(BZ_vecequal(1, 0, 0, 1, 0, &status), 0);
    EXPECT_EQ(status, -3);
    status = kSentinel16;
    EXPECT_EQ(BZ_vecequal(1, 1, 0, 0, 1e-8, &status), 0);
    EXPECT_EQ(status, -3);
}

TEST(GeometryVectors, RotateDir) {
    EXPECT_EQ(rotateDir(1, 0, 2, 0, 1e-8), 1);
    EXPECT_EQ(rotateDir(1, 0, -2, 0, 1e-8), 2);
    EXPECT_EQ(rotateDir(1, 0, 0, 1, 1e-8), 3);
    // The tolerance is on the cross product and inclusive.
    EXPECT_EQ(rotateDir(1, 0, 1, 0.5, 0.5), 1);
    EXPECT_EQ(rotateDir(1, 0, 1, 0.5, 0.4), 3);
    EXPECT_EQ(rotateDir(0, 0, 0, 0, 0), 1);  // dot 0 counts as the same way
}

TEST(GeometryVectors, ScalarHelpers) {
    double x = kSentinel, y = kSentinel;
    BZ_Polar2Cart(0.5, 2, &x, &y);
    EXPECT_EQ(x, std::cos(0.5) * 2);
    EXPECT_EQ(y, std::sin(0.5) * 2);
    EXPECT_EQ(BZ_sqrt(4), 2.0);
    EXPECT_EQ(BZ_sqrt(0), 0.0);
    EXPECT_EQ(BZ_sqrt(-1), 0.0);
    EXPECT_EQ(BZ_acos(1), 0.0);
    EXPECT_EQ(BZ_acos(1.5), 0.0);
    EXPECT_EQ(BZ_acos(-1), kPi);
    EXPECT_EQ(BZ_acos(-2), kPi);
    EXPECT_EQ(BZ_acos(0.5), std::acos(0.5));
}

TEST(GeometryVectors, Atan2zFallback) {
    // Squared length just under 2e-13 gives the fallback, not an angle.
    const double x = std::sqrt(1.99e-13);
    EXPECT_EQ(BZ_atan2z(0, x, 7.0), 7.0);
    EXPECT_EQ(BZ_atan2z(x, 0, 7.0), 7.0);
    const double y = std::sqrt(2.01e-13);
    EXPECT_EQ(BZ_atan2z(y, 0, 7.0), std::atan2(y, 0.0));
    EXPECT_EQ(BZ_atan2z(-1, -1, 0), std::atan2(-1.0, -1.0));
}

TEST(GeometryVectors, MinAngle) {
    EXPECT_DOUBLE_EQ(BZminanglev1v2(1, 0, 0, 1), kPi / 2);
    EXPECT_DOUBLE_EQ(BZminanglev1v2(0, 1, 1, 0), -kPi / 2);
    // Across the negative x axis the short way is taken.
    const double a = BZminanglev1v2(std::cos(3.0), std::sin(3.0), std::cos(-3.0), std::sin(-3.0));
    EXPECT_NEAR(a, kTurn - 6.0, 1e-12);
    // A vector too short for an angle counts as angle 0.
    EXPECT_DOUBLE_EQ(BZminanglev1v2(0, 0, 0, 1), kPi / 2);
    EXPECT_EQ(BZminanglev1v2(1, 0, 1e-7, 0), 0.0);
}

TEST(GeometryDirections, Table) {
    EXPECT_EQ(BZccwdir(-1), -1 + kTurn);
    EXPECT_EQ(BZccwdir(1), 1.0);
    EXPECT_EQ(BZccwdir(0), 0.0);
    EXPECT_EQ(BZcwdir(1), 1 - kTurn);
    EXPECT_EQ(BZcwdir(-1), -1.0);
    EXPECT_EQ(BZcwdir(0), 0.0);
    EXPECT_EQ(BZsym(-1), -1 + kPi);
    EXPECT_EQ(BZsym(1), 1 - kPi);
    EXPECT_EQ(BZsym(0), -kPi);
    EXPECT_EQ(BZeven(-1), -kPi + 1);
    EXPECT_EQ(BZeven(1), kPi - 1);
    EXPECT_EQ(BZeven(0), kPi);
    EXPECT_EQ(BZodd(1.5), -1.5);
    EXPECT_EQ(BZcomp(-1), -1 + kTurn);
    EXPECT_EQ(BZcomp(1), 1 - kTurn);
    EXPECT_EQ(BZcomp(0), -kTurn);
    EXPECT_EQ(BZmindir(4), 4 - kTurn);
    EXPECT_EQ(BZmindir(-4), -4 + kTurn);
    EXPECT_EQ(BZmindir(3), 3.0);
    EXPECT_EQ(BZmindir(kPi), kPi);
    EXPECT_EQ(BZmindir(-kPi), -kPi);
}

TEST(GeometryDirections, Onerevol) {
    EXPECT_NEAR(BZonerevol(kTurn), 0.0, 1e-15);
    EXPECT_EQ(BZonerevol(6.2831853), 6.2831853);
    EXPECT_NEAR(BZonerevol(-kTurn), 0.0, 1e-15);
    EXPECT_EQ(BZonerevol(-6.2831853), -6.2831853);
    EXPECT_EQ(BZonerevol(1.0), 1.0);
    // Within the slack of a full turn.
    EXPECT_LT(BZonerevol(kTurn - 5e-14), 0.0);
    double big = 10 * kTurn + 0.5;
    double expect = big;
    while (expect + 1e-13 >= kTurn) expect -= kTurn;
    EXPECT_EQ(BZonerevol(big), expect);
    double small = -10 * kTurn - 0.5;
    expect = small;
    while (expect - 1e-13 <= -kTurn) expect += kTurn;
    EXPECT_EQ(BZonerevol(small), expect);
}

TEST(GeometryDirections, OnerevolLeavesWhatATurnCannotMove) {
    const double inf = std::numeric_limits<double>::infinity();
    EXPECT_EQ(BZonerevol(inf), inf);
    EXPECT_EQ(BZonerevol(-inf), -inf);
    EXPECT_TRUE(std::isnan(BZonerevol(std::nan(""))));
    EXPECT_EQ(BZonerevol(1e300), 1e300);
    EXPECT_EQ(BZonerevol(-1e300), -1e300);
    // A million turns and more: unchanged; just below, brought home.
    EXPECT_EQ(BZonerevol(1e6 * kTurn), 1e6 * kTurn);
    EXPECT_EQ(BZonerevol(-1e6 * kTurn - 1), -1e6 * kTurn - 1);
    const double near = 999999.5 * kTurn;
    EXPECT_GT(BZonerevol(near), -kTurn);
    EXPECT_LT(BZonerevol(near), kTurn);
}

TEST(GeometryFrames, XformMatrix) {
    double m[4] = {kSentinel, kSentinel, kSentinel, kSentinel};
    EXPECT_EQ(VC_xformMatrix(0.4, m), 10);
    EXPECT_EQ(m[0], std::cos(0.4));
    EXPECT_EQ(m[3], std::cos(0.4));
    EXPECT_EQ(m[1], std::sin(0.4));
    EXPECT_EQ(m[2], -std::sin(0.4));
}

TEST(GeometryFrames, TwoDimensions) {
    double m[4];
    VC_xformMatrix(0.7, m);
    BZ_Point p = SentinelPoint();
    EXPECT_EQ(BZ_2Doldtnw(1, 2, m, 2.0, 4, 6, &p), 10);
    EXPECT_EQ(p.x, (3 * m[0] + 4 * m[1]) * 2.0);
    EXPECT_EQ(p.y, (3 * m[2] + 4 * m[3]) * 2.0);
    BZ_Point back = SentinelPoint();
    EXPECT_EQ(BZ_2Dnwtold(1, 2, m, 2.0, p.x, p.y, &back), 10);
    EXPECT_NEAR(back.x, 4, 1e-12);
    EXPECT_NEAR(back.y, 6, 1e-12);
    EXPECT_EQ(back.x, (p.x * m[0] + p.y * m[2]) * (1 / 2.0) + 1);
}

TEST(GeometryFrames, NewToOldRefusesTinyScale) {
    const double m2[4] = {1, 0, 0, 1};
    BZ_Point p = SentinelPoint();
    EXPECT_EQ(BZ_2Dnwtold(0, 0, m2, 0.0001, 1, 1, &p), -1);
    ExpectSentinel(p);
    EXPECT_EQ(BZ_2Dnwtold(0, 0, m2, -0.0001, 1, 1, &p), -1);
    ExpectSentinel(p);
    EXPECT_EQ(BZ_2Dnwtold(0, 0, m2, 0.00011, 1, 1, &p), 10);
    EXPECT_EQ(p.x, 1 * (1 / 0.00011));
    const double m3[9] = {1, 0, 0, 0, 1, 0, 0, 0, 1};
    double q[3] = {kSentinel, kSentinel, kSentinel};
    EXPECT_EQ(BZ_3Dnwtold(0, 0, 0, m3, 0.0001, 1, 1, 1, q), -1);
    EXPECT_EQ(q[0], kSentinel);
    EXPECT_EQ(q[1], kSentinel);
    EXPECT_EQ(q[2], kSentinel);
    EXPECT_EQ(BZ_3Dnwtold(0, 0, 0, m3, 0.00011, 1, 1, 1, q), 10);
    EXPECT_EQ(q[2], 1 * (1 / 0.00011));
}

TEST(GeometryFrames, ThreeDimensions) {
    // A rotation about z by 90 degrees and one about x, rows of the matrix.
    const double m[9] = {0, 1, 0, 0, 0, 1, 1, 0, 0};
    double p[3];
    EXPECT_EQ(BZ_3Doldtnw(1, 1, 1, m, 3.0, 2, 3, 4, p), 10);
    EXPECT_EQ(p[0], (1 * 0 + 2 * 1 + 3 * 0) * 3.0);
    EXPECT_EQ(p[1], (1 * 0 + 2 * 0 + 3 * 1) * 3.0);
    EXPECT_EQ(p[2], (1 * 1 + 2 * 0 + 3 * 0) * 3.0);
    double back[3];
    EXPECT_EQ(BZ_3Dnwtold(1, 1, 1, m, 3.0, p[0], p[1], p[2], back), 10);
    EXPECT_DOUBLE_EQ(back[0], 2);
    EXPECT_DOUBLE_EQ(back[1], 3);
    EXPECT_DOUBLE_EQ(back[2], 4);
}

TEST(GeometrySort, SelectionSortKeepsEarliestOnTie) {
    BZ_SortEntry e[5] = {{3, 1}, {1, 2}, {2, 3}, {1, 4}, {-1, 5}};
    Sort_a(e, 5);
    const double keys[5] = {-1, 1, 1, 2, 3};
    for (int i = 0; i < 5; ++i) EXPECT_EQ(e[i].key, keys[i]);
    EXPECT_EQ(e[0].tag, 5);
    EXPECT_EQ(e[1].tag, 2);
    EXPECT_EQ(e[2].tag, 4);
    EXPECT_EQ(e[3].tag, 3);
    EXPECT_EQ(e[4].tag, 1);
}

TEST(GeometrySort, SwapsMoveTies) {
    // Selection sort is not stable: the swap of place 0 moves the first 2
    // behind the second one.
    BZ_SortEntry e[3] = {{2, 1}, {2, 2}, {1, 3}};
    Sort_a(e, 3);
    EXPECT_EQ(e[0].tag, 3);
    EXPECT_EQ(e[1].tag, 2);
    EXPECT_EQ(e[2].tag, 1);
}

TEST(GeometrySort, CountZeroOrBelowDoesNothing) {
    BZ_SortEntry e[2] = {{2, 1}, {1, 2}};
    Sort_a(e, 0);
    EXPECT_EQ(e[0].tag, 1);
    Sort_a(e, -3);
    EXPECT_EQ(e[0].tag, 1);
    Sort_a(e, 1);
    EXPECT_EQ(e[0].tag, 1);
}

TEST(GeometrySide, LeftRightOn) {
    EXPECT_EQ(BZ_PtOnWhichSideofLine(1e-8, 0, 0, 1, 0, 5, 1), 0);
    EXPECT_EQ(BZ_PtOnWhichSideofLine(1e-8, 0, 0, 1, 0, 5, -1), 1);
    EXPECT_EQ(BZ_PtOnWhichSideofLine(1e-8, 0, 0, 1, 0, 5, 0), 2);
    EXPECT_EQ(BZ_PtOnWhichSideofLine(1e-8, 0, 0, 1, 0, -5, 0), 2);
    // The tolerance is on the sine: 0.1 of a distance 100 away is about 0.001.
    EXPECT_EQ(BZ_PtOnWhichSideofLine(0.01, 0, 0, 1, 0, 100, 0.1), 2);
    EXPECT_EQ(BZ_PtOnWhichSideofLine(0.01, 0, 0, 1, 0, 1, 0.1), 0);
}

TEST(GeometrySide, DegenerateGivesMinus3) {
    EXPECT_EQ(BZ_PtOnWhichSideofLine(1e-8, 1, 1, 1, 1, 5, 5), -3);
    EXPECT_EQ(BZ_PtOnWhichSideofLine(1e-8, 0, 0, 1, 0, 0, 0), -3);
}

TEST(GeometryBox, OverlapWithTolerance) {
    EXPECT_EQ(BZ_BBoxBoxInt(0, 0, 1, 1, 2, 0, 3, 1, 1.0), 1);  // apart by exactly the tolerance
    EXPECT_EQ(BZ_BBoxBoxInt(0, 0, 1, 1, 2, 0, 3, 1, 0.5), 0);
    EXPECT_EQ(BZ_BBoxBoxInt(0, 0, 1, 1, 0, 2, 1, 3, 1.0), 1);
    EXPECT_EQ(BZ_BBoxBoxInt(0, 0, 1, 1, 0, -3, 1, -1.5, 0.25), 0);
    EXPECT_EQ(BZ_BBoxBoxInt(0, 0, 1, 1, 1, 1, 2, 2, 0), 1);
    EXPECT_EQ(BZ_BBoxBoxInt(2, 0, 3, 1, 0, 0, 1, 1, 0.5), 0);
}
