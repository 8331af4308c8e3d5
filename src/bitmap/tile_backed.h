// What ties a bitmap to its files.
#pragma once

#include <cstdint>

#include <tessarine/bitmap.h>

namespace tessarine::bitmap {

// Makes the bitmap's tile file from its fields, with the colour entries and
// the user bytes as given; fills tilePath and tileFile. A status.
int32_t MakeTileFile(BI_Bitmap *bitmap, const uint8_t *colors, uint8_t userByte1,
                     uint8_t userByte2, uint8_t userByte3);

// Closes a descriptor that a failed MakeTileFile left in tileFile without a
// path, so that the record's deletion leaves nothing open.
void DropHalfMadeTileFile(BI_Bitmap *bitmap);

// Removes the bitmap's tile file and companion file, before its memory goes.
void RemoveFiles(BI_Bitmap *bitmap);

}  // namespace tessarine::bitmap
