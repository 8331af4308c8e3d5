// Column reads against the same pixels read by rows, from the top and from the
// bottom, on every layout and storage route; the single-pixel operation of
// 1-bit bitmaps.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include <tessarine/tessarine.h>

#include "platform/test_hooks.h"
#include "row_model.h"
#include "test_support.h"

namespace {

using rowtest::Layout;
using rowtest::Route;
using tessarine::testing::AllocationFailureHit;
using tessarine::testing::FileCall;
using tessarine::testing::FileFailureHit;
using Bytes = std::vector<uint8_t>;

class Columns : public tstest::Sandbox {};

bool ColumnGrayFails(const Layout &l) { return l.type == 4 && l.model != 1; }

// Every column of interest of a bitmap, by column and by rows, both ways.
void CheckColumns(BI_Bitmap *b, const Layout &l, const char *route) {
    const int32_t w = b->width, h = b->height;
    std::vector<int32_t> xs = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, w - 1};
    if (w > 8192) xs.insert(xs.end(), {8191, 8192, 8193});
    const std::vector<std::pair<int32_t, int32_t>> spans = {
        {0, h}, {0, 1}, {h - 1, 1}, {1, h - 2}, {h / 3, h / 2}};
    for (int32_t x : xs) {
        for (auto [y, n] : spans) {
            SCOPED_TRACE(testing::Message() << l.name << " " << route << " x " << x << " y " << y
                                            << " n " << n);
            Bytes r(n), g(n), bl(n), gray(n), rr(n), rg(n), rb(n), rgray(n);
            for (int32_t i = 0; i < n; ++i) {
                ASSERT_EQ(BI_GetRGBRow(b, y + i, x, 1, &rr[i], &rg[i], &rb[i]), TS_OK);
                if (!ColumnGrayFails(l)) {
                    ASSERT_EQ(BI_GetGRow(b, y + i, x, 1, &rgray[i]), TS_OK);
                }
            }
            ASSERT_EQ(BI_GetRGBColTopdown(b, x, y, n, r.data(), g.data(), bl.data()), TS_OK);
            EXPECT_EQ(r, rr);
            EXPECT_EQ(g, rg);
            EXPECT_EQ(bl, rb);
            ASSERT_EQ(BI_GetRGBColBottomup(b, x, y, n, r.data(), g.data(), bl.data()), TS_OK);
            EXPECT_EQ(r, Bytes(rr.rbegin(), rr.rend()));
            EXPECT_EQ(g, Bytes(rg.rbegin(), rg.rend()));
            EXPECT_EQ(bl, Bytes(rb.rbegin(), rb.rend()));
            if (ColumnGrayFails(l)) {
                EXPECT_EQ(BI_GetGColTopdown(b, x, y, n, gray.data()), -2);
                EXPECT_EQ(BI_GetGColBottomup(b, x, y, n, gray.data()), -2);
                continue;
            }
            ASSERT_EQ(BI_GetGColTopdown(b, x, y, n, gray.data()), TS_OK);
            EXPECT_EQ(gray, rgray);
            ASSERT_EQ(BI_GetGColBottomup(b, x, y, n, gray.data()), TS_OK);
            EXPECT_EQ(gray, Bytes(rgray.rbegin(), rgray.rend()));
        }
    }
}

TEST_F(Columns, EqualRowsOnEveryLayoutAndRoute) {
    uint32_t seed = 1;
    for (const Layout &l : rowtest::Layouts()) {
        for (Route route : {Route::Memory, Route::Alone, Route::AloneOwnFd}) {
            const rowtest::Image img = rowtest::RandomImage(37, 23, l.d, seed++);
            BI_Bitmap *b = rowtest::MakeBitmap(l, route, img, rowtest::RandomTable(l, seed++));
            ASSERT_NE(b, nullptr);
            CheckColumns(b, l, rowtest::RouteName(route));
            BI_DeleteBitmap(&b);
        }
    }
}

