// The tile file's records on disk: little-endian, field by field.
#include "storage/tile_format.h"

#include <tessarine/core.h>

#include "platform/file_runtime.h"

namespace tessarine::storage {

ScopedBlock::~ScopedBlock() {
    if (block_ != nullptr) MEM_FreeHdl(block_);
}

void EncodeFileHeader(const HVT_FileHeader &h, uint8_t out[kFileHeaderBytes]) {
    std::memset(out, 0, kFileHeaderBytes);
    std::memcpy(out, h.stamp, 6);
    out[6] = h.userByte1;
    out[7] = h.userByte2;
    out[8] = h.userByte3;
    out[9] = h.bitsPerPixel;
    out[10] = h.reserved1[0];
    out[11] = h.reserved1[1];
    PutF64(out + 12, h.xResolution);
    PutF64(out + 20, h.yResolution);
    out[28] = h.colorModel;
    std::memcpy(out + 29, h.reserved2, 3);
    PutI32(out + 32, h.colorCount);
    out[36] = h.imageType;
    out[37] = h.subbmpCount;
    out[38] = h.reserved3[0];
    out[39] = h.reserved3[1];
    for (int i = 0; i < kMaxSubbmps; ++i) PutI32(out + 40 + 4 * i, h.subbmpOffset[i]);
}

void DecodeFileHeader(const uint8_t in[kFileHeaderBytes], HVT_FileHeader &h) {
    std::memcpy(h.stamp, in, 6);
    h.userByte1 = in[6];
    h.userByte2 = in[7];
    h.userByte3 = in[8];
    h.bitsPerPixel = in[9];
    h.reserved1[0] = in[10];
    h.reserved1[1] = in[11];
    h.xResolution = GetF64(in + 12);
    h.yResolution = GetF64(in + 20);
    h.colorModel = in[28];
    std::memcpy(h.reserved2, in + 29, 3);
    h.colorCount = GetI32(in + 32);
    h.imageType = in[36];
    h.subbmpCount = in[37];
    h.reserved3[0] = in[38];
    h.reserved3[1] = in[39];
    for (int i = 0; i < kMaxSubbmps; ++i) h.subbmpOffset[i] = GetI32(in + 40 + 4 * i);
}

void EncodeSubbmpHdr(const HVT_SubbmpHdr &hdr, uint8_t out[kSubbmpHdrBytes]) {
    PutI32(out, hdr.width);
    PutI32(out + 4, hdr.height);
    PutI32(out + 8, hdr.tilesAcross);
    PutI32(out + 12, hdr.tilesDown);
}

void DecodeSubbmpSlot(const uint8_t in[kSubbmpHdrBytes], HVT_SubbmpSlot &slot) {
    slot.width = GetI32(in);
    slot.height = GetI32(in + 4);
    slot.tilesAcross = GetI32(in + 8);
    slot.tilesDown = GetI32(in + 12);
}

void EncodeTileHdr(const HVT_TileHdr &t, uint8_t out[kTileHdrBytes]) {
    PutI32(out, t.offset);
    PutI32(out + 4, t.left);
    PutI32(out + 8, t.top);
    PutI32(out + 12, t.right);
    PutI32(out + 16, t.bottom);
}

void DecodeTileHdrsInPlace(HVT_TileHdr *tiles, int64_t count) {
    if constexpr (std::endian::native == std::endian::little) {
        (void)tiles;
        (void)count;  // the file's order is already the record's
    } else {
        for (int64_t i = 0; i < count; ++i) {
            uint8_t raw[kTileHdrBytes];
            std::memcpy(raw, &tiles[i], kTileHdrBytes);
            tiles[i] = {GetI32(raw), GetI32(raw + 4), GetI32(raw + 8), GetI32(raw + 12),
                        GetI32(raw + 16)};
        }
    }
}

int64_t FileLength(int32_t fd) { return platform::_filelength(fd); }

}  // namespace tessarine::storage
