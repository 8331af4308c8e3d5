// True-colour row access: rows of any layout as R, G, B planes or triples.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "bitmap/color_tables.h"
#include "bitmap/rgb_rows.h"
#include "bitmap/rgb_split.h"
#include "bitmap/row_pack.h"
#include "bitmap/row_steps.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::Failed;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

enum class Shape { Planes, RGB, BGR };

// Where the channels of a row go: three planes, or triples in one array.
struct RgbOut {
    Shape shape;
    uint8_t *p0;
    uint8_t *p1;
    uint8_t *p2;
};

using Lut = bm::RgbLut;

void EmitThroughLut(const RgbOut &o, const uint8_t *v, int64_t n, int64_t done, const Lut &lut) {
    const uint8_t *l0 = lut[0], *l1 = lut[1], *l2 = lut[2];
    switch (o.shape) {
        case Shape::Planes: {
            uint8_t *r = o.p0 + done, *g = o.p1 + done, *b = o.p2 + done;
            for (int64_t i = 0; i < n; ++i) {
                const uint8_t k = v[i];
                r[i] = l0[k];
                g[i] = l1[k];
                b[i] = l2[k];
            }
            break;
        }
        case Shape::RGB:
        case Shape::BGR: {
            if (o.shape == Shape::BGR) std::swap(l0, l2);
            uint8_t *out = o.p0 + 3 * done;
            for (int64_t i = 0; i < n; ++i, out += 3) {
                const uint8_t k = v[i];
                out[0] = l0[k];
                out[1] = l1[k];
                out[2] = l2[k];
            }
            break;
        }
    }
}

// 3-byte pixels as they stand: split over the planes, or copied whole (also
// for BGR, whose true-colour bytes are not swapped).
void EmitTrueColour(const RgbOut &o, const uint8_t *s, int64_t n) {
    if (o.shape != Shape::Planes) {
        std::memcpy(o.p0, s, static_cast<size_t>(n * 3));
        return;
    }
    bm::SplitRgb(s, n, o.p0, o.p1, o.p2);
}

int32_t UnpackRgb(uint8_t type, uint8_t d, MEM_Handle table, const uint8_t *src, int32_t x,
                  int32_t count, const RgbOut &o) {
    if (count < 1) return kOk;
    Lut lut;
    int depth = 0;
    const int32_t status = bm::RgbValueLut(type, d, table, lut, &depth);
    if (status != kOk) return status;
    if (depth == 0) {
        EmitTrueColour(o, src, count);
        return kOk;
    }
    bm::ForEachValueChunk(depth, src, x, count, [&](const uint8_t *v, int64_t n, int64_t done) {
        EmitThroughLut(o, v, n, done, lut);
    });
    return kOk;
}

// Bytes the unpacking of a run reads from the byte holding x.
int64_t UnpackBytes(const BI_Bitmap *b, int32_t x, int32_t count, int pixelBytes) {
    const int64_t n = bm::Pixels(count);
    const int type = b->imageType;
    if (type == 4) return n * pixelBytes;
    if (type == 1 || (type == 2 && b->bitsPerPixel == 1)) return tessarine::storage::RunBytes(1, x, n);
    return bm::OwnRunBytes(b, x, count);
}

int32_t GetRgb(BI_Bitmap *b, int32_t y, int32_t x, int32_t count, const RgbOut &o) {
    return bm::GetRowSteps(b, y, x, count, UnpackBytes(b, x, count, 3), [&](const uint8_t *row) {
        return UnpackRgb(b->imageType, b->bitsPerPixel, b->colorTable, row, x, count, o);
    });
}

struct EqualsOne {
    static constexpr int kWide = -1;
    static bool Bit(uint8_t v) { return v == 1; }
    static uint8_t Pack8(const uint8_t *v) {
        uint8_t out = 0;
        for (int i = 0; i < 8; ++i) out = static_cast<uint8_t>(out << 1 | (v[i] == 1));
        return out;
    }
};

// Index of a colour: the colour index first, the nearest table entry when
// the colour is not in it. The last colour found is kept, as rows hold runs.
class IndexFinder {
  public:
    IndexFinder(int32_t colorCount, const void *index, const uint8_t *table, int32_t tableEntries)
        : index_(static_cast<const bm::ColorIndexEntry *>(index)),
          entries_(bm::ColorIndexEntries(index, colorCount)),
          table_(table),
          tableEntries_(table != nullptr ? tableEntries : 0) {}
    uint8_t Find(uint8_t r, uint8_t g, uint8_t b) {
        const uint32_t key = bm::ColorKey(r, g, b);
        if (key == lastKey_) return last_;
        const bm::ColorIndexEntry *e = std::lower_bound(
            index_, index_ + entries_, key,
            [](const bm::ColorIndexEntry &a, uint32_t k) { return a.key < k; });
        last_ = e != index_ + entries_ && e->key == key
                    ? e->index
                    : BI_RGBMapToColorIndex(r, g, b, tableEntries_, table_);
        lastKey_ = key;
        return last_;
    }

