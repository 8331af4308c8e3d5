// The row ring between the image thread and the caller: every row arrives
// once and in order, handed over in place or copied, whether the ring runs
// full, runs dry or holds fewer rows than a batch; a failure on either side
// reaches the caller; giving up early never hangs.
#include <chrono>
#include <cstring>
#include <memory>
#include <thread>

#include "cli_test_support.h"
#include "failure.h"
#include "row_pipeline.h"

namespace clitest {
namespace {

using tessarine::cli::Failure;
using tessarine::cli::PixelKind;
using tessarine::cli::RasterReader;
using tessarine::cli::RasterWriter;
using tessarine::cli::ReadAhead;
using tessarine::cli::WriteBehind;

uint8_t Sample(int32_t y, size_t x) { return uint8_t(y * 7 + x * 13); }

// Gray rows of a known pattern; fails at row `failAt` when it is set, and
// naps now and then so that the caller finds the ring empty.
class PatternReader final : public RasterReader {
  public:
    PatternReader(int32_t width, int32_t height, int32_t failAt = -1, int32_t napEvery = 0)
        : failAt_(failAt), napEvery_(napEvery) {
        format_.width = width;
        format_.height = height;
        format_.kind = PixelKind::Gray;
    }
    void ReadRow(uint8_t *row) override {
        if (next_ == failAt_) throw Failure("pattern", "row " + std::to_string(next_));
        if (napEvery_ > 0 && next_ % napEvery_ == 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
        for (size_t x = 0; x < size_t(format_.width); ++x) row[x] = Sample(next_, x);
        ++next_;
    }

  private:
    int32_t next_ = 0, failAt_, napEvery_;
};

// Keeps what it is given; fails at row `failAt` when it is set.
class KeepingWriter final : public RasterWriter {
  public:
    KeepingWriter(size_t rowBytes, std::vector<std::vector<uint8_t>> *rows, bool *finished, int32_t failAt = -1)
        : rowBytes_(rowBytes), rows_(rows), finished_(finished), failAt_(failAt) {}
    void WriteRow(const uint8_t *row) override {
        if (int32_t(rows_->size()) == failAt_) throw Failure("kept", "row " + std::to_string(failAt_));
        rows_->emplace_back(row, row + rowBytes_);
    }
    void Finish() override { *finished_ = true; }