// Columns that cross tile rows and, near x = 8192, sit on both sides of a tile
// column edge.
TEST_F(Columns, CrossTileEdges) {
    for (const Layout &l : {Layout{"bw1", 1, 1, 1, 0}, Layout{"gray4", 2, 4, 1, 0},
                            Layout{"rgb24", 4, 24, 1, 0}}) {
        const rowtest::Image img = rowtest::RandomImage(8195, 1030, l.d, 77);
        BI_Bitmap *b = rowtest::MakeBitmap(l, Route::Alone, img, {});
        ASSERT_NE(b, nullptr);
        for (int32_t x : {0, 8191, 8192, 8194}) {
            Bytes r(1030), g(1030), bl(1030), rr(1), rg(1), rb(1);
            ASSERT_EQ(BI_GetRGBColBottomup(b, x, 0, 1030, r.data(), g.data(), bl.data()), TS_OK);
            for (int32_t y : {0, 1, 1023, 1024, 1029}) {
                ASSERT_EQ(BI_GetRGBRow(b, y, x, 1, rr.data(), rg.data(), rb.data()), TS_OK);
                EXPECT_EQ(r[1029 - y], rr[0]) << l.name << " x " << x << " y " << y;
                EXPECT_EQ(g[1029 - y], rg[0]);
                EXPECT_EQ(bl[1029 - y], rb[0]);
            }
        }
        BI_DeleteBitmap(&b);
    }
}

TEST_F(Columns, CountOneSameFromBothEnds) {
    const uint8_t column[3] = {0x12, 0x34, 0x56};
    uint8_t a[3], b[3], c[3], d[3], e[3], f[3];
    ASSERT_EQ(BI_UnpackRGBColTopdown(4, 24, nullptr, 3, column, 0, 1, a, b, c), TS_OK);
    ASSERT_EQ(BI_UnpackRGBColBottomup(4, 24, nullptr, 3, column, 0, 1, d, e, f), TS_OK);
    EXPECT_EQ(a[0], d[0]);
    EXPECT_EQ(b[0], e[0]);
    EXPECT_EQ(c[0], f[0]);
    EXPECT_EQ(a[0], 0x12);
    uint8_t g1 = 0, g2 = 1;
    ASSERT_EQ(BI_UnpackGColTopdown(2, 1, 8, nullptr, 7, column, 0, 1, &g1), TS_OK);
    ASSERT_EQ(BI_UnpackGColBottomup(2, 1, 8, nullptr, 7, column, 0, 1, &g2), TS_OK);
    EXPECT_EQ(g1, g2);
}

TEST_F(Columns, BottomupOfRowsTenToTwelvePutsRowTwelveFirst) {
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(2, 8, 4, 20, 300, 300, 1, 0, nullptr, &b, 1, 0, 0, 0), TS_OK);
    for (int y = 0; y < 20; ++y) {
        const Bytes row(4, static_cast<uint8_t>(y * 10));
        ASSERT_EQ(BI_SetGRow(y, 0, 4, row.data(), b), TS_OK);
    }
    Bytes r(3), g(3), bl(3);
    ASSERT_EQ(BI_GetRGBColBottomup(b, 2, 10, 3, r.data(), g.data(), bl.data()), TS_OK);
    EXPECT_EQ(r, (Bytes{255 - 120, 255 - 110, 255 - 100}));
    BI_DeleteBitmap(&b);
}

