// Pixels between a raw area and the platform's device-independent bitmap.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include "bitmap/block_movers.h"
#include "bitmap/row_bits.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

// The DIB's pixels begin behind the header and its palette of 4-byte entries;
// the header's own size field is not consulted.
uint8_t *DibPixels(const BITMAPINFOHEADER *dib) {
    int64_t entries = 0;
    if (dib->biBitCount <= 8)
        entries = dib->biClrUsed != 0 ? int64_t{dib->biClrUsed} : int64_t{1} << dib->biBitCount;
    return reinterpret_cast<uint8_t *>(const_cast<BITMAPINFOHEADER *>(dib)) + 40 + 4 * entries;
}

int64_t DibStride(const BITMAPINFOHEADER *dib) {
    return ((int64_t{dib->biBitCount} * dib->biWidth + 31) >> 3) & ~int64_t{3};
}

// The packed depths, the same both ways.
int32_t MovePacked(int d, const uint8_t *s, int64_t sStride, int32_t left, uint8_t *t,
                   int64_t tStride, int32_t x, int64_t rows, int32_t width) {
    if (d != 1 && d != 4 && d != 8) return kErrUnsupported;
    for (int64_t r = 0; r < rows; ++r, s += sStride, t += tStride) {
        if (d == 1)
            BI_CopyRow1BPPBits(width, static_cast<uint8_t>(left & 7), s,
                               static_cast<uint8_t>(x & 7), t);
        else if (d == 4)
            BI_CopyRow4BPPBits(width, static_cast<uint8_t>(left & 1), s,
                               static_cast<uint8_t>(x & 1), t);
        else
            MEM_Copy(s, t, width);
    }
    return kOk;
}

void SwapThree(const uint8_t *s, uint8_t *t, int32_t width) {
    for (int32_t i = 0; i < width; ++i, s += 3, t += 3) {
        const uint8_t first = s[0];
        t[0] = s[2];
        t[1] = s[1];
        t[2] = first;
    }
}

// Device CMYK to the DIB's blue, green, red: each ink taken from white less
// the black.
void CmykToBgr(const uint8_t *s, uint8_t *t, int32_t width) {
    for (int32_t i = 0; i < width; ++i, s += 4, t += 3) {
        const int w = 255 - s[3];
        const int c = s[0], m = s[1], y = s[2];
        t[0] = static_cast<uint8_t>(y < w ? w - y : 0);
        t[1] = static_cast<uint8_t>(m < w ? w - m : 0);
        t[2] = static_cast<uint8_t>(c < w ? w - c : 0);
    }
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_MemBitsToDIB(const BI_Bitmap *bitmap, int32_t sourceStride,
                                      const RECT *sourceRect, const uint8_t *sourceBase, int32_t x,
                                      int32_t y, BITMAPINFOHEADER *dib) {
    const RECT r = *sourceRect;
    const int d = bitmap->bitsPerPixel;
    const int64_t dibStride = DibStride(dib);
    const uint8_t *s = bm::PixelAt(sourceBase, sourceStride, d, r.left, r.top);
    auto *t = const_cast<uint8_t *>(bm::PixelAt(DibPixels(dib), dibStride, d, x, y));
    const int64_t rows = int64_t{r.bottom} - r.top;
    const auto width = static_cast<int32_t>(int64_t{r.right} - r.left);
    if (bitmap->imageType != 4)
        return MovePacked(d, s, sourceStride, r.left, t, dibStride, x, rows, width);
    if (bitmap->colorModel != 1 && bitmap->colorModel != 2) return kErrUnsupported;
    for (int64_t row = 0; row < rows; ++row, s += sourceStride, t += dibStride) {
        if (bitmap->colorModel == 1)
            SwapThree(s, t, width);
        else
            CmykToBgr(s, t, width);
    }
    return kOk;
}

TESSARINE_API int32_t BI_DIBToMemBits(const RECT *sourceRect, const BITMAPINFOHEADER *dib,
                                      const BI_Bitmap *bitmap, int32_t destinationStride,
                                      int32_t x, int32_t y, uint8_t *destinationBase) {
    const RECT r = *sourceRect;
    const int d = bitmap->bitsPerPixel;
    const int64_t dibStride = DibStride(dib);
    const uint8_t *s = bm::PixelAt(DibPixels(dib), dibStride, d, r.left, r.top);
    auto *t = const_cast<uint8_t *>(bm::PixelAt(destinationBase, destinationStride, d, x, y));
    const int64_t rows = int64_t{r.bottom} - r.top;
    const auto width = static_cast<int32_t>(int64_t{r.right} - r.left);
    if (bitmap->imageType != 4)
        return MovePacked(d, s, dibStride, r.left, t, destinationStride, x, rows, width);
    // CMYK has no way back from three bytes.
    if (bitmap->colorModel != 1) return kErrUnsupported;
    for (int64_t row = 0; row < rows; ++row, s += dibStride, t += destinationStride)
        SwapThree(s, t, width);
    return kOk;
}

}  // extern "C"
