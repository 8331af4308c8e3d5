// Low-resolution levels against a per-pixel model of point sampling and of
// the averaging table; the progress object; failures at every allocation and
// file call.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <random>
#include <vector>

#include <tessarine/tessarine.h>

#include "platform/test_hooks.h"
#include "storage/low_res.h"
#include "test_support.h"
#include "tile_test_util.h"

namespace {

using tessarine::testing::AllocationFailureHit;
using tessarine::testing::FileCall;
using tessarine::testing::FileFailureHit;
using Bytes = std::vector<uint8_t>;

// Packed rows as the tile file holds them.
struct Pixels {
    int32_t w = 0, h = 0, d = 0;
    Bytes bytes;
    Pixels(int32_t width, int32_t height, int32_t depth)
        : w(width), h(height), d(depth), bytes(static_cast<size_t>(RowBytes() * height) + 1, 0) {}
    int64_t RowBytes() const { return (int64_t{w} * d + 7) / 8; }
    const uint8_t *Row(int64_t y) const { return bytes.data() + y * RowBytes(); }
    // Channel k of pixel (x, y): the value itself below 8 bits, byte k above.
    uint32_t At(int64_t x, int64_t y, int k = 0) const {
        const uint8_t *r = Row(y);
        if (d == 1) return (r[x >> 3] >> (7 - (x & 7))) & 1;
        if (d == 4) return (x & 1) ? r[x >> 1] & 15 : r[x >> 1] >> 4;
        return r[x * (d / 8) + k];
    }
    void Set(int64_t x, int64_t y, uint32_t v, int k = 0) {
        uint8_t *r = bytes.data() + y * RowBytes();
        if (d == 1) {
            const uint8_t bit = static_cast<uint8_t>(0x80 >> (x & 7));
            r[x >> 3] = v ? (r[x >> 3] | bit) : (r[x >> 3] & ~bit);
        } else if (d == 4) {
            uint8_t &b = r[x >> 1];
            b = (x & 1) ? static_cast<uint8_t>((b & 0xF0) | (v & 15)) : static_cast<uint8_t>((b & 0x0F) | (v << 4));
        } else {
            r[x * (d / 8) + k] = static_cast<uint8_t>(v);
        }
    }
    int Channels() const { return d <= 8 ? 1 : d / 8; }
};

Pixels RandomPixels(int32_t w, int32_t h, int32_t d, uint32_t seed) {
    Pixels p(w, h, d);
    std::mt19937 rng(seed);
    for (int64_t i = 0; i < p.RowBytes() * h; ++i) p.bytes[i] = static_cast<uint8_t>(rng());
    return p;
}

// The model of point sampling: steps summed, half added, truncated, limited.
Pixels SampleModel(const Pixels &src, int32_t dw, int32_t dh) {
    Pixels out(dw, dh, src.d);
    const double rowStep = src.h / (dh - 1.0), colStep = src.w / (dw - 1.0);
    double rowAt = 0;
    for (int32_t y = 0; y < dh; ++y, rowAt += rowStep) {
        const int64_t sy = std::min<int64_t>(static_cast<int64_t>(rowAt + 0.5), src.h - 1);
        double colAt = 0;
        for (int32_t x = 0; x < dw; ++x, colAt += colStep) {
            const int64_t sx = std::min<int64_t>(static_cast<int64_t>(colAt + 0.5), src.w - 1);
            for (int k = 0; k < src.Channels(); ++k) out.Set(x, y, src.At(sx, sy, k), k);
        }
    }
    return out;
}

uint32_t AverageOf(int64_t sum, int64_t f) {
    const int64_t n = f * f;
    return static_cast<uint32_t>(std::min<int64_t>(255, (sum + n / 2 + 1) / n));
}

// The model of box averaging over the written size srcW / F by srcH / F.
Pixels AverageModel(const Pixels &src, int32_t dw) {
    const int64_t f = src.w / dw;
    Pixels out(static_cast<int32_t>(src.w / f), static_cast<int32_t>(src.h / f), src.d);
    for (int64_t y = 0; y < out.h; ++y)
        for (int64_t x = 0; x < out.w; ++x)
            for (int k = 0; k < src.Channels(); ++k) {
                int64_t sum = 0;
                for (int64_t r = 0; r < f; ++r)
                    for (int64_t c = 0; c < f; ++c) sum += src.At(x * f + c, y * f + r, k);
                const uint32_t a = AverageOf(sum, f);
                out.Set(x, y, src.d == 1 ? (a != 0) : a, k);
            }
    return out;
}

// A tile file with the source as sub-bitmap 0 and an empty level as 1.
class Level {
  public:
    Level(const Pixels &src, int32_t dw, int32_t dh, uint8_t imageType, uint8_t model = 1,
          int32_t colors = 0)
        : table_(static_cast<size_t>(colors) * 3, 7),
          file_(static_cast<uint8_t>(src.d), src.w, src.h, imageType, model, colors,
                colors ? table_.data() : nullptr),
          dw_(dw), dh_(dh) {
        EXPECT_EQ(file_.Status(), TS_OK);
        const HVT_Box all{0, 0, src.w, src.h};
        EXPECT_EQ(HVT_SaveBlock(0, file_.Info(), &all, static_cast<int32_t>(src.RowBytes()), src.bytes.data()), TS_OK);
        EXPECT_EQ(file_.AddSubbmp(dw, dh), TS_OK);
    }
    HVT_FileInfo *Info() { return file_.Info(); }
    const char *Path() const { return file_.Path(); }
    // The level as the file holds it, through a fresh view of the file.
    Pixels Read(uint8_t sub = 1) {
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        BI_Bitmap view{};
        view.tileFile = -1;
        std::snprintf(view.tilePath, sizeof view.tilePath, "%s", file_.Path());
        EXPECT_EQ(HVT_TileFileBegin(&view, &info, 1), TS_OK);
        Pixels p(info.subbmps[sub].width, info.subbmps[sub].height, info.header->bitsPerPixel);
        const HVT_Box all{0, 0, p.w, p.h};
        EXPECT_EQ(HVT_ReadBlock(sub, &info, &all, static_cast<int32_t>(p.RowBytes()), p.bytes.data()), TS_OK);
        HVT_TileFileEnd(&info, 1);
        return p;
    }

