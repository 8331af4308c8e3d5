// Filling a whole bitmap with one colour, row by row in the bitmap's layout.
#include <tessarine/bitmap.h>
#include <tessarine/color.h>
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "bitmap/color_tables.h"
#include "bitmap/copy_steps.h"
#include "core/block_guards.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::Failed;
using tessarine::FreeGuard;
using tessarine::kErrArgument;
using tessarine::kErrMemory;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

template <class Row>
int32_t EveryRow(const BI_Bitmap *b, Row &&row) {
    for (int32_t y = 0; y < b->height; ++y) {
        const int32_t status = row(y);
        if (Failed(status)) return status;
    }
    return kOk;
}

int32_t FillRows(BI_Bitmap *b, uint8_t r, uint8_t g, uint8_t bl) {
    const int32_t type = b->imageType;
    if (type == 0 || type > 4) return kErrUnsupported;
    if (type == 4 && b->colorModel != 1 && b->colorModel != 2) return kOk;
    const int64_t w = b->width > 0 ? b->width : 0;
    // One block holds the row: packed bytes, one plane, or the planes side by side.
    const int64_t bytes = std::max<int64_t>(
        {type == 1 ? std::max<int64_t>(b->bytesPerRow, (w + 7) / 8 + 1) : w * 4, 1});
    if (bytes > UINT32_MAX) return kErrMemory;
    auto *row = static_cast<uint8_t *>(MEM_AllocPtr(0, static_cast<uint32_t>(bytes)));
    if (row == nullptr) return kErrMemory;
    const FreeGuard rowGuard(row);
    const int a = (r + g + bl) / 3;
    const auto width = static_cast<int32_t>(w);
    switch (type) {
        case 1:
            // A dark colour sets the bits, a light one clears them.
            std::memset(row, a <= 128 ? 255 : 0, static_cast<size_t>(bytes));
            return EveryRow(b, [&](int32_t y) { return BI_SetBWPackedRow(y, 0, width, row, b); });
        case 2:
            std::memset(row, 255 - a, static_cast<size_t>(w));
            return EveryRow(b, [&](int32_t y) { return BI_SetGRow(y, 0, width, row, b); });
        case 3: {
            uint8_t index = 0;
            {
                // The table is read as RGB whatever its model.
                const bm::TableView table(b->colorTable);
                const int32_t entries = static_cast<int32_t>(
                    std::clamp<int64_t>(table.Size() / 3, 0, std::max(b->colorCount, 0)));
                index = BI_RGBMapToColorIndex(r, g, bl, entries, table.Bytes());
            }
            return EveryRow(b, [&](int32_t y) {
                // The row call clears values past the table in place: make it afresh.
                std::memset(row, index, static_cast<size_t>(w));
                return BI_SetIndexRow(y, 0, width, row, b);
            });
        }
        default: break;
    }
    uint8_t *planes[4] = {row, row + w, row + 2 * w, row + 3 * w};
    if (b->colorModel == 1) {
        std::memset(planes[0], r, static_cast<size_t>(w));
        std::memset(planes[1], g, static_cast<size_t>(w));
        std::memset(planes[2], bl, static_cast<size_t>(w));
        return EveryRow(b, [&](int32_t y) { return BI_SetRGBRow(y, 0, width, planes[0], planes[1], planes[2], b); });
    }
    uint8_t rgb[3] = {r, g, bl};
    uint8_t cmyk[4];
    CX_SRgb2SWOPCmyk(rgb, cmyk);
    for (int k = 0; k < 4; ++k) std::memset(planes[k], cmyk[k], static_cast<size_t>(w));
    return EveryRow(b, [&](int32_t y) {
        return BI_SetCMYKRow(y, 0, width, planes[0], planes[1], planes[2], planes[3], b);
    });
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_FillBmp(BI_Bitmap *bitmap, uint8_t r, uint8_t g, uint8_t b) {
    // A transfer of the caller's would be overwritten and lost.
    if (bm::TileOnly(bitmap) && bitmap->ioSession != nullptr) return kErrArgument;
    int32_t status = HVT_TileFileRowIOBegin(2, bitmap, nullptr, 2, 0, 0);
    if (!Failed(status)) status = FillRows(bitmap, r, g, b);
    HVT_TileFileRowColIOEnd(bitmap);
    return status;
}

}  // extern "C"
