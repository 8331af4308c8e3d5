// Internal services of the tag layer: the steps that appending, inserting,
// deleting and copying tags share.
#pragma once

#include <cstdint>

#include <tessarine/storage.h>

namespace tessarine::storage {

// The kind byte of a tag that only holds space: a hole in the stream.
inline constexpr uint8_t kFreeTag = 0;

// Writes a tag's 8 header bytes at `at`; `data` (or null) gets the block
// write's out address.
int32_t WriteTagHdr(FM_BlockFile *file, FM_BlockAddr at, const FM_TagHdr &header,
                    FM_BlockAddr *data);

// Takes a new block and links it after `after`.
int32_t AddBlock(FM_BlockFile *file, uint32_t after, FM_MemBlock **node);

// The `next` link of a block, from its cached node or the file.
uint32_t NextOf(FM_BlockFile *file, uint32_t block, int32_t *status);

// Walks on from `*following` over free tags, adding their lengths to
// `*total`, until a live tag or the end; `*following` is left on it. The
// walk began at `start`: a run of free tags that leads back to one it has
// passed would never end, and gives -50.
int32_t SkipFreeTags(FM_BlockFile *file, FM_BlockAddr start, FM_BlockAddr *following,
                     uint32_t *total);

// Frees the blocks that follow `from` in the chain, up to but not including
// `until`, while `*budget` holds a whole block's worth; each takes
// payloadSize off it. `*stop` gets the block where the walk stopped.
int32_t FreeBlocksBefore(FM_BlockFile *file, uint32_t from, uint32_t until, uint32_t *budget,
                         uint32_t *stop);

}  // namespace tessarine::storage
