// Moving runs of bits between rows, high bit first, as the bit-shift
// transfers do.
#pragma once

#include <cstdint>
#include <cstring>

namespace tessarine::storage {

inline uint8_t ByteOrZero(const uint8_t *s, int64_t length, int64_t i) {
    return i >= 0 && i < length ? s[i] : 0;
}

// Eight source bits from bit `pos` on, high bit first; bits outside the
// source's `length` bytes read as 0, so that nothing outside it is touched.
inline uint8_t Fetch8(const uint8_t *s, int64_t length, int64_t pos) {
    const int64_t i = pos >> 3;
    const unsigned window = unsigned{ByteOrZero(s, length, i)} << 8 | ByteOrZero(s, length, i + 1);
    return static_cast<uint8_t>(window >> (8 - (pos & 7)));
}

// Copies `bits` bits (at least 1) from bit `from` of the source to bit `to` of
// the destination, high bits first. Destination bits before the start in the
// first byte and after the end in the last byte keep their values. Bit
// positions count from the start of the source's `srcLength` bytes; only the
// edge bytes may reach past the span, and they stay inside those bytes.
inline void CopyBits(const uint8_t *src, int64_t srcLength, int64_t from, uint8_t *dst, int64_t to,
                     int64_t bits) {
    const int64_t first = to >> 3;
    const int64_t end = to + bits;
    const int64_t last = (end - 1) >> 3;
    const int phase = static_cast<int>(to & 7);
    const int endPhase = static_cast<int>(end & 7);
    const auto keepFirst = static_cast<uint8_t>(0xFF << (8 - phase));
    const auto keepLast = static_cast<uint8_t>(endPhase ? ~(0xFF << (8 - endPhase)) : 0);
    const int64_t pos = from - phase;  // the source bit that lands on the top of dst[first]
    if (first == last) {
        const auto keep = static_cast<uint8_t>(keepFirst | keepLast);
        dst[first] = static_cast<uint8_t>((dst[first] & keep) | (Fetch8(src, srcLength, pos) & ~keep));
        return;
    }
    dst[first] = static_cast<uint8_t>((dst[first] & keepFirst) |
                                      (Fetch8(src, srcLength, pos) & ~keepFirst));
    // Whole bytes between the edges; their source bits all lie in the span.
    const int64_t middle = last - first - 1;
    const int64_t at = pos + 8;
    uint8_t *out = dst + first + 1;
    const uint8_t *in = src + (at >> 3);
    const int shift = static_cast<int>(at & 7);
    if (shift == 0) {
        std::memcpy(out, in, static_cast<size_t>(middle));
    } else {
        for (int64_t j = 0; j < middle; ++j)
            out[j] = static_cast<uint8_t>((in[j] << shift) | (in[j + 1] >> (8 - shift)));
    }
    const uint8_t tail = Fetch8(src, srcLength, pos + (last - first) * 8);
    dst[last] = static_cast<uint8_t>((dst[last] & keepLast) | (tail & ~keepLast));
}

}  // namespace tessarine::storage
