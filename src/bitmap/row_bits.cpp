// The exported 1-bit and 4-bit row movers, and the whole-byte shift that
// carries their bodies.
#include "bitmap/row_bits.h"

#include <tessarine/bitmap.h>
#include <tessarine/core.h>

namespace tessarine::bitmap {

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
