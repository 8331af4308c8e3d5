// A per-pixel model of bitmap rows for the row tests: packed rows as a tile
// file holds them, bitmaps of every valid layout on every storage route, and
// the expected results of the row functions worked out pixel by pixel.
#pragma once

#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include <tessarine/tessarine.h>

namespace rowtest {

struct Layout {
    const char *name;
    uint8_t type;
    uint8_t d;
    uint8_t model;
    int32_t colors;
};

inline const std::vector<Layout> &Layouts() {
    static const std::vector<Layout> all = {
        {"bw1", 1, 1, 1, 0},        {"bw1cmyk", 1, 1, 2, 0},     {"gray1", 2, 1, 1, 0},
        {"gray4", 2, 4, 1, 0},      {"gray8", 2, 8, 1, 0},       {"gray4cmyk", 2, 4, 2, 0},
        {"gray8cmyk", 2, 8, 2, 0},  {"idx1rgb", 3, 1, 1, 2},     {"idx4rgb", 3, 4, 1, 11},
        {"idx8rgb", 3, 8, 1, 200},  {"idx1cmyk", 3, 1, 2, 2},    {"idx4cmyk", 3, 4, 2, 11},
        {"idx8cmyk", 3, 8, 2, 200}, {"rgb24", 4, 24, 1, 0},      {"cmyk32", 4, 32, 2, 0}};
    return all;
}

enum class Route { Memory, Alone, AloneOwnFd, Mode0, Mode1, Mode2, Mode3 };
inline const std::vector<Route> &Routes() {
    static const std::vector<Route> all = {Route::Memory, Route::Alone, Route::AloneOwnFd,
                                           Route::Mode0,  Route::Mode1, Route::Mode2,
                                           Route::Mode3};
    return all;
}
inline const char *RouteName(Route r) {
    switch (r) {
        case Route::Memory: return "memory";
        case Route::Alone: return "tile, no session";
        case Route::AloneOwnFd: return "tile, no session, file closed";
        case Route::Mode0: return "session mode 0";
        case Route::Mode1: return "session mode 1";
        case Route::Mode2: return "session mode 2";
        case Route::Mode3: return "session mode 3";
    }
    return "?";
}

// Packed rows, (w * d + 7) / 8 bytes each, plus two bytes of slack for the
// functions that write one byte past a run.
struct Image {
    int32_t w = 0, h = 0, d = 0;
    std::vector<std::vector<uint8_t>> rows;

