// Internal services of the block file: byte order, slot arithmetic, cache
// look-ups and link patching shared by the block and tag layers.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "storage/little_endian.h"

namespace tessarine::storage {

static_assert(sizeof(FM_BlockFileHdr) == 36, "block file header is 36 bytes on disk");
static_assert(sizeof(FM_BlockHdr) == 12, "block header is 12 bytes on disk");
static_assert(sizeof(FM_TagHdr) == 8, "tag header is 8 bytes on disk");
static_assert(offsetof(FM_MemBlock, dirty) == offsetof(ListNode, data) &&
                  offsetof(FM_MemBlock, next) == offsetof(ListNode, next) &&
                  offsetof(FM_MemBlock, prev) == offsetof(ListNode, prev),
              "a cache node starts as a list node");

inline constexpr uint32_t kNextField = 0;  // slot offsets of the link words
inline constexpr uint32_t kPrevField = 4;
inline constexpr uint32_t kFirstTagField = 8;

inline ListNode *AsList(FM_MemBlock *node) {
    return reinterpret_cast<ListNode *>(node);
}
inline ListNode **AsListHead(FM_MemBlock **head) {
    return reinterpret_cast<ListNode **>(head);
}

inline uint8_t *NodeData(FM_MemBlock *node) {
    return node->image + FM_BLOCK_HDR_BYTES;
}
inline uint32_t NodeWord(const FM_MemBlock *node, uint32_t field) {
    return GetU32(node->image + field);
}
inline void SetNodeWord(FM_MemBlock *node, uint32_t field, uint32_t value) {
    PutU32(node->image + field, value);
}

void EncodeFileHdr(const FM_BlockFileHdr &header, uint8_t out[FM_BLOCKFILE_HDR_BYTES]);
void DecodeFileHdr(const uint8_t in[FM_BLOCKFILE_HDR_BYTES], FM_BlockFileHdr *header);
void EncodeTagHdr(const FM_TagHdr &header, uint8_t out[FM_TAG_HDR_BYTES]);
void DecodeTagHdr(const uint8_t in[FM_TAG_HDR_BYTES], FM_TagHdr *header);

// File offset of byte `field` of slot `index`; -50 when it does not fit a
// signed 32-bit offset.
int32_t SlotOffset(const FM_BlockFile *file, uint32_t index, uint32_t field, int32_t *offset);

// The cached node of a block, or null; the cache order does not change.
FM_MemBlock *FindCached(const FM_BlockFile *file, uint32_t index);

// A link word of a block's header: from its cached node, else from the file.
int32_t ReadLink(FM_BlockFile *file, uint32_t index, uint32_t field, uint32_t *value);
// Sets a link word in the cached node (no dirty mark), else as a 4-byte
// write at the block's slot.
int32_t PatchLink(FM_BlockFile *file, uint32_t index, uint32_t field, uint32_t value);

// Blocks that can exist: the slots the file holds plus the cached ones. The
// file position does not move.
int32_t BlocksThatExist(FM_BlockFile *file, uint64_t *count);

// Watches a walk whose every step follows from where it stands (a chain of
// blocks, a run of tags): once it stands where it stood before it goes round
// for ever. Points are saved at doubling distances, so a circle is seen
// within a few turns of entering it, with no memory of the walk.
class CircleWatch {
  public:
    explicit CircleWatch(uint64_t start) : saved_(start) {}
    // After each step: the circle's length once the walk is back at the
    // saved point, else 0.
    uint64_t Step(uint64_t now) {
        ++since_;
        if (now == saved_) return since_;
        if (since_ == span_) {
            saved_ = now;
            span_ *= 2;
            since_ = 0;
        }
        return 0;
    }

  private:
    uint64_t saved_;
    uint64_t since_ = 0;
    uint64_t span_ = 1;
};

inline uint64_t AddrKey(FM_BlockAddr at) {
    return uint64_t(at.block) << 32 | at.offset;
}

// A temporary block of the heap, released on every way out.
class ScratchBlock {
  public:
    explicit ScratchBlock(uint32_t size) : block_(MEM_AllocPtr(0, size)) {}
    ~ScratchBlock() {
        if (block_ != nullptr) MEM_FreeHdl(block_);
    }
    ScratchBlock(const ScratchBlock &) = delete;
    ScratchBlock &operator=(const ScratchBlock &) = delete;
    uint8_t *get() const { return static_cast<uint8_t *>(block_); }

  private:
    void *block_;
};

// Takes a cache node: a fresh one below the limit, else the least recently
// used one (written back first when dirty). Returns 10, -5 or a write status.
int32_t FM_GetFreeMemBlock(FM_BlockFile *file, FM_MemBlock **node);

// FM_GetNextAddr with an observer of every block stepped into; the observer
// returns a status: a failure stops the step with it, kStopWalk stops it with
// the result half-way and is handed back as it is. Whole turns round a chain
// that has come back on itself are skipped, observer and all.
inline constexpr int32_t kStopWalk = 1;
using BlockObserver = int32_t (*)(void *context, uint32_t block, uint32_t offsetLeft);
int32_t NextAddr(FM_BlockFile *file, uint32_t block, uint32_t offset, uint32_t distance,
                 FM_BlockAddr *result, BlockObserver observer, void *context);

}  // namespace tessarine::storage
