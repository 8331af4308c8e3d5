// A pool of equal nodes carved from blocks, with a free list linked through
// the nodes themselves. The platform is asked once per block.
#include <tessarine/core.h>

#include "core/pool_blocks.h"
#include "core/status.h"

using tessarine::kErrArgument;
using tessarine::kErrMemory;
using tessarine::kOk;

namespace {

int32_t NewBlock(MGR_List *pool) {
    const int64_t bytes = tessarine::detail::BlockBytes(pool->perBlock, pool->elementSize);
    if (bytes < 0) return kErrMemory;
    uint8_t *block = tessarine::detail::AddPoolBlock(&pool->blocks, static_cast<uint32_t>(bytes));
    if (block == nullptr) return kErrMemory;
    pool->current = block;
    pool->usedInCurrent = 0;
    return kOk;
}

}  // namespace

extern "C" {

TESSARINE_API void MGR_ListInit(MGR_List *pool, int32_t elementSize, int32_t perBlock) {
    pool->elementSize = elementSize;
    pool->perBlock = perBlock;
    pool->current = nullptr;
    pool->usedInCurrent = 0;
    pool->freeList = nullptr;
    pool->blocks = nullptr;
}

// A reused node keeps its contents, with its links pointing at itself; a fresh
// one is not cleared.
TESSARINE_API int32_t MGR_ListAlloc(MGR_List *pool, void **node) {
    if (pool->freeList != nullptr) {
        ListNode *reused = nullptr;
        ListRemoveHead(&pool->freeList, &reused);
        *node = reused;
        return kOk;
    }
    // A fresh node must hold the links that MGR_ListFree threads through it.
    if (pool->perBlock == 0 || pool->elementSize < static_cast<int32_t>(sizeof(ListNode)))
        return kErrArgument;
    if (pool->current == nullptr || pool->usedInCurrent >= pool->perBlock) {
        const int32_t status = NewBlock(pool);
        if (status < 0) return status;
    }
    *node = pool->current + static_cast<int64_t>(pool->elementSize) * pool->usedInCurrent;
    ++pool->usedInCurrent;
    return kOk;
}

TESSARINE_API void MGR_ListFree(MGR_List *pool, void **node) {
    ListAppend(static_cast<ListNode *>(*node), &pool->freeList);
    *node = nullptr;
}

// Keeps the first block and releases the others. The free list is left as it
// is: nodes in it that lay in released blocks dangle, so callers empty it first.
TESSARINE_API int32_t MGR_ListResetOneBlock(MGR_List *pool) {
    if (pool->blocks == nullptr) return NewBlock(pool);
    ListNode *kept = nullptr;
    ListRemoveHead(&pool->blocks, &kept);
    tessarine::detail::FreePoolBlocks(&pool->blocks);
    pool->blocks = kept;
    pool->current = reinterpret_cast<uint8_t *>(kept->data);
    pool->usedInCurrent = 0;
    return kOk;
}

// The other fields keep their values: the pool must be initialised again.
TESSARINE_API void MGR_ListEnd(MGR_List *pool) {
    tessarine::detail::FreePoolBlocks(&pool->blocks);
}

TESSARINE_API void MGR_ListReport(MGR_List *pool) {
    [[maybe_unused]] const int32_t blocks = ListNumber(pool->blocks);
    [[maybe_unused]] const int32_t free = ListNumber(pool->freeList);
}

}  // extern "C"
