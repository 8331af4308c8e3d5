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
