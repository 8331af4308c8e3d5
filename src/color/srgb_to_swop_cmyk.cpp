#include <tessarine/color.h>

#include "color/device_tables.h"

using tessarine::color::CX_RgbGrid;
using tessarine::color::CX_RgbWeight;

// Trilinear interpolation in integers: the eight corner weights are products
// of three 7-bit weights, so every plane sums to at most 255 << 21.
extern "C" TESSARINE_API void CX_SRgb2SWOPCmyk(uint8_t *rgb, uint8_t *cmyk) {
    const int rNode = rgb[0] >> 6;
    const int gNode = rgb[1] >> 6;
    const int bNode = rgb[2] >> 6;
    // The caller's colour keeps the fractions: callers rely on it.
    rgb[0] &= 63;
    rgb[1] &= 63;
    rgb[2] &= 63;
    const int32_t rW[2] = {CX_RgbWeight[rgb[0]], CX_RgbWeight[64 - rgb[0]]};
    const int32_t gW[2] = {CX_RgbWeight[rgb[1]], CX_RgbWeight[64 - rgb[1]]};
    const int32_t bW[2] = {CX_RgbWeight[rgb[2]], CX_RgbWeight[64 - rgb[2]]};
    int32_t corner[8];
    for (int i = 0; i < 8; ++i) corner[i] = rW[i >> 2] * gW[(i >> 1) & 1] * bW[i & 1];
    for (int plane = 0; plane < 4; ++plane) {
        int32_t sum = 0;
        for (int i = 0; i < 8; ++i)
            sum += CX_RgbGrid[plane][rNode + (i >> 2)][gNode + ((i >> 1) & 1)][bNode + (i & 1)] *
                   corner[i];
        cmyk[plane] = static_cast<uint8_t>(sum >> 21);
    }
}
