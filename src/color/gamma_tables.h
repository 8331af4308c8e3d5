// The two output curves of the device formulas, 256 entries each, built at
// their first use and indexed by the truncation of a value in [0, 1] * 255.9.
#pragma once

#include <cstdint>

namespace tessarine::color {

struct GammaTable {
    uint8_t entry[256];
};

GammaTable BuildCmykGamma();
GammaTable BuildLabGamma();

// Inline so that a per-pixel caller pays only the check that the table is
// built. The language's guard makes the first use thread-safe: a second
// thread waits for the first instead of building the same bytes again.

// The CMYK route's own curve: 2.708 t up to 0.05, then 1.1625 t^(1/2.2) - 0.1625.
inline const GammaTable &CX_CmykGammaTable() {
    static const GammaTable table = BuildCmykGamma();
    return table;
}

// The sRGB curve with its break at 0.00304, indexed by i / 256.
inline const GammaTable &CX_LabGammaTable() {
    static const GammaTable table = BuildLabGamma();
    return table;
}

}  // namespace tessarine::color
