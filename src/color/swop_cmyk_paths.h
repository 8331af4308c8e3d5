// The two ways through CX_SWOPCmyk2SRgb. Both give the same bytes for every
// input; the exported function takes the vector one where the processor has it.
#pragma once

#include <cstdint>

#include "color/gamma_tables.h"

namespace tessarine::color {

// The formula term by term, in scalar doubles.
void SwopCmykToSRgbScalar(const uint8_t *cmyk, uint8_t *rgb);

// The same operations on the same operands, four lanes at a time (AVX2).
// Call only where the processor has VectorPath::kWide, with
// CX_CmykGammaTable(): taken by the caller, so that the vector code makes no
// call.
void SwopCmykToSRgbAvx2(const uint8_t *cmyk, uint8_t *rgb, const GammaTable &gamma);

}  // namespace tessarine::color
