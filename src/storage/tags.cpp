// The tag layer: a stream of variable-length records laid end to end over
// the chain of a block file. Deleted space stays in the stream as free tags.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/block_file.h"

namespace {

using namespace tessarine;
using namespace tessarine::storage;

int32_t WriteTagHdr(FM_BlockFile *file, FM_BlockAddr at, const FM_TagHdr &header,
                    FM_BlockAddr *data) {
    uint8_t bytes[FM_TAG_HDR_BYTES];
    EncodeTagHdr(header, bytes);
    return FM_BlockWrite(file, at.block, at.offset, FM_TAG_HDR_BYTES, bytes, data);
}

// Takes a new block and links it after `after`.
int32_t AddBlock(FM_BlockFile *file, uint32_t after, FM_MemBlock **node) {
    int32_t status = FM_NewBlock(file, node);
    if (!Failed(status)) status = FM_InsertBlockAfter(file, after, *node);
    return status;
}

uint32_t NextOf(FM_BlockFile *file, uint32_t block, int32_t *status) {
    FM_BlockHdr header{};
    *status = FM_GetFileBlockHdrByIndex(file, block, &header);
    return header.next;
}

// Moves the tail of the insertion block, from `from` to its end, to the same
// offset of `target`, and tells the caller where each of its tags went.
int32_t MoveTail(FM_BlockFile *file, uint32_t insertion, FM_BlockAddr from, uint32_t target) {
    const uint32_t count = file->header.payloadSize - from.offset;
    int32_t status = kOk;
    {
        ScratchBlock tail(count);
        if (tail.get() == nullptr) return kErrMemory;
        status = FM_BlockRead(file, insertion, from.offset, static_cast<int32_t>(count), tail.get(),
                              nullptr);
        if (!Failed(status))
            status = FM_BlockWrite(file, target, from.offset, static_cast<int32_t>(count),
                                   tail.get(), nullptr);
    }
    if (Failed(status)) return status;
    if (file->tagCallback == nullptr) return kErrEmptyList;
    FM_BlockAddr at = from;
    // A step may come back to a smaller offset of the block (round a ring);
    // only a walk back to a tag it has passed would never leave it.
    CircleWatch watch(AddrKey(at));
    while (at.block == insertion) {
        FM_BlockAddr before = at;
        FM_BlockAddr after = {target, at.offset};
        status = file->tagCallback(&before, &after);
        if (Failed(status)) return status;
        FM_TagHdr header;
        FM_BlockAddr next;
        status = FM_TagReadHdr(file, at.block, at.offset, &header, nullptr, &next);
        if (Failed(status)) return status;
        if (next.block == insertion && watch.Step(AddrKey(next)) != 0) return kErrFileAccess;
        at = next;
    }
    return kOk;
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
    FM_MemBlock *node = nullptr;
    int32_t status = kOk;
    if (h.endBlock == 0) {
        status = AddBlock(file, h.lastBlock, &node);
        if (Failed(status)) return status;
        h.endBlock = node->index;
        h.endOffset = 0;
        SetNodeWord(node, kFirstTagField, 0);
    }
    const FM_BlockAddr at = {h.endBlock, h.endOffset};
    h.endOffset += header->length;
    while (h.endOffset > h.payloadSize) {
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

TESSARINE_API int32_t FM_TagInsertHdrAt(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                        FM_TagHdr *header, FM_BlockAddr *tag, FM_BlockAddr *data,
                                        FM_BlockAddr *next) {
    FM_BlockFileHdr &h = file->header;
    const uint32_t payload = h.payloadSize;
    if (block == 0 || (block == h.endBlock && offset == h.endOffset))
        return FM_TagAppendHdrAtEnd(file, header, tag, nullptr);

    // Free tags at the position make up the room; the first live tag after
    // them (or the end) is the following address.
    FM_TagHdr found;
    FM_BlockAddr following;
    int32_t status = FM_TagReadHdr(file, block, offset, &found, nullptr, &following);
    if (Failed(status)) return status;
    uint32_t room = 0;
    if (found.kind == 0) {
        // Free tags that lead back to one they passed would never end.
        CircleWatch watch(AddrKey({block, offset}));
        for (;;) {
            room += found.length;
            if (following.block == 0) break;
            if (watch.Step(AddrKey(following)) != 0) return kErrFileAccess;
            FM_BlockAddr after;
            status =
                FM_TagReadHdr(file, following.block, following.offset, &found, nullptr, &after);
            if (Failed(status)) return status;
            if (found.kind != 0) break;
            following = after;
        }
    } else {
        following = {block, offset};
    }

    if (room < header->length) {
        uint32_t shortage = header->length - room;
        // Only whole blocks can be put in; any other shortage would never end.
        if (shortage % payload != 0) return kErrArgument;
        FM_MemBlock *node = nullptr;
        if (following.offset == 0 && following.block == block) {
            FM_BlockHdr hdr;
            status = FM_GetFileBlockHdrByIndex(file, block, &hdr);
            if (!Failed(status)) status = AddBlock(file, hdr.prev, &node);
            if (Failed(status)) return status;
            SetNodeWord(node, kFirstTagField, 0);
            block = node->index;
            offset = 0;
            shortage -= payload;
            room += payload;
        }
        uint32_t lastAdded = block;
        while (shortage != 0) {
            status = AddBlock(file, lastAdded, &node);
            if (Failed(status)) return status;
            lastAdded = node->index;
            shortage -= payload;
            room += payload;
        }
        SetNodeWord(node, kFirstTagField, following.offset);
        if (following.block == block) {
            status = MoveTail(file, block, following, lastAdded);
            if (Failed(status)) return status;
            if (h.endBlock == block) h.endBlock = lastAdded;
            following.block = lastAdded;
        }
    }

    // Blocks that hold nothing but free space go back to the free list.
    const uint32_t length = header->length;
    if (uint64_t(room) >= uint64_t(length) + payload &&
        uint64_t(room) + offset >= 2 * uint64_t(payload) + following.offset) {
        uint32_t excess = room - length;
        uint32_t b = NextOf(file, block, &status);
        if (Failed(status)) return status;
        while (excess >= payload && b != following.block) {
            const uint32_t after = NextOf(file, b, &status);
            if (!Failed(status)) status = FM_FreeBlock(file, b);
            if (Failed(status)) return status;
            excess -= payload;
            room -= payload;
            b = after;
        }
    }

    // Less than a free tag's header left over: the new tag takes it.
    if (room - header->length < FM_TAG_HDR_BYTES) header->length = room;
    FM_BlockAddr dataAt{};
    status = WriteTagHdr(file, {block, offset}, *header, &dataAt);
    if (Failed(status)) return status;

    if (header->length < room) {
        FM_BlockAddr rest;
        status = FM_GetNextAddr(file, block, offset, header->length, &rest);
        if (Failed(status)) return status;
        if (rest.block != block) {
            FM_MemBlock *node = nullptr;
            status = FM_GetMemBlockByIndex(file, rest.block, &node);
            if (Failed(status)) return status;
            SetNodeWord(node, kFirstTagField, rest.offset);
        }
        FM_TagHdr freeTag = {0, {0, 0, 0}, room - header->length};
        status = WriteTagHdr(file, rest, freeTag, nullptr);
        if (Failed(status)) return status;
    }
    if (tag != nullptr) *tag = {block, offset};
    if (data != nullptr) *data = dataAt;
    if (next != nullptr) *next = following;
    return kOk;
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

    // Free tags that lead back to one they passed would never end.
    CircleWatch watch(AddrKey(at));
    while (following.block != 0) {
        if (watch.Step(AddrKey(following)) != 0) return kErrFileAccess;
        FM_TagHdr found;
        FM_BlockAddr after;
        status = FM_TagReadHdr(file, following.block, following.offset, &found, nullptr, &after);
        if (Failed(status)) return status;
        if (found.kind != 0) break;
        size += found.length;
        following = after;
    }

    if (following.block != 0) {
        // Blocks wholly inside the freed span leave the chain.
        if (following.block != at.block) {
            uint32_t b = NextOf(file, at.block, &status);
            if (Failed(status)) return status;
            while (b != following.block) {
                if (size < h.payloadSize) return kErrFileAccess;  // the span has no such block
                const uint32_t after = NextOf(file, b, &status);
                if (!Failed(status)) status = FM_FreeBlock(file, b);
                if (Failed(status)) return status;
                size -= h.payloadSize;
                b = after;
            }
        }
        header.kind = 0;
        header.length = size;
        status = WriteTagHdr(file, at, header, nullptr);
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