  private:
    Bytes table_;
    tiletest::TileFile file_;
    int32_t dw_, dh_;
};

// Pixels of `got` inside `want`'s size (and the declared level's) compared.
void ExpectPixels(const Pixels &got, const Pixels &want, const char *what) {
    const int32_t w = std::min(got.w, want.w), h = std::min(got.h, want.h);
    int64_t bad = 0;
    for (int32_t y = 0; y < h && bad < 5; ++y)
        for (int32_t x = 0; x < w && bad < 5; ++x)
            for (int k = 0; k < want.Channels(); ++k)
                if (got.At(x, y, k) != want.At(x, y, k)) {
                    ADD_FAILURE() << what << " pixel " << x << "," << y << " channel " << k << ": "
                                  << got.At(x, y, k) << " != " << want.At(x, y, k);
                    ++bad;
                }
}

// A fresh view of the level's file, so that tile tables are loaded again.
class View {
  public:
    explicit View(const char *path) {
        HVT_InitFileInfo(&info_);
        BI_Bitmap view{};
        view.tileFile = -1;
        std::snprintf(view.tilePath, sizeof view.tilePath, "%s", path);
        status_ = HVT_TileFileBegin(&view, &info_, 1);
    }
    ~View() { HVT_TileFileEnd(&info_, 1); }
    int32_t Status() const { return status_; }
    HVT_FileInfo *Info() { return &info_; }

  private:
    HVT_FileInfo info_;
    int32_t status_;
};

class LowRes : public tstest::Sandbox {};

TEST_F(LowRes, SamplingMatchesTheModel) {
    struct Case {
        uint8_t type;
        int d;
        int32_t sw, sh, dw, dh;
    };
    // 1-bit and indexed files are sampled; sizes cross the 1024-row bands
    // and put the last output row and column on the last source ones.
    for (const Case &c : {Case{1, 1, 300, 2100, 37, 700}, Case{3, 4, 201, 1500, 67, 9},
                          Case{3, 8, 97, 3000, 31, 2}, Case{3, 1, 64, 64, 64, 64},
                          Case{2, 1, 50, 40, 17, 13}}) {
        SCOPED_TRACE(testing::Message() << "d " << c.d << " " << c.sw << "x" << c.sh);
        const Pixels src = RandomPixels(c.sw, c.sh, c.d, c.sw + c.d);
        Level level(src, c.dw, c.dh, c.type, 1, c.type == 3 ? (1 << c.d) : 0);
        ASSERT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), TS_OK);
        const Pixels got = level.Read();
        const Pixels want = SampleModel(src, c.dw, c.dh);
        ExpectPixels(got, want, "sample");
        // A level keeps only pixels the source really has: first and last
        // output pixels are the source's corners.
        EXPECT_EQ(got.At(0, 0), src.At(0, 0));
        EXPECT_EQ(got.At(c.dw - 1, c.dh - 1), src.At(c.sw - 1, c.sh - 1));
    }
}

