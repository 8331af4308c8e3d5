// Tile-backed bitmaps: a bitmap whose pixels live in a tile file on disk.
#include <cstdio>
#include <cstring>
#include <vector>

#include <tessarine/tessarine.h>

#include "demo.h"

void DemoTiles() {
    std::puts("Tile-backed bitmap:");
    BI_Bitmap *bmp = nullptr;
    int32_t s = BI_CreateBlankBmp(2, 8, 9000, 1500, 300.0, 300.0, 0, 0, nullptr, &bmp, 2, 1, 0, 0);
    if (TS_FAILED(s)) {
        std::printf("  BI_CreateBlankBmp failed (status %d)\n", TS_STATUS(s));
        return;
    }
    std::printf("  made %dx%d 8-bit gray, storage %u, tile file %s\n", bmp->width, bmp->height,
                bmp->storage, bmp->tilePath);

    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    const int32_t ownFile = bmp->tileFile == -1;
    s = HVT_TileFileBegin(bmp, &info, ownFile);
    if (!TS_FAILED(s)) {
        std::printf("  %d by %d tiles\n", info.subbmps[0].tilesAcross, info.subbmps[0].tilesDown);
        // A rectangle across the corner where four tiles meet.
        const HVT_Box box{8000, 900, 8400, 1200};
        const int32_t w = box.right - box.left, h = box.bottom - box.top;
        std::vector<uint8_t> pixels(size_t(w) * h), back(pixels.size());
        for (size_t i = 0; i < pixels.size(); ++i) pixels[i] = static_cast<uint8_t>(i * 31 + 7);
        s = HVT_SaveBlock(0, &info, &box, w, pixels.data());
        std::printf("  wrote %dx%d at (%d, %d): status %d\n", w, h, box.left, box.top, TS_STATUS(s));
        if (!TS_FAILED(s)) s = HVT_ReadBlock(0, &info, &box, w, back.data());
        std::printf("  read it back: status %d, %s\n", TS_STATUS(s),
                    back == pixels ? "same pixels" : "DIFFERENT pixels");
        HVT_TileFileEnd(&info, ownFile);
    }
    BI_DeleteBitmap(&bmp);
    std::printf("  deleted the bitmap and its file (pointer now %s)\n", bmp ? "set" : "null");
}
