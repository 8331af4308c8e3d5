#include "platform/heap.h"

#include <atomic>
#include <cstdlib>
#include <cstring>
#include <limits>

#include "platform/injection.h"
#include "platform/test_hooks.h"

namespace tessarine::platform {
namespace {

constexpr uint32_t kFixedMagic = 0x58494654;     // "TFIX"
constexpr uint32_t kMoveableMagic = 0x564F4D54;  // "TMOV"
constexpr size_t kLargest = std::numeric_limits<size_t>::max() / 4;

// A fixed block carries its size in front of the caller's bytes; the header
// keeps the caller's bytes 16-aligned like the C allocator's.
struct alignas(16) FixedHeader {
    size_t size;
    uint32_t magic;
};

// A moveable block's handle is the address of this record plus one, which
// tells the two kinds apart by the low bit (the allocator aligns to 16).
struct MoveableRecord {
    uint32_t magic;
    uint32_t lockCount;
    uint32_t flags;
    size_t size;
    void *data;  // null while discarded
};

std::atomic<int64_t> g_liveBlocks{0};
std::atomic<uint32_t> g_lastAllocFlags{0};

FixedHeader *FixedHeaderOf(MEM_Handle block) {
    auto *header = reinterpret_cast<FixedHeader *>(static_cast<unsigned char *>(block) -
                                                   sizeof(FixedHeader));
    return header->magic == kFixedMagic ? header : nullptr;
}

MoveableRecord *RecordOf(MEM_Handle block) {
    auto *record = reinterpret_cast<MoveableRecord *>(reinterpret_cast<uintptr_t>(block) - 1);
    return record->magic == kMoveableMagic ? record : nullptr;
}

MEM_Handle HandleOf(MoveableRecord *record) {
    return reinterpret_cast<MEM_Handle>(reinterpret_cast<uintptr_t>(record) + 1);
}

void *FixedData(FixedHeader *header) { return header + 1; }

// The one place memory is asked of the C allocator: counted for injection.
void *Acquire(void *old, size_t bytes) {
    if (bytes > kLargest || injection::TooLarge(bytes) || injection::ShouldFail(injection::kAlloc))
        return nullptr;
    return std::realloc(old, bytes == 0 ? 1 : bytes);
}

MEM_Handle AllocFixed(uint32_t flags, size_t bytes) {
    if (bytes > kLargest - sizeof(FixedHeader)) return nullptr;
    auto *header = static_cast<FixedHeader *>(Acquire(nullptr, sizeof(FixedHeader) + bytes));
    if (header == nullptr) return nullptr;
    header->size = bytes;
    header->magic = kFixedMagic;
    if (flags & GMEM_ZEROINIT) std::memset(FixedData(header), 0, bytes);
    ++g_liveBlocks;
    return FixedData(header);
}

MEM_Handle AllocMoveable(uint32_t flags, size_t bytes) {
    void *data = nullptr;
    if (bytes != 0) {
        data = Acquire(nullptr, bytes);
        if (data == nullptr) return nullptr;
        if (flags & GMEM_ZEROINIT) std::memset(data, 0, bytes);
    }
    // The record itself is bookkeeping of the same allocation, not counted.
    auto *record = static_cast<MoveableRecord *>(std::malloc(sizeof(MoveableRecord)));
    if (record == nullptr) {
        std::free(data);
        return nullptr;
    }
    *record = MoveableRecord{kMoveableMagic, 0, flags, bytes, data};
    ++g_liveBlocks;
    return HandleOf(record);
}

MEM_Handle ResizeMoveable(MoveableRecord *record, size_t bytes, uint32_t flags) {
    if (bytes == 0) {
        if (record->lockCount != 0) return nullptr;
        std::free(record->data);
        record->data = nullptr;
        record->size = 0;
        return HandleOf(record);
    }
    if (record->lockCount != 0 && !(flags & GMEM_MOVEABLE)) {
        // A locked block may not move: only an in-place shrink is possible.
        if (bytes > record->size) return nullptr;
        record->size = bytes;
        return HandleOf(record);
    }
    void *data = Acquire(record->data, bytes);
    if (data == nullptr) return nullptr;
    if ((flags & GMEM_ZEROINIT) && bytes > record->size)
        std::memset(static_cast<unsigned char *>(data) + record->size, 0, bytes - record->size);
    record->data = data;
    record->size = bytes;
    return HandleOf(record);
}

MEM_Handle ResizeFixed(FixedHeader *header, size_t bytes, uint32_t flags) {
    if (bytes == 0) return nullptr;  // only moveable blocks can be discarded
    if (!(flags & GMEM_MOVEABLE)) {
        if (bytes > header->size) return nullptr;
        header->size = bytes;
        return FixedData(header);
    }
    if (bytes > kLargest - sizeof(FixedHeader)) return nullptr;
    const size_t old = header->size;
    auto *moved = static_cast<FixedHeader *>(Acquire(header, sizeof(FixedHeader) + bytes));
    if (moved == nullptr) return nullptr;
    moved->size = bytes;
    if ((flags & GMEM_ZEROINIT) && bytes > old)
        std::memset(static_cast<unsigned char *>(FixedData(moved)) + old, 0, bytes - old);
    return FixedData(moved);
}

}  // namespace

bool IsMoveable(MEM_Handle block) { return (reinterpret_cast<uintptr_t>(block) & 1u) != 0; }

MEM_Handle GlobalAlloc(uint32_t flags, size_t bytes) {
    g_lastAllocFlags = flags;
    return (flags & GMEM_MOVEABLE) ? AllocMoveable(flags, bytes) : AllocFixed(flags, bytes);
}

void *GlobalLock(MEM_Handle block) {
    if (block == nullptr) return nullptr;
    if (!IsMoveable(block)) return FixedHeaderOf(block) ? block : nullptr;
    MoveableRecord *record = RecordOf(block);
    if (record == nullptr || record->data == nullptr) return nullptr;
    ++record->lockCount;
    return record->data;
}

int32_t GlobalUnlock(MEM_Handle block) {
    if (block == nullptr || !IsMoveable(block)) return 0;
    MoveableRecord *record = RecordOf(block);
    if (record == nullptr || record->lockCount == 0) return 0;
    --record->lockCount;
    return record->lockCount != 0 ? 1 : 0;
}

size_t GlobalSize(MEM_Handle block) {
    if (block == nullptr) return 0;
    if (IsMoveable(block)) {
        MoveableRecord *record = RecordOf(block);
        return record ? record->size : 0;
    }
    FixedHeader *header = FixedHeaderOf(block);
    return header ? header->size : 0;
}

MEM_Handle GlobalReAlloc(MEM_Handle block, size_t bytes, uint32_t flags) {
    if (block == nullptr) return nullptr;
    if (IsMoveable(block)) {
        MoveableRecord *record = RecordOf(block);
        return record ? ResizeMoveable(record, bytes, flags) : nullptr;
    }
    FixedHeader *header = FixedHeaderOf(block);
    return header ? ResizeFixed(header, bytes, flags) : nullptr;
}

MEM_Handle GlobalFree(MEM_Handle block) {
    if (block == nullptr) return nullptr;
    if (IsMoveable(block)) {
        MoveableRecord *record = RecordOf(block);
        if (record == nullptr) return block;
        std::free(record->data);
        record->magic = 0;
        std::free(record);
    } else {
        FixedHeader *header = FixedHeaderOf(block);
        if (header == nullptr) return block;
        header->magic = 0;
        std::free(header);
    }
    --g_liveBlocks;
    return nullptr;
}

}  // namespace tessarine::platform

namespace tessarine::testing {
int64_t LiveBlocks() { return platform::g_liveBlocks; }
uint32_t LastGlobalAllocFlags() { return platform::g_lastAllocFlags; }
}  // namespace tessarine::testing
