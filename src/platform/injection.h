// Counters behind the test hooks; consulted by the heap and the file runtime.
#pragma once

#include <cstdint>

namespace tessarine::platform::injection {

enum Slot { kAlloc = 0, kRead, kWrite, kSeek, kSlots };

// Counts one call of the slot and says whether it must fail.
bool ShouldFail(Slot slot);

}  // namespace tessarine::platform::injection
