// Direct copy and mask: the tiles read and written, colour tables, statuses,
// and every allocation and file call made to fail.
#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <random>
#include <vector>

#include <tessarine/tessarine.h>

#include "platform/test_hooks.h"
#include "test_support.h"

namespace {

using Bytes = std::vector<uint8_t>;
using tessarine::testing::FileCall;
namespace th = tessarine::testing;

class DirectEdges : public tstest::Sandbox {
  protected:
    void TearDown() override {
        for (BI_Bitmap *&b : made_)
            if (b != nullptr) BI_DeleteBitmap(&b);
        tstest::Sandbox::TearDown();
    }
    // Every byte of the pixels `fill`: 8-bit gray, or black and white.
    BI_Bitmap *Filled(uint8_t type, uint8_t d, int32_t w, int32_t h, bool tiled, uint8_t fill) {
        BI_Bitmap *b = nullptr;
        EXPECT_EQ(BI_CreateBlankBmp(type, d, w, h, 300, 300, 1, 0, nullptr, &b, tiled ? 2 : 1, 0, 0, 0), TS_OK);
        made_.push_back(b);
        if (!tiled) {
            BI_FillByte(b, fill);
            return b;
        }
        const Bytes row((int64_t{w} * d + 7) / 8, fill);
        EXPECT_EQ(HVT_TileFileRowIOBegin(2, b, nullptr, 2, 0, 0), TS_OK);
        for (int32_t y = 0; y < h; ++y)
            EXPECT_EQ(d == 8 ? BI_SetGRow(y, 0, w, row.data(), b) : BI_SetBWPackedRow(y, 0, w, row.data(), b), TS_OK);
        HVT_TileFileRowColIOEnd(b);
        return b;
    }
    BI_Bitmap *Gray8(int32_t w, int32_t h, bool tiled, uint8_t fill) { return Filled(2, 8, w, h, tiled, fill); }
    // The failure loops run many times: one bit a pixel keeps the buffers small.
    BI_Bitmap *Bw(int32_t w, int32_t h, bool tiled, uint8_t fill) { return Filled(1, 1, w, h, tiled, fill); }
    BI_Bitmap *Made(BI_Bitmap *b) {
        made_.push_back(b);
        return b;
    }
    std::vector<BI_Bitmap *> made_;
};

struct Traffic {
    int64_t reads, writes, seeks;
};

// File calls of one run, less those of the same call with an empty
// rectangle: what the tiles cost.
Traffic TileTraffic(const std::function<int32_t(const RECT &)> &run, const RECT &r) {
    const RECT none{r.left, r.top, r.left, r.top};
    th::ResetInjection();
    EXPECT_EQ(run(none), TS_OK);
    const Traffic base{th::FileCallCount(FileCall::Read), th::FileCallCount(FileCall::Write),
                       th::FileCallCount(FileCall::Seek)};
    th::ResetInjection();
    EXPECT_EQ(run(r), TS_OK);
    const Traffic all{th::FileCallCount(FileCall::Read), th::FileCallCount(FileCall::Write),
                      th::FileCallCount(FileCall::Seek)};
    th::ResetInjection();
    return {all.reads - base.reads, all.writes - base.writes, all.seeks - base.seeks};
}

TEST_F(DirectEdges, ARectangleInsideOneTileTouchesOneTileOnEveryRoute) {
    BI_Bitmap *memS = Bw(9000, 1100, false, 1), *memD = Bw(9000, 1100, false, 2);
    BI_Bitmap *tileS = Bw(9000, 1100, true, 3), *tileD = Bw(9000, 1100, true, 4);
    const RECT r{100, 100, 200, 150};
    auto copy = [&](BI_Bitmap *s, BI_Bitmap *d) {
        return [=](const RECT &x) { return BI_DirectCopyBmp(&x, s, &x, d, 0, 0); };
    };
    Traffic t = TileTraffic(copy(memS, tileD), r);
    EXPECT_EQ(t.reads, 1);
    EXPECT_EQ(t.writes, 1);
    t = TileTraffic(copy(tileS, memD), r);
    EXPECT_EQ(t.reads, 1);
    EXPECT_EQ(t.writes, 0);
    t = TileTraffic(copy(tileS, tileD), r);
    // The destination tile, the source's tile table at its first use, and
    // the source block.
    EXPECT_EQ(t.reads, 3);
    EXPECT_EQ(t.writes, 1);
    const Bytes mask(64 * 64, 0xFF);
    auto masked = [&](BI_Bitmap *s, BI_Bitmap *d) {
        return [=, &mask](const RECT &x) { return BI_DirectMaskBmp(&x, s, 64, 0, 0, mask.data(), &x, d); };
    };
    t = TileTraffic(masked(memS, tileD), r);
    EXPECT_EQ(t.reads, 1);
    EXPECT_EQ(t.writes, 1);
    t = TileTraffic(masked(tileS, memD), r);
    EXPECT_EQ(t.reads, 1);
    t = TileTraffic(masked(tileS, tileD), r);
    EXPECT_EQ(t.reads, 3);
    EXPECT_EQ(t.writes, 1);
}

TEST_F(DirectEdges, ACrossingOfColumn8192WritesTwoTilesPerRowOfTiles) {
    BI_Bitmap *memS = Bw(9000, 1100, false, 1);
    BI_Bitmap *tileS = Bw(9000, 1100, true, 3), *tileD = Bw(9000, 1100, true, 4);
    const RECT one{8000, 10, 8300, 20};     // one row of tiles
    const RECT two{8000, 1000, 8300, 1050};  // two rows of tiles
    auto copy = [&](BI_Bitmap *s) {
        return [=](const RECT &x) { return BI_DirectCopyBmp(&x, s, &x, tileD, 0, 0); };
    };
    EXPECT_EQ(TileTraffic(copy(memS), one).writes, 2);
    EXPECT_EQ(TileTraffic(copy(memS), two).writes, 4);
    EXPECT_EQ(TileTraffic(copy(memS), two).reads, 4);
    EXPECT_EQ(TileTraffic(copy(tileS), two).writes, 4);
}

TEST_F(DirectEdges, AFullTileWidthIsNotReadAndOnePixelLessIs) {
    BI_Bitmap *src = Gray8(8192 + 100, 50, false, 9);
    BI_Bitmap *dst = Gray8(8192 + 100, 50, true, 4);
    auto copy = [&](const RECT &x) { return BI_DirectCopyBmp(&x, src, &x, dst, 0, 0); };
    Traffic t = TileTraffic(copy, RECT{0, 5, 8192, 10});
    EXPECT_EQ(t.reads, 0);
    EXPECT_EQ(t.writes, 1);
    Bytes row(8192 + 100);
    ASSERT_EQ(BI_GetGRow(dst, 7, 0, 8292, row.data()), TS_OK);
    EXPECT_EQ(row[0], 9);
    EXPECT_EQ(row[8191], 9);
    EXPECT_EQ(row[8192], 4);

    t = TileTraffic(copy, RECT{0, 20, 8191, 25});
    EXPECT_EQ(t.reads, 1);
    EXPECT_EQ(t.writes, 1);
    ASSERT_EQ(BI_GetGRow(dst, 22, 0, 8292, row.data()), TS_OK);
    EXPECT_EQ(row[8190], 9);
    EXPECT_EQ(row[8191], 4);  // outside the rectangle: kept

    // The masked form always reads.
    const Bytes mask(2048 * 8, 0xFF);
    auto masked = [&](const RECT &x) { return BI_DirectMaskBmp(&x, src, 2048, 0, 0, mask.data(), &x, dst); };
    EXPECT_EQ(TileTraffic(masked, RECT{0, 30, 8192, 35}).reads, 1);
}

TEST_F(DirectEdges, OneBitCopyFromLeftThreeToLeftFiveShiftsThePhases) {
    for (bool tiled : {false, true}) {
        BI_Bitmap *s = nullptr, *d = nullptr;
        ASSERT_EQ(BI_CreateBlankBmp(1, 1, 64, 4, 300, 300, 1, 0, nullptr, &s, 1, 0, 0, 0), TS_OK);
        ASSERT_EQ(BI_CreateBlankBmp(1, 1, 64, 4, 300, 300, 1, 0, nullptr, &d, tiled ? 2 : 1, 0, 0, 0), TS_OK);
        Made(s);
        Made(d);
        std::vector<uint8_t> flags(64);
        for (int i = 0; i < 64; ++i) flags[i] = static_cast<uint8_t>((i * 7 + i / 3) & 1);
        ASSERT_EQ(BI_SetBWRow(1, 0, 64, flags.data(), s), TS_OK);
        std::vector<uint8_t> zero(64, 0);
        ASSERT_EQ(BI_SetBWRow(2, 0, 64, zero.data(), d), TS_OK);
        const RECT sr{3, 1, 40, 2}, dr{5, 2, 42, 3};
        ASSERT_EQ(BI_DirectCopyBmp(&sr, s, &dr, d, 0, 0), TS_OK);
        std::vector<uint8_t> got(64);
        ASSERT_EQ(BI_GetBWRow(d, 2, 0, 64, got.data()), TS_OK);
        for (int i = 0; i < 64; ++i) {
            const int want = i >= 5 && i < 42 ? flags[i - 2] : 0;
            EXPECT_EQ(got[i] != 0, want != 0) << i << (tiled ? " tiled" : " memory");
        }
    }
}

TEST_F(DirectEdges, IndexedRgbCopyReplacesTheColourTableAndLeavesTheIndexStale) {
    const uint8_t a[6] = {1, 2, 3, 4, 5, 6}, b[9] = {9, 9, 9, 8, 8, 8, 7, 7, 7};
    BI_Bitmap *s = nullptr, *d = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(3, 8, 10, 10, 300, 300, 1, 2, a, &s, 1, 0, 0, 0), TS_OK);
    ASSERT_EQ(BI_CreateBlankBmp(3, 8, 10, 10, 300, 300, 1, 3, b, &d, 1, 0, 0, 0), TS_OK);
    Made(s);
    Made(d);
    ASSERT_EQ(MakeColorTableIndex(d), TS_OK);
    void *index = d->colorIndex;
    const RECT r{0, 0, 10, 10};
    ASSERT_EQ(BI_DirectCopyBmp(&r, s, &r, d, 0, 0), TS_OK);
    EXPECT_EQ(d->colorCount, 2);
    uint8_t got[6];
    int32_t count = 0;
    ASSERT_EQ(BI_GetRGBColorTable(d, &count, got), TS_OK);
    EXPECT_EQ(std::memcmp(got, a, 6), 0);
    EXPECT_EQ(d->colorIndex, index);  // not rebuilt
}

