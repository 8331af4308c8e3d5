// The four row services. A bitmap in memory hands out a pointer into its
// pixels; a tile bitmap without a session opens its file around each row;
// with a session the row comes from, or goes to, the session's buffers.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <algorithm>
#include <cstring>

#include "core/status.h"
#include "storage/row_services.h"
#include "storage/row_session.h"

namespace ts = tessarine::storage;
using tessarine::Failed;
using tessarine::kErrGeneral;
using tessarine::kErrMemory;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

// A row outside a session's region, or a write with a gap: -1 in the low 16
// bits only, as the band and window modes report it.
constexpr int32_t kRowRefused = 0xFFFF;

int32_t Refused(const HVT_FileInfo *s) {
    const uint8_t mode = s->sessionMode;
    return mode >= 1 && mode <= 3 ? kRowRefused : kErrGeneral;
}

bool InMemory(const BI_Bitmap *b) { return (b->storage & BI_STORAGE_MEMORY) != 0; }
int32_t OwnDescriptor(const BI_Bitmap *b) { return b->tileFile == -1 ? 1 : 0; }

HVT_Box MakeBox(int64_t left, int64_t top, int64_t right, int64_t bottom) {
    return {static_cast<int32_t>(left), static_cast<int32_t>(top), static_cast<int32_t>(right),
            static_cast<int32_t>(bottom)};
}

bool RunInside(int64_t y, int64_t x, int64_t n, int64_t left, int64_t top, int64_t right,
               int64_t bottom) {
    return y >= top && y < bottom && x >= left && x + n <= right;
}

struct Span {
    int64_t left;
    int64_t right;
};

// The run widened to the bytes that hold its edge pixels, below 8 bits.
Span Widen(int64_t d, int64_t x, int64_t n, int64_t limit) {
    if (d >= 8) return {x, x + n};
    Span s{x - ((d * x) & 7) / d, x + n};
    const int64_t e = (d * (x + n)) & 7;
    if (e != 7) s.right += (7 - e) / d;
    s.right = std::min(s.right, limit);
    return s;
}

// True when the run's edge bytes also hold pixels of the image outside it,
// which must come from the file before the bytes go back.
bool PartialEdges(int64_t d, int64_t x, int64_t n, int64_t width) {
    if (d >= 8) return false;
    return ((x * d) & 7) != 0 || ((((x + n) * d) & 7) != 0 && x + n < width);
}

int64_t BlockSize(MEM_Handle h) { return h != nullptr ? MEM_HdlSize(h) : 0; }

uint8_t *AllocRow(int64_t bytes) {
    if (bytes <= 0 || bytes > UINT32_MAX) return nullptr;
    return static_cast<uint8_t *>(MEM_AllocPtr(0, static_cast<uint32_t>(bytes)));
}

int64_t TempRowBytes(const BI_Bitmap *b, int64_t needed) {
    return std::max<int64_t>(((int64_t{b->bitsPerPixel} * b->width + 7) >> 3) + 2, needed);
}

int32_t Hand(uint8_t *block, int64_t size, int64_t offset, int64_t needed, ts::RowAccess *a) {
    if (offset < 0 || offset + needed > size) return kErrGeneral;
    a->row = block + offset;
    a->room = size - offset;
    return kOk;
}

int32_t LockMemoryRow(BI_Bitmap *b, int64_t y, int64_t x, int64_t n, int64_t needed,
                      ts::RowAccess *a) {
    if (!RunInside(y, x, n, 0, 0, b->width, b->height) || b->pixelHandle == nullptr)
        return kErrGeneral;
    const int64_t size = MEM_HdlSize(b->pixelHandle);
    const int64_t offset = y * b->bytesPerRow + ((int64_t{b->bitsPerPixel} * x) >> 3);
    if (offset + needed > size) return kErrGeneral;
    auto *base = static_cast<uint8_t *>(MEM_Lock(b->pixelHandle));
    if (base == nullptr) return kErrGeneral;
    a->pixelsLocked = true;
    return Hand(base, size, offset, needed, a);
}

int32_t ReadRowAlone(BI_Bitmap *b, int64_t y, int64_t x, int64_t n, int64_t needed,
                     ts::RowAccess *a) {
    const int64_t d = b->bitsPerPixel;
    if (!RunInside(y, x, n, 0, 0, b->width, b->height)) return kErrGeneral;
    if (n == 0) return kOk;
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    const int32_t own = OwnDescriptor(b);
    int32_t status = HVT_TileFileBegin(b, &info, own);
    if (Failed(status)) return status;
    const int64_t size = TempRowBytes(b, needed);
    uint8_t *temp = AllocRow(size);
    if (temp == nullptr) {
        HVT_TileFileEnd(&info, own);
        return kErrMemory;
    }
    const Span w = Widen(d, x, n, b->width);
    const HVT_Box box = MakeBox(w.left, y, w.right, y + 1);
    status = HVT_ReadBlock(0, &info, &box, 0, temp);
    HVT_TileFileEnd(&info, own);
    if (Failed(status)) {
        MEM_FreePtr(temp);
        return status;
    }
    a->temp = temp;
    return Hand(temp, size, 0, needed, a);
}

