// Internal RGB row conversion shared by the row and copy functions.
#pragma once

#include <cstdint>

namespace tessarine::bitmap {

// Planes to a row of the given layout, from pixel x. Indexed pixels are found
// in the colour index (colorCount entries); a colour that is not there, or a
// bitmap without an index, takes the nearest of the `tableEntries` RGB
// entries of `table`.
int32_t BI_PackRGBRow(uint8_t imageType, uint8_t bitsPerPixel, const uint8_t *r, const uint8_t *g,
                      const uint8_t *b, int32_t x, int32_t count, uint8_t *row, int32_t colorCount,
                      const void *colorIndex, const uint8_t *table = nullptr,
                      int32_t tableEntries = 0);

}  // namespace tessarine::bitmap
