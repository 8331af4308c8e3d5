// The growing array, the node pool and the arena.
#include <cstdint>
#include <cstring>

#include <gtest/gtest.h>

#include <tessarine/core.h>

#include "hook_recorder.h"
#include "test_support.h"

namespace {

using tessarine::testing::LastGlobalAllocFlags;
using tessarine::testing::LiveBlocks;

class DynamicArray : public tstest::Sandbox {};
class NodePool : public tstest::Sandbox {};
class Arena : public tstest::Sandbox {};

void *const kUntouched = reinterpret_cast<void *>(uintptr_t{0x5A5A5A5A});

struct Record {
    ListNode link;
    int32_t value;
};

// ---- growing array --------------------------------------------------------

TEST_F(DynamicArray, InitClearsHandleAndBase) {
    MGR_DARY a;
    std::memset(&a, 0xEE, sizeof a);
    MGR_DARYInit(&a);
    EXPECT_EQ(a.handle, nullptr);
    EXPECT_EQ(a.base, nullptr);
    MGR_DARYEnd(&a);  // nothing to free
    EXPECT_EQ(a.handle, nullptr);
}

TEST_F(DynamicArray, StartMakesZeroFilledLockedBlock) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 8, 10), 10);
    EXPECT_NE(a.handle, nullptr);
    EXPECT_EQ(a.capacity, 10);
    EXPECT_EQ(a.growBy, 10);
    EXPECT_EQ(a.elementSize, 8);
    EXPECT_EQ(a.used, 1);
    EXPECT_EQ(MEM_HdlSize(a.handle), 80u);
    const auto *bytes = static_cast<const uint8_t *>(a.base);
    for (int i = 0; i < 80; ++i) EXPECT_EQ(bytes[i], 0);
    // Kept locked: a lock of our own does not move it.
    EXPECT_EQ(MEM_Lock(a.handle), a.base);
    MEM_Unlock(a.handle);
    MGR_DARYEnd(&a);
    EXPECT_EQ(a.handle, nullptr);
    EXPECT_EQ(a.base, nullptr);
}

TEST_F(DynamicArray, StartAsksForAZeroFilledMoveableBlock) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 4, 10), 10);
    EXPECT_EQ(LastGlobalAllocFlags(), 0x42u);
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, FirstAllocGivesIndexOne) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 4, 10), 10);
    void *element = nullptr;
    ASSERT_EQ(MGR_DARYAlloc(&a, &element), 10);
    EXPECT_EQ(element, static_cast<uint8_t *>(a.base) + 4);
    EXPECT_EQ(a.used, 2);
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, GrowsTwoElementsBeforeFull) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 4, 10), 10);
    void *element = nullptr;
    for (int index = 1; index <= 7; ++index) {
        ASSERT_EQ(MGR_DARYAlloc(&a, &element), 10);
        *static_cast<int32_t *>(element) = index * 11;
        EXPECT_EQ(a.capacity, 10) << index;
    }
    ASSERT_EQ(MGR_DARYAlloc(&a, &element), 10);  // index 8
    EXPECT_EQ(a.capacity, 20);
    EXPECT_EQ(MEM_HdlSize(a.handle), 80u);
    EXPECT_EQ(element, static_cast<uint8_t *>(a.base) + 32);
    const auto *values = static_cast<const int32_t *>(a.base);
    for (int index = 1; index <= 7; ++index) EXPECT_EQ(values[index], index * 11);
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, ResizeNeverShrinks) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 2, 10), 10);
    EXPECT_EQ(MGR_DARYResize(&a, 4), 10);
    EXPECT_EQ(a.capacity, 10);
    EXPECT_EQ(MEM_HdlSize(a.handle), 20u);
    EXPECT_NE(a.base, nullptr);
    EXPECT_EQ(MGR_DARYResize(&a, 30), 10);
    EXPECT_EQ(a.capacity, 30);
    EXPECT_EQ(a.growBy, 10);
    EXPECT_EQ(MEM_HdlSize(a.handle), 60u);
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, StartWithNothingToLockGivesMinusOne) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    const int64_t live = LiveBlocks();
    EXPECT_EQ(MGR_DARYStart(&a, 4, 0), -1);
    EXPECT_EQ(MGR_DARYStart(&a, 0, 10), -1);
    EXPECT_EQ(a.handle, nullptr);
    EXPECT_EQ(LiveBlocks(), live);
}