// The band of bandRows rows, aligned from row 0 of the image, that holds y;
// limited to the region.
HVT_Box BandOf(const HVT_FileInfo *s, int64_t y) {
    const int64_t rows = s->bandRows;
    const HVT_Box &r = s->regionBox;
    const int64_t start = y - (((y % rows) + rows) % rows);
    return MakeBox(r.left, std::max<int64_t>(start, r.top), r.right,
                   std::min<int64_t>(start + rows, r.bottom));
}

bool Overlap(const HVT_Box &a, const HVT_Box &b) {
    return std::max(a.left, b.left) < std::min(a.right, b.right) &&
           std::max(a.top, b.top) < std::min(a.bottom, b.bottom);
}

int32_t ReadRowInSession(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n,
                         int64_t needed, ts::RowAccess *a) {
    if (s->readBuffer == nullptr || s->header == nullptr) return kErrGeneral;
    const HVT_Box &region = s->regionBox;
    if (!RunInside(y, x, n, region.left, region.top, region.right, region.bottom))
        return Refused(s);
    if (n == 0) return kOk;
    const int64_t d = s->header->bitsPerPixel;
    const Span w = Widen(d, x, n, region.right);
    const int64_t size = BlockSize(s->readHandle);
    uint8_t *buffer = s->readBuffer;
    HVT_Box &rb = s->readBox;
    int32_t status = kOk;
    int64_t offset = 0;
    switch (s->sessionMode) {
        case 1: {
            const bool hit = w.left == rb.left && w.right == rb.right && y >= rb.top && y < rb.bottom;
            if (!hit) {
                const int64_t rowBytes = (d * (x + n)) / 8 - (d * x) / 8 + (d < 8 ? 1 : 0);
                if (rowBytes > size) return kErrGeneral;
                // count rows, as many as the window holds
                int64_t bottom = std::min<int64_t>(y + n, region.bottom);
                if (rowBytes > 0) bottom = std::min(bottom, y + size / rowBytes);
                const HVT_Box window = MakeBox(w.left, y, w.right, bottom);
                if (ts::HasPending(s) && Overlap(window, s->pendingBox)) {
                    status = ts::SavePending(s);
                    if (Failed(status)) return status;
                    s->writeBox.top = s->writeBox.bottom = -1;
                    s->pendingBox.top = s->pendingBox.bottom = -1;
                }
                rb = window;
                s->readRowBytes = static_cast<int32_t>(rowBytes);
                status = HVT_ReadBlock(s->subIndex, s, &rb, s->readRowBytes, buffer);
                if (Failed(status)) {
                    rb.top = rb.bottom = -1;
                    return status;
                }
            }
            offset = (y - rb.top) * s->readRowBytes;
            break;
        }
        case 2:
        case 3: {
            if (!(y >= rb.top && y < rb.bottom)) {
                if (s->bandRows < 1) return kErrGeneral;
                rb = BandOf(s, y);
                status = HVT_ReadBlock(s->subIndex, s, &rb, s->bandRowBytes, buffer);
                if (Failed(status)) {
                    rb.top = rb.bottom = -1;
                    return status;
                }
            }
            offset = (y - rb.top) * s->bandRowBytes - ((rb.left * d) >> 3) + ((w.left * d) >> 3);
            break;
        }
        default: {
            const HVT_Box box = MakeBox(w.left, y, w.right, y + 1);
            status = HVT_ReadBlock(s->subIndex, s, &box, 0, buffer);
            if (Failed(status)) return status;
            break;
        }
    }
    return Hand(buffer, size, offset, needed, a);
}

