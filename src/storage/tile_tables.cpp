// Tile tables of a sub-bitmap, loaded once per file state, and whole tile rows.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/tile_format.h"

namespace ts = tessarine::storage;
using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrFileAccess;
using tessarine::kErrMemory;
using tessarine::kOk;

namespace {

// The tile record for a tile row transfer, or a status.
int32_t FindTile(uint8_t sub, HVT_FileInfo *info, int32_t tile, const HVT_TileHdr **out) {
    const int32_t status = HVT_GetSubbmpTileHdrs(sub, info);
    if (Failed(status)) return status;
    const HVT_SubbmpSlot &slot = info->subbmps[sub];
    if (tile < 0 || tile >= int64_t{slot.tilesAcross} * slot.tilesDown) return kErrArgument;
    *out = &slot.tileHdrs[tile];
    return kOk;
}

// File offset and byte count of rows of a tile, or false when they do not
// fit a 32-bit transfer.
bool TileRowSpan(const HVT_TileHdr &t, int32_t d, int32_t firstRow, int32_t rowCount,
                 int32_t *offset, uint32_t *bytes) {
    const int64_t rowBytes = ts::TileRowBytes(t, d);
    const int64_t at = t.offset + rowBytes * firstRow;
    const int64_t n = rowBytes * rowCount;
    if (rowBytes < 0 || at < 0 || at > INT32_MAX || n < 0 || n > INT32_MAX) return false;
    *offset = static_cast<int32_t>(at);
    *bytes = static_cast<uint32_t>(n);
    return true;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t HVT_GetSubbmpTileHdrs(uint8_t sub, HVT_FileInfo *info) {
    if (sub >= ts::kMaxSubbmps || info->header == nullptr) return kErrArgument;
    HVT_SubbmpSlot &slot = info->subbmps[sub];
    if (slot.tileHdrs != nullptr) return kOk;
    if (slot.tilesAcross < 0 || slot.tilesDown < 0) return kErrFileAccess;
    const int64_t count = int64_t{slot.tilesAcross} * slot.tilesDown;
    const int64_t at = int64_t{info->header->subbmpOffset[sub]} + ts::kSubbmpHdrBytes;
    // A table that runs past the end of the file, or past what one read
    // moves, could not be read: refuse it before allocating for it.
    if (at < 0 || at > INT32_MAX || count > (ts::FileLength(info->descriptor) - at) / ts::kTileHdrBytes)
        return kErrFileAccess;
    const int64_t bytes = count * ts::kTileHdrBytes;
    if (bytes > INT32_MAX) return kErrFileAccess;
    slot.tileHdrs = static_cast<HVT_TileHdr *>(MEM_AllocPtr(MEM_FLAG_ZERO, static_cast<uint32_t>(bytes)));
    if (slot.tileHdrs == nullptr) return kErrMemory;
    // A failed read keeps the table, so that it is not tried again.
    const int32_t status = FM_SeekAndRead(info->descriptor, static_cast<int32_t>(at), 0,
                                          slot.tileHdrs, static_cast<uint32_t>(bytes));
    if (!Failed(status)) ts::DecodeTileHdrsInPlace(slot.tileHdrs, count);
    return status;
}

TESSARINE_API int32_t HVT_SaveTile(uint8_t sub, HVT_FileInfo *info, int32_t tile, int32_t firstRow,
                                   int32_t rowCount, const void *buffer) {
    const HVT_TileHdr *t = nullptr;
    const int32_t status = FindTile(sub, info, tile, &t);
    if (Failed(status)) return status;
    int32_t offset;
    uint32_t bytes;
    if (!TileRowSpan(*t, info->header->bitsPerPixel, firstRow, rowCount, &offset, &bytes))
        return kErrFileAccess;
    return FM_SeekAndWrite(info->descriptor, offset, 0, buffer, bytes);
}

TESSARINE_API int32_t HVT_ReadTile(uint8_t sub, HVT_FileInfo *info, int32_t tile, int32_t firstRow,
                                   int32_t rowCount, void *buffer) {
    const HVT_TileHdr *t = nullptr;
    const int32_t status = FindTile(sub, info, tile, &t);
    if (Failed(status)) return status;
    int32_t offset;
    uint32_t bytes;
    if (!TileRowSpan(*t, info->header->bitsPerPixel, firstRow, rowCount, &offset, &bytes))
        return kErrFileAccess;
    return FM_SeekAndRead(info->descriptor, offset, 0, buffer, bytes);
}

TESSARINE_API int32_t HVT_PixelInWhichTile(int32_t tilesAcross, int32_t x, int32_t y) {
    const int64_t index = x / ts::kTileWidth + int64_t{y / ts::kTileHeight} * tilesAcross;
    return static_cast<int32_t>(index);
}

}  // extern "C"