TEST_F(DynamicArray, ResizeToNothingLockableGivesMinusOne) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 4, 10), 10);
    a.elementSize = 0;  // the resize asks for 0 bytes: the block is discarded
    EXPECT_EQ(MGR_DARYResize(&a, 20), -1);
    EXPECT_NE(a.handle, nullptr);  // the handle stays, for MGR_DARYEnd
    EXPECT_EQ(a.base, nullptr);
    EXPECT_EQ(a.capacity, 20);
    void *element = kUntouched;
    a.used = 18;
    EXPECT_EQ(MGR_DARYAlloc(&a, &element), -1);
    EXPECT_EQ(element, kUntouched);
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, AllocAfterAFailedResizeIsRefused) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 4, 10), 10);
    tessarine::testing::FailAllocationsFrom(1);
    EXPECT_EQ(MGR_DARYResize(&a, 100), -5);
    tessarine::testing::ResetInjection();
    void *element = kUntouched;
    EXPECT_EQ(MGR_DARYAlloc(&a, &element), -1);
    EXPECT_EQ(element, kUntouched);
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, OverflowingByteCountFailsWithoutAllocating) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(MGR_DARYStart(&a, 65536, 65536), -5);
    EXPECT_EQ(MGR_DARYStart(&a, -4, 10), -5);
    EXPECT_EQ(MGR_DARYStart(&a, 4, -10), -5);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 0);
    EXPECT_EQ(a.handle, nullptr);

    ASSERT_EQ(MGR_DARYStart(&a, 65536, 10), 10);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(MGR_DARYResize(&a, 65536), -5);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 0);
    EXPECT_EQ(a.handle, nullptr);  // as after any failed resize
    EXPECT_EQ(a.base, nullptr);
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, GrowthPastInt32CapacityFails) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 1, 10), 10);
    a.growBy = INT32_MAX;  // capacity + growBy does not fit
    a.used = 8;
    void *element = kUntouched;
    EXPECT_EQ(MGR_DARYAlloc(&a, &element), -5);
    EXPECT_EQ(element, kUntouched);
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, StartAllocationFailure) {
    tstest::OutOfMemoryRecorder hook;  // the handle family never calls it
    tstest::ForEachAllocationFailure([](int64_t) {
        MGR_DARY a;
        MGR_DARYInit(&a);
        const int32_t status = MGR_DARYStart(&a, 4, 10);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(status, -5);
            EXPECT_EQ(a.handle, nullptr);
            EXPECT_EQ(a.base, nullptr);
        } else {
            EXPECT_EQ(status, 10);
        }
        MGR_DARYEnd(&a);
    });
    EXPECT_TRUE(hook.Calls().empty());
}

TEST_F(DynamicArray, ResizeInPlaceFailureFallsBackToAFreshBlock) {
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 4, 10), 10);
    static_cast<int32_t *>(a.base)[9] = 99;
    const int64_t live = LiveBlocks();
    tessarine::testing::FailAllocationAt(1);
    EXPECT_EQ(MGR_DARYResize(&a, 5000), 10);
    EXPECT_TRUE(tessarine::testing::AllocationFailureHit());
    tessarine::testing::ResetInjection();
    EXPECT_EQ(MEM_HdlSize(a.handle), 20000u);
    EXPECT_EQ(static_cast<int32_t *>(a.base)[9], 99);
    EXPECT_EQ(LiveBlocks(), live);
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, ResizeFailureLosesTheBlock) {
    tstest::OutOfMemoryRecorder hook;
    MGR_DARY a;
    MGR_DARYInit(&a);
    ASSERT_EQ(MGR_DARYStart(&a, 4, 10), 10);
    const int64_t live = LiveBlocks();
    tessarine::testing::FailAllocationsFrom(1);
    EXPECT_EQ(MGR_DARYResize(&a, 5000), -5);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(a.handle, nullptr);
    EXPECT_EQ(a.base, nullptr);
    EXPECT_EQ(LiveBlocks(), live - 1);
    EXPECT_TRUE(hook.Calls().empty());
    MGR_DARYEnd(&a);
}

