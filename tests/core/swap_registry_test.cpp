// The swap element registry. It is process-global and made at first use, so
// the checks that need no registry run in a fresh copy of this program, and
// every other test removes what it registers.
#include <cstdint>
#include <cstdlib>
#include <vector>

#include <gtest/gtest.h>

#include <tessarine/core.h>

#include "hook_recorder.h"
#include "test_support.h"

namespace {

using tessarine::testing::AllocationFailureHit;

std::vector<std::pair<uintptr_t, int32_t>> g_calls;
int32_t g_answer = 10;
uintptr_t g_negativeFor = 0;
int32_t g_negative = -1;

int32_t Squeeze(uintptr_t element, int32_t argument) {
    g_calls.emplace_back(element, argument);
    return element == g_negativeFor ? g_negative : g_answer + static_cast<int32_t>(element & 0xFF);
}

int32_t SqueezeAndLeave(uintptr_t element, int32_t argument) {
    g_calls.emplace_back(element, argument);
    MEM_DeleteSwapElement(element);
    return 10;
}

// Runs `check` in a fresh process started from this program, where no
// registry exists yet; it returns 0 when all is well, else a code naming the
// failed check.
void InFreshProcess(int (*check)()) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(std::exit(check()), ::testing::ExitedWithCode(0), "");
}

int BeforeAnyRegistry() {
    if (MEM_SqueezMemory(0) != -1) return 1;
    if (MEM_DeleteSwapElement(5) != -1) return 2;
    if (MEM_LockSwapElement(5) != -1) return 3;
    if (MEM_UnlockSwapElement(5) != -1) return 4;
    // Argument checks come before the registry is made.
    if (MEM_RegisterSwapElement(0, Squeeze) != -4) return 5;
    if (MEM_RegisterSwapElement(5, nullptr) != -4) return 6;
    if (MEM_SqueezMemory(0) != -1) return 7;
    if (MEM_InitMemManager() != 10) return 8;
    if (tessarine::testing::LastGlobalAllocFlags() != 0) return 11;  // a fixed block
    if (MEM_SqueezMemory(0) != 10) return 9;  // empty registry
    if (MEM_InitMemManager() != 10) return 10;
    return 0;
}

int InitFailsWithMinusFive() {
    tstest::OutOfMemoryRecorder hook;
    tessarine::testing::FailAllocationAt(1);
    if (MEM_InitMemManager() != -5) return 1;
    if (!AllocationFailureHit()) return 2;
    tessarine::testing::ResetInjection();
    if (!hook.Calls().empty()) return 3;  // no out-of-memory hook here
    if (MEM_SqueezMemory(0) != -1) return 4;
    const int64_t live = tessarine::testing::LiveBlocks();
    if (MEM_InitMemManager() != 10) return 5;
    if (tessarine::testing::LiveBlocks() != live + 1) return 6;  // made once, kept
    if (MEM_InitMemManager() != 10 || tessarine::testing::LiveBlocks() != live + 1) return 7;
    return 0;
}

int RegisterMakesTheRegistry() {
    tstest::OutOfMemoryRecorder hook;
    // First allocation: the registry itself.
    tessarine::testing::FailAllocationAt(1);
    if (MEM_RegisterSwapElement(7, Squeeze) != -5) return 1;
    tessarine::testing::ResetInjection();
    if (!hook.Calls().empty()) return 2;
    if (MEM_SqueezMemory(0) != -1) return 3;
    // Second allocation: the swap node; the registry stays made.
    const int64_t live = tessarine::testing::LiveBlocks();
    tessarine::testing::FailAllocationAt(2);
    if (MEM_RegisterSwapElement(7, Squeeze) != -5) return 4;
    tessarine::testing::ResetInjection();
    if (hook.Calls().size() != 1 || hook.Calls()[0] < sizeof(ListNode) + sizeof(void *)) return 5;
    if (tessarine::testing::LiveBlocks() != live + 1) return 6;
    if (MEM_SqueezMemory(0) != 10) return 7;  // there, and empty
    if (MEM_RegisterSwapElement(7, Squeeze) != 10) return 8;
    g_calls.clear();
    if (MEM_SqueezMemory(3) != 10 + 7 || g_calls.size() != 1) return 9;
    return 0;
}

