// The tag layer: a stream of variable-length records laid end to end over
// the chain of a block file. Deleted space stays in the stream as free tags.
// Reading, appending, deleting and rewriting; inserting is in tag_insert.cpp.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/block_file.h"
#include "storage/tag_stream.h"

namespace {

using namespace tessarine;
using namespace tessarine::storage;

// Takes a block for the append position when there is none: it becomes the
// end block, and the first tag in it starts at offset 0.
int32_t TakeEndBlock(FM_BlockFile *file) {
    FM_BlockFileHdr &h = file->header;
    FM_MemBlock *node = nullptr;
    const int32_t status = AddBlock(file, h.lastBlock, &node);
    if (Failed(status)) return status;
    h.endBlock = node->index;
    h.endOffset = 0;
    SetNodeWord(node, kFirstTagField, 0);
    return kOk;
}

// What a deleted span becomes when a live tag follows it: blocks wholly inside
// it leave the chain, and the rest is one free tag.
int32_t FreeSpan(FM_BlockFile *file, FM_BlockAddr at, FM_TagHdr header, uint32_t size,
                 FM_BlockAddr following) {
    if (following.block != at.block) {
        uint32_t stop = 0;
        const int32_t status = FreeBlocksBefore(file, at.block, following.block, &size, &stop);
        if (Failed(status)) return status;
        if (stop != following.block) return kErrFileAccess;  // the span has no such block
    }
    header.kind = kFreeTag;
    header.length = size;
    return WriteTagHdr(file, at, header, nullptr);
}

}  // namespace

extern "C" {

TESSARINE_API int32_t FM_TagReadHdr(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                    FM_TagHdr *header, FM_BlockAddr *data, FM_BlockAddr *next) {
    uint8_t bytes[FM_TAG_HDR_BYTES];
    FM_BlockAddr dataAt{};
    int32_t status = FM_BlockRead(file, block, offset, FM_TAG_HDR_BYTES, bytes, &dataAt);
    if (Failed(status)) return status;
    DecodeTagHdr(bytes, header);
    if (data != nullptr) *data = dataAt;
    if (next != nullptr) return FM_GetNextAddr(file, block, offset, header->length, next);
    return kOk;
}

TESSARINE_API int32_t FM_TagAppendHdrAtEnd(FM_BlockFile *file, const FM_TagHdr *header,
                                           FM_BlockAddr *tag, FM_BlockAddr *data) {
    FM_BlockFileHdr &h = file->header;
    // An append position lies inside its block; one beyond it comes from a
    // damaged header and would take blocks without end.
    if (h.endBlock != 0 && h.endOffset >= h.payloadSize) return kErrFileAccess;
    int32_t status = h.endBlock == 0 ? TakeEndBlock(file) : kOk;
    if (Failed(status)) return status;
    const FM_BlockAddr at = {h.endBlock, h.endOffset};
    h.endOffset += header->length;
    while (h.endOffset > h.payloadSize) {
        FM_MemBlock *node = nullptr;
        status = AddBlock(file, h.lastBlock, &node);
        if (Failed(status)) return status;
        h.endBlock = node->index;
        h.endOffset -= h.payloadSize;
    }
    if (h.endOffset == h.payloadSize) h.endBlock = h.endOffset = 0;
    status = WriteTagHdr(file, at, *header, data);
    if (!Failed(status) && tag != nullptr) *tag = at;
    return status;
}

TESSARINE_API int32_t FM_TagDelete(FM_BlockFile *file, const FM_BlockAddr *tag,
                                   FM_BlockAddr *next) {
    FM_BlockFileHdr &h = file->header;
    const FM_BlockAddr at = *tag;
    FM_TagHdr header;
    FM_BlockAddr following;
    int32_t status = FM_TagReadHdr(file, at.block, at.offset, &header, nullptr, &following);
    if (Failed(status)) return status;
    uint32_t size = header.length;
    status = SkipFreeTags(file, at, &following, &size);
    if (Failed(status)) return status;

    if (following.block != 0) {
        status = FreeSpan(file, at, header, size, following);
        if (Failed(status)) return status;
    } else if (at.offset == 0) {
        status = FM_FreeBlock(file, at.block);
        if (Failed(status)) return status;
        h.endBlock = h.endOffset = 0;
    } else {
        h.endBlock = at.block;
        h.endOffset = at.offset;
    }
    if (next != nullptr) *next = following;
    return kOk;
}

TESSARINE_API int32_t FM_TagRewriteHdr(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                       FM_TagHdr *header, FM_BlockAddr *tag, FM_BlockAddr *data,
                                       FM_BlockAddr *next) {
    const FM_BlockAddr at = {block, offset};
    FM_BlockAddr following{};
    int32_t status = FM_TagDelete(file, &at, &following);
    if (Failed(status)) return status;
    if (following.block != 0)
        return FM_TagInsertHdrAt(file, block, offset, header, tag, data, next);
    if (next != nullptr) *next = {0, 0};
    return FM_TagAppendHdrAtEnd(file, header, tag, data);
}

}  // extern "C"