TEST_F(DynamicArray, AllocGrowthFailureLeavesOutUnwritten) {
    tstest::ForEachAllocationFailure([](int64_t n) {
        MGR_DARY a;
        MGR_DARYInit(&a);
        tessarine::testing::FailAllocationAt(0);
        ASSERT_EQ(MGR_DARYStart(&a, 4, 3), 10);
        void *element = kUntouched;
        tessarine::testing::FailAllocationsFrom(n);
        const int32_t status = MGR_DARYAlloc(&a, &element);  // grows at once
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(status, -5);
            EXPECT_EQ(element, kUntouched);
            EXPECT_EQ(a.handle, nullptr);
        } else {
            EXPECT_EQ(status, 10);
            EXPECT_EQ(a.capacity, 6);
            EXPECT_EQ(element, static_cast<uint8_t *>(a.base) + 4);
        }
        MGR_DARYEnd(&a);
    });
}

// ---- node pool ---------------------------------------------------------------

TEST_F(NodePool, InitFillsSizesAndClearsTheRest) {
    MGR_List pool;
    std::memset(&pool, 0xEE, sizeof pool);
    MGR_ListInit(&pool, sizeof(Record), 4);
    EXPECT_EQ(pool.elementSize, static_cast<int32_t>(sizeof(Record)));
    EXPECT_EQ(pool.perBlock, 4);
    EXPECT_EQ(pool.current, nullptr);
    EXPECT_EQ(pool.usedInCurrent, 0);
    EXPECT_EQ(pool.freeList, nullptr);
    EXPECT_EQ(pool.blocks, nullptr);
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, CarvesBlocksOfPerBlockNodes) {
    MGR_List pool;
    MGR_ListInit(&pool, sizeof(Record), 3);
    void *nodes[7];
    for (int i = 0; i < 7; ++i) ASSERT_EQ(MGR_ListAlloc(&pool, &nodes[i]), 10);
    EXPECT_EQ(ListNumber(pool.blocks), 3);
    EXPECT_EQ(static_cast<uint8_t *>(nodes[1]), static_cast<uint8_t *>(nodes[0]) + sizeof(Record));
    EXPECT_EQ(static_cast<uint8_t *>(nodes[2]),
              static_cast<uint8_t *>(nodes[0]) + 2 * sizeof(Record));
    EXPECT_EQ(reinterpret_cast<uint8_t *>(pool.blocks->data), nodes[0]);
    EXPECT_EQ(reinterpret_cast<uint8_t *>(pool.blocks->next->data), nodes[3]);
    EXPECT_EQ(pool.current, nodes[6]);
    EXPECT_EQ(pool.usedInCurrent, 1);
    EXPECT_EQ(MEM_HdlSize(pool.current), 3 * sizeof(Record));
    // The block node is zero-filled but for its links and data.
    MGR_ListReport(&pool);
    MGR_ListEnd(&pool);
    EXPECT_EQ(pool.blocks, nullptr);
    EXPECT_EQ(pool.elementSize, static_cast<int32_t>(sizeof(Record)));
    EXPECT_NE(pool.current, nullptr);  // kept: the pool must be initialised again
}

