// The bitmap record and its life cycle: creation, sharing, validity, deletion.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <cstring>

#include "bitmap/tile_backed.h"
#include "core/status.h"
#include "platform/file_path_hooks.h"

namespace bm = tessarine::bitmap;
using tessarine::Failed;
using tessarine::kErrMemory;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

uint32_t StrideOf(uint8_t bitsPerPixel, int32_t width) {
    return static_cast<uint32_t>(((int64_t{bitsPerPixel} * width + 31) >> 3) & ~int64_t{3});
}

int32_t EntryBytes(uint8_t colorModel) { return colorModel == 1 ? 3 : colorModel == 2 ? 4 : 0; }

// A moveable block of `bytes`, or 0 when it cannot be had; a size that does
// not fit the heap's 32-bit word cannot be had either.
MEM_Handle AllocBlock(int64_t bytes) {
    if (bytes < 0 || bytes > UINT32_MAX) return nullptr;
    return MEM_AllocHdl(0, static_cast<uint32_t>(bytes));
}

// Colour table of colorCount entries copied from `colors`; storage block for
// the pixels. Both as the creating functions share them.
int32_t MakeColorTable(BI_Bitmap *bmp, const uint8_t *colors) {
    if (bmp->colorCount <= 0) return kOk;
    const int32_t entry = EntryBytes(bmp->colorModel);
    if (entry == 0) return kErrUnsupported;
    const int64_t bytes = int64_t{bmp->colorCount} * entry;
    bmp->colorTable = AllocBlock(bytes);
    if (bmp->colorTable == nullptr) return kErrMemory;
    if (colors != nullptr) {
        void *table = MEM_Lock(bmp->colorTable);
        std::memcpy(table, colors, static_cast<size_t>(bytes));
        MEM_Unlock(bmp->colorTable);
    }
    return kOk;
}

int32_t MakePixels(BI_Bitmap *bmp) {
    if (!(bmp->storage & BI_STORAGE_MEMORY)) return kOk;
    bmp->pixelHandle = AllocBlock(int64_t{bmp->height} * bmp->bytesPerRow);
    return bmp->pixelHandle == nullptr ? kErrMemory : kOk;
}

