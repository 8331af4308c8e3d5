#include "color/gamma_tables.h"

#include <cmath>

namespace tessarine::color {
namespace {

GammaTable BuildCmykGamma() {
    GammaTable table{};
    for (int i = 0; i < 256; ++i) {
        const double t = i * 0.00392156862745098;
        const double v = t <= 0.05 ? 2.708 * t : std::pow(t, 0.45454545454545453) * 1.1625 - 0.1625;
        table.entry[i] = static_cast<uint8_t>(v * 255.1);
    }
    return table;
}

GammaTable BuildLabGamma() {
    GammaTable table{};
    for (int i = 0; i < 256; ++i) {
        const double t = i * 0.00390625;
        const double v = t <= 0.00304 ? 12.92 * t : std::pow(t, 0.416667) * 1.055 - 0.055;
        table.entry[i] = static_cast<uint8_t>(v * 255.1);
    }
    return table;
}

}  // namespace

std::atomic<const GammaTable *> g_cmykGammaBuilt{nullptr};

// A function-local static is built once, under the language's own guard; a
// second thread waits for the first instead of building the same bytes again.
const GammaTable &CX_CmykGammaTable() {
    static const GammaTable table = BuildCmykGamma();
    g_cmykGammaBuilt.store(&table, std::memory_order_release);
    return table;
}

const GammaTable &CX_LabGammaTable() {
    static const GammaTable table = BuildLabGamma();
    return table;
}

}  // namespace tessarine::color
