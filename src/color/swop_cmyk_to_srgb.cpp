#include <tessarine/color.h>

#include "bitmap/cpu_features.h"
#include "color/device_tables.h"
#include "color/gamma_tables.h"
#include "color/lab_to_rgb.h"
#include "color/swop_cmyk_paths.h"

namespace tessarine::color {

// A Neugebauer model in Lab: primaries 0 to 7 at no black, 8 to 15 at half
// black, and black itself at full black, joined by a quadratic in k.
void SwopCmykToSRgbScalar(const uint8_t *cmyk, uint8_t *rgb) {
    const double c = cmyk[0] * 0.00392156862745098;
    const double m = cmyk[1] * 0.00392156862745098;
    const double y = cmyk[2] * 0.00392156862745098;
    const double k = cmyk[3] * 0.00392156862745098;
    const double cf[2] = {1 - c, c};
    const double mf[2] = {1 - m, m};
    const double yf[2] = {1 - y, y};
    double weight[8];
    for (int i = 0; i < 8; ++i)
        weight[i] = cf[i & 1] * mf[(i >> 1) & 1] * yf[(i >> 2) & 1] * (1 - k);
    double lab[3];
    for (int row = 0; row < 3; ++row) {
        const int32_t *P = CX_SwopPrimaries[row];
        double noBlack = 0;
        double halfBlack = 0;
        for (int i = 0; i < 8; ++i) {
            noBlack += P[i] * weight[i];
            halfBlack += P[8 + i] * weight[i];
        }
        lab[row] = (1 - 2 * k) * noBlack + 4 * k * halfBlack;
    }
    const double L = lab[0];
    const double f = L * 0.008621 + 0.137931;
    const double Y = L > 8 ? 100 * Cube(L * 0.008621 + 0.137931) : 100 * L * 0.0011070519207350825;
    const LinearRgb linear = XyzFromLabToLinearRgb(f, lab[1], lab[2], Y);
    double v[3] = {linear.r, linear.g, linear.b};
    double low = v[0];
    if (v[1] < low) low = v[1];
    if (v[2] < low) low = v[2];
    if (low < 0) {
        // Desaturate towards white instead of clipping: the lowest value
        // lands on 0 and 1 stays where it is.
        const double t = -low / (1 - low);
        for (double &value : v) value = value * (1 - t) + t;
    }
    const GammaTable &gamma = CX_CmykGammaTable();
    for (int i = 0; i < 3; ++i) rgb[i] = gamma.entry[static_cast<int>(Clamp01(v[i]) * 255.9)];
}

}  // namespace tessarine::color

// The first call takes the scalar path, which builds the gamma table; the
// vector path then finds it built.
extern "C" TESSARINE_API void CX_SWOPCmyk2SRgb(const uint8_t *cmyk, uint8_t *rgb) {
    using namespace tessarine::color;
    if (tessarine::ActiveVectorPath() >= tessarine::VectorPath::kWide) {
        if (const GammaTable *gamma = CmykGammaTableIfBuilt()) {
            SwopCmykToSRgbAvx2(cmyk, rgb, *gamma);
            return;
        }
    }
    SwopCmykToSRgbScalar(cmyk, rgb);
}