// Each block: a zero-filled fixed list node first, then the fixed block.
TEST_F(NodePool, BlockNodeIsZeroFilledAndTheBlockIsNot) {
    MGR_List pool;
    MGR_ListInit(&pool, sizeof(Record), 4);
    void *node = kUntouched;
    tessarine::testing::FailAllocationAt(1);
    EXPECT_EQ(MGR_ListAlloc(&pool, &node), -5);
    EXPECT_EQ(LastGlobalAllocFlags(), 0x40u);
    tessarine::testing::FailAllocationAt(0);
    ASSERT_EQ(MGR_ListAlloc(&pool, &node), 10);
    EXPECT_EQ(LastGlobalAllocFlags(), 0x00u);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 2);
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, AllocAfterFreeGivesBackTheSameNode) {
    MGR_List pool;
    MGR_ListInit(&pool, sizeof(Record), 4);
    void *node = nullptr;
    ASSERT_EQ(MGR_ListAlloc(&pool, &node), 10);
    void *kept = node;
    static_cast<Record *>(node)->value = 1234;
    MGR_ListFree(&pool, &node);
    EXPECT_EQ(node, nullptr);
    EXPECT_EQ(pool.freeList, kept);
    void *again = nullptr;
    ASSERT_EQ(MGR_ListAlloc(&pool, &again), 10);
    EXPECT_EQ(again, kept);
    EXPECT_EQ(pool.freeList, nullptr);
    auto *record = static_cast<Record *>(again);
    EXPECT_EQ(record->value, 1234);
    EXPECT_EQ(record->link.next, &record->link);
    EXPECT_EQ(record->link.prev, &record->link);
    EXPECT_EQ(pool.usedInCurrent, 1);
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, FreeListIsFirstInFirstOut) {
    MGR_List pool;
    MGR_ListInit(&pool, sizeof(Record), 4);
    void *a, *b;
    ASSERT_EQ(MGR_ListAlloc(&pool, &a), 10);
    ASSERT_EQ(MGR_ListAlloc(&pool, &b), 10);
    void *fa = a, *fb = b;
    MGR_ListFree(&pool, &a);
    MGR_ListFree(&pool, &b);
    MGR_ListReport(&pool);
    void *x, *y;
    MGR_ListAlloc(&pool, &x);
    MGR_ListAlloc(&pool, &y);
    EXPECT_EQ(x, fa);
    EXPECT_EQ(y, fb);
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, FreeOfNullStoresNull) {
    MGR_List pool;
    MGR_ListInit(&pool, sizeof(Record), 4);
    void *node = nullptr;
    MGR_ListFree(&pool, &node);
    EXPECT_EQ(node, nullptr);
    EXPECT_EQ(pool.freeList, nullptr);
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, ResetKeepsTheFirstBlock) {
    MGR_List pool;
    MGR_ListInit(&pool, sizeof(Record), 2);
    void *nodes[5];
    for (auto &n : nodes) ASSERT_EQ(MGR_ListAlloc(&pool, &n), 10);
    ASSERT_EQ(ListNumber(pool.blocks), 3);
    const int64_t live = LiveBlocks();
    EXPECT_EQ(MGR_ListResetOneBlock(&pool), 10);
    EXPECT_EQ(LiveBlocks(), live - 4);  // two blocks and their nodes
    EXPECT_EQ(ListNumber(pool.blocks), 1);
    EXPECT_EQ(pool.current, nodes[0]);
    EXPECT_EQ(pool.usedInCurrent, 0);
    void *again;
    ASSERT_EQ(MGR_ListAlloc(&pool, &again), 10);
    EXPECT_EQ(again, nodes[0]);
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, ResetLeavesTheFreeList) {
    MGR_List pool;
    MGR_ListInit(&pool, sizeof(Record), 4);
    void *node;
    ASSERT_EQ(MGR_ListAlloc(&pool, &node), 10);
    void *freed = node;
    MGR_ListFree(&pool, &node);
    EXPECT_EQ(MGR_ListResetOneBlock(&pool), 10);
    EXPECT_EQ(pool.freeList, freed);  // lies in the kept block here
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, ResetOfEmptyPoolMakesOneBlock) {
    MGR_List pool;
    MGR_ListInit(&pool, sizeof(Record), 4);
    EXPECT_EQ(MGR_ListResetOneBlock(&pool), 10);
    EXPECT_EQ(ListNumber(pool.blocks), 1);
    EXPECT_NE(pool.current, nullptr);
    EXPECT_EQ(pool.usedInCurrent, 0);
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, OverflowingBlockFailsWithoutAllocating) {
    tstest::OutOfMemoryRecorder hook;
    MGR_List pool;
    MGR_ListInit(&pool, 65536, 65536);
    tessarine::testing::ResetInjection();
    void *node = kUntouched;
    EXPECT_EQ(MGR_ListAlloc(&pool, &node), -5);
    EXPECT_EQ(node, kUntouched);
    EXPECT_EQ(MGR_ListResetOneBlock(&pool), -5);
    MGR_ListInit(&pool, 32, -1);
    EXPECT_EQ(MGR_ListAlloc(&pool, &node), -5);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 0);
    EXPECT_EQ(pool.blocks, nullptr);
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, NodesTooSmallForTheirLinksAreRefused) {
    MGR_List pool;
    MGR_ListInit(&pool, sizeof(ListNode) - 1, 4);
    tessarine::testing::ResetInjection();
    void *node = kUntouched;
    EXPECT_EQ(MGR_ListAlloc(&pool, &node), -4);
    EXPECT_EQ(node, kUntouched);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 0);
    EXPECT_EQ(pool.blocks, nullptr);
    // Not even from a block made by a reset.
    EXPECT_EQ(MGR_ListResetOneBlock(&pool), 10);
    EXPECT_EQ(MGR_ListAlloc(&pool, &node), -4);
    EXPECT_EQ(node, kUntouched);
    EXPECT_EQ(pool.usedInCurrent, 0);
    MGR_ListEnd(&pool);
    MGR_ListInit(&pool, sizeof(Record), 0);
    EXPECT_EQ(MGR_ListAlloc(&pool, &node), -4);
    EXPECT_EQ(node, kUntouched);
    EXPECT_EQ(pool.blocks, nullptr);
    // Exactly a list node is enough.
    MGR_ListInit(&pool, sizeof(ListNode), 1);
    ASSERT_EQ(MGR_ListAlloc(&pool, &node), 10);
    MGR_ListFree(&pool, &node);
    MGR_ListEnd(&pool);
}

