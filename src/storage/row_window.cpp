// The window mode of a session: a small block of rows around the requested
// row, count rows high, of the columns the run spans.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/rect_ops.h"
#include "storage/row_access.h"

namespace tessarine::storage {
namespace {

// Rows of a window placed at y: count rows, as many as the buffer holds,
// within the region.
int64_t WindowBottom(const HVT_FileInfo *s, int64_t y, int64_t n, int64_t rowBytes, int64_t size) {
    int64_t bottom = std::min<int64_t>(y + n, s->regionBox.bottom);
    if (rowBytes > 0) bottom = std::min(bottom, y + size / rowBytes);
    return bottom;
}

void DropWrites(HVT_FileInfo *s) {
    s->writeBox.top = s->writeBox.bottom = -1;
    s->pendingBox.top = s->pendingBox.bottom = -1;
}

// Reads the window at y into readBuffer; pending rows it meets are saved
// first, so that it reads what was written.
int32_t PlaceReadWindow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, const PixelSpan &w,
                        int64_t size) {
    const int64_t d = s->header->bitsPerPixel;
    const int64_t rowBytes = WindowRowBytes(d, x, n);
    if (rowBytes > size) return kErrGeneral;
    const HVT_Box window = MakeBox(w.left, y, w.right, WindowBottom(s, y, n, rowBytes, size));
    if (HasPending(s) && RectsOverlap(window, s->pendingBox)) {
        const int32_t status = SavePending(s);
        if (Failed(status)) return status;
        DropWrites(s);
    }
    s->readBox = window;
    s->readRowBytes = static_cast<int32_t>(rowBytes);
    const int32_t status = HVT_ReadBlock(s->subIndex, s, &s->readBox, s->readRowBytes, s->readBuffer);
    if (Failed(status)) s->readBox.top = s->readBox.bottom = -1;
    return status;
}

// Places the write window at y, saving what is pending first. Below 8 bits
// the window's edge bytes, and a byte the widening took in, go back whole,
// so they are read first.
int32_t PlaceWriteWindow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, const PixelSpan &w,
                         int64_t size) {
    if (HasPending(s)) {
        const int32_t status = SavePending(s);
        if (Failed(status)) return status;
    }
    const int64_t d = s->header->bitsPerPixel;
    const int64_t rowBytes = WindowRowBytes(d, x, n);
    if (rowBytes > size) return kErrGeneral;
    HVT_Box &wb = s->writeBox;
    wb = MakeBox(w.left, y, w.right, WindowBottom(s, y, n, rowBytes, size));
    s->pendingBox = MakeBox(w.left, y, w.right, y);
    s->writeRowBytes = static_cast<int32_t>(rowBytes);
    const bool widened = w.left != x || w.right != x + n;
    if (d >= 8 || !(widened || PartialEdges(d, x, n, s->subbmps[s->subIndex].width))) return kOk;
    // A window of no rows (a count of 0) still hands out row y.
    HVT_Box window = wb;
    window.bottom = std::max(window.bottom, static_cast<int32_t>(y + 1));
    const int32_t status = HVT_ReadBlock(s->subIndex, s, &window, s->writeRowBytes, s->writeBuffer);
    if (Failed(status)) DropWrites(s);
    return status;
}

bool SameColumns(const PixelSpan &w, const HVT_Box &box) { return w.left == box.left && w.right == box.right; }
bool InRows(int64_t y, const HVT_Box &box) { return y >= box.top && y < box.bottom; }

}  // namespace

int32_t ReadWindowRow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a) {
    const PixelSpan w = Widen(s->header->bitsPerPixel, x, n, s->regionBox.right);
    const int64_t size = BlockSize(s->readHandle);
    if (!(SameColumns(w, s->readBox) && InRows(y, s->readBox))) {
        const int32_t status = PlaceReadWindow(s, y, x, n, w, size);
        if (Failed(status)) return status;
    }
    return Hand(s->readBuffer, size, (y - s->readBox.top) * s->readRowBytes, needed, a);
}

int32_t WriteWindowRow(HVT_FileInfo *s, int64_t y, int64_t x, int64_t n, int64_t needed, RowAccess *a) {
    const PixelSpan w = Widen(s->header->bitsPerPixel, x, n, s->regionBox.right);
    const int64_t size = BlockSize(s->writeHandle);
    if (!(SameColumns(w, s->writeBox) && InRows(y, s->writeBox))) {
        const int32_t status = PlaceWriteWindow(s, y, x, n, w, size);
        if (Failed(status)) return status;
    }
    HVT_Box &pending = s->pendingBox;
    if (y >= pending.bottom)
        pending.bottom += 1;
    else if (y < pending.top)
        return kRowRefused;
    return Hand(s->writeBuffer, size, (y - s->writeBox.top) * s->writeRowBytes, needed, a);
}

}  // namespace tessarine::storage
