// CMYK row access: indexed CMYK and 32-bit rows as four planes.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include "bitmap/color_tables.h"
#include "bitmap/rgb_split.h"
#include "bitmap/row_pack.h"
#include "bitmap/row_steps.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

int32_t UnpackCmyk(uint8_t type, uint8_t d, MEM_Handle table, const uint8_t *src, int32_t x,
                   int32_t count, uint8_t *const out[4]) {
    if (count < 1) return kOk;
    uint8_t *c = out[0], *m = out[1], *y = out[2], *k = out[3];
    if (type == 4) {
        bm::SplitCmyk(src, count, out);
        return kOk;
    }
    if (type != 3) return kErrUnsupported;
    if (d != 1 && d != 4 && d != 8) {
        if (table != nullptr) MEM_Lock(table);  // left locked, as in the RGB unpacking
        return kErrUnsupported;
    }
    uint8_t lut[4][256];
    {
        const bm::TableView t(table);
        for (int i = 0; i < (1 << d); ++i)
            for (int ch = 0; ch < 4; ++ch) lut[ch][i] = t.At(int64_t{i} * 4 + ch);
    }
    bm::ForEachValueChunk(d, src, x, count, [&](const uint8_t *v, int64_t n, int64_t done) {
        for (int64_t i = 0; i < n; ++i) {
            const uint8_t e = v[i];
            c[done + i] = lut[0][e];
            m[done + i] = lut[1][e];
            y[done + i] = lut[2][e];
            k[done + i] = lut[3][e];
        }
    });
    return kOk;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_UnpackCMYKRow(uint8_t imageType, uint8_t bitsPerPixel, MEM_Handle table,
                                       const uint8_t *row, int32_t x, int32_t count, uint8_t *c,
                                       uint8_t *m, uint8_t *y, uint8_t *k) {
    uint8_t *const out[4] = {c, m, y, k};
    return UnpackCmyk(imageType, bitsPerPixel, table, row, x, count, out);
}

TESSARINE_API int32_t BI_GetCMYKRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                    uint8_t *c, uint8_t *m, uint8_t *yellow, uint8_t *k) {
    const int64_t needed = bitmap->imageType == 4 ? bm::Pixels(count) * 4 : bm::OwnRunBytes(bitmap, x, count);
    uint8_t *const out[4] = {c, m, yellow, k};
    return bm::GetRowSteps(bitmap, y, x, count, needed, [&](const uint8_t *row) {
        return UnpackCmyk(bitmap->imageType, bitmap->bitsPerPixel, bitmap->colorTable, row, x,
                          count, out);
    });
}

TESSARINE_API int32_t BI_SetCMYKRow(int32_t y, int32_t x, int32_t count, const uint8_t *c,
                                    const uint8_t *m, const uint8_t *yellow, const uint8_t *k,
                                    BI_Bitmap *bitmap) {
    const int64_t n = bm::Pixels(count);
    const uint8_t *const planes[4] = {c, m, yellow, k};
    return bm::SetRowSteps(bitmap, y, x, count, n * 4, [&](uint8_t *row, int64_t) {
        bm::JoinCmyk(planes, n, row);
        return kOk;
    });
}

}  // extern "C"
