// The tile bitmap file: creation, sub-bitmaps, and the open state of a file.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <algorithm>
#include <cstring>

#include "core/status.h"
#include "storage/raw_file.h"
#include "storage/tile_format.h"

namespace ts = tessarine::storage;
using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrFileAccess;
using tessarine::kErrGeneral;
using tessarine::kErrMemory;
using tessarine::kErrTooLarge;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

constexpr int64_t kMaxOffset = INT32_MAX;

int64_t TilesAlong(uint32_t size, int shift) { return 1 + ((int64_t{size} - 1) >> shift); }

// Bytes of the tile data of a width by height sub-bitmap at depth d, or -1
// when it cannot fit a 32-bit file. Every band of tiles has the same row
// bytes, so the tile data is that sum of row bytes times the height.
int64_t TileDataBytes(uint32_t width, uint32_t height, int32_t d) {
    const int64_t fullRow = (int64_t{ts::kTileWidth} * d + 7) >> 3;
    const int64_t rest = width % ts::kTileWidth;
    const int64_t rowBytes = (width / ts::kTileWidth) * fullRow + (rest ? (rest * d + 7) >> 3 : 0);
    if (rowBytes > kMaxOffset) return -1;
    const int64_t bytes = rowBytes * int64_t{height};
    return bytes > kMaxOffset ? -1 : bytes;
}

int32_t WriteHeader(int32_t fd, const HVT_FileHeader &header) {
    uint8_t raw[ts::kFileHeaderBytes];
    ts::EncodeFileHeader(header, raw);
    return FM_SeekAndWrite(fd, 0, 0, raw, sizeof raw);
}

int32_t OpenFileState(const char *path, int32_t openFile, HVT_FileInfo *info) {
    info->header = static_cast<HVT_FileHeader *>(MEM_AllocPtr(0, sizeof(HVT_FileHeader)));
    if (info->header == nullptr) return kErrMemory;
    int32_t status = kOk;
    if (openFile) {
        status = FM_Open(path, 2, &info->descriptor);
        if (Failed(status)) return status;
    }
    const int32_t fd = info->descriptor;
    uint8_t raw[ts::kFileHeaderBytes];
    status = FM_SeekAndRead(fd, 0, 0, raw, sizeof raw);
    if (Failed(status)) return status;
    ts::DecodeFileHeader(raw, *info->header);
    const HVT_FileHeader &header = *info->header;
    // The offset table has room for the end of nine sub-bitmaps only.
    if (header.subbmpCount > ts::kMaxSubbmps - 1) return kErrFileAccess;

    if (header.colorCount > 0) {
        const int32_t entry = ts::ColorEntryBytes(header.colorModel);
        if (entry == 0) return kErrUnsupported;
        const int64_t bytes = int64_t{header.colorCount} * entry;
        // A table longer than the file, or than one read moves, could never be
        // read: refuse it before allocating for it.
        if (bytes > ts::FileLength(fd) - ts::kFileHeaderBytes || bytes > kMaxOffset)
            return kErrFileAccess;
        if (info->colorTable == nullptr) {
            info->colorTable = static_cast<uint8_t *>(MEM_AllocPtr(0, static_cast<uint32_t>(bytes)));
            if (info->colorTable == nullptr) return kErrMemory;
        }
        status = FM_Read(fd, info->colorTable, static_cast<uint32_t>(bytes));
        if (Failed(status)) return status;
    }
    for (int i = 0; i < header.subbmpCount; ++i) {
        uint8_t slot[ts::kSubbmpHdrBytes];
        status = FM_SeekAndRead(fd, header.subbmpOffset[i], 0, slot, sizeof slot);
        if (Failed(status)) return status;
        ts::DecodeSubbmpSlot(slot, info->subbmps[i]);
    }
    const auto tileBytes = static_cast<uint32_t>(ts::TileBufferBytes(header.bitsPerPixel));
    info->tileBuffer = static_cast<uint8_t *>(MEM_AllocPtr(0, tileBytes));
    return info->tileBuffer == nullptr ? kErrMemory : kOk;
}

