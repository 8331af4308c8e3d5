#include "platform/injection.h"

#include <atomic>

#include "platform/test_hooks.h"

namespace tessarine::platform::injection {
namespace {

struct Counter {
    std::atomic<int64_t> calls{0};
    std::atomic<int64_t> failAt{0};
    std::atomic<bool> hit{false};
    std::atomic<bool> sticky{false};  // every call from failAt on fails
};

Counter g_counters[kSlots];
std::atomic<size_t> g_sizeLimit{0};

Slot SlotOf(testing::FileCall kind) {
    switch (kind) {
        case testing::FileCall::Read: return kRead;
        case testing::FileCall::Write: return kWrite;
        case testing::FileCall::Seek: return kSeek;
    }
    return kRead;
}

void Arm(Slot slot, int64_t n, bool sticky = false) {
    g_counters[slot].calls = 0;
    g_counters[slot].hit = false;
    g_counters[slot].sticky = sticky;
    g_counters[slot].failAt = n;
}

}  // namespace

bool ShouldFail(Slot slot) {
    Counter &c = g_counters[slot];
    const int64_t n = ++c.calls;
    if (c.failAt != 0 && (n == c.failAt || (c.sticky && n > c.failAt))) {
        c.hit = true;
        return true;
    }
    return false;
}

bool TooLarge(size_t bytes) {
    const size_t limit = g_sizeLimit;
    return limit != 0 && bytes > limit;
}

}  // namespace tessarine::platform::injection

namespace tessarine::testing {

using platform::injection::g_counters;

void FailAllocationAt(int64_t n) { platform::injection::Arm(platform::injection::kAlloc, n); }
void FailAllocationsFrom(int64_t n) {
    platform::injection::Arm(platform::injection::kAlloc, n, true);
}
int64_t AllocationCount() { return g_counters[platform::injection::kAlloc].calls; }
bool AllocationFailureHit() { return g_counters[platform::injection::kAlloc].hit; }

void FailFileCallAt(FileCall kind, int64_t n) {
    platform::injection::Arm(platform::injection::SlotOf(kind), n);
}
int64_t FileCallCount(FileCall kind) {
    return g_counters[platform::injection::SlotOf(kind)].calls;
}
bool FileFailureHit(FileCall kind) { return g_counters[platform::injection::SlotOf(kind)].hit; }

void LimitAllocationSize(size_t bytes) { platform::injection::g_sizeLimit = bytes; }

void ResetInjection() {
    for (int s = 0; s < platform::injection::kSlots; ++s)
        platform::injection::Arm(static_cast<platform::injection::Slot>(s), 0);
}

}  // namespace tessarine::testing
