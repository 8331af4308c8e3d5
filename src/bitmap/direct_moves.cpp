// Pixels moved between two bitmaps of one layout, plainly or through a 1-bit
// mask, on the four pairs of storage. Tile files are worked tile by tile, so
// that each tile a rectangle meets is read at most once and written at most
// once; a tile whose full width is replaced is not read at all.
#include <tessarine/bitmap.h>
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <algorithm>

#include "bitmap/block_movers.h"
#include "core/block_guards.h"
#include "core/status.h"
#include "storage/tile_format.h"

namespace bm = tessarine::bitmap;
namespace ts = tessarine::storage;
using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrFileAccess;
using tessarine::kErrGeneral;
using tessarine::kErrMemory;
using tessarine::kErrUnsupported;
using tessarine::kOk;

namespace {

// A file state of its own for one call: allocated, begun, and at the end
// closed with the given flag and freed.
class FileState {
  public:
    FileState() = default;
    FileState(const FileState &) = delete;
    FileState &operator=(const FileState &) = delete;
    ~FileState() {
        if (info_ == nullptr) return;
        HVT_TileFileEnd(info_, endFlag_);
        MEM_FreeHdl(info_);
    }
    int32_t Begin(const BI_Bitmap *b, int32_t openFlag, int32_t endFlag) {
        info_ = static_cast<HVT_FileInfo *>(MEM_AllocPtr(0, sizeof(HVT_FileInfo)));
        if (info_ == nullptr) return kErrMemory;
        HVT_InitFileInfo(info_);
        endFlag_ = endFlag;
        return HVT_TileFileBegin(b, info_, openFlag);
    }
    HVT_FileInfo *Info() const { return info_; }
    bm::Fence TileBufferFence() const {
        return {info_->tileBuffer, int64_t{(uint32_t{info_->header->bitsPerPixel} << 23) >> 3}};
    }

  private:
    HVT_FileInfo *info_ = nullptr;
    int32_t endFlag_ = 0;
};

bool Empty(const RECT &r) { return r.right <= r.left || r.bottom <= r.top; }

RECT Moved(const RECT &r, int64_t dx, int64_t dy) {
    return {static_cast<int32_t>(r.left + dx), static_cast<int32_t>(r.top + dy),
            static_cast<int32_t>(r.right + dx), static_cast<int32_t>(r.bottom + dy)};
}

// The pixel block of a bitmap in memory, locked for the call.
struct MemoryPixels {
    tessarine::LockGuard lock;
    explicit MemoryPixels(const BI_Bitmap *b) : lock(b->pixelHandle) {}
    bm::PixelArea Area(const BI_Bitmap *b) const {
        return {lock.Get(), int64_t{b->bytesPerRow}, {lock.Get(), lock.Size()}};
    }
    // The rectangle lies in the bitmap and in its block, at depth d: the text
    // does not clip, and memory outside the block is not the bitmap's.
    bool Holds(const BI_Bitmap *b, int d, const RECT &r) const {
        if (Empty(r)) return lock.Get() != nullptr;
        if (lock.Get() == nullptr || r.left < 0 || r.top < 0 || r.right > b->width ||
            r.bottom > b->height)
            return false;
        const int64_t rowEnd = (int64_t{r.right} * d + 7) >> 3;
        return rowEnd <= b->bytesPerRow &&
               int64_t{r.bottom - 1} * b->bytesPerRow + rowEnd <= lock.Size();
    }
};

// What differs between the plain copy and the masked one.
struct Job {
    bool masked;
    RECT srcRect, dstRect;
    BI_Bitmap *src, *dst;
    uint8_t srcSub, dstSub;
    bm::MaskArea mask;  // masked only: the point for the destination rectangle's corner
    int d;              // bitsPerPixel, from the source

    int64_t Dx() const { return int64_t{srcRect.left} - dstRect.left; }
    int64_t Dy() const { return int64_t{srcRect.top} - dstRect.top; }

