// Row and column transfer sessions: a band of a tiled bitmap kept in memory
// for as long as a bulk job runs over its rows.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <algorithm>

#include "core/status.h"
#include "platform/memory_advice.h"
#include "storage/row_session.h"
#include "storage/tile_format.h"

namespace ts = tessarine::storage;
using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrBudget;
using tessarine::kErrGeneral;
using tessarine::kErrMemory;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

int32_t AllocBuffer(int64_t size, MEM_Handle *handle, uint8_t **buffer) {
    if (size < 1 || size > UINT32_MAX) return kErrMemory;
    *handle = MEM_AllocHdl(0, static_cast<uint32_t>(size));
    if (*handle == nullptr) return kErrMemory;
    *buffer = static_cast<uint8_t *>(MEM_Lock(*handle));
    // A band is read whole and streamed through once per band.
    tessarine::platform::AdviseLargePages(*buffer, static_cast<size_t>(size));
    return kOk;
}

// Band rows for a budget: kMaxBandRows, halved until the band fits, then no
// more than the region is high.
int32_t BandRowsFor(int64_t budget, int64_t rowBytes, int64_t regionRows) {
    int64_t rows = ts::kMaxBandRows;
    const int64_t fit = budget / rowBytes;
    if (fit < ts::kMaxBandRows)
        while (rows > fit && rows > 0) rows /= 2;
    return static_cast<int32_t>(std::min(rows, std::max<int64_t>(regionRows, 0)));
}

// The region: the box, or the whole sub-bitmap. Below 8 bits a row
// session's left edge moves down to the pixel that starts its byte.
HVT_Box RegionOf(const HVT_FileInfo *s, const HVT_Box *box, int64_t d, bool rotated) {
    const HVT_SubbmpSlot &slot = s->subbmps[s->subIndex];
    HVT_Box region = box != nullptr ? *box : HVT_Box{0, 0, slot.width, slot.height};
    if (box != nullptr && d < 8 && !rotated)
        region.left -= static_cast<int32_t>(((region.left * d) & 7) / d);
    return region;
}

// Size of each buffer by mode, or the status when no band fits.
int32_t BufferSize(HVT_FileInfo *s, int64_t rowBytes, int32_t budget, bool rotated, int64_t *size) {
    const HVT_Box &region = s->regionBox;
    if (ts::IsBandMode(s->sessionMode)) {
        // A region with no row, or rows wider than any buffer, holds no band.
        if (rowBytes < 1) return kErrBudget;
        s->bandRows = BandRowsFor(budget == 0 ? ts::kDefaultBandBudget : budget, rowBytes,
                                  int64_t{region.bottom} - region.top);
        if (s->bandRows < 1) return kErrBudget;
        *size = s->bandRows * rowBytes;
    } else if (s->sessionMode == ts::kModeWindow && !rotated) {
        *size = ts::kWindowBufferBytes;
    } else {
        if (rowBytes < 1) return kErrBudget;
        *size = rowBytes;
    }
    return kOk;
}

int32_t Configure(uint8_t flags, const HVT_Box *box, uint8_t mode, uint8_t sub, int32_t budget,
                  bool rotated, HVT_FileInfo *s) {
    s->sessionFlags = flags;
    s->sessionMode = mode;
    s->subIndex = sub;
    const int64_t d = s->header->bitsPerPixel;
    if (d == 0) return kErrUnsupported;
    const HVT_Box region = s->regionBox = RegionOf(s, box, d, rotated);
    const int64_t rowBytes = (region.right * d) / 8 - (region.left * d) / 8 + 1;
    s->bandRowBytes = static_cast<int32_t>(std::clamp<int64_t>(rowBytes, INT32_MIN, INT32_MAX));
    if (!rotated) s->readRowBytes = s->writeRowBytes = static_cast<int32_t>(d * ts::kWindowSide);
    const bool reads = (flags & ts::kSessionReads) != 0;
    const bool writes = (flags & ts::kSessionWrites) != 0 && !rotated;
    if (rotated && !reads) return kOk;
    int64_t size = 0;
    int32_t status = BufferSize(s, rowBytes, budget, rotated, &size);
    if (!Failed(status) && reads) status = AllocBuffer(size, &s->readHandle, &s->readBuffer);
    if (!Failed(status) && writes) status = AllocBuffer(size, &s->writeHandle, &s->writeBuffer);
    if (Failed(status)) return status;
    if (reads) s->readBox = {region.left, -1, region.right, -1};
    if (!rotated) {
        s->writeBox = {region.left, -1, region.right, -1};
        s->pendingBox = {region.left, -1, region.right, -1};
    }
    return kOk;
}

