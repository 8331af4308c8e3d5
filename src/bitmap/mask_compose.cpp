// A rectangle of one bitmap painted over another of any layout through a
// 1-bit mask in memory: equal layouts go the direct way, the others row by
// row on unpacked planes, converting only the pixels under set mask bits.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <cstring>

#include "bitmap/color_tables.h"
#include "core/block_guards.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::Failed;
using tessarine::kErrGeneral;
using tessarine::kErrMemory;
using tessarine::kOk;

namespace {

bool TileOnly(const BI_Bitmap *b) {
    return !(b->storage & BI_STORAGE_MEMORY) && (b->storage & BI_STORAGE_TILEFILE);
}

// Ends the row transfers of both bitmaps on every exit.
class Transfers {
  public:
    Transfers(BI_Bitmap *a, BI_Bitmap *b) : a_(a), b_(b) {}
    ~Transfers() {
        HVT_TileFileRowColIOEnd(a_);
        HVT_TileFileRowColIOEnd(b_);
    }
    Transfers(const Transfers &) = delete;
    Transfers &operator=(const Transfers &) = delete;

  private:
    BI_Bitmap *a_, *b_;
};

// Up to eight zero-filled planes of one row, freed together.
class Planes {
  public:
    Planes() = default;
    Planes(const Planes &) = delete;
    Planes &operator=(const Planes &) = delete;
    ~Planes() {
        for (int i = 0; i < count_; ++i) MEM_FreeHdl(plane_[i]);
    }
    bool Make(int n, int32_t width) {
        for (int i = 0; i < n; ++i) {
            auto *p = static_cast<uint8_t *>(
                width < 0 ? nullptr : MEM_AllocPtr(MEM_FLAG_ZERO, static_cast<uint32_t>(width)));
            if (p == nullptr) return false;
            plane_[count_++] = p;
        }
        return true;
    }
    uint8_t *operator[](int i) const { return plane_[i]; }

  private:
    uint8_t *plane_[8] = {};
    int count_ = 0;
};

enum class Kind { None, Rgb, Cmyk, RgbToIndex, CmykToIndex, IndexToIndex };

Kind KindOf(const BI_Bitmap *src, const BI_Bitmap *dst) {
    if (dst->imageType == 4)
        return dst->colorModel == 1 ? Kind::Rgb : dst->colorModel == 2 ? Kind::Cmyk : Kind::None;
    if (src->imageType == 4)
        return src->colorModel == 1   ? Kind::RgbToIndex
               : src->colorModel == 2 ? Kind::CmykToIndex
                                      : Kind::None;
    return Kind::IndexToIndex;
}

int PlaneCount(Kind k) {
    switch (k) {
        case Kind::Rgb: return 6;
        case Kind::Cmyk: return 8;
        case Kind::RgbToIndex: return 4;
        case Kind::CmykToIndex: return 5;
        case Kind::IndexToIndex: return 2;
        default: return 0;
    }
}

// Calls apply(i) for every set mask bit of the row, i from 0 below width.
// The caller has cleared the bits in front of the phase.
template <class Apply>
void ForEachSetBit(const uint8_t *m, int phase, int32_t width, Apply &&apply) {
    int64_t i = -phase;
    while (i < width) {
        const unsigned b = *m++;
        if (b == 0) {
            i += 8;
            continue;
        }
        for (int j = 0; j < 8; ++j, ++i) {
            if (i >= width) return;
            if (b & (0x80u >> j)) apply(static_cast<int32_t>(i));
        }
    }
}

// Zero-filled, so that values a table getter does not reach map to 0.
struct Tables {
    uint8_t entries[256 * 4] = {};
    int32_t count = 0;
    uint8_t map[256] = {};
};

int32_t ReadTables(Kind kind, const BI_Bitmap *src, const BI_Bitmap *dst, Tables *t) {
    // Gray and black-and-white tables are implied and report no count.
    t->count = dst->bitsPerPixel <= 8 ? 1 << dst->bitsPerPixel : 0;
    switch (kind) {
        case Kind::RgbToIndex:
            if (dst->imageType == 3 && dst->colorCount > 256) return kErrGeneral;
            return BI_GetRGBColorTable(dst, &t->count, t->entries);
        case Kind::CmykToIndex:
            if (dst->imageType == 3 && dst->colorCount > 256) return kErrGeneral;
            return BI_GetCMYKColorTable(dst, &t->count, t->entries);
        case Kind::IndexToIndex: return BI_GetMapTable(src, dst, t->map);
        default: return kOk;
    }
}

struct Rows {
    BI_Bitmap *src, *dst;
    int32_t sx, dx, width;
    Kind kind;
    const Planes &p;
    const Tables &t;

