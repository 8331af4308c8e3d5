// Pixel-value kernels shared by the row functions: packed 1-, 4- and 8-bit
// pixels to one byte per pixel and back, by whole bytes and words where the
// run allows it. Positions follow the image: pixel x sits at bit 7 - (x & 7)
// at one bit, in the high nibble for even x at four bits.
#pragma once

#include <array>
#include <cstdint>
#include <cstring>

namespace tessarine::bitmap {

// The eight pixels of a 1-bit byte as eight 0/1 bytes of a word, first pixel
// in the lowest byte.
inline constexpr std::array<uint64_t, 256> kBitFlags = [] {
    std::array<uint64_t, 256> t{};
    for (int b = 0; b < 256; ++b) {
        uint64_t w = 0;
        for (int i = 0; i < 8; ++i)
            if (b & (0x80 >> i)) w |= uint64_t{1} << (8 * i);
        t[b] = w;
    }
    return t;
}();

// The two pixels of a 4-bit byte, first pixel in the low byte.
inline constexpr std::array<uint16_t, 256> kNibblePairs = [] {
    std::array<uint16_t, 256> t{};
    for (int b = 0; b < 256; ++b) t[b] = static_cast<uint16_t>((b >> 4) | ((b & 15) << 8));
    return t;
}();

// A density to a 4-bit gray level: the * 17 of reading undone, truncating.
inline constexpr std::array<uint8_t, 256> kDiv17 = [] {
    std::array<uint8_t, 256> t{};
    for (int v = 0; v < 256; ++v) t[v] = static_cast<uint8_t>(v / 17);
    return t;
}();

inline uint64_t Load64(const uint8_t *p) {
    uint64_t w;
    std::memcpy(&w, p, 8);
    return w;
}
inline void Store64(uint8_t *p, uint64_t w) { std::memcpy(p, &w, 8); }

// Eight bytes of 0/1 (lowest byte first) gathered into one byte, the first in
// the high bit.
inline uint8_t GatherLowBits(uint64_t ones) {
    return static_cast<uint8_t>((ones * 0x8040201008040201ULL) >> 56);
}

// Packs 8 * bytes values into whole bytes of 1-bit pixels: a value is a set
// bit when it is non-zero, or with `highBit` when it is above 127.
void PackFlagBytes(const uint8_t *values, int64_t bytes, uint8_t *dst, bool highBit);
// The other way: `bytes` whole bytes to 8 * bytes values of 0 and 1.
void UnpackFlagBytes(const uint8_t *src, int64_t bytes, uint8_t *out);

// What makes a one-byte value a set bit when it is packed into 1 bit; kWide
// says which whole-byte packing serves it (-1 none).
struct NonZeroBit {
    static constexpr int kWide = 0;
    static bool Bit(uint8_t v) { return v != 0; }
    static uint8_t Pack8(const uint8_t *v) {
        const uint64_t w = Load64(v);
        const uint64_t nz = (((w & 0x7F7F7F7F7F7F7F7FULL) + 0x7F7F7F7F7F7F7F7FULL) | w) &
                            0x8080808080808080ULL;
        return GatherLowBits(nz >> 7);
    }
};
struct HighBit {  // a density above 127 is black
    static constexpr int kWide = 1;
    static bool Bit(uint8_t v) { return v > 127; }
    static uint8_t Pack8(const uint8_t *v) {
        return GatherLowBits((Load64(v) & 0x8080808080808080ULL) >> 7);
    }
};

// count 1-bit pixels from pixel x of the row at `src` (the byte holding x) to
// 0/1 bytes.
inline void UnpackBits1(const uint8_t *src, int64_t x, int64_t count, uint8_t *out) {
    int phase = static_cast<int>(x & 7);
    if (phase != 0) {
        const uint8_t b = *src++;
        for (; phase < 8 && count > 0; ++phase, --count) *out++ = (b >> (7 - phase)) & 1;
    }
    const int64_t bytes = count >> 3;
    UnpackFlagBytes(src, bytes, out);
    src += bytes;
    out += bytes * 8;
    count &= 7;
    if (count > 0) {
        const uint8_t b = *src;
        for (int i = 0; i < count; ++i) out[i] = (b >> (7 - i)) & 1;
    }
}

inline void UnpackNibbles(const uint8_t *src, int64_t x, int64_t count, uint8_t *out) {
    if ((x & 1) && count > 0) {
        *out++ = *src++ & 15;
        --count;
    }
    for (; count >= 2; count -= 2, out += 2) std::memcpy(out, &kNibblePairs[*src++], 2);
    if (count > 0) *out = *src >> 4;
}

// Pixel values of depth d (1, 4 or 8) to one byte each.
inline void UnpackValues(int d, const uint8_t *src, int64_t x, int64_t count, uint8_t *out) {
    if (count <= 0) return;
    if (d == 1)
        UnpackBits1(src, x, count, out);
    else if (d == 4)
        UnpackNibbles(src, x, count, out);
    else
        std::memcpy(out, src, static_cast<size_t>(count));
}

// Values to 1-bit pixels from pixel x on; the bits before x and after the run
// keep their value.
template <class Rule>
void PackBits1(const uint8_t *v, int64_t x, int64_t count, uint8_t *dst) {
    if (count <= 0) return;
    int phase = static_cast<int>(x & 7);
    if (phase != 0) {
        uint8_t b = *dst;
        for (; phase < 8 && count > 0; ++phase, --count, ++v) {
            const uint8_t bit = static_cast<uint8_t>(0x80 >> phase);
            b = Rule::Bit(*v) ? (b | bit) : (b & ~bit);
        }
        *dst++ = b;
    }
    if constexpr (Rule::kWide >= 0) {
        const int64_t bytes = count >> 3;
        PackFlagBytes(v, bytes, dst, Rule::kWide == 1);
        dst += bytes;
        v += bytes * 8;
        count &= 7;
    }
    for (; count >= 8; count -= 8, v += 8) *dst++ = Rule::Pack8(v);
    if (count > 0) {
        uint8_t b = *dst;
        for (int i = 0; i < count; ++i) {
            const uint8_t bit = static_cast<uint8_t>(0x80 >> i);
            b = Rule::Bit(v[i]) ? (b | bit) : (b & ~bit);
        }
        *dst = b;
    }
}

// Values to 4-bit pixels from pixel x on through `level`; the other nibble
// of an edge byte keeps its value.
template <class Level>
void PackNibbles(const uint8_t *v, int64_t x, int64_t count, uint8_t *dst, Level level) {
    if (count <= 0) return;
    if (x & 1) {
        *dst = static_cast<uint8_t>((*dst & 0xF0) | level(*v++));
        ++dst;
        --count;
    }
    for (; count >= 2; count -= 2, v += 2)
        *dst++ = static_cast<uint8_t>((level(v[0]) << 4) | level(v[1]));
    if (count > 0) *dst = static_cast<uint8_t>((level(*v) << 4) | (*dst & 0x0F));
}

// Runs the pixel values of a row through `emit(values, n, done)` in pieces
// that fit a stack buffer, so that no conversion allocates. At 8 bits the row
// itself is handed on.
template <class Emit>
void ForEachValueChunk(int d, const uint8_t *src, int64_t x, int64_t count, Emit &&emit) {
    if (count <= 0) return;
    if (d == 8) {
        emit(src, count, int64_t{0});
        return;
    }
    constexpr int64_t kChunk = 4096;  // a multiple of 8: later chunks start on a byte
    uint8_t values[kChunk];
    for (int64_t done = 0; done < count;) {
        const int64_t n = count - done < kChunk ? count - done : kChunk;
        const int64_t at = x + done;
        const uint8_t *from = src + (((at * d) >> 3) - ((x * d) >> 3));
        UnpackValues(d, from, at, n, values);
        emit(values, n, done);
        done += n;
    }
}

}  // namespace tessarine::bitmap
