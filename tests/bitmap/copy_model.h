// A per-pixel model of the planar copy between two bitmaps of different
// layouts: what the row getters read, how values are mapped or searched, and
// what the row setters write.
#pragma once

#include <cstdint>
#include <cstring>
#include <vector>

#include <tessarine/tessarine.h>

#include "row_model.h"

namespace copytest {

using Bytes = std::vector<uint8_t>;

struct Side {
    rowtest::Layout layout;
    Bytes table;  // as the bitmap holds it: colorCount entries of 3 or 4 bytes
};

inline uint8_t TableAt(const Side &s, int64_t i) { return rowtest::TableByte(s.table, i); }

// The three channels the RGB getter gives for pixel i of a run from sx.
inline void RgbOf(const Side &s, const rowtest::Image &img, int y, int64_t sx, int64_t i,
                  uint8_t rgb[3]) {
    const auto &l = s.layout;
    const uint8_t *row = img.rows[y].data();
    if (l.type == 4) {
        for (int k = 0; k < 3; ++k) rgb[k] = row[(sx * l.d) / 8 + 3 * i + k];
        return;
    }
    const uint32_t v = img.Pixel(y, sx + i);
    if (l.type == 1 || (l.type == 2 && l.d == 1)) {
        rgb[0] = rgb[1] = rgb[2] = v ? 0 : 255;
    } else if (l.type == 2 && l.d == 4) {
        const auto w = static_cast<uint8_t>(v << 4);
        rgb[0] = rgb[1] = rgb[2] = w == 0 ? 255 : static_cast<uint8_t>(~w);
    } else if (l.type == 2) {
        rgb[0] = rgb[1] = rgb[2] = static_cast<uint8_t>(255 - v);
    } else {
        for (int k = 0; k < 3; ++k) rgb[k] = TableAt(s, int64_t{v} * 3 + k);
    }
}

// The four planes the CMYK getter gives; false where it gives -2.
inline bool CmykOf(const Side &s, const rowtest::Image &img, int y, int64_t sx, int64_t i,
                   uint8_t cmyk[4]) {
    const auto &l = s.layout;
    const uint8_t *row = img.rows[y].data();
    if (l.type == 4) {
        for (int k = 0; k < 4; ++k) cmyk[k] = row[(sx * l.d) / 8 + 4 * i + k];
        return true;
    }
    if (l.type != 3) return false;
    const uint32_t v = img.Pixel(y, sx + i);
    for (int k = 0; k < 4; ++k) cmyk[k] = TableAt(s, int64_t{v} * 4 + k);
    return true;
}

inline uint8_t CmykNearestModel(const uint8_t c[4], int32_t count, const uint8_t *e) {
    int64_t best = INT64_MAX;
    uint8_t index = 0;
    for (int32_t i = 0; i < count; ++i) {
        int64_t d = 0;
        for (int k = 0; k < 4; ++k) d += (int64_t{e[4 * i + k]} - c[k]) * (int64_t{e[4 * i + k]} - c[k]);
        if (d < best) {
            best = d;
            index = static_cast<uint8_t>(i);
        }
    }
    return index;
}

// The implied tables of gray and black-and-white layouts.
inline Bytes ImpliedRgb(const rowtest::Layout &l) {
    const int d = l.type == 1 ? 1 : l.d;
    Bytes t;
    for (int i = 0; i < (1 << d); ++i) {
        const uint8_t v = d == 1 ? (i ? 0 : 255) : d == 4 ? static_cast<uint8_t>((15 - i) * 17)
                                                           : static_cast<uint8_t>(255 - i);
        t.insert(t.end(), {v, v, v});
    }
    return t;
}
inline Bytes ImpliedCmyk(const rowtest::Layout &l) {
    const int d = l.type == 1 ? 1 : l.d;
    Bytes t;
    for (int i = 0; i < (1 << d); ++i)
        t.insert(t.end(), {0, 0, 0, static_cast<uint8_t>(d == 1 ? (i ? 255 : 0) : d == 4 ? i * 17 : i)});
    return t;
}

// Writes index value v as the index setter does: values at or above the
// destination's colour count become 0 first.
inline void PutIndex(const Side &d, rowtest::Image &img, int y, int64_t x, uint32_t v) {
    if (static_cast<int64_t>(v) >= d.layout.colors) v = 0;
    const int depth = d.layout.d;
    if (depth == 1) v = v != 0;
    if (depth == 4) v &= 15;
    rowtest::Image::SetPixelOf(img.rows[y].data(), x, depth, v);
}

struct Expected {
    int32_t status = TS_OK;
    int rows = 0;  // rows of the rectangle written
};

// The planar copy of the source rectangle into the destination image, pixel
// by pixel. `map` is the map table the library gives for the pair.
inline Expected PlanarModel(const Side &s, const rowtest::Image &src, const RECT &sr,
                            const Side &d, rowtest::Image &dst, const RECT &dr,
                            const uint8_t *map, int32_t mapStatus) {
    const auto &sl = s.layout, &dl = d.layout;
    const int64_t w = sr.right - sr.left;
    const int h = sr.bottom - sr.top;
    Expected e{TS_OK, h};
    auto eachPixel = [&](auto &&pixel) {
        for (int r = 0; r < h; ++r)
            for (int64_t i = 0; i < w; ++i) pixel(sr.top + r, dr.top + r, i);
    };
    if (dl.type == 4) {
        if (dl.model == 1) {
            eachPixel([&](int sy, int dy, int64_t i) {
                uint8_t rgb[3];
                RgbOf(s, src, sy, sr.left, i, rgb);
                std::memcpy(dst.rows[dy].data() + 3 * (dr.left + i), rgb, 3);
            });
        } else if (dl.model == 2) {
            if (sl.type != 3 && sl.type != 4) return {-2, 0};
            eachPixel([&](int sy, int dy, int64_t i) {
                uint8_t cmyk[4];
                CmykOf(s, src, sy, sr.left, i, cmyk);
                std::memcpy(dst.rows[dy].data() + 4 * (dr.left + i), cmyk, 4);
            });
        }
        return e;
    }
    if (sl.type != 4) {
        if (mapStatus != TS_OK) return {mapStatus, 0};
        eachPixel([&](int sy, int dy, int64_t i) {
            PutIndex(d, dst, dy, dr.left + i, map[src.Pixel(sy, sr.left + i)]);
        });
        return e;
    }
    const bool level = dl.type == 1 || dl.type == 2;
    if (sl.model == 1) {
        if (dl.type == 3 && dl.model != 1) return {-1, 0};
        const Bytes table = level ? ImpliedRgb(dl) : d.table;
        const int32_t count = level ? static_cast<int32_t>(table.size() / 3) : dl.colors;
        eachPixel([&](int sy, int dy, int64_t i) {
            uint8_t rgb[3];
            RgbOf(s, src, sy, sr.left, i, rgb);
            PutIndex(d, dst, dy, dr.left + i, BI_RGBMapToColorIndex(rgb[0], rgb[1], rgb[2], count, table.data()));
        });
        return e;
    }
    if (dl.type == 3 && dl.model != 2) return {-1, 0};
    const Bytes table = level ? ImpliedCmyk(dl) : d.table;
    const int32_t count = level ? static_cast<int32_t>(table.size() / 4) : dl.colors;
    eachPixel([&](int sy, int dy, int64_t i) {
        uint8_t cmyk[4];
        CmykOf(s, src, sy, sr.left, i, cmyk);
        PutIndex(d, dst, dy, dr.left + i, CmykNearestModel(cmyk, count, table.data()));
    });
    return e;
}

}  // namespace copytest
