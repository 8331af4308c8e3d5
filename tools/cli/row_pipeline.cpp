#include "row_pipeline.h"

#include <algorithm>
#include <condition_variable>
#include <cstring>
#include <exception>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <thread>

namespace tessarine::cli {
namespace {

// Rows in flight: enough to keep the image thread busy while the caller saves
// a band of the tile file (a few MiB, kSessionBudget at most), few enough to
// keep memory bounded whatever the width.
constexpr size_t kRingBytes = size_t(12) << 20;
constexpr size_t kMinSlots = 4, kMaxSlots = 1024;

// A single-producer, single-consumer ring of rows. A side that finds the ring
// empty (or full) sleeps until a quarter of it is ready, and is woken only
// then: the threads trade batches of rows, not a wake-up for every row.
class RowRing {
  public:
    explicit RowRing(size_t rowBytes)
        : rowBytes_(rowBytes), slots_(std::clamp(kRingBytes / std::max<size_t>(rowBytes, 1), kMinSlots, kMaxSlots)),
          batch_(slots_ / 4), rows_(std::make_unique_for_overwrite<uint8_t[]>(rowBytes_ * slots_)) {}

    // Producer: the next empty row, or null once the ring is stopped.
    uint8_t *Empty() {
        std::unique_lock<std::mutex> lock(mutex_);
        if (full_ == slots_ && !stopped_) {
            producerWaits_ = true;
            space_.wait(lock, [&] { return stopped_ || slots_ - full_ >= batch_; });
            producerWaits_ = false;
        }
        return stopped_ ? nullptr : Slot((head_ + full_) % slots_);
    }
    void Filled() {
        std::unique_lock<std::mutex> lock(mutex_);
        ++full_;
        const bool wake = consumerWaits_ && full_ >= batch_;
        lock.unlock();
        if (wake) filled_.notify_one();
    }
    // Consumer: the oldest full row, or null when there is none to come.
    const uint8_t *Full() {
        std::unique_lock<std::mutex> lock(mutex_);
        if (full_ == 0 && !stopped_ && !closed_) {
            consumerWaits_ = true;
            filled_.wait(lock, [&] { return stopped_ || closed_ || full_ >= batch_; });
            consumerWaits_ = false;
        }
        return stopped_ || full_ == 0 ? nullptr : Slot(head_);
    }
    void Used() {
        std::unique_lock<std::mutex> lock(mutex_);
        head_ = (head_ + 1) % slots_;
        --full_;
        const bool wake = producerWaits_ && slots_ - full_ >= batch_;
        lock.unlock();
        if (wake) space_.notify_one();
    }
    // The producer is done: the consumer takes what is left.
    void Close() {
        std::lock_guard<std::mutex> lock(mutex_);
        closed_ = true;
        filled_.notify_all();
    }
    // Either side failed or gave up: nobody waits any longer.
    void Stop(std::exception_ptr error = nullptr) {
        std::lock_guard<std::mutex> lock(mutex_);
        if (error && !error_) error_ = error;
        stopped_ = true;
        filled_.notify_all();
        space_.notify_all();
    }
    std::exception_ptr Error() {
        std::lock_guard<std::mutex> lock(mutex_);
        return error_;
    }
    size_t RowBytes() const { return rowBytes_; }

  private:
    uint8_t *Slot(size_t i) { return rows_.get() + i * rowBytes_; }

    const size_t rowBytes_, slots_, batch_;
    std::unique_ptr<uint8_t[]> rows_; // left unset: every row is written before it is read
    std::mutex mutex_;
    std::condition_variable filled_, space_;
    size_t head_ = 0, full_ = 0;
    bool producerWaits_ = false, consumerWaits_ = false;
    bool closed_ = false, stopped_ = false;
    std::exception_ptr error_;
};

class AheadReader final : public RowsAhead {
  public:
    explicit AheadReader(std::unique_ptr<RasterReader> inner)
        : inner_(std::move(inner)), ring_(cli::RowBytes(inner_->Format()) + 16) {
        format_ = inner_->Format();
        worker_ = std::thread([this] {
            try {
                for (int32_t y = 0; y < format_.height; ++y) {
                    uint8_t *row = ring_.Empty();
                    if (row == nullptr) return;
                    inner_->ReadRow(row);
                    ring_.Filled();
                }
                ring_.Close();
            } catch (...) {
                ring_.Stop(std::current_exception());
            }
        });
    }
    ~AheadReader() override {
        ring_.Stop();
        worker_.join();
    }
    const uint8_t *NextRow() override {
        if (held_) {
            held_ = false;
            ring_.Used();
        }
        const uint8_t *next = ring_.Full();
        if (next == nullptr) {
            if (auto error = ring_.Error()) std::rethrow_exception(error);
            throw std::logic_error("read past the last row");
        }
        held_ = true;
        return next;
    }
    void ReadRow(uint8_t *row) override { std::memcpy(row, NextRow(), cli::RowBytes(format_)); }

  private:
    std::unique_ptr<RasterReader> inner_;
    RowRing ring_;
    bool held_ = false; // the caller still reads the ring's oldest row
    std::thread worker_;
};

class BehindWriter final : public RowsBehind {
  public:
    BehindWriter(std::unique_ptr<RasterWriter> inner, size_t rowBytes) : inner_(std::move(inner)), ring_(rowBytes) {
        worker_ = std::thread([this] {
            try {
                while (const uint8_t *row = ring_.Full()) {
                    inner_->WriteRow(row);
                    ring_.Used();
                }
            } catch (...) {
                ring_.Stop(std::current_exception());
            }
        });
    }
    ~BehindWriter() override {
        ring_.Stop();
        if (worker_.joinable()) worker_.join();
    }
    uint8_t *NextSlot() override {
        if (slot_ == nullptr) {
            slot_ = ring_.Empty();
            // Only the worker stops the ring while the caller writes, and
            // only with its error.
            if (slot_ == nullptr) std::rethrow_exception(ring_.Error());
        }
        return slot_;
    }
    void WriteRow(const uint8_t *row) override {
        uint8_t *slot = NextSlot();
        if (row != slot) std::memcpy(slot, row, ring_.RowBytes());
        slot_ = nullptr;
        ring_.Filled();
    }
    void Finish() override {
        ring_.Close();
        worker_.join();
        if (auto error = ring_.Error()) std::rethrow_exception(error);
        inner_->Finish();
    }

  private:
    std::unique_ptr<RasterWriter> inner_;
    RowRing ring_;
    uint8_t *slot_ = nullptr; // handed out by NextSlot, not yet written
    std::thread worker_;
};

}  // namespace

std::unique_ptr<RowsAhead> ReadAhead(std::unique_ptr<RasterReader> reader) {
    return std::make_unique<AheadReader>(std::move(reader));
}

std::unique_ptr<RowsBehind> WriteBehind(std::unique_ptr<RasterWriter> writer, size_t rowBytes) {
    return std::make_unique<BehindWriter>(std::move(writer), rowBytes);
}

}  // namespace tessarine::cli
