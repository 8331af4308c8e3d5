// The 1-bit and 4-bit row movers, byte for byte as the exported functions
// define them, over an access policy. RawBytes is the exported behaviour:
// the reads past a run and the writes before and after it land where they
// land. FencedBytes serves the library's own callers at the end of a block:
// bytes outside the two blocks read as 0 and are never written, while every
// byte inside gets exactly what the raw form gives.
#pragma once

#include <cstdint>
#include <cstring>

namespace tessarine::bitmap {

struct RawBytes {
    static constexpr bool kRaw = true;
    uint8_t Ld(const uint8_t *p) const { return *p; }
    void St(uint8_t *p, uint8_t v) const { *p = v; }
};

// A block's bounds; an unset fence is the caller's memory, read as it lies.
struct Fence {
    const uint8_t *lo = nullptr;
    int64_t bytes = 0;
    bool Set() const { return lo != nullptr; }
    // True when [p, p + n) lies inside the block (or there is no block).
    bool Holds(const uint8_t *p, int64_t n) const {
        if (!Set()) return true;
        const auto u = reinterpret_cast<uintptr_t>(p);
        const auto l = reinterpret_cast<uintptr_t>(lo);
        return u >= l && n >= 0 && u - l <= static_cast<uintptr_t>(bytes) &&
               static_cast<uintptr_t>(n) <= static_cast<uintptr_t>(bytes) - (u - l);
    }
};

struct FencedBytes {
    static constexpr bool kRaw = false;
    uintptr_t srcLo, srcHi, dstLo, dstHi, maskLo, maskHi;
    static void Bounds(const Fence &f, uintptr_t *lo, uintptr_t *hi) {
        *lo = f.Set() ? reinterpret_cast<uintptr_t>(f.lo) : 0;
        *hi = f.Set() ? *lo + static_cast<uintptr_t>(f.bytes) : UINTPTR_MAX;
    }
    // The mask bytes, when there is a mask, are the caller's run of them.
    FencedBytes(const Fence &src, const Fence &dst, const uint8_t *mask = nullptr,
                int64_t maskBytes = 0) {
        Bounds(src, &srcLo, &srcHi);
        Bounds(dst, &dstLo, &dstHi);
        maskLo = reinterpret_cast<uintptr_t>(mask);
        maskHi = maskLo + static_cast<uintptr_t>(mask != nullptr ? maskBytes : 0);
    }
    uint8_t Ld(const uint8_t *p) const {
        const auto u = reinterpret_cast<uintptr_t>(p);
        return (u >= srcLo && u < srcHi) || (u >= dstLo && u < dstHi) ||
                       (u >= maskLo && u < maskHi)
                   ? *p
                   : 0;
    }
    void St(uint8_t *p, uint8_t v) const {
        const auto u = reinterpret_cast<uintptr_t>(p);
        if (u >= dstLo && u < dstHi) *p = v;
    }
};

inline uint64_t LoadBE64(const uint8_t *p) {
    uint64_t w;
    std::memcpy(&w, p, 8);
    return __builtin_bswap64(w);
}
inline void StoreBE64(uint8_t *p, uint64_t w) {
    w = __builtin_bswap64(w);
    std::memcpy(p, &w, 8);
}

// out[k] = (in[k] << r | in[k + 1] >> (8 - r)) for k < n, r in 0..7: the body
// of the 1-bit copy. Reads in[0..n], as the byte loop does.
void ShiftBytesLeft(const uint8_t *in, int64_t n, int r, uint8_t *out);

// The library's forward copy, for the whole bytes of equal phases.
void CopyWholeBytes(const uint8_t *src, int32_t n, uint8_t *dst);

// Top n bits of a byte (n in 0..8).
inline uint8_t TopBits(int n) { return static_cast<uint8_t>(0xFF00u >> n); }

template <class A>
void CopyRow1(const A &a, int32_t count, int sp, const uint8_t *src, int dp, uint8_t *dst) {
    const int shift = 8 - ((sp - dp) & 7);
    if (dp != 0) {
        const uint8_t keep = TopBits(dp);
        unsigned value;
        if (dp < sp)
            value = (unsigned{a.Ld(src)} << 8 | a.Ld(src + 1)) >> shift;
        else
            value = unsigned{a.Ld(src)} >> (dp - sp);
        a.St(dst, static_cast<uint8_t>((value & ~unsigned{keep}) | (a.Ld(dst) & keep)));
        count -= 8 - dp;
        ++dst;
        if (dp <= sp) ++src;
    }
    unsigned acc = unsigned{a.Ld(src)} << 8;
    const uint8_t *p = src + 1;
    if (count >= 8) {
        const int64_t n = count >> 3;
        if constexpr (A::kRaw) {
            ShiftBytesLeft(src, n, 8 - shift, dst);
        } else {
            for (int64_t k = 0; k < n; ++k) {
                const unsigned w = acc | a.Ld(p + k);
                acc = w << 8;
                a.St(dst + k, static_cast<uint8_t>(w >> shift));
            }
        }
        p += n;
        dst += n;
        acc = unsigned{a.Ld(p - 1)} << 8;
        count &= 7;
    }
    if (count > 0) {
        const uint8_t mask = TopBits(count);
        if (shift < count) acc |= a.Ld(p);
        a.St(dst, static_cast<uint8_t>(((acc >> shift) & mask) | (a.Ld(dst) & ~mask)));
    }
}

template <class A>
void CopyRow4(const A &a, int32_t count, int sp, const uint8_t *src, int dp, uint8_t *dst) {
    if (sp == dp) {
        if (dp == 1) {
            a.St(dst, static_cast<uint8_t>((a.Ld(dst) & 0xF0) | (a.Ld(src) & 0x0F)));
            ++src;
            ++dst;
            --count;
        }
        const int32_t bytes = count / 2;
        if (bytes > 0) {
            if constexpr (A::kRaw) {
                CopyWholeBytes(src, bytes, dst);
            } else {
                for (int32_t k = 0; k < bytes; ++k) a.St(dst + k, a.Ld(src + k));
            }
        }
        if (count % 2 == 1)
            a.St(dst + bytes, static_cast<uint8_t>((a.Ld(src + bytes) & 0xF0) |
                                                   (a.Ld(dst + bytes) & 0x0F)));
        return;
    }
    if (dp == 1) {
        a.St(dst, static_cast<uint8_t>((a.Ld(dst) & 0xF0) | (a.Ld(src) >> 4)));
        ++dst;
        --count;
    }
    if (dp <= sp) ++src;
    unsigned acc = unsigned{a.Ld(src)} << 8;
    const uint8_t *p = src + 1;
    const int32_t pairs = count / 2;
    if (pairs > 0) {
        if constexpr (A::kRaw) {
            ShiftBytesLeft(src, pairs, 4, dst);
        } else {
            for (int32_t k = 0; k < pairs; ++k) {
                const unsigned w = acc | a.Ld(p + k);
                acc = w << 8;
                a.St(dst + k, static_cast<uint8_t>(w >> 4));
            }
        }
        p += pairs;
        dst += pairs;
        acc = unsigned{a.Ld(p - 1)} << 8;
    }
    if (count % 2 == 1)
        a.St(dst, static_cast<uint8_t>((((acc >> 4) & 0xFF) & 0xF0) | (a.Ld(dst) & 0x0F)));
}

template <class A>
inline unsigned Word(const A &a, const uint8_t *p) {
    return unsigned{a.Ld(p)} << 8 | a.Ld(p + 1);
}

template <class A>
inline void StoreWord(const A &a, uint8_t *p, unsigned v) {
    a.St(p, static_cast<uint8_t>(v >> 8));
    a.St(p + 1, static_cast<uint8_t>(v));
}

// One body step of the 1-bit mask: eight pixels under mask byte m, at bit s
// of the source word and bit d of the destination word. The words are kept
// in 32 bits so that the destination bits above d survive the shift back.
template <class A>
inline void MaskStep1(const A &a, unsigned m, const uint8_t *src, int s, uint8_t *dst, int d) {
    const unsigned M = m << 8;
    const unsigned v = ((Word(a, src) << s) & M) | ((Word(a, dst) << d) & ~M);
    StoreWord(a, dst, v >> d);
}

template <class A>
void MaskRow1(const A &a, int32_t count, int sp, const uint8_t *src, int mp, const uint8_t *mask,
              int dp, uint8_t *dst) {
    const int s = (sp - mp) & 7;
    const int d = (dp - mp) & 7;
    if (mp != 0) {
        const unsigned m = a.Ld(mask) & (0xFFu >> mp);
        if (m != 0) {
            const unsigned M = m << 8;
            const unsigned S = sp < mp ? Word(a, src) >> (8 - s) : Word(a, src) << s;
            const unsigned D = dp < mp ? Word(a, dst) >> (8 - d) : Word(a, dst) << d;
            unsigned v = (S & M) | (D & ~M);
            v = dp < mp ? v << (8 - d) : v >> d;
            StoreWord(a, dst, v);
        }
        count -= 8 - mp;
        ++mask;
        if (mp <= sp) ++src;
        if (mp <= dp) ++dst;
    }
    for (; count >= 8; count -= 8, ++mask, ++src, ++dst) {
        const unsigned m = a.Ld(mask);
        if (m != 0) MaskStep1(a, m, src, s, dst, d);
    }
    if (count > 0) {
        const unsigned mb = a.Ld(mask);
        if (mb == 0) return;
        const unsigned M = unsigned{static_cast<uint8_t>(mb & TopBits(count))} << 8;
        const unsigned S = unsigned{a.Ld(src)} << 8 | (count > 8 - s ? a.Ld(src + 1) : 0u);
        const unsigned D = unsigned{a.Ld(dst)} << 8 | (count > 8 - d ? a.Ld(dst + 1) : 0u);
        const unsigned v = (((S << s) & M) | ((D << d) & ~M)) >> d;
        a.St(dst, static_cast<uint8_t>(v >> 8));
        if (count > 8 - d) a.St(dst + 1, static_cast<uint8_t>(v));
    }
}

// The new destination byte for one set mask bit, by the parities of the two
// columns (see the exported function for the uneven last case).
inline uint8_t Mask4Pixel(uint8_t s, uint8_t t, bool srcOdd, bool dstOdd) {
    if (!srcOdd && dstOdd) return static_cast<uint8_t>((s >> 4) | (t & 0xF0));
    if (srcOdd && !dstOdd) return static_cast<uint8_t>((s << 4) | (t & 0x0F));
    if (srcOdd && dstOdd) return static_cast<uint8_t>((s & 0x0F) | (t & 0xF0));
    return static_cast<uint8_t>(((s >> 4) | t) & 0x0F);
}

template <class A>
void MaskRow4(const A &a, int32_t count, int sp, const uint8_t *src, int mp, const uint8_t *mask,
              int dp, uint8_t *dst) {
    int64_t done = 0;
    int64_t c = sp;
    const int64_t toDst = int64_t{dp} - sp;
    auto apply = [&](int64_t col) {
        const int64_t dc = col + toDst;
        uint8_t *t = dst + (dc >> 1);
        a.St(t, Mask4Pixel(a.Ld(src + (col >> 1)), a.Ld(t), (col & 1) != 0, (dc & 1) != 0));
    };
    auto serve = [&](unsigned bits, int n) {
        for (int j = 0; j < n && done < count; ++j, ++c, ++done)
            if (bits & (0x80u >> j)) apply(c);
    };
    if (mp != 0) {
        const unsigned b = (unsigned{a.Ld(mask)} << mp) & 0xFF;
        if (b == 0) {
            c += 8 - mp;
            done += 8 - mp;
        } else {
            serve(b, 8 - mp);
        }
    }
    while (done < count) {
        const unsigned b = a.Ld(mask++);
        if (b == 0) {
            c += 8;
            done += 8;
        } else {
            serve(b, 8);
        }
    }
}

}  // namespace tessarine::bitmap