TEST_F(DirectEdges, AColourTableThatCannotBeSetStopsTheCopy) {
    const uint8_t a[6] = {1, 2, 3, 4, 5, 6}, b[9] = {9, 9, 9, 8, 8, 8, 7, 7, 7};
    BI_Bitmap *s = nullptr, *d = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(3, 8, 10, 10, 300, 300, 1, 2, a, &s, 1, 0, 0, 0), TS_OK);
    ASSERT_EQ(BI_CreateBlankBmp(3, 8, 10, 10, 300, 300, 1, 3, b, &d, 2, 0, 0, 0), TS_OK);
    Made(s);
    Made(d);
    const RECT r{0, 0, 10, 10};
    // The table of another size needs a new block: that allocation fails.
    th::FailAllocationAt(1);
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&r, s, &r, d, 0, 0)), -5);
    EXPECT_TRUE(th::AllocationFailureHit());
    th::ResetInjection();
    EXPECT_EQ(d->colorCount, 3);
    // A destination with no table cannot take one.
    BI_Bitmap *gray = Gray8(10, 10, false, 0);
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&r, s, &r, gray, 0, 0)), -2);
}

TEST_F(DirectEdges, AnIndexedCmykSourceIsRefusedAndNothingMoves) {
    const uint8_t t[8] = {1, 2, 3, 4, 5, 6, 7, 8};
    BI_Bitmap *s = nullptr, *d = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(3, 8, 10, 10, 300, 300, 2, 2, t, &s, 1, 0, 0, 0), TS_OK);
    ASSERT_EQ(BI_CreateBlankBmp(3, 8, 10, 10, 300, 300, 2, 2, t, &d, 1, 0, 0, 0), TS_OK);
    Made(s);
    Made(d);
    Bytes ones(10, 1), zeros(10, 0);
    ASSERT_EQ(BI_SetIndexRow(0, 0, 10, ones.data(), s), TS_OK);
    ASSERT_EQ(BI_SetIndexRow(0, 0, 10, zeros.data(), d), TS_OK);
    const RECT r{0, 0, 10, 1};
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&r, s, &r, d, 0, 0)), -1);
    Bytes got(10);
    ASSERT_EQ(BI_GetIndexRow(d, 0, 0, 10, got.data()), TS_OK);
    EXPECT_EQ(got, zeros);
}

