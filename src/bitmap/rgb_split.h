// 3- and 4-byte pixels to planes and back: the inner loops of true-colour
// rows, with vector paths where the processor has them (bitmap/cpu_features.h
// picks the path and caps it for tests).
#pragma once

#include <cstdint>

namespace tessarine::bitmap {

void SplitRgb(const uint8_t *pixels, int64_t count, uint8_t *r, uint8_t *g, uint8_t *b);
void JoinRgb(const uint8_t *r, const uint8_t *g, const uint8_t *b, int64_t count, uint8_t *pixels);

// The same for 4-byte pixels and four planes.
void SplitCmyk(const uint8_t *pixels, int64_t count, uint8_t *const planes[4]);
void JoinCmyk(const uint8_t *const planes[4], int64_t count, uint8_t *pixels);

}  // namespace tessarine::bitmap
