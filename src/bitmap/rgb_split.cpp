// 3-byte pixels to planes and back. The vector paths move 64 pixels at a
// time through 64-byte permutes where the processor has them, 32
// through 256-bit byte shuffles, or 16 through 128-bit ones; the plain path
// is beside them for the rest of a row and for processors without any.
#include "bitmap/rgb_split.h"

#include <array>
#include <utility>

#include "bitmap/cpu_features.h"

namespace tessarine::bitmap {
namespace {

void SplitPlain(const uint8_t *s, int64_t n, uint8_t *r, uint8_t *g, uint8_t *b) {
    for (int64_t i = 0; i < n; ++i, s += 3) {
        r[i] = s[0];
        g[i] = s[1];
        b[i] = s[2];
    }
}

void JoinPlain(const uint8_t *r, const uint8_t *g, const uint8_t *b, int64_t n, uint8_t *d) {
    for (int64_t i = 0; i < n; ++i, d += 3) {
        d[0] = r[i];
        d[1] = g[i];
        d[2] = b[i];
    }
}

void SplitCmykPlain(const uint8_t *s, int64_t n, uint8_t *const p[4]) {
    for (int64_t i = 0; i < n; ++i, s += 4) {
        p[0][i] = s[0];
        p[1][i] = s[1];
        p[2][i] = s[2];
        p[3][i] = s[3];
    }
}

void JoinCmykPlain(const uint8_t *const p[4], int64_t n, uint8_t *d) {
    for (int64_t i = 0; i < n; ++i, d += 4) {
        d[0] = p[0][i];
        d[1] = p[1][i];
        d[2] = p[2][i];
        d[3] = p[3][i];
    }
}

#ifdef TESSARINE_SHUFFLE_PATH

using Mask = std::array<int8_t, 16>;

// Gathers channel c of 16 pixels from the k-th of three 16-byte pieces.
constexpr Mask SplitMask(int c, int k) {
    Mask m{};
    for (int i = 0; i < 16; ++i) {
        const int s = 3 * i + c;
        m[i] = static_cast<int8_t>(s / 16 == k ? s % 16 : -128);
    }
    return m;
}

// Places channel c of 16 pixels into the k-th 16-byte piece of the output.
constexpr Mask JoinMask(int c, int k) {
    Mask m{};
    for (int j = 0; j < 16; ++j) {
        const int o = 16 * k + j;
        m[j] = static_cast<int8_t>(o % 3 == c ? o / 3 : -128);
    }
    return m;
}

template <class F, size_t... I>
constexpr auto Table(F f, std::index_sequence<I...>) {
    return std::array<Mask, sizeof...(I)>{f(static_cast<int>(I) / 3, static_cast<int>(I) % 3)...};
}

alignas(16) constexpr auto kSplit = Table(SplitMask, std::make_index_sequence<9>{});
alignas(16) constexpr auto kJoin = Table(JoinMask, std::make_index_sequence<9>{});

__attribute__((target("ssse3"))) inline __m128i Load(const Mask &m) {
    return _mm_loadu_si128(reinterpret_cast<const __m128i *>(m.data()));
}

__attribute__((target("ssse3"))) void SplitShuffled(const uint8_t *s, int64_t n, uint8_t *r,
                                                    uint8_t *g, uint8_t *b) {
    __m128i m[9];
    for (int i = 0; i < 9; ++i) m[i] = Load(kSplit[i]);
    uint8_t *planes[3] = {r, g, b};
    int64_t i = 0;
    for (; i + 16 <= n; i += 16, s += 48) {
        const __m128i a = _mm_loadu_si128(reinterpret_cast<const __m128i *>(s));
        const __m128i c = _mm_loadu_si128(reinterpret_cast<const __m128i *>(s + 16));
        const __m128i e = _mm_loadu_si128(reinterpret_cast<const __m128i *>(s + 32));
        for (int ch = 0; ch < 3; ++ch) {
            const __m128i v = _mm_or_si128(
                _mm_or_si128(_mm_shuffle_epi8(a, m[3 * ch]), _mm_shuffle_epi8(c, m[3 * ch + 1])),
                _mm_shuffle_epi8(e, m[3 * ch + 2]));
            _mm_storeu_si128(reinterpret_cast<__m128i *>(planes[ch] + i), v);
        }
    }
    SplitPlain(s, n - i, r + i, g + i, b + i);
}

__attribute__((target("ssse3"))) void JoinShuffled(const uint8_t *r, const uint8_t *g,
                                                   const uint8_t *b, int64_t n, uint8_t *d) {
    __m128i m[9];
    for (int i = 0; i < 9; ++i) m[i] = Load(kJoin[i]);
    int64_t i = 0;
    for (; i + 16 <= n; i += 16, d += 48) {
        const __m128i vr = _mm_loadu_si128(reinterpret_cast<const __m128i *>(r + i));
        const __m128i vg = _mm_loadu_si128(reinterpret_cast<const __m128i *>(g + i));
        const __m128i vb = _mm_loadu_si128(reinterpret_cast<const __m128i *>(b + i));
        for (int k = 0; k < 3; ++k) {
            const __m128i v = _mm_or_si128(
                _mm_or_si128(_mm_shuffle_epi8(vr, m[k]), _mm_shuffle_epi8(vg, m[3 + k])),
                _mm_shuffle_epi8(vb, m[6 + k]));
            _mm_storeu_si128(reinterpret_cast<__m128i *>(d + 16 * k), v);
        }
    }
    JoinPlain(r + i, g + i, b + i, n - i, d);
}

// 16 pixels of 4 bytes: each 4-pixel piece is grouped by channel with a
// shuffle, then the 4 by 4 words are transposed.
__attribute__((target("ssse3"))) void SplitCmykShuffled(const uint8_t *s, int64_t n,
                                                        uint8_t *const p[4]) {
    const __m128i group = _mm_setr_epi8(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15);
    int64_t i = 0;
    for (; i + 16 <= n; i += 16, s += 64) {
        __m128i v[4];
        for (int k = 0; k < 4; ++k)
            v[k] = _mm_shuffle_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i *>(s + 16 * k)), group);
        const __m128i t0 = _mm_unpacklo_epi32(v[0], v[1]);  // c0 c1 m0 m1
        const __m128i t1 = _mm_unpackhi_epi32(v[0], v[1]);  // y0 y1 k0 k1
        const __m128i t2 = _mm_unpacklo_epi32(v[2], v[3]);
        const __m128i t3 = _mm_unpackhi_epi32(v[2], v[3]);
        _mm_storeu_si128(reinterpret_cast<__m128i *>(p[0] + i), _mm_unpacklo_epi64(t0, t2));
        _mm_storeu_si128(reinterpret_cast<__m128i *>(p[1] + i), _mm_unpackhi_epi64(t0, t2));
        _mm_storeu_si128(reinterpret_cast<__m128i *>(p[2] + i), _mm_unpacklo_epi64(t1, t3));
        _mm_storeu_si128(reinterpret_cast<__m128i *>(p[3] + i), _mm_unpackhi_epi64(t1, t3));
    }
    const uint8_t *rest[4] = {p[0] + i, p[1] + i, p[2] + i, p[3] + i};
    SplitCmykPlain(s, n - i, const_cast<uint8_t *const *>(rest));
}

