// The four row services. A bitmap in memory hands out a pointer into its
// pixels; a tile bitmap without a session opens its file around each row;
// with a session the row comes from, or goes to, the session's buffers, as
// its mode says.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <cstring>

#include "storage/row_access.h"
#include "storage/row_services.h"
#include "storage/tile_transfer.h"

namespace ts = tessarine::storage;
using tessarine::Failed;
using tessarine::kErrGeneral;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

// One row at a time: the row is read into readBuffer on every call.
int32_t ReadOneRow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed,
                   ts::RowAccess *a) {
    const ts::PixelSpan w = ts::Widen(s->header->bitsPerPixel, x, n, s->regionBox.right);
    const HVT_Box box = ts::MakeBox(w.left, y, w.right, y + 1);
    const int32_t status = HVT_ReadBlock(s->subIndex, s, &box, 0, s->readBuffer);
    if (Failed(status)) return status;
    return ts::Hand(s->readBuffer, ts::BlockSize(s->readHandle), 0, needed, a);
}

// What every row of a session passes: the buffer of its direction, and the
// run inside the region.
int32_t CheckSessionRun(const HVT_FileInfo *s, const uint8_t *buffer, int64_t y, int64_t x,
                        int64_t n) {
    if (buffer == nullptr || s->header == nullptr) return kErrGeneral;
    const HVT_Box &region = s->regionBox;
    if (!ts::RunInside(y, x, n, region.left, region.top, region.right, region.bottom))
        return ts::Refused(s);
    return kOk;
}

int32_t ReadRowInSession(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed,
                         ts::RowAccess *a) {
    const int32_t status = CheckSessionRun(s, s->readBuffer, y, x, n);
    if (Failed(status) || n == 0) return status;
    if (s->sessionMode == ts::kModeWindow) return ts::ReadWindowRow(s, y, x, n, needed, a);
    if (ts::IsBandMode(s->sessionMode)) return ts::ReadBandRow(s, y, x, n, needed, a);
    return ReadOneRow(s, y, x, n, needed, a);
}

int32_t WriteRowInSession(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed,
                          ts::RowAccess *a) {
    const int32_t status = CheckSessionRun(s, s->writeBuffer, y, x, n);
    if (Failed(status)) return status;
    if (s->sessionMode == ts::kModeWindow) return ts::WriteWindowRow(s, y, x, n, needed, a);
    if (ts::IsBandMode(s->sessionMode)) return ts::WriteBandRow(s, y, x, n, needed, a);
    // One row at a time: the row goes to the file at the unlock.
    return ts::Hand(s->writeBuffer, ts::BlockSize(s->writeHandle), 0, needed, a);
}

// Read-after-write in a session: the written bytes go into the read buffer
// when it holds the row.
void CopyToReadBuffer(HVT_FileInfo *s, const HVT_Box &box, const uint8_t *row) {
    const HVT_Box &rb = s->readBox;
    if (s->readBuffer == nullptr || box.top < rb.top || box.top >= rb.bottom) return;
    if (box.left < rb.left || box.right > rb.right) return;
    const int64_t d = s->header->bitsPerPixel;
    const int64_t stride = s->sessionMode == ts::kModeWindow ? s->readRowBytes : s->bandRowBytes;
    const int64_t bytes = ts::RunBytes(d, box.left, int64_t{box.right} - box.left);
    const int64_t at =
        (int64_t{box.top} - rb.top) * stride + ((box.left * d) >> 3) - ((rb.left * d) >> 3);
    if (at < 0 || at + bytes > ts::BlockSize(s->readHandle)) return;
    ts::PayTileBuffer(s);  // the band's bytes as read, before they change
    std::memcpy(s->readBuffer + at, row, static_cast<size_t>(bytes));
}

