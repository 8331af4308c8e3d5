// A band session reads the whole band that holds a row on a miss, with one
// HVT_ReadBlock at the band's stride, whatever the session's flags; rows of
// that band come from the buffer until another band replaces it. Wide images,
// so that a band is many tiles and many megabytes.
#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <vector>

#include <tessarine/tessarine.h>

#include "platform/test_hooks.h"
#include "test_support.h"

namespace {

using tessarine::testing::FileCall;
using tessarine::testing::FileCallCount;
using tessarine::testing::FileFailureHit;
using tessarine::testing::LiveBlocks;
using tessarine::testing::ResetInjection;
using Bytes = std::vector<uint8_t>;

uint8_t Value(int32_t y, int64_t x) { return static_cast<uint8_t>(x * 7 + y * 13 + (x >> 9)); }

struct Calls {
    int64_t reads, seeks;
    bool operator==(const Calls &o) const { return reads == o.reads && seeks == o.seeks; }
};
Calls Counted() { return {FileCallCount(FileCall::Read), FileCallCount(FileCall::Seek)}; }

std::vector<int32_t> Order(int kind, int32_t first, int32_t end, int count, uint32_t seed) {
    std::vector<int32_t> ys;
    if (kind == 0)
        for (int32_t y = first; y < end; ++y) ys.push_back(y);
    else if (kind == 1)
        for (int32_t y = end - 1; y >= first; --y) ys.push_back(y);
    else {
        std::mt19937 rng(seed);
        for (int i = 0; i < count; ++i) ys.push_back(std::uniform_int_distribution<int32_t>(first, end - 1)(rng));
    }
    return ys;
}

class BandSession : public tstest::Sandbox {
  protected:
    void TearDown() override {
        if (bitmap_ != nullptr) {
            HVT_TileFileRowColIOEnd(bitmap_);
            BI_DeleteBitmap(&bitmap_);
        }
        tstest::Sandbox::TearDown();
    }
    // A tile-backed bitmap whose rows in [top, bottom) hold Value, written in
    // bands through a record of its own; other rows are left unwritten.
    void Make(uint8_t type, uint8_t bpp, int32_t width, int32_t height, int32_t top, int32_t bottom) {
        ASSERT_EQ(BI_CreateBlankBmp(type, bpp, width, height, 300, 300, 1, 0, nullptr, &bitmap_, 2, 0, 0, 0),
                  TS_OK);
        rowBytes_ = int64_t{width} * bpp / 8;
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        ASSERT_EQ(HVT_TileFileBegin(bitmap_, &info, 0), TS_OK);
        Bytes chunk(rowBytes_ * 64);
        for (int32_t y = top; y < bottom; y += 64) {
            const int32_t end = std::min(bottom, y + 64);
            for (int32_t r = y; r < end; ++r)
                for (int64_t x = 0; x < rowBytes_; ++x) chunk[(r - y) * rowBytes_ + x] = Value(r, x);
            const HVT_Box box{0, y, width, end};
            ASSERT_EQ(HVT_SaveBlock(0, &info, &box, static_cast<int32_t>(rowBytes_), chunk.data()), TS_OK);
        }
        HVT_TileFileEnd(&info, 0);
    }
    // What one HVT_ReadBlock of a band costs in file calls, on a record of its own.
    Calls OneBandRead(const HVT_Box &band, int32_t stride) {
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        EXPECT_EQ(HVT_TileFileBegin(bitmap_, &info, 0), TS_OK);
        EXPECT_EQ(HVT_GetSubbmpTileHdrs(0, &info), TS_OK);
        Bytes buffer(static_cast<size_t>(stride) * (band.bottom - band.top));
        ResetInjection();
        EXPECT_EQ(HVT_ReadBlock(0, &info, &band, stride, buffer.data()), TS_OK);
        const Calls c = Counted();
        HVT_TileFileEnd(&info, 0);
        ResetInjection();
        return c;
    }
    // Reads row y's bytes in the session and checks a spread of them.
    void ExpectRow(int32_t y, bool written = true) {
        row_.resize(rowBytes_);
        int32_t s;
        if (bitmap_->bitsPerPixel == 24)
            s = BI_GetRGBRowInterlace(bitmap_, y, 0, bitmap_->width, row_.data());
        else
            s = BI_GetIndexRow(bitmap_, y, 0, bitmap_->width, row_.data());
        ASSERT_EQ(s, TS_OK) << y;
        if (!written) return;
        for (int64_t x = 0; x < rowBytes_; x += 997) ASSERT_EQ(row_[x], Value(y, x)) << y << " " << x;
        ASSERT_EQ(row_[rowBytes_ - 1], Value(y, rowBytes_ - 1)) << y;
    }
    const HVT_FileInfo &S() const { return *bitmap_->ioSession; }
    BI_Bitmap *bitmap_ = nullptr;
    int64_t rowBytes_ = 0;
    Bytes row_;
};

// The 39999 by 3000 8-bit example: bands of 512 rows of 40000 bytes.
TEST_F(BandSession, ReadingRowZeroReadsTheWholeBand) {
    Make(3, 8, 39999, 3000, 0, 3000);
    for (uint8_t flags : {1, 3}) {
        ASSERT_EQ(HVT_TileFileRowIOBegin(flags, bitmap_, nullptr, 2, 0, 0), TS_OK);
        ASSERT_EQ(S().bandRows, 512);
        ASSERT_EQ(S().bandRowBytes, 40000);
        ExpectRow(0);  // loads the tile table first
        HVT_TileFileRowColIOEnd(bitmap_);
        ASSERT_EQ(HVT_TileFileRowIOBegin(flags, bitmap_, nullptr, 2, 0, 0), TS_OK);
        const HVT_Box band{0, 0, 39999, 512};
        const Calls one = OneBandRead(band, 40000);
        ASSERT_EQ(HVT_GetSubbmpTileHdrs(0, bitmap_->ioSession), TS_OK);
        ResetInjection();
        ExpectRow(0);
        EXPECT_EQ(Counted(), one) << int(flags);
        EXPECT_EQ(S().readBox.top, 0);
        EXPECT_EQ(S().readBox.bottom, 512);
        ResetInjection();
        for (int32_t y : {1, 255, 511, 300, 0}) ExpectRow(y);
        EXPECT_EQ(FileCallCount(FileCall::Read), 0) << int(flags);
        EXPECT_EQ(FileCallCount(FileCall::Seek), 0) << int(flags);
        HVT_TileFileRowColIOEnd(bitmap_);
    }
}

// A pixel changed in the file after its band was read is not seen until the
// band is read again.
TEST_F(BandSession, AChangeToTheFileWaitsForTheNextBandRead) {
    Make(3, 8, 39999, 3000, 0, 1024);
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, bitmap_, nullptr, 2, 0, 0), TS_OK);
    ExpectRow(0);
    {
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        ASSERT_EQ(HVT_TileFileBegin(bitmap_, &info, 0), TS_OK);
        const HVT_Box pixel{20000, 300, 20001, 301};
        const uint8_t v = static_cast<uint8_t>(Value(300, 20000) ^ 0xFF);
        ASSERT_EQ(HVT_SaveBlock(0, &info, &pixel, 0, &v), TS_OK);
        HVT_TileFileEnd(&info, 0);
    }
    uint8_t got = 0;
    ASSERT_EQ(BI_GetIndexRow(bitmap_, 300, 20000, 1, &got), TS_OK);
    EXPECT_EQ(got, Value(300, 20000));
    ASSERT_EQ(BI_GetIndexRow(bitmap_, 512, 20000, 1, &got), TS_OK);  // the next band
    ASSERT_EQ(BI_GetIndexRow(bitmap_, 300, 20000, 1, &got), TS_OK);  // read again
    EXPECT_EQ(got, static_cast<uint8_t>(Value(300, 20000) ^ 0xFF));
}