  private:
    const bm::ColorIndexEntry *index_;
    int32_t entries_;
    const uint8_t *table_;
    int32_t tableEntries_;
    uint32_t lastKey_ = UINT32_MAX;
    uint8_t last_ = 0;
};

// Runs the planes through `value(i)` into chunks of one byte per pixel and
// hands each to `pack(values, n, done)`.
template <class Value, class Pack>
void InChunks(int64_t count, Value &&value, Pack &&pack) {
    constexpr int64_t kChunk = 4096;
    uint8_t values[kChunk];
    for (int64_t done = 0; done < count;) {
        const int64_t n = std::min(count - done, kChunk);
        for (int64_t i = 0; i < n; ++i) values[i] = value(done + i);
        pack(values, n, done);
        done += n;
    }
}

}  // namespace

namespace tessarine::bitmap {

namespace {

void FillGrayLut(RgbLut &lut, int n, uint8_t (*level)(int)) {
    for (int i = 0; i < n; ++i) lut[0][i] = lut[1][i] = lut[2][i] = level(i);
}

}  // namespace

int32_t RgbValueLut(uint8_t type, uint8_t d, MEM_Handle table, RgbLut &lut, int *depth) {
    int bits = d;
    switch (type) {
        case 1: bits = 1; [[fallthrough]];
        case 2:
            if (bits == 1)
                FillGrayLut(lut, 2, [](int i) -> uint8_t { return i ? 0 : 255; });
            else if (bits == 4)
                FillGrayLut(lut, 16, [](int i) -> uint8_t {
                    const auto v = static_cast<uint8_t>(i << 4);
                    return v == 0 ? 255 : static_cast<uint8_t>(~v);
                });
            else if (bits == 8)
                FillGrayLut(lut, 256, [](int i) -> uint8_t { return static_cast<uint8_t>(255 - i); });
            else
                return kErrUnsupported;
            break;
        case 3: {
            if (d != 1 && d != 4 && d != 8) {
                if (table != nullptr) MEM_Lock(table);  // left locked, as it always was
                return kErrUnsupported;
            }
            const TableView t(table);
            for (int i = 0; i < (1 << d); ++i)
                for (int k = 0; k < 3; ++k) lut[k][i] = t.At(int64_t{i} * 3 + k);
            break;
        }
        case 4: bits = 0; break;
        default: return kErrUnsupported;
    }
    *depth = bits;
    return kOk;
}

int32_t BI_PackRGBRow(uint8_t imageType, uint8_t d, const uint8_t *r, const uint8_t *g,
                      const uint8_t *b, int32_t x, int32_t count, uint8_t *row, int32_t colorCount,
                      const void *colorIndex, const uint8_t *table, int32_t tableEntries) {
    if (count < 1) return kOk;
    if (imageType == 2 && d == 1) imageType = 1;
    const int64_t n = count;
    auto density = [&](int64_t i) { return GrayOf(r[i], g[i], b[i]); };
    // Pixel i of the run at pixel x + i of the row, for depths below 8.
    auto at = [&](int depth, int64_t done) { return row + (((x + done) * depth) >> 3) - ((int64_t{x} * depth) >> 3); };
    switch (imageType) {
        case 1:
            InChunks(n, density, [&](const uint8_t *v, int64_t k, int64_t done) {
                PackBits1<HighBit>(v, x + done, k, at(1, done));
            });
            return kOk;
        case 2:
            if (d == 8) {
                for (int64_t i = 0; i < n; ++i) row[i] = density(i);
            } else if (d == 4) {
                InChunks(n, density, [&](const uint8_t *v, int64_t k, int64_t done) {
                    PackNibbles(v, x + done, k, at(4, done), [](uint8_t v) { return uint8_t(v >> 4); });
                });
            } else {
                return kErrUnsupported;
            }
            return kOk;
        case 3: {
            if (d != 1 && d != 4 && d != 8) return kErrUnsupported;
            IndexFinder finder(colorCount, colorIndex, table, tableEntries);
            auto index = [&](int64_t i) { return finder.Find(r[i], g[i], b[i]); };
            if (d == 8) {
                for (int64_t i = 0; i < n; ++i) row[i] = index(i);
            } else if (d == 4) {
                InChunks(n, index, [&](const uint8_t *v, int64_t k, int64_t done) {
                    PackNibbles(v, x + done, k, at(4, done), [](uint8_t v) { return uint8_t(v & 15); });
                });
            } else {
                InChunks(n, index, [&](const uint8_t *v, int64_t k, int64_t done) {
                    PackBits1<EqualsOne>(v, x + done, k, at(1, done));
                });
            }
            return kOk;
        }
        case 4: JoinRgb(r, g, b, n, row); return kOk;
        default: return kErrUnsupported;
    }
}

}  // namespace tessarine::bitmap

