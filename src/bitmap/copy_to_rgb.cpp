// Copying into RGB true colour through the device formula or a colour match:
// indexed CMYK, true-colour CMYK and gray sources.
#include <tessarine/bitmap.h>
#include <tessarine/color.h>
#include <tessarine/core.h>
#include <tessarine/profile.hpp>
#include <tessarine/storage.h>

#include <cstdint>

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

// One call of the match: `count` colours from `inFormat` to RGB. Its result
// is not looked at; the destination keeps the record's second path.
void Match(const BI_ColorMatch *m, int16_t inFormat, int32_t count, void *in, void *out,
           BI_Bitmap *destination) {
    CX_ColorBuffer input{inFormat, count, in};
    CX_ColorBuffer output{CX_FORMAT_RGB, count, out};
    (void)R27_XQMatchColors(m->source, m->destination, m->proofing, m->abstractProfile, &input,
                            &output, m->intent, m->flags, 0);
    bm::ReplaceProfile(destination, m->destination);
}

uint8_t *AllocateBuffer(int64_t bytes) {
    if (bytes < 1) bytes = 1;
    if (bytes > UINT32_MAX) return nullptr;
    return static_cast<uint8_t *>(MEM_AllocPtr(0, static_cast<uint32_t>(bytes)));
}

void Spread(const uint8_t *rgb, int32_t n, uint8_t *r, uint8_t *g, uint8_t *b) {
    for (int32_t i = 0; i < n; ++i, rgb += 3) {
        r[i] = rgb[0];
        g[i] = rgb[1];
        b[i] = rgb[2];
    }
}

struct Job {
    const RECT &sourceRect;
    BI_Bitmap *source;
    const RECT &destinationRect;
    BI_Bitmap *destination;
    const BI_ColorMatch *match;
    int32_t width;

    template <class Row>
    int32_t EachRow(Row &&row) const {
        int32_t dy = destinationRect.top;
        for (int64_t sy = sourceRect.top; sy < sourceRect.bottom; ++sy, ++dy) {
            const int32_t status = row(static_cast<int32_t>(sy), dy);
            if (Failed(status)) return status;
        }
        return kOk;
    }
};

int32_t FromIndexedCmyk(const Job &j) {
    uint8_t cmyk[256 * 4] = {};
    uint8_t rgb[256 * 3] = {};
    int32_t count = 0;
    if (j.source->colorCount > 256) return kErrArgument;  // more than the tables hold
    if (int32_t st = BI_GetCMYKColorTable(j.source, &count, cmyk); Failed(st)) return st;
    if (j.match == nullptr) {
        for (int32_t i = 0; i < count; ++i) CX_SWOPCmyk2SRgb(cmyk + 4 * i, rgb + 3 * i);
    } else {
        Match(j.match, CX_FORMAT_CMYK, count, cmyk, rgb, j.destination);
    }
    bm::Planes planes;
    if (int32_t st = planes.Allocate(3, j.width); Failed(st)) return st;
    const int32_t sx = j.sourceRect.left, dx = j.destinationRect.left, w = j.width;
    return j.EachRow([&](int32_t sy, int32_t dy) {
        uint8_t *r = planes[0], *g = planes[1], *b = planes[2];
        int32_t st = BI_GetIndexRow(j.source, sy, sx, w, r);
        if (Failed(st)) return st;
        for (int32_t i = 0; i < w; ++i) {
            const uint8_t *e = rgb + 3 * r[i];
            r[i] = e[0];
            g[i] = e[1];
            b[i] = e[2];
        }
        return BI_SetRGBRow(dy, dx, w, r, g, b, j.destination);
    });
}

int32_t FromCmyk(const Job &j) {
    const int32_t sx = j.sourceRect.left, dx = j.destinationRect.left, w = j.width;
    bm::Planes planes;
    if (int32_t st = planes.Allocate(4, w); Failed(st)) return st;
    FreeGuard inGuard, outGuard;
    uint8_t *in = nullptr, *out = nullptr;
    if (j.match != nullptr) {
        in = AllocateBuffer(int64_t{w} * 4);
        inGuard.Reset(in);
        out = AllocateBuffer(int64_t{w} * 3);
        outGuard.Reset(out);
        if (in == nullptr || out == nullptr) return kErrMemory;
    }
    return j.EachRow([&](int32_t sy, int32_t dy) {
        uint8_t *c = planes[0], *m = planes[1], *y = planes[2], *k = planes[3];
        int32_t st = BI_GetCMYKRow(j.source, sy, sx, w, c, m, y, k);
        if (Failed(st)) return st;
        if (j.match == nullptr) {
            for (int32_t i = 0; i < w; ++i) {
                const uint8_t px[4] = {c[i], m[i], y[i], k[i]};
                uint8_t rgb[3];
                CX_SWOPCmyk2SRgb(px, rgb);
                c[i] = rgb[0];
                m[i] = rgb[1];
                y[i] = rgb[2];
            }
        } else {
            for (int32_t i = 0; i < w; ++i) {
                in[4 * i] = c[i];
                in[4 * i + 1] = m[i];
                in[4 * i + 2] = y[i];
                in[4 * i + 3] = k[i];
            }
            Match(j.match, CX_FORMAT_CMYK, w, in, out, j.destination);
            Spread(out, w, c, m, y);
        }
        return BI_SetRGBRow(dy, dx, w, c, m, y, j.destination);
    });
}

int32_t FromGray(const Job &j) {
    const int32_t sx = j.sourceRect.left, dx = j.destinationRect.left, w = j.width;
    bm::Planes planes;
    if (int32_t st = planes.Allocate(3, w); Failed(st)) return st;
    FreeGuard outGuard;
    uint8_t *out = nullptr;
    if (j.match != nullptr) {
        out = AllocateBuffer(int64_t{w} * 3);
        outGuard.Reset(out);
        if (out == nullptr) return kErrMemory;
    }
    return j.EachRow([&](int32_t sy, int32_t dy) {
        uint8_t *r = planes[0], *g = planes[1], *b = planes[2];
        int32_t st = BI_GetRGBRow(j.source, sy, sx, w, r, g, b);
        if (Failed(st)) return st;
        if (j.match != nullptr) {
            Match(j.match, CX_FORMAT_GRAY, w, r, out, j.destination);
            Spread(out, w, r, g, b);
        }
        return BI_SetRGBRow(dy, dx, w, r, g, b, j.destination);
    });
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_CopyBmpToRGBTrueColor(const RECT *sourceRect, BI_Bitmap *source,
                                               const RECT *destinationRect,
                                               BI_Bitmap *destination, uint8_t sourceSub,
                                               uint8_t destinationSub,
                                               const BI_ColorMatch *match) {
    int32_t width = 0;
    if (!bm::RectExtent(*sourceRect, &width) || !bm::CopyTransfersFit(source, destination))
        return kErrArgument;
    int32_t status = bm::BeginCopyTransfers(source, sourceRect, sourceSub, destination,
                                            destinationRect, destinationSub);
    if (!Failed(status)) {
        const Job job{*sourceRect, source, *destinationRect, destination, match, width};
        if (source->imageType == 3 && source->colorModel == 2)
            status = FromIndexedCmyk(job);
        else if (source->imageType == 4 && source->colorModel == 2)
            status = FromCmyk(job);
        else if (source->imageType == 2)
            status = FromGray(job);
        else
            status = kErrUnsupported;
    }
    HVT_TileFileRowColIOEnd(source);
    HVT_TileFileRowColIOEnd(destination);
    return status;
}

}  // extern "C"
