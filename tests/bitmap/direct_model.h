// A model of the direct copy and direct mask of bitmaps, step by step as
// their routes are defined: whole images held as flat rows, the tile buffer
// and the block buffer of a call simulated with their own contents. Bytes a
// call finds in a buffer before it has written them are not known; the model
// runs twice, with those bytes 0x00 and 0xFF, and only bits that agree are
// compared.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <random>
#include <vector>

#include <tessarine/tessarine.h>

#include "row_bits_model.h"

namespace dmodel {

using rowbits::Bytes;

struct Img {
    int32_t w = 0, h = 0, d = 0;
    int64_t stride = 0;  // bytesPerRow in memory; the unpadded row in a tile file
    Bytes px;
    Img() = default;
    Img(int32_t width, int32_t height, int32_t depth, int64_t rowStride)
        : w(width), h(height), d(depth), stride(rowStride), px(rowStride * height + 64, 0) {}
    uint8_t *Row(int64_t y) { return px.data() + y * stride; }
};

struct Mask {
    Bytes bytes;
    int64_t stride = 0;
    int32_t x = 0, y = 0;
};

// Row by row over an area, as the block movers are defined.
inline void Move(bool masked, int d, const uint8_t *sBase, int64_t sStride, const RECT &r,
                 uint8_t *tBase, int64_t tStride, int64_t x, int64_t y, const Mask *mask,
                 int64_t mx, int64_t my) {
    const int w = r.right - r.left;
    if (!masked && (w <= 0 || r.bottom <= r.top)) return;
    for (int row = 0; row < r.bottom - r.top; ++row) {
        const uint8_t *s = sBase + (r.top + row) * sStride + ((int64_t{d} * r.left) >> 3);
        uint8_t *t = tBase + (y + row) * tStride + ((d * x) >> 3);
        if (!masked) {
            if (d == 1) rowbits::CopyRow1(w, r.left & 7, s, x & 7, t);
            else if (d == 4) rowbits::CopyRow4(w, r.left & 1, s, x & 1, t);
            else std::memcpy(t, s, static_cast<size_t>(d / 8 * w));
            continue;
        }
        const uint8_t *m = mask->bytes.data() + (my + row) * mask->stride + (mx >> 3);
        const int mp = static_cast<int>(mx & 7);
        if (d == 1) {
            rowbits::MaskRow1(w, r.left & 7, s, mp, m, x & 7, t);
        } else if (d == 4) {
            rowbits::MaskRow4(w, r.left & 1, s, mp, m, x & 1, t);
        } else {
            for (int i = 0; i < w; ++i)
                if (rowbits::Bit(m, mp + i)) std::memcpy(t + i * d / 8, s + i * d / 8, d / 8);
        }
    }
}

struct Tile {
    int32_t left, top, right, bottom;
};

// The tiles of a sub-bitmap that R meets, band by band, left to right.
inline std::vector<Tile> TilesMet(int32_t w, int32_t h, const RECT &R) {
    std::vector<Tile> out;
    for (int32_t top = 0; top < h; top += 1024)
        for (int32_t left = 0; left < w; left += 8192) {
            const Tile t{left, top, std::min(left + 8192, w), std::min(top + 1024, h)};
            if (std::max(t.left, R.left) < std::min(t.right, R.right) &&
                std::max(t.top, R.top) < std::min(t.bottom, R.bottom))
                out.push_back(t);
        }
    return out;
}

inline RECT Inter(const Tile &t, const RECT &R) {
    return {std::max(t.left, R.left), std::max(t.top, R.top), std::min(t.right, R.right),
            std::min(t.bottom, R.bottom)};
}

struct Call {
    bool masked;
    int d;
    RECT sr, dr;
    const Mask *mask;
};

struct Counts {
    int reads = 0, writes = 0, blocks = 0;
};

// Runs the route given by the two storages; `stale` fills buffer bytes the
// call has not written yet.
inline Counts Run(const Call &c, const Img &srcImg, bool srcTiled, Img &dst, bool dstTiled,
                  uint8_t stale) {
    Img &src = const_cast<Img &>(srcImg);  // read only
    Counts n;
    const int d = c.d;
    const int64_t dx = int64_t{c.sr.left} - c.dr.left, dy = int64_t{c.sr.top} - c.dr.top;
    const Mask *m = c.mask;
    auto maskX = [&](int64_t destX) { return m ? m->x + (destX - c.dr.left) : 0; };
    auto maskY = [&](int64_t destY) { return m ? m->y + (destY - c.dr.top) : 0; };
    if (!srcTiled && !dstTiled) {
        Move(c.masked, d, src.px.data(), src.stride, c.sr, dst.px.data(), dst.stride, c.dr.left,
             c.dr.top, m, maskX(c.dr.left), maskY(c.dr.top));
        return n;
    }
    // The rows a call can fill, and a few bytes past them: all the movers see.
    const int64_t rowsHeld = std::max(c.dr.bottom - c.dr.top, c.sr.bottom - c.sr.top) + 2;
    Bytes tileBuf(rowsHeld * ((8192 * int64_t{d} + 7) >> 3) + 64, stale);
    auto tileStride = [&](const Tile &t) { return ((int64_t{t.right} - t.left) * d + 7) >> 3; };
    auto readTile = [&](Img &img, const Tile &t, int32_t firstRow, int32_t rows) {
        const int64_t T = tileStride(t);
        for (int r = 0; r < rows; ++r)
            std::memcpy(tileBuf.data() + r * T, img.Row(t.top + firstRow + r) + ((int64_t{t.left} * d) >> 3), T);
        ++n.reads;
    };
    auto saveTile = [&](Img &img, const Tile &t, int32_t firstRow, int32_t rows) {
        const int64_t T = tileStride(t);
        for (int r = 0; r < rows; ++r)
            std::memcpy(img.Row(t.top + firstRow + r) + ((int64_t{t.left} * d) >> 3), tileBuf.data() + r * T, T);
        ++n.writes;
    };
    if (!srcTiled) {  // memory to tile
        for (const Tile &t : TilesMet(dst.w, dst.h, c.dr)) {
            const RECT I = Inter(t, c.dr);
            const int32_t firstRow = I.top - t.top, rows = I.bottom - I.top;
            if (c.masked || I.left != t.left || I.right != t.right) readTile(dst, t, firstRow, rows);
            const RECT from{static_cast<int32_t>(I.left + dx), static_cast<int32_t>(I.top + dy),
                            static_cast<int32_t>(I.right + dx), static_cast<int32_t>(I.bottom + dy)};
            Move(c.masked, d, src.px.data(), src.stride, from, tileBuf.data(), tileStride(t),
                 I.left - t.left, 0, m, maskX(I.left), maskY(I.top));
            saveTile(dst, t, firstRow, rows);
        }
        return n;
    }
    if (!dstTiled) {  // tile to memory
        for (const Tile &t : TilesMet(src.w, src.h, c.sr)) {
            const RECT I = Inter(t, c.sr);
            const int32_t rows = I.bottom - I.top;
            readTile(src, t, I.top - t.top, rows);
            const RECT in{I.left - t.left, 0, I.right - t.left, rows};
            const int64_t x = I.left - dx, y = I.top - dy;
            Move(c.masked, d, tileBuf.data(), tileStride(t), in, dst.px.data(), dst.stride, x, y, m,
                 maskX(x), maskY(y));
        }
        return n;
    }
    const int64_t S = ((8192 * int64_t{d} + 7) >> 3) + 2;
    Bytes block(S * rowsHeld + 64, stale);
    for (const Tile &t : TilesMet(dst.w, dst.h, c.dr)) {
        const RECT I = Inter(t, c.dr);
        const int32_t firstRow = I.top - t.top, rows = I.bottom - I.top;
        if (c.masked || I.left != t.left || I.right != t.right) readTile(dst, t, firstRow, rows);
        const RECT from{static_cast<int32_t>(I.left + dx), static_cast<int32_t>(I.top + dy),
                        static_cast<int32_t>(I.right + dx), static_cast<int32_t>(I.bottom + dy)};
        const int64_t a = ((int64_t{d} * from.left) & ~int64_t{7}) / d;
        const int64_t first = (a * d) >> 3, end = (int64_t{from.right} * d + 7) >> 3;
        for (int r = 0; r < rows; ++r)
            std::memcpy(block.data() + r * S, src.Row(from.top + r) + first, end - first);
        ++n.blocks;
        const RECT in{static_cast<int32_t>(from.left - a), 0,
                      static_cast<int32_t>(from.left - a + (I.right - I.left)), rows};
        Move(c.masked, d, block.data(), S, in, tileBuf.data(), tileStride(t), I.left - t.left, 0, m,
             maskX(I.left), maskY(I.top));
        saveTile(dst, t, firstRow, rows);
    }
    return n;
}

}  // namespace dmodel