template <class T>
void FreeField(T *&field) {
    if (field != nullptr) MEM_FreeHdl(field);
    field = nullptr;
}

void FreeSessionHandle(MEM_Handle &handle, uint8_t *&buffer) {
    if (handle != nullptr) {
        MEM_Unlock(handle);
        MEM_FreeHdl(handle);
    }
    handle = nullptr;
    buffer = nullptr;
}

}  // namespace

namespace tessarine::storage {

int32_t HVT_OpenFileInfo(const char *path, int32_t openFile, HVT_FileInfo *info) {
    const int32_t status = OpenFileState(path, openFile, info);
    if (Failed(status)) HVT_TileFileEnd(info, openFile);
    return status;
}

}  // namespace tessarine::storage

extern "C" {

TESSARINE_API int32_t HVT_AddSubbmp(int32_t fd, HVT_FileHeader *header, uint32_t width,
                                    uint32_t height, HVT_SubbmpHdr *subbmpHdr,
                                    uint8_t *subIndex) {
    const uint8_t count = header->subbmpCount;
    // A tenth sub-bitmap would store its end offset past the header.
    if (count >= ts::kMaxSubbmps - 1) return kErrArgument;
    if (subIndex != nullptr) *subIndex = count;

    const int32_t d = header->bitsPerPixel;
    const int64_t across = TilesAlong(width, 13);
    const int64_t down = TilesAlong(height, 10);
    const int64_t tableBytes = across * down * ts::kTileHdrBytes;
    const int64_t dataBytes = width == 0 || height == 0 ? -1 : TileDataBytes(width, height, d);
    const int64_t start = header->subbmpOffset[count];
    const int64_t end = start + ts::kSubbmpHdrBytes + tableBytes + dataBytes;
    // A table past any 32-bit size is past the offset limit as well.
    if (tableBytes > kMaxOffset) return kErrTooLarge;
    // The table is had before the end is judged: without memory the status is -5.
    ts::ScopedBlock table(MEM_AllocPtr(0, static_cast<uint32_t>(tableBytes)));
    if (table.Get() == nullptr) return kErrMemory;
    // Past what a signed 32-bit offset reaches, by any amount: nothing is written.
    if (dataBytes < 0 || end <= 0 || end > kMaxOffset) return kErrTooLarge;
    auto *entry = static_cast<uint8_t *>(table.Get());
    int64_t running = start + tableBytes + ts::kSubbmpHdrBytes;
    for (int64_t top = 0; top < height; top += ts::kTileHeight) {
        const int64_t bottom = std::min<int64_t>(top + ts::kTileHeight, height);
        for (int64_t left = 0; left < width; left += ts::kTileWidth) {
            const int64_t right = std::min<int64_t>(left + ts::kTileWidth, width);
            const HVT_TileHdr tile{static_cast<int32_t>(running), static_cast<int32_t>(left),
                                   static_cast<int32_t>(top), static_cast<int32_t>(right),
                                   static_cast<int32_t>(bottom)};
            ts::EncodeTileHdr(tile, entry);
            entry += ts::kTileHdrBytes;
            running += (((right - left) * d + 7) >> 3) * (bottom - top);
        }
    }

    const HVT_SubbmpHdr hdr{static_cast<int32_t>(width), static_cast<int32_t>(height),
                            static_cast<int32_t>(across), static_cast<int32_t>(down)};
    uint8_t rawHdr[ts::kSubbmpHdrBytes];
    ts::EncodeSubbmpHdr(hdr, rawHdr);
    int32_t status = FM_SeekAndWrite(fd, static_cast<int32_t>(start), 0, rawHdr, sizeof rawHdr);
    if (Failed(status)) return status;
    status = FM_Write(fd, table.Get(), static_cast<uint32_t>(tableBytes));
    if (Failed(status)) return status;
    header->subbmpCount = count + 1;
    header->subbmpOffset[count + 1] = static_cast<int32_t>(running);
    status = FM_SeekAndWrite(fd, static_cast<int32_t>(running), 0, &ts::kClosingByte, 1);
    if (Failed(status)) return status;
    status = WriteHeader(fd, *header);
    if (Failed(status)) return status;
    if (subbmpHdr != nullptr) *subbmpHdr = hdr;
    return status;
}

TESSARINE_API int32_t HVT_CreateBlankTileBmpFile(uint8_t imageType, uint8_t bitsPerPixel,
                                                 uint32_t width, uint32_t height,
                                                 double xResolution, double yResolution,
                                                 uint8_t colorModel, int32_t colorCount,
                                                 const uint8_t *colors, char *path, int32_t *fd,
                                                 uint8_t userByte1, uint8_t userByte2,
                                                 uint8_t userByte3) {
    HVT_FileHeader header;
    std::memset(&header, 0, sizeof header);
    std::memcpy(header.stamp, ts::kStamp, sizeof header.stamp);
    header.userByte1 = userByte1;
    header.userByte2 = userByte2;
    header.userByte3 = userByte3;
    header.bitsPerPixel = bitsPerPixel;
    header.xResolution = xResolution;
    header.yResolution = yResolution;
    header.colorModel = colorModel;
    header.colorCount = colorCount;
    header.imageType = imageType;

    char local[ts::kScratchPathBytes];
    local[0] = '\0';
    int32_t status = kOk;
    int64_t tableBytes = 0;
    if (colorCount >= 1) {
        const int32_t entry = ts::ColorEntryBytes(colorModel);
        if (entry == 0) status = kErrUnsupported;
        tableBytes = int64_t{colorCount} * entry;
        if (!Failed(status) && tableBytes + ts::kFileHeaderBytes > kMaxOffset) status = kErrTooLarge;
    }
    if (!Failed(status)) {
        header.subbmpOffset[0] = static_cast<int32_t>(ts::kFileHeaderBytes + tableBytes);
        status = ts::FM_CreateScratchFile(local, fd);
    }
    if (!Failed(status) && tableBytes > 0)
        status = FM_SeekAndWrite(*fd, ts::kFileHeaderBytes, 0, colors,
                                 static_cast<uint32_t>(tableBytes));
    if (!Failed(status)) status = HVT_AddSubbmp(*fd, &header, width, height, nullptr, nullptr);
    if (!Failed(status)) {
        ts::FM_CopyPath(local, path);
        local[0] = '\0';
    }
    if (*fd == -1) status = kErrGeneral;
    if (local[0] != '\0') FM_Delete(local);
    return status;
}

TESSARINE_API void HVT_InitFileInfo(HVT_FileInfo *info) {
    std::memset(info, 0, sizeof *info);
    info->descriptor = -1;
}

TESSARINE_API int32_t HVT_TileFileBegin(const BI_Bitmap *bitmap, HVT_FileInfo *info,
                                        int32_t openFile) {
    info->descriptor = bitmap->tileFile;
    return ts::HVT_OpenFileInfo(bitmap->tilePath, openFile, info);
}

TESSARINE_API void HVT_TileFileEnd(HVT_FileInfo *info, int32_t closeFile) {
    if (closeFile) {
        FM_Close(info->descriptor);
        info->descriptor = -1;
    }
    // Every loaded table goes, also one of a slot past subbmpCount.
    for (HVT_SubbmpSlot &slot : info->subbmps) FreeField(slot.tileHdrs);
    FreeField(info->header);
    FreeField(info->colorTable);
    FreeSessionHandle(info->readHandle, info->readBuffer);
    FreeSessionHandle(info->writeHandle, info->writeBuffer);
    FreeField(info->tileBuffer);
    info->tileBufferOwed = 0;
}

}  // extern "C"
