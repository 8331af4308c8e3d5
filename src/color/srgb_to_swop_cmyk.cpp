#include <tessarine/color.h>

#include <array>

#include "color/device_tables.h"

namespace {
using tessarine::color::CX_RgbGrid;
using tessarine::color::CX_RgbWeight;

// Each plane's weighted sum stays below 255 << 21, under 2^29, so two planes
// share a 64-bit word without a carry between them: c and m in one, y and k
// in the other. One multiplication then serves two planes, exactly.
struct PackedPlanes {
    uint64_t cm;
    uint64_t yk;
};

// The grid already blended along b for every b value: the sum over the
// eight corners regroups exactly into four (r, g) corners of these.
using BlendTable = std::array<std::array<std::array<PackedPlanes, 256>, 5>, 5>;

constexpr BlendTable MakeBlendTable() {
    BlendTable table{};
    for (int r = 0; r < 5; ++r)
        for (int g = 0; g < 5; ++g)
            for (int b = 0; b < 256; ++b) {
                const int node = b >> 6;
                const int low = CX_RgbWeight[b & 63];
                const int high = CX_RgbWeight[64 - (b & 63)];
                uint64_t lanes[4];
                for (int plane = 0; plane < 4; ++plane)
                    lanes[plane] = static_cast<uint64_t>(CX_RgbGrid[plane][r][g][node] * low +
                                                         CX_RgbGrid[plane][r][g][node + 1] * high);
                table[r][g][b] = {lanes[0] | lanes[1] << 32, lanes[2] | lanes[3] << 32};
            }
    return table;
}

constexpr BlendTable kBlend = MakeBlendTable();

}  // namespace

// Trilinear interpolation in integers: the eight corner weights are products
// of three 7-bit weights whose sum is 128 * 128 * 128.
extern "C" TESSARINE_API void CX_SRgb2SWOPCmyk(uint8_t *rgb, uint8_t *cmyk) {
    const int rNode = rgb[0] >> 6;
    const int gNode = rgb[1] >> 6;
    const uint8_t b = rgb[2];
    // The caller's colour keeps the fractions: callers rely on it.
    rgb[0] &= 63;
    rgb[1] &= 63;
    rgb[2] &= 63;
    const uint64_t rW[2] = {CX_RgbWeight[rgb[0]], CX_RgbWeight[64 - rgb[0]]};
    const uint64_t gW[2] = {CX_RgbWeight[rgb[1]], CX_RgbWeight[64 - rgb[1]]};
    uint64_t cm = 0;
    uint64_t yk = 0;
    for (int dr = 0; dr < 2; ++dr)
        for (int dg = 0; dg < 2; ++dg) {
            const uint64_t weight = rW[dr] * gW[dg];
            const PackedPlanes &blend = kBlend[rNode + dr][gNode + dg][b];
            cm += blend.cm * weight;
            yk += blend.yk * weight;
        }
    cmyk[0] = static_cast<uint8_t>((cm & 0xFFFFFFFFu) >> 21);
    cmyk[1] = static_cast<uint8_t>(cm >> 53);
    cmyk[2] = static_cast<uint8_t>((yk & 0xFFFFFFFFu) >> 21);
    cmyk[3] = static_cast<uint8_t>(yk >> 53);
}
