// Copying the live tags of a block file into a new one, which leaves the
// free tags behind and so compacts the stream.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/block_file.h"
#include "storage/tag_stream.h"

namespace {

using namespace tessarine;
using namespace tessarine::storage;

constexpr uint8_t kDupCacheLimit = 5;

// Blocks the walk has stepped into. When the stream ends exactly at a block's
// end the chain gives no end mark, and the walk ends where it would step into
// a block it has already passed.
struct Passed {
    uint8_t *bits = nullptr;
    uint64_t count = 0;
    bool revisit = false;  // the last tag steps into a passed block

    Passed() = default;
    Passed(const Passed &) = delete;
    Passed &operator=(const Passed &) = delete;
    ~Passed() {
        if (bits != nullptr) MEM_FreeHdl(bits);
    }
    int32_t Make(uint64_t blocks) {
        count = blocks;
        bits = static_cast<uint8_t *>(MEM_AllocPtr(MEM_FLAG_ZERO, uint32_t(count / 8 + 1)));
        return bits == nullptr ? kErrMemory : kOk;
    }
    // A block the file does not hold is never passed: the walk's own read of
    // it fails.
    bool Seen(uint32_t block) const {
        return block < count && ((bits[block / 8] >> (block % 8)) & 1);
    }
    void Mark(uint32_t block) {
        if (block < count) bits[block / 8] |= uint8_t(1u << (block % 8));
    }

    static int32_t Step(void *context, uint32_t block, uint32_t) {
        auto *self = static_cast<Passed *>(context);
        // A next of 0 ends the chain: no tag follows.
        if (block == 0) return kOk;
        if (self->Seen(block)) {
            self->revisit = true;
            return kStopWalk;
        }
        self->Mark(block);
        return kOk;
    }
};

// Copies `count` data bytes from one stream to the other, a block's worth at
// a time, each transfer going on from the address the last one gave.
int32_t CopyData(FM_BlockFile *source, FM_BlockAddr from, FM_BlockFile *destination,
                 FM_BlockAddr to, uint32_t count, uint8_t *buffer) {
    const uint32_t piece = source->header.payloadSize;
    while (count > 0) {
        const uint32_t n = count < piece ? count : piece;
        int32_t status =
            FM_BlockRead(source, from.block, from.offset, static_cast<int32_t>(n), buffer, &from);
        if (!Failed(status))
            status = FM_BlockWrite(destination, to.block, to.offset, static_cast<int32_t>(n),
                                   buffer, &to);
        if (Failed(status)) return status;
        count -= n;
    }
    return kOk;
}

// Appends a live tag to the destination and copies its data; the data lies
// 8 bytes on from each tag's address.
int32_t CopyLiveTag(FM_BlockFile *source, FM_BlockAddr at, const FM_TagHdr &header,
                    FM_BlockFile *destination, uint8_t *buffer) {
    FM_BlockAddr tag;
    int32_t status = FM_TagAppendHdrAtEnd(destination, &header, &tag, nullptr);
    if (Failed(status) || header.length == FM_TAG_HDR_BYTES) return status;
    FM_BlockAddr from;
    FM_BlockAddr to;
    status = FM_GetNextAddr(source, at.block, at.offset, FM_TAG_HDR_BYTES, &from);
    if (!Failed(status))
        status = FM_GetNextAddr(destination, tag.block, tag.offset, FM_TAG_HDR_BYTES, &to);
    if (Failed(status)) return status;
    return CopyData(source, from, destination, to, header.length - FM_TAG_HDR_BYTES, buffer);
}

// Each tag is handled before the walk steps on from it, so a tag whose data
// runs off the chain is appended and fails in its copy.
int32_t CopyLiveTags(FM_BlockFile *source, FM_BlockFile *destination, uint8_t *buffer) {
    const FM_BlockFileHdr &h = source->header;
    if (h.firstBlock == 0 || (h.firstBlock == h.endBlock && h.endOffset == 0)) return kOk;
    uint64_t blocks = 0;
    int32_t status = BlocksThatExist(source, &blocks);
    if (Failed(status)) return status;
    Passed passed;
    const bool fullLastBlock = h.endBlock == 0;
    if (fullLastBlock) {
        status = passed.Make(blocks);
        if (Failed(status)) return status;
        passed.Mark(h.firstBlock);
    }

    FM_BlockAddr at = {h.firstBlock, 0};
    // Tags that lead back to one the walk has passed would be copied for ever.
    CircleWatch watch(AddrKey(at));
    while (at.block != 0) {
        FM_TagHdr header;
        status = FM_TagReadHdr(source, at.block, at.offset, &header, nullptr, nullptr);
        if (Failed(status)) return status;
        if (header.kind != kFreeTag) {
            // A tag longer than the file can hold would make the copy grow
            // without end; one shorter than its header has a data count that
            // wraps round.
            if (header.length < FM_TAG_HDR_BYTES ||
                uint64_t(header.length) > blocks * uint64_t(h.payloadSize))
                return kErrFileAccess;
            status = CopyLiveTag(source, at, header, destination, buffer);
            if (Failed(status)) return status;
        }
        FM_BlockAddr next;
        status = NextAddr(source, at.block, at.offset, header.length, &next,
                          fullLastBlock ? Passed::Step : nullptr, &passed);
        if (Failed(status)) return status;
        if (passed.revisit) next.block = 0;
        if (next.block != 0 && watch.Step(AddrKey(next)) != 0) return kErrFileAccess;
        at = next;
    }
    return kOk;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t FM_DupTagBlockFile(const char *sourcePath, const char *destinationPath) {
    FM_BlockFile *source = nullptr;
    int32_t status = FM_BlockFileOpen(sourcePath, &source, kDupCacheLimit);
    if (Failed(status)) return status;
    FM_BlockFile *destination = nullptr;
    status = FM_BlockFileCreate(destinationPath, &destination, source->header.payloadSize,
                                kDupCacheLimit, source->tagCallback);
    if (!Failed(status)) {
        ScratchBlock piece(source->header.payloadSize);
        status =
            piece.get() == nullptr ? kErrMemory : CopyLiveTags(source, destination, piece.get());
    }
    const int32_t closedDestination = FM_BlockFileClose(&destination);
    const int32_t closedSource = FM_BlockFileClose(&source);
    if (Failed(status)) return status;
    if (Failed(closedDestination)) return closedDestination;
    return closedSource;
}

}  // extern "C"
