// The block read of the column functions: a box of pixels with its stride,
// straight from memory, or from the tile file packed at a stride of one
// pixel (one byte below 8 bits), so that a box one pixel wide comes back as
// a column. Sessions are not consulted.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "storage/row_access.h"
#include "storage/tile_format.h"

namespace tessarine::storage {
namespace {

int32_t LockMemoryBlock(BI_Bitmap *b, const HVT_Box &r, int32_t *stride, uint8_t **pointer) {
    if (b->pixelHandle == nullptr) return kErrGeneral;
    auto *base = static_cast<uint8_t *>(MEM_Lock(b->pixelHandle));
    if (base == nullptr) return kErrGeneral;
    *stride = static_cast<int32_t>(b->bytesPerRow);
    *pointer = base + int64_t{r.top} * b->bytesPerRow + ((int64_t{b->bitsPerPixel} * r.left) >> 3);
    return kOk;
}

int32_t ReadTileBlock(BI_Bitmap *b, const HVT_Box &r, int32_t *stride, uint8_t **pointer,
                      void **temp) {
    const int64_t d = b->bitsPerPixel;
    LocalFileInfo info(b);
    if (Failed(info.Status())) return info.Status();
    const int64_t step = d / 8 != 0 ? d / 8 : 1;
    const int64_t rows = int64_t{r.bottom} - r.top;
    // Rows wider than the step overlap; the block still holds the last whole.
    const int64_t size = std::max<int64_t>(
        {rows * step, (rows - 1) * step + RunBytes(d, r.left, int64_t{r.right} - r.left), 1});
    ScopedBlock block(AllocRow(size));
    if (block.Get() == nullptr) return kErrMemory;
    const int32_t read = HVT_ReadBlock(0, info.Get(), &r, static_cast<int32_t>(step), block.Get());
    if (Failed(read)) return read;
    *stride = static_cast<int32_t>(step);
    *pointer = static_cast<uint8_t *>(block.Get());
    *temp = block.Release();
    return kOk;
}

}  // namespace

int32_t BI_LockBlockRead(BI_Bitmap *b, const HVT_Box *box, int32_t *stride, uint8_t **pointer,
                         void **temp) {
    *temp = nullptr;
    const HVT_Box &r = *box;
    if (b->bitsPerPixel == 0) return kErrUnsupported;
    if (r.left < 0 || r.top < 0 || r.left > r.right || r.top > r.bottom || r.right > b->width ||
        r.bottom > b->height)
        return kErrGeneral;
    if (InMemory(b)) return LockMemoryBlock(b, r, stride, pointer);
    return ReadTileBlock(b, r, stride, pointer, temp);
}

}  // namespace tessarine::storage
