// Pixel movers: a rectangle copied directly from a tile file into memory and
// back, and painted through a mask onto a bitmap of another layout.
#include <cstdio>
#include <vector>

#include <tessarine/tessarine.h>

#include "demo.h"

void DemoMovers() {
    std::puts("Pixel movers:");
    BI_Bitmap *tiled = nullptr, *mem = nullptr, *rgb = nullptr;
    int32_t s = BI_CreateBlankBmp(2, 8, 9000, 1500, 300.0, 300.0, 1, 0, nullptr, &tiled, 2, 0, 0, 0);
    if (!TS_FAILED(s)) s = BI_CreateBlankBmp(2, 8, 600, 400, 300.0, 300.0, 1, 0, nullptr, &mem, 1, 0, 0, 0);
    if (!TS_FAILED(s)) s = BI_CreateBlankBmp(4, 24, 600, 400, 300.0, 300.0, 1, 0, nullptr, &rgb, 1, 0, 0, 0);
    if (TS_FAILED(s)) {
        std::printf("  could not make the bitmaps (status %d)\n", TS_STATUS(s));
    } else {
        // A gradient in memory, copied into the tile file across the corner
        // where four tiles meet, then back into a clean bitmap in memory.
        std::vector<uint8_t> row(600);
        for (int32_t y = 0; y < 400; ++y) {
            for (int32_t x = 0; x < 600; ++x) row[x] = static_cast<uint8_t>((x + y) & 0xFF);
            BI_SetGRow(y, 0, 600, row.data(), mem);
        }
        const RECT inMemory{0, 0, 600, 400}, onTiles{7900, 800, 8500, 1200};
        s = BI_DirectCopyBmp(&inMemory, mem, &onTiles, tiled, 0, 0);
        std::printf("  memory to tile file at (%d, %d): status %d\n", onTiles.left, onTiles.top, TS_STATUS(s));
        BI_FillByte(mem, 0);
        if (!TS_FAILED(s)) s = BI_DirectCopyBmp(&onTiles, tiled, &inMemory, mem, 0, 0);
        std::vector<uint8_t> back(600);
        bool same = !TS_FAILED(s);
        for (int32_t y = 0; same && y < 400; y += 37) {
            BI_GetGRow(mem, y, 0, 600, back.data());
            for (int32_t x = 0; x < 600; ++x) same = same && back[x] == static_cast<uint8_t>((x + y) & 0xFF);
        }
        std::printf("  tile file to memory: status %d, %s\n", TS_STATUS(s), same ? "same pixels" : "DIFFERENT pixels");

        // A checkered mask paints the gray over RGB.
        std::vector<uint8_t> mask(size_t{75} * 400);
        for (int32_t y = 0; y < 400; ++y)
            for (int32_t i = 0; i < 75; ++i) mask[size_t(y) * 75 + i] = ((y / 8 + i) & 1) ? 0xFF : 0x00;
        s = BI_MaskBmp(&inMemory, mem, 75, 0, 0, mask.data(), &inMemory, rgb);
        std::vector<uint8_t> r(600), g(600), b(600);
        if (!TS_FAILED(s)) BI_GetRGBRow(rgb, 0, 0, 600, r.data(), g.data(), b.data());
        std::printf("  gray painted over RGB through a mask: status %d, pixel 8 is (%u, %u, %u), pixel 0 stays (%u, %u, %u)\n",
                    TS_STATUS(s), r[8], g[8], b[8], r[0], g[0], b[0]);
    }
    BI_DeleteBitmap(&tiled);
    BI_DeleteBitmap(&mem);
    BI_DeleteBitmap(&rgb);
}
