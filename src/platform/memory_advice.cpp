#include "platform/memory_advice.h"

#include <sys/mman.h>

#include <cstdint>

namespace tessarine::platform {

void AdviseLargePages(void *block, size_t bytes) {
#ifdef MADV_HUGEPAGE
    constexpr uintptr_t kLargePage = uintptr_t{1} << 21;
    const auto start = reinterpret_cast<uintptr_t>(block);
    if (block == nullptr || bytes < 2 * kLargePage) return;
    const uintptr_t first = (start + kLargePage - 1) & ~(kLargePage - 1);
    const uintptr_t end = (start + bytes) & ~(kLargePage - 1);
    if (end > first) (void)::madvise(reinterpret_cast<void *>(first), end - first, MADV_HUGEPAGE);
#else
    (void)block;
    (void)bytes;
#endif
}

}  // namespace tessarine::platform
