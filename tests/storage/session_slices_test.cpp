// A band of a read-only session comes from the file a slice at a time, as its
// rows are first asked for. Whatever the order of the reads, the rows are the
// ones a whole-band read gives, and the file is read no more than once per
// row of a band.
#include <gtest/gtest.h>

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

// 8-bit gray rows of 70001 band bytes: with budget 0 a band is 256 rows
// (33554432 / 70001 = 479), read in slices of 8 rows (8 * 70001 <= 1 MiB).
constexpr int32_t kWidth = 70000;
constexpr int32_t kHeight = 600;
constexpr int32_t kBand = 256;
constexpr int32_t kSlice = 8;

uint8_t Value(int32_t y, int32_t x) { return static_cast<uint8_t>(x * 7 + y * 13 + (x >> 9)); }

class BandSlices : public tstest::Sandbox {
  protected:
    void SetUp() override {
        tstest::Sandbox::SetUp();
        ASSERT_EQ(BI_CreateBlankBmp(2, 8, kWidth, kHeight, 300, 300, 1, 0, nullptr, &bitmap_, 2,
                                    0, 0, 0),
                  TS_OK);
        ASSERT_EQ(HVT_TileFileRowIOBegin(2, bitmap_, nullptr, 2, 0, 0), TS_OK);
        Bytes row(kWidth);
        for (int32_t y = 0; y < kHeight; ++y) {
            for (int32_t x = 0; x < kWidth; ++x) row[x] = Value(y, x);
            ASSERT_EQ(BI_SetGRow(y, 0, kWidth, row.data(), bitmap_), TS_OK);
        }
        HVT_TileFileRowColIOEnd(bitmap_);
    }
    void TearDown() override {
        HVT_TileFileRowColIOEnd(bitmap_);
        BI_DeleteBitmap(&bitmap_);
        tstest::Sandbox::TearDown();
    }
    // Reads row y whole in the session and checks every pixel.
    void ExpectRow(int32_t y) {
        Bytes row(kWidth);
        ASSERT_EQ(BI_GetGRow(bitmap_, y, 0, kWidth, row.data()), TS_OK) << y;
        for (int32_t x = 0; x < kWidth; ++x) ASSERT_EQ(row[x], Value(y, x)) << y << " " << x;
    }
    const HVT_FileInfo &S() const { return *bitmap_->ioSession; }
    BI_Bitmap *bitmap_ = nullptr;
};

TEST_F(BandSlices, TheRunReadSoFarGrowsBySlices) {
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, bitmap_, nullptr, 2, 0, 0), TS_OK);
    ASSERT_EQ(S().bandRows, kBand);
    ExpectRow(0);
    EXPECT_EQ(S().readBox.top, 0);
    EXPECT_EQ(S().readBox.bottom, kBand);  // the band is what the session holds
    EXPECT_EQ(S().bandReadTop, 0);
    EXPECT_EQ(S().bandReadBottom, kSlice);
    ExpectRow(20);  // the slices between come with it
    EXPECT_EQ(S().bandReadBottom, 24);
    ExpectRow(5);
    EXPECT_EQ(S().bandReadBottom, 24);
    ExpectRow(kBand - 1);
    EXPECT_EQ(S().bandReadTop, 0);
    EXPECT_EQ(S().bandReadBottom, kBand);
    // Upwards through the next band.
    ExpectRow(2 * kBand - 1);
    EXPECT_EQ(S().readBox.top, kBand);
    EXPECT_EQ(S().bandReadTop, 2 * kBand - kSlice);
    EXPECT_EQ(S().bandReadBottom, 2 * kBand);
    ExpectRow(300);
    EXPECT_EQ(S().bandReadTop, 296);
    EXPECT_EQ(S().bandReadBottom, 2 * kBand);
    // The last band is cut by the image, and so is its last slice.
    ExpectRow(kHeight - 1);
    EXPECT_EQ(S().readBox.top, 2 * kBand);
    EXPECT_EQ(S().readBox.bottom, kHeight);
    EXPECT_EQ(S().bandReadTop, 592);
    EXPECT_EQ(S().bandReadBottom, kHeight);
}

