// Rows in several layouts: written as colours, read back as colours,
// densities, indexes and flags, in memory and through a tile-file session.
#include <cstdio>

#include <tessarine/tessarine.h>

#include "demo.h"

namespace {

void Show(const char *what, const uint8_t *v, int n) {
    std::printf("    %-28s", what);
    for (int i = 0; i < n; ++i) std::printf(" %3u", v[i]);
    std::printf("\n");
}

}  // namespace

void DemoRows() {
    std::puts("Row access:");
    const uint8_t r[8] = {255, 0, 0, 255, 128, 30, 200, 0};
    const uint8_t g[8] = {255, 0, 255, 0, 128, 60, 100, 0};
    const uint8_t b[8] = {255, 0, 0, 0, 128, 90, 50, 0};
    uint8_t out[3][16];

    // 24-bit RGB in a tile file, written and read through a band session
    BI_Bitmap *rgb = nullptr;
    if (!TS_FAILED(BI_CreateBlankBmp(4, 24, 8, 4, 300, 300, 1, 0, nullptr, &rgb, 2, 0, 0, 0))) {
        HVT_TileFileRowIOBegin(3, rgb, nullptr, 2, 0, 0);
        std::printf("  RGB 8x4 in a tile file, session of %d-row bands\n", rgb->ioSession->bandRows);
        for (int y = 0; y < 4; ++y) BI_SetRGBRow(y, 0, 8, r, g, b, rgb);
        HVT_TileFileRowColIOEnd(rgb);
        BI_GetRGBRow(rgb, 2, 0, 8, out[0], out[1], out[2]);
        Show("row 2, red plane:", out[0], 8);
        BI_GetGRow(rgb, 2, 0, 8, out[0]);
        Show("row 2 as densities:", out[0], 8);
        BI_DeleteBitmap(&rgb);
    }

    // 4-bit gray in memory: densities packed to nibbles and back
    BI_Bitmap *gray = nullptr;
    if (!TS_FAILED(BI_CreateBlankBmp(2, 4, 8, 1, 300, 300, 1, 0, nullptr, &gray, 1, 0, 0, 0))) {
        const uint8_t d[8] = {0, 16, 17, 100, 128, 200, 254, 255};
        BI_SetGRow(0, 0, 8, d, gray);
        BI_GetGRow(gray, 0, 0, 8, out[0]);
        Show("4-bit gray, densities in:", d, 8);
        Show("4-bit gray, densities out:", out[0], 8);
        BI_GetRGBRow(gray, 0, 0, 8, out[0], out[1], out[2]);
        Show("4-bit gray as RGB:", out[0], 8);
        BI_DeleteBitmap(&gray);
    }

    // 4-bit indexed RGB: colours found in the colour index, the rest by the nearest entry
    const uint8_t table[] = {255, 255, 255, 0, 0, 0, 0, 255, 0, 255, 0, 0};
    BI_Bitmap *idx = nullptr;
    if (!TS_FAILED(BI_CreateBlankBmp(3, 4, 8, 1, 300, 300, 1, 4, table, &idx, 2, 0, 0, 0))) {
        MakeColorTableIndex(idx);
        BI_SetRGBRow(0, 0, 8, r, g, b, idx);
        BI_GetIndexRow(idx, 0, 0, 8, out[0]);
        Show("indexed (tile file), indexes:", out[0], 8);
        BI_DeleteBitmap(&idx);
    }

    // black and white: flags in, packed bytes out, at x = 3
    BI_Bitmap *bw = nullptr;
    if (!TS_FAILED(BI_CreateBlankBmp(1, 1, 16, 1, 300, 300, 1, 0, nullptr, &bw, 1, 0, 0, 0))) {
        const uint8_t zero[2] = {0, 0};
        BI_SetBWPackedRow(0, 0, 16, zero, bw);
        const uint8_t flags[8] = {1, 1, 0, 1, 0, 0, 1, 1};
        BI_SetBWRow(0, 3, 8, flags, bw);
        BI_GetBWPackedRow(bw, 0, 0, 16, out[0]);
        std::printf("    %-28s 0x%02X 0x%02X\n", "b/w flags from x 3, packed:", out[0][0], out[0][1]);
        BI_GetBWRow(bw, 0, 3, 8, out[1]);
        Show("b/w read back as flags:", out[1], 8);
        BI_DeleteBitmap(&bw);
    }
}
