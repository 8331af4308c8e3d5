// Integer rectangles, transform matrices and GetSinCos.
#include <cmath>
#include <cstdint>
#include <limits>

#include <gtest/gtest.h>

#include <tessarine/core.h>

namespace {

void ExpectRect(const RECT &r, int32_t l, int32_t t, int32_t rr, int32_t b) {
    EXPECT_EQ(r.left, l);
    EXPECT_EQ(r.top, t);
    EXPECT_EQ(r.right, rr);
    EXPECT_EQ(r.bottom, b);
}

TEST(Rect, SetStoresAsGiven) {
    RECT r;
    IM_SetRECT(5, 6, 1, 2, &r);
    ExpectRect(r, 5, 6, 1, 2);
    HVT_Box box;
    IM_SetRECT(-1, -2, 3, 4, &box);
    ExpectRect(box, -1, -2, 3, 4);
}

TEST(Rect, Empty) {
    const RECT thin{5, 5, 5, 9};
    const RECT unit{5, 5, 6, 6};
    const RECT flat{5, 5, 9, 5};
    const RECT inverted{9, 9, 5, 5};
    EXPECT_EQ(IM_EmptyRECT(&thin), 1);
    EXPECT_EQ(IM_EmptyRECT(&unit), 0);
    EXPECT_EQ(IM_EmptyRECT(&flat), 1);
    EXPECT_EQ(IM_EmptyRECT(&inverted), 1);
}

TEST(Rect, IntersectionOverlapping) {
    const RECT a{0, 0, 10, 10}, b{5, -5, 20, 7};
    RECT out;
    EXPECT_EQ(IM_FindRECTInt(&a, &b, &out), 1);
    ExpectRect(out, 5, 0, 10, 7);
}

TEST(Rect, IntersectionSharingAnEdgeIsEmptyButWritten) {
    const RECT a{0, 0, 10, 10}, right{10, 2, 20, 8}, below{0, 10, 10, 20};
    RECT out{99, 99, 99, 99};
    EXPECT_EQ(IM_FindRECTInt(&a, &right, &out), 0);
    ExpectRect(out, 10, 2, 10, 8);
    EXPECT_EQ(IM_FindRECTInt(&a, &below, &out), 0);
    ExpectRect(out, 0, 10, 10, 10);
    const RECT far{50, 50, 60, 60};
    EXPECT_EQ(IM_FindRECTInt(&a, &far, &out), 0);
    ExpectRect(out, 50, 50, 10, 10);
}

TEST(Rect, IntersectionIntoAnArgument) {
    RECT a{0, 0, 10, 10};
    const RECT b{2, 3, 4, 5};
    EXPECT_EQ(IM_FindRECTInt(&a, &b, &a), 1);
    ExpectRect(a, 2, 3, 4, 5);
}

TEST(Rect, Enclosed) {
    const RECT r{1, 2, 3, 4};
    EXPECT_EQ(IM_IsRECTEnclosed(&r, &r), 1);
    const RECT outer{0, 0, 10, 10}, inner{1, 1, 9, 9}, sticking{1, 1, 11, 9};
    EXPECT_EQ(IM_IsRECTEnclosed(&inner, &outer), 1);
    EXPECT_EQ(IM_IsRECTEnclosed(&outer, &inner), 0);
    EXPECT_EQ(IM_IsRECTEnclosed(&sticking, &outer), 0);
    const RECT left{-1, 1, 5, 5}, top{1, -1, 5, 5}, bottom{1, 1, 5, 11};
    EXPECT_EQ(IM_IsRECTEnclosed(&left, &outer), 0);
    EXPECT_EQ(IM_IsRECTEnclosed(&top, &outer), 0);
    EXPECT_EQ(IM_IsRECTEnclosed(&bottom, &outer), 0);
}

TEST(Rect, UnionWithZeroRectTakesInOrigin) {
    const RECT a{5, 6, 10, 12};
    RECT b{0, 0, 0, 0};
    IM_UnionRECT(&a, &b);
    ExpectRect(b, 0, 0, 10, 12);
    RECT c{-3, 7, 4, 8};
    IM_UnionRECT(&a, &c);
    ExpectRect(c, -3, 6, 10, 12);
}

TEST(Rect, ExpandAndShrink) {
    RECT r{0, 0, 3, 3};
    IM_ExpandRECT(-2, &r);
    ExpectRect(r, 2, 2, 1, 1);
    EXPECT_EQ(IM_EmptyRECT(&r), 1);
    RECT s{0, 0, 3, 3};
    IM_ExpandRECT(4, &s);
    ExpectRect(s, -4, -4, 7, 7);
}

TEST(Rect, Translate) {
    RECT r{1, 2, 3, 4};
    IM_TranslateRECT(10, -20, &r);
    ExpectRect(r, 11, -18, 13, -16);
}

TEST(Rect, ArithmeticWrapsInsteadOfOverflowing) {
    RECT r{INT32_MIN, INT32_MIN, INT32_MAX, INT32_MAX};
    IM_ExpandRECT(1, &r);
    ExpectRect(r, INT32_MAX, INT32_MAX, INT32_MIN, INT32_MIN);
    IM_ExpandRECT(INT32_MIN, &r);
    ExpectRect(r, -1, -1, 0, 0);
    RECT t{INT32_MAX, INT32_MIN, 0, 0};
    IM_TranslateRECT(1, -1, &t);
    ExpectRect(t, INT32_MIN, INT32_MAX, 1, -1);
}

TEST(Matrix, InverseOfTranslation) {
    const QM m{1, 0, 0, 1, 7, -3};
    QM inv;
    QM_GetInverseQM(&m, &inv);
    EXPECT_EQ(inv.a, 1);
    EXPECT_EQ(inv.b, 0);
    EXPECT_EQ(inv.c, 0);
    EXPECT_EQ(inv.d, 1);
    EXPECT_EQ(inv.e, -7);
    EXPECT_EQ(inv.f, 3);
}

TEST(Matrix, InverseFollowsWrittenFormulas) {
    const QM m{2, 0.5, -1, 3, 4, 5};
    QM inv;
    QM_GetInverseQM(&m, &inv);
    const double r = 1 / (2 * 3.0 - 0.5 * -1);
    EXPECT_EQ(inv.a, r * 3);
    EXPECT_EQ(inv.b, -(r * 0.5));
    EXPECT_EQ(inv.c, -(r * -1));
    EXPECT_EQ(inv.d, r * 2);
    EXPECT_EQ(inv.e, (5 * -1.0 - 4 * 3.0) * r);
    EXPECT_EQ(inv.f, (4 * 0.5 - 5 * 2.0) * r);
    double x, y;
    QM_ApplyQmXY(&m, 1.5, -2, &x, &y);
    QM_ApplyQmXY(&inv, x, y, &x, &y);
    EXPECT_NEAR(x, 1.5, 1e-12);
    EXPECT_NEAR(y, -2, 1e-12);
}

TEST(Matrix, InverseOfSingularGivesInfinities) {
    const QM m{1, 2, 2, 4, 0, 0};
    QM inv;
    QM_GetInverseQM(&m, &inv);
    EXPECT_TRUE(std::isinf(inv.a));
    EXPECT_TRUE(std::isinf(inv.d));
}

TEST(Matrix, InverseInPlaceUsesStoredValues) {
    // Each value is stored as soon as computed: in place, later lines read
    // the new values.
    QM m{2, 0, 0, 4, 6, 8};
    QM_GetInverseQM(&m, &m);
    EXPECT_EQ(m.a, 0.125 * 4);
    EXPECT_EQ(m.d, 0.125 * m.a);
}

TEST(Matrix, ApplyXYAndPoint) {
    const QM m{1, 2, 3, 4, 5, 6};
    double x, y;
    QM_ApplyQmXY(&m, 10, 100, &x, &y);
    EXPECT_EQ(x, 10 * 1 + 100 * 3 + 5);
    EXPECT_EQ(y, 10 * 2 + 100 * 4 + 6);
    double p[2] = {10, 100};
    QM_ApplyQmPt(&m, p);
    EXPECT_EQ(p[0], x);
    EXPECT_EQ(p[1], y);
}

TEST(Matrix, ApplyIntIdentityKeepsIntegers) {
    const QM id{1, 0, 0, 1, 0, 0};
    for (int32_t v : {0, 1, -1, 7, -7, 123456, -123456, INT32_MAX, INT32_MIN}) {
        int32_t x = 99, y = 99;
        QM_ApplyQmIntXY(&id, v, 3, &x, &y);
        EXPECT_EQ(x, v);
        EXPECT_EQ(y, 3);
        QM_ApplyQmIntXY(&id, -4, v, &x, &y);
        EXPECT_EQ(x, -4);
        EXPECT_EQ(y, v);
    }
}

TEST(Matrix, ApplyIntRoundsLikeLongRound) {
    const QM half{0.5, 0, 0, 0.5, 0, 0};
    int32_t x, y;
    QM_ApplyQmIntXY(&half, 5, -5, &x, &y);
    EXPECT_EQ(x, 3);   // 2.5 away from zero
    EXPECT_EQ(y, -2);  // -2.5 toward zero
    EXPECT_EQ(x, LongRound(2.5));
    EXPECT_EQ(y, LongRound(-2.5));
    const QM shift{1, 0, 0, 1, 0.4999999995, 0};
    QM_ApplyQmIntXY(&shift, 0, 0, &x, &y);
    EXPECT_EQ(x, 1);
}

TEST(Matrix, ApplyIntOutOfRangeIsIntMin) {
    const QM big{1e12, 0, 0, 1, std::numeric_limits<double>::quiet_NaN(), 0};
    int32_t x = 0, y = 0;
    QM_ApplyQmIntXY(&big, 3, 4, &x, &y);
    EXPECT_EQ(x, INT32_MIN);
    EXPECT_EQ(y, 4);
}

TEST(Matrix, RectRotatedBy90SwapsWidthAndHeight) {
    double s, c;
    GetSinCos(M_PI / 2, &s, &c);
    const QM rot{c, s, -s, c, 0, 0};
    RECT r{0, 0, 30, 10};
    QM_ApplyQmRECT(&rot, &r);
    EXPECT_EQ(r.right - r.left, 10);
    EXPECT_EQ(r.bottom - r.top, 30);
    ExpectRect(r, -10, 0, 0, 30);
}

TEST(Matrix, RectUsesExclusiveCornersAsTheyStand) {
    const QM flip{-1, 0, 0, 1, 0, 0};
    RECT r{2, 3, 5, 7};
    QM_ApplyQmRECT(&flip, &r);
    ExpectRect(r, -5, 3, -2, 7);
    const QM scale{2, 0, 0, 3, 1, 1};
    RECT q{0, 0, 1, 1};
    QM_ApplyQmRECT(&scale, &q);
    ExpectRect(q, 1, 1, 3, 4);
}

TEST(SinCos, NearZeroIsExactIdentity) {
    double s = 5, c = 5;
    GetSinCos(0, &s, &c);
    EXPECT_EQ(s, 0.0);
    EXPECT_EQ(c, 1.0);
    s = c = 5;
    GetSinCos(1e-9, &s, &c);
    EXPECT_EQ(s, 0.0);
    EXPECT_EQ(c, 1.0);
    GetSinCos(-1e-8, &s, &c);
    EXPECT_EQ(s, 0.0);
    EXPECT_EQ(c, 1.0);
    GetSinCos(2e-8, &s, &c);
    EXPECT_EQ(s, std::sin(2e-8));
    EXPECT_EQ(c, std::cos(2e-8));
    GetSinCos(1.0, &s, &c);
    EXPECT_EQ(s, std::sin(1.0));
    EXPECT_EQ(c, std::cos(1.0));
}

}  // namespace
