#include "core/pool_blocks.h"

#include <limits>

namespace tessarine::detail {

int64_t BlockBytes(int64_t count, int64_t size) {
    if (count < 0 || size < 0) return -1;
    const int64_t bytes = count * size;  // both below 2^31: no overflow
    return bytes > std::numeric_limits<uint32_t>::max() ? -1 : bytes;
}

uint8_t *AddPoolBlock(ListNode **blocks, uint32_t bytes) {
    auto *node = static_cast<ListNode *>(MEM_AllocPtr(MEM_FLAG_ZERO, sizeof(ListNode)));
    if (node == nullptr) return nullptr;
    auto *block = static_cast<uint8_t *>(MEM_AllocPtr(0, bytes));
    if (block == nullptr) {
        MEM_FreeHdl(node);
        return nullptr;
    }
    node->data = reinterpret_cast<uintptr_t>(block);
    ListAppend(node, blocks);
    return block;
}

void FreePoolBlocks(ListNode **blocks) {
    if (ListNode *first = *blocks) {
        ListNode *node = first;
        do {
            MEM_FreeHdl(reinterpret_cast<MEM_Handle>(node->data));
            node = node->next;
        } while (node != first);
    }
    FreeEntireList(blocks);
}

}  // namespace tessarine::detail