TEST(SwapRegistryFresh, BeforeAnyRegistryEverythingButRegisterIsMinusOne) {
    InFreshProcess(BeforeAnyRegistry);
}

TEST(SwapRegistryFresh, InitAllocationFailure) {
    InFreshProcess(InitFailsWithMinusFive);
}

TEST(SwapRegistryFresh, RegisterAllocationFailureAtEachAllocation) {
    InFreshProcess(RegisterMakesTheRegistry);
}

// In this process the registry is made before the leak accounting starts.
class SwapRegistry : public tstest::Sandbox {
  protected:
    void SetUp() override {
        ASSERT_EQ(MEM_InitMemManager(), 10);
        Sandbox::SetUp();
        g_calls.clear();
        g_answer = 10;
        g_negativeFor = 0;
        g_negative = -1;
    }
    void TearDown() override {
        for (uintptr_t e : registered_) {
            while (Registered(e)) MEM_DeleteSwapElement(e);
        }
        Sandbox::TearDown();
    }
    void Register(uintptr_t element, MEM_SqueezeFn fn = Squeeze) {
        ASSERT_EQ(MEM_RegisterSwapElement(element, fn), 10);
        registered_.push_back(element);
    }
    // Whether a squeeze reaches the element; elements of other tests are
    // never left behind, so the walk only sees this test's.
    static bool Registered(uintptr_t element) {
        g_calls.clear();
        MEM_UnlockSwapElement(element);
        const int32_t saved = g_answer;
        const uintptr_t savedNeg = g_negativeFor;
        g_negativeFor = 0;
        MEM_SqueezMemory(0);
        g_answer = saved;
        g_negativeFor = savedNeg;
        for (const auto &c : g_calls)
            if (c.first == element) return true;
        return false;
    }
    std::vector<uintptr_t> registered_;
};

TEST_F(SwapRegistry, EmptyRegistrySqueezesToTen) {
    EXPECT_EQ(MEM_SqueezMemory(123), 10);
}

TEST_F(SwapRegistry, InitWhenPresentIsTen) {
    const int64_t live = tessarine::testing::LiveBlocks();
    EXPECT_EQ(MEM_InitMemManager(), 10);
    EXPECT_EQ(tessarine::testing::LiveBlocks(), live);
}

TEST_F(SwapRegistry, RegisterRefusesZeroArguments) {
    EXPECT_EQ(MEM_RegisterSwapElement(0, Squeeze), -4);
    EXPECT_EQ(MEM_RegisterSwapElement(0x10, nullptr), -4);
    EXPECT_EQ(MEM_SqueezMemory(0), 10);
}

TEST_F(SwapRegistry, SqueezeWalksInRegistrationOrderAndReturnsLastResult) {
    Register(0x31);
    Register(0x12);
    Register(0x23);
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(-9), 10 + 0x23);
    const std::vector<std::pair<uintptr_t, int32_t>> expected = {
        {0x31, -9}, {0x12, -9}, {0x23, -9}};
    EXPECT_EQ(g_calls, expected);
}

TEST_F(SwapRegistry, NegativeResultStopsTheWalk) {
    Register(0x41);
    Register(0x42);
    Register(0x43);
    g_negativeFor = 0x42;
    g_negative = -77;
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(1), -77);
    ASSERT_EQ(g_calls.size(), 2u);
    EXPECT_EQ(g_calls[1].first, 0x42u);
}

TEST_F(SwapRegistry, TheWholeWordIsTestedNotTheLowHalf) {
    Register(0x51);
    Register(0x52);
    g_negativeFor = 0x51;
    g_negative = 0x0000FFFB;  // low half -5, whole word positive: goes on
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(0), 10 + 0x52);
    EXPECT_EQ(g_calls.size(), 2u);
    g_negative = static_cast<int32_t>(0x8000000Au);  // low half 10, whole word negative: stops
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(0), static_cast<int32_t>(0x8000000Au));
    EXPECT_EQ(g_calls.size(), 1u);
}

