// Internal RGB row conversion shared by the row and copy functions.
#pragma once

#include <cstdint>

#include <tessarine/platform.h>

namespace tessarine::bitmap {

// lut[k][v]: channel k (r, g, b) of pixel value v.
using RgbLut = uint8_t[3][256];

// The channels of every value of a layout whose pixels are values (imageType
// 1 to 3), with the bits a value takes in *depth; imageType 4 gives *depth 0
// and leaves the pixels to the caller. -2 for a layout the RGB unpacking does
// not handle (an indexed one keeps its table locked then, as it always did).
int32_t RgbValueLut(uint8_t imageType, uint8_t bitsPerPixel, MEM_Handle table, RgbLut &lut,
                    int *depth);

// Planes to a row of the given layout, from pixel x. Indexed pixels are found
// in the colour index (colorCount entries); a colour that is not there, or a
// bitmap without an index, takes the nearest of the `tableEntries` RGB
// entries of `table`.
int32_t BI_PackRGBRow(uint8_t imageType, uint8_t bitsPerPixel, const uint8_t *r, const uint8_t *g,
                      const uint8_t *b, int32_t x, int32_t count, uint8_t *row, int32_t colorCount,
                      const void *colorIndex, const uint8_t *table = nullptr,
                      int32_t tableEntries = 0);

}  // namespace tessarine::bitmap
