// Nearest-colour searches and the sorted colour index of a table.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <algorithm>

#include "bitmap/color_tables.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::kErrMemory;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace tessarine::bitmap {

uint8_t CmykNearest(uint8_t c, uint8_t m, uint8_t y, uint8_t k, int32_t count,
                    const uint8_t *e) {
    int32_t best = 0x7FFFFFFF;
    int32_t bestIndex = 0;
    for (int32_t i = 0; i < count; ++i, e += 4) {
        const int32_t dc = e[0] - c, dm = e[1] - m, dy = e[2] - y, dk = e[3] - k;
        const int32_t dist = dc * dc + dm * dm + dy * dy + dk * dk;
        if (dist < best) {
            best = dist;
            bestIndex = i;
        }
    }
    return static_cast<uint8_t>(bestIndex);
}

int32_t ColorIndexEntries(const void *colorIndex, int32_t count) {
    if (colorIndex == nullptr || count <= 0) return 0;
    const int64_t held = MEM_HdlSize(const_cast<void *>(colorIndex)) / sizeof(ColorIndexEntry);
    return static_cast<int32_t>(std::min<int64_t>(count, held));
}

}  // namespace tessarine::bitmap

extern "C" {

TESSARINE_API uint8_t BI_RGBMapToColorIndex(uint8_t r, uint8_t g, uint8_t b, int32_t count,
                                            const uint8_t *e) {
    int32_t best = 0x7FFFFFFF;
    int32_t bestIndex = 0;
    for (int32_t i = 0; i < count; ++i, e += 3) {
        const int32_t dr = e[0] - r, dg = e[1] - g, db = e[2] - b;
        const int32_t dist = dr * dr + dg * dg + db * db;
        if (dist < best) {
            best = dist;
            bestIndex = i;
        }
    }
    return static_cast<uint8_t>(bestIndex);
}

TESSARINE_API int32_t MakeColorTableIndex(BI_Bitmap *bitmap) {
    if (bitmap->imageType != 3 || bitmap->bitsPerPixel > 8) return kErrUnsupported;
    if (bitmap->colorIndex != nullptr) {
        MEM_FreeHdl(bitmap->colorIndex);
        bitmap->colorIndex = nullptr;
    }
    const int32_t count = bitmap->colorCount;
    if (count <= 0) return kOk;
    const int64_t bytes = int64_t{count} * sizeof(bm::ColorIndexEntry);
    if (bytes > UINT32_MAX) return kErrMemory;
    auto *index = static_cast<bm::ColorIndexEntry *>(MEM_AllocPtr(0, static_cast<uint32_t>(bytes)));
    if (index == nullptr) return kErrMemory;
    {
        // Entries are read as 3 bytes whatever the model; bytes past the
        // table's block read as 0.
        const bm::TableView table(bitmap->colorTable);
        for (int32_t i = 0; i < count; ++i) {
            const int64_t at = int64_t{i} * 3;
            index[i] = {bm::ColorKey(table.At(at), table.At(at + 1), table.At(at + 2)),
                        static_cast<uint8_t>(i), {0, 0, 0}};
        }
    }
    std::sort(index, index + count,
              [](const bm::ColorIndexEntry &a, const bm::ColorIndexEntry &b) { return a.key < b.key; });
    bitmap->colorIndex = index;
    return kOk;
}

}  // extern "C"