TEST_F(SwapRegistry, LockedElementsAreSkipped) {
    Register(0x61);
    Register(0x62);
    EXPECT_EQ(MEM_LockSwapElement(0x62), 10);
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(0), 10 + 0x61);
    ASSERT_EQ(g_calls.size(), 1u);
    EXPECT_EQ(g_calls[0].first, 0x61u);
    EXPECT_EQ(MEM_LockSwapElement(0x61), 10);
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(0), 10);  // no callback ran
    EXPECT_TRUE(g_calls.empty());
}

TEST_F(SwapRegistry, OneUnlockUndoesAnyNumberOfLocks) {
    Register(0x71);
    EXPECT_EQ(MEM_LockSwapElement(0x71), 10);
    EXPECT_EQ(MEM_LockSwapElement(0x71), 10);
    EXPECT_EQ(MEM_UnlockSwapElement(0x71), 10);
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(0), 10 + 0x71);
    EXPECT_EQ(g_calls.size(), 1u);
}

TEST_F(SwapRegistry, UnknownElementsAreNoFailure) {
    EXPECT_EQ(MEM_DeleteSwapElement(0xDEAD), 10);
    EXPECT_EQ(MEM_LockSwapElement(0xDEAD), 10);
    EXPECT_EQ(MEM_UnlockSwapElement(0xDEAD), 10);
}

TEST_F(SwapRegistry, DeleteRemovesTheFirstMatchOnly) {
    Register(0x81);
    Register(0x82);
    Register(0x81, SqueezeAndLeave);  // same key, registered twice
    const int64_t live = tessarine::testing::LiveBlocks();
    EXPECT_EQ(MEM_DeleteSwapElement(0x81), 10);
    EXPECT_EQ(tessarine::testing::LiveBlocks(), live - 1);
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(0), 10);  // the second 0x81 answers 10 and leaves
    const std::vector<std::pair<uintptr_t, int32_t>> expected = {{0x82, 0}, {0x81, 0}};
    EXPECT_EQ(g_calls, expected);
}

TEST_F(SwapRegistry, LockAffectsTheFirstMatchOnly) {
    Register(0x91);
    Register(0x91);
    EXPECT_EQ(MEM_LockSwapElement(0x91), 10);
    g_calls.clear();
    MEM_SqueezMemory(0);
    EXPECT_EQ(g_calls.size(), 1u);
}

TEST_F(SwapRegistry, CallbackMayDeleteItsOwnElement) {
    Register(0xA1, SqueezeAndLeave);
    Register(0xA2);
    Register(0xA3, SqueezeAndLeave);
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(4), 10);
    ASSERT_EQ(g_calls.size(), 3u);
    EXPECT_EQ(g_calls[0].first, 0xA1u);
    EXPECT_EQ(g_calls[1].first, 0xA2u);
    EXPECT_EQ(g_calls[2].first, 0xA3u);
    g_calls.clear();
    EXPECT_EQ(MEM_SqueezMemory(4), 10 + 0xA2);
    EXPECT_EQ(g_calls.size(), 1u);
}

TEST_F(SwapRegistry, RegisterAllocationFailure) {
    tstest::OutOfMemoryRecorder hook;
    const int64_t n = tstest::ForEachAllocationFailure([&](int64_t) {
        hook.Clear();
        const int32_t status = MEM_RegisterSwapElement(0xB1, Squeeze);
        if (AllocationFailureHit()) {
            EXPECT_EQ(status, -5);
            ASSERT_EQ(hook.Calls().size(), 1u);
            EXPECT_GE(hook.Calls()[0], sizeof(ListNode) + sizeof(void *));
            EXPECT_FALSE(Registered(0xB1));
        } else {
            EXPECT_EQ(status, 10);
            EXPECT_TRUE(hook.Calls().empty());
            EXPECT_EQ(MEM_DeleteSwapElement(0xB1), 10);
        }
    });
    EXPECT_EQ(n, 1);
}

TEST_F(SwapRegistry, SwapNodeIsAZeroFilledFixedBlock) {
    Register(0xC1);
    EXPECT_EQ(tessarine::testing::LastGlobalAllocFlags(), 0x40u);
}

TEST_F(SwapRegistry, InitAllocationFailureWhenPresentIsNone) {
    const int64_t n =
        tstest::ForEachAllocationFailure([](int64_t) { EXPECT_EQ(MEM_InitMemManager(), 10); });
    EXPECT_EQ(n, 0);
}

}  // namespace
