// The exported 1-bit and 4-bit row movers, and the whole-byte shift that
// carries their bodies.
#include "bitmap/row_bits.h"

#include "bitmap/cpu_features.h"

#include <tessarine/bitmap.h>
#include <tessarine/core.h>

namespace tessarine::bitmap {
namespace {

#ifdef TESSARINE_SHUFFLE_PATH
// 32 bytes: each byte's bits moved up by r and filled from the next byte's
// top. Bytes have no shift of their own; the 16-bit shifts are masked.
__attribute__((target("avx2"))) inline void ShiftStep(const uint8_t *in, uint8_t *out, __m128i up,
                                                      __m128i down, __m256i keepUp,
                                                      __m256i keepDown) {
    const __m256i a = _mm256_loadu_si256(reinterpret_cast<const __m256i *>(in));
    const __m256i b = _mm256_loadu_si256(reinterpret_cast<const __m256i *>(in + 1));
    const __m256i v = _mm256_or_si256(_mm256_and_si256(_mm256_sll_epi16(a, up), keepUp),
                                      _mm256_and_si256(_mm256_srl_epi16(b, down), keepDown));
    _mm256_storeu_si256(reinterpret_cast<__m256i *>(out), v);
}

__attribute__((target("avx2"))) int64_t ShiftBytesLeftWide(const uint8_t *in, int64_t n, int r,
                                                           uint8_t *out) {
    const __m128i up = _mm_cvtsi32_si128(r), down = _mm_cvtsi32_si128(8 - r);
    const __m256i keepUp = _mm256_set1_epi8(static_cast<char>((0xFF << r) & 0xFF));
    const __m256i keepDown = _mm256_set1_epi8(static_cast<char>(0xFF >> (8 - r)));
    int64_t k = 0;
    for (; k + 128 <= n; k += 128) {
        ShiftStep(in + k, out + k, up, down, keepUp, keepDown);
        ShiftStep(in + k + 32, out + k + 32, up, down, keepUp, keepDown);
        ShiftStep(in + k + 64, out + k + 64, up, down, keepUp, keepDown);
        ShiftStep(in + k + 96, out + k + 96, up, down, keepUp, keepDown);
    }
    for (; k + 32 <= n; k += 32) ShiftStep(in + k, out + k, up, down, keepUp, keepDown);
    return k;
}
#endif

}  // namespace

void CopyWholeBytes(const uint8_t *src, int32_t n, uint8_t *dst) { MEM_Copy(src, dst, n); }

void ShiftBytesLeft(const uint8_t *in, int64_t n, int r, uint8_t *out) {
    const auto i = reinterpret_cast<uintptr_t>(in);
    const auto o = reinterpret_cast<uintptr_t>(out);
    // Eight bytes at a time read ahead of what they write; where the two runs
    // overlap, only the byte order of the definition gives its result.
    const bool apart = o + static_cast<uintptr_t>(n) <= i || i + static_cast<uintptr_t>(n) + 1 <= o;
    int64_t k = 0;
    if (apart) {
        if (r == 0) {
            std::memcpy(out, in, static_cast<size_t>(n));
            return;
        }
        const int back = 8 - r;
#ifdef TESSARINE_SHUFFLE_PATH
        if (n >= 64 && ActiveVectorPath() >= VectorPath::kWide) k = ShiftBytesLeftWide(in, n, r, out);
#endif
        for (; k + 8 <= n; k += 8)
            StoreBE64(out + k, (LoadBE64(in + k) << r) | (uint64_t{in[k + 8]} >> back));
    }
    // Each byte read once, before the write that may cover it.
    unsigned held = in[k];
    for (; k < n; ++k) {
        const unsigned next = in[k + 1];
        out[k] = static_cast<uint8_t>((held << r) | (next >> (8 - r)));
        held = next;
    }
}

}  // namespace tessarine::bitmap

namespace bm = tessarine::bitmap;

extern "C" {

// Phases outside their range name no pixel: such a call moves nothing.
TESSARINE_API void BI_CopyRow1BPPBits(int32_t count, uint8_t sourcePhase, const uint8_t *source,
                                      uint8_t destinationPhase, uint8_t *destination) {
    if (sourcePhase > 7 || destinationPhase > 7) return;
    bm::CopyRow1(bm::RawBytes{}, count, sourcePhase, source, destinationPhase, destination);
}

TESSARINE_API void BI_CopyRow4BPPBits(int32_t count, uint8_t sourcePhase, const uint8_t *source,
                                      uint8_t destinationPhase, uint8_t *destination) {
    if (sourcePhase > 1 || destinationPhase > 1) return;
    bm::CopyRow4(bm::RawBytes{}, count, sourcePhase, source, destinationPhase, destination);
}

TESSARINE_API void BI_MaskRow1BPPBits(int32_t count, uint8_t sourcePhase, const uint8_t *source,
                                      uint8_t maskPhase, const uint8_t *mask,
                                      uint8_t destinationPhase, uint8_t *destination) {
    if (sourcePhase > 7 || maskPhase > 7 || destinationPhase > 7) return;
    bm::MaskRow1(bm::RawBytes{}, count, sourcePhase, source, maskPhase, mask, destinationPhase,
                 destination);
}

TESSARINE_API void BI_MaskRow4BPPBits(int32_t count, uint8_t sourcePhase, const uint8_t *source,
                                      uint8_t maskPhase, const uint8_t *mask,
                                      uint8_t destinationPhase, uint8_t *destination) {
    if (sourcePhase > 1 || maskPhase > 7 || destinationPhase > 1) return;
    bm::MaskRow4(bm::RawBytes{}, count, sourcePhase, source, maskPhase, mask, destinationPhase,
                 destination);
}

}  // extern "C"
