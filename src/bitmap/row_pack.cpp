// Whole bytes of 1-bit pixels from one byte per pixel, sixteen at a time
// where the processor has byte shuffles.
#include "bitmap/row_pack.h"

#include "bitmap/cpu_features.h"

namespace tessarine::bitmap {
namespace {

template <class Rule>
void PackPlain(const uint8_t *v, int64_t bytes, uint8_t *dst) {
    for (int64_t i = 0; i < bytes; ++i, v += 8) dst[i] = Rule::Pack8(v);
}

#ifdef TESSARINE_SHUFFLE_PATH

// Each 8-byte half reversed, so that the sign mask holds the first pixel of
// each half in its high bit.
__attribute__((target("ssse3"))) void PackShuffled(const uint8_t *v, int64_t bytes, uint8_t *dst,
                                                   bool highBit) {
    const __m128i reverse = _mm_setr_epi8(7, 6, 5, 4, 3, 2, 1, 0, 15, 14, 13, 12, 11, 10, 9, 8);
    const __m128i zero = _mm_setzero_si128();
    int64_t i = 0;
    for (; i + 2 <= bytes; i += 2, v += 16) {
        const __m128i x = _mm_shuffle_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i *>(v)), reverse);
        const int bits = highBit ? _mm_movemask_epi8(x) : ~_mm_movemask_epi8(_mm_cmpeq_epi8(x, zero));
        dst[i] = static_cast<uint8_t>(bits);
        dst[i + 1] = static_cast<uint8_t>(bits >> 8);
    }
    if (i < bytes) dst[i] = highBit ? HighBit::Pack8(v) : NonZeroBit::Pack8(v);
}

// Two bytes of 1-bit pixels to sixteen 0/1 bytes: each byte spread over
// eight lanes, its bits picked out high bit first.
__attribute__((target("ssse3"))) void UnpackShuffled(const uint8_t *src, int64_t bytes, uint8_t *out) {
    const __m128i spread = _mm_setr_epi8(0, 0, 0, 0, 0, 0, 0, 0, 1, 1, 1, 1, 1, 1, 1, 1);
    const __m128i bits = _mm_setr_epi8(-128, 64, 32, 16, 8, 4, 2, 1, -128, 64, 32, 16, 8, 4, 2, 1);
    const __m128i one = _mm_set1_epi8(1);
    int64_t i = 0;
    for (; i + 2 <= bytes; i += 2, out += 16) {
        uint16_t pair;
        std::memcpy(&pair, src + i, 2);
        const __m128i x = _mm_shuffle_epi8(_mm_cvtsi32_si128(pair), spread);
        const __m128i set = _mm_cmpeq_epi8(_mm_and_si128(x, bits), bits);
        _mm_storeu_si128(reinterpret_cast<__m128i *>(out), _mm_and_si128(set, one));
    }
    if (i < bytes) Store64(out, kBitFlags[src[i]]);
}

#endif

}  // namespace

void UnpackFlagBytes(const uint8_t *src, int64_t bytes, uint8_t *out) {
#ifdef TESSARINE_SHUFFLE_PATH
    if (ActiveVectorPath() >= VectorPath::kShuffle) return UnpackShuffled(src, bytes, out);
#endif
    for (int64_t i = 0; i < bytes; ++i, out += 8) Store64(out, kBitFlags[src[i]]);
}

void PackFlagBytes(const uint8_t *values, int64_t bytes, uint8_t *dst, bool highBit) {
#ifdef TESSARINE_SHUFFLE_PATH
    if (ActiveVectorPath() >= VectorPath::kShuffle) return PackShuffled(values, bytes, dst, highBit);
#endif
    if (highBit)
        PackPlain<HighBit>(values, bytes, dst);
    else
        PackPlain<NonZeroBit>(values, bytes, dst);
}

}  // namespace tessarine::bitmap
