// Moving bytes through the chain, block by block through the cache.
#include <algorithm>
#include <type_traits>

#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/block_file.h"

namespace {

using namespace tessarine;
using namespace tessarine::storage;

// The out address holds the last block touched and the bytes moved in it,
// not the true position: callers go on from there with FM_GetNextAddr.
template <bool kWrite, typename Buffer>
int32_t Transfer(FM_BlockFile *file, uint32_t block, uint32_t offset, int32_t count, Buffer *buffer,
                 FM_BlockAddr *last) {
    if (count < 1) return kOk;
    const uint32_t payload = file->header.payloadSize;
    if (offset > payload) return kErrArgument;  // would move outside the image
    auto *bytes = static_cast<std::conditional_t<kWrite, const uint8_t, uint8_t> *>(buffer);
    uint32_t remaining = static_cast<uint32_t>(count);
    uint32_t moved = 0;
    for (;;) {
        FM_MemBlock *node = nullptr;
        int32_t status = FM_GetMemBlockByIndex(file, block, &node);
        if (Failed(status)) return status;
        moved = std::min(payload - offset, remaining);
        if constexpr (kWrite)
            std::memcpy(NodeData(node) + offset, bytes, moved);
        else
            std::memcpy(bytes, NodeData(node) + offset, moved);
        bytes += moved;
        remaining -= moved;
        if (remaining == 0) break;
        block = NodeWord(node, kNextField);
        offset = 0;
    }
    if (last != nullptr) {
        last->block = block;
        last->offset = moved;
    }
    return kOk;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t FM_BlockRead(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                   int32_t count, void *buffer, FM_BlockAddr *last) {
    return Transfer<false>(file, block, offset, count, buffer, last);
}

// No dirty mark: only FM_NewBlock marks a block for write-back.
TESSARINE_API int32_t FM_BlockWrite(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                    int32_t count, const void *buffer, FM_BlockAddr *last) {
    return Transfer<true>(file, block, offset, count, buffer, last);
}

}  // extern "C"
