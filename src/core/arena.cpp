// An arena of variable-sized pieces carved without alignment from blocks and
// released all together. Large requests that do not fit get a block of their
// own, so the current block keeps its free tail.
#include <tessarine/core.h>

#include "core/pool_blocks.h"
#include "core/status.h"

using tessarine::kErrArgument;
using tessarine::kErrMemory;
using tessarine::kOk;

namespace {

constexpr int32_t kSmallestThreshold = 500;
constexpr int32_t kDefaultThresholdFloor = 5000;

int32_t NewCurrent(MGR_SMem *arena) {
    const int32_t bytes = arena->blockSize < 0 ? 0 : arena->blockSize;
    uint8_t *block = tessarine::detail::AddPoolBlock(&arena->blocks, static_cast<uint32_t>(bytes));
    if (block == nullptr) return kErrMemory;
    arena->current = block;
    arena->usedInCurrent = 0;
    return kOk;
}

int32_t OwnBlock(MGR_SMem *arena, int32_t size, void **piece) {
    uint8_t *block = tessarine::detail::AddPoolBlock(&arena->blocks, static_cast<uint32_t>(size));
    if (block == nullptr) return kErrMemory;
    *piece = block;
    return kOk;
}

}  // namespace

extern "C" {

TESSARINE_API void MSG_SMemInit(MGR_SMem *arena, int32_t blockSize, int32_t threshold) {
    arena->blockSize = blockSize;
    arena->current = nullptr;
    arena->usedInCurrent = 0;
    arena->blocks = nullptr;
    arena->wasted = 0;
    if (threshold > kSmallestThreshold) {
        arena->largeThreshold = threshold;
    } else {
        const int32_t fifth = blockSize / 5;
        arena->largeThreshold = fifth < kDefaultThresholdFloor ? kDefaultThresholdFloor : fifth;
    }
}

TESSARINE_API int32_t MGR_SMemAlloc(MGR_SMem *arena, int32_t size, void **piece) {
    if (size < 0) return kErrArgument;
    if (size > arena->blockSize) return OwnBlock(arena, size, piece);
    if (arena->current == nullptr || arena->usedInCurrent >= arena->blockSize) {
        const int32_t status = NewCurrent(arena);
        if (status < 0) return status;
    }
    if (size <= arena->blockSize - arena->usedInCurrent) {
        *piece = arena->current + arena->usedInCurrent;
        arena->usedInCurrent += size;
        return kOk;
    }
    if (size > arena->largeThreshold) return OwnBlock(arena, size, piece);
    // Abandon the tail of the current block.
    arena->wasted =
        static_cast<int32_t>(static_cast<uint32_t>(arena->wasted) +
                             static_cast<uint32_t>(arena->blockSize - arena->usedInCurrent));
    const int32_t status = NewCurrent(arena);
    if (status < 0) return status;
    *piece = arena->current;
    arena->usedInCurrent = size;
    return kOk;
}

// The other fields keep their values: the arena must be initialised again.
TESSARINE_API void MGR_SMemEnd(MGR_SMem *arena) {
    tessarine::detail::FreePoolBlocks(&arena->blocks);
}

TESSARINE_API void MGR_SMemReport(MGR_SMem *arena) {
    [[maybe_unused]] int64_t bytes = 0;
    if (ListNode *first = arena->blocks) {
        ListNode *node = first;
        do {
            bytes += MEM_HdlSize(reinterpret_cast<MEM_Handle>(node->data));
            node = node->next;
        } while (node != first);
    }
    [[maybe_unused]] const int32_t count = ListNumber(arena->blocks);
}

}  // extern "C"
