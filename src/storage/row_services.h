// The row services: how a row or column function reaches the pixels of one
// row, in memory, in a tile file alone, or through the bitmap's session.
#pragma once

#include <cstdint>

#include <tessarine/storage.h>

namespace tessarine::storage {

// What a row lock hands out.
struct RowAccess {
    uint8_t *row = nullptr;          // the byte that holds the first pixel
    void *temp = nullptr;            // a temporary row, freed by the unlock
    HVT_FileInfo *alone = nullptr;   // the record of a write without a session
    int64_t room = 0;                // bytes from `row` to the end of its block
    bool pixelsLocked = false;       // pixelHandle was locked for this access
};

// A row of count pixels from x in row y, for reading. `needed` is how many
// bytes from the row pointer the caller will read; a run outside the bitmap
// or the session's region, or one that would pass the end of the block, is
// refused with -1. EndRowRead releases what the lock took, also after a
// failed lock.
int32_t LockRowRead(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count, int64_t needed,
                    RowAccess *access);
void EndRowRead(BI_Bitmap *bitmap, RowAccess *access);

// The same for writing the one-row box; UnlockRowWrite brings the row to its
// storage and releases everything, also after a failed lock.
int32_t LockRowWrite(BI_Bitmap *bitmap, const HVT_Box &box, int64_t needed, RowAccess *access);
int32_t UnlockRowWrite(BI_Bitmap *bitmap, const HVT_Box &box, RowAccess *access);

// Bytes that count pixels of depth d from x span: from the byte holding x to
// the byte holding the last.
inline int64_t RunBytes(int64_t d, int64_t x, int64_t count) {
    if (count <= 0) return 0;
    return (((x + count) * d + 7) >> 3) - ((x * d) >> 3);
}

// The shapes the column and copy functions use.
int32_t BI_LockRowRead(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count, uint8_t **row,
                       void **temp);
int32_t BI_LockRowWrite(BI_Bitmap *bitmap, const HVT_Box *box, uint8_t **row, void **temp,
                        HVT_FileInfo **alone);
int32_t BI_UnlockRowWrite(BI_Bitmap *bitmap, HVT_FileInfo **alone, const HVT_Box *box,
                          uint8_t *row, void **temp);
// A box of pixels with its stride; from a tile file, the box comes packed at
// a stride of d / 8 bytes (1 below 8 bits), so a one-pixel-wide box is a
// column. The caller unlocks pixelHandle for a bitmap in memory and frees
// `temp` otherwise.
int32_t BI_LockBlockRead(BI_Bitmap *bitmap, const HVT_Box *box, int32_t *stride,
                         uint8_t **pointer, void **temp);

}  // namespace tessarine::storage