TEST_F(DirectEdges, NeitherStorageBitIsRefusedBeforeAnythingOpens) {
    BI_Bitmap *s = Gray8(20, 20, true, 1), *d = Gray8(20, 20, false, 2);
    const RECT r{0, 0, 5, 5};
    const uint8_t keep = s->storage;
    s->storage = 0;
    const int fds = tstest::OpenDescriptorCount();
    th::ResetInjection();
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&r, s, &r, d, 0, 0)), -2);
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&r, d, &r, s, 0, 0)), -2);
    const Bytes mask(64, 0xFF);
    EXPECT_EQ(TS_STATUS(BI_DirectMaskBmp(&r, s, 8, 0, 0, mask.data(), &r, d)), -2);
    EXPECT_EQ(th::FileCallCount(FileCall::Read) + th::FileCallCount(FileCall::Seek), 0);
    EXPECT_EQ(th::AllocationCount(), 0);
    EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
    s->storage = keep;
}

TEST_F(DirectEdges, AnUnsupportedDepthIsRefusedByThePixelMover) {
    BI_Bitmap *s = Gray8(20, 20, false, 1), *d = Gray8(20, 20, true, 2);
    const RECT r{0, 0, 5, 5};
    s->bitsPerPixel = 16;
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&r, s, &r, d, 0, 0)), -2);
    s->bitsPerPixel = 8;
    Bytes row(20);
    ASSERT_EQ(BI_GetGRow(d, 0, 0, 20, row.data()), TS_OK);
    EXPECT_EQ(row[0], 2);
}

