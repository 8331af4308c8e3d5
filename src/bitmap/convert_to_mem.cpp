// Moving a tile-only bitmap's pixels into memory and dropping its file.
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

TESSARINE_API int32_t BI_ConvertBmpToMem(BI_Bitmap *bitmap) {
    const int32_t open = bitmap->tileFile == -1;
    if (bitmap->storage != BI_STORAGE_TILEFILE) return kOk;
    // An open transfer holds the file.
    if (bitmap->ioSession != nullptr) return kErrArgument;
    auto *info = static_cast<HVT_FileInfo *>(MEM_AllocPtr(0, sizeof(HVT_FileInfo)));
    if (info == nullptr) return kErrMemory;
    // The original leaves the record behind on a failure; nothing refers to
    // it, so it goes.
    const FreeGuard infoGuard(info);
    HVT_InitFileInfo(info);
    const int64_t stride = ((int64_t{bitmap->bitsPerPixel} * bitmap->width + 31) >> 3) & ~int64_t{3};
    const int64_t bytes = stride * bitmap->height;
    if (stride < 0 || bitmap->height < 0 || bytes > UINT32_MAX) return kErrMemory;
    MEM_Handle pixels = MEM_AllocHdl(0, static_cast<uint32_t>(bytes));
    if (pixels == nullptr) return kErrMemory;
    // A block left by an earlier failed attempt is stale: a tile-only
    // bitmap's pixels are in its file.
    if (bitmap->pixelHandle != nullptr) MEM_FreeHdl(bitmap->pixelHandle);
    bitmap->bytesPerRow = static_cast<uint32_t>(stride);
    bitmap->pixelHandle = pixels;
    int32_t status = HVT_TileFileBegin(bitmap, info, open);
    if (!Failed(status)) {
        void *base = MEM_Lock(pixels);
        const HVT_Box all{0, 0, bitmap->width, bitmap->height};
        status = HVT_ReadBlock(0, info, &all, static_cast<int32_t>(stride), base);
        MEM_Unlock(pixels);
    }
    HVT_TileFileEnd(info, open);
    if (Failed(status)) return status;
    bitmap->storage = BI_STORAGE_MEMORY;
    if (bitmap->tileFile != -1) FM_Close(bitmap->tileFile);
    FM_Delete(bitmap->tilePath);
    bitmap->tilePath[0] = '\0';
    return status;
}

}  // extern "C"