__attribute__((target("ssse3"))) void JoinCmykShuffled(const uint8_t *const p[4], int64_t n,
                                                       uint8_t *d) {
    const __m128i spread = _mm_setr_epi8(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15);
    int64_t i = 0;
    for (; i + 16 <= n; i += 16, d += 64) {
        const __m128i c = _mm_loadu_si128(reinterpret_cast<const __m128i *>(p[0] + i));
        const __m128i m = _mm_loadu_si128(reinterpret_cast<const __m128i *>(p[1] + i));
        const __m128i y = _mm_loadu_si128(reinterpret_cast<const __m128i *>(p[2] + i));
        const __m128i k = _mm_loadu_si128(reinterpret_cast<const __m128i *>(p[3] + i));
        const __m128i cm0 = _mm_unpacklo_epi32(c, m), cm1 = _mm_unpackhi_epi32(c, m);
        const __m128i yk0 = _mm_unpacklo_epi32(y, k), yk1 = _mm_unpackhi_epi32(y, k);
        const __m128i v[4] = {_mm_unpacklo_epi64(cm0, yk0), _mm_unpackhi_epi64(cm0, yk0),
                              _mm_unpacklo_epi64(cm1, yk1), _mm_unpackhi_epi64(cm1, yk1)};
        for (int q = 0; q < 4; ++q)
            _mm_storeu_si128(reinterpret_cast<__m128i *>(d + 16 * q), _mm_shuffle_epi8(v[q], spread));
    }
    const uint8_t *rest[4] = {p[0] + i, p[1] + i, p[2] + i, p[3] + i};
    JoinCmykPlain(rest, n - i, d);
}

