// The two output curves of the device formulas, 256 entries each, built at
// their first use and indexed by the truncation of a value in [0, 1] * 255.9.
#pragma once

#include <atomic>
#include <cstdint>

namespace tessarine::color {

struct GammaTable {
    uint8_t entry[256];
};

// The CMYK route's own curve: 2.708 t up to 0.05, then 1.1625 t^(1/2.2) - 0.1625.
const GammaTable &CX_CmykGammaTable();
// The sRGB curve with its break at 0.00304, indexed by i / 256.
const GammaTable &CX_LabGammaTable();

// The CMYK table's flag: null until the table is complete, then the table.
// Per-pixel code reads it with one load instead of a call.
extern __attribute__((visibility("hidden"))) std::atomic<const GammaTable *> g_cmykGammaBuilt;

inline const GammaTable *CmykGammaTableIfBuilt() {
    return g_cmykGammaBuilt.load(std::memory_order_acquire);
}

}  // namespace tessarine::color
