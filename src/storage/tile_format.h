// Byte layout of the tile bitmap file and the internal services shared by the
// tile file, its tables and the block transfers.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include <tessarine/storage.h>

#include "storage/little_endian.h"

namespace tessarine::storage {

inline constexpr int32_t kFileHeaderBytes = 80;
inline constexpr int32_t kSubbmpHdrBytes = 16;
inline constexpr int32_t kTileHdrBytes = 20;
inline constexpr int32_t kTileWidth = HVT_TILE_WIDTH;
inline constexpr int32_t kTileHeight = HVT_TILE_HEIGHT;
inline constexpr int32_t kMaxSubbmps = HVT_MAX_SUBBMPS;
inline constexpr uint8_t kStamp[6] = {7, 20, 19, 0x44, 0, 1};
inline constexpr uint8_t kClosingByte = '.';

static_assert(sizeof(HVT_FileHeader) == 80);
static_assert(offsetof(HVT_FileHeader, xResolution) == 12);
static_assert(offsetof(HVT_FileHeader, yResolution) == 20);
static_assert(offsetof(HVT_FileHeader, colorModel) == 28);
static_assert(offsetof(HVT_FileHeader, colorCount) == 32);
static_assert(offsetof(HVT_FileHeader, imageType) == 36);
static_assert(offsetof(HVT_FileHeader, subbmpCount) == 37);
static_assert(offsetof(HVT_FileHeader, subbmpOffset) == 40);
static_assert(sizeof(HVT_SubbmpHdr) == 16);
static_assert(sizeof(HVT_TileHdr) == 20);

void EncodeFileHeader(const HVT_FileHeader &header, uint8_t out[kFileHeaderBytes]);
void DecodeFileHeader(const uint8_t in[kFileHeaderBytes], HVT_FileHeader &header);
void EncodeSubbmpHdr(const HVT_SubbmpHdr &hdr, uint8_t out[kSubbmpHdrBytes]);
void DecodeSubbmpSlot(const uint8_t in[kSubbmpHdrBytes], HVT_SubbmpSlot &slot);
void EncodeTileHdr(const HVT_TileHdr &tile, uint8_t out[kTileHdrBytes]);
// Turns `count` tile headers read from the file into records, in place.
void DecodeTileHdrsInPlace(HVT_TileHdr *tiles, int64_t count);

// Bytes of one colour-table entry for a colour model; 0 for a model that has none.
inline int32_t ColorEntryBytes(uint8_t colorModel) {
    return colorModel == 1 ? 3 : colorModel == 2 ? 4 : 0;
}

// Length of an open file, or -1. Used only to refuse counts read from a file
// that cannot fit in it, before allocating for them.
int64_t FileLength(int32_t fd);

// Opens the file state on `path` (see HVT_TileFileBegin).
int32_t HVT_OpenFileInfo(const char *path, int32_t openFile, HVT_FileInfo *info);

// A tile whose record can be used without leaving its tile buffer or the
// 32-bit file range, for a depth d. Files are hostile input.
inline bool UsableTile(const HVT_TileHdr &t, int32_t d) {
    const int64_t w = int64_t{t.right} - t.left;
    const int64_t h = int64_t{t.bottom} - t.top;
    return w >= 0 && w <= kTileWidth && h >= 0 && h <= kTileHeight && t.offset >= 0 &&
           (int64_t{t.left} * d) % 8 == 0;
}

// Bytes of a record's tileBuffer: one whole tile at the largest, 8192 by 1024
// pixels of depth d.
inline int64_t TileBufferBytes(int32_t d) { return (int64_t{d} << 23) >> 3; }

// Row size of a tile in the file: packed to the byte.
inline int64_t TileRowBytes(const HVT_TileHdr &t, int32_t d) {
    return ((int64_t{t.right} - t.left) * d + 7) >> 3;
}

}  // namespace tessarine::storage

namespace tessarine::storage {

// Frees a fixed block at the end of a scope unless released.
class ScopedBlock {
  public:
    explicit ScopedBlock(void *block) : block_(block) {}
    ScopedBlock(const ScopedBlock &) = delete;
    ScopedBlock &operator=(const ScopedBlock &) = delete;
    ~ScopedBlock();
    void *Get() const { return block_; }
    void *Release() {
        void *b = block_;
        block_ = nullptr;
        return b;
    }

  private:
    void *block_;
};

}  // namespace tessarine::storage