extern "C" {

TESSARINE_API int32_t BI_UnpackRGBRow(uint8_t imageType, uint8_t bitsPerPixel, MEM_Handle table,
                                      const uint8_t *row, int32_t x, int32_t count, uint8_t *r,
                                      uint8_t *g, uint8_t *b) {
    return UnpackRgb(imageType, bitsPerPixel, table, row, x, count, {Shape::Planes, r, g, b});
}

TESSARINE_API int32_t BI_UnpackRGBRowInterlace(uint8_t imageType, uint8_t bitsPerPixel,
                                               MEM_Handle table, const uint8_t *row, int32_t x,
                                               int32_t count, uint8_t *rgb) {
    return UnpackRgb(imageType, bitsPerPixel, table, row, x, count, {Shape::RGB, rgb, nullptr, nullptr});
}

TESSARINE_API int32_t BI_UnpackBGRRowInterlace(uint8_t imageType, uint8_t bitsPerPixel,
                                               MEM_Handle table, const uint8_t *row, int32_t x,
                                               int32_t count, uint8_t *bgr) {
    return UnpackRgb(imageType, bitsPerPixel, table, row, x, count, {Shape::BGR, bgr, nullptr, nullptr});
}

TESSARINE_API int32_t BI_GetRGBRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                   uint8_t *r, uint8_t *g, uint8_t *b) {
    return GetRgb(bitmap, y, x, count, {Shape::Planes, r, g, b});
}

TESSARINE_API int32_t BI_GetRGBRowInterlace(BI_Bitmap *bitmap, int32_t y, int32_t x,
                                            int32_t count, uint8_t *rgb) {
    return GetRgb(bitmap, y, x, count, {Shape::RGB, rgb, nullptr, nullptr});
}

TESSARINE_API int32_t BI_GetBGRRowInterlace(BI_Bitmap *bitmap, int32_t y, int32_t x,
                                            int32_t count, uint8_t *bgr) {
    return GetRgb(bitmap, y, x, count, {Shape::BGR, bgr, nullptr, nullptr});
}

TESSARINE_API int32_t BI_SetRGBRow(int32_t y, int32_t x, int32_t count, const uint8_t *r,
                                   const uint8_t *g, const uint8_t *b, BI_Bitmap *bitmap) {
    const uint8_t type = bitmap->imageType;
    const int64_t needed = type == 4 ? bm::Pixels(count) * 3
                           : type == 1 || (type == 2 && bitmap->bitsPerPixel == 1)
                               ? tessarine::storage::RunBytes(1, x, bm::Pixels(count))
                               : bm::OwnRunBytes(bitmap, x, count);
    return bm::SetRowSteps(bitmap, y, x, count, needed, [&](uint8_t *row, int64_t) {
        if (type != 3)
            return bm::BI_PackRGBRow(type, bitmap->bitsPerPixel, r, g, b, x, count, row,
                                     bitmap->colorCount, bitmap->colorIndex);
        const bm::TableView table(bitmap->colorTable);
        const int32_t entries = static_cast<int32_t>(
            std::clamp<int64_t>(table.Size() / 3, 0, std::max(bitmap->colorCount, 0)));
        return bm::BI_PackRGBRow(type, bitmap->bitsPerPixel, r, g, b, x, count, row,
                                 bitmap->colorCount, bitmap->colorIndex, table.Bytes(), entries);
    });
}

TESSARINE_API int32_t BI_SetRGBRowInterlace(int32_t y, int32_t x, int32_t count,
                                            const uint8_t *rgb, BI_Bitmap *bitmap) {
    const int64_t n = bm::Pixels(count);
    return bm::SetRowSteps(bitmap, y, x, count, n * 3, [&](uint8_t *row, int64_t) {
        std::memcpy(row, rgb, static_cast<size_t>(n * 3));
        return kOk;
    });
}

TESSARINE_API int32_t BI_SetBGRRowInterlace(int32_t y, int32_t x, int32_t count,
                                            const uint8_t *bgr, BI_Bitmap *bitmap) {
    const int64_t n = bm::Pixels(count);
    return bm::SetRowSteps(bitmap, y, x, count, n * 3, [&](uint8_t *row, int64_t) {
        for (int64_t i = 0; i < n; ++i, row += 3, bgr += 3) {
            row[0] = bgr[2];
            row[1] = bgr[1];
            row[2] = bgr[0];
        }
        return kOk;
    });
}

}  // extern "C"
