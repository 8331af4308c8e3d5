// The block movers on raw pixel areas: plain copy, copy through a 1-bit mask
// and copy through a map table.
#include "bitmap/block_movers.h"

#include <cstring>

#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include "core/status.h"
#include "core/block_guards.h"

namespace tessarine::bitmap {
namespace {

// Bytes a row mover may touch from a run's first byte: the run, the phase
// in front of it and the reading ahead.
int64_t TouchedBytes(int bitsPerPixel, int phase, int64_t count) {
    const int64_t pixels = count > 0 ? count : 0;
    return ((phase + pixels) * bitsPerPixel + 7) / 8 + 3;
}

bool RowFits(const PixelArea &a, const uint8_t *row, int64_t n) { return a.fence.Holds(row, n); }

template <class Row>
void EachRow(int bitsPerPixel, const PixelArea &src, const RECT &rect, const PixelArea &dst,
             int32_t x, int32_t y, Row &&row) {
    const int64_t width = int64_t{rect.right} - rect.left;
    for (int64_t r = rect.top; r < rect.bottom; ++r) {
        const int64_t dy = y + (r - rect.top);
        row(PixelAt(src.base, src.stride, bitsPerPixel, rect.left, r),
            const_cast<uint8_t *>(PixelAt(dst.base, dst.stride, bitsPerPixel, x, dy)), width);
    }
}

}  // namespace

int32_t DirectCopyBits(int d, const PixelArea &src, const RECT &rect, const PixelArea &dst,
                       int32_t x, int32_t y) {
    if (d != 1 && d != 4 && d != 8 && d != 24 && d != 32) return kErrUnsupported;
    if (rect.right <= rect.left || rect.bottom <= rect.top) return kOk;
    const int sp = d == 1 ? rect.left & 7 : rect.left & 1;
    const int dp = d == 1 ? x & 7 : x & 1;
    const auto count = static_cast<int32_t>(int64_t{rect.right} - rect.left);
    EachRow(d, src, rect, dst, x, y, [&](const uint8_t *s, uint8_t *t, int64_t width) {
        if (d >= 8) {
            MEM_Copy(s, t, static_cast<int32_t>((d * width) >> 3));
            return;
        }
        const bool raw = RowFits(src, s, TouchedBytes(d, sp, width)) &&
                         RowFits(dst, t, TouchedBytes(d, dp, width));
        if (raw) {
            if (d == 1)
                CopyRow1(RawBytes{}, count, sp, s, dp, t);
            else
                CopyRow4(RawBytes{}, count, sp, s, dp, t);
        } else {
            const FencedBytes fenced(src.fence, dst.fence);
            if (d == 1)
                CopyRow1(fenced, count, sp, s, dp, t);
            else
                CopyRow4(fenced, count, sp, s, dp, t);
        }
    });
    return kOk;
}

namespace {

// Whole pixels of N bytes under the set bits of the mask, high bit first
// from `phase`. Zero mask bytes after the first skip eight pixels.
template <int N>
void MaskWholePixels(const uint8_t *s, const uint8_t *m, int phase, int64_t count, uint8_t *t) {
    int64_t done = 0;
    if (phase != 0) {
        const unsigned b = *m++;
        for (int j = phase; j < 8 && done < count; ++j, ++done, s += N, t += N)
            if (b & (0x80u >> j)) std::memcpy(t, s, N);
    }
    while (done < count) {
        const unsigned b = *m++;
        if (b == 0xFF && count - done >= 8) {
            std::memcpy(t, s, 8 * N);
        } else if (b != 0) {
            for (int j = 0; j < 8 && done + j < count; ++j)
                if (b & (0x80u >> j)) std::memcpy(t + j * N, s + j * N, N);
        }
        done += 8;
        s += 8 * N;
        t += 8 * N;
    }
}

void MaskWholePixels(int bytesPer, const uint8_t *s, const uint8_t *m, int phase, int64_t count,
                     uint8_t *t) {
    if (bytesPer == 1) MaskWholePixels<1>(s, m, phase, count, t);
    else if (bytesPer == 3) MaskWholePixels<3>(s, m, phase, count, t);
    else MaskWholePixels<4>(s, m, phase, count, t);
}

}  // namespace

int32_t DirectMaskBits(int d, const PixelArea &src, const RECT &rect, const MaskArea &mask,
                       const PixelArea &dst, int32_t x, int32_t y) {
    if (d != 1 && d != 4 && d != 8 && d != 24 && d != 32) return kErrUnsupported;
    const int mp = mask.x & 7;
    const int sp = d == 1 ? rect.left & 7 : rect.left & 1;
    const int dp = d == 1 ? x & 7 : x & 1;
    int64_t maskRow = int64_t{mask.y};
    EachRow(d, src, rect, dst, x, y, [&](const uint8_t *s, uint8_t *t, int64_t width) {
        const uint8_t *m = mask.base + maskRow * mask.stride + (mask.x >> 3);
        ++maskRow;
        const auto count = static_cast<int32_t>(width);
        if (d >= 8) {
            MaskWholePixels(d / 8, s, m, mp, width, t);
            return;
        }
        const bool raw = RowFits(src, s, TouchedBytes(d, sp, width) + 1) &&
                         RowFits(dst, t, TouchedBytes(d, dp, width) + 1);
        if (raw) {
            if (d == 1)
                MaskRow1(RawBytes{}, count, sp, s, mp, m, dp, t);
            else
                MaskRow4(RawBytes{}, count, sp, s, mp, m, dp, t);
        } else {
            const FencedBytes fenced(src.fence, dst.fence, m, (mp + width + 7) / 8 + 1);
            if (d == 1)
                MaskRow1(fenced, count, sp, s, mp, m, dp, t);
            else
                MaskRow4(fenced, count, sp, s, mp, m, dp, t);
        }
    });
    return kOk;
}

}  // namespace tessarine::bitmap