// 32 pixels at a time: the same shuffles on two 16-pixel groups at once, one
// in each half of a 256-bit register.
#define TESSARINE_WIDE_TARGET __attribute__((target("avx2")))

TESSARINE_WIDE_TARGET inline __m256i Pair(const uint8_t *lo, const uint8_t *hi) {
    return _mm256_inserti128_si256(
        _mm256_castsi128_si256(_mm_loadu_si128(reinterpret_cast<const __m128i *>(lo))),
        _mm_loadu_si128(reinterpret_cast<const __m128i *>(hi)), 1);
}

TESSARINE_WIDE_TARGET inline __m256i Both(const Mask &m) {
    return _mm256_broadcastsi128_si256(
        _mm_loadu_si128(reinterpret_cast<const __m128i *>(m.data())));
}

TESSARINE_WIDE_TARGET void SplitWide(const uint8_t *s, int64_t n, uint8_t *r, uint8_t *g,
                                     uint8_t *b) {
    __m256i m[9];
    for (int i = 0; i < 9; ++i) m[i] = Both(kSplit[i]);
    uint8_t *planes[3] = {r, g, b};
    int64_t i = 0;
    for (; i + 32 <= n; i += 32, s += 96) {
        const __m256i a = Pair(s, s + 48);
        const __m256i c = Pair(s + 16, s + 64);
        const __m256i e = Pair(s + 32, s + 80);
        for (int ch = 0; ch < 3; ++ch) {
            const __m256i v =
                _mm256_or_si256(_mm256_or_si256(_mm256_shuffle_epi8(a, m[3 * ch]),
                                                _mm256_shuffle_epi8(c, m[3 * ch + 1])),
                                _mm256_shuffle_epi8(e, m[3 * ch + 2]));
            _mm256_storeu_si256(reinterpret_cast<__m256i *>(planes[ch] + i), v);
        }
    }
    SplitShuffled(s, n - i, r + i, g + i, b + i);
}

TESSARINE_WIDE_TARGET void JoinWide(const uint8_t *r, const uint8_t *g, const uint8_t *b, int64_t n,
                                    uint8_t *d) {
    __m256i m[9];
    for (int i = 0; i < 9; ++i) m[i] = Both(kJoin[i]);
    int64_t i = 0;
    for (; i + 32 <= n; i += 32, d += 96) {
        const __m256i vr = _mm256_loadu_si256(reinterpret_cast<const __m256i *>(r + i));
        const __m256i vg = _mm256_loadu_si256(reinterpret_cast<const __m256i *>(g + i));
        const __m256i vb = _mm256_loadu_si256(reinterpret_cast<const __m256i *>(b + i));
        __m256i v[3];
        for (int k = 0; k < 3; ++k)
            v[k] = _mm256_or_si256(
                _mm256_or_si256(_mm256_shuffle_epi8(vr, m[k]), _mm256_shuffle_epi8(vg, m[3 + k])),
                _mm256_shuffle_epi8(vb, m[6 + k]));
        // Low halves hold the first 16 pixels' 48 bytes, high halves the next.
        auto *out = reinterpret_cast<__m256i *>(d);
        _mm256_storeu_si256(out, _mm256_permute2x128_si256(v[0], v[1], 0x20));
        _mm256_storeu_si256(out + 1, _mm256_permute2x128_si256(v[2], v[0], 0x30));
        _mm256_storeu_si256(out + 2, _mm256_permute2x128_si256(v[1], v[2], 0x31));
    }
    JoinShuffled(r + i, g + i, b + i, n - i, d);
}