// Forward, backward and in random order, in both band modes and with both
// read flags: one band read per miss, and every row as the file holds it.
TEST_F(BandSession, EveryOrderReadsOneBandPerMiss) {
    Make(3, 8, 39999, 3000, 0, 3000);
    const Calls full = OneBandRead({0, 0, 39999, 512}, 40000);
    const Calls last = OneBandRead({0, 2560, 39999, 3000}, 40000);
    for (uint8_t mode : {2, 3}) {
        for (uint8_t flags : {1, 3}) {
            for (int kind = 0; kind < 3; ++kind) {
                if (kind == 2 && mode != (flags == 1 ? 2 : 3)) continue;  // random order twice
                ASSERT_EQ(HVT_TileFileRowIOBegin(flags, bitmap_, nullptr, mode, 0, 0), TS_OK);
                ASSERT_EQ(HVT_GetSubbmpTileHdrs(0, bitmap_->ioSession), TS_OK);
                ResetInjection();
                Calls expected{0, 0};
                int32_t held = -1;
                for (int32_t y : Order(kind, 0, 3000, 40, 77u + mode)) {
                    if (y / 512 != held) {
                        held = y / 512;
                        const Calls c = held == 5 ? last : full;
                        expected.reads += c.reads;
                        expected.seeks += c.seeks;
                    }
                    ExpectRow(y);
                    ASSERT_EQ(S().readBox.top, held * 512);
                    ASSERT_EQ(S().readBox.bottom, std::min(3000, held * 512 + 512));
                }
                EXPECT_EQ(Counted(), expected) << int(mode) << " " << int(flags) << " " << kind;
                HVT_TileFileRowColIOEnd(bitmap_);
            }
        }
    }
}

