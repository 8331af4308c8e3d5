// The band modes of a session: bands of bandRows rows, read whole on a miss
// with one HVT_ReadBlock at the band's stride, and written back as their
// pending rows when the band changes or the session ends.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "storage/row_access.h"
#include "storage/tile_transfer.h"

namespace tessarine::storage {
namespace {

bool InRows(int64_t y, const HVT_Box &box) { return y >= box.top && y < box.bottom; }

// Offset in a band buffer of x's byte in row y.
int64_t BandOffset(const HVT_FileInfo *s, const HVT_Box &band, int64_t y, int64_t x) {
    const int64_t d = s->header->bitsPerPixel;
    return (y - band.top) * s->bandRowBytes - ((band.left * d) >> 3) + ((x * d) >> 3);
}

// A write that fills every byte of its region row, so that nothing of the
// row's old content survives it.
bool FillsRegionRow(const HVT_FileInfo *s, int64_t d, int64_t x, int64_t n) {
    const HVT_Box &r = s->regionBox;
    if (x > r.left || x + n < r.right) return false;
    if (d >= 8) return true;
    const int64_t width = s->subbmps[s->subIndex].width;
    return ((x * d) & 7) == 0 && ((((x + n) * d) & 7) == 0 || x + n >= width);
}

// Moves the write band to the one holding y, saving what is pending first.
int32_t PlaceWriteBand(HVT_FileInfo *s, int64_t y) {
    if (HasPending(s)) {
        const int32_t status = SavePending(s);
        if (Failed(status)) return status;
    }
    if (s->bandRows < 1) return kErrGeneral;
    s->writeBox = BandOf(s, y);
    s->pendingBox = MakeBox(s->writeBox.left, y, s->writeBox.right, y);
    return kOk;
}

}  // namespace

int32_t ReadBandRow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a) {
    const PixelSpan w = Widen(s->header->bitsPerPixel, x, n, s->regionBox.right);
    HVT_Box &rb = s->readBox;
    if (!InRows(y, rb)) {
        if (s->bandRows < 1) return kErrGeneral;
        const int32_t status = ReadSessionBand(s, BandOf(s, y));
        if (Failed(status)) {
            rb.top = rb.bottom = -1;
            return status;
        }
    }
    return Hand(s->readBuffer, BlockSize(s->readHandle), BandOffset(s, rb, y, w.left), needed, a);
}

// Rows are written in order, either way, with no gap: y may lie from one
// above the pending rows to one below them.
int32_t WriteBandRow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a) {
    const int64_t d = s->header->bitsPerPixel;
    const int64_t size = BlockSize(s->writeHandle);
    if (!InRows(y, s->writeBox)) {
        const int32_t status = PlaceWriteBand(s, y);
        if (Failed(status)) return status;
    }
    const HVT_Box &wb = s->writeBox;
    HVT_Box &pending = s->pendingBox;
    const bool isPending = InRows(y, pending);
    if (!isPending && y != pending.top - 1 && y != pending.bottom) return kRowRefused;
    if (x < wb.left || x + n > wb.right) return kRowRefused;
    const int64_t rowStart = (y - wb.top) * s->bandRowBytes;
    if (rowStart < 0 || rowStart + s->bandRowBytes > size) return kErrGeneral;
    // A row that is not pending holds whatever the buffer held: one that is
    // written only in part is read first, so that the rest of it survives
    // the save.
    if (!isPending && !FillsRegionRow(s, d, x, n)) {
        const HVT_Box row = MakeBox(wb.left, y, wb.right, y + 1);
        const int32_t status = HVT_ReadBlock(s->subIndex, s, &row, 0, s->writeBuffer + rowStart);
        if (Failed(status)) return status;
    }
    if (y == pending.top - 1)
        pending.top -= 1;
    else if (y == pending.bottom)
        pending.bottom += 1;
    return Hand(s->writeBuffer, size, BandOffset(s, wb, y, x), needed, a);
}

}  // namespace tessarine::storage
