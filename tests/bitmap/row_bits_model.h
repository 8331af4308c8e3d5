// Bit-by-bit and nibble-by-nibble models of the 1-bit and 4-bit row movers,
// written from their definitions pixel by pixel, with the bits written past a
// run included.
#pragma once

#include <algorithm>
#include <cstdint>
#include <vector>

namespace rowbits {

using Bytes = std::vector<uint8_t>;

inline int Bit(const uint8_t *p, int64_t i) { return (p[i >> 3] >> (7 - (i & 7))) & 1; }
inline void SetBit(uint8_t *p, int64_t i, int v) {
    const auto b = static_cast<uint8_t>(0x80 >> (i & 7));
    p[i >> 3] = v ? (p[i >> 3] | b) : (p[i >> 3] & ~b);
}
inline int Nib(const uint8_t *p, int64_t i) { return (i & 1) ? p[i >> 1] & 15 : p[i >> 1] >> 4; }
inline void SetNib(uint8_t *p, int64_t i, int v) {
    uint8_t &b = p[i >> 1];
    b = (i & 1) ? static_cast<uint8_t>((b & 0xF0) | (v & 15)) : static_cast<uint8_t>((b & 0x0F) | (v << 4));
}

// Pixel j of the run goes from bit sp + j to bit dp + j; a destination phase
// other than 0 always fills its first byte.
inline void CopyRow1(int count, int sp, const uint8_t *src, int dp, uint8_t *dst) {
    const int n = dp != 0 ? std::max(count, 8 - dp) : std::max(count, 0);
    for (int j = 0; j < n; ++j) SetBit(dst, dp + j, Bit(src, sp + j));
}

// Equal phases and phase 0 to 1 move pixel for pixel; a first destination
// pixel at phase 1 is always written. Phase 1 to 0 starts two pixels late.
inline void CopyRow4(int count, int sp, const uint8_t *src, int dp, uint8_t *dst) {
    const int n = dp == 1 ? std::max(count, 1) : std::max(count, 0);
    const int from = (sp == 1 && dp == 0) ? 3 : sp;
    for (int j = 0; j < n; ++j) SetNib(dst, dp + j, Nib(src, from + j));
}

// Pixel j moves from bit sp + j to bit dp + j under mask bit mp + j. The
// first byte's pixels (8 - mp of them) are all served, whatever the count.
// When any of them is set and dp < mp, the last mp - dp bits of the second
// destination byte are cleared first.
inline void MaskRow1(int count, int sp, const uint8_t *src, int mp, const uint8_t *mask, int dp,
                     uint8_t *dst) {
    int j = 0;
    if (mp != 0) {
        bool any = false;
        for (; j < 8 - mp; ++j)
            if (Bit(mask, mp + j)) {
                SetBit(dst, dp + j, Bit(src, sp + j));
                any = true;
            }
        if (any && dp < mp)
            for (int b = 16 - (mp - dp); b < 16; ++b) SetBit(dst, b, 0);
    }
    for (; j < count; ++j)
        if (Bit(mask, mp + j)) SetBit(dst, dp + j, Bit(src, sp + j));
}

// Pixel by pixel; with mp not 0 the first mask byte serves twice: its bits
// from mp for the first 8 - mp pixels, then all eight for the next eight. The
// pixel is written by the parities of its two columns.
inline void MaskRow4(int count, int sp, const uint8_t *src, int mp, const uint8_t *mask, int dp,
                     uint8_t *dst) {
    auto maskBit = [&](int j) {
        if (mp == 0) return Bit(mask, j);
        if (j < 8 - mp) return Bit(mask, mp + j);
        return Bit(mask, j - (8 - mp));
    };
    for (int j = 0; j < count; ++j) {
        if (!maskBit(j)) continue;
        const int c = sp + j, t = dp + j;
        if ((c & 1) == 0 && (t & 1) == 0) {
            // The high nibble is cleared and the source or-ed into the low one.
            SetNib(dst, t + 1, Nib(dst, t + 1) | Nib(src, c));
            SetNib(dst, t, 0);
        } else {
            SetNib(dst, t, Nib(src, c));
        }
    }
}

}  // namespace rowbits