// 16384 by 16384 at 24 bits: bands of 512 rows of 49153 bytes, two tiles
// across. Only the bands the test reads are written.
TEST_F(BandSession, SixteenThousandSquareAt24Bits) {
    Make(4, 24, 16384, 16384, 0, 1536);
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, bitmap_, nullptr, 2, 0, 0), TS_OK);
    ASSERT_EQ(S().bandRows, 512);
    ASSERT_EQ(S().bandRowBytes, 49153);
    const Calls one = OneBandRead({0, 0, 16384, 512}, 49153);
    ASSERT_EQ(HVT_GetSubbmpTileHdrs(0, bitmap_->ioSession), TS_OK);
    for (int kind = 0; kind < 3; ++kind) {
        ResetInjection();
        int64_t misses = 0;
        int32_t held = S().readBox.top < 0 ? -1 : S().readBox.top / 512;
        for (int32_t y : Order(kind, 0, 1536, 12, 5u)) {
            if (y / 512 != held) {
                held = y / 512;
                ++misses;
            }
            ExpectRow(y);
        }
        EXPECT_EQ(FileCallCount(FileCall::Read), misses * one.reads) << kind;
        EXPECT_EQ(FileCallCount(FileCall::Seek), misses * one.seeks) << kind;
    }
    // The last band, unwritten: read once for all its rows.
    ResetInjection();
    for (int32_t y = 16383; y >= 15872; y -= 37) ExpectRow(y, false);
    EXPECT_EQ(FileCallCount(FileCall::Read), one.reads);
    HVT_TileFileRowColIOEnd(bitmap_);
}

// A band read that fails at any of its reads or seeks gives -50, drops the
// band, leaks nothing and leaves no descriptor; the next read tries again.
TEST_F(BandSession, AFailedBandReadDropsTheBand) {
    Make(3, 8, 39999, 1100, 0, 1100);
    const Calls one = OneBandRead({0, 512, 39999, 1024}, 40000);
    for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
        const int64_t calls = kind == FileCall::Read ? one.reads : one.seeks;
        ASSERT_GE(calls, 1);
        for (int64_t n = 1; n <= calls; ++n) {
            ASSERT_EQ(HVT_TileFileRowIOBegin(1, bitmap_, nullptr, 2, 0, 0), TS_OK);
            ExpectRow(0);
            const int64_t live = LiveBlocks();
            const int fds = tstest::OpenDescriptorCount();
            ResetInjection();
            tessarine::testing::FailFileCallAt(kind, n);
            Bytes out(39999, 0xEE);
            EXPECT_EQ(BI_GetIndexRow(bitmap_, 600, 0, 39999, out.data()), -50) << n;
            EXPECT_TRUE(FileFailureHit(kind));
            EXPECT_EQ(out, Bytes(39999, 0xEE));
            EXPECT_EQ(S().readBox.top, -1);
            EXPECT_EQ(S().readBox.bottom, -1);
            ResetInjection();
            EXPECT_EQ(LiveBlocks(), live);
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            ExpectRow(600);
            ExpectRow(0);
            HVT_TileFileRowColIOEnd(bitmap_);
        }
    }
}

// The first band read of a session loads the tile table: an allocation
// failure there gives -5 and leaves the session as it was.
TEST_F(BandSession, AFailedTableAllocationOnTheFirstBand) {
    Make(3, 8, 39999, 1100, 0, 1100);
    tstest::ForEachAllocationFailure([&](int64_t) {
        const int32_t begun = HVT_TileFileRowIOBegin(1, bitmap_, nullptr, 2, 0, 0);
        if (begun != TS_OK) {
            EXPECT_EQ(begun, -5);
            EXPECT_EQ(bitmap_->ioSession, nullptr);
            return;
        }
        Bytes out(39999, 0xEE);
        const int32_t s = BI_GetIndexRow(bitmap_, 700, 0, 39999, out.data());
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(s, -5);
            EXPECT_EQ(out, Bytes(39999, 0xEE));
            EXPECT_EQ(S().readBox.top, -1);
        } else {
            EXPECT_EQ(s, TS_OK);
        }
        HVT_TileFileRowColIOEnd(bitmap_);
    });
}

}  // namespace
