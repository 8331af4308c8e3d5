// Index row access: one byte per pixel value of a 1-, 4- or 8-bit row.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <cstring>

#include "bitmap/padded_rows.h"
#include "bitmap/row_pack.h"
#include "bitmap/row_steps.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::kErrUnsupported;
using tessarine::kOk;

extern "C" {

TESSARINE_API int32_t BI_UnpackIndexRow(uint8_t bitsPerPixel, const uint8_t *row, int32_t x,
                                        int32_t count, uint8_t *out) {
    if (count < 1) return kOk;
    if (bitsPerPixel != 1 && bitsPerPixel != 4 && bitsPerPixel != 8) return kErrUnsupported;
    bm::UnpackValues(bitsPerPixel, row, x, count, out);
    return kOk;
}

TESSARINE_API int32_t BI_PackIndexRow(uint8_t bitsPerPixel, const uint8_t *values, int32_t x,
                                      int32_t count, uint8_t *row) {
    if (count < 1) return kOk;
    switch (bitsPerPixel) {
        case 1: bm::PackBits1<bm::NonZeroBit>(values, x, count, row); return kOk;
        case 4:
            bm::PackNibbles(values, x, count, row, [](uint8_t v) { return uint8_t(v & 15); });
            return kOk;
        case 8: std::memcpy(row, values, static_cast<size_t>(count)); return kOk;
        default: return kErrUnsupported;
    }
}

TESSARINE_API int32_t BI_GetIndexRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                     uint8_t *out) {
    return bm::GetRowSteps(bitmap, y, x, count, bm::OwnRunBytes(bitmap, x, count),
                           [&](const uint8_t *row) {
                               return BI_UnpackIndexRow(bitmap->bitsPerPixel, row, x, count, out);
                           });
}

TESSARINE_API int32_t BI_SetIndexRow(int32_t y, int32_t x, int32_t count, uint8_t *values,
                                     BI_Bitmap *bitmap) {
    // Values the table has no entry for become 0, in the caller's own array.
    for (int32_t i = 0; i < count; ++i)
        if (values[i] >= bitmap->colorCount) values[i] = 0;
    return bm::SetRowSteps(bitmap, y, x, count, bm::OwnRunBytes(bitmap, x, count),
                           [&](uint8_t *row, int64_t) {
                               return BI_PackIndexRow(bitmap->bitsPerPixel, values, x, count, row);
                           });
}

TESSARINE_API int32_t BI_GetPaddedIndexRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                           uint8_t *out) {
    return bm::PaddedRead(bitmap, x, count, out, [&](int32_t from, int32_t n, uint8_t *to) {
        return BI_GetIndexRow(bitmap, y, from, n, to);
    });
}

}  // extern "C"