TEST_F(NodePool, AllocAllocationFailure) {
    tstest::OutOfMemoryRecorder hook;
    const int64_t allocations = tstest::ForEachAllocationFailure([&](int64_t n) {
        hook.Clear();
        MGR_List pool;
        MGR_ListInit(&pool, sizeof(Record), 10);
        void *node = kUntouched;
        const int32_t status = MGR_ListAlloc(&pool, &node);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(status, -5);
            EXPECT_EQ(node, kUntouched);
            EXPECT_EQ(pool.blocks, nullptr);
            EXPECT_EQ(pool.current, nullptr);
            ASSERT_EQ(hook.Calls().size(), 1u);
            EXPECT_EQ(hook.Calls()[0], n == 1 ? sizeof(ListNode) : 10 * sizeof(Record));
        } else {
            EXPECT_EQ(status, 10);
            EXPECT_TRUE(hook.Calls().empty());
        }
        MGR_ListEnd(&pool);
    });
    EXPECT_EQ(allocations, 2);
}

TEST_F(NodePool, ResetAllocationFailure) {
    tstest::OutOfMemoryRecorder hook;
    tstest::ForEachAllocationFailure([&](int64_t) {
        MGR_List pool;
        MGR_ListInit(&pool, sizeof(Record), 10);
        const int32_t status = MGR_ListResetOneBlock(&pool);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(status, -5);
            EXPECT_EQ(pool.blocks, nullptr);
        } else {
            EXPECT_EQ(status, 10);
        }
        MGR_ListEnd(&pool);
    });
}

// ---- arena -------------------------------------------------------------------