  private:
    size_t rowBytes_;
    std::vector<std::vector<uint8_t>> *rows_;
    bool *finished_;
    int32_t failAt_;
};

void ExpectPatternRow(const uint8_t *row, int32_t y, int32_t width) {
    for (size_t x = 0; x < size_t(width); ++x)
        ASSERT_EQ(row[x], Sample(y, x)) << "row " << y << ", x " << x;
}

void ExpectAllRowsInPlace(int32_t width, int32_t height, int32_t napEvery = 0) {
    auto reader = ReadAhead(std::make_unique<PatternReader>(width, height, -1, napEvery));
    ASSERT_EQ(reader->Format().width, width);
    for (int32_t y = 0; y < height; ++y) ASSERT_NO_FATAL_FAILURE(ExpectPatternRow(reader->NextRow(), y, width));
    EXPECT_THROW(reader->NextRow(), std::logic_error);
}

TEST(RowPipeline, NarrowRowsGoRoundTheRingManyTimes) { ExpectAllRowsInPlace(100, 5000); }

// Wide rows leave only a few slots: the ring is full and empty in turn.
TEST(RowPipeline, WideRowsThroughAFewSlots) { ExpectAllRowsInPlace(1 << 20, 30); }

TEST(RowPipeline, FewerRowsThanABatch) {
    ExpectAllRowsInPlace(64, 1);
    ExpectAllRowsInPlace(64, 3);
    ExpectAllRowsInPlace(64, 0);
}

TEST(RowPipeline, ReaderSlowerThanTheCaller) { ExpectAllRowsInPlace(5000, 700, 50); }

TEST(RowPipeline, CallerSlowerThanTheReader) {
    auto reader = ReadAhead(std::make_unique<PatternReader>(3000, 2000));
    for (int32_t y = 0; y < 2000; ++y) {
        if (y % 300 == 0) std::this_thread::sleep_for(std::chrono::milliseconds(3));
        ASSERT_NO_FATAL_FAILURE(ExpectPatternRow(reader->NextRow(), y, 3000));
    }
}

TEST(RowPipeline, ReadRowCopiesAndMixesWithNextRow) {
    auto reader = ReadAhead(std::make_unique<PatternReader>(300, 900));
    std::vector<uint8_t> row(300);
    for (int32_t y = 0; y < 900; ++y) {
        if (y % 3 == 0) {
            reader->ReadRow(row.data());
            ASSERT_NO_FATAL_FAILURE(ExpectPatternRow(row.data(), y, 300));
        } else {
            ASSERT_NO_FATAL_FAILURE(ExpectPatternRow(reader->NextRow(), y, 300));
        }
    }
}

TEST(RowPipeline, ReaderFailureReachesTheCaller) {
    auto reader = ReadAhead(std::make_unique<PatternReader>(200, 5000, 1234));
    try {
        for (int32_t y = 0;; ++y) {
            const uint8_t *row = reader->NextRow();
            ASSERT_LT(y, 1234);
            ASSERT_NO_FATAL_FAILURE(ExpectPatternRow(row, y, 200));
        }
    } catch (const Failure &failure) {
        EXPECT_STREQ(failure.what(), "pattern: row 1234");
    }
}

TEST(RowPipeline, GivingUpEarlyDoesNotHang) {
    for (int32_t taken : {0, 1, 700}) {
        auto reader = ReadAhead(std::make_unique<PatternReader>(5000, 100000));
        for (int32_t y = 0; y < taken; ++y) reader->NextRow();
        std::this_thread::sleep_for(std::chrono::milliseconds(5)); // the ring fills up
        reader.reset();
    }
}

TEST(RowPipeline, WritesInPlaceAndCopiedArriveInOrder) {
    constexpr size_t kBytes = 2500;
    constexpr int32_t kRows = 6000;
    std::vector<std::vector<uint8_t>> kept;
    bool finished = false;
    {
        auto writer = WriteBehind(std::make_unique<KeepingWriter>(kBytes, &kept, &finished), kBytes);
        std::vector<uint8_t> own(kBytes);
        for (int32_t y = 0; y < kRows; ++y) {
            // In place, in place asked twice, copied from the caller's buffer,
            // and copied over a slot that was asked for and left unused.
            const int way = y % 4;
            uint8_t *row = way == 2 ? own.data() : writer->NextSlot();
            if (way == 1) {
                ASSERT_EQ(writer->NextSlot(), row);
            }
            if (way == 3) row = own.data();
            for (size_t x = 0; x < kBytes; ++x) row[x] = Sample(y, x);
            if (y % 1000 == 0) std::this_thread::sleep_for(std::chrono::milliseconds(2)); // the ring runs dry
            writer->WriteRow(row);
        }
        writer->Finish();
    }
    EXPECT_TRUE(finished);
    ASSERT_EQ(kept.size(), size_t(kRows));
    for (int32_t y = 0; y < kRows; ++y) ASSERT_NO_FATAL_FAILURE(ExpectPatternRow(kept[size_t(y)].data(), y, int32_t(kBytes)));
}

TEST(RowPipeline, WriterFailureReachesTheCaller) {
    constexpr size_t kBytes = 1000;
    std::vector<std::vector<uint8_t>> kept;
    bool finished = false;
    auto writer = WriteBehind(std::make_unique<KeepingWriter>(kBytes, &kept, &finished, 4321), kBytes);
    try {
        for (int32_t y = 0; y < 100000; ++y) {
            uint8_t *row = writer->NextSlot();
            std::memset(row, 0, kBytes);
            writer->WriteRow(row);
        }
        writer->Finish();
        ADD_FAILURE() << "no failure";
    } catch (const Failure &failure) {
        EXPECT_STREQ(failure.what(), "kept: row 4321");
    }
    EXPECT_FALSE(finished);
    EXPECT_EQ(kept.size(), 4321u);
}

TEST(RowPipeline, WriterFailureAtTheLastRowsReachesFinish) {
    std::vector<std::vector<uint8_t>> kept;
    bool finished = false;
    auto writer = WriteBehind(std::make_unique<KeepingWriter>(10, &kept, &finished, 2), 10);
    uint8_t row[10] = {};
    for (int i = 0; i < 3; ++i) writer->WriteRow(row);
    EXPECT_THROW(writer->Finish(), Failure);
    EXPECT_FALSE(finished);
}

TEST(RowPipeline, WriterDroppedWithoutFinishDoesNotHang) {
    std::vector<std::vector<uint8_t>> kept;
    bool finished = false;
    {
        auto writer = WriteBehind(std::make_unique<KeepingWriter>(100, &kept, &finished), 100);
        for (int32_t y = 0; y < 5000; ++y) {
            uint8_t *row = writer->NextSlot();
            std::memset(row, 1, 100);
            writer->WriteRow(row);
        }
        writer->NextSlot();
    }
    EXPECT_FALSE(finished);
    EXPECT_LE(kept.size(), 5000u);
}

}  // namespace
}  // namespace clitest
