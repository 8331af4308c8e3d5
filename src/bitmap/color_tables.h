// Colour tables as the row functions and map tables see them: implied tables
// of gray and black-and-white bitmaps, nearest-colour searches, the colour
// index, and the one rule from RGB to gray.
#pragma once

#include <cstdint>

#include <tessarine/bitmap.h>

namespace tessarine::bitmap {

// Gray density (ink) of an RGB colour.
inline uint8_t GrayOf(uint8_t r, uint8_t g, uint8_t b) {
    if (r == g && g == b) return static_cast<uint8_t>(255 - b);
    return static_cast<uint8_t>(255 - (30 * r + 59 * g + 11 * b) / 100);
}

// Gray density of a CMYK colour: the three inks weighted over what black leaves.
inline uint8_t GrayOfCmyk(uint8_t c, uint8_t m, uint8_t y, uint8_t k) {
    return static_cast<uint8_t>(k + ((255 - k) * (6 * c + 3 * m + y)) / 2550);
}

// The implied table of a gray or black-and-white bitmap of depth d (1, 4 or
// 8): 1 << d entries of 3 (RGB) or 4 (CMYK) bytes. False for another depth.
bool ImpliedRGBTable(int d, uint8_t *entries);
bool ImpliedCMYKTable(int d, uint8_t *entries);

// Nearest entry by squared distance over `count` entries of 4 bytes: the
// first of equal distances; 0 when count is below 1.
uint8_t CmykNearest(uint8_t c, uint8_t m, uint8_t y, uint8_t k, int32_t count,
                    const uint8_t *entries);

// One sorted colour-index entry.
struct ColorIndexEntry {
    uint32_t key;  // R | G << 8 | B << 16
    uint8_t index;
    uint8_t unused[3];
};
static_assert(sizeof(ColorIndexEntry) == 8);

inline uint32_t ColorKey(uint8_t r, uint8_t g, uint8_t b) {
    return uint32_t{r} | uint32_t{g} << 8 | uint32_t{b} << 16;
}

// Entries of a colour index that its block really holds, at most `count`.
int32_t ColorIndexEntries(const void *colorIndex, int32_t count);

// A locked view of a bitmap's colour table; bytes past the block read as 0.
class TableView {
  public:
    explicit TableView(MEM_Handle table);
    ~TableView();
    TableView(const TableView &) = delete;
    TableView &operator=(const TableView &) = delete;
    uint8_t At(int64_t i) const { return i >= 0 && i < size_ ? bytes_[i] : 0; }
    const uint8_t *Bytes() const { return bytes_; }
    int64_t Size() const { return size_; }

  private:
    MEM_Handle handle_;
    const uint8_t *bytes_ = nullptr;
    int64_t size_ = 0;
};

}  // namespace tessarine::bitmap
