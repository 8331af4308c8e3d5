// What the row services' routes share: run arithmetic, handing out a row,
// and the routes themselves, one file each (memory and the tile file alone
// in row_alone.cpp, the window mode in row_window.cpp, the band modes in
// row_band.cpp).
#pragma once

#include <algorithm>
#include <cstdint>

#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/row_services.h"
#include "storage/row_session.h"

namespace tessarine::storage {

// A row outside a session's region, or a write with a gap: -1 in the low 16
// bits only, as the window and band modes report it.
inline constexpr int32_t kRowRefused = 0xFFFF;

inline int32_t Refused(const HVT_FileInfo *s) {
    return CachesRows(s->sessionMode) ? kRowRefused : kErrGeneral;
}

inline bool InMemory(const BI_Bitmap *b) { return (b->storage & BI_STORAGE_MEMORY) != 0; }
// The open flag of a record of the bitmap's file: a descriptor of its own
// when the bitmap keeps none.
inline int32_t OwnDescriptor(const BI_Bitmap *b) { return b->tileFile == -1 ? 1 : 0; }

inline HVT_Box MakeBox(int64_t left, int64_t top, int64_t right, int64_t bottom) {
    return {static_cast<int32_t>(left), static_cast<int32_t>(top), static_cast<int32_t>(right),
            static_cast<int32_t>(bottom)};
}

inline bool RunInside(int64_t y, int64_t x, int64_t n, int64_t left, int64_t top, int64_t right,
                      int64_t bottom) {
    return y >= top && y < bottom && x >= left && x + n <= right;
}

struct PixelSpan {
    int64_t left;
    int64_t right;
};

// The run widened to the bytes that hold its edge pixels, below 8 bits.
inline PixelSpan Widen(int64_t d, int64_t x, int64_t n, int64_t limit) {
    if (d >= 8) return {x, x + n};
    PixelSpan s{x - ((d * x) & 7) / d, x + n};
    const int64_t e = (d * (x + n)) & 7;
    if (e != 7) s.right += (7 - e) / d;
    s.right = std::min(s.right, limit);
    return s;
}

// True when the run's edge bytes also hold pixels of the image outside it,
// which must come from the file before the bytes go back.
inline bool PartialEdges(int64_t d, int64_t x, int64_t n, int64_t width) {
    if (d >= 8) return false;
    return ((x * d) & 7) != 0 || ((((x + n) * d) & 7) != 0 && x + n < width);
}

// Bytes from x's byte to the byte after the run's last, in the window mode.
inline int64_t WindowRowBytes(int64_t d, int64_t x, int64_t n) {
    return (d * (x + n)) / 8 - (d * x) / 8 + (d < 8 ? 1 : 0);
}

// A fixed block for a temporary row or block; null when it cannot be had.
inline uint8_t *AllocRow(int64_t bytes) {
    if (bytes <= 0 || bytes > UINT32_MAX) return nullptr;
    return static_cast<uint8_t *>(MEM_AllocPtr(0, static_cast<uint32_t>(bytes)));
}

inline int64_t BlockSize(MEM_Handle h) { return h != nullptr ? MEM_HdlSize(h) : 0; }

// Hands out the row at `offset` of a block of `size` bytes, when the caller's
// `needed` bytes fit.
inline int32_t Hand(uint8_t *block, int64_t size, int64_t offset, int64_t needed, RowAccess *a) {
    if (offset < 0 || offset + needed > size) return kErrGeneral;
    a->row = block + offset;
    a->room = size - offset;
    return kOk;
}

// Ends a record of the bitmap's file when it leaves scope, unless released.
class FileInfoEnd {
  public:
    FileInfoEnd(HVT_FileInfo *info, int32_t closeFile) : info_(info), close_(closeFile) {}
    FileInfoEnd(const FileInfoEnd &) = delete;
    FileInfoEnd &operator=(const FileInfoEnd &) = delete;
    ~FileInfoEnd() {
        if (info_ != nullptr) HVT_TileFileEnd(info_, close_);
    }
    void Release() { info_ = nullptr; }

  private:
    HVT_FileInfo *info_;
    int32_t close_;
};

// A record of the bitmap's tile file for the length of one call, on a
// descriptor of its own when the bitmap keeps none; ended when it leaves
// scope. A failed begin has ended it already.
class LocalFileInfo {
  public:
    explicit LocalFileInfo(const BI_Bitmap *b) : own_(OwnDescriptor(b)) {
        HVT_InitFileInfo(&info_);
        status_ = HVT_TileFileBegin(b, &info_, own_);
    }
    LocalFileInfo(const LocalFileInfo &) = delete;
    LocalFileInfo &operator=(const LocalFileInfo &) = delete;
    ~LocalFileInfo() {
        if (!Failed(status_)) HVT_TileFileEnd(&info_, own_);
    }
    int32_t Status() const { return status_; }
    HVT_FileInfo *Get() { return &info_; }

  private:
    HVT_FileInfo info_;
    int32_t own_;
    int32_t status_;
};

// The routes. Each checks its own run and hands out the row of count pixels
// from x in row y through `a`.
int32_t LockMemoryRow(BI_Bitmap *b, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a);
int32_t ReadRowAlone(BI_Bitmap *b, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a);
int32_t WriteRowAlone(BI_Bitmap *b, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a);
int32_t ReadWindowRow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a);
int32_t WriteWindowRow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a);
int32_t ReadBandRow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a);
int32_t WriteBandRow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a);

}  // namespace tessarine::storage
