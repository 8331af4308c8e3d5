// Tile-backed bitmaps: the tile file a bitmap makes and the files it removes.
#include "bitmap/tile_backed.h"

#include <tessarine/storage.h>

namespace tessarine::bitmap {

int32_t MakeTileFile(BI_Bitmap *bitmap, const uint8_t *colors, uint8_t userByte1,
                     uint8_t userByte2, uint8_t userByte3) {
    return HVT_CreateBlankTileBmpFile(
        bitmap->imageType, bitmap->bitsPerPixel, static_cast<uint32_t>(bitmap->width),
        static_cast<uint32_t>(bitmap->height), bitmap->xResolution, bitmap->yResolution,
        bitmap->colorModel, bitmap->colorCount, colors, bitmap->tilePath, &bitmap->tileFile,
        userByte1, userByte2, userByte3);
}

void DropHalfMadeTileFile(BI_Bitmap *bitmap) {
    if (bitmap->tilePath[0] == '\0' && bitmap->tileFile != -1) {
        FM_Close(bitmap->tileFile);
        bitmap->tileFile = -1;
    }
}

void RemoveFiles(BI_Bitmap *bitmap) {
    if (bitmap->tilePath[0] != '\0') {
        if (bitmap->tileFile != -1) FM_Close(bitmap->tileFile);
        FM_Delete(bitmap->tilePath);
    }
    if (bitmap->companionPath[0] != '\0') FM_Delete(bitmap->companionPath);
}

}  // namespace tessarine::bitmap
