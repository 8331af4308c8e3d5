// One pixel of a 1-bit bitmap in memory: set, clear or flip.
#include <tessarine/bitmap.h>

#include "core/status.h"

extern "C" {

TESSARINE_API int32_t BI_PixelOpBWBmp(int32_t x, int32_t y, int32_t operation, int32_t stride,
                                      uint8_t *first) {
    if (operation < 0 || operation > 2) return tessarine::kErrUnsupported;
    if (first == nullptr) return tessarine::kErrArgument;
    uint8_t &byte = first[int64_t{y} * stride + (x >> 3)];
    const auto mask = static_cast<uint8_t>(0x80 >> (x & 7));
    switch (operation) {
        case 0: byte |= mask; break;
        // The mask is taken as a truth value, not inverted: the whole byte clears.
        case 1: byte = static_cast<uint8_t>(byte & !mask); break;
        default: byte ^= mask; break;
    }
    return tessarine::kOk;
}

}  // extern "C"
