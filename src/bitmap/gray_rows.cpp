// Gray row access: rows of any layout as densities (0 white, 255 black), and
// densities into gray rows.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <cstring>

#include "bitmap/color_tables.h"
#include "bitmap/gray_rows.h"
#include "bitmap/padded_rows.h"
#include "bitmap/row_pack.h"
#include "bitmap/row_steps.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

void ThroughLut(int d, const uint8_t *src, int64_t x, int64_t count, const uint8_t *lut,
                uint8_t *out) {
    bm::ForEachValueChunk(d, src, x, count, [&](const uint8_t *v, int64_t n, int64_t done) {
        for (int64_t i = 0; i < n; ++i) out[done + i] = lut[v[i]];
    });
}

int64_t GrayBytes(const BI_Bitmap *b, int32_t x, int32_t count) {
    const int64_t n = bm::Pixels(count);
    switch (b->imageType) {
        case 1: return tessarine::storage::RunBytes(1, x, n);
        case 4: return n * (b->colorModel == 2 ? 4 : 3);
        default: return bm::OwnRunBytes(b, x, count);
    }
}

}  // namespace

namespace tessarine::bitmap {

int32_t GrayValueLut(uint8_t imageType, uint8_t d, MEM_Handle table, uint8_t (&lut)[256],
                     int *depth) {
    switch (imageType) {
        case 1:
        case 2:
            if (imageType == 1 || d == 1) {
                lut[0] = 0;
                lut[1] = 255;
                *depth = 1;
            } else if (d == 4) {
                for (int i = 0; i < 16; ++i) lut[i] = static_cast<uint8_t>(i * 17);
                *depth = 4;
            } else if (d == 8) {
                for (int i = 0; i < 256; ++i) lut[i] = static_cast<uint8_t>(i);
                *depth = 8;
            } else {
                return kErrUnsupported;
            }
            return kOk;
        case 3: {
            if (d != 1 && d != 4 && d != 8) {
                if (table != nullptr) MEM_Lock(table);  // left locked, as in the RGB unpacking
                return kErrUnsupported;
            }
            // Entries are read as 3 bytes whatever the model.
            const TableView t(table);
            for (int i = 0; i < (1 << d); ++i)
                lut[i] = GrayOf(t.At(3 * i), t.At(3 * i + 1), t.At(3 * i + 2));
            *depth = d;
            return kOk;
        }
        case 4: *depth = 0; return kOk;
        default: return kErrUnsupported;
    }
}

}  // namespace tessarine::bitmap

extern "C" {

TESSARINE_API int32_t BI_UnpackGRow(uint8_t imageType, uint8_t colorModel, uint8_t bitsPerPixel,
                                    MEM_Handle table, const uint8_t *src, int32_t x, int32_t count,
                                    uint8_t *out) {
    if (count < 1) return kOk;
    uint8_t lut[256];
    int depth = 0;
    const int32_t status = bm::GrayValueLut(imageType, bitsPerPixel, table, lut, &depth);
    if (status != kOk) return status;
    if (depth == 8 && imageType == 2) {
        std::memcpy(out, src, static_cast<size_t>(count));
        return kOk;
    }
    if (depth != 0) {
        ThroughLut(depth, src, x, count, lut, out);
        return kOk;
    }
    if (colorModel == 1) {
        for (int64_t i = 0; i < count; ++i, src += 3) out[i] = bm::GrayOf(src[0], src[1], src[2]);
        return kOk;
    }
    if (colorModel == 2) {
        for (int64_t i = 0; i < count; ++i, src += 4)
            out[i] = bm::GrayOfCmyk(src[0], src[1], src[2], src[3]);
        return kOk;
    }
    return kErrUnsupported;
}

TESSARINE_API int32_t BI_PackGRow(uint8_t bitsPerPixel, const uint8_t *values, int8_t x,
                                  int32_t count, uint8_t *row) {
    if (count < 1) return kOk;
    switch (bitsPerPixel) {
        case 1: bm::PackBits1<bm::HighBit>(values, x, count, row); return kOk;
        case 4:
            bm::PackNibbles(values, x, count, row, [](uint8_t v) { return bm::kDiv17[v]; });
            return kOk;
        case 8: std::memcpy(row, values, static_cast<size_t>(count)); return kOk;
        default: return kErrUnsupported;
    }
}

TESSARINE_API int32_t BI_GetGRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                 uint8_t *out) {
    return bm::GetRowSteps(bitmap, y, x, count, GrayBytes(bitmap, x, count), [&](const uint8_t *row) {
        return BI_UnpackGRow(bitmap->imageType, bitmap->colorModel, bitmap->bitsPerPixel,
                             bitmap->colorTable, row, x, count, out);
    });
}

TESSARINE_API int32_t BI_SetGRow(int32_t y, int32_t x, int32_t count, const uint8_t *values,
                                 BI_Bitmap *bitmap) {
    return bm::SetRowSteps(bitmap, y, x, count, bm::OwnRunBytes(bitmap, x, count),
                           [&](uint8_t *row, int64_t) {
                               return BI_PackGRow(bitmap->bitsPerPixel, values,
                                                  static_cast<int8_t>(x), count, row);
                           });
}

TESSARINE_API int32_t BI_GetPaddedGRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                       uint8_t *out) {
    return bm::PaddedRead(bitmap, x, count, out, [&](int32_t from, int32_t n, uint8_t *to) {
        return BI_GetGRow(bitmap, y, from, n, to);
    });
}

}  // extern "C"