TEST_F(LowRes, SamplingOfWidePixelsThroughTheInternalEntry) {
    for (int d : {8, 24, 32}) {
        const Pixels src = RandomPixels(40, 30, d, d);
        Level level(src, 9, 7, 4, d == 32 ? 2 : 1);
        ASSERT_EQ(tessarine::storage::HVT_UpdateLowResSample(level.Info(), 0, 1, nullptr), TS_OK);
        ExpectPixels(level.Read(), SampleModel(src, 9, 7), "sample wide");
    }
}

TEST_F(LowRes, AveragingMatchesTheModel) {
    struct Case {
        uint8_t type, model;
        int d;
        int32_t sw, sh, dw, dh;
    };
    for (const Case &c : {Case{2, 1, 8, 300, 2100, 150, 1050},   // F = 2, bands of 1024
                          Case{2, 1, 8, 1000, 3100, 300, 1000},  // F = 3: blocks cross band ends
                          Case{2, 1, 4, 333, 70, 111, 20},       // nibbles, odd widths
                          Case{4, 1, 24, 123, 77, 30, 19},       // F = 4
                          Case{4, 2, 32, 70, 50, 7, 5},          // F = 10
                          Case{2, 1, 8, 35, 40, 35, 40},         // F = 1
                          Case{2, 1, 8, 41, 25, 20, 9}}) {       // F = 2 at an odd source width
        SCOPED_TRACE(testing::Message() << "d " << c.d << " " << c.sw << "x" << c.sh << " to "
                                        << c.dw << "x" << c.dh);
        const Pixels src = RandomPixels(c.sw, c.sh, c.d, c.sw * 3 + c.d);
        Level level(src, c.dw, c.dh, c.type, c.model);
        ASSERT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), TS_OK);
        ExpectPixels(level.Read(), AverageModel(src, c.dw), "average");
    }
}

// Wide enough that the level has two tile columns and the source three.
TEST_F(LowRes, AveragingAcrossTileColumns) {
    const Pixels src = RandomPixels(16400, 1030, 8, 99);
    Level level(src, 8200, 515, 2);
    ASSERT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), TS_OK);
    ExpectPixels(level.Read(), AverageModel(src, 8200), "average wide");
}

TEST_F(LowRes, ThousandWideToThreeHundredGivesThreeAndThreeHundredThirtyThreeColumns) {
    const Pixels src = RandomPixels(1000, 12, 8, 5);
    Level level(src, 300, 10, 2);
    const int64_t length = static_cast<int64_t>(tiletest::FileBytes(level.Path()).size());
    ASSERT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), TS_OK);
    const Pixels model = AverageModel(src, 300);
    EXPECT_EQ(model.w, 333);
    EXPECT_EQ(model.h, 4);
    // Column 299 is the block from source column 897, not from 1000 / 300.
    const Pixels got = level.Read();
    ExpectPixels(got, model, "F = 3");
    // The columns past the declared 300 went nowhere: the file keeps its
    // length and its closing byte.
    const Bytes bytes = tiletest::FileBytes(level.Path());
    EXPECT_EQ(static_cast<int64_t>(bytes.size()), length);
    EXPECT_EQ(bytes.back(), '.');
    // Rows 4 to 9 of the level are not written: they still read as the
    // unwritten file reads, zero.
    for (int x = 0; x < 300; ++x) EXPECT_EQ(got.At(x, 9), 0u);
}