    Image() = default;
    Image(int32_t width, int32_t height, int32_t depth) : w(width), h(height), d(depth) {
        rows.assign(h, std::vector<uint8_t>(RowBytes() + 2, 0));
    }
    int64_t RowBytes() const { return (int64_t{w} * d + 7) / 8; }
    uint32_t Pixel(int y, int64_t x) const { return PixelOf(rows[y].data(), x, d); }
    static uint32_t PixelOf(const uint8_t *row, int64_t x, int d) {
        if (d == 1) return (row[x >> 3] >> (7 - (x & 7))) & 1;
        if (d == 4) return (x & 1) ? row[x >> 1] & 15 : row[x >> 1] >> 4;
        return row[x];  // 8 bits; wider pixels are read byte by byte
    }
    static void SetPixelOf(uint8_t *row, int64_t x, int d, uint32_t v) {
        if (d == 1) {
            const uint8_t bit = static_cast<uint8_t>(0x80 >> (x & 7));
            row[x >> 3] = v ? (row[x >> 3] | bit) : (row[x >> 3] & ~bit);
        } else if (d == 4) {
            uint8_t &b = row[x >> 1];
            b = (x & 1) ? static_cast<uint8_t>((b & 0xF0) | (v & 15))
                        : static_cast<uint8_t>((b & 0x0F) | ((v & 15) << 4));
        } else {
            row[x] = static_cast<uint8_t>(v);
        }
    }
    // Clears the bits past the last pixel, which no route keeps the same.
    void MaskTail() {
        const int rest = static_cast<int>((int64_t{w} * d) % 8);
        for (auto &r : rows) {
            for (size_t i = RowBytes(); i < r.size(); ++i) r[i] = 0;
            if (rest) r[RowBytes() - 1] &= static_cast<uint8_t>(0xFF << (8 - rest));
        }
    }
    bool operator==(const Image &o) const {
        for (int y = 0; y < h; ++y)
            if (std::memcmp(rows[y].data(), o.rows[y].data(), RowBytes()) != 0) return false;
        return true;
    }
};

inline Image RandomImage(int32_t w, int32_t h, int32_t d, uint32_t seed) {
    Image img(w, h, d);
    std::mt19937 rng(seed);
    for (auto &r : img.rows)
        for (int64_t i = 0; i < img.RowBytes(); ++i) r[i] = static_cast<uint8_t>(rng());
    img.MaskTail();
    return img;
}

// Distinct colour-table entries: 3 bytes (RGB) or 4 (CMYK).
inline std::vector<uint8_t> RandomTable(const Layout &l, uint32_t seed) {
    const int entry = l.model == 2 ? 4 : 3;
    std::vector<uint8_t> t(static_cast<size_t>(l.colors) * entry);
    std::mt19937 rng(seed);
    for (int i = 0; i < l.colors; ++i) {
        for (int k = 0; k < entry; ++k) t[i * entry + k] = static_cast<uint8_t>(rng());
        t[i * entry] = static_cast<uint8_t>(i);  // distinct
    }
    return t;
}

inline uint8_t TableByte(const std::vector<uint8_t> &t, int64_t i) {
    return i >= 0 && i < static_cast<int64_t>(t.size()) ? t[i] : 0;
}

inline uint8_t Gray(int r, int g, int b) {
    if (r == g && g == b) return static_cast<uint8_t>(255 - b);
    return static_cast<uint8_t>(255 - (30 * r + 59 * g + 11 * b) / 100);
}

// The pixel block of a bitmap in memory, or its tile file, as packed rows.
inline Image ReadImage(BI_Bitmap *b) {
    Image img(b->width, b->height, b->bitsPerPixel);
    if (b->storage & 1) {
        auto *base = static_cast<uint8_t *>(MEM_Lock(b->pixelHandle));
        for (int y = 0; y < img.h; ++y)
            std::memcpy(img.rows[y].data(), base + int64_t{y} * b->bytesPerRow, img.RowBytes());
        MEM_Unlock(b->pixelHandle);
    } else {
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        const int32_t own = b->tileFile == -1;
        EXPECT_EQ(HVT_TileFileBegin(b, &info, own), TS_OK);
        std::vector<uint8_t> flat(img.RowBytes() * img.h + 1);
        HVT_Box all{0, 0, img.w, img.h};
        EXPECT_EQ(HVT_ReadBlock(0, &info, &all, static_cast<int32_t>(img.RowBytes()), flat.data()), TS_OK);
        HVT_TileFileEnd(&info, own);
        for (int y = 0; y < img.h; ++y)
            std::memcpy(img.rows[y].data(), flat.data() + y * img.RowBytes(), img.RowBytes());
    }
    img.MaskTail();
    return img;
}

inline void WriteImage(BI_Bitmap *b, const Image &img) {
    if (b->storage & 1) {
        auto *base = static_cast<uint8_t *>(MEM_Lock(b->pixelHandle));
        for (int y = 0; y < img.h; ++y)
            std::memcpy(base + int64_t{y} * b->bytesPerRow, img.rows[y].data(), img.RowBytes());
        MEM_Unlock(b->pixelHandle);
        return;
    }
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    const int32_t own = b->tileFile == -1;
    ASSERT_EQ(HVT_TileFileBegin(b, &info, own), TS_OK);
    std::vector<uint8_t> flat(img.RowBytes() * img.h + 1);
    for (int y = 0; y < img.h; ++y)
        std::memcpy(flat.data() + y * img.RowBytes(), img.rows[y].data(), img.RowBytes());
    HVT_Box all{0, 0, img.w, img.h};
    EXPECT_EQ(HVT_SaveBlock(0, &info, &all, static_cast<int32_t>(img.RowBytes()), flat.data()), TS_OK);
    HVT_TileFileEnd(&info, own);
}

// A bitmap of the layout holding the image, in memory or in a tile file.
inline BI_Bitmap *MakeBitmap(const Layout &l, Route route, const Image &img,
                             const std::vector<uint8_t> &table) {
    BI_Bitmap *b = nullptr;
    const uint8_t storage = route == Route::Memory ? 1 : 2;
    EXPECT_EQ(BI_CreateBlankBmp(l.type, l.d, img.w, img.h, 300, 300, l.model, l.colors,
                                table.empty() ? nullptr : table.data(), &b, storage, 0, 0, 0),
              TS_OK);
    if (b == nullptr) return nullptr;
    if (route == Route::AloneOwnFd) {  // each call opens and closes the file itself
        FM_Close(b->tileFile);
        b->tileFile = -1;
    }
    WriteImage(b, img);
    if (l.type == 3) { EXPECT_EQ(MakeColorTableIndex(b), TS_OK); }
    return b;
}

inline int32_t BeginRoute(Route r, BI_Bitmap *b, uint8_t flags) {
    switch (r) {
        case Route::Mode0: return HVT_TileFileRowIOBegin(flags, b, nullptr, 0, 0, 0);
        case Route::Mode1: return HVT_TileFileRowIOBegin(flags, b, nullptr, 1, 0, 0);
        case Route::Mode2: return HVT_TileFileRowIOBegin(flags, b, nullptr, 2, 0, 0);
        case Route::Mode3: return HVT_TileFileRowIOBegin(flags, b, nullptr, 3, 0, 64 * 8);  // small bands
        default: return TS_OK;
    }
}

// Runs that cross byte edges at every phase: x from 0 to 9 and lengths
// around one and two bytes, and the rest of the row.
inline std::vector<std::pair<int32_t, int32_t>> Runs(int32_t width) {
    std::vector<std::pair<int32_t, int32_t>> runs;
    for (int32_t x = 0; x < 10; ++x) {
        for (int32_t n : {1, 2, 3, 5, 7, 8, 9, 16, 17})
            if (x + n <= width) runs.push_back({x, n});
        runs.push_back({x, width - x});
    }
    return runs;
}

}  // namespace rowtest
