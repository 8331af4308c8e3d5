// Guards for memory blocks: one frees a block on every exit, one unlocks a
// handle it locked.
#pragma once

#include <tessarine/core.h>

namespace tessarine {

class FreeGuard {
  public:
    FreeGuard() = default;
    explicit FreeGuard(void *block) : block_(block) {}
    ~FreeGuard() {
        if (block_ != nullptr) MEM_FreeHdl(block_);
    }
    FreeGuard(const FreeGuard &) = delete;
    FreeGuard &operator=(const FreeGuard &) = delete;
    void Reset(void *block) {
        if (block_ != nullptr) MEM_FreeHdl(block_);
        block_ = block;
    }

  private:
    void *block_ = nullptr;
};

// Locks a handle for its lifetime; Get() is null when there is no handle or
// the lock failed.
class LockGuard {
  public:
    explicit LockGuard(MEM_Handle handle)
        : handle_(handle), data_(handle != nullptr ? static_cast<uint8_t *>(MEM_Lock(handle)) : nullptr) {}
    ~LockGuard() {
        if (data_ != nullptr) MEM_Unlock(handle_);
    }
    LockGuard(const LockGuard &) = delete;
    LockGuard &operator=(const LockGuard &) = delete;
    uint8_t *Get() const { return data_; }
    int64_t Size() const { return data_ != nullptr ? MEM_HdlSize(handle_) : 0; }

  private:
    MEM_Handle handle_;
    uint8_t *data_;
};

}  // namespace tessarine