// The unpacking takes pixel i at first + i * stride, x only placing it in
// its byte.
TEST_F(Columns, StrideAndBitPlace) {
    const uint8_t bytes[6] = {0x80, 0x01, 0x40, 0x10, 0xFF, 0x00};
    uint8_t out[3];
    // d = 1, x = 7: the lowest bit of bytes 0, 2, 4 (stride 2).
    ASSERT_EQ(BI_UnpackGColTopdown(1, 0, 1, nullptr, 2, bytes, 7, 3, out), TS_OK);
    EXPECT_EQ(out[0], 0);
    EXPECT_EQ(out[1], 0);
    EXPECT_EQ(out[2], 255);
    // d = 1, x = 8 + 1: bit 6.
    ASSERT_EQ(BI_UnpackGColTopdown(1, 0, 1, nullptr, 2, bytes, 9, 3, out), TS_OK);
    EXPECT_EQ(out[0], 0);
    EXPECT_EQ(out[1], 255);
    EXPECT_EQ(out[2], 255);
    // d = 4: even x the high nibble, odd x the low nibble; from the bottom.
    ASSERT_EQ(BI_UnpackGColBottomup(2, 0, 4, nullptr, 3, bytes, 4, 2, out), TS_OK);
    EXPECT_EQ(out[0], 0x1 * 17);
    EXPECT_EQ(out[1], 0x8 * 17);
    ASSERT_EQ(BI_UnpackGColTopdown(2, 0, 4, nullptr, 3, bytes, 5, 2, out), TS_OK);
    EXPECT_EQ(out[0], 0);
    EXPECT_EQ(out[1], 0);
    // A gray 4-bit pixel of 15 reads as channels 15, and 0 as 255.
    uint8_t r[2], g[2], bl[2];
    const uint8_t nibbles[2] = {0xF0, 0x00};
    ASSERT_EQ(BI_UnpackRGBColTopdown(2, 4, nullptr, 1, nibbles, 0, 2, r, g, bl), TS_OK);
    EXPECT_EQ(r[0], 15);
    EXPECT_EQ(r[1], 255);
}

TEST_F(Columns, IndexedColumnsThroughTheTable) {
    MEM_Handle table = MEM_AllocHdl(0, 9);
    auto *t = static_cast<uint8_t *>(MEM_Lock(table));
    const uint8_t entries[9] = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    std::memcpy(t, entries, 9);
    MEM_Unlock(table);
    const uint8_t column[4] = {0x20, 0x12, 0x01, 0x00};
    uint8_t r[4], g[4], b[4];
    // x odd: low nibbles 0, 2, 1, 0.
    ASSERT_EQ(BI_UnpackRGBColTopdown(3, 4, table, 1, column, 1, 4, r, g, b), TS_OK);
    EXPECT_EQ(r[0], 1);
    EXPECT_EQ(r[1], 7);
    EXPECT_EQ(g[1], 8);
    EXPECT_EQ(b[2], 6);
    uint8_t gray[4];
    const uint8_t values[3] = {2, 1, 0x12};
    ASSERT_EQ(BI_UnpackGColBottomup(3, 2, 8, table, 1, values, 0, 3, gray), TS_OK);
    EXPECT_EQ(gray[0], 255);  // entry 0x12 is past the table: 0, 0, 0
    EXPECT_EQ(gray[1], rowtest::Gray(4, 5, 6));
    EXPECT_EQ(gray[2], rowtest::Gray(7, 8, 9));
    MEM_FreeHdl(table);
}

TEST_F(Columns, GrayColumnOfCmykTrueColourFailsWhereTheRowGivesDensities) {
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(4, 32, 3, 3, 300, 300, 2, 0, nullptr, &b, 1, 0, 0, 0), TS_OK);
    const Bytes c(3, 255), z(3, 0);
    ASSERT_EQ(BI_SetCMYKRow(0, 0, 3, c.data(), z.data(), z.data(), z.data(), b), TS_OK);
    uint8_t out[3] = {1, 2, 3};
    EXPECT_EQ(BI_GetGColTopdown(b, 0, 0, 3, out), -2);
    EXPECT_EQ(BI_GetGColBottomup(b, 0, 0, 3, out), -2);
    EXPECT_EQ(out[0], 1);
    ASSERT_EQ(BI_GetGRow(b, 0, 0, 3, out), TS_OK);
    EXPECT_EQ(out[0], 153);
    BI_DeleteBitmap(&b);
}

