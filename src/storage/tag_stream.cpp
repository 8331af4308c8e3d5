// Steps shared by the tag operations: header writes, new blocks, the walk
// over free tags and the release of blocks that hold only free space.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/block_file.h"
#include "storage/tag_stream.h"

namespace tessarine::storage {

int32_t WriteTagHdr(FM_BlockFile *file, FM_BlockAddr at, const FM_TagHdr &header,
                    FM_BlockAddr *data) {
    uint8_t bytes[FM_TAG_HDR_BYTES];
    EncodeTagHdr(header, bytes);
    return FM_BlockWrite(file, at.block, at.offset, FM_TAG_HDR_BYTES, bytes, data);
}

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

int32_t SkipFreeTags(FM_BlockFile *file, FM_BlockAddr start, FM_BlockAddr *following,
                     uint32_t *total) {
    CircleWatch watch(AddrKey(start));
    while (following->block != 0) {
        if (watch.Step(AddrKey(*following)) != 0) return kErrFileAccess;
        FM_TagHdr found;
        FM_BlockAddr after;
        const int32_t status =
            FM_TagReadHdr(file, following->block, following->offset, &found, nullptr, &after);
        if (Failed(status)) return status;
        if (found.kind != kFreeTag) break;
        *total += found.length;
        *following = after;
    }
    return kOk;
}

int32_t FreeBlocksBefore(FM_BlockFile *file, uint32_t from, uint32_t until, uint32_t *budget,
                         uint32_t *stop) {
    const uint32_t payload = file->header.payloadSize;
    int32_t status = kOk;
    uint32_t block = NextOf(file, from, &status);
    if (Failed(status)) return status;
    // A span of free space as long as a damaged stream can make it would have
    // blocks freed again and again round a ring: no walk frees more blocks
    // than there were before it began (its own link writes can make the file
    // longer).
    uint64_t freed = 0;
    uint64_t blocks = 0;
    while (*budget >= payload && block != until) {
        if (freed++ == 0) {
            status = BlocksThatExist(file, &blocks);
            if (Failed(status)) return status;
        }
        if (freed > blocks) return kErrFileAccess;
        const uint32_t after = NextOf(file, block, &status);
        if (!Failed(status)) status = FM_FreeBlock(file, block);
        if (Failed(status)) return status;
        *budget -= payload;
        block = after;
    }
    *stop = block;
    return kOk;
}

}  // namespace tessarine::storage
