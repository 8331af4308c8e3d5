// Putting a tag at a position of the stream: find the room that free tags
// there give, make more room with new blocks when it is too small, give back
// blocks that would hold only free space, then write the tag and a free tag
// with what is left.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/block_file.h"
#include "storage/tag_stream.h"

namespace {

using namespace tessarine;
using namespace tessarine::storage;

// The room at an insert position: the bytes of the free tags there, and the
// first live tag behind them (or the end, block 0).
struct Room {
    uint32_t size = 0;
    FM_BlockAddr following{};
};

int32_t FindRoom(FM_BlockFile *file, FM_BlockAddr at, Room *room) {
    FM_TagHdr found;
    int32_t status = FM_TagReadHdr(file, at.block, at.offset, &found, nullptr, &room->following);
    if (Failed(status)) return status;
    if (found.kind != kFreeTag) {
        room->size = 0;
        room->following = at;
        return kOk;
    }
    room->size = found.length;
    return SkipFreeTags(file, at, &room->following, &room->size);
}

// Copies the insertion block's bytes from `from` to its end into `target` at
// the same offset.
int32_t CopyTail(FM_BlockFile *file, uint32_t insertion, FM_BlockAddr from, uint32_t target) {
    const int32_t count = static_cast<int32_t>(file->header.payloadSize - from.offset);
    ScratchBlock tail(static_cast<uint32_t>(count));
    if (tail.get() == nullptr) return kErrMemory;
    int32_t status = FM_BlockRead(file, insertion, from.offset, count, tail.get(), nullptr);
    if (!Failed(status))
        status = FM_BlockWrite(file, target, from.offset, count, tail.get(), nullptr);
    return status;
}

// Tells the caller where each tag of the moved tail went, from `from` on while
// the walk is still in the insertion block.
int32_t ReportMovedTags(FM_BlockFile *file, uint32_t insertion, FM_BlockAddr from,
                        uint32_t target) {
    if (file->tagCallback == nullptr) return kErrEmptyList;
    FM_BlockAddr at = from;
    // A step may come back to a smaller offset of the block (round a ring);
    // only a walk back to a tag it has passed would never leave it.
    CircleWatch watch(AddrKey(at));
    while (at.block == insertion) {
        FM_BlockAddr before = at;
        FM_BlockAddr after = {target, at.offset};
        int32_t status = file->tagCallback(&before, &after);
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

// Puts a new block in front of the insertion block, which the position starts:
// it becomes the insertion block, at offset 0.
int32_t PutBlockInFront(FM_BlockFile *file, FM_BlockAddr *at, FM_MemBlock **node) {
    FM_BlockHdr header;
    int32_t status = FM_GetFileBlockHdrByIndex(file, at->block, &header);
    if (!Failed(status)) status = AddBlock(file, header.prev, node);
    if (Failed(status)) return status;
    SetNodeWord(*node, kFirstTagField, 0);
    *at = {(*node)->index, 0};
    return kOk;
}

// Room too small: whole blocks go in behind the position until the room holds
// `length`, and the tail of the insertion block moves on into the last of them.
int32_t MakeRoom(FM_BlockFile *file, FM_BlockAddr *at, Room *room, uint32_t length) {
    FM_BlockFileHdr &h = file->header;
    const uint32_t payload = h.payloadSize;
    uint32_t shortage = length - room->size;
    // Only whole blocks can be put in; any other shortage would never end.
    if (shortage % payload != 0) return kErrArgument;
    FM_MemBlock *node = nullptr;
    int32_t status = kOk;
    if (room->following.offset == 0 && room->following.block == at->block) {
        status = PutBlockInFront(file, at, &node);
        if (Failed(status)) return status;
        shortage -= payload;
        room->size += payload;
    }
    uint32_t lastAdded = at->block;
    while (shortage != 0) {
        status = AddBlock(file, lastAdded, &node);
        if (Failed(status)) return status;
        lastAdded = node->index;
        shortage -= payload;
        room->size += payload;
    }
    SetNodeWord(node, kFirstTagField, room->following.offset);
    // Tags behind the position in its block would sit in front of the new room.
    if (room->following.block == at->block) {
        status = CopyTail(file, at->block, room->following, lastAdded);
        if (!Failed(status))
            status = ReportMovedTags(file, at->block, room->following, lastAdded);
        if (Failed(status)) return status;
        if (h.endBlock == at->block) h.endBlock = lastAdded;
        room->following.block = lastAdded;
    }
    return kOk;
}

// Room to spare: blocks that would hold nothing but free space go back to the
// free list.
int32_t GiveBackFreeBlocks(FM_BlockFile *file, FM_BlockAddr at, uint32_t length, Room *room) {
    const uint64_t payload = file->header.payloadSize;
    if (uint64_t(room->size) < uint64_t(length) + payload ||
        uint64_t(room->size) + at.offset < 2 * payload + room->following.offset)
        return kOk;
    uint32_t excess = room->size - length;
    uint32_t stop = 0;
    const int32_t status = FreeBlocksBefore(file, at.block, room->following.block, &excess, &stop);
    room->size = length + excess;
    return status;
}

// Writes the tag's header, taking the whole room when what is left could not
// hold a free tag's header, and a free tag with the rest otherwise.
int32_t PutTag(FM_BlockFile *file, FM_BlockAddr at, FM_TagHdr *header, uint32_t room,
               FM_BlockAddr *data) {
    if (room - header->length < FM_TAG_HDR_BYTES) header->length = room;
    int32_t status = WriteTagHdr(file, at, *header, data);
    if (Failed(status) || header->length >= room) return status;
    FM_BlockAddr rest;
    status = FM_GetNextAddr(file, at.block, at.offset, header->length, &rest);
    if (Failed(status)) return status;
    if (rest.block != at.block) {
        FM_MemBlock *node = nullptr;
        status = FM_GetMemBlockByIndex(file, rest.block, &node);
        if (Failed(status)) return status;
        SetNodeWord(node, kFirstTagField, rest.offset);
    }
    const FM_TagHdr freeTag = {kFreeTag, {0, 0, 0}, room - header->length};
    return WriteTagHdr(file, rest, freeTag, nullptr);
}

}  // namespace

extern "C" {

TESSARINE_API int32_t FM_TagInsertHdrAt(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                        FM_TagHdr *header, FM_BlockAddr *tag, FM_BlockAddr *data,
                                        FM_BlockAddr *next) {
    const FM_BlockFileHdr &h = file->header;
    if (block == 0 || (block == h.endBlock && offset == h.endOffset))
        return FM_TagAppendHdrAtEnd(file, header, tag, nullptr);
    FM_BlockAddr at = {block, offset};
    Room room;
    int32_t status = FindRoom(file, at, &room);
    if (!Failed(status) && room.size < header->length)
        status = MakeRoom(file, &at, &room, header->length);
    if (!Failed(status)) status = GiveBackFreeBlocks(file, at, header->length, &room);
    FM_BlockAddr dataAt{};
    if (!Failed(status)) status = PutTag(file, at, header, room.size, &dataAt);
    if (Failed(status)) return status;
    if (tag != nullptr) *tag = at;
    if (data != nullptr) *data = dataAt;
    if (next != nullptr) *next = room.following;
    return kOk;
}

}  // extern "C"