    int32_t Read(int32_t sy, int32_t dy) const {
        int32_t s;
        switch (kind) {
            case Kind::Rgb:
                s = BI_GetRGBRow(src, sy, sx, width, p[0], p[1], p[2]);
                return Failed(s) ? s : BI_GetRGBRow(dst, dy, dx, width, p[3], p[4], p[5]);
            case Kind::Cmyk:
                s = BI_GetCMYKRow(src, sy, sx, width, p[0], p[1], p[2], p[3]);
                return Failed(s) ? s : BI_GetCMYKRow(dst, dy, dx, width, p[4], p[5], p[6], p[7]);
            case Kind::RgbToIndex:
                s = BI_GetRGBRow(src, sy, sx, width, p[0], p[1], p[2]);
                return Failed(s) ? s : BI_GetIndexRow(dst, dy, dx, width, p[3]);
            case Kind::CmykToIndex:
                s = BI_GetCMYKRow(src, sy, sx, width, p[0], p[1], p[2], p[3]);
                return Failed(s) ? s : BI_GetIndexRow(dst, dy, dx, width, p[4]);
            default:
                s = BI_GetIndexRow(src, sy, sx, width, p[0]);
                return Failed(s) ? s : BI_GetIndexRow(dst, dy, dx, width, p[1]);
        }
    }

    void Paint(const uint8_t *m, int phase) const {
        switch (kind) {
            case Kind::Rgb:
                ForEachSetBit(m, phase, width, [&](int32_t i) {
                    p[3][i] = p[0][i];
                    p[4][i] = p[1][i];
                    p[5][i] = p[2][i];
                });
                return;
            case Kind::Cmyk:
                ForEachSetBit(m, phase, width, [&](int32_t i) {
                    p[4][i] = p[0][i];
                    p[5][i] = p[1][i];
                    p[6][i] = p[2][i];
                    p[7][i] = p[3][i];
                });
                return;
            case Kind::RgbToIndex:
                ForEachSetBit(m, phase, width, [&](int32_t i) {
                    p[3][i] = BI_RGBMapToColorIndex(p[0][i], p[1][i], p[2][i], t.count, t.entries);
                });
                return;
            case Kind::CmykToIndex:
                ForEachSetBit(m, phase, width, [&](int32_t i) {
                    p[4][i] = bm::CmykNearest(p[0][i], p[1][i], p[2][i], p[3][i], t.count, t.entries);
                });
                return;
            default:
                ForEachSetBit(m, phase, width, [&](int32_t i) { p[1][i] = t.map[p[0][i]]; });
                return;
        }
    }

    int32_t Write(int32_t dy) const {
        switch (kind) {
            case Kind::Rgb: return BI_SetRGBRow(dy, dx, width, p[3], p[4], p[5], dst);
            case Kind::Cmyk: return BI_SetCMYKRow(dy, dx, width, p[4], p[5], p[6], p[7], dst);
            case Kind::RgbToIndex: return BI_SetIndexRow(dy, dx, width, p[3], dst);
            case Kind::CmykToIndex: return BI_SetIndexRow(dy, dx, width, p[4], dst);
            default: return BI_SetIndexRow(dy, dx, width, p[1], dst);
        }
    }
};

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_MaskBmp(const RECT *sourceRect, BI_Bitmap *source, int32_t maskStride,
                                 int32_t maskX, int32_t maskY, uint8_t *maskBase,
                                 const RECT *destinationRect, BI_Bitmap *destination) {
    if (source->imageType == destination->imageType &&
        source->bitsPerPixel == destination->bitsPerPixel)
        return BI_DirectMaskBmp(sourceRect, source, maskStride, maskX, maskY, maskBase,
                                destinationRect, destination);
    const RECT sr = *sourceRect, dr = *destinationRect;
    const Transfers transfers(source, destination);
    int32_t status = kOk;
    if (TileOnly(source)) status = HVT_TileFileRowIOBegin(1, source, &sr, 2, 0, 0);
    if (!Failed(status) && TileOnly(destination))
        status = HVT_TileFileRowIOBegin(3, destination, &dr, 2, 0, 0);
    if (Failed(status)) return status;

    // The phase is added as a count of bytes: a mask x of 8 or more starts at
    // the byte of x & 7, not x >> 3.
    const int phase = maskX & 7;
    uint8_t *maskRow = maskBase + int64_t{maskY} * maskStride + phase;

    const Kind kind = KindOf(source, destination);
    if (kind == Kind::None) return kOk;
    Tables tables;
    status = ReadTables(kind, source, destination, &tables);
    if (Failed(status)) return status;
    const int64_t wide = int64_t{sr.right} - sr.left;
    const auto width = static_cast<int32_t>(wide);
    Planes planes;
    if (!planes.Make(PlaneCount(kind), width)) return kErrMemory;
    const Rows rows{source, destination, sr.left, dr.left, width, kind, planes, tables};

    int32_t dy = dr.top;
    for (int32_t sy = sr.top; sy < sr.bottom; ++sy, ++dy, maskRow += maskStride) {
        status = rows.Read(sy, dy);
        if (Failed(status)) return status;
        const uint8_t saved = maskRow[0];
        maskRow[0] = static_cast<uint8_t>(saved & (0xFFu >> phase));
        rows.Paint(maskRow, phase);
        maskRow[0] = saved;
        status = rows.Write(dy);
        if (Failed(status)) return status;
    }
    return status;
}

}  // extern "C"