namespace bm = tessarine::bitmap;
using tessarine::Failed;
using tessarine::kErrMemory;
using tessarine::kOk;

extern "C" {

TESSARINE_API int32_t BI_MemDirectCopyBits(uint8_t bitsPerPixel, int32_t sourceStride,
                                           const RECT *sourceRect, const uint8_t *sourceBase,
                                           int32_t destinationStride, int32_t x, int32_t y,
                                           uint8_t *destinationBase) {
    return bm::DirectCopyBits(bitsPerPixel, {sourceBase, sourceStride, {}}, *sourceRect,
                              {destinationBase, destinationStride, {}}, x, y);
}

TESSARINE_API int32_t BI_MemDirectMaskBits(uint8_t bitsPerPixel, int32_t sourceStride,
                                           const RECT *sourceRect, const uint8_t *sourceBase,
                                           int32_t maskStride, int32_t maskX, int32_t maskY,
                                           const uint8_t *maskBase, int32_t destinationStride,
                                           int32_t x, int32_t y, uint8_t *destinationBase) {
    return bm::DirectMaskBits(bitsPerPixel, {sourceBase, sourceStride, {}}, *sourceRect,
                              {maskBase, maskStride, maskX, maskY},
                              {destinationBase, destinationStride, {}}, x, y);
}

TESSARINE_API int32_t BI_MemMapTableCopyBits(const uint8_t *map, uint8_t sourceBitsPerPixel,
                                             int32_t sourceStride, const RECT *sourceRect,
                                             const uint8_t *sourceBase,
                                             uint8_t destinationBitsPerPixel,
                                             int32_t destinationStride, int32_t x, int32_t y,
                                             uint8_t *destinationBase, uint8_t *rowBuffer) {
    const RECT r = *sourceRect;
    const int64_t width = int64_t{r.right} - r.left;
    uint8_t *buffer = rowBuffer;
    tessarine::FreeGuard own;
    if (buffer == nullptr) {
        // A width that is not a byte count of this platform cannot be had.
        buffer = static_cast<uint8_t *>(
            width < 0 || width > UINT32_MAX ? nullptr
                                            : MEM_AllocPtr(MEM_FLAG_ZERO, static_cast<uint32_t>(width)));
        if (buffer == nullptr) return kErrMemory;
        own.Reset(buffer);
    }
    const auto count = static_cast<int32_t>(width);
    int32_t status = kOk;
    for (int64_t row = r.top; row < r.bottom; ++row) {
        const int64_t dy = y + (row - r.top);
        status = BI_UnpackIndexRow(
            sourceBitsPerPixel,
            bm::PixelAt(sourceBase, sourceStride, sourceBitsPerPixel, r.left, row), 0, count,
            buffer);
        if (Failed(status)) break;
        for (int32_t i = 0; i < count; ++i) buffer[i] = map[buffer[i]];
        status = BI_PackIndexRow(
            destinationBitsPerPixel, buffer, 0, count,
            const_cast<uint8_t *>(bm::PixelAt(destinationBase, destinationStride,
                                              destinationBitsPerPixel, x, dy)));
        if (Failed(status)) break;
    }
    return status;
}

}  // extern "C"
