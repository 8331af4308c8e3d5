// Blocks of the node pool and the arena: each block is fixed memory named by
// a small zero-filled list node, whose data word holds the block.
#pragma once

#include <cstdint>

#include <tessarine/core.h>

namespace tessarine::detail {

// Byte count of count * size, or -1 when it is negative or does not fit the
// heap's 32-bit size word.
int64_t BlockBytes(int64_t count, int64_t size);

// Makes the node, then the block, and appends the node to `blocks`. On
// failure the out-of-memory hook hears the size that failed, what was made is
// freed, and null comes back.
uint8_t *AddPoolBlock(ListNode **blocks, uint32_t bytes);

// Frees every block, then the nodes; the head ends null.
void FreePoolBlocks(ListNode **blocks);

}  // namespace tessarine::detail
