// 3- and 4-byte pixels to planes and back: the inner loops of true-colour
// rows, with a vector path where the processor has byte shuffles.
#pragma once

#include <cstdint>

namespace tessarine::bitmap {

void SplitRgb(const uint8_t *pixels, int64_t count, uint8_t *r, uint8_t *g, uint8_t *b);
void JoinRgb(const uint8_t *r, const uint8_t *g, const uint8_t *b, int64_t count, uint8_t *pixels);

// The 3-byte paths, slowest first. Tests cap the fastest that SplitRgb and
// JoinRgb may take, to run each path this processor has; the previous cap is
// returned. A path the processor lacks is skipped whatever the cap.
inline constexpr int kRgbPathPlain = 0;
inline constexpr int kRgbPathShuffle = 1;
inline constexpr int kRgbPathWide = 2;
inline constexpr int kRgbPathPermute = 3;
int LimitRgbPaths(int fastest);

// The same for 4-byte pixels and four planes.
void SplitCmyk(const uint8_t *pixels, int64_t count, uint8_t *const planes[4]);
void JoinCmyk(const uint8_t *const planes[4], int64_t count, uint8_t *pixels);

}  // namespace tessarine::bitmap
