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

// Band rows for a budget: 1024, halved until the band fits, then no more than
// the region is high.
int32_t BandRowsFor(int64_t budget, int64_t rowBytes, int64_t regionRows) {
    int64_t rows = ts::kMaxBandRows;
    const int64_t fit = budget / rowBytes;
    if (fit < ts::kMaxBandRows)
        while (rows > fit && rows > 0) rows /= 2;
    return static_cast<int32_t>(std::min(rows, std::max<int64_t>(regionRows, 0)));
}

int32_t Configure(uint8_t flags, const HVT_Box *box, uint8_t mode, uint8_t sub, int32_t budget,
                  bool rotated, HVT_FileInfo *s) {
    s->sessionFlags = flags;
    s->sessionMode = mode;
    s->subIndex = sub;
    const int64_t d = s->header->bitsPerPixel;
    if (d == 0) return kErrUnsupported;
    const HVT_SubbmpSlot &slot = s->subbmps[sub];
    HVT_Box region = box != nullptr ? *box : HVT_Box{0, 0, slot.width, slot.height};
    if (box != nullptr && d < 8 && !rotated)
        region.left -= static_cast<int32_t>(((region.left * d) & 7) / d);
    s->regionBox = region;
    const int64_t rowBytes = (region.right * d) / 8 - (region.left * d) / 8 + 1;
    s->bandRowBytes = static_cast<int32_t>(std::clamp<int64_t>(rowBytes, INT32_MIN, INT32_MAX));
    if (!rotated) s->readRowBytes = s->writeRowBytes = static_cast<int32_t>(d * 100);
    if (rotated && !(flags & 1)) return kOk;

    int64_t size;
    if (mode == 2 || mode == 3) {
        // A region with no row, or rows wider than any buffer, holds no band.
        if (rowBytes < 1) return kErrBudget;
        s->bandRows = BandRowsFor(budget == 0 ? ts::kDefaultBandBudget : budget, rowBytes,
                                  int64_t{region.bottom} - region.top);
        if (s->bandRows < 1) return kErrBudget;
        size = s->bandRows * rowBytes;
    } else if (mode == 1 && !rotated) {
        size = ts::kWindowBufferBytes;
    } else {
        if (rowBytes < 1) return kErrBudget;
        size = rowBytes;
    }
    int32_t status = kOk;
    if (flags & 1) status = AllocBuffer(size, &s->readHandle, &s->readBuffer);
    if (!Failed(status) && (flags & 2) && !rotated)
        status = AllocBuffer(size, &s->writeHandle, &s->writeBuffer);
    if (Failed(status)) return status;
    if (flags & 1) s->readBox = {region.left, -1, region.right, -1};
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
    if ((s->sessionFlags & 2) && ts::HasPending(s)) (void)ts::SavePending(s);
    HVT_TileFileEnd(s, bitmap->tileFile == -1 ? 1 : 0);
    MEM_FreePtr(s);
    bitmap->ioSession = nullptr;
}

}  // extern "C"
