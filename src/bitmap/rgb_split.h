// 3-byte pixels to three planes and back: the inner loops of true-colour
// rows, with a vector path where the processor has byte shuffles.
#pragma once

#include <cstdint>

namespace tessarine::bitmap {

void SplitRgb(const uint8_t *pixels, int64_t count, uint8_t *r, uint8_t *g, uint8_t *b);
void JoinRgb(const uint8_t *r, const uint8_t *g, const uint8_t *b, int64_t count, uint8_t *pixels);

}  // namespace tessarine::bitmap