TEST_F(LowRes, AveragingTableEntries) {
    // F = 2: sums 0, 1, 4, 5 and 1020 as blocks of one 2 by 2 block each.
    const int sums[] = {0, 1, 4, 5, 1020, 2, 3, 6};
    Pixels src(16, 2, 8);
    for (int i = 0; i < 8; ++i) {
        int s = sums[i];
        for (int k = 0; k < 4; ++k) {
            const int v = std::min(s, 255);
            src.Set(2 * i + (k & 1), k >> 1, static_cast<uint32_t>(v));
            s -= v;
        }
    }
    Level level(src, 8, 1, 2);
    ASSERT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), TS_OK);
    const Pixels got = level.Read();
    const uint32_t want[] = {0, 1, 1, 2, 255, 1, 1, 2};
    for (int i = 0; i < 8; ++i) EXPECT_EQ(got.At(i, 0), want[i]) << "sum " << sums[i];

    // F = 3: the first non-zero entry is A[4].
    Pixels three(9, 3, 8);
    three.Set(0, 0, 3);
    three.Set(3, 0, 4);
    three.Set(6, 2, 255);
    three.Set(7, 2, 255);
    Level level3(three, 3, 1, 2);
    ASSERT_EQ(HVT_UpdateLowRes(level3.Info(), 0, 1, nullptr), TS_OK);
    const Pixels got3 = level3.Read();
    EXPECT_EQ(got3.At(0, 0), 0u);
    EXPECT_EQ(got3.At(1, 0), 1u);
    EXPECT_EQ(got3.At(2, 0), 57u);  // (510 + 4 + 1) / 9
}

TEST_F(LowRes, OneBitAveragingThroughTheInternalEntry) {
    const Pixels src = RandomPixels(67, 45, 1, 3);
    Level level(src, 22, 15, 1);
    ASSERT_EQ(tessarine::storage::HVT_UpdateLowResAverage(level.Info(), 0, 1, nullptr), TS_OK);
    ExpectPixels(level.Read(), AverageModel(src, 22), "average bits");
}

TEST_F(LowRes, OneBitAndIndexedFilesAreNeverAveraged) {
    // A checkerboard averages to grey, but a sampled level keeps 0 and 1.
    Pixels src(64, 64, 8);
    for (int y = 0; y < 64; ++y)
        for (int x = 0; x < 64; ++x) src.Set(x, y, ((x + y) & 1) ? 200 : 10);
    Level level(src, 32, 32, 3, 1, 256);
    ASSERT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), TS_OK);
    const Pixels got = level.Read();
    for (int y = 0; y < 32; ++y)
        for (int x = 0; x < 32; ++x) EXPECT_TRUE(got.At(x, y) == 200 || got.At(x, y) == 10);
    ExpectPixels(got, SampleModel(src, 32, 32), "indexed");
}

TEST_F(LowRes, GuardsRefuseBeforeTouchingAnything) {
    struct Case {
        uint8_t type;
        int d;
        int32_t sw, sh, dw, dh;
    };
    // One output row or column in sampling; F above 100 in averaging.
    for (const Case &c : {Case{1, 1, 50, 50, 10, 1}, Case{1, 1, 50, 50, 1, 10},
                          Case{3, 8, 50, 50, 1, 1}, Case{2, 8, 202, 4, 2, 1}}) {
        const Pixels src = RandomPixels(c.sw, c.sh, c.d, 1);
        Level level(src, c.dw, c.dh, c.type, 1, c.type == 3 ? 256 : 0);
        const Bytes before = tiletest::FileBytes(level.Path());
        const HVT_ProgressOps ops{[](HVT_Progress *, double) -> int32_t { return 1; }};
        HVT_Progress progress{&ops, 1.0, 2.0};
        tessarine::testing::ResetInjection();
        EXPECT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, &progress), -4);
        EXPECT_EQ(tessarine::testing::AllocationCount(), 0);
        EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Read), 0);
        EXPECT_EQ(level.Info()->subbmps[1].tileHdrs, nullptr);
        EXPECT_EQ(tiletest::FileBytes(level.Path()), before);
    }
    // F = 100 is within the bound.
    const Pixels src = RandomPixels(200, 100, 8, 2);
    Level level(src, 2, 1, 2);
    ASSERT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), TS_OK);
    ExpectPixels(level.Read(), AverageModel(src, 2), "F = 100");
    // Sub-bitmaps past the record's ten, and a level that does not exist.
    EXPECT_EQ(HVT_UpdateLowRes(level.Info(), 0, 10, nullptr), -4);
    EXPECT_EQ(HVT_UpdateLowRes(level.Info(), 10, 1, nullptr), -4);
    EXPECT_EQ(HVT_UpdateLowRes(level.Info(), 0, 5, nullptr), -4);
    HVT_FileInfo closed;
    HVT_InitFileInfo(&closed);
    EXPECT_EQ(HVT_UpdateLowRes(&closed, 0, 1, nullptr), -4);
}

