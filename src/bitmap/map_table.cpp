// Map tables: one byte per source pixel value giving the nearest pixel value
// of the destination, so that a copy between two bitmaps does one lookup per
// pixel.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <algorithm>

#include "bitmap/color_tables.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

constexpr int kMapEntries = 256;

// Entries of a stored table that its block really holds.
int32_t HeldEntries(const BI_Bitmap *b, const bm::TableView &t, int entry) {
    return static_cast<int32_t>(std::clamp<int64_t>(t.Size() / entry, 0, std::max(b->colorCount, 0)));
}

// Source entries that can stand in a map: a pixel value is at most 255.
int32_t SourceEntries(const BI_Bitmap *b) { return std::clamp(b->colorCount, 0, kMapEntries); }

int32_t LevelToLevel(const BI_Bitmap *src, const BI_Bitmap *dst, uint8_t *map) {
    const int sd = src->bitsPerPixel, dd = dst->bitsPerPixel;
    if (sd < 1 || sd > 8 || dd < 1 || dd > 8) return kErrUnsupported;
    const int S = 1 << sd, D = 1 << dd;
    if (D >= S) {
        const int step = (D - 1) / (S - 1);
        for (int i = 0; i < S; ++i) map[i] = static_cast<uint8_t>(step * i);
    } else {
        const int q = S / D;
        for (int i = 0; i < S; ++i) map[i] = static_cast<uint8_t>(i / q);
    }
    return kOk;
}

int32_t LevelToIndex(const BI_Bitmap *src, const BI_Bitmap *dst, const bm::TableView &dt,
                     uint8_t *map) {
    const int model = dst->colorModel;
    if (model != 1 && model != 2) return kErrUnsupported;
    const int sd = src->bitsPerPixel;
    uint8_t implied[kMapEntries * 4];
    const bool ok = model == 1 ? bm::ImpliedRGBTable(sd, implied) : bm::ImpliedCMYKTable(sd, implied);
    if (!ok) return kErrUnsupported;
    const int S = 1 << sd;
    if (model == 1) {
        const int32_t n = HeldEntries(dst, dt, 3);
        for (int i = 0; i < S; ++i)
            map[i] = BI_RGBMapToColorIndex(implied[3 * i], implied[3 * i + 1], implied[3 * i + 2], n,
                                           dt.Bytes());
    } else {
        const int32_t n = HeldEntries(dst, dt, 4);
        for (int i = 0; i < S; ++i)
            map[i] = bm::CmykNearest(implied[4 * i], implied[4 * i + 1], implied[4 * i + 2],
                                     implied[4 * i + 3], n, dt.Bytes());
    }
    return kOk;
}

int32_t IndexToLevel(const BI_Bitmap *src, const bm::TableView &st, const BI_Bitmap *dst,
                     uint8_t *map) {
    const int model = src->colorModel;
    if (model != 1 && model != 2) return kErrUnsupported;
    const int dd = dst->bitsPerPixel;
    uint8_t implied[kMapEntries * 4];
    if (model == 1)  // the table is made, and the map is left as it was
        return bm::ImpliedRGBTable(dd, implied) ? kOk : kErrUnsupported;
    if (!bm::ImpliedCMYKTable(dd, implied)) return kErrUnsupported;
    const int D = 1 << dd;
    const int32_t n = SourceEntries(src);
    for (int32_t i = 0; i < n; ++i)
        map[i] = bm::CmykNearest(st.At(4 * i), st.At(4 * i + 1), st.At(4 * i + 2), st.At(4 * i + 3),
                                 D, implied);
    return kOk;
}

int32_t IndexToIndex(const BI_Bitmap *src, const bm::TableView &st, const BI_Bitmap *dst,
                     const bm::TableView &dt, uint8_t *map) {
    const int32_t n = SourceEntries(src);
    if (dst->colorModel == 1) {
        const int32_t dn = HeldEntries(dst, dt, 3);
        for (int32_t i = 0; i < n; ++i)
            map[i] = BI_RGBMapToColorIndex(st.At(3 * i), st.At(3 * i + 1), st.At(3 * i + 2), dn,
                                           dt.Bytes());
    } else if (dst->colorModel == 2) {
        // Entries read as 4 bytes whatever the source's own model; bytes past
        // its table read as 0.
        const int32_t dn = HeldEntries(dst, dt, 4);
        for (int32_t i = 0; i < n; ++i)
            map[i] = bm::CmykNearest(st.At(4 * i), st.At(4 * i + 1), st.At(4 * i + 2),
                                     st.At(4 * i + 3), dn, dt.Bytes());
    }
    return kOk;
}

bool IsLevel(uint8_t t) { return t == 1 || t == 2; }

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_GetMapTable(const BI_Bitmap *source, const BI_Bitmap *destination,
                                     uint8_t *map) {
    const bm::TableView st(source->colorTable);
    const bm::TableView dt(destination->colorTable);
    const uint8_t s = source->imageType, d = destination->imageType;
    if (IsLevel(s) && IsLevel(d)) return LevelToLevel(source, destination, map);
    if (IsLevel(s) && d == 3) return LevelToIndex(source, destination, dt, map);
    if (s == 3 && IsLevel(d)) return IndexToLevel(source, st, destination, map);
    if (s == 3 && d == 3) return IndexToIndex(source, st, destination, dt, map);
    return kErrUnsupported;
}

}  // extern "C"
