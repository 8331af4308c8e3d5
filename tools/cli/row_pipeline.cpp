#include "row_pipeline.h"

#include <condition_variable>
#include <cstring>
#include <exception>
#include <mutex>
#include <thread>
#include <vector>

namespace tessarine::cli {
namespace {

// Enough rows in flight to even out a band save, small next to a band.
constexpr size_t kSlots = 64;

class RowRing {
  public:
    explicit RowRing(size_t rowBytes) : rowBytes_(rowBytes), rows_(kSlots, std::vector<uint8_t>(rowBytes)) {}

    // Producer: the next empty row, or null once the ring is stopped.
    uint8_t *Empty() {
        std::unique_lock<std::mutex> lock(mutex_);
        changed_.wait(lock, [&] { return stopped_ || full_ < kSlots; });
        return stopped_ ? nullptr : rows_[(head_ + full_) % kSlots].data();
    }
    void Filled() {
        std::lock_guard<std::mutex> lock(mutex_);
        ++full_;
        changed_.notify_all();
    }
    // Consumer: the oldest full row, or null when there is none to come.
    const uint8_t *Full() {
        std::unique_lock<std::mutex> lock(mutex_);
        changed_.wait(lock, [&] { return stopped_ || full_ > 0 || closed_; });
        return stopped_ || full_ == 0 ? nullptr : rows_[head_].data();
    }
    void Used() {
        std::lock_guard<std::mutex> lock(mutex_);
        head_ = (head_ + 1) % kSlots;
        --full_;
        changed_.notify_all();
    }
    void Close() {
        std::lock_guard<std::mutex> lock(mutex_);
        closed_ = true;
        changed_.notify_all();
    }
    // Either side failed or gave up: nobody waits any longer.
    void Stop(std::exception_ptr error = nullptr) {
        std::lock_guard<std::mutex> lock(mutex_);
        if (error && !error_) error_ = error;
        stopped_ = true;
        changed_.notify_all();
    }
    std::exception_ptr Error() {
        std::lock_guard<std::mutex> lock(mutex_);
        return error_;
    }
    size_t RowBytes() const { return rowBytes_; }

  private:
    size_t rowBytes_;
    std::vector<std::vector<uint8_t>> rows_;
    std::mutex mutex_;
    std::condition_variable changed_;
    size_t head_ = 0, full_ = 0;
    bool closed_ = false, stopped_ = false;
    std::exception_ptr error_;
};

class AheadReader final : public RasterReader {
  public:
    explicit AheadReader(std::unique_ptr<RasterReader> inner)
        : inner_(std::move(inner)), ring_(RowBytes(inner_->Format()) + 16) {
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
    void ReadRow(uint8_t *row) override {
        const uint8_t *next = ring_.Full();
        if (next == nullptr) {
            if (auto error = ring_.Error()) std::rethrow_exception(error);
            throw std::logic_error("read past the last row");
        }
        std::memcpy(row, next, RowBytes(format_));
        ring_.Used();
    }

  private:
    std::unique_ptr<RasterReader> inner_;
    RowRing ring_;
    std::thread worker_;
};

class BehindWriter final : public RasterWriter {
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
    void WriteRow(const uint8_t *row) override {
        uint8_t *slot = ring_.Empty();
        if (slot == nullptr) std::rethrow_exception(ring_.Error());
        std::memcpy(slot, row, ring_.RowBytes());
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
    std::thread worker_;
};

}  // namespace

std::unique_ptr<RasterReader> ReadAhead(std::unique_ptr<RasterReader> reader) {
    return std::make_unique<AheadReader>(std::move(reader));
}

std::unique_ptr<RasterWriter> WriteBehind(std::unique_ptr<RasterWriter> writer, size_t rowBytes) {
    return std::make_unique<BehindWriter>(std::move(writer), rowBytes);
}

}  // namespace tessarine::cli
