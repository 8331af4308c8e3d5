// Levels by box averaging: each output pixel is the average of an F by F
// block of source pixels, channel by channel, through a table that turns a
// sum into the average.
#include <tessarine/storage.h>

#include <emmintrin.h>

#include <cstdint>
#include <cstring>

#include "core/status.h"
#include "storage/low_res.h"

using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrMemory;
using tessarine::kOk;

namespace {

// The row-buffer record of the averaging has this many places.
constexpr int32_t kMaxReduction = 100;

// Rows of averaged levels are padded to 4 bytes.
int64_t AverageStride(int64_t d, int64_t width) { return ((d * width + 31) >> 3) & ~int64_t{3}; }

// A[s] for a sum s of F * F samples: the average, half a step ahead of
// ordinary rounding, at most 255.
void FillAverageTable(int64_t f, uint8_t *table) {
    const int64_t n = f * f;
    for (int64_t s = 0; s <= n * 255; ++s) {
        const int64_t a = (s + n / 2 + 1) / n;
        table[s] = static_cast<uint8_t>(a < 255 ? a : 255);
    }
}

// The F source rows of one output row.
struct Block {
    const uint8_t *const *rows;
    int64_t f;
};

// Bytes of `Bpp` channels: every channel of an output pixel summed over its
// block and looked up.
template <int Bpp>
void AverageBytes(const Block &b, const uint8_t *table, int64_t width, uint8_t *out) {
    const int64_t f = b.f;
    for (int64_t x = 0; x < width; ++x) {
        uint32_t sum[Bpp] = {};
        for (int64_t r = 0; r < f; ++r) {
            const uint8_t *p = b.rows[r] + x * f * Bpp;
            for (int64_t c = 0; c < f; ++c, p += Bpp)
                for (int k = 0; k < Bpp; ++k) sum[k] += p[k];
        }
        for (int k = 0; k < Bpp; ++k) out[x * Bpp + k] = table[sum[k]];
    }
}

// F = 2 at 8 bits, sixteen output pixels a step. The table there is exactly
// (s + 3) >> 2: a sum is at most 1020, which gives 255.
void AverageBytesBy2(const uint8_t *r0, const uint8_t *r1, const uint8_t *table, int64_t width,
                     uint8_t *out) {
    int64_t x = 0;
    const __m128i low = _mm_set1_epi16(0x00FF);
    const __m128i three = _mm_set1_epi16(3);
    for (; x + 16 <= width; x += 16) {
        const __m128i a0 = _mm_loadu_si128(reinterpret_cast<const __m128i *>(r0 + 2 * x));
        const __m128i a1 = _mm_loadu_si128(reinterpret_cast<const __m128i *>(r0 + 2 * x + 16));
        const __m128i b0 = _mm_loadu_si128(reinterpret_cast<const __m128i *>(r1 + 2 * x));
        const __m128i b1 = _mm_loadu_si128(reinterpret_cast<const __m128i *>(r1 + 2 * x + 16));
        auto pairs = [&](__m128i v) { return _mm_add_epi16(_mm_and_si128(v, low), _mm_srli_epi16(v, 8)); };
        const __m128i s0 = _mm_add_epi16(_mm_add_epi16(pairs(a0), pairs(b0)), three);
        const __m128i s1 = _mm_add_epi16(_mm_add_epi16(pairs(a1), pairs(b1)), three);
        const __m128i v = _mm_packus_epi16(_mm_srli_epi16(s0, 2), _mm_srli_epi16(s1, 2));
        _mm_storeu_si128(reinterpret_cast<__m128i *>(out + x), v);
    }
    for (; x < width; ++x)
        out[x] = table[r0[2 * x] + r0[2 * x + 1] + r1[2 * x] + r1[2 * x + 1]];
}

// Nibbles: the high one stored with x even, the low one added to that byte
// with x odd.
void AverageNibbles(const Block &b, const uint8_t *table, int64_t width, uint8_t *out) {
    const int64_t f = b.f;
    for (int64_t x = 0; x < width; ++x) {
        uint32_t sum = 0;
        for (int64_t r = 0; r < f; ++r)
            for (int64_t c = x * f; c < x * f + f; ++c) {
                const uint8_t v = b.rows[r][c >> 1];
                sum += (c & 1) ? v & 15u : v >> 4;
            }
        uint8_t &o = out[x >> 1];
        o = (x & 1) ? static_cast<uint8_t>(o + table[sum]) : static_cast<uint8_t>(table[sum] << 4);
    }
}

// Bits: set where the table gives a non-zero average of the count.
void AverageBits(const Block &b, const uint8_t *table, int64_t width, uint8_t *out) {
    const int64_t f = b.f;
    for (int64_t x = 0; x < width; ++x) {
        uint32_t count = 0;
        for (int64_t r = 0; r < f; ++r)
            for (int64_t c = x * f; c < x * f + f; ++c) count += (b.rows[r][c >> 3] >> (7 - (c & 7))) & 1u;
        uint8_t &o = out[x >> 3];
        if ((x & 7) == 0) o = 0;
        if (table[count] != 0) o = static_cast<uint8_t>(o | (0x80 >> (x & 7)));
    }
}

void AverageRow(int d, const Block &b, const uint8_t *table, int64_t width, uint8_t *out) {
    switch (d) {
        case 1: AverageBits(b, table, width, out); break;
        case 4: AverageNibbles(b, table, width, out); break;
        case 8:
            if (b.f == 2)
                AverageBytesBy2(b.rows[0], b.rows[1], table, width, out);
            else
                AverageBytes<1>(b, table, width, out);
            break;
        case 24: AverageBytes<3>(b, table, width, out); break;
        case 32: AverageBytes<4>(b, table, width, out); break;
        default: break;  // another depth leaves the band as it is
    }
}

}  // namespace

