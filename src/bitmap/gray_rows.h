// Internal gray conversion shared by the row and column functions.
#pragma once

#include <cstdint>

#include <tessarine/platform.h>

namespace tessarine::bitmap {

// The density of every value of a layout whose pixels are values (imageType
// 1 to 3), with the bits a value takes in *depth; imageType 4 gives *depth 0
// and leaves the pixels to the caller. -2 for a layout the gray unpacking
// does not handle (an indexed one keeps its table locked then).
int32_t GrayValueLut(uint8_t imageType, uint8_t bitsPerPixel, MEM_Handle table,
                     uint8_t (&lut)[256], int *depth);

}  // namespace tessarine::bitmap