TEST_F(Arena, InitThresholds) {
    MGR_SMem arena;
    std::memset(&arena, 0xEE, sizeof arena);
    MSG_SMemInit(&arena, 100000, 0);
    EXPECT_EQ(arena.largeThreshold, 20000);
    EXPECT_EQ(arena.blockSize, 100000);
    EXPECT_EQ(arena.current, nullptr);
    EXPECT_EQ(arena.usedInCurrent, 0);
    EXPECT_EQ(arena.blocks, nullptr);
    EXPECT_EQ(arena.wasted, 0);
    MSG_SMemInit(&arena, 1000, 0);
    EXPECT_EQ(arena.largeThreshold, 5000);
    MSG_SMemInit(&arena, 1000, 501);
    EXPECT_EQ(arena.largeThreshold, 501);
    MSG_SMemInit(&arena, 100000, 500);
    EXPECT_EQ(arena.largeThreshold, 20000);
    MSG_SMemInit(&arena, 1000, 500);
    EXPECT_EQ(arena.largeThreshold, 5000);
    MSG_SMemInit(&arena, 1000, -7);
    EXPECT_EQ(arena.largeThreshold, 5000);
}

TEST_F(Arena, PiecesAreCarvedWithoutAlignment) {
    MGR_SMem arena;
    MSG_SMemInit(&arena, 100, 0);
    void *a, *b, *c;
    ASSERT_EQ(MGR_SMemAlloc(&arena, 3, &a), 10);
    ASSERT_EQ(MGR_SMemAlloc(&arena, 5, &b), 10);
    ASSERT_EQ(MGR_SMemAlloc(&arena, 0, &c), 10);
    EXPECT_EQ(b, static_cast<uint8_t *>(a) + 3);
    EXPECT_EQ(c, static_cast<uint8_t *>(a) + 8);
    EXPECT_EQ(arena.usedInCurrent, 8);
    EXPECT_EQ(ListNumber(arena.blocks), 1);
    MGR_SMemReport(&arena);
    MGR_SMemEnd(&arena);
    EXPECT_EQ(arena.blocks, nullptr);
    EXPECT_NE(arena.current, nullptr);
}

TEST_F(Arena, ExactlyBlockSizeUsesAWholeOrdinaryBlock) {
    MGR_SMem arena;
    MSG_SMemInit(&arena, 100, 0);
    void *piece;
    ASSERT_EQ(MGR_SMemAlloc(&arena, 100, &piece), 10);
    EXPECT_EQ(piece, arena.current);
    EXPECT_EQ(arena.usedInCurrent, 100);
    EXPECT_EQ(MEM_HdlSize(arena.current), 100u);
    // The next request starts a fresh block, with nothing wasted.
    void *next;
    ASSERT_EQ(MGR_SMemAlloc(&arena, 1, &next), 10);
    EXPECT_EQ(next, arena.current);
    EXPECT_NE(next, piece);
    EXPECT_EQ(arena.wasted, 0);
    EXPECT_EQ(ListNumber(arena.blocks), 2);
    MGR_SMemEnd(&arena);
}

TEST_F(Arena, AboveBlockSizeGetsItsOwnBlock) {
    MGR_SMem arena;
    MSG_SMemInit(&arena, 100, 0);
    void *big;
    ASSERT_EQ(MGR_SMemAlloc(&arena, 101, &big), 10);
    EXPECT_EQ(arena.current, nullptr);  // current does not change
    EXPECT_EQ(MEM_HdlSize(big), 101u);
    EXPECT_EQ(ListNumber(arena.blocks), 1);
    MGR_SMemEnd(&arena);
}

TEST_F(Arena, NonFittingSmallRequestWastesTheTail) {
    MGR_SMem arena;
    MSG_SMemInit(&arena, 100, 0);  // threshold 5000: nothing here is large
    void *a, *b;
    ASSERT_EQ(MGR_SMemAlloc(&arena, 70, &a), 10);
    ASSERT_EQ(MGR_SMemAlloc(&arena, 40, &b), 10);
    EXPECT_EQ(arena.wasted, 30);
    EXPECT_EQ(b, arena.current);
    EXPECT_NE(b, a);
    EXPECT_EQ(arena.usedInCurrent, 40);
    EXPECT_EQ(ListNumber(arena.blocks), 2);
    MGR_SMemEnd(&arena);
}

