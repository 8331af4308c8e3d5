// Rectangles of raw pixel areas moved row by row, for the exported block
// movers and for the bitmap routes that hand them whole pixel blocks or tile
// buffers. A fenced side is a block of the library's own: its rows are moved
// exactly, and the bytes the row movers read or write past a run stay inside
// the block.
#pragma once

#include <cstdint>

#include <tessarine/platform.h>

#include "bitmap/row_bits.h"

namespace tessarine::bitmap {

struct PixelArea {
    const uint8_t *base;
    int64_t stride;
    Fence fence;  // unset: the caller's memory
};

struct MaskArea {
    const uint8_t *base;
    int64_t stride;
    int32_t x, y;
};

int32_t DirectCopyBits(int bitsPerPixel, const PixelArea &src, const RECT &rect,
                       const PixelArea &dst, int32_t x, int32_t y);
int32_t DirectMaskBits(int bitsPerPixel, const PixelArea &src, const RECT &rect,
                       const MaskArea &mask, const PixelArea &dst, int32_t x, int32_t y);

// Address of the byte holding pixel x of row y in an area.
inline const uint8_t *PixelAt(const uint8_t *base, int64_t stride, int bitsPerPixel, int64_t x,
                              int64_t y) {
    return base + y * stride + ((bitsPerPixel * x) >> 3);
}

}  // namespace tessarine::bitmap
