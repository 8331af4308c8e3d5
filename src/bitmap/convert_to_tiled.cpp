// Moving a memory-only bitmap's pixels into a new scratch tile file.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <cstdint>

#include "core/block_guards.h"
#include "core/status.h"

using tessarine::Failed;
using tessarine::FreeGuard;
using tessarine::kErrArgument;
using tessarine::kErrMemory;
using tessarine::kOk;

extern "C" {

TESSARINE_API int32_t BI_ConvertBmpToTiledFile(BI_Bitmap *bitmap) {
    if (bitmap->storage != BI_STORAGE_MEMORY) return kOk;
    // A file of the bitmap's own would be lost, and there are no pixels to move.
    if (bitmap->tilePath[0] != '\0' || bitmap->pixelHandle == nullptr) return kErrArgument;
    auto *info = static_cast<HVT_FileInfo *>(MEM_AllocPtr(0, sizeof(HVT_FileInfo)));
    if (info == nullptr) return kErrMemory;
    const FreeGuard infoGuard(info);
    int32_t status;
    {
        const tessarine::LockGuard colors(bitmap->colorTable);
        status = HVT_CreateBlankTileBmpFile(
            bitmap->imageType, bitmap->bitsPerPixel, static_cast<uint32_t>(bitmap->width),
            static_cast<uint32_t>(bitmap->height), bitmap->xResolution, bitmap->yResolution,
            bitmap->colorModel, bitmap->colorCount, colors.Get(), bitmap->tilePath,
            &bitmap->tileFile, bitmap->userByte1, bitmap->userByte2, bitmap->userByte3);
    }
    if (Failed(status)) return status;
    HVT_InitFileInfo(info);
    status = HVT_TileFileBegin(bitmap, info, 0);
    if (!Failed(status)) {
        const tessarine::LockGuard pixels(bitmap->pixelHandle);
        const HVT_Box all{0, 0, bitmap->width, bitmap->height};
        status = HVT_SaveBlock(0, info, &all, static_cast<int32_t>(bitmap->bytesPerRow), pixels.Get());
    }
    HVT_TileFileEnd(info, 0);
    if (Failed(status)) return status;  // the bitmap stays in memory, the file under tilePath
    bitmap->storage = BI_STORAGE_TILEFILE;
    MEM_FreeHdl(bitmap->pixelHandle);
    bitmap->pixelHandle = nullptr;
    return status;
}

}  // extern "C"
