#include <gtest/gtest.h>

#include <cstring>

#include "platform/heap.h"
#include "test_support.h"

namespace {
using namespace tessarine::platform;

class Heap : public tstest::Sandbox {};

TEST_F(Heap, FixedBlockIsItsAddressAndKnowsItsSize) {
    MEM_Handle block = GlobalAlloc(GPTR, 100);
    ASSERT_NE(block, nullptr);
    EXPECT_FALSE(IsMoveable(block));
    EXPECT_EQ(GlobalLock(block), block);
    EXPECT_EQ(GlobalSize(block), 100u);
    auto *bytes = static_cast<unsigned char *>(block);
    for (int i = 0; i < 100; ++i) EXPECT_EQ(bytes[i], 0);
    EXPECT_EQ(GlobalFree(block), nullptr);
}

TEST_F(Heap, MoveableBlockLocksCountAndDiscardKeepsTheHandle) {
    MEM_Handle h = GlobalAlloc(GHND, 64);
    ASSERT_NE(h, nullptr);
    EXPECT_TRUE(IsMoveable(h));
    void *p = GlobalLock(h);
    ASSERT_NE(p, nullptr);
    EXPECT_EQ(GlobalLock(h), p);
    EXPECT_EQ(GlobalUnlock(h), 1);  // still locked once
    EXPECT_EQ(GlobalReAlloc(h, 0, GMEM_MOVEABLE), nullptr) << "a locked block is not discarded";
    EXPECT_EQ(GlobalUnlock(h), 0);
    EXPECT_EQ(GlobalReAlloc(h, 0, GMEM_MOVEABLE), h);
    EXPECT_EQ(GlobalSize(h), 0u);
    EXPECT_EQ(GlobalLock(h), nullptr);
    EXPECT_EQ(GlobalReAlloc(h, 16, GMEM_MOVEABLE | GMEM_ZEROINIT), h);
    EXPECT_EQ(GlobalSize(h), 16u);
    EXPECT_EQ(GlobalFree(h), nullptr);
}

TEST_F(Heap, ResizeKeepsContentsAndZeroFillsGrowth) {
    MEM_Handle h = GlobalAlloc(GMEM_MOVEABLE, 8);
    std::memset(GlobalLock(h), 0xAB, 8);
    GlobalUnlock(h);
    ASSERT_EQ(GlobalReAlloc(h, 4096, GMEM_MOVEABLE | GMEM_ZEROINIT), h);
    auto *p = static_cast<unsigned char *>(GlobalLock(h));
    EXPECT_EQ(p[7], 0xAB);
    EXPECT_EQ(p[8], 0);
    EXPECT_EQ(p[4095], 0);
    GlobalUnlock(h);
    GlobalFree(h);
}

TEST_F(Heap, FixedBlockIsNeverDiscardedAndMovesOnlyWhenAllowed) {
    MEM_Handle block = GlobalAlloc(GMEM_FIXED, 32);
    ASSERT_NE(block, nullptr);
    std::memset(block, 0x5C, 32);
    EXPECT_EQ(GlobalReAlloc(block, 0, GMEM_MOVEABLE), nullptr);
    EXPECT_EQ(GlobalSize(block), 32u);
    // Without GMEM_MOVEABLE it may shrink where it stands but not grow.
    EXPECT_EQ(GlobalReAlloc(block, 16, 0), block);
    EXPECT_EQ(GlobalSize(block), 16u);
    EXPECT_EQ(GlobalReAlloc(block, 64, 0), nullptr);
    EXPECT_EQ(GlobalSize(block), 16u);
    MEM_Handle moved = GlobalReAlloc(block, 4096, GMEM_MOVEABLE | GMEM_ZEROINIT);
    ASSERT_NE(moved, nullptr);
    EXPECT_FALSE(IsMoveable(moved));
    EXPECT_EQ(GlobalSize(moved), 4096u);
    auto *bytes = static_cast<unsigned char *>(moved);
    EXPECT_EQ(bytes[15], 0x5C);
    EXPECT_EQ(bytes[16], 0);
    EXPECT_EQ(bytes[4095], 0);
    EXPECT_EQ(GlobalUnlock(moved), 0);  // fixed blocks carry no lock count
    EXPECT_EQ(GlobalFree(moved), nullptr);
}

TEST_F(Heap, LockedMoveableBlockGrowsOnlyWhenItMayMove) {
    MEM_Handle h = GlobalAlloc(GMEM_MOVEABLE | GMEM_DISCARDABLE, 32);
    ASSERT_NE(h, nullptr);
    ASSERT_NE(GlobalLock(h), nullptr);
    EXPECT_EQ(GlobalReAlloc(h, 64, 0), nullptr);
    EXPECT_EQ(GlobalReAlloc(h, 16, 0), h);
    EXPECT_EQ(GlobalSize(h), 16u);
    EXPECT_EQ(GlobalReAlloc(h, 64, GMEM_MOVEABLE), h);  // the handle stays
    EXPECT_EQ(GlobalSize(h), 64u);
    EXPECT_EQ(GlobalUnlock(h), 0);
    EXPECT_EQ(GlobalUnlock(h), 0);  // not locked: nothing to undo
    EXPECT_EQ(GlobalFree(h), nullptr);
}

TEST_F(Heap, EmptyMoveableBlockStartsDiscarded) {
    MEM_Handle h = GlobalAlloc(GHND, 0);
    ASSERT_NE(h, nullptr);
    EXPECT_TRUE(IsMoveable(h));
    EXPECT_EQ(GlobalSize(h), 0u);
    EXPECT_EQ(GlobalLock(h), nullptr);
    EXPECT_EQ(GlobalFree(h), nullptr);
    EXPECT_EQ(GlobalFree(nullptr), nullptr);
}

TEST_F(Heap, InjectedFailureFailsTheNthAllocationOnly) {
    tessarine::testing::FailAllocationAt(2);
    MEM_Handle a = GlobalAlloc(GPTR, 10);
    MEM_Handle b = GlobalAlloc(GHND, 10);
    MEM_Handle c = GlobalAlloc(GPTR, 10);
    EXPECT_NE(a, nullptr);
    EXPECT_EQ(b, nullptr);
    EXPECT_NE(c, nullptr);
    EXPECT_TRUE(tessarine::testing::AllocationFailureHit());
    GlobalFree(a);
    GlobalFree(c);
}

TEST_F(Heap, AbsurdSizeGivesNothing) {
    EXPECT_EQ(GlobalAlloc(GPTR, SIZE_MAX), nullptr);
    EXPECT_EQ(GlobalAlloc(GHND, SIZE_MAX - 8), nullptr);
}

}  // namespace
