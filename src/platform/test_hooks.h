// Controls for the failure-injection and leak tests. Not exported: tests link
// the static build of the library.
#pragma once

#include <cstddef>
#include <cstdint>

namespace tessarine::testing {

// Make the Nth allocation from now fail (1 = the next one); 0 turns it off.
void FailAllocationAt(int64_t n);
// Make the Nth allocation from now and every later one fail, for paths that
// only fail when a fall-back allocation fails as well; 0 turns it off.
void FailAllocationsFrom(int64_t n);
// Allocations attempted since the last FailAllocationAt or ResetCounters.
int64_t AllocationCount();
// True once the injected failure has been delivered.
bool AllocationFailureHit();
// Blocks and handles now alive in the heap.
int64_t LiveBlocks();
// The flag word of the latest GlobalAlloc call, whether it failed or not.
uint32_t LastGlobalAllocFlags();

// Make every allocation above this many bytes fail, as a small heap would
// (for fuzz targets, whose inputs can ask for any size); 0 lifts the limit.
// Not touched by ResetInjection.
void LimitAllocationSize(size_t bytes);

enum class FileCall { Read, Write, Seek };
// Make the Nth call of that kind from now fail with EIO; 0 turns it off.
void FailFileCallAt(FileCall kind, int64_t n);
int64_t FileCallCount(FileCall kind);
bool FileFailureHit(FileCall kind);

// Turns every injection off and zeroes the counters.
void ResetInjection();

}  // namespace tessarine::testing
