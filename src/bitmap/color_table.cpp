// Colour tables of a bitmap: the stored table of an indexed bitmap, the
// implied tables of gray and black-and-white ones, and the gray rule.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <algorithm>
#include <cstring>

#include "bitmap/color_tables.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::kErrGeneral;
using tessarine::kErrMemory;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace tessarine::bitmap {

bool ImpliedRGBTable(int d, uint8_t *e) {
    if (d != 1 && d != 4 && d != 8) return false;
    const int n = 1 << d;
    for (int i = 0; i < n; ++i) {
        uint8_t v;
        if (d == 1)
            v = i == 0 ? 255 : 0;
        else if (d == 4)
            v = static_cast<uint8_t>((15 - i) * 17);
        else
            v = static_cast<uint8_t>(255 - i);
        e[3 * i] = e[3 * i + 1] = e[3 * i + 2] = v;
    }
    return true;
}

bool ImpliedCMYKTable(int d, uint8_t *e) {
    if (d != 1 && d != 4 && d != 8) return false;
    const int n = 1 << d;
    for (int i = 0; i < n; ++i) {
        e[4 * i] = e[4 * i + 1] = e[4 * i + 2] = 0;
        e[4 * i + 3] = static_cast<uint8_t>(d == 1 ? (i ? 255 : 0) : d == 4 ? i * 17 : i);
    }
    return true;
}

TableView::TableView(MEM_Handle table) : handle_(table) {
    if (handle_ == nullptr) return;
    bytes_ = static_cast<const uint8_t *>(MEM_Lock(handle_));
    size_ = bytes_ != nullptr ? MEM_HdlSize(handle_) : 0;
}

TableView::~TableView() {
    if (handle_ != nullptr && bytes_ != nullptr) MEM_Unlock(handle_);
}

}  // namespace tessarine::bitmap

namespace {

// The stored table of an indexed bitmap, copied out with `entry` bytes per
// entry: -1 when the model is not the one asked for or there is no table.
int32_t CopyStoredTable(const BI_Bitmap *b, uint8_t model, int32_t entry, int32_t *count,
                        uint8_t *entries) {
    if (b->colorModel != model) return kErrGeneral;
    if (b->colorCount <= 0 || b->colorTable == nullptr) return kErrGeneral;
    const bm::TableView table(b->colorTable);
    const int64_t bytes = int64_t{b->colorCount} * entry;
    const int64_t have = std::min(bytes, table.Size());
    if (have > 0) std::memcpy(entries, table.Bytes(), static_cast<size_t>(have));
    if (bytes > have) std::memset(entries + have, 0, static_cast<size_t>(bytes - have));
    *count = b->colorCount;
    return kOk;
}

}  // namespace

extern "C" {

TESSARINE_API uint8_t RGB2GrayScale(uint8_t r, uint8_t g, uint8_t b) { return bm::GrayOf(r, g, b); }

TESSARINE_API int32_t BI_SetRGBColorTable(BI_Bitmap *bitmap, int32_t count,
                                          const uint8_t *entries) {
    if (bitmap->imageType != 3) return kErrUnsupported;
    if (bitmap->colorModel != 1) return kErrGeneral;
    if (bitmap->colorCount <= 0 || bitmap->colorTable == nullptr) return kErrGeneral;
    // A table of no entries cannot stand in for one.
    if (count <= 0) return kErrGeneral;
    const int64_t bytes = int64_t{count} * 3;
    if (count != bitmap->colorCount) {
        // The new block is had before the old one goes, so that a failure
        // leaves the bitmap as it was.
        MEM_Handle fresh = MEM_AllocHdl(0, static_cast<uint32_t>(bytes));
        if (fresh == nullptr) return kErrMemory;
        MEM_FreeHdl(bitmap->colorTable);
        bitmap->colorTable = fresh;
        bitmap->colorCount = count;
    }
    void *table = MEM_Lock(bitmap->colorTable);
    std::memcpy(table, entries, static_cast<size_t>(bytes));
    MEM_Unlock(bitmap->colorTable);
    return kOk;
}

TESSARINE_API int32_t BI_GetRGBColorTable(const BI_Bitmap *bitmap, int32_t *count,
                                          uint8_t *entries) {
    switch (bitmap->imageType) {
        case 1:
        case 2: return bm::ImpliedRGBTable(bitmap->bitsPerPixel, entries) ? kOk : kErrUnsupported;
        case 3: return CopyStoredTable(bitmap, 1, 3, count, entries);
        default: return kErrUnsupported;
    }
}

TESSARINE_API int32_t BI_GetCMYKColorTable(const BI_Bitmap *bitmap, int32_t *count,
                                           uint8_t *entries) {
    switch (bitmap->imageType) {
        case 1:
        case 2: return bm::ImpliedCMYKTable(bitmap->bitsPerPixel, entries) ? kOk : kErrUnsupported;
        case 3: return CopyStoredTable(bitmap, 2, 4, count, entries);
        default: return kErrUnsupported;
    }
}

}  // extern "C"
