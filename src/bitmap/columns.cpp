// Column access: a run of pixels down one column, from the top or from the
// bottom, as colour planes or densities.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include "bitmap/color_tables.h"
#include "bitmap/gray_rows.h"
#include "bitmap/rgb_rows.h"
#include "core/status.h"
#include "storage/row_services.h"

namespace bm = tessarine::bitmap;
using tessarine::Failed;
using tessarine::kErrGeneral;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

// The pixels of a column: pixel i lies at `at + i * step`, its place in the
// byte given by the column x.
struct Column {
    const uint8_t *at;
    int64_t step;

    Column(const uint8_t *first, int32_t stride, int32_t count, bool bottomUp) {
        at = bottomUp ? first + (int64_t{count} - 1) * stride : first;
        step = bottomUp ? -int64_t{stride} : int64_t{stride};
    }
    const uint8_t *Pixel(int64_t i) const { return at + i * step; }
};

// Calls `take(i, value)` for the value of every pixel of a column of
// `depth`-bit values (1, 4 or 8).
template <class Take>
void ForEachValue(const Column &c, int depth, int32_t x, int32_t count, Take &&take) {
    if (depth == 8) {
        for (int64_t i = 0; i < count; ++i) take(i, *c.Pixel(i));
        return;
    }
    const int shift = depth == 1 ? 7 - (x & 7) : ((x & 1) ? 0 : 4);
    const unsigned mask = depth == 1 ? 1u : 15u;
    for (int64_t i = 0; i < count; ++i) take(i, static_cast<uint8_t>((*c.Pixel(i) >> shift) & mask));
}

int32_t UnpackRgbColumn(uint8_t type, uint8_t d, MEM_Handle table, int32_t stride,
                        const uint8_t *first, int32_t x, int32_t count, uint8_t *r, uint8_t *g,
                        uint8_t *b, bool bottomUp) {
    if (count < 1) return kOk;
    bm::RgbLut lut;
    int depth = 0;
    const int32_t status = bm::RgbValueLut(type, d, table, lut, &depth);
    if (status != kOk) return status;
    const Column c(first, stride, count, bottomUp);
    if (depth == 0) {
        for (int64_t i = 0; i < count; ++i) {
            const uint8_t *p = c.Pixel(i);
            r[i] = p[0];
            g[i] = p[1];
            b[i] = p[2];
        }
        return kOk;
    }
    ForEachValue(c, depth, x, count, [&](int64_t i, uint8_t v) {
        r[i] = lut[0][v];
        g[i] = lut[1][v];
        b[i] = lut[2][v];
    });
    return kOk;
}

int32_t UnpackGrayColumn(uint8_t type, uint8_t model, uint8_t d, MEM_Handle table, int32_t stride,
                         const uint8_t *first, int32_t x, int32_t count, uint8_t *out,
                         bool bottomUp) {
    if (count < 1) return kOk;
    uint8_t lut[256];
    int depth = 0;
    const int32_t status = bm::GrayValueLut(type, d, table, lut, &depth);
    if (status != kOk) return status;
    const Column c(first, stride, count, bottomUp);
    if (depth == 0) {
        // Unlike the rows, a column knows no CMYK density.
        if (model != 1) return kErrUnsupported;
        for (int64_t i = 0; i < count; ++i) {
            const uint8_t *p = c.Pixel(i);
            out[i] = bm::GrayOf(p[0], p[1], p[2]);
        }
        return kOk;
    }
    ForEachValue(c, depth, x, count, [&](int64_t i, uint8_t v) { out[i] = lut[v]; });
    return kOk;
}

