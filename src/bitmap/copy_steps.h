// What the whole-bitmap copies share: one-byte-per-channel planes, the row
// transfers begun on tile-only bitmaps, and the profile a copy hands on.
#pragma once

#include <cstdint>

#include <tessarine/bitmap.h>

namespace tessarine::bitmap {

// Up to four zero-filled planes of `width` bytes, one block each, freed with
// the object.
class Planes {
  public:
    Planes() = default;
    ~Planes();
    Planes(const Planes &) = delete;
    Planes &operator=(const Planes &) = delete;
    // -5 when a plane cannot be had; those already had are freed later.
    int32_t Allocate(int count, int64_t width);
    uint8_t *operator[](int i) const { return planes_[i]; }

  private:
    uint8_t *planes_[4] = {};
};

// Pixels only in a tile file: storage bit 0 clear and bit 1 set.
inline bool TileOnly(const BI_Bitmap *b) { return (b->storage & 3) == 2; }

// False when a copy's transfers would overwrite one already open on either
// bitmap, or both are one tile-only bitmap: a session record would be lost.
bool CopyTransfersFit(const BI_Bitmap *source, const BI_Bitmap *destination);

// Begins a band transfer for reading on a tile-only source and one for
// writing on a tile-only destination, over the two rectangles.
int32_t BeginCopyTransfers(BI_Bitmap *source, const RECT *sourceRect, uint8_t sourceSub,
                           BI_Bitmap *destination, const RECT *destinationRect,
                           uint8_t destinationSub);

// The destination's profile becomes a copy of the source's, or goes when the
// source has none. A copy that cannot get its memory leaves it null.
void HandOnProfile(const BI_Bitmap *source, BI_Bitmap *destination);

// The destination's profile becomes a copy of `path`, or an empty path when
// `path` is null.
void ReplaceProfile(BI_Bitmap *destination, const AFilePath *path);

// Pixels of a rectangle; false for a negative or overflowing extent.
inline bool RectExtent(const RECT &r, int32_t *width) {
    const int64_t w = int64_t{r.right} - r.left;
    if (w < 0 || w > INT32_MAX) return false;
    *width = static_cast<int32_t>(w);
    return true;
}

}  // namespace tessarine::bitmap