TEST_F(Columns, LayoutsOutsideTheTablesGiveMinusTwo) {
    const uint8_t px[4] = {1, 2, 3, 4};
    uint8_t r[1], g[1], b[1], out[1];
    for (uint8_t type : {0, 5}) {
        EXPECT_EQ(BI_UnpackRGBColTopdown(type, 8, nullptr, 1, px, 0, 1, r, g, b), -2);
        EXPECT_EQ(BI_UnpackRGBColBottomup(type, 8, nullptr, 1, px, 0, 1, r, g, b), -2);
        EXPECT_EQ(BI_UnpackGColTopdown(type, 1, 8, nullptr, 1, px, 0, 1, out), -2);
        EXPECT_EQ(BI_UnpackGColBottomup(type, 1, 8, nullptr, 1, px, 0, 1, out), -2);
    }
    EXPECT_EQ(BI_UnpackRGBColTopdown(2, 2, nullptr, 1, px, 0, 1, r, g, b), -2);
    EXPECT_EQ(BI_UnpackGColTopdown(2, 1, 24, nullptr, 1, px, 0, 1, out), -2);
    EXPECT_EQ(BI_UnpackGColTopdown(4, 0, 24, nullptr, 1, px, 0, 1, out), -2);
    EXPECT_EQ(BI_UnpackGColTopdown(4, 2, 32, nullptr, 1, px, 0, 1, out), -2);
    MEM_Handle table = MEM_AllocHdl(0, 6);
    EXPECT_EQ(BI_UnpackRGBColTopdown(3, 2, table, 1, px, 0, 1, r, g, b), -2);
    MEM_Unlock(table);  // this one path leaves the table locked
    EXPECT_EQ(BI_UnpackGColBottomup(3, 1, 24, table, 1, px, 0, 1, out), -2);
    MEM_Unlock(table);
    MEM_FreeHdl(table);
}

TEST_F(Columns, CountBelowOneDoesNothingBeforeTheLayoutTest) {
    uint8_t r[1] = {7}, out[1] = {7};
    for (int32_t count : {0, -1, INT32_MIN}) {
        EXPECT_EQ(BI_UnpackRGBColTopdown(9, 3, nullptr, 1, nullptr, 0, count, r, r, r), TS_OK);
        EXPECT_EQ(BI_UnpackRGBColBottomup(9, 3, nullptr, 1, nullptr, 0, count, r, r, r), TS_OK);
        EXPECT_EQ(BI_UnpackGColTopdown(4, 2, 32, nullptr, 1, nullptr, 0, count, out), TS_OK);
        EXPECT_EQ(BI_UnpackGColBottomup(0, 0, 3, nullptr, 1, nullptr, 0, count, out), TS_OK);
    }
    EXPECT_EQ(r[0], 7);
    EXPECT_EQ(out[0], 7);
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(4, 32, 3, 3, 300, 300, 2, 0, nullptr, &b, 2, 0, 0, 0), TS_OK);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(BI_GetGColTopdown(b, 0, 0, 0, out), TS_OK);
    EXPECT_EQ(BI_GetRGBColBottomup(b, 0, 0, -3, r, r, r), TS_OK);
    EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Read), 0);
    BI_DeleteBitmap(&b);
}

TEST_F(Columns, RunOutsideTheBitmapIsRefused) {
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(2, 8, 5, 5, 300, 300, 1, 0, nullptr, &b, 1, 0, 0, 0), TS_OK);
    uint8_t out[8];
    EXPECT_EQ(TS_STATUS(BI_GetGColTopdown(b, 0, 3, 3, out)), -1);
    EXPECT_EQ(TS_STATUS(BI_GetGColTopdown(b, 5, 0, 1, out)), -1);
    EXPECT_EQ(TS_STATUS(BI_GetGColTopdown(b, 0, INT32_MAX, 2, out)), -1);
    EXPECT_EQ(TS_STATUS(BI_GetGColTopdown(b, INT32_MAX, 0, 2, out)), -1);
    BI_DeleteBitmap(&b);
}