int32_t Finish(BI_Bitmap *bmp, int32_t status, BI_Bitmap **out) {
    if (Failed(status)) {
        bm::DropHalfMadeTileFile(bmp);
        BI_DeleteBitmap(&bmp);
        return status;
    }
    *out = bmp;
    return status;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_NewBitmap(BI_Bitmap **out) {
    auto *bmp = static_cast<BI_Bitmap *>(MEM_AllocPtr(0, sizeof(BI_Bitmap)));
    if (bmp == nullptr) return kErrMemory;
    std::memset(bmp, 0, sizeof *bmp);
    bmp->refCount = 1;
    bmp->userByte1 = 1;
    bmp->tileFile = -1;
    *out = bmp;
    return kOk;
}

TESSARINE_API void BI_UseBitmap(BI_Bitmap *bitmap) { ++bitmap->refCount; }

TESSARINE_API int32_t BI_IsValidBmp(const BI_Bitmap *b) {
    const uint8_t bpp = b->bitsPerPixel;
    const bool upTo8 = bpp == 1 || bpp == 4 || bpp == 8;
    switch (b->imageType) {
        case 1: return b->colorCount <= 0 && bpp == 1;
        case 2: return b->colorCount <= 0 && upTo8;
        case 3: return (b->colorModel == 1 || b->colorModel == 2) && b->colorCount >= 1 && upTo8;
        case 4:
            return b->colorCount <= 0 &&
                   ((b->colorModel == 1 && bpp == 24) || (b->colorModel == 2 && bpp == 32));
        default: return 0;
    }
}

TESSARINE_API void BI_DeleteBitmap(BI_Bitmap **bitmap) {
    BI_Bitmap *b = *bitmap;
    *bitmap = nullptr;
    if (b->refCount > 1) {
        --b->refCount;
        return;
    }
    bm::RemoveFiles(b);
    if (b->pixelHandle != nullptr) MEM_FreeHdl(b->pixelHandle);
    if (b->colorTable != nullptr) MEM_FreeHdl(b->colorTable);
    if (b->colorIndex != nullptr) MEM_FreeHdl(b->colorIndex);
    if (b->profilePath != nullptr) tessarine::platform::DestroyFilePath(b->profilePath);
    MEM_FreeHdl(b);
}

TESSARINE_API int32_t BI_CreateBlankBmp(uint8_t imageType, uint8_t bitsPerPixel, int32_t width,
                                        int32_t height, double xResolution, double yResolution,
                                        uint8_t colorModel, int32_t colorCount,
                                        const uint8_t *colors, BI_Bitmap **out, uint8_t storage,
                                        uint8_t userByte1, uint8_t userByte2, uint8_t userByte3) {
    BI_Bitmap *bmp = nullptr;
    int32_t status = BI_NewBitmap(&bmp);
    if (Failed(status)) return status;
    bmp->imageType = imageType;
    bmp->bitsPerPixel = bitsPerPixel;
    bmp->width = width;
    bmp->height = height;
    bmp->xResolution = xResolution;
    bmp->yResolution = yResolution;
    bmp->colorModel = colorModel;
    bmp->colorCount = colorCount;
    bmp->userByte1 = userByte1 != 0 ? userByte1 : 1;
    bmp->userByte2 = userByte2;
    bmp->userByte3 = userByte3;
    bmp->storage = storage != 0 ? storage : BI_STORAGE_TILEFILE;

    status = MakeColorTable(bmp, colors);
    if (!Failed(status)) {
        bmp->bytesPerRow = StrideOf(bitsPerPixel, width);
        status = MakePixels(bmp);
    }
    // The file gets the user bytes as the caller gave them.
    if (!Failed(status) && (bmp->storage & BI_STORAGE_TILEFILE))
        status = bm::MakeTileFile(bmp, colors, userByte1, userByte2, userByte3);
    return Finish(bmp, status, out);
}

TESSARINE_API int32_t BI_GetBlankBmp(const BI_Bitmap *source, const RECT *rect, BI_Bitmap **out,
                                     uint8_t storage) {
    BI_Bitmap *bmp = nullptr;
    int32_t status = BI_NewBitmap(&bmp);
    if (Failed(status)) return status;
    bmp->imageType = source->imageType;
    bmp->bitsPerPixel = source->bitsPerPixel;
    bmp->width = static_cast<int32_t>(int64_t{rect->right} - rect->left);
    bmp->height = static_cast<int32_t>(int64_t{rect->bottom} - rect->top);
    bmp->xResolution = source->xResolution;
    bmp->yResolution = source->yResolution;
    bmp->colorModel = source->colorModel;
    bmp->colorCount = source->colorCount;
    bmp->userByte1 = source->userByte1;
    bmp->userByte2 = source->userByte2;
    bmp->userByte3 = source->userByte3;
    bmp->storage = storage != 0 ? storage : source->storage;

    if (source->colorCount > 0 && source->colorTable != nullptr) {
        const void *colors = MEM_Lock(source->colorTable);
        status = MakeColorTable(bmp, static_cast<const uint8_t *>(colors));
        MEM_Unlock(source->colorTable);
    } else {
        status = MakeColorTable(bmp, nullptr);
    }
    if (!Failed(status)) {
        bmp->bytesPerRow = StrideOf(bmp->bitsPerPixel, bmp->width);
        status = MakePixels(bmp);
    }
    if (!Failed(status) && (bmp->storage & BI_STORAGE_TILEFILE)) {
        const auto *colors = static_cast<const uint8_t *>(
            bmp->colorTable != nullptr ? MEM_Lock(bmp->colorTable) : nullptr);
        status = bm::MakeTileFile(bmp, colors, bmp->userByte1, bmp->userByte2, bmp->userByte3);
        if (bmp->colorTable != nullptr) MEM_Unlock(bmp->colorTable);
    }
    return Finish(bmp, status, out);
}

}  // extern "C"
