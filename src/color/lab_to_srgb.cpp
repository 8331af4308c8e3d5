#include <tessarine/color.h>

#include "color/gamma_tables.h"
#include "color/lab_to_rgb.h"

using namespace tessarine::color;

extern "C" TESSARINE_API void CX_Lab2SRgb(const uint8_t *lab, uint8_t *rgb) {
    const double L = lab[0];
    const double a = static_cast<int8_t>(lab[1]);
    const double b = static_cast<int8_t>(lab[2]);
    const double Y = L > 20 ? 100 * Cube(0.003381 * L + 0.137931) : 100 * 0.0004341380081314049 * L;
    const double f = L * 0.003381 + 0.137931;
    const LinearRgb linear = XyzFromLabToLinearRgb(f, a, b, Y);
    const double v[3] = {linear.r, linear.g, linear.b};
    const GammaTable &gamma = CX_LabGammaTable();
    for (int i = 0; i < 3; ++i) rgb[i] = gamma.entry[static_cast<int>(Clamp01(v[i]) * 255.9)];
}
