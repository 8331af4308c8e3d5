// Counters behind the test hooks; consulted by the heap and the file runtime.
#pragma once

#include <cstddef>
#include <cstdint>

namespace tessarine::platform::injection {

enum Slot { kAlloc = 0, kRead, kWrite, kSeek, kSlots };

// Counts one call of the slot and says whether it must fail.
bool ShouldFail(Slot slot);

// True when a size limit is set and the request is above it.
bool TooLarge(size_t bytes);

}  // namespace tessarine::platform::injection
