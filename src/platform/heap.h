// The global-heap stand-in: fixed blocks (the value is the address) and
// moveable blocks (an opaque handle with a lock count that may move on resize,
// be discarded to size 0 and report its size). Every allocation of the library
// goes through here, so that tests can make any one of them fail.
#pragma once

#include <cstddef>
#include <cstdint>

#include <tessarine/platform.h>

namespace tessarine::platform {

// Flag words with the platform's numeric values.
inline constexpr uint32_t GMEM_FIXED = 0x0000;
inline constexpr uint32_t GMEM_MOVEABLE = 0x0002;
inline constexpr uint32_t GMEM_ZEROINIT = 0x0040;
inline constexpr uint32_t GMEM_DISCARDABLE = 0x0100;
inline constexpr uint32_t GPTR = GMEM_FIXED | GMEM_ZEROINIT;
inline constexpr uint32_t GHND = GMEM_MOVEABLE | GMEM_ZEROINIT;

MEM_Handle GlobalAlloc(uint32_t flags, size_t bytes);
void *GlobalLock(MEM_Handle block);
// Nonzero while the block stays locked after this unlock.
int32_t GlobalUnlock(MEM_Handle block);
size_t GlobalSize(MEM_Handle block);
// Size 0 with GMEM_MOVEABLE discards an unlocked moveable block (the handle
// stays). Otherwise resizes; a fixed block moves only with GMEM_MOVEABLE.
// Returns the block's word (new for a moved fixed block), or 0 on failure, in
// which case the block is untouched.
MEM_Handle GlobalReAlloc(MEM_Handle block, size_t bytes, uint32_t flags);
// 0 on success, the block itself if it was not a block of this heap.
MEM_Handle GlobalFree(MEM_Handle block);

// True when the word names a moveable block; constant time, no lookup.
bool IsMoveable(MEM_Handle block);

// The application's out-of-memory hook.
int32_t NewMemoryHandler(uint32_t size);

}  // namespace tessarine::platform
