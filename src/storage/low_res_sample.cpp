// Levels by point sampling, for data that cannot be averaged (1-bit and
// indexed pixels): every output pixel is a source pixel, unchanged.
#include <tessarine/storage.h>

#include <cstdint>
#include <cstring>

#include "core/status.h"
#include "storage/low_res.h"

using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

// Rows of point-sampled levels are padded to 2 bytes.
int64_t SampleStride(int64_t d, int64_t width) { return ((d * width + 15) >> 3) & ~int64_t{1}; }

// The source column of every output column of a row, walked by summing the
// column step, so that the last column lands on the last source column.
template <class Take>
void ForEachSourceColumn(int32_t outWidth, double step, int32_t srcWidth, Take &&take) {
    double at = 0.0;
    for (int64_t x = 0; x < outWidth; ++x, at += step) {
        int64_t c = static_cast<int64_t>(at + 0.5);
        if (c > srcWidth - 1) c = srcWidth - 1;
        take(x, c);
    }
}

int32_t SampleRow(int d, const uint8_t *src, uint8_t *out, int32_t outWidth, double step,
                  int32_t srcWidth) {
    switch (d) {
        case 1: {
            unsigned acc = 0;
            ForEachSourceColumn(outWidth, step, srcWidth, [&](int64_t x, int64_t c) {
                acc = (acc << 1) | ((src[c >> 3] >> (7 - (c & 7))) & 1u);
                if ((x & 7) == 7) {
                    out[x >> 3] = static_cast<uint8_t>(acc);
                    acc = 0;
                }
            });
            if (const int rest = outWidth & 7; rest != 0)
                out[outWidth >> 3] = static_cast<uint8_t>(acc << (8 - rest));
            return kOk;
        }
        case 4:
            ForEachSourceColumn(outWidth, step, srcWidth, [&](int64_t x, int64_t c) {
                const unsigned v = (c & 1) ? src[c >> 1] & 15u : src[c >> 1] >> 4;
                uint8_t &o = out[x >> 1];
                o = (x & 1) ? static_cast<uint8_t>(o | v) : static_cast<uint8_t>(v << 4);
            });
            return kOk;
        case 8:
            ForEachSourceColumn(outWidth, step, srcWidth,
                                [&](int64_t x, int64_t c) { out[x] = src[c]; });
            return kOk;
        case 24:
            ForEachSourceColumn(outWidth, step, srcWidth,
                                [&](int64_t x, int64_t c) { std::memcpy(out + 3 * x, src + 3 * c, 3); });
            return kOk;
        case 32:
            ForEachSourceColumn(outWidth, step, srcWidth,
                                [&](int64_t x, int64_t c) { std::memcpy(out + 4 * x, src + 4 * c, 4); });
            return kOk;
        default: return kErrUnsupported;
    }
}

}  // namespace

namespace tessarine::storage {

int32_t HVT_UpdateLowResSample(HVT_FileInfo *info, uint8_t source, uint8_t destination,
                               HVT_Progress *progress) {
    if (source >= HVT_MAX_SUBBMPS || destination >= HVT_MAX_SUBBMPS) return kErrArgument;
    const int32_t srcW = info->subbmps[source].width, srcH = info->subbmps[source].height;
    const int32_t dstW = info->subbmps[destination].width, dstH = info->subbmps[destination].height;
    // One row or column would make the step infinite.
    if (srcW < 1 || srcH < 1 || dstW < 2 || dstH < 2) return kErrArgument;
    const ProgressRange range(progress);
    int32_t status = LoadLevelTables(info, source, destination);
    if (Failed(status)) return status;

    const int d = info->header->bitsPerPixel;
    const int64_t srcStride = SampleStride(d, srcW), dstStride = SampleStride(d, dstW);
    LevelBand in, out;
    status = in.Allocate(srcStride, 1);
    if (!Failed(status)) status = out.Allocate(dstStride, 1);
    if (Failed(status)) return status;

    int64_t inRows = in.Rows() < srcH ? in.Rows() : srcH;
    if (inRows < 2 * (srcH / dstH)) inRows = 1;
    SourceBands bands(info, source, in.Bytes(), srcStride, inRows, srcW, srcH);
    const double rowStep = srcH / (dstH - 1.0);
    const double colStep = srcW / (dstW - 1.0);
    double rowAt = 0.0;
    LevelWriter writer(info, destination, progress, dstH, out.Bytes(), out.Rows(), dstStride, dstW,
                       dstH);
    return writer.Run([&](int64_t, uint8_t *row) {
        int64_t y = static_cast<int64_t>(rowAt + 0.5);
        if (y > srcH - 1) y = srcH - 1;
        rowAt += rowStep;
        const int32_t s = bands.Reach(y);
        if (Failed(s)) return s;
        return SampleRow(d, bands.Row(y), row, dstW, colStep, srcW);
    });
}

}  // namespace tessarine::storage
