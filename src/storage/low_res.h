// Low-resolution levels: one sub-bitmap of a tile file filled from another,
// by point sampling or by box averaging, and the band loop both share.
#pragma once

#include <cstdint>

#include <tessarine/storage.h>

namespace tessarine::storage {

// The two methods; HVT_UpdateLowRes chooses by the file's layout.
int32_t HVT_UpdateLowResSample(HVT_FileInfo *info, uint8_t source, uint8_t destination,
                               HVT_Progress *progress);
int32_t HVT_UpdateLowResAverage(HVT_FileInfo *info, uint8_t source, uint8_t destination,
                                HVT_Progress *progress);

// A band buffer of up to 1024 rows of `stride` bytes, zero-filled: on a
// failed allocation the rows are halved, and the attempt gives up with -5
// when they come down to `giveUpRows`. Freed with the object.
class LevelBand {
  public:
    LevelBand() = default;
    ~LevelBand();
    LevelBand(const LevelBand &) = delete;
    LevelBand &operator=(const LevelBand &) = delete;
    int32_t Allocate(int64_t stride, int64_t giveUpRows);
    uint8_t *Bytes() const { return bytes_; }
    int64_t Rows() const { return rows_; }

  private:
    uint8_t *bytes_ = nullptr;
    int64_t rows_ = 0;
};

// A zero-filled block of the library heap, freed with the object.
class LevelBlock {
  public:
    LevelBlock() = default;
    ~LevelBlock();
    LevelBlock(const LevelBlock &) = delete;
    LevelBlock &operator=(const LevelBlock &) = delete;
    // False when the block cannot be had.
    bool Allocate(int64_t bytes);
    uint8_t *Bytes() const { return bytes_; }

  private:
    uint8_t *bytes_ = nullptr;
};

// Reads the source in consecutive whole-width bands of `rows` rows, from the
// top, into `buffer` at `stride`.
class SourceBands {
  public:
    SourceBands(HVT_FileInfo *info, uint8_t sub, uint8_t *buffer, int64_t stride, int64_t rows,
                int32_t width, int32_t height)
        : info_(info), sub_(sub), buffer_(buffer), stride_(stride), rows_(rows), width_(width),
          height_(height) {}
    // Reads forward band by band until row y is held.
    int32_t Reach(int64_t y);
    bool Holds(int64_t y) const { return y >= top_ && y < bottom_; }
    const uint8_t *Row(int64_t y) const { return buffer_ + (y - top_) * stride_; }

  private:
    HVT_FileInfo *info_;
    uint8_t sub_;
    uint8_t *buffer_;
    int64_t stride_;
    int64_t rows_;
    int32_t width_;
    int32_t height_;
    int64_t top_ = 0;
    int64_t bottom_ = 0;
};

// The output side of a level: `rowCount` rows of `width` pixels made one at a
// time by `makeRow(y, row)` into a band of `band.Rows()` rows (at most
// `rowCount`), each full band saved to the destination, the progress object
// asked before every row y with y mod 30 equal to 10.
class LevelWriter {
  public:
    LevelWriter(HVT_FileInfo *info, uint8_t sub, HVT_Progress *progress, int32_t progressHeight,
                uint8_t *band, int64_t bandRows, int64_t stride, int32_t width, int32_t rowCount)
        : info_(info), sub_(sub), progress_(progress), progressHeight_(progressHeight),
          band_(band), bandRows_(bandRows < rowCount ? bandRows : rowCount), stride_(stride),
          width_(width), rowCount_(rowCount) {}

    template <class MakeRow>
    int32_t Run(MakeRow &&makeRow) {
        int64_t top = 0;
        int64_t bottom = bandRows_;
        for (int64_t y = 0; y < rowCount_; ++y) {
            if (progress_ != nullptr && y % 30 == 10 && Stop(y)) return kCancelled;
            if (y == bottom) {
                const int32_t status = Save(top, bottom);
                if (StatusFailed(status)) return status;
                top = bottom;
                bottom = top + bandRows_ < rowCount_ ? top + bandRows_ : rowCount_;
            }
            const int32_t status = makeRow(y, band_ + (y - top) * stride_);
            if (StatusFailed(status)) return status;
        }
        return Save(top, rowCount_);
    }

  private:
    static constexpr int32_t kCancelled = -18;
    static bool StatusFailed(int32_t s) { return static_cast<int16_t>(s) < 0; }
    bool Stop(int64_t y) const;
    int32_t Save(int64_t top, int64_t bottom) const;

    HVT_FileInfo *info_;
    uint8_t sub_;
    HVT_Progress *progress_;
    int32_t progressHeight_;
    uint8_t *band_;
    int64_t bandRows_;
    int64_t stride_;
    int32_t width_;
    int32_t rowCount_;
};

// Saves the progress object's range on entry and puts it back on exit.
class ProgressRange {
  public:
    explicit ProgressRange(HVT_Progress *p) : p_(p) {
        if (p_ != nullptr) {
            start_ = p_->start;
            end_ = p_->end;
        }
    }
    ~ProgressRange() {
        if (p_ != nullptr) {
            p_->start = start_;
            p_->end = end_;
        }
    }
    ProgressRange(const ProgressRange &) = delete;
    ProgressRange &operator=(const ProgressRange &) = delete;

  private:
    HVT_Progress *p_;
    double start_ = 0;
    double end_ = 0;
};

// Both tile tables, loaded before any band is allocated.
int32_t LoadLevelTables(HVT_FileInfo *info, uint8_t source, uint8_t destination);

}  // namespace tessarine::storage
