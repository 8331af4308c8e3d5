// The steps every Get and Set row function shares: reach the row through the
// row services, convert, release.
#pragma once

#include <cstdint>

#include <tessarine/bitmap.h>

#include "core/status.h"
#include "storage/row_services.h"

namespace tessarine::bitmap {

// Reads the row and hands its first byte to `convert(row)`; releases what the
// row service gave, on failure too.
template <class Convert>
int32_t GetRowSteps(BI_Bitmap *b, int32_t y, int32_t x, int32_t count, int64_t needed,
                    Convert &&convert) {
    storage::RowAccess access;
    int32_t status = storage::LockRowRead(b, y, x, count, needed, &access);
    if (!Failed(status) && access.row != nullptr) status = convert(access.row);
    storage::EndRowRead(b, &access);
    return status;
}

// Locks the row for the box (x, y, x + count, y + 1), lets `convert(row, room)`
// fill it, and unlocks it in any case. The result is that of the lock and the
// conversion: the unlock's own status is not the caller's.
template <class Convert>
int32_t SetRowSteps(BI_Bitmap *b, int32_t y, int32_t x, int32_t count, int64_t needed,
                    Convert &&convert) {
    const int64_t right = int64_t{x} + count;
    if (right > INT32_MAX || right < INT32_MIN || y == INT32_MAX) return kErrGeneral;
    const HVT_Box box{x, y, static_cast<int32_t>(right), y + 1};
    storage::RowAccess access;
    int32_t status = storage::LockRowWrite(b, box, needed, &access);
    if (!Failed(status) && access.row != nullptr) status = convert(access.row, access.room);
    (void)storage::UnlockRowWrite(b, box, &access);
    return status;
}

inline int64_t Pixels(int32_t count) { return count > 0 ? count : 0; }

// Bytes a run of the bitmap's own layout spans from the byte holding x.
inline int64_t OwnRunBytes(const BI_Bitmap *b, int32_t x, int32_t count) {
    return storage::RunBytes(b->bitsPerPixel, x, Pixels(count));
}

}  // namespace tessarine::bitmap