namespace tessarine::storage {

int32_t HVT_UpdateLowResAverage(HVT_FileInfo *info, uint8_t source, uint8_t destination,
                                HVT_Progress *progress) {
    if (source >= HVT_MAX_SUBBMPS || destination >= HVT_MAX_SUBBMPS) return kErrArgument;
    const int32_t srcW = info->subbmps[source].width, srcH = info->subbmps[source].height;
    const int32_t dstW = info->subbmps[destination].width, dstH = info->subbmps[destination].height;
    if (srcW < 1 || dstW < 1 || srcH < 0) return kErrArgument;
    const int64_t f = srcW / dstW;
    if (f < 1 || f > kMaxReduction) return kErrArgument;
    const ProgressRange range(progress);
    int32_t status = LoadLevelTables(info, source, destination);
    if (Failed(status)) return status;

    const int d = info->header->bitsPerPixel;
    // What is written: srcW / F by srcH / F, whatever the declared size.
    const int32_t outW = static_cast<int32_t>(srcW / f);
    const int32_t outH = static_cast<int32_t>(srcH / f);
    const int64_t srcStride = AverageStride(d, srcW), dstStride = AverageStride(d, outW);
    LevelBlock table, rowBuffers;
    if (!table.Allocate(f * f * 255 + 1) || !rowBuffers.Allocate(f * (srcStride > 0 ? srcStride : 1)))
        return kErrMemory;
    FillAverageTable(f, table.Bytes());
    LevelBand in, out;
    status = in.Allocate(srcStride, f);
    if (!Failed(status)) status = out.Allocate(dstStride, 1);
    if (Failed(status)) return status;

    int64_t inRows = in.Rows() < srcH ? in.Rows() : srcH;
    if (inRows < 1) inRows = 1;
    SourceBands bands(info, source, in.Bytes(), srcStride, inRows, srcW, srcH);
    const uint8_t *rows[kMaxReduction];
    LevelWriter writer(info, destination, progress, dstH, out.Bytes(), out.Rows(), dstStride, outW,
                       outH);
    return writer.Run([&](int64_t y, uint8_t *row) {
        const int64_t first = y * f;
        int32_t s = bands.Reach(first);
        if (Failed(s)) return s;
        if (bands.Holds(first + f - 1)) {
            for (int64_t r = 0; r < f; ++r) rows[r] = bands.Row(first + r);
        } else {
            // The block crosses the end of the band: its rows are copied one
            // at a time, the next band read when a row lies past it.
            for (int64_t r = 0; r < f; ++r) {
                s = bands.Reach(first + r);
                if (Failed(s)) return s;
                uint8_t *copy = rowBuffers.Bytes() + r * srcStride;
                std::memcpy(copy, bands.Row(first + r), static_cast<size_t>(srcStride));
                rows[r] = copy;
            }
        }
        AverageRow(d, Block{rows, f}, table.Bytes(), outW, row);
        return kOk;
    });
}

}  // namespace tessarine::storage