// The steps every column read shares: the box's pixels from the block lock,
// the conversion, the release.
template <class Convert>
int32_t GetColumn(BI_Bitmap *b, int32_t x, int32_t y, int32_t count, Convert &&convert) {
    if (count < 1) return kOk;
    const int64_t bottom = int64_t{y} + count;
    const int64_t right = int64_t{x} + 1;
    if (bottom > INT32_MAX || right > INT32_MAX) return kErrGeneral;
    const HVT_Box box{x, y, static_cast<int32_t>(right), static_cast<int32_t>(bottom)};
    int32_t stride = 0;
    uint8_t *pointer = nullptr;
    void *temp = nullptr;
    int32_t status = tessarine::storage::BI_LockBlockRead(b, &box, &stride, &pointer, &temp);
    if (!Failed(status)) {
        status = convert(stride, pointer);
        if (b->storage & BI_STORAGE_MEMORY) MEM_Unlock(b->pixelHandle);
    }
    if (temp != nullptr) MEM_FreePtr(temp);
    return status;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_UnpackRGBColTopdown(uint8_t imageType, uint8_t bitsPerPixel,
                                             MEM_Handle table, int32_t stride,
                                             const uint8_t *first, int32_t x, int32_t count,
                                             uint8_t *r, uint8_t *g, uint8_t *b) {
    return UnpackRgbColumn(imageType, bitsPerPixel, table, stride, first, x, count, r, g, b, false);
}

TESSARINE_API int32_t BI_UnpackRGBColBottomup(uint8_t imageType, uint8_t bitsPerPixel,
                                              MEM_Handle table, int32_t stride,
                                              const uint8_t *first, int32_t x, int32_t count,
                                              uint8_t *r, uint8_t *g, uint8_t *b) {
    return UnpackRgbColumn(imageType, bitsPerPixel, table, stride, first, x, count, r, g, b, true);
}

TESSARINE_API int32_t BI_UnpackGColTopdown(uint8_t imageType, uint8_t colorModel,
                                           uint8_t bitsPerPixel, MEM_Handle table, int32_t stride,
                                           const uint8_t *first, int32_t x, int32_t count,
                                           uint8_t *out) {
    return UnpackGrayColumn(imageType, colorModel, bitsPerPixel, table, stride, first, x, count,
                            out, false);
}

TESSARINE_API int32_t BI_UnpackGColBottomup(uint8_t imageType, uint8_t colorModel,
                                            uint8_t bitsPerPixel, MEM_Handle table, int32_t stride,
                                            const uint8_t *first, int32_t x, int32_t count,
                                            uint8_t *out) {
    return UnpackGrayColumn(imageType, colorModel, bitsPerPixel, table, stride, first, x, count,
                            out, true);
}

TESSARINE_API int32_t BI_GetRGBColTopdown(BI_Bitmap *bitmap, int32_t x, int32_t y, int32_t count,
                                          uint8_t *r, uint8_t *g, uint8_t *b) {
    return GetColumn(bitmap, x, y, count, [&](int32_t stride, const uint8_t *first) {
        return BI_UnpackRGBColTopdown(bitmap->imageType, bitmap->bitsPerPixel, bitmap->colorTable,
                                      stride, first, x, count, r, g, b);
    });
}

TESSARINE_API int32_t BI_GetRGBColBottomup(BI_Bitmap *bitmap, int32_t x, int32_t y, int32_t count,
                                           uint8_t *r, uint8_t *g, uint8_t *b) {
    return GetColumn(bitmap, x, y, count, [&](int32_t stride, const uint8_t *first) {
        return BI_UnpackRGBColBottomup(bitmap->imageType, bitmap->bitsPerPixel,
                                       bitmap->colorTable, stride, first, x, count, r, g, b);
    });
}

TESSARINE_API int32_t BI_GetGColTopdown(BI_Bitmap *bitmap, int32_t x, int32_t y, int32_t count,
                                        uint8_t *out) {
    return GetColumn(bitmap, x, y, count, [&](int32_t stride, const uint8_t *first) {
        return BI_UnpackGColTopdown(bitmap->imageType, bitmap->colorModel, bitmap->bitsPerPixel,
                                    bitmap->colorTable, stride, first, x, count, out);
    });
}

TESSARINE_API int32_t BI_GetGColBottomup(BI_Bitmap *bitmap, int32_t x, int32_t y, int32_t count,
                                         uint8_t *out) {
    return GetColumn(bitmap, x, y, count, [&](int32_t stride, const uint8_t *first) {
        return BI_UnpackGColBottomup(bitmap->imageType, bitmap->colorModel, bitmap->bitsPerPixel,
                                     bitmap->colorTable, stride, first, x, count, out);
    });
}

}  // extern "C"