TEST_F(DirectEdges, ARectangleOutsideABitmapInMemoryIsRefused) {
    BI_Bitmap *s = Gray8(20, 20, false, 1), *d = Gray8(20, 20, false, 2);
    const RECT in{0, 0, 5, 5}, out{18, 18, 23, 23}, neg{-3, 0, 2, 5};
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&out, s, &in, d, 0, 0)), -1);
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&in, s, &out, d, 0, 0)), -1);
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&neg, s, &in, d, 0, 0)), -1);
    BI_Bitmap *t = Gray8(20, 20, true, 3);
    EXPECT_EQ(TS_STATUS(BI_DirectCopyBmp(&in, t, &out, d, 0, 0)), -1);
    // A tile file takes what lies on its image and ignores the rest.
    EXPECT_EQ(BI_DirectCopyBmp(&in, s, &out, t, 0, 0), TS_OK);
}

// Every allocation of every route, for the copy and the mask.
TEST_F(DirectEdges, AllocationFailuresOnEveryRoute) {
    const RECT r{8180, 1020, 8200, 1030};
    const Bytes mask(64 * 16, 0xA5);
    for (int route = 0; route < 4; ++route)
        for (bool masked : {false, true}) {
            BI_Bitmap *s = Bw(8210, 1040, route & 2, 0x5A);
            BI_Bitmap *d = Bw(8210, 1040, route & 1, 0x0F);
            const int fds = tstest::OpenDescriptorCount();
            const int64_t n = tstest::ForEachAllocationFailure([&](int64_t) {
                const int32_t st = masked ? BI_DirectMaskBmp(&r, s, 64, 3, 0, mask.data(), &r, d)
                                          : BI_DirectCopyBmp(&r, s, &r, d, 0, 0);
                if (th::AllocationFailureHit())
                    EXPECT_EQ(TS_STATUS(st), -5) << route << masked;
                else
                    EXPECT_EQ(st, TS_OK);
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            });
            EXPECT_GE(n, route == 0 ? 0 : 3) << route;
        }
}

// Every read, write and seek: the file layer's status, the walk stopped, no
// descriptor left.
TEST_F(DirectEdges, FileFailuresOnEveryRoute) {
    const RECT r{8180, 1020, 8200, 1030};
    const Bytes mask(64 * 16, 0x5A);
    for (FileCall kind : {FileCall::Read, FileCall::Write, FileCall::Seek})
        for (int route = 1; route < 4; ++route)
            for (bool masked : {false, true}) {
                BI_Bitmap *s = Bw(8210, 1040, route & 2, 0x5A);
                BI_Bitmap *d = Bw(8210, 1040, route & 1, 0x0F);
                const int fds = tstest::OpenDescriptorCount();
                const int64_t n = tstest::ForEachFileFailure(kind, [&](int64_t) {
                    const int32_t st = masked ? BI_DirectMaskBmp(&r, s, 64, 3, 0, mask.data(), &r, d)
                                              : BI_DirectCopyBmp(&r, s, &r, d, 0, 0);
                    if (th::FileFailureHit(kind))
                        EXPECT_EQ(TS_STATUS(st), -50) << route << masked;
                    else
                        EXPECT_EQ(st, TS_OK);
                    EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
                });
                // Tile to memory writes nothing.
                if (kind != FileCall::Write || route != 2) {
                    EXPECT_GT(n, 0) << "kind " << int(kind) << " route " << route << " masked " << masked;
                }
            }
}

}  // namespace