TEST_F(LowRes, DepthNotHandledInSamplingGivesMinusTwo) {
    const Pixels src = RandomPixels(16, 16, 8, 4);
    Level level(src, 4, 4, 3, 1, 256);
    level.Info()->header->bitsPerPixel = 2;  // as a hostile file would say
    EXPECT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), -2);
    level.Info()->header->bitsPerPixel = 8;
}

struct Recorder {
    HVT_Progress progress;
    std::vector<double> values;
    int stopAt = -1;  // the call that answers non-zero
};

int32_t Record(HVT_Progress *self, double value) {
    auto *r = reinterpret_cast<Recorder *>(self);
    r->values.push_back(value);
    // The job may move the range while it runs; it is put back at the end.
    self->start += 100;
    self->end += 100;
    return static_cast<int>(r->values.size()) - 1 == r->stopAt ? 1 : 0;
}

const HVT_ProgressOps kRecordOps{Record};

TEST_F(LowRes, ProgressIsCalledAtTenFortySeventyAndRangeRestored) {
    for (bool sample : {false, true}) {
        const Pixels src = RandomPixels(60, 200, 8, 8);
        Level level(src, 30, 100, sample ? 3 : 2, 1, sample ? 256 : 0);
        Recorder rec{{&kRecordOps, 0.25, 0.75}, {}, -1};
        ASSERT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, &rec.progress), TS_OK);
        ASSERT_EQ(rec.values.size(), 3u);  // rows 10, 40, 70 of 100
        // Each value is y * (end - start) / height + start, from the fields as
        // the object holds them at that call.
        EXPECT_DOUBLE_EQ(rec.values[0], 10 * 0.5 / 100 + 0.25);
        EXPECT_DOUBLE_EQ(rec.values[1], 40 * 0.5 / 100 + 100.25);
        EXPECT_DOUBLE_EQ(rec.values[2], 70 * 0.5 / 100 + 200.25);
        EXPECT_EQ(rec.progress.start, 0.25);
        EXPECT_EQ(rec.progress.end, 0.75);
    }
}

TEST_F(LowRes, ProgressStopsTheJobSilently) {
    for (bool sample : {false, true}) {
        // Output bands of 1024 rows: the first is saved before the stop at row 1030.
        const Pixels src = RandomPixels(8, 2200, 8, 9);
        Level level(src, 4, 1100, sample ? 3 : 2, 1, sample ? 256 : 0);
        const int64_t length = static_cast<int64_t>(tiletest::FileBytes(level.Path()).size());
        const int64_t live = tessarine::testing::LiveBlocks();
        Recorder rec{{&kRecordOps, 0, 1}, {}, 34};  // the 35th call: row 10 + 34 * 30 = 1030
        {
            View view(level.Path());
            EXPECT_EQ(HVT_UpdateLowRes(view.Info(), 0, 1, &rec.progress), -18);
        }
        EXPECT_EQ(rec.values.size(), 35u);
        EXPECT_EQ(rec.progress.start, 0);
        EXPECT_EQ(rec.progress.end, 1);
        EXPECT_EQ(tessarine::testing::LiveBlocks(), live);
        // The file is still valid, its first band written, the rest not.
        EXPECT_EQ(static_cast<int64_t>(tiletest::FileBytes(level.Path()).size()), length);
        const Pixels got = level.Read();
        const Pixels want = sample ? SampleModel(src, 4, 1100) : AverageModel(src, 4);
        Pixels firstBand(4, 1024, 8);
        std::memcpy(firstBand.bytes.data(), want.bytes.data(), 4 * 1024);
        ExpectPixels(got, firstBand, "first band");
        for (int x = 0; x < 4; ++x) EXPECT_EQ(got.At(x, 1050), 0u);
    }
}

