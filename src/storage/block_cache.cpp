// The block cache: a small list of block images in most-recently-used order,
// written back only when marked dirty.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "platform/file_runtime.h"
#include "storage/block_file.h"

namespace tessarine::storage {

int32_t SlotOffset(const FM_BlockFile *file, uint32_t index, uint32_t field, int32_t *offset) {
    const uint64_t at = uint64_t(index) * file->header.stride + field;
    if (at > uint64_t(INT32_MAX)) return kErrFileAccess;
    *offset = static_cast<int32_t>(at);
    return kOk;
}

FM_MemBlock *FindCached(const FM_BlockFile *file, uint32_t index) {
    FM_MemBlock *head = file->cacheHead;
    if (head == nullptr) return nullptr;
    FM_MemBlock *node = head;
    do {
        if (node->index == index) return node;
        node = node->next;
    } while (node != head);
    return nullptr;
}

int32_t ReadLink(FM_BlockFile *file, uint32_t index, uint32_t field, uint32_t *value) {
    if (FM_MemBlock *node = FindCached(file, index)) {
        *value = NodeWord(node, field);
        return kOk;
    }
    int32_t offset = 0;
    int32_t status = SlotOffset(file, index, field, &offset);
    uint8_t bytes[4];
    if (!Failed(status)) status = FM_SeekAndRead(file->descriptor, offset, 0, bytes, 4);
    if (Failed(status)) return status;
    *value = GetU32(bytes);
    return kOk;
}

int32_t PatchLink(FM_BlockFile *file, uint32_t index, uint32_t field, uint32_t value) {
    if (FM_MemBlock *node = FindCached(file, index)) {
        SetNodeWord(node, field, value);
        return kOk;
    }
    int32_t offset = 0;
    int32_t status = SlotOffset(file, index, field, &offset);
    if (Failed(status)) return status;
    uint8_t bytes[4];
    PutU32(bytes, value);
    return FM_SeekAndWrite(file->descriptor, offset, 0, bytes, 4);
}

int32_t BlocksThatExist(FM_BlockFile *file, uint64_t *count) {
    // Asked of the file itself: walks must leave the position where the
    // reads of their steps put it.
    const int64_t length = platform::_filelength(file->descriptor);
    if (length < 0) return kErrFileAccess;
    uint64_t cached = 0;
    if (FM_MemBlock *head = file->cacheHead) {
        FM_MemBlock *node = head;
        do {
            ++cached;
            node = node->next;
        } while (node != head);
    }
    *count = uint64_t(length) / file->header.stride + 1 + cached;
    return kOk;
}

int32_t FM_GetFreeMemBlock(FM_BlockFile *file, FM_MemBlock **out) {
    if (file->cachedCount < file->cacheLimit) {
        // Cleared so that the bytes a new block carries to the file are known.
        auto *node = static_cast<FM_MemBlock *>(MEM_AllocPtr(MEM_FLAG_ZERO, file->nodeBytes));
        if (node != nullptr) {
            ++file->cachedCount;
            ListInsertHead(AsList(node), AsListHead(&file->cacheHead));
            *out = node;
            return kOk;
        }
    }
    if (file->cacheHead == nullptr || file->cachedCount < 4) return kErrMemory;
    FM_MemBlock *oldest = file->cacheHead->prev;
    if (oldest->dirty != 0) {
        int32_t offset = 0;
        int32_t status = SlotOffset(file, oldest->index, 0, &offset);
        if (!Failed(status))
            status =
                FM_SeekAndWrite(file->descriptor, offset, 0, oldest->image, file->header.stride);
        if (Failed(status)) return status;
    }
    // The ring turns: the oldest node becomes the head without unlinking.
    file->cacheHead = oldest;
    *out = oldest;
    return kOk;
}

}  // namespace tessarine::storage

using namespace tessarine;
using namespace tessarine::storage;

extern "C" {

TESSARINE_API int32_t FM_GetMemBlockByIndex(FM_BlockFile *file, uint32_t index, FM_MemBlock **out) {
    if (index == 0) return kErrArgument;
    if (FM_MemBlock *node = FindCached(file, index)) {
        ListRemove(AsList(node), AsListHead(&file->cacheHead));
        ListInsertHead(AsList(node), AsListHead(&file->cacheHead));
        *out = node;
        return kOk;
    }
    FM_MemBlock *node = nullptr;
    int32_t status = FM_GetFreeMemBlock(file, &node);
    if (Failed(status)) return status;
    int32_t offset = 0;
    status = SlotOffset(file, index, 0, &offset);
    if (!Failed(status))
        status = FM_SeekAndRead(file->descriptor, offset, 0, node->image, file->header.stride);
    if (Failed(status)) return status;
    node->dirty = 0;
    node->index = index;
    *out = node;
    return kOk;
}

TESSARINE_API int32_t FM_GetFileBlockHdrByIndex(FM_BlockFile *file, uint32_t index,
                                                FM_BlockHdr *header) {
    uint8_t bytes[FM_BLOCK_HDR_BYTES];
    if (FM_MemBlock *node = FindCached(file, index)) {
        std::memcpy(bytes, node->image, sizeof bytes);
    } else {
        int32_t offset = 0;
        int32_t status = SlotOffset(file, index, 0, &offset);
        if (!Failed(status))
            status = FM_SeekAndRead(file->descriptor, offset, 0, bytes, sizeof bytes);
        if (Failed(status)) return status;
    }
    header->next = GetU32(bytes + kNextField);
    header->prev = GetU32(bytes + kPrevField);
    header->firstTag = GetU32(bytes + kFirstTagField);
    return kOk;
}

}  // extern "C"
