// CX_SWOPCmyk2SRgb four lanes at a time. Every lane performs the scalar
// formula's own operations on the same operands in the same order, so the
// bytes are those of SwopCmykToSRgbScalar. What changes is only how the work is
// laid out:
//
// - the ink factors 1 - x and x of every byte value are tabulated, already
//   spread into the lane patterns of the weights;
// - the three rows L, a, b are summed side by side, lanes (L, a, L, b), with
//   the weight of each primary broadcast to all lanes; a second vector sums the
//   half-black primaries when k is not 0;
// - a weight that holds a factor 1 - x or x equal to 0 (x = 0 or 255; 255 times
//   the byte scale is exactly 1) is exactly +0, and so is its term. Adding +0
//   changes no partial sum, so those four terms are left out; the other four
//   are the products of two tabulated factors, a factor 1 being exact;
// - with k = 0 the factor 1 - k is 1 and the half-black term is +0 or -0:
//   both leave the values unchanged and are skipped;
// - the straight branches of the Lab inverse are rare: they are computed only
//   when a lane needs them.
//
// A sum may start with its first term instead of 0 + that term. The two differ
// only when the term is -0, and then only in the sign of a zero L, a or b,
// which no later step can see: f, fx and fz come out the same, and Y = -0
// gives the same R, G and B as Y = +0 since X and Z are never -0.
#include <immintrin.h>

#include "color/device_tables.h"
#include "color/gamma_tables.h"
#include "color/swop_cmyk_paths.h"

#define TESSARINE_AVX2 __attribute__((target("avx2")))