TEST_F(Arena, NonFittingLargeRequestKeepsTheTail) {
    MGR_SMem arena;
    MSG_SMemInit(&arena, 1000, 600);
    void *a, *large, *c;
    ASSERT_EQ(MGR_SMemAlloc(&arena, 500, &a), 10);
    ASSERT_EQ(MGR_SMemAlloc(&arena, 700, &large), 10);
    EXPECT_EQ(arena.wasted, 0);
    EXPECT_EQ(arena.current, a);
    EXPECT_EQ(arena.usedInCurrent, 500);
    EXPECT_EQ(MEM_HdlSize(large), 700u);
    ASSERT_EQ(MGR_SMemAlloc(&arena, 400, &c), 10);
    EXPECT_EQ(c, static_cast<uint8_t *>(a) + 500);
    EXPECT_EQ(ListNumber(arena.blocks), 2);
    MGR_SMemReport(&arena);
    MGR_SMemEnd(&arena);
}

TEST_F(Arena, BlockNodeIsZeroFilledAndTheBlockIsNot) {
    MGR_SMem arena;
    MSG_SMemInit(&arena, 100, 0);
    void *piece = kUntouched;
    tessarine::testing::FailAllocationAt(1);
    EXPECT_EQ(MGR_SMemAlloc(&arena, 10, &piece), -5);
    EXPECT_EQ(LastGlobalAllocFlags(), 0x40u);
    tessarine::testing::FailAllocationAt(0);
    ASSERT_EQ(MGR_SMemAlloc(&arena, 10, &piece), 10);
    EXPECT_EQ(LastGlobalAllocFlags(), 0x00u);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 2);
    MGR_SMemEnd(&arena);
}

TEST_F(Arena, NegativeSizeIsRefused) {
    MGR_SMem arena;
    MSG_SMemInit(&arena, 100, 0);
    void *piece = kUntouched;
    EXPECT_EQ(MGR_SMemAlloc(&arena, -1, &piece), -4);
    EXPECT_EQ(piece, kUntouched);
    EXPECT_EQ(arena.blocks, nullptr);
    MGR_SMemEnd(&arena);
}

// Runs one request on a fresh arena under every injected failure.
void ArenaFailureAt(int32_t blockSize, int32_t threshold, int32_t first, int32_t second,
                    uint32_t blockBytes) {
    tstest::OutOfMemoryRecorder hook;
    tstest::ForEachAllocationFailure([&](int64_t n) {
        MGR_SMem arena;
        MSG_SMemInit(&arena, blockSize, threshold);
        void *piece = nullptr;
        tessarine::testing::FailAllocationAt(0);
        if (first > 0) {
            ASSERT_EQ(MGR_SMemAlloc(&arena, first, &piece), 10);
        }
        tessarine::testing::FailAllocationAt(n);
        hook.Clear();
        const int32_t blocksBefore = ListNumber(arena.blocks);
        piece = kUntouched;
        const int32_t status = MGR_SMemAlloc(&arena, second, &piece);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(status, -5);
            EXPECT_EQ(piece, kUntouched);
            EXPECT_EQ(ListNumber(arena.blocks), blocksBefore);
            ASSERT_EQ(hook.Calls().size(), 1u);
            EXPECT_EQ(hook.Calls()[0], n == 1 ? sizeof(ListNode) : blockBytes);
        } else {
            EXPECT_EQ(status, 10);
            EXPECT_NE(piece, kUntouched);
        }
        MGR_SMemEnd(&arena);
    });
}

TEST_F(Arena, AllocationFailureOnFirstBlock) {
    ArenaFailureAt(100, 0, 0, 10, 100);
}
TEST_F(Arena, AllocationFailureOnOwnBlock) {
    ArenaFailureAt(100, 0, 0, 150, 150);
}
TEST_F(Arena, AllocationFailureOnLargePiece) {
    ArenaFailureAt(1000, 600, 500, 700, 700);
}
TEST_F(Arena, AllocationFailureOnReplacementBlock) {
    ArenaFailureAt(100, 0, 70, 40, 100);
}

}  // namespace