int32_t WriteRowAlone(BI_Bitmap *b, int64_t y, int64_t x, int64_t n, int64_t needed,
                      ts::RowAccess *a) {
    const int64_t d = b->bitsPerPixel;
    if (!RunInside(y, x, n, 0, 0, b->width, b->height)) return kErrGeneral;
    auto *info = static_cast<HVT_FileInfo *>(MEM_AllocPtr(0, sizeof(HVT_FileInfo)));
    if (info == nullptr) return kErrMemory;
    HVT_InitFileInfo(info);
    const int32_t own = OwnDescriptor(b);
    int32_t status = HVT_TileFileBegin(b, info, own);
    if (Failed(status)) {
        MEM_FreePtr(info);
        return status;
    }
    const int64_t size = TempRowBytes(b, needed);
    uint8_t *temp = AllocRow(size);
    if (temp == nullptr) status = kErrMemory;
    // The edge bytes keep the pixels around the run: the row is read first
    // when the run does not fill them.
    if (!Failed(status) && n > 0 && PartialEdges(d, x, n, b->width)) {
        const Span w = Widen(d, x, n, b->width);
        const HVT_Box box = MakeBox(w.left, y, w.right, y + 1);
        status = HVT_ReadBlock(0, info, &box, 0, temp);
    }
    if (Failed(status)) {
        if (temp != nullptr) MEM_FreePtr(temp);
        HVT_TileFileEnd(info, own);
        MEM_FreePtr(info);
        return status;
    }
    a->alone = info;
    a->temp = temp;
    return Hand(temp, size, 0, needed, a);
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

int32_t WriteRowInSession(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed,
                          ts::RowAccess *a) {
    if (s->writeBuffer == nullptr || s->header == nullptr) return kErrGeneral;
    const HVT_Box &region = s->regionBox;
    if (!RunInside(y, x, n, region.left, region.top, region.right, region.bottom))
        return Refused(s);
    const int64_t d = s->header->bitsPerPixel;
    const int64_t size = BlockSize(s->writeHandle);
    uint8_t *buffer = s->writeBuffer;
    HVT_Box &wb = s->writeBox;
    HVT_Box &pending = s->pendingBox;
    int32_t status = kOk;
    int64_t offset = 0;
    switch (s->sessionMode) {
        case 1: {
            const Span w = Widen(d, x, n, region.right);
            const bool hit = w.left == wb.left && w.right == wb.right && y >= wb.top && y < wb.bottom;
            if (!hit) {
                if (ts::HasPending(s)) {
                    status = ts::SavePending(s);
                    if (Failed(status)) return status;
                }
                const int64_t rowBytes = (d * (x + n)) / 8 - (d * x) / 8 + (d < 8 ? 1 : 0);
                if (rowBytes > size) return kErrGeneral;
                int64_t bottom = std::min<int64_t>(y + n, region.bottom);
                if (rowBytes > 0) bottom = std::min(bottom, y + size / rowBytes);
                wb = MakeBox(w.left, y, w.right, bottom);
                pending = MakeBox(w.left, y, w.right, y);
                s->writeRowBytes = static_cast<int32_t>(rowBytes);
                // The window's edge bytes, and a byte the widening took in,
                // go back whole: they are read first.
                const bool widened = w.left != x || w.right != x + n;
                if (d < 8 && (widened || PartialEdges(d, x, n, s->subbmps[s->subIndex].width))) {
                    // A window of no rows (a count of 0) still hands out row y.
                    HVT_Box window = wb;
                    window.bottom = std::max(window.bottom, static_cast<int32_t>(y + 1));
                    status = HVT_ReadBlock(s->subIndex, s, &window, s->writeRowBytes, buffer);
                    if (Failed(status)) {
                        wb.top = wb.bottom = pending.top = pending.bottom = -1;
                        return status;
                    }
                }
            }
            if (y >= pending.bottom)
                pending.bottom += 1;
            else if (y < pending.top)
                return kRowRefused;
            offset = (y - wb.top) * s->writeRowBytes;
            break;
        }
        case 2:
        case 3: {
            if (!(y >= wb.top && y < wb.bottom)) {
                if (ts::HasPending(s)) {
                    status = ts::SavePending(s);
                    if (Failed(status)) return status;
                }
                if (s->bandRows < 1) return kErrGeneral;
                wb = BandOf(s, y);
                pending = MakeBox(wb.left, y, wb.right, y);
            }
            const bool isPending = y >= pending.top && y < pending.bottom;
            if (!isPending && y != pending.top - 1 && y != pending.bottom) return kRowRefused;
            if (x < wb.left || x + n > wb.right) return kRowRefused;
            const int64_t rowStart = (y - wb.top) * s->bandRowBytes;
            offset = rowStart - ((d * wb.left) >> 3) + ((d * x) >> 3);
            if (rowStart < 0 || rowStart + s->bandRowBytes > size) return kErrGeneral;
            // A row that is not pending holds whatever the buffer held: one
            // that is written only in part is read first, so that the rest of
            // it survives the save.
            if (!isPending && !FillsRegionRow(s, d, x, n)) {
                const HVT_Box row = MakeBox(wb.left, y, wb.right, y + 1);
                status = HVT_ReadBlock(s->subIndex, s, &row, 0, buffer + rowStart);
                if (Failed(status)) return status;
            }
            if (y == pending.top - 1)
                pending.top -= 1;
            else if (y == pending.bottom)
                pending.bottom += 1;
            break;
        }
        default: break;
    }
    return Hand(buffer, size, offset, needed, a);
}

// Read-after-write in a session: the written bytes go into the read buffer
// when it holds the row.
void CopyToReadBuffer(HVT_FileInfo *s, const HVT_Box &box, const uint8_t *row) {
    const HVT_Box &rb = s->readBox;
    if (s->readBuffer == nullptr || box.top < rb.top || box.top >= rb.bottom) return;
    if (box.left < rb.left || box.right > rb.right) return;
    const int64_t d = s->header->bitsPerPixel;
    const int64_t stride = s->sessionMode == 1 ? s->readRowBytes : s->bandRowBytes;
    const int64_t bytes = ts::RunBytes(d, box.left, int64_t{box.right} - box.left);
    const int64_t at = (int64_t{box.top} - rb.top) * stride + ((box.left * d) >> 3) - ((rb.left * d) >> 3);
    if (at < 0 || at + bytes > BlockSize(s->readHandle)) return;
    std::memcpy(s->readBuffer + at, row, static_cast<size_t>(bytes));
}

}  // namespace