TEST_F(BandSlices, RowsZeroOneTwoReadTheFileOnce) {
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, bitmap_, nullptr, 2, 0, 0), TS_OK);
    ExpectRow(0);
    ResetInjection();
    ExpectRow(1);
    ExpectRow(2);
    EXPECT_EQ(FileCallCount(FileCall::Read), 0);
    // Rows read once stay held while the band does.
    ExpectRow(kBand - 1);
    const int64_t rest = FileCallCount(FileCall::Read);
    EXPECT_GE(rest, 1);
    for (int32_t y : {kBand - 2, 100, 3, 0}) ExpectRow(y);
    EXPECT_EQ(FileCallCount(FileCall::Read), rest);
}

TEST_F(BandSlices, EveryOrderGivesTheRowsOfTheFile) {
    std::vector<int32_t> orders[3];
    for (int32_t y = 0; y < kHeight; ++y) orders[0].push_back(y);
    for (int32_t y = kHeight - 1; y >= 0; --y) orders[1].push_back(y);
    uint32_t seed = 12345;
    for (int i = 0; i < 200; ++i) {
        seed = seed * 1103515245u + 12345u;
        orders[2].push_back(static_cast<int32_t>((seed >> 8) % kHeight));
    }
    for (uint8_t flags : {1, 3}) {
        for (const auto &order : orders) {
            ASSERT_EQ(HVT_TileFileRowIOBegin(flags, bitmap_, nullptr, 2, 0, 0), TS_OK);
            for (int32_t y : order) {
                ExpectRow(y);
                // A session that also writes reads its bands whole.
                if (flags == 3) {
                    EXPECT_EQ(S().bandReadTop, S().readBox.top);
                    EXPECT_EQ(S().bandReadBottom, S().readBox.bottom);
                }
            }
            HVT_TileFileRowColIOEnd(bitmap_);
        }
    }
}

TEST_F(BandSlices, PartsOfRowsAcrossTiles) {
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, bitmap_, nullptr, 2, 0, 0), TS_OK);
    for (int32_t y : {40, 13, 200, 399, 257}) {
        for (int32_t x : {0, 8191, 8192, 30000, kWidth - 5}) {
            uint8_t run[5];
            ASSERT_EQ(BI_GetGRow(bitmap_, y, x, 5, run), TS_OK);
            for (int k = 0; k < 5; ++k) ASSERT_EQ(run[k], Value(y, x + k)) << y << " " << x;
        }
    }
}

// A slice that fails to come in, at any of its calls, drops the whole band;
// the next read of the row tries again.
TEST_F(BandSlices, AFailedSliceDropsTheBand) {
    for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
        ASSERT_EQ(HVT_TileFileRowIOBegin(1, bitmap_, nullptr, 2, 0, 0), TS_OK);
        ExpectRow(0);
        ResetInjection();
        ExpectRow(100);
        const int64_t calls = FileCallCount(kind);
        ASSERT_GE(calls, 1);
        HVT_TileFileRowColIOEnd(bitmap_);
        for (int64_t n = 1; n <= calls; ++n) {
            ASSERT_EQ(HVT_TileFileRowIOBegin(1, bitmap_, nullptr, 2, 0, 0), TS_OK);
            ExpectRow(0);
            const int64_t live = LiveBlocks();
            const int fds = tstest::OpenDescriptorCount();
            ResetInjection();
            tessarine::testing::FailFileCallAt(kind, n);
            Bytes out(kWidth, 0xEE);
            EXPECT_EQ(BI_GetGRow(bitmap_, 100, 0, kWidth, out.data()), -50) << n;
            EXPECT_TRUE(FileFailureHit(kind));
            EXPECT_EQ(out, Bytes(kWidth, 0xEE));
            EXPECT_EQ(S().readBox.top, -1);
            EXPECT_EQ(S().readBox.bottom, -1);
            ResetInjection();
            ExpectRow(100);
            ExpectRow(0);
            EXPECT_EQ(LiveBlocks(), live);
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            HVT_TileFileRowColIOEnd(bitmap_);
        }
    }
}

}  // namespace
