// Device-independent bitmaps handed to the platform: the header, the palette
// and room for the pixels in one block.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <cstdint>
#include <cstring>

#include "core/status.h"

using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrMemory;
using tessarine::kOk;

extern "C" {

TESSARINE_API int32_t BI_CreateDIB(uint8_t bitsPerPixel, int32_t width, int32_t height,
                                   int32_t count, const uint8_t *colors, BITMAPINFOHEADER **out) {
    const int64_t stride = ((int64_t{bitsPerPixel} * width + 31) >> 3) & ~int64_t{3};
    const int64_t s = stride * height;
    if (width < 0 || height < 0 || count < 0 || (count > 0 && colors == nullptr)) return kErrArgument;
    // With no count the pixel rule places the pixels behind a palette of
    // 1 << bitsPerPixel entries: the block keeps room for it, so that pixels
    // written by that rule stay inside.
    const int64_t implied = count == 0 && bitsPerPixel <= 8 ? int64_t{1} << bitsPerPixel : 0;
    const int64_t bytes = s + 40 + (int64_t{count} + implied) * 4;
    if (s > UINT32_MAX || bytes > UINT32_MAX) return kErrArgument;
    auto *block = static_cast<uint8_t *>(MEM_AllocPtr(0, static_cast<uint32_t>(bytes)));
    if (block == nullptr) return kErrMemory;
    BITMAPINFOHEADER h{};
    h.biSize = 40;
    h.biWidth = width;
    h.biHeight = -height;  // rows run top down, as in the bitmaps
    h.biPlanes = 1;
    h.biBitCount = bitsPerPixel;
    h.biCompression = 0;
    h.biSizeImage = static_cast<uint32_t>(s);
    h.biXPelsPerMeter = 300;  // stored as it stands, whatever the unit
    h.biYPelsPerMeter = 300;
    h.biClrUsed = static_cast<uint32_t>(count);
    h.biClrImportant = 0;
    std::memcpy(block, &h, sizeof h);
    uint8_t *palette = block + 40;
    for (int64_t i = 0; i < count; ++i) {
        palette[4 * i] = colors[3 * i + 2];
        palette[4 * i + 1] = colors[3 * i + 1];
        palette[4 * i + 2] = colors[3 * i];
        palette[4 * i + 3] = 0;
    }
    std::memset(palette + 4 * count, 0, static_cast<size_t>(implied * 4));
    *out = reinterpret_cast<BITMAPINFOHEADER *>(block);
    return kOk;
}

TESSARINE_API int32_t BI_CreateDIBFromBmp(const BI_Bitmap *bitmap, const RECT *rect,
                                          BITMAPINFOHEADER **out) {
    int32_t count = 0;
    uint8_t table[256 * 3];
    if (bitmap->imageType != 4) {
        if (bitmap->imageType == 3 && bitmap->colorCount > 256) return kErrArgument;  // past the table
        const int32_t status = BI_GetRGBColorTable(bitmap, &count, table);
        if (Failed(status)) return status;
    }
    const int64_t width = int64_t{rect->right} - rect->left;
    const int64_t height = int64_t{rect->bottom} - rect->top;
    if (width < INT32_MIN || width > INT32_MAX || height < INT32_MIN || height > INT32_MAX)
        return kErrArgument;
    return BI_CreateDIB(bitmap->bitsPerPixel, static_cast<int32_t>(width),
                        static_cast<int32_t>(height), count, table, out);
}

}  // extern "C"