namespace tessarine::storage {

bool HasPending(const HVT_FileInfo *s) {
    const HVT_Box &p = s->pendingBox;
    const HVT_Box &r = s->regionBox;
    return s->writeBuffer != nullptr && r.top <= p.top && p.bottom <= r.bottom && p.top < p.bottom;
}

int32_t SavePending(HVT_FileInfo *s) {
    const int64_t stride = s->sessionMode == 1 ? s->writeRowBytes : s->bandRowBytes;
    const int64_t at = (int64_t{s->pendingBox.top} - s->writeBox.top) * stride;
    if (at < 0 || at >= BlockSize(s->writeHandle)) return kErrGeneral;
    return HVT_SaveBlock(s->subIndex, s, &s->pendingBox, static_cast<int32_t>(stride),
                         s->writeBuffer + at);
}

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
        HVT_FileInfo *s = b->ioSession;
        if (s->sessionMode == 1 || s->sessionMode == 2 || s->sessionMode == 3) {
            if (s->sessionFlags & 1) CopyToReadBuffer(s, box, a->row);
        } else {
            status = HVT_SaveBlockWithBitShift(s->subIndex, s, &box, 0, a->row);
        }
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

int32_t BI_LockBlockRead(BI_Bitmap *b, const HVT_Box *box, int32_t *stride, uint8_t **pointer,
                         void **temp) {
    *temp = nullptr;
    const int64_t d = b->bitsPerPixel;
    const HVT_Box &r = *box;
    if (d == 0) return kErrUnsupported;
    if (r.left < 0 || r.top < 0 || r.left > r.right || r.top > r.bottom || r.right > b->width ||
        r.bottom > b->height)
        return kErrGeneral;
    if (InMemory(b)) {
        if (b->pixelHandle == nullptr) return kErrGeneral;
        auto *base = static_cast<uint8_t *>(MEM_Lock(b->pixelHandle));
        if (base == nullptr) return kErrGeneral;
        *stride = static_cast<int32_t>(b->bytesPerRow);
        *pointer = base + int64_t{r.top} * b->bytesPerRow + ((d * r.left) >> 3);
        return kOk;
    }
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    const int32_t own = OwnDescriptor(b);
    int32_t status = HVT_TileFileBegin(b, &info, own);
    if (Failed(status)) return status;
    const int64_t step = d / 8 != 0 ? d / 8 : 1;
    const int64_t rows = int64_t{r.bottom} - r.top;
    // Rows wider than the step overlap; the block still holds the last whole.
    const int64_t size = std::max<int64_t>(
        {rows * step, (rows - 1) * step + RunBytes(d, r.left, int64_t{r.right} - r.left), 1});
    uint8_t *block = AllocRow(size);
    if (block == nullptr) {
        HVT_TileFileEnd(&info, own);
        return kErrMemory;
    }
    status = HVT_ReadBlock(0, &info, box, static_cast<int32_t>(step), block);
    HVT_TileFileEnd(&info, own);
    if (Failed(status)) {
        MEM_FreePtr(block);
        return status;
    }
    *stride = static_cast<int32_t>(step);
    *pointer = block;
    *temp = block;
    return kOk;
}

}  // namespace tessarine::storage