// 64 pixels of 3 bytes at a time with byte permutes over whole 64-byte
// registers, against nine shuffles per 16 pixels above.
using Index64 = std::array<uint8_t, 64>;

// The split works on 64 pixels, three 64-byte source pieces. One
// single-table permute per piece sorts its bytes by plane, each plane's run
// at its own place: red from slot 0, blue from slot 22, green from slot 43
// in the first piece, and so on round the register, so that for every
// plane the three pieces' runs fill the 64 slots without overlapping. Two
// masked blends then give each plane whole, turned by its start slot; the
// permute that aligns a plane's stores also undoes the turn.
inline constexpr int kPlaneTurn[3] = {0, 43, 22};

// Plane c's pixel in slot t of the sorted pieces, and the source byte
// that holds it.
constexpr int PlanePixel(int c, int t) { return (t - kPlaneTurn[c]) & 63; }
constexpr int SourceByte(int c, int t) { return 3 * PlanePixel(c, t) + c; }

// Piece k's sort: slot t takes the byte of whichever plane has its pixel
// for slot t in piece k.
constexpr Index64 SortPiece(int k) {
    Index64 m{};
    for (int t = 0; t < 64; ++t)
        for (int c = 0; c < 3; ++c)
            if (SourceByte(c, t) / 64 == k) m[t] = static_cast<uint8_t>(SourceByte(c, t) & 63);
    return m;
}

// The slots where plane c takes piece k.
constexpr uint64_t PieceSlots(int c, int k) {
    uint64_t m = 0;
    for (int t = 0; t < 64; ++t)
        if (SourceByte(c, t) / 64 == k) m |= uint64_t{1} << t;
    return m;
}

// Output byte j of 64-byte piece k: from the red or green plane first
// (bit 6 picks green), then blue from the second step.
constexpr Index64 JoinFirst(int k) {
    Index64 m{};
    for (int j = 0; j < 64; ++j) {
        const int o = 64 * k + j;
        m[j] = static_cast<uint8_t>(o % 3 == 2 ? 0 : (o % 3) * 64 + o / 3);
    }
    return m;
}

constexpr Index64 JoinSecond(int k) {
    Index64 m{};
    for (int j = 0; j < 64; ++j) {
        const int o = 64 * k + j;
        m[j] = static_cast<uint8_t>(o % 3 == 2 ? 64 + o / 3 : j);
    }
    return m;
}

// With these turns every slot takes the same byte offset from each piece, so
// one index sorts all three.
alignas(64) constexpr Index64 kSortPiece = SortPiece(0);
static_assert(SortPiece(1) == kSortPiece && SortPiece(2) == kSortPiece);
alignas(64) constexpr Index64 kJoinFirst[3] = {JoinFirst(0), JoinFirst(1), JoinFirst(2)};
alignas(64) constexpr Index64 kJoinSecond[3] = {JoinSecond(0), JoinSecond(1), JoinSecond(2)};

#define TESSARINE_PERMUTE_TARGET __attribute__((target("avx512f,avx512bw,avx512vbmi")))

TESSARINE_PERMUTE_TARGET inline __m512i Load64(const void *p) { return _mm512_loadu_si512(p); }

