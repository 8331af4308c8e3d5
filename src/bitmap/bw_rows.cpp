// Black-and-white row access: 1-bit rows as 0/1 flags, or as packed bytes.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <cstring>

#include "bitmap/row_pack.h"
#include "bitmap/row_steps.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::kOk;

namespace {

// The three parts of a run: phase s of the first pixel, phase e of the last,
// and n, the byte of the last counted from the byte of the first. A run
// inside one byte has n = 0, and head and tail both work on that byte.
struct BitRun {
    int s;
    int e;
    int64_t n;
};

BitRun RunOf(int64_t x, int64_t count) {
    const int64_t last = x + count - 1;
    return {static_cast<int>(x & 7), static_cast<int>(last & 7), (last >> 3) - (x >> 3)};
}

int64_t FlagBytes(int32_t x, int32_t count) { return tessarine::storage::RunBytes(1, x, bm::Pixels(count)); }

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_UnpackBWRow(const uint8_t *row, int32_t x, int32_t count, uint8_t *out) {
    if (count < 1) return kOk;
    const BitRun r = RunOf(x, count);
    const uint8_t first = row[0];
    for (int i = r.s; i < 8; ++i) *out++ = (first >> (7 - i)) & 1;
    if (r.n > 1) {
        bm::UnpackFlagBytes(row + 1, r.n - 1, out);
        out += (r.n - 1) * 8;
    }
    const uint8_t last = row[r.n];
    for (int i = 0; i <= r.e; ++i) *out++ = (last >> (7 - i)) & 1;
    return kOk;
}

TESSARINE_API int32_t BI_PackBWRow(const uint8_t *flags, int32_t x, int32_t count, uint8_t *row) {
    if (count < 1) return kOk;
    const BitRun r = RunOf(x, count);
    auto b = static_cast<uint8_t>(row[0] & ~(0xFF >> r.s));
    for (int i = r.s; i < 8; ++i)
        if (*flags++) b |= static_cast<uint8_t>(0x80 >> i);
    row[0] = b;
    if (r.n > 1) {
        bm::PackFlagBytes(flags, r.n - 1, row + 1, false);
        flags += (r.n - 1) * 8;
    }
    b = static_cast<uint8_t>(row[r.n] & (0xFF >> (r.e + 1)));
    for (int i = 0; i <= r.e; ++i)
        if (*flags++) b |= static_cast<uint8_t>(0x80 >> i);
    row[r.n] = b;
    return kOk;
}

TESSARINE_API int32_t BI_GetBWRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                  uint8_t *out) {
    return bm::GetRowSteps(bitmap, y, x, count, FlagBytes(x, count),
                           [&](const uint8_t *row) { return BI_UnpackBWRow(row, x, count, out); });
}

TESSARINE_API int32_t BI_SetBWRow(int32_t y, int32_t x, int32_t count, const uint8_t *flags,
                                  BI_Bitmap *bitmap) {
    return bm::SetRowSteps(bitmap, y, x, count, FlagBytes(x, count), [&](uint8_t *row, int64_t) {
        return BI_PackBWRow(flags, x, count, row);
    });
}

TESSARINE_API int32_t BI_GetBWPackedRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                        uint8_t *out) {
    const int64_t bytes = FlagBytes(x, count);
    return bm::GetRowSteps(bitmap, y, x, count, bytes, [&](const uint8_t *row) {
        std::memcpy(out, row, static_cast<size_t>(bytes));
        return kOk;
    });
}

TESSARINE_API int32_t BI_SetBWPackedRow(int32_t y, int32_t x, int32_t count, const uint8_t *packed,
                                        BI_Bitmap *bitmap) {
    const int64_t bytes = FlagBytes(x, count);
    // The byte after the run is written too, when it lies in the same row.
    const int64_t rowBytes = (int64_t{bitmap->width} * bitmap->bitsPerPixel + 7) >> 3;
    const int64_t firstByte = (int64_t{x} * bitmap->bitsPerPixel) >> 3;
    return bm::SetRowSteps(bitmap, y, x, count, bytes, [&](uint8_t *row, int64_t room) {
        if (count < 1) return kOk;
        if ((x & 7) == 0) {
            std::memcpy(row, packed, static_cast<size_t>((int64_t{count} + 7) / 8));
            return kOk;
        }
        const BitRun r = RunOf(x, count);
        const int s = r.s;
        const int64_t n = r.n + 1;
        row[0] = static_cast<uint8_t>(packed[0] >> s);
        for (int64_t k = 0; k + 1 < n; ++k)
            row[k + 1] = static_cast<uint8_t>((packed[k] << (8 - s)) | (packed[k + 1] >> s));
        if (n < room && firstByte + n < rowBytes) {
            row[n] = static_cast<uint8_t>((packed[n - 1] << (8 - s)) | (packed[n] >> s));
            row[n] &= static_cast<uint8_t>(0xFF >> r.e);
        }
        return kOk;
    });
}

}  // extern "C"
