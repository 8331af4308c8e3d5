// Copying a rectangle between bitmaps of any two layouts: the direct route
// when the layouts agree, planes of one byte per channel otherwise.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <cstdint>

#include "bitmap/color_tables.h"
#include "bitmap/copy_steps.h"
#include "core/status.h"

namespace bm = tessarine::bitmap;
using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kOk;

namespace {

struct CopyRows {
    const RECT &sourceRect;
    BI_Bitmap *source;
    const RECT &destinationRect;
    BI_Bitmap *destination;
    int32_t width;

    // Runs `row(sourceY, destinationY)` from the source rectangle's top to its
    // bottom; a failed row ends the run with its status.
    template <class Row>
    int32_t Each(Row &&row) const {
        int32_t dy = destinationRect.top;
        for (int64_t sy = sourceRect.top; sy < sourceRect.bottom; ++sy, ++dy) {
            const int32_t status = row(static_cast<int32_t>(sy), dy);
            if (Failed(status)) return status;
        }
        return kOk;
    }
};

// The entries a nearest search runs over: the count the getter reports for an
// indexed destination, and 1 << d for gray and black-and-white ones, whose
// getter reports none.
int32_t SearchCount(const BI_Bitmap *d, int32_t reported) {
    if (d->imageType == 1 || d->imageType == 2) return 1 << (d->imageType == 1 ? 1 : d->bitsPerPixel);
    return reported;
}

int32_t PlanarCopy(const CopyRows &c) {
    BI_Bitmap *s = c.source;
    BI_Bitmap *d = c.destination;
    const int32_t sx = c.sourceRect.left, dx = c.destinationRect.left, w = c.width;
    bm::Planes planes;
    if (d->imageType == 4) {
        if (d->colorModel == 1) {
            if (int32_t st = planes.Allocate(3, w); Failed(st)) return st;
            return c.Each([&](int32_t sy, int32_t dy) {
                int32_t st = BI_GetRGBRow(s, sy, sx, w, planes[0], planes[1], planes[2]);
                if (!Failed(st)) st = BI_SetRGBRow(dy, dx, w, planes[0], planes[1], planes[2], d);
                return st;
            });
        }
        if (d->colorModel == 2) {
            if (int32_t st = planes.Allocate(4, w); Failed(st)) return st;
            return c.Each([&](int32_t sy, int32_t dy) {
                int32_t st = BI_GetCMYKRow(s, sy, sx, w, planes[0], planes[1], planes[2], planes[3]);
                if (!Failed(st))
                    st = BI_SetCMYKRow(dy, dx, w, planes[0], planes[1], planes[2], planes[3], d);
                return st;
            });
        }
        return kOk;
    }
    if (s->imageType != 4) {
        uint8_t map[256] = {};
        if (int32_t st = BI_GetMapTable(s, d, map); Failed(st)) return st;
        if (int32_t st = planes.Allocate(1, w); Failed(st)) return st;
        return c.Each([&](int32_t sy, int32_t dy) {
            uint8_t *v = planes[0];
            int32_t st = BI_GetIndexRow(s, sy, sx, w, v);
            if (Failed(st)) return st;
            for (int32_t i = 0; i < w; ++i) v[i] = map[v[i]];
            return BI_SetIndexRow(dy, dx, w, v, d);
        });
    }
    if (s->colorModel == 1) {
        uint8_t table[256 * 3] = {};
        int32_t count = 0;
        if (d->imageType == 3 && d->colorCount > 256) return kErrArgument;  // more than the table holds
        if (int32_t st = BI_GetRGBColorTable(d, &count, table); Failed(st)) return st;
        count = SearchCount(d, count);
        if (int32_t st = planes.Allocate(3, w); Failed(st)) return st;
        return c.Each([&](int32_t sy, int32_t dy) {
            uint8_t *r = planes[0], *g = planes[1], *b = planes[2];
            int32_t st = BI_GetRGBRow(s, sy, sx, w, r, g, b);
            if (Failed(st)) return st;
            // Rows hold runs of one colour: the last search is kept.
            uint32_t lastKey = UINT32_MAX;
            uint8_t last = 0;
            for (int32_t i = 0; i < w; ++i) {
                const uint32_t key = bm::ColorKey(r[i], g[i], b[i]);
                if (key != lastKey) {
                    last = BI_RGBMapToColorIndex(r[i], g[i], b[i], count, table);
                    lastKey = key;
                }
                r[i] = last;
            }
            return BI_SetIndexRow(dy, dx, w, r, d);
        });
    }
    if (s->colorModel == 2) {
        uint8_t table[256 * 4] = {};
        int32_t count = 0;
        if (d->imageType == 3 && d->colorCount > 256) return kErrArgument;
        if (int32_t st = BI_GetCMYKColorTable(d, &count, table); Failed(st)) return st;
        count = SearchCount(d, count);
        if (int32_t st = planes.Allocate(4, w); Failed(st)) return st;
        return c.Each([&](int32_t sy, int32_t dy) {
            uint8_t *p[4] = {planes[0], planes[1], planes[2], planes[3]};
            int32_t st = BI_GetCMYKRow(s, sy, sx, w, p[0], p[1], p[2], p[3]);
            if (Failed(st)) return st;
            uint64_t lastKey = UINT64_MAX;
            uint8_t last = 0;
            for (int32_t i = 0; i < w; ++i) {
                const uint64_t key = uint64_t{p[0][i]} | uint64_t{p[1][i]} << 8 |
                                     uint64_t{p[2][i]} << 16 | uint64_t{p[3][i]} << 24;
                if (key != lastKey) {
                    last = bm::CmykNearest(p[0][i], p[1][i], p[2][i], p[3][i], count, table);
                    lastKey = key;
                }
                p[0][i] = last;
            }
            return BI_SetIndexRow(dy, dx, w, p[0], d);
        });
    }
    return kOk;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_CopyBmp(const RECT *sourceRect, BI_Bitmap *source,
                                 const RECT *destinationRect, BI_Bitmap *destination,
                                 uint8_t sourceSub, uint8_t destinationSub) {
    const bool direct = source->imageType == destination->imageType &&
                        source->bitsPerPixel == destination->bitsPerPixel;
    if (!direct && !bm::CopyTransfersFit(source, destination)) return kErrArgument;
    int32_t status = kOk;
    if (direct) {
        status = BI_DirectCopyBmp(sourceRect, source, destinationRect, destination, sourceSub,
                                  destinationSub);
    } else {
        int32_t width = 0;
        if (!bm::RectExtent(*sourceRect, &width)) {
            status = kErrArgument;
        } else {
            status = bm::BeginCopyTransfers(source, sourceRect, sourceSub, destination,
                                            destinationRect, destinationSub);
            if (!Failed(status))
                status = PlanarCopy(CopyRows{*sourceRect, source, *destinationRect, destination, width});
        }
    }
    bm::HandOnProfile(source, destination);
    HVT_TileFileRowColIOEnd(source);
    HVT_TileFileRowColIOEnd(destination);
    return status;
}

}  // extern "C"