// Takes 64 bytes of plane c from two turned blocks: from pixel `head` of the
// first on, so that the stores start on a 64-byte boundary.
inline Index64 AlignIndex(int c, int64_t head) {
    Index64 index{};
    for (int j = 0; j < 64; ++j) {
        const int64_t p = head + j;
        index[j] = static_cast<uint8_t>((p < 64 ? 0 : 64) + ((p + kPlaneTurn[c]) & 63));
    }
    return index;
}

// GCC 12's single-table permute leaves a dummy operand unset, and warns of
// it wherever the permute is inlined.
#if defined(__GNUC__) && !defined(__clang__)
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wmaybe-uninitialized"
#endif

// One plane of a block, turned, from the three sorted pieces.
TESSARINE_PERMUTE_TARGET inline __m512i Assemble(__m512i x, __m512i y, __m512i z,
                                                 __mmask64 fromSecond, __mmask64 fromThird) {
    return _mm512_mask_blend_epi8(fromThird, _mm512_mask_blend_epi8(fromSecond, x, y), z);
}

// Each plane's stores start on a 64-byte boundary: a store that straddles
// two cache lines costs about three aligned ones. The first pixels of a
// plane, up to its boundary, go the short way. The loop names every register
// on its own, so that nothing of it lives on the stack.
TESSARINE_PERMUTE_TARGET void SplitPermuted(const uint8_t *s, int64_t n, uint8_t *r, uint8_t *g,
                                            uint8_t *b) {
    if (n < 256) return SplitShuffled(s, n, r, g, b);
    const auto headOf = [](const uint8_t *p) {
        return (64 - static_cast<int64_t>(reinterpret_cast<uintptr_t>(p) & 63)) & 63;
    };
    const int64_t hr = headOf(r), hg = headOf(g), hb = headOf(b);
    alignas(64) const Index64 align[3] = {AlignIndex(0, hr), AlignIndex(1, hg), AlignIndex(2, hb)};
    const __m512i ar = Load64(align[0].data()), ag = Load64(align[1].data()),
                  ab = Load64(align[2].data());
    const __m512i sort = Load64(kSortPiece.data());
    const __mmask64 r1 = PieceSlots(0, 1), r2 = PieceSlots(0, 2), g1 = PieceSlots(1, 1),
                    g2 = PieceSlots(1, 2), b1 = PieceSlots(2, 1), b2 = PieceSlots(2, 2);
    __m512i x = _mm512_permutexvar_epi8(sort, Load64(s));
    __m512i y = _mm512_permutexvar_epi8(sort, Load64(s + 64));
    __m512i z = _mm512_permutexvar_epi8(sort, Load64(s + 128));
    __m512i pr = Assemble(x, y, z, r1, r2);
    __m512i pg = Assemble(x, y, z, g1, g2);
    __m512i pb = Assemble(x, y, z, b1, b2);
    int64_t i = 64;  // the source block after the one in pr, pg, pb
    for (; i + 64 <= n; i += 64) {
        const uint8_t *q = s + 3 * i;
        x = _mm512_permutexvar_epi8(sort, Load64(q));
        y = _mm512_permutexvar_epi8(sort, Load64(q + 64));
        z = _mm512_permutexvar_epi8(sort, Load64(q + 128));
        const __m512i cr = Assemble(x, y, z, r1, r2);
        const __m512i cg = Assemble(x, y, z, g1, g2);
        const __m512i cb = Assemble(x, y, z, b1, b2);
        _mm512_store_si512(r + hr + i - 64, _mm512_permutex2var_epi8(pr, ar, cr));
        _mm512_store_si512(g + hg + i - 64, _mm512_permutex2var_epi8(pg, ag, cg));
        _mm512_store_si512(b + hb + i - 64, _mm512_permutex2var_epi8(pb, ab, cb));
        pr = cr;
        pg = cg;
        pb = cb;
    }
    uint8_t *planes[3] = {r, g, b};
    const int64_t heads[3] = {hr, hg, hb};
    for (int c = 0; c < 3; ++c) {
        uint8_t *p = planes[c];
        for (int64_t k = 0; k < heads[c]; ++k) p[k] = s[3 * k + c];
        for (int64_t k = heads[c] + i - 64; k < n; ++k) p[k] = s[3 * k + c];
    }
}

