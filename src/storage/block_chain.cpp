// The chain of blocks and the free list: taking, linking, freeing and
// stepping through blocks. A neighbour's link is patched in its cached node
// when there is one, else with a 4-byte write, so that a chain change does not
// pull blocks into the cache.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/block_file.h"

namespace tessarine::storage {

int32_t NextAddr(FM_BlockFile *file, uint32_t block, uint32_t offset, uint32_t distance,
                 FM_BlockAddr *result, BlockObserver observer, void *context) {
    const uint32_t payload = file->header.payloadSize;
    result->block = block;
    result->offset = offset + distance;
    CircleWatch watch(block);
    while (result->offset >= payload) {
        result->offset -= payload;
        FM_BlockHdr header;
        int32_t status = FM_GetFileBlockHdrByIndex(file, result->block, &header);
        if (Failed(status)) return status;
        result->block = header.next;
        if (observer != nullptr) {
            status = observer(context, result->block, result->offset);
            if (status != kOk) return status;
        }
        // Every chain closes on itself, so a long distance goes round it:
        // whole turns end where they began and are skipped.
        if (const uint64_t circle = watch.Step(result->block)) {
            const uint64_t turns = result->offset / payload / circle;
            result->offset -= static_cast<uint32_t>(turns * circle * payload);
        }
    }
    if (result->block == file->header.endBlock && result->offset >= file->header.endOffset)
        result->block = 0;
    return kOk;
}

}  // namespace tessarine::storage

using namespace tessarine;
using namespace tessarine::storage;

extern "C" {

TESSARINE_API int32_t FM_NewBlock(FM_BlockFile *file, FM_MemBlock **out) {
    FM_MemBlock *node = nullptr;
    int32_t status = FM_GetFreeMemBlock(file, &node);
    if (Failed(status)) return status;
    // The node takes its index before the read or seek that may fail, and
    // keeps it then; only the marks of a new block wait for success.
    FM_BlockFileHdr &h = file->header;
    if (h.freeHead != 0) {
        node->index = h.freeHead;
        int32_t offset = 0;
        uint8_t bytes[4];
        status = SlotOffset(file, h.freeHead, kNextField, &offset);
        if (!Failed(status)) status = FM_SeekAndRead(file->descriptor, offset, 0, bytes, 4);
        if (!Failed(status)) h.freeHead = GetU32(bytes);
    } else {
        node->index = h.nextIndex;
        ++h.nextIndex;
        // The slot after the new block, counted without wrapping round.
        const uint64_t after = (uint64_t(node->index) + 1) * h.stride;
        status = after > uint64_t(INT32_MAX)
                     ? kErrFileAccess
                     : FM_Seek(file->descriptor, 0, static_cast<int32_t>(after));
    }
    if (Failed(status)) {
        // A damaged header can name a slot that no file offset reaches: a
        // dirty node there could never be written back, and would hold up
        // the close and every later eviction.
        int32_t offset = 0;
        if (Failed(SlotOffset(file, node->index, 0, &offset))) node->dirty = 0;
        return status;
    }
    node->dirty = 1;
    SetNodeWord(node, kNextField, 0);
    SetNodeWord(node, kPrevField, 0);
    SetNodeWord(node, kFirstTagField, h.payloadSize);
    *out = node;
    return kOk;
}

TESSARINE_API int32_t FM_InsertBlockAfter(FM_BlockFile *file, uint32_t after, FM_MemBlock *node) {
    FM_BlockFileHdr &h = file->header;
    int32_t status = kOk;
    if (after != 0) {
        uint32_t oldNext = 0;
        if (FM_MemBlock *cached = FindCached(file, after)) {
            oldNext = NodeWord(cached, kNextField);
            SetNodeWord(cached, kNextField, node->index);
        } else {
            status = ReadLink(file, after, kNextField, &oldNext);
            if (!Failed(status)) status = PatchLink(file, after, kNextField, node->index);
            if (Failed(status)) return status;
        }
        SetNodeWord(node, kNextField, oldNext);
        SetNodeWord(node, kPrevField, after);
        if (oldNext == 0)
            h.lastBlock = node->index;
        else
            status = PatchLink(file, oldNext, kPrevField, node->index);
        return status;
    }
    if (h.firstBlock == 0) {
        h.firstBlock = h.lastBlock = node->index;
    } else {
        status = PatchLink(file, h.firstBlock, kPrevField, node->index);
        if (Failed(status)) return status;
    }
    SetNodeWord(node, kNextField, h.firstBlock);
    SetNodeWord(node, kPrevField, 0);
    return kOk;
}

TESSARINE_API int32_t FM_FreeBlock(FM_BlockFile *file, uint32_t index) {
    // Block 0 is the file header: freeing it would overwrite the magic.
    if (index == 0) return kErrArgument;
    FM_BlockHdr old;
    if (FM_MemBlock *node = FindCached(file, index)) {
        old.next = NodeWord(node, kNextField);
        old.prev = NodeWord(node, kPrevField);
        old.firstTag = NodeWord(node, kFirstTagField);
        // The count keeps the released node, so the cache fills earlier.
        ListRemove(AsList(node), AsListHead(&file->cacheHead));
        MEM_FreeHdl(node);
    } else {
        int32_t status = FM_GetFileBlockHdrByIndex(file, index, &old);
        if (Failed(status)) return status;
    }
    FM_BlockFileHdr &h = file->header;
    if (h.firstBlock == index) h.firstBlock = old.next;
    if (h.lastBlock == index) h.lastBlock = old.prev;
    if (old.prev != 0) {
        int32_t status = PatchLink(file, old.prev, kNextField, old.next);
        if (Failed(status)) return status;
    }
    if (old.next != 0) {
        int32_t status = PatchLink(file, old.next, kPrevField, old.prev);
        if (Failed(status)) return status;
    }
    // The free link goes to the file even if a stale image of the block is
    // still cached under the same index.
    int32_t offset = 0;
    int32_t status = SlotOffset(file, index, kNextField, &offset);
    uint8_t link[4];
    PutU32(link, h.freeHead);
    if (!Failed(status)) status = FM_SeekAndWrite(file->descriptor, offset, 0, link, 4);
    if (Failed(status)) return status;
    h.freeHead = index;
    return kOk;
}

TESSARINE_API int32_t FM_GetNextAddr(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                     uint32_t distance, FM_BlockAddr *result) {
    return NextAddr(file, block, offset, distance, result, nullptr, nullptr);
}

}  // extern "C"