namespace tessarine::color {
namespace {

constexpr double kByteScale = 0.00392156862745098;

struct alignas(32) Lanes {
    double v[4];
};

// Per byte value x, with s = x * kByteScale: the factors of bit 0 of the
// primary's index over four lanes, (1 - s, s, 1 - s, s), and of bit 1,
// (1 - s, 1 - s, s, s).
struct InkFactors {
    Lanes bit0;
    Lanes bit1;
};

struct InkTable {
    InkFactors byValue[256];
};

constexpr InkTable MakeInkTable() {
    InkTable table{};
    for (int x = 0; x < 256; ++x) {
        const double s = x * kByteScale;
        table.byValue[x] = {{{1 - s, s, 1 - s, s}}, {{1 - s, 1 - s, s, s}}};
    }
    return table;
}

constexpr InkTable kInk = MakeInkTable();

// Per byte value of k: 1 - k, 1 - 2k and 4k, each as the scalar formula forms it.
struct BlackFactors {
    double oneMinusK, oneMinusTwoK, fourK, unused;
};

struct BlackTable {
    BlackFactors byValue[256];
};

constexpr BlackTable MakeBlackTable() {
    BlackTable table{};
    for (int x = 0; x < 256; ++x) {
        const double k = x * kByteScale;
        table.byValue[x] = {1 - k, 1 - 2 * k, 4 * k, 0};
    }
    return table;
}

constexpr BlackTable kBlack = MakeBlackTable();

// The primaries of index i in the lanes (L, a, L, b), without black and at
// half black.
struct PrimaryLanes {
    Lanes noBlack[8];
    Lanes halfBlack[8];
};

constexpr PrimaryLanes MakePrimaryLanes() {
    PrimaryLanes lanes{};
    for (int i = 0; i < 8; ++i) {
        for (int half = 0; half < 2; ++half) {
            const int p = half * 8 + i;
            const Lanes row = {{static_cast<double>(CX_SwopPrimaries[0][p]),
                                static_cast<double>(CX_SwopPrimaries[1][p]),
                                static_cast<double>(CX_SwopPrimaries[0][p]),
                                static_cast<double>(CX_SwopPrimaries[2][p])}};
            (half == 0 ? lanes.noBlack : lanes.halfBlack)[i] = row;
        }
    }
    return lanes;
}

constexpr PrimaryLanes kPrimaries = MakePrimaryLanes();

// When one of c, m, y is 0 or 255, the four primaries whose weights are not
// zero, in rising index order. Cases: y 0, y 255, m 0, m 255, c 0, c 255.
constexpr int kLiveIndex[6][4] = {{0, 1, 2, 3}, {4, 5, 6, 7}, {0, 1, 4, 5},
                                  {2, 3, 6, 7}, {0, 2, 4, 6}, {1, 3, 5, 7}};

struct LivePrimaryLanes {
    Lanes noBlack[6][4];
    Lanes halfBlack[6][4];
};

constexpr LivePrimaryLanes MakeLivePrimaryLanes() {
    LivePrimaryLanes live{};
    for (int edge = 0; edge < 6; ++edge)
        for (int j = 0; j < 4; ++j) {
            live.noBlack[edge][j] = kPrimaries.noBlack[kLiveIndex[edge][j]];
            live.halfBlack[edge][j] = kPrimaries.halfBlack[kLiveIndex[edge][j]];
        }
    return live;
}

constexpr LivePrimaryLanes kLive = MakeLivePrimaryLanes();

// 0 for an ink byte strictly between 0 and 255, 1 for 0, 2 for 255.
struct EdgeTable {
    uint8_t byValue[256];
};

constexpr EdgeTable MakeEdgeTable() {
    EdgeTable table{};
    table.byValue[0] = 1;
    table.byValue[255] = 2;
    return table;
}

constexpr EdgeTable kEdge = MakeEdgeTable();

// Constants of the Lab to sRGB steps in the lanes (L, a, L, b) and, after the
// Lab inverse, (Y, X, Y, Z); the matrix gives (R, G, B, 0).
alignas(32) constexpr double kFSlope[4] = {0.008621, 0.008621, 0.008621, 0.008621};
alignas(32) constexpr double kFOffset[4] = {0.137931, 0.137931, 0.137931, 0.137931};
alignas(32) constexpr double kAbSlope[4] = {0, 0.002, 0, -0.005};
alignas(32) constexpr double kWhite[4] = {100, 95.04, 100, 108.89};
alignas(32) constexpr double kStraightSlope[4] = {0.1284191601386927, 0.1284191601386927,
                                                  0.1284191601386927, 0.1284191601386927};
alignas(32) constexpr double kNegativeToZero[4] = {-__builtin_inf(), 0, -__builtin_inf(), 0};
alignas(32) constexpr double kHundred[4] = {100, 100, 100, 100};
alignas(32) constexpr double kYStraightSlope[4] = {0.0011070519207350825, 0.0011070519207350825,
                                                   0.0011070519207350825, 0.0011070519207350825};
// Straight below or at: L 8 for Y, 0.2069 for fx and fz.
alignas(32) constexpr double kBreak[4] = {8, 0.2069, 8, 0.2069};
// R = (X 0.03241 - Y 0.015374) - Z 0.004986, G = (Y 0.01876 + Z 0.000416) - X 0.009692,
// B = (X 0.000556 - Y 0.00204) + Z 0.01057: a subtraction is the addition of
// the negated product, exactly.
alignas(32) constexpr double kFirst[4] = {0.03241, 0.01876, 0.000556, 0};
alignas(32) constexpr double kSecond[4] = {-0.015374, 0.000416, -0.00204, 0};
alignas(32) constexpr double kThird[4] = {-0.004986, -0.009692, 0.01057, 0};
alignas(32) constexpr double kIndexScale[4] = {255.9, 255.9, 255.9, 255.9};

TESSARINE_AVX2 inline __m256d Load(const double *v) {
    return _mm256_load_pd(v);
}

template <int Lane>
TESSARINE_AVX2 inline __m256d Spread(__m256d v) {
    return _mm256_permute4x64_pd(v, Lane * 0x55);
}

// sum over the four live primaries of weight * primary, in index order.
TESSARINE_AVX2 inline __m256d SumOfFour(__m256d w, const Lanes *primary) {
    __m256d sum = _mm256_mul_pd(Spread<0>(w), Load(primary[0].v));
    sum = _mm256_add_pd(sum, _mm256_mul_pd(Spread<1>(w), Load(primary[1].v)));
    sum = _mm256_add_pd(sum, _mm256_mul_pd(Spread<2>(w), Load(primary[2].v)));
    return _mm256_add_pd(sum, _mm256_mul_pd(Spread<3>(w), Load(primary[3].v)));
}

// (1 - 2k) * noBlack + 4k * halfBlack
TESSARINE_AVX2 inline __m256d JoinBlack(const BlackFactors &k, __m256d noBlack,
                                        __m256d halfBlack) {
    return _mm256_add_pd(_mm256_mul_pd(_mm256_broadcast_sd(&k.oneMinusTwoK), noBlack),
                         _mm256_mul_pd(_mm256_broadcast_sd(&k.fourK), halfBlack));
}

// L, a, L, b when one of c, m, y is 0 or 255; `edge` indexes kLiveIndex and
// `w` holds the four live weights before the factor 1 - k.
TESSARINE_AVX2 inline __m256d LabFromFourWeights(int edge, __m256d w, uint8_t kByte) {
    if (kByte == 0) return SumOfFour(w, kLive.noBlack[edge]);
    const BlackFactors &k = kBlack.byValue[kByte];
    w = _mm256_mul_pd(w, _mm256_broadcast_sd(&k.oneMinusK));
    return JoinBlack(k, SumOfFour(w, kLive.noBlack[edge]), SumOfFour(w, kLive.halfBlack[edge]));
}

// L, a, L, b over all eight primaries; `low` holds the weights 0 to 3 and
// `high` 4 to 7, before the factor 1 - k.
TESSARINE_AVX2 inline __m256d LabFromEightWeights(__m256d low, __m256d high, uint8_t kByte) {
    const Lanes *noBlack = kPrimaries.noBlack;
    if (kByte == 0) {
        __m256d sum = _mm256_mul_pd(Spread<0>(low), Load(noBlack[0].v));
        sum = _mm256_add_pd(sum, _mm256_mul_pd(Spread<1>(low), Load(noBlack[1].v)));
        sum = _mm256_add_pd(sum, _mm256_mul_pd(Spread<2>(low), Load(noBlack[2].v)));
        sum = _mm256_add_pd(sum, _mm256_mul_pd(Spread<3>(low), Load(noBlack[3].v)));
        sum = _mm256_add_pd(sum, _mm256_mul_pd(Spread<0>(high), Load(noBlack[4].v)));
        sum = _mm256_add_pd(sum, _mm256_mul_pd(Spread<1>(high), Load(noBlack[5].v)));
        sum = _mm256_add_pd(sum, _mm256_mul_pd(Spread<2>(high), Load(noBlack[6].v)));
        return _mm256_add_pd(sum, _mm256_mul_pd(Spread<3>(high), Load(noBlack[7].v)));
    }
    const BlackFactors &k = kBlack.byValue[kByte];
    const __m256d oneMinusK = _mm256_broadcast_sd(&k.oneMinusK);
    low = _mm256_mul_pd(low, oneMinusK);
    high = _mm256_mul_pd(high, oneMinusK);
    const Lanes *halfBlack = kPrimaries.halfBlack;
    __m256d w = Spread<0>(low);
    __m256d no = _mm256_mul_pd(w, Load(noBlack[0].v));
    __m256d half = _mm256_mul_pd(w, Load(halfBlack[0].v));
#define TESSARINE_TERM(from, lane, i)                                      \
    w = Spread<lane>(from);                                                \
    no = _mm256_add_pd(no, _mm256_mul_pd(w, Load(noBlack[i].v)));          \
    half = _mm256_add_pd(half, _mm256_mul_pd(w, Load(halfBlack[i].v)));
    TESSARINE_TERM(low, 1, 1)
    TESSARINE_TERM(low, 2, 2)
    TESSARINE_TERM(low, 3, 3)
    TESSARINE_TERM(high, 0, 4)
    TESSARINE_TERM(high, 1, 5)
    TESSARINE_TERM(high, 2, 6)
    TESSARINE_TERM(high, 3, 7)
#undef TESSARINE_TERM
    return JoinBlack(k, no, half);
}

TESSARINE_AVX2 inline __m256d ProductOf(const Lanes &a, const Lanes &b) {
    return _mm256_mul_pd(Load(a.v), Load(b.v));
}

}  // namespace

TESSARINE_AVX2 void SwopCmykToSRgbAvx2(const uint8_t *cmyk, uint8_t *rgb, const GammaTable &gamma) {
    const uint8_t c = cmyk[0], m = cmyk[1], y = cmyk[2], kByte = cmyk[3];
    const InkFactors &cf = kInk.byValue[c];
    const InkFactors &mf = kInk.byValue[m];
    const InkFactors &yf = kInk.byValue[y];

    // Weights are c factor * m factor * y factor (* (1 - k)); lanes run over
    // the index bits that are left.
    __m256d lab;  // (L, a, L, b)
    if (const int e = kEdge.byValue[y]) {
        lab = LabFromFourWeights(e - 1, ProductOf(cf.bit0, mf.bit1), kByte);
    } else if (const int e = kEdge.byValue[m]) {
        lab = LabFromFourWeights(e + 1, ProductOf(cf.bit0, yf.bit1), kByte);
    } else if (const int e = kEdge.byValue[c]) {
        lab = LabFromFourWeights(e + 3, ProductOf(mf.bit0, yf.bit1), kByte);
    } else {
        const __m256d cm = ProductOf(cf.bit0, mf.bit1);
        lab = LabFromEightWeights(_mm256_mul_pd(cm, _mm256_broadcast_sd(&yf.bit0.v[0])),
                                  _mm256_mul_pd(cm, _mm256_broadcast_sd(&yf.bit0.v[1])), kByte);
    }

    // f = L 0.008621 + 0.137931 in every lane; V = (f, fx, f, fz). A lane's
    // f + L * 0 is f: f is not 0 wherever that lane is used (L above 8).
    const __m256d f = _mm256_add_pd(_mm256_mul_pd(_mm256_permute_pd(lab, 0x0), Load(kFSlope)),
                                    Load(kFOffset));
    const __m256d V = _mm256_add_pd(f, _mm256_mul_pd(lab, Load(kAbSlope)));
    // Y = 100 f^3, X = 95.04 fx^3, Z = 108.89 fz^3 ...
    __m256d xyz = _mm256_mul_pd(_mm256_mul_pd(_mm256_mul_pd(V, V), V), Load(kWhite));
    // ... unless L is 8 or less, or fx or fz 0.2069 or less.
    const __m256d straight = _mm256_cmp_pd(_mm256_blend_pd(V, lab, 0x5), Load(kBreak), _CMP_LE_OQ);
    if (__builtin_expect(_mm256_movemask_pd(straight) != 0, 0)) {
        __m256d line = _mm256_mul_pd(
            _mm256_mul_pd(_mm256_sub_pd(V, Load(kFOffset)), Load(kStraightSlope)), Load(kWhite));
        line = _mm256_max_pd(line, Load(kNegativeToZero));  // a negative X or Z is 0
        const __m256d yLine = _mm256_mul_pd(_mm256_mul_pd(lab, Load(kHundred)), Load(kYStraightSlope));
        xyz = _mm256_blendv_pd(xyz, _mm256_blend_pd(line, yLine, 0x5), straight);
    }
    // The cubes are positive, so X and Z need no floor on that branch.

    // (R, G, B, 0) from (Y, X, Y, Z).
    const __m256d first = _mm256_permute4x64_pd(xyz, 0x11);   // X, Y, X, Y
    const __m256d second = _mm256_permute4x64_pd(xyz, 0x0C);  // Y, Z, Y, Y
    const __m256d third = _mm256_permute4x64_pd(xyz, 0xF7);   // Z, X, Z, Z
    __m256d v = _mm256_add_pd(
        _mm256_add_pd(_mm256_mul_pd(first, Load(kFirst)), _mm256_mul_pd(second, Load(kSecond))),
        _mm256_mul_pd(third, Load(kThird)));
    // A set sign bit: some value is below 0, or is -0. For -0 alone the
    // smallest value is a zero, t is a zero and the step changes nothing but
    // the sign of a zero, which the index does not see.
    if (_mm256_movemask_pd(v) != 0) {
        // Lane 3 is 0, so the smallest lane is the smallest of R, G, B.
        __m256d low = _mm256_min_pd(v, _mm256_permute4x64_pd(v, 0x4E));
        low = _mm256_min_pd(low, _mm256_permute_pd(low, 0x5));
        const double m0 = _mm256_cvtsd_f64(low);
        const double t = -m0 / (1 - m0);
        v = _mm256_add_pd(_mm256_mul_pd(v, _mm256_set1_pd(1 - t)), _mm256_set1_pd(t));
    }
    // Truncating v 255.9 and clamping the index to 0..255 gives the index of
    // the clamped value: the products agree inside [0, 1], a value at or below
    // 0 truncates to 0 or less, and one above 1 to 255 or more. The two packs
    // saturate to 16 bits, signed, and then to 0..255.
    const __m128i index32 = _mm256_cvttpd_epi32(_mm256_mul_pd(v, Load(kIndexScale)));
    const __m128i index8 = _mm_packus_epi16(_mm_packs_epi32(index32, index32), index32);
    const uint32_t at = static_cast<uint32_t>(_mm_cvtsi128_si32(index8));
    rgb[0] = gamma.entry[at & 0xFF];
    rgb[1] = gamma.entry[(at >> 8) & 0xFF];
    rgb[2] = gamma.entry[(at >> 16) & 0xFF];
}

}  // namespace tessarine::color