    // Moves `rect` of the source area to (x, y) of the destination area; (x, y)
    // are in the destination's coordinates of the bitmap's pixels at (dx, dy).
    int32_t Move(const bm::PixelArea &from, const RECT &rect, const bm::PixelArea &to, int32_t x,
                 int32_t y, int64_t destX, int64_t destY) const {
        if (!masked) return bm::DirectCopyBits(d, from, rect, to, x, y);
        bm::MaskArea m = mask;
        m.x = static_cast<int32_t>(mask.x + (destX - dstRect.left));
        m.y = static_cast<int32_t>(mask.y + (destY - dstRect.top));
        return bm::DirectMaskBits(d, from, rect, m, to, x, y);
    }
    // The destination tile is read first unless the intersection replaces
    // whole tile rows; a masked move keeps unmasked pixels, so it always reads.
    int32_t ReadDestinationTile(HVT_FileInfo *info, int32_t i, const HVT_TileHdr &t,
                                const RECT &I) const {
        if (!masked && I.left == t.left && I.right == t.right) return kOk;
        return HVT_ReadTile(dstSub, info, i, I.top - t.top, I.bottom - I.top, info->tileBuffer);
    }
};

int64_t TileStride(const HVT_TileHdr &t, int d) { return ((int64_t{t.right} - t.left) * d + 7) >> 3; }

// Calls step(i, tile, I) for the tiles of sub-bitmap `sub` that R meets. The
// clamped form (masked tile to tile) keeps the first index at 0 at the least
// and the last at total - 1 at the most, and stops when the first index
// reaches the total.
template <class Step>
int32_t WalkTiles(HVT_FileInfo *info, uint8_t sub, const RECT &R, int d, bool clamped, Step &&step) {
    if (sub >= ts::kMaxSubbmps) return kErrArgument;
    HVT_SubbmpSlot &slot = info->subbmps[sub];
    if (slot.tileHdrs == nullptr) {
        const int32_t status = HVT_GetSubbmpTileHdrs(sub, info);
        if (Failed(status)) return status;
    }
    const int64_t across = slot.tilesAcross;
    const int64_t total = across * slot.tilesDown;
    if (across <= 0 || total <= 0) return kOk;
    int64_t first = HVT_PixelInWhichTile(slot.tilesAcross, R.left, R.top);
    const int32_t lastX = R.right == INT32_MIN ? INT32_MIN : R.right - 1;
    int64_t last = HVT_PixelInWhichTile(slot.tilesAcross, lastX, R.top);
    if (clamped) {
        first = std::max<int64_t>(first, 0);
        last = std::min<int64_t>(last, total - 1);
    } else if (last >= total) {
        return kOk;
    }
    // A rectangle left of or above the image by a whole tile names no tile.
    if (first < 0 || first >= total) return kOk;
    while (first < total && slot.tileHdrs[first].top < R.bottom) {
        const int64_t end = std::min(last, total - 1);
        for (int64_t i = first; i <= end; ++i) {
            const HVT_TileHdr &t = slot.tileHdrs[i];
            RECT I;
            const RECT tile{t.left, t.top, t.right, t.bottom};
            if (!IM_FindRECTInt(&tile, &R, &I)) continue;
            if (!ts::UsableTile(t, d)) return kErrFileAccess;
            const int32_t status = step(static_cast<int32_t>(i), t, I);
            if (Failed(status)) return status;
        }
        first += across;
        last += across;
        if (!clamped && last >= total) break;
    }
    return kOk;
}

// The part of R that lies on the sub-bitmap's image: all a walk can touch.
RECT OnImage(const HVT_FileInfo *info, uint8_t sub, const RECT &R) {
    if (sub >= ts::kMaxSubbmps) return {0, 0, 0, 0};
    const HVT_SubbmpSlot &slot = info->subbmps[sub];
    return {std::max(R.left, 0), std::max(R.top, 0), std::min(R.right, slot.width),
            std::min(R.bottom, slot.height)};
}

int32_t MemoryToMemory(const Job &job) {
    const MemoryPixels from(job.src), to(job.dst);
    const RECT &s = job.srcRect;
    const RECT place = Moved(s, -job.Dx(), -job.Dy());
    if (!from.Holds(job.src, job.d, s) || !to.Holds(job.dst, job.d, place)) return kErrGeneral;
    return job.Move(from.Area(job.src), s, to.Area(job.dst), job.dstRect.left, job.dstRect.top,
                    job.dstRect.left, job.dstRect.top);
}

int32_t MemoryToTile(const Job &job) {
    FileState file;
    // The masked route always asks for a descriptor of its own; it is closed
    // again at the end, so that no descriptor outlives the call. The record
    // it is begun from shows no descriptor, so that a failure before the
    // file is opened cannot close the bitmap's own.
    const int32_t open = job.masked ? 1 : job.dst->tileFile == -1;
    BI_Bitmap unopened;
    const BI_Bitmap *from = job.dst;
    if (job.masked && job.dst->tileFile != -1) {
        unopened = *job.dst;
        unopened.tileFile = -1;
        from = &unopened;
    }
    int32_t status = file.Begin(from, open, open);
    if (Failed(status)) return status;
    const MemoryPixels pixels(job.src);
    HVT_FileInfo *info = file.Info();
    const RECT reach = Moved(OnImage(info, job.dstSub, job.dstRect), job.Dx(), job.Dy());
    if (!Empty(reach) && !pixels.Holds(job.src, job.d, reach)) return kErrGeneral;
    const bm::PixelArea source = pixels.Area(job.src);
    return WalkTiles(info, job.dstSub, job.dstRect, job.d, false,
                     [&](int32_t i, const HVT_TileHdr &t, const RECT &I) {
                         const int32_t firstRow = I.top - t.top, rows = I.bottom - I.top;
                         const int32_t s0 = job.ReadDestinationTile(info, i, t, I);
                         if (Failed(s0)) return s0;
                         const bm::PixelArea buffer{info->tileBuffer, TileStride(t, job.d),
                                                    file.TileBufferFence()};
                         const int32_t s = job.Move(source, Moved(I, job.Dx(), job.Dy()), buffer,
                                                    I.left - t.left, 0, I.left, I.top);
                         if (Failed(s)) return s;
                         return HVT_SaveTile(job.dstSub, info, i, firstRow, rows, info->tileBuffer);
                     });
}

int32_t TileToMemory(const Job &job) {
    FileState file;
    const int32_t open = job.src->tileFile == -1;
    int32_t status = file.Begin(job.src, open, open);
    if (Failed(status)) return status;
    const MemoryPixels to(job.dst);
    HVT_FileInfo *info = file.Info();
    const RECT reach = Moved(OnImage(info, job.srcSub, job.srcRect), -job.Dx(), -job.Dy());
    if (!Empty(reach) && !to.Holds(job.dst, job.d, reach)) return kErrGeneral;
    const bm::PixelArea target = to.Area(job.dst);
    return WalkTiles(info, job.srcSub, job.srcRect, job.d, false,
                     [&](int32_t i, const HVT_TileHdr &t, const RECT &I) {
                         const int32_t rows = I.bottom - I.top;
                         const int32_t s = HVT_ReadTile(job.srcSub, info, i, I.top - t.top, rows,
                                                        info->tileBuffer);
                         if (Failed(s)) return s;
                         const bm::PixelArea buffer{info->tileBuffer, TileStride(t, job.d),
                                                    file.TileBufferFence()};
                         const RECT inBuffer{I.left - t.left, 0, I.right - t.left, rows};
                         const int64_t x = I.left - job.Dx(), y = I.top - job.Dy();
                         return job.Move(buffer, inBuffer, target, static_cast<int32_t>(x),
                                         static_cast<int32_t>(y), x, y);
                     });
}

int32_t TileToTile(const Job &job) {
    FileState srcFile, dstFile;
    const int32_t srcOpen = job.src->tileFile == -1, dstOpen = job.dst->tileFile == -1;
    int32_t status = srcFile.Begin(job.src, srcOpen, srcOpen);
    if (Failed(status)) return status;
    status = dstFile.Begin(job.dst, dstOpen, dstOpen);
    if (Failed(status)) return status;
    // The block is laid out by the record's depth and filled by the file's:
    // a record that disagrees with its file cannot take this route.
    if (srcFile.Info()->header->bitsPerPixel != job.d) return kErrUnsupported;
    // One tile's rows with two bytes to spare for the row movers.
    const int64_t S = ((int64_t{ts::kTileWidth} * job.d + 7) >> 3) + 2;
    auto *block = static_cast<uint8_t *>(MEM_AllocPtr(0, static_cast<uint32_t>(S * ts::kTileHeight)));
    if (block == nullptr) return kErrMemory;
    const tessarine::FreeGuard blockGuard(block);
    const bm::PixelArea blockArea{block, S, {block, S * ts::kTileHeight}};
    HVT_FileInfo *in = srcFile.Info();
    HVT_FileInfo *out = dstFile.Info();
    return WalkTiles(out, job.dstSub, job.dstRect, job.d, job.masked,
                     [&](int32_t i, const HVT_TileHdr &t, const RECT &I) {
                         const int32_t firstRow = I.top - t.top, rows = I.bottom - I.top;
                         const int32_t s0 = job.ReadDestinationTile(out, i, t, I);
                         if (Failed(s0)) return s0;
                         const RECT from = Moved(I, job.Dx(), job.Dy());
                         // The block starts on the byte that holds the left edge.
                         // (A depth of 0 is refused by the pixel mover below.)
                         const int32_t a = job.d == 0 ? from.left : static_cast<int32_t>(
                             ((int64_t{job.d} * from.left) & ~int64_t{7}) / job.d);
                         const HVT_Box box{a, from.top, from.right, from.bottom};
                         const bm::PixelArea buffer{out->tileBuffer, TileStride(t, job.d),
                                                    dstFile.TileBufferFence()};
                         if (!job.masked && (job.d == 8 || job.d == 24 || job.d == 32)) {
                             // Whole bytes land where the copy out of the block
                             // would put them: read them there at once.
                             uint8_t *at = out->tileBuffer + ((int64_t{I.left} - t.left) * job.d >> 3);
                             const int32_t s = HVT_ReadBlock(job.srcSub, in, &box,
                                                             static_cast<int32_t>(buffer.stride), at);
                             if (Failed(s)) return s;
                             return HVT_SaveTile(job.dstSub, out, i, firstRow, rows, out->tileBuffer);
                         }
                         int32_t s = HVT_ReadBlock(job.srcSub, in, &box, static_cast<int32_t>(S), block);
                         if (Failed(s)) return s;
                         const RECT inBlock{from.left - a, 0, from.left - a + (I.right - I.left), rows};
                         s = job.Move(blockArea, inBlock, buffer, I.left - t.left, 0, I.left, I.top);
                         if (Failed(s)) return s;
                         return HVT_SaveTile(job.dstSub, out, i, firstRow, rows, out->tileBuffer);
                     });
}

int32_t Run(const Job &job) {
    const bool srcMem = job.src->storage & BI_STORAGE_MEMORY;
    const bool dstMem = job.dst->storage & BI_STORAGE_MEMORY;
    const bool srcTile = !srcMem && (job.src->storage & BI_STORAGE_TILEFILE);
    const bool dstTile = !dstMem && (job.dst->storage & BI_STORAGE_TILEFILE);
    if ((!srcMem && !srcTile) || (!dstMem && !dstTile)) return kErrUnsupported;
    if (srcMem && dstMem) return MemoryToMemory(job);
    if (srcMem) return MemoryToTile(job);
    if (dstMem) return TileToMemory(job);
    return TileToTile(job);
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BI_DirectCopyBmp(const RECT *sourceRect, BI_Bitmap *source,
                                       const RECT *destinationRect, BI_Bitmap *destination,
                                       uint8_t sourceSub, uint8_t destinationSub) {
    if (source->imageType == 3) {
        // The destination's table follows the source's; its colour index is
        // not rebuilt.
        uint8_t table[256 * 3];
        int32_t count = 0;
        if (source->colorCount > 256) return kErrGeneral;
        int32_t status = BI_GetRGBColorTable(source, &count, table);
        if (Failed(status)) return status;
        status = BI_SetRGBColorTable(destination, count, table);
        if (Failed(status)) return status;
    }
    const Job job{false,  *sourceRect, *destinationRect, source, destination, sourceSub,
                  destinationSub, {}, source->bitsPerPixel};
    return Run(job);
}

TESSARINE_API int32_t BI_DirectMaskBmp(const RECT *sourceRect, BI_Bitmap *source,
                                       int32_t maskStride, int32_t maskX, int32_t maskY,
                                       const uint8_t *maskBase, const RECT *destinationRect,
                                       BI_Bitmap *destination) {
    const Job job{true, *sourceRect, *destinationRect, source, destination, 0, 0,
                  {maskBase, maskStride, maskX, maskY}, source->bitsPerPixel};
    return Run(job);
}

}  // extern "C"
