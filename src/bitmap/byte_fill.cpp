// Whole pixel blocks of a bitmap in memory filled or complemented byte for
// byte, the filler at the end of each row included.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <algorithm>
#include <cstring>

#include "core/block_guards.h"

namespace {

// height * bytesPerRow, kept within the block that is really there.
int64_t PixelBytes(const BI_Bitmap *b, const tessarine::LockGuard &pixels) {
    const int64_t bytes = b->height > 0 ? int64_t{b->height} * b->bytesPerRow : 0;
    return std::min(bytes, pixels.Size());
}

}  // namespace

extern "C" {

TESSARINE_API void BI_FillByte(BI_Bitmap *bitmap, uint8_t value) {
    const tessarine::LockGuard pixels(bitmap->pixelHandle);
    if (pixels.Get() != nullptr)
        std::memset(pixels.Get(), value, static_cast<size_t>(PixelBytes(bitmap, pixels)));
}

TESSARINE_API void BI_ReverseByte(BI_Bitmap *bitmap) {
    const tessarine::LockGuard pixels(bitmap->pixelHandle);
    uint8_t *p = pixels.Get();
    if (p == nullptr) return;
    const int64_t n = PixelBytes(bitmap, pixels);
    int64_t i = 0;
    for (; i + 8 <= n; i += 8) {
        uint64_t w;
        std::memcpy(&w, p + i, 8);
        w = ~w;
        std::memcpy(p + i, &w, 8);
    }
    for (; i < n; ++i) p[i] = static_cast<uint8_t>(~p[i]);
}

}  // extern "C"