// Brings a row written in a session towards the file: at once in the
// one-row mode, through the buffers (and the read buffer's copy) otherwise.
int32_t UnlockSessionRow(HVT_FileInfo *s, const HVT_Box &box, const uint8_t *row) {
    if (!ts::CachesRows(s->sessionMode))
        return HVT_SaveBlockWithBitShift(s->subIndex, s, &box, 0, row);
    if (s->sessionFlags & ts::kSessionReads) CopyToReadBuffer(s, box, row);
    return kOk;
}

}  // namespace

namespace tessarine::storage {

int32_t LockRowRead(BI_Bitmap *b, int32_t y, int32_t x, int32_t count, int64_t needed,
                    RowAccess *a) {
    *a = RowAccess{};
    const int64_t n = std::max(count, 0);
    if (b->bitsPerPixel == 0) return kErrUnsupported;
    if (InMemory(b)) return LockMemoryRow(b, y, x, n, needed, a);
    if (b->ioSession == nullptr) return ReadRowAlone(b, y, x, n, needed, a);
    return ReadRowInSession(b->ioSession, y, x, n, needed, a);
}

void EndRowRead(BI_Bitmap *b, RowAccess *a) {
    if (a->pixelsLocked) MEM_Unlock(b->pixelHandle);
    if (a->temp != nullptr) MEM_FreePtr(a->temp);
    *a = RowAccess{};
}

int32_t LockRowWrite(BI_Bitmap *b, const HVT_Box &box, int64_t needed, RowAccess *a) {
    *a = RowAccess{};
    const int64_t n = std::max<int64_t>(int64_t{box.right} - box.left, 0);
    if (b->bitsPerPixel == 0) return kErrUnsupported;
    if (InMemory(b)) return LockMemoryRow(b, box.top, box.left, n, needed, a);
    if (b->ioSession == nullptr) return WriteRowAlone(b, box.top, box.left, n, needed, a);
    return WriteRowInSession(b->ioSession, box.top, box.left, n, needed, a);
}

int32_t UnlockRowWrite(BI_Bitmap *b, const HVT_Box &box, RowAccess *a) {
    int32_t status = kOk;
    if (a->pixelsLocked) {
        MEM_Unlock(b->pixelHandle);
    } else if (a->alone != nullptr) {
        // The record goes in any case, so that a failed save leaves no file open.
        status = HVT_SaveBlock(0, a->alone, &box, 0, a->row);
        HVT_TileFileEnd(a->alone, OwnDescriptor(b));
        MEM_FreePtr(a->alone);
    } else if (a->row != nullptr && b->ioSession != nullptr) {
        status = UnlockSessionRow(b->ioSession, box, a->row);
    }
    if (a->temp != nullptr) MEM_FreePtr(a->temp);
    *a = RowAccess{};
    return status;
}

int32_t BI_LockRowRead(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count, uint8_t **row,
                       void **temp) {
    RowAccess a;
    const int32_t status =
        LockRowRead(bitmap, y, x, count, RunBytes(bitmap->bitsPerPixel, x, count), &a);
    *row = a.row;
    *temp = a.temp;
    return status;
}

int32_t BI_LockRowWrite(BI_Bitmap *bitmap, const HVT_Box *box, uint8_t **row, void **temp,
                        HVT_FileInfo **alone) {
    RowAccess a;
    const int32_t status = LockRowWrite(
        bitmap, *box, RunBytes(bitmap->bitsPerPixel, box->left, int64_t{box->right} - box->left), &a);
    *row = a.row;
    *temp = a.temp;
    *alone = a.alone;
    return status;
}

int32_t BI_UnlockRowWrite(BI_Bitmap *bitmap, HVT_FileInfo **alone, const HVT_Box *box,
                          uint8_t *row, void **temp) {
    RowAccess a;
    a.row = row;
    a.temp = *temp;
    a.alone = *alone;
    a.pixelsLocked = InMemory(bitmap) && row != nullptr;
    *temp = nullptr;
    *alone = nullptr;
    return UnlockRowWrite(bitmap, *box, &a);
}

}  // namespace tessarine::storage