#if defined(__GNUC__) && !defined(__clang__)
#pragma GCC diagnostic pop
#endif

// The stores start on a 64-byte boundary: the first h pixels go the short
// way, with 3 * h + (d mod 64) a multiple of 64 (43 is the inverse of 3
// modulo 64).
TESSARINE_PERMUTE_TARGET void JoinPermuted(const uint8_t *r, const uint8_t *g, const uint8_t *b,
                                           int64_t n, uint8_t *d) {
    if (n < 256) return JoinShuffled(r, g, b, n, d);
    const int64_t phase = static_cast<int64_t>(reinterpret_cast<uintptr_t>(d) & 63);
    const int64_t h = (((64 - phase) & 63) * 43) & 63;
    JoinPlain(r, g, b, h, d);
    __m512i first[3], second[3];
    for (int k = 0; k < 3; ++k) {
        first[k] = Load64(kJoinFirst[k].data());
        second[k] = Load64(kJoinSecond[k].data());
    }
    int64_t i = h;
    d += 3 * h;
    for (; i + 64 <= n; i += 64, d += 192) {
        const __m512i vr = Load64(r + i);
        const __m512i vg = Load64(g + i);
        const __m512i vb = Load64(b + i);
        for (int k = 0; k < 3; ++k) {
            const __m512i t = _mm512_permutex2var_epi8(vr, first[k], vg);
            _mm512_store_si512(d + 64 * k, _mm512_permutex2var_epi8(t, second[k], vb));
        }
    }
    JoinShuffled(r + i, g + i, b + i, n - i, d);
}

#endif

}  // namespace

// The fastest path first: each vector path finishes a run's tail on the
// next slower one.
void SplitRgb(const uint8_t *pixels, int64_t count, uint8_t *r, uint8_t *g, uint8_t *b) {
#ifdef TESSARINE_SHUFFLE_PATH
    switch (ActiveVectorPath()) {
        case VectorPath::kPermute: return SplitPermuted(pixels, count, r, g, b);
        case VectorPath::kWide: return SplitWide(pixels, count, r, g, b);
        case VectorPath::kShuffle: return SplitShuffled(pixels, count, r, g, b);
        case VectorPath::kPlain: break;
    }
#endif
    SplitPlain(pixels, count, r, g, b);
}

void JoinRgb(const uint8_t *r, const uint8_t *g, const uint8_t *b, int64_t count, uint8_t *pixels) {
#ifdef TESSARINE_SHUFFLE_PATH
    switch (ActiveVectorPath()) {
        case VectorPath::kPermute: return JoinPermuted(r, g, b, count, pixels);
        case VectorPath::kWide: return JoinWide(r, g, b, count, pixels);
        case VectorPath::kShuffle: return JoinShuffled(r, g, b, count, pixels);
        case VectorPath::kPlain: break;
    }
#endif
    JoinPlain(r, g, b, count, pixels);
}

void SplitCmyk(const uint8_t *pixels, int64_t count, uint8_t *const planes[4]) {
#ifdef TESSARINE_SHUFFLE_PATH
    if (ActiveVectorPath() >= VectorPath::kShuffle) return SplitCmykShuffled(pixels, count, planes);
#endif
    SplitCmykPlain(pixels, count, planes);
}

void JoinCmyk(const uint8_t *const planes[4], int64_t count, uint8_t *pixels) {
#ifdef TESSARINE_SHUFFLE_PATH
    if (ActiveVectorPath() >= VectorPath::kShuffle) return JoinCmykShuffled(planes, count, pixels);
#endif
    JoinCmykPlain(planes, count, pixels);
}

}  // namespace tessarine::bitmap