TEST_F(LowRes, AllocationFailures) {
    for (bool sample : {false, true}) {
        const Pixels src = RandomPixels(50, 40, 8, 10);
        Level level(src, 25, 20, sample ? 3 : 2, 1, sample ? 256 : 0);
        const Pixels want = sample ? SampleModel(src, 25, 20) : AverageModel(src, 25);
        std::vector<int64_t> survived;
        const int64_t made = tstest::ForEachAllocationFailure([&](int64_t n) {
            View view(level.Path());
            if (AllocationFailureHit()) {
                EXPECT_EQ(view.Status(), -5);
                return;
            }
            ASSERT_EQ(view.Status(), TS_OK);
            Recorder rec{{&kRecordOps, 3, 4}, {}, -1};
            const int32_t s = HVT_UpdateLowRes(view.Info(), 0, 1, &rec.progress);
            // A band that cannot be had at 1024 rows is tried at 512: the
            // job then succeeds. The tables and the row buffers have no
            // second try.
            if (s != TS_OK) {
                EXPECT_EQ(s, -5);
            } else if (AllocationFailureHit()) {
                survived.push_back(n);
            }
            EXPECT_EQ(rec.progress.start, 3);
            EXPECT_EQ(rec.progress.end, 4);
        });
        EXPECT_GE(made, sample ? 7 : 8);
        EXPECT_EQ(survived.size(), 2u);  // the input and the output band
        for (int64_t n : survived) {
            tessarine::testing::FailAllocationAt(n);
            {
                View view(level.Path());
                EXPECT_EQ(HVT_UpdateLowRes(view.Info(), 0, 1, nullptr), TS_OK);
            }
            tessarine::testing::ResetInjection();
            ExpectPixels(level.Read(), want, "after a band failure");
        }
        // Every band allocation failing: -5.
        for (int64_t from = 1; from <= (sample ? 2 : 4); ++from) {
            tessarine::testing::FailAllocationsFrom(from);
            EXPECT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), -5);
            tessarine::testing::ResetInjection();
        }
    }
}

TEST_F(LowRes, FileFailures) {
    for (FileCall kind : {FileCall::Read, FileCall::Write, FileCall::Seek}) {
        for (bool sample : {false, true}) {
            // Several bands each way, so that every read and write is a call of its own.
            const Pixels src = RandomPixels(20, 2100, 8, 11);
            Level level(src, 10, 1050, sample ? 3 : 2, 1, sample ? 256 : 0);
            const int64_t length = static_cast<int64_t>(tiletest::FileBytes(level.Path()).size());
            const int fds = tstest::OpenDescriptorCount();
            tstest::ForEachFileFailure(kind, [&](int64_t) {
                int32_t s = 0;
                {
                    View view(level.Path());
                    if (FileFailureHit(kind)) {
                        EXPECT_EQ(view.Status(), -50);
                        return;
                    }
                    ASSERT_EQ(view.Status(), TS_OK);
                    s = HVT_UpdateLowRes(view.Info(), 0, 1, nullptr);
                }
                EXPECT_EQ(s, FileFailureHit(kind) ? -50 : TS_OK);
                EXPECT_EQ(static_cast<int64_t>(tiletest::FileBytes(level.Path()).size()), length);
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            });
        }
    }
}

TEST_F(LowRes, LevelFromALevel) {
    const Pixels src = RandomPixels(64, 48, 24, 12);
    Level level(src, 32, 24, 4);
    HVT_FileHeader header = *level.Info()->header;
    ASSERT_EQ(HVT_UpdateLowRes(level.Info(), 0, 1, nullptr), TS_OK);
    // A third sub-bitmap, filled from the second.
    int32_t fd = -1;
    ASSERT_EQ(FM_Open(level.Path(), 2, &fd), TS_OK);
    uint8_t sub = 0;
    ASSERT_EQ(HVT_AddSubbmp(fd, &header, 8, 6, nullptr, &sub), TS_OK);
    ASSERT_EQ(sub, 2);
    FM_Close(fd);
    {
        View view(level.Path());
        ASSERT_EQ(view.Status(), TS_OK);
        ASSERT_EQ(HVT_UpdateLowRes(view.Info(), 1, 2, nullptr), TS_OK);
    }
    const Pixels second = level.Read(1);
    ExpectPixels(level.Read(2), AverageModel(second, 8), "level of a level");
}

}  // namespace
