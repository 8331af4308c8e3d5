// Large-page advice is a hint: any block, aligned or not, stays usable.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>

#include "platform/heap.h"
#include "platform/memory_advice.h"

namespace {

namespace pf = tessarine::platform;

TEST(MemoryAdvice, AnyBlockStaysUsable) {
    pf::AdviseLargePages(nullptr, 0);
    pf::AdviseLargePages(nullptr, size_t{64} << 20);
    for (size_t bytes : {size_t{1}, size_t{4096}, (size_t{4} << 20) - 1, (size_t{9} << 20) + 3}) {
        auto *block = static_cast<uint8_t *>(pf::GlobalAlloc(pf::GMEM_FIXED, bytes));
        ASSERT_NE(block, nullptr);
        pf::AdviseLargePages(block, bytes);
        pf::AdviseLargePages(block + 1, bytes - 1);
        std::memset(block, 0x5A, bytes);
        EXPECT_EQ(block[0], 0x5A);
        EXPECT_EQ(block[bytes / 2], 0x5A);
        EXPECT_EQ(block[bytes - 1], 0x5A);
        pf::GlobalFree(block);
    }
}

}  // namespace
