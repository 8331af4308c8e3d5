// The row routes that need no session: a bitmap in memory hands out a pointer
// into its pixels; a tile bitmap without a session opens its file around
// each row.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "storage/row_access.h"
#include "storage/tile_format.h"

namespace tessarine::storage {
namespace {

// A temporary row: a whole image row and two bytes, or what the caller reads.
int64_t TempRowBytes(const BI_Bitmap *b, int64_t needed) {
    return std::max<int64_t>(((int64_t{b->bitsPerPixel} * b->width + 7) >> 3) + 2, needed);
}

}  // namespace

int32_t LockMemoryRow(BI_Bitmap *b, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a) {
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

int32_t ReadRowAlone(BI_Bitmap *b, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a) {
    if (!RunInside(y, x, n, 0, 0, b->width, b->height)) return kErrGeneral;
    if (n == 0) return kOk;
    LocalFileInfo info(b);
    if (Failed(info.Status())) return info.Status();
    const int64_t size = TempRowBytes(b, needed);
    ScopedBlock temp(AllocRow(size));
    if (temp.Get() == nullptr) return kErrMemory;
    const PixelSpan w = Widen(b->bitsPerPixel, x, n, b->width);
    const HVT_Box box = MakeBox(w.left, y, w.right, y + 1);
    const int32_t read = HVT_ReadBlock(0, info.Get(), &box, 0, temp.Get());
    if (Failed(read)) return read;
    a->temp = temp.Release();
    return Hand(static_cast<uint8_t *>(a->temp), size, 0, needed, a);
}

int32_t WriteRowAlone(BI_Bitmap *b, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a) {
    const int64_t d = b->bitsPerPixel;
    if (!RunInside(y, x, n, 0, 0, b->width, b->height)) return kErrGeneral;
    ScopedBlock record(MEM_AllocPtr(0, sizeof(HVT_FileInfo)));
    auto *info = static_cast<HVT_FileInfo *>(record.Get());
    if (info == nullptr) return kErrMemory;
    HVT_InitFileInfo(info);
    const int32_t own = OwnDescriptor(b);
    int32_t status = HVT_TileFileBegin(b, info, own);
    if (Failed(status)) return status;
    FileInfoEnd end(info, own);
    const int64_t size = TempRowBytes(b, needed);
    ScopedBlock temp(AllocRow(size));
    if (temp.Get() == nullptr) return kErrMemory;
    // The edge bytes keep the pixels around the run: the row is read first
    // when the run does not fill them.
    if (n > 0 && PartialEdges(d, x, n, b->width)) {
        const PixelSpan w = Widen(d, x, n, b->width);
        const HVT_Box box = MakeBox(w.left, y, w.right, y + 1);
        status = HVT_ReadBlock(0, info, &box, 0, temp.Get());
        if (Failed(status)) return status;
    }
    end.Release();
    a->alone = static_cast<HVT_FileInfo *>(record.Release());
    a->temp = temp.Release();
    return Hand(static_cast<uint8_t *>(a->temp), size, 0, needed, a);
}

}  // namespace tessarine::storage