int32_t Begin(uint8_t flags, BI_Bitmap *bitmap, const HVT_Box *box, uint8_t mode, uint8_t sub,
              int32_t budget, bool rotated) {
    if (bitmap->storage & BI_STORAGE_MEMORY) return kOk;
    if (sub >= ts::kMaxSubbmps) return kErrArgument;
    // A session present is replaced without a look.
    auto *s = static_cast<HVT_FileInfo *>(MEM_AllocPtr(0, sizeof(HVT_FileInfo)));
    bitmap->ioSession = s;
    if (s == nullptr) return kErrMemory;
    HVT_InitFileInfo(s);
    const int32_t own = bitmap->tileFile == -1 ? 1 : 0;
    int32_t status = HVT_TileFileBegin(bitmap, s, own);
    if (!Failed(status)) {
        status = Configure(flags, box, mode, sub, budget, rotated, s);
        if (Failed(status)) HVT_TileFileEnd(s, own);
    }
    if (Failed(status)) {
        MEM_FreePtr(s);
        bitmap->ioSession = nullptr;
    }
    return status;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t HVT_TileFileRowIOBegin(uint8_t flags, BI_Bitmap *bitmap, const HVT_Box *box,
                                             uint8_t mode, uint8_t sub, int32_t budget) {
    return Begin(flags, bitmap, box, mode, sub, budget, false);
}

TESSARINE_API int32_t HVT_RotatedTileFileColIOBegin(uint8_t flags, BI_Bitmap *bitmap,
                                                    const HVT_Box *box, uint8_t mode, uint8_t sub,
                                                    int32_t budget) {
    return Begin(flags, bitmap, box, mode, sub, budget, true);
}

TESSARINE_API void HVT_TileFileRowColIOEnd(BI_Bitmap *bitmap) {
    HVT_FileInfo *s = bitmap->ioSession;
    if (s == nullptr) return;
    // There is no result to carry a failed save.
    if ((s->sessionFlags & ts::kSessionWrites) && ts::HasPending(s)) (void)ts::SavePending(s);
    HVT_TileFileEnd(s, bitmap->tileFile == -1 ? 1 : 0);
    MEM_FreePtr(s);
    bitmap->ioSession = nullptr;
}

}  // extern "C"

namespace tessarine::storage {

HVT_Box BandOf(const HVT_FileInfo *s, int64_t y) {
    const int64_t rows = s->bandRows;
    const HVT_Box &r = s->regionBox;
    const int64_t start = y - (((y % rows) + rows) % rows);
    return {r.left, static_cast<int32_t>(std::max<int64_t>(start, r.top)), r.right,
            static_cast<int32_t>(std::min<int64_t>(start + rows, r.bottom))};
}

int64_t WriteStride(const HVT_FileInfo *s) {
    return s->sessionMode == kModeWindow ? s->writeRowBytes : s->bandRowBytes;
}

bool HasPending(const HVT_FileInfo *s) {
    const HVT_Box &p = s->pendingBox;
    const HVT_Box &r = s->regionBox;
    return s->writeBuffer != nullptr && r.top <= p.top && p.bottom <= r.bottom && p.top < p.bottom;
}

int32_t SavePending(HVT_FileInfo *s) {
    const int64_t stride = WriteStride(s);
    const int64_t at = (int64_t{s->pendingBox.top} - s->writeBox.top) * stride;
    const int64_t size = s->writeHandle != nullptr ? MEM_HdlSize(s->writeHandle) : 0;
    if (at < 0 || at >= size) return kErrGeneral;
    return HVT_SaveBlock(s->subIndex, s, &s->pendingBox, static_cast<int32_t>(stride),
                         s->writeBuffer + at);
}

}  // namespace tessarine::storage