TEST_F(Columns, TileFileColumnAllocationFailure) {
    for (bool own : {false, true}) {
        const Layout l{"gray8", 2, 8, 1, 0};
        BI_Bitmap *b = rowtest::MakeBitmap(l, own ? Route::AloneOwnFd : Route::Alone,
                                           rowtest::RandomImage(9, 9, 8, 5), {});
        ASSERT_NE(b, nullptr);
        Bytes expect(9);
        ASSERT_EQ(BI_GetGColTopdown(b, 4, 0, 9, expect.data()), TS_OK);
        const int fds = tstest::OpenDescriptorCount();
        const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
            Bytes out(9, 0xAB);
            const int32_t s = BI_GetGColBottomup(b, 4, 0, 9, out.data());
            if (AllocationFailureHit()) {
                EXPECT_EQ(s, -5);
                EXPECT_EQ(out, Bytes(9, 0xAB));
            } else {
                EXPECT_EQ(s, TS_OK);
                EXPECT_EQ(out, Bytes(expect.rbegin(), expect.rend()));
            }
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
        });
        EXPECT_GE(made, 3);  // header, tile buffer, column
        BI_DeleteBitmap(&b);
    }
}

TEST_F(Columns, TileFileColumnFileFailures) {
    for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
        for (bool own : {false, true}) {
            const Layout l{"rgb24", 4, 24, 1, 0};
            BI_Bitmap *b = rowtest::MakeBitmap(l, own ? Route::AloneOwnFd : Route::Alone,
                                               rowtest::RandomImage(6, 7, 24, 6), {});
            ASSERT_NE(b, nullptr);
            const int fds = tstest::OpenDescriptorCount();
            tstest::ForEachFileFailure(kind, [&](int64_t) {
                Bytes r(7, 1), g(7, 1), bl(7, 1);
                const int32_t s = BI_GetRGBColTopdown(b, 5, 0, 7, r.data(), g.data(), bl.data());
                if (FileFailureHit(kind)) {
                    EXPECT_EQ(s, -50);
                    EXPECT_EQ(r, Bytes(7, 1));
                } else {
                    EXPECT_EQ(s, TS_OK);
                }
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            });
            BI_DeleteBitmap(&b);
        }
    }
}

TEST_F(Columns, PixelOperations) {
    // Two rows of 4 bytes; pixel (10, 1) is bit 5 of byte 4 + 1.
    uint8_t bits[8] = {0, 0, 0, 0, 0, 0x00, 0, 0};
    EXPECT_EQ(BI_PixelOpBWBmp(10, 1, 0, 4, bits), TS_OK);
    EXPECT_EQ(bits[5], 0x20);
    EXPECT_EQ(BI_PixelOpBWBmp(10, 1, 2, 4, bits), TS_OK);
    EXPECT_EQ(bits[5], 0x00);
    EXPECT_EQ(BI_PixelOpBWBmp(15, 1, 2, 4, bits), TS_OK);
    EXPECT_EQ(bits[5], 0x01);
    bits[5] = 0xFF;
    EXPECT_EQ(BI_PixelOpBWBmp(10, 1, 1, 4, bits), TS_OK);  // the whole byte clears
    EXPECT_EQ(bits[5], 0x00);
    bits[0] = 0xFF;
    EXPECT_EQ(BI_PixelOpBWBmp(0, 0, 1, 4, bits), TS_OK);
    EXPECT_EQ(bits[0], 0x00);
    bits[3] = 0x5A;
    for (int32_t op : {3, -1, 255}) {
        EXPECT_EQ(BI_PixelOpBWBmp(24, 0, op, 4, bits), -2);
        EXPECT_EQ(bits[3], 0x5A);
    }
    EXPECT_EQ(BI_PixelOpBWBmp(0, 0, 0, 4, nullptr), -4);
}

}  // namespace
