// Memory handles and pointer blocks over the global heap.
#include <cstdint>
#include <cstring>
#include <vector>

#include <gtest/gtest.h>

#include <tessarine/core.h>

#include "hook_recorder.h"
#include "platform/heap.h"
#include "test_support.h"

namespace {

using tessarine::platform::IsMoveable;
using tessarine::testing::AllocationFailureHit;
using tessarine::testing::LastGlobalAllocFlags;
using tessarine::testing::LiveBlocks;

class Memory : public tstest::Sandbox {};

bool AllBytes(const void *p, size_t n, uint8_t v) {
    const auto *b = static_cast<const uint8_t *>(p);
    for (size_t i = 0; i < n; ++i)
        if (b[i] != v) return false;
    return true;
}

TEST_F(Memory, AllocHdlGivesMoveableHandles) {
    for (uint32_t flags : {0u, 1u, 2u, 4u, 6u, 7u}) {
        MEM_Handle h = MEM_AllocHdl(flags, 64);
        ASSERT_NE(h, nullptr) << flags;
        EXPECT_TRUE(IsMoveable(h)) << flags;
        EXPECT_EQ(MEM_HdlSize(h), 64u);
        void *p = MEM_Lock(h);
        ASSERT_NE(p, nullptr);
        if (flags & 4) {
            EXPECT_TRUE(AllBytes(p, 64, 0)) << flags;
        }
        EXPECT_EQ(MEM_Unlock(h), 0);
        EXPECT_EQ(MEM_FreeHdl(h), nullptr);
    }
}

TEST_F(Memory, AllocPtrGivesFixedBlocks) {
    for (uint32_t flags : {0u, 1u, 2u, 4u, 6u}) {
        void *p = MEM_AllocPtr(flags, 48);
        ASSERT_NE(p, nullptr) << flags;
        EXPECT_FALSE(IsMoveable(p));
        EXPECT_EQ(MEM_Lock(p), p);  // a fixed block is its own address
        EXPECT_EQ(MEM_HdlSize(p), 48u);
        if (flags & 4) {
            EXPECT_TRUE(AllBytes(p, 48, 0)) << flags;
        }
        EXPECT_EQ(MEM_FreePtr(p), nullptr);
    }
}

// The heap sees the platform's flag words: moveable 0x2, discardable 0x100
// on top of it, zero fill 0x40; bit 1 means nothing to either allocator.
TEST_F(Memory, AllocFlagsReachTheHeapAsPlatformWords) {
    const struct {
        uint32_t flags, handleWord, pointerWord;
    } cases[] = {{0, 0x002, 0x00}, {1, 0x002, 0x00}, {2, 0x102, 0x00},
                 {4, 0x042, 0x40}, {6, 0x142, 0x40}, {7, 0x142, 0x40}};
    for (const auto &c : cases) {
        MEM_Handle h = MEM_AllocHdl(c.flags, 16);
        EXPECT_EQ(LastGlobalAllocFlags(), c.handleWord) << c.flags;
        MEM_FreeHdl(h);
        void *p = MEM_AllocPtr(c.flags, 16);
        EXPECT_EQ(LastGlobalAllocFlags(), c.pointerWord) << c.flags;
        MEM_FreePtr(p);
    }
    MEM_Handle h = MEM_ReallocHdl(nullptr, 8);
    EXPECT_EQ(LastGlobalAllocFlags(), 0x002u);
    MEM_FreeHdl(h);
    void *p = MEM_ReallocPtr(nullptr, 8);
    EXPECT_EQ(LastGlobalAllocFlags(), 0x000u);
    // The fall-back blocks of a failed resize: fixed for a pointer, plain
    // moveable for a handle whatever it was made with.
    h = MEM_AllocHdl(MEM_FLAG_DISCARDABLE | MEM_FLAG_ZERO, 8);
    EXPECT_EQ(LastGlobalAllocFlags(), 0x142u);
    tessarine::testing::FailAllocationAt(1);
    p = MEM_ReallocPtr(p, 64);
    EXPECT_TRUE(AllocationFailureHit());
    EXPECT_EQ(LastGlobalAllocFlags(), 0x000u);
    tessarine::testing::FailAllocationAt(1);
    h = MEM_ReallocHdl(h, 64);
    EXPECT_TRUE(AllocationFailureHit());
    EXPECT_EQ(LastGlobalAllocFlags(), 0x002u);
    tessarine::testing::ResetInjection();
    MEM_FreeHdl(h);
    MEM_FreePtr(p);
}

TEST_F(Memory, FreePtrAndFreeHdlTakeEitherKind) {
    MEM_Handle h = MEM_AllocHdl(0, 8);
    void *p = MEM_AllocPtr(0, 8);
    EXPECT_EQ(MEM_FreePtr(h), nullptr);
    EXPECT_EQ(MEM_FreeHdl(p), nullptr);
}

TEST_F(Memory, LockCountsAndUnlockReportsPlatformValue) {
    MEM_Handle h = MEM_AllocHdl(MEM_FLAG_ZERO, 16);
    void *p = MEM_Lock(h);
    EXPECT_EQ(MEM_Lock(h), p);
    EXPECT_EQ(MEM_Unlock(h), 1);  // still locked once
    EXPECT_EQ(MEM_Unlock(h), 0);
    MEM_FreeHdl(h);
}

TEST_F(Memory, PurgeKeepsTheHandle) {
    MEM_Handle h = MEM_AllocHdl(MEM_FLAG_DISCARDABLE, 100);
    EXPECT_EQ(MEM_PurgeHdl(h), h);
    EXPECT_EQ(MEM_HdlSize(h), 0u);
    EXPECT_EQ(MEM_Lock(h), nullptr);
    // It can be brought back by a resize.
    EXPECT_EQ(MEM_ReallocHdl(h, 10), h);
    EXPECT_EQ(MEM_HdlSize(h), 10u);
    MEM_FreeHdl(h);
}

TEST_F(Memory, AllocHdlFailureReturnsZeroWithoutHook) {
    tstest::OutOfMemoryRecorder hook;
    const int64_t n = tstest::ForEachAllocationFailure([&](int64_t) {
        MEM_Handle h = MEM_AllocHdl(MEM_FLAG_ZERO, 1000);
        if (AllocationFailureHit()) {
            EXPECT_EQ(h, nullptr);
        } else {
            EXPECT_NE(h, nullptr);
            MEM_FreeHdl(h);
        }
    });
    EXPECT_EQ(n, 1);
    EXPECT_TRUE(hook.Calls().empty());
}

TEST_F(Memory, AllocPtrFailureCallsHookWithSize) {
    tstest::OutOfMemoryRecorder hook;
    const int64_t n = tstest::ForEachAllocationFailure([&](int64_t) {
        hook.Clear();
        void *p = MEM_AllocPtr(0, 1234);
        if (AllocationFailureHit()) {
            EXPECT_EQ(p, nullptr);
            EXPECT_EQ(hook.Calls(), std::vector<uint32_t>({1234u}));
        } else {
            EXPECT_NE(p, nullptr);
            EXPECT_TRUE(hook.Calls().empty());
            MEM_FreePtr(p);
        }
    });
    EXPECT_EQ(n, 1);
}

TEST_F(Memory, ReallocHdlOfNullAllocates) {
    MEM_Handle h = MEM_ReallocHdl(nullptr, 32);
    ASSERT_NE(h, nullptr);
    EXPECT_TRUE(IsMoveable(h));
    EXPECT_EQ(MEM_HdlSize(h), 32u);
    MEM_FreeHdl(h);
}

TEST_F(Memory, ReallocHdlKeepsContents) {
    MEM_Handle h = MEM_AllocHdl(0, 10);
    std::memcpy(MEM_Lock(h), "abcdefghij", 10);
    MEM_Unlock(h);
    h = MEM_ReallocHdl(h, 100000);
    ASSERT_NE(h, nullptr);
    EXPECT_EQ(std::memcmp(MEM_Lock(h), "abcdefghij", 10), 0);
    MEM_Unlock(h);
    h = MEM_ReallocHdl(h, 3);
    EXPECT_EQ(MEM_HdlSize(h), 3u);
    EXPECT_EQ(std::memcmp(MEM_Lock(h), "abc", 3), 0);
    MEM_Unlock(h);
    MEM_FreeHdl(h);
}

TEST_F(Memory, ReallocHdlAllocationFailureAtEachStep) {
    tstest::OutOfMemoryRecorder hook;
    // Resize in place fails: a fresh block takes the contents, the old goes.
    MEM_Handle h = MEM_AllocHdl(0, 7);
    std::memcpy(MEM_Lock(h), "1234567", 7);
    MEM_Unlock(h);
    const int64_t live = LiveBlocks();
    tessarine::testing::FailAllocationAt(1);
    MEM_Handle moved = MEM_ReallocHdl(h, 4096);
    ASSERT_TRUE(AllocationFailureHit());
    tessarine::testing::ResetInjection();
    ASSERT_NE(moved, nullptr);
    EXPECT_NE(moved, h);
    EXPECT_EQ(LiveBlocks(), live);
    EXPECT_EQ(MEM_HdlSize(moved), 4096u);
    EXPECT_EQ(std::memcmp(MEM_Lock(moved), "1234567", 7), 0);
    EXPECT_EQ(MEM_Unlock(moved), 0);  // both blocks were unlocked again
    // Both fail: the old block is freed and 0 comes back.
    tessarine::testing::FailAllocationsFrom(1);
    EXPECT_EQ(MEM_ReallocHdl(moved, 8192), nullptr);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(LiveBlocks(), live - 1);
    // A null handle: plain allocation, which may fail.
    tstest::ForEachAllocationFailure([](int64_t) {
        MEM_Handle fresh = MEM_ReallocHdl(nullptr, 64);
        if (AllocationFailureHit()) {
            EXPECT_EQ(fresh, nullptr);
        } else {
            MEM_FreeHdl(fresh);
        }
    });
    EXPECT_TRUE(hook.Calls().empty());  // the handle family never calls it
}

TEST_F(Memory, ReallocPtrOfNullAllocatesFixedAndCallsHookOnFailure) {
    tstest::OutOfMemoryRecorder hook;
    tstest::ForEachAllocationFailure([&](int64_t) {
        hook.Clear();
        void *p = MEM_ReallocPtr(nullptr, 77);
        if (AllocationFailureHit()) {
            EXPECT_EQ(p, nullptr);
            EXPECT_EQ(hook.Calls(), std::vector<uint32_t>({77u}));
        } else {
            ASSERT_NE(p, nullptr);
            EXPECT_FALSE(IsMoveable(p));
            EXPECT_EQ(MEM_HdlSize(p), 77u);
            MEM_FreePtr(p);
        }
    });
}

TEST_F(Memory, ReallocPtrKeepsContentsAndMayMove) {
    void *p = MEM_AllocPtr(0, 5);
    std::memcpy(p, "hello", 5);
    void *q = MEM_ReallocPtr(p, 1 << 20);
    ASSERT_NE(q, nullptr);
    EXPECT_FALSE(IsMoveable(q));
    EXPECT_EQ(std::memcmp(q, "hello", 5), 0);
    EXPECT_EQ(MEM_HdlSize(q), 1u << 20);
    MEM_FreePtr(q);
}

TEST_F(Memory, ReallocPtrAllocationFailureAtEachStep) {
    tstest::OutOfMemoryRecorder hook;
    void *p = MEM_AllocPtr(0, 6);
    std::memcpy(p, "abcdef", 6);
    const int64_t live = LiveBlocks();
    tessarine::testing::FailAllocationAt(1);
    void *moved = MEM_ReallocPtr(p, 5000);
    ASSERT_TRUE(AllocationFailureHit());
    tessarine::testing::ResetInjection();
    ASSERT_NE(moved, nullptr);
    EXPECT_FALSE(IsMoveable(moved));
    EXPECT_EQ(std::memcmp(moved, "abcdef", 6), 0);
    EXPECT_EQ(MEM_HdlSize(moved), 5000u);
    EXPECT_EQ(LiveBlocks(), live);
    EXPECT_TRUE(hook.Calls().empty());
    tessarine::testing::FailAllocationsFrom(1);
    EXPECT_EQ(MEM_ReallocPtr(moved, 9000), nullptr);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(hook.Calls(), std::vector<uint32_t>({9000u}));
    EXPECT_EQ(LiveBlocks(), live - 1);
}

int64_t g_liveWhenHookRan = -1;
int32_t NoteLiveBlocks(uint32_t) {
    g_liveWhenHookRan = LiveBlocks();
    return 0;
}

// The hook hears of the failure while the old block still exists.
TEST_F(Memory, ReallocPtrCallsTheHookBeforeFreeingTheOldBlock) {
    void *p = MEM_AllocPtr(0, 6);
    const int64_t live = LiveBlocks();
    const TS_NewMemoryHandlerFn previous = TS_SetNewMemoryHandler(NoteLiveBlocks);
    g_liveWhenHookRan = -1;
    tessarine::testing::FailAllocationsFrom(1);
    EXPECT_EQ(MEM_ReallocPtr(p, 9000), nullptr);
    tessarine::testing::ResetInjection();
    TS_SetNewMemoryHandler(previous);
    EXPECT_EQ(g_liveWhenHookRan, live);
    EXPECT_EQ(LiveBlocks(), live - 1);
}

TEST_F(Memory, FillStoresTheLowByte) {
    for (int32_t count : {0, 1, 2, 3, 4, 5, 7, 8, 9, 64, 1003}) {
        std::vector<uint8_t> buffer(static_cast<size_t>(count) + 8, 0xEE);
        MEM_Fill(buffer.data() + 4, count, 0x12345678);
        EXPECT_TRUE(AllBytes(buffer.data(), 4, 0xEE));
        EXPECT_TRUE(AllBytes(buffer.data() + 4, static_cast<size_t>(count), 0x78)) << count;
        EXPECT_TRUE(AllBytes(buffer.data() + 4 + count, 4, 0xEE)) << count;
    }
    uint8_t guard[4] = {1, 2, 3, 4};
    MEM_Fill(guard, -5, 0);
    EXPECT_EQ(guard[0], 1);
    MEM_Fill(guard, 2, -1);
    EXPECT_EQ(guard[1], 0xFF);
    EXPECT_EQ(guard[2], 3);
}

TEST_F(Memory, CopyOfZeroOrNegativeCountCopiesNothing) {
    uint8_t from[8] = {1, 2, 3, 4, 5, 6, 7, 8};
    uint8_t to[8] = {};
    MEM_Copy(from, to, 0);
    MEM_Copy(from, to, -1);
    MEM_Copy(from, to, INT32_MIN);
    EXPECT_TRUE(AllBytes(to, 8, 0));
    MEM_Copy(nullptr, nullptr, 0);
}

TEST_F(Memory, CopySourceFirst) {
    for (int32_t count : {1, 2, 3, 4, 5, 6, 7, 8, 13, 4096, 100003}) {
        std::vector<uint8_t> from(static_cast<size_t>(count)),
            to(static_cast<size_t>(count) + 4, 0xEE);
        for (int32_t i = 0; i < count; ++i)
            from[static_cast<size_t>(i)] = static_cast<uint8_t>(i * 7 + 1);
        MEM_Copy(from.data(), to.data(), count);
        EXPECT_EQ(std::memcmp(from.data(), to.data(), static_cast<size_t>(count)), 0) << count;
        EXPECT_TRUE(AllBytes(to.data() + count, 4, 0xEE));
    }
}

// Forward copy in 32-bit words, each read whole before it is written, then
// the last bytes one at a time.
void ReferenceForwardCopy(const uint8_t *s, uint8_t *d, int32_t count) {
    int32_t i = 0;
    for (; i + 4 <= count; i += 4) {
        uint8_t word[4];
        for (int k = 0; k < 4; ++k) word[k] = s[i + k];
        for (int k = 0; k < 4; ++k) d[i + k] = word[k];
    }
    for (; i < count; ++i) d[i] = s[i];
}

TEST_F(Memory, CopyToAHigherDestinationInTheSameBlockSmears) {
    for (int32_t shift : {1, 2, 3, 4, 5, 6, 7, 8, 12, 13, 40, 99}) {
        for (int32_t count : {1, 3, 4, 7, 16, 33, 100, 150}) {
            std::vector<uint8_t> block(256), expected(256);
            for (size_t i = 0; i < block.size(); ++i)
                block[i] = expected[i] = static_cast<uint8_t>(i);
            MEM_Copy(block.data(), block.data() + shift, count);
            ReferenceForwardCopy(expected.data(), expected.data() + shift, count);
            EXPECT_EQ(block, expected) << "shift " << shift << " count " << count;
        }
    }
    // The plainest case: one byte up over eight bytes repeats the first byte
    // through the first word.
    uint8_t b[12] = {10, 11, 12, 13, 14, 15, 16, 17, 18, 19, 20, 21};
    MEM_Copy(b, b + 4, 8);
    const uint8_t smeared[12] = {10, 11, 12, 13, 10, 11, 12, 13, 10, 11, 12, 13};
    EXPECT_EQ(std::memcmp(b, smeared, 12), 0);
}

TEST_F(Memory, CopyToALowerDestinationInTheSameBlockIsExact) {
    std::vector<uint8_t> block(64);
    for (size_t i = 0; i < block.size(); ++i) block[i] = static_cast<uint8_t>(i);
    MEM_Copy(block.data() + 3, block.data(), 40);
    for (size_t i = 0; i < 40; ++i) EXPECT_EQ(block[i], i + 3);
}

}  // namespace
