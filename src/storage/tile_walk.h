// The walk over the tiles that a box meets, shared by the four block
// transfers: bands of tiles from the top, left to right in a band.
#pragma once

#include <algorithm>
#include <cstdint>

#include <tessarine/storage.h>

#include "core/rect_ops.h"
#include "core/status.h"
#include "storage/tile_format.h"

namespace tessarine::storage {

// The columns and bands of tiles a box meets. The walk stays inside the
// table: the parts of a box past the last tile column or row, or left of or
// above the image, find nothing.
class TileWalk {
  public:
    TileWalk(const HVT_SubbmpSlot &slot, const HVT_Box &box, int32_t d) : slot_(slot), box_(box), d_(d) {
        const int64_t across = slot.tilesAcross;
        const int64_t down = slot.tilesDown;
        if (across <= 0 || down <= 0) return;
        colLo_ = std::max<int64_t>(box.left / kTileWidth, 0);
        colHi_ = std::min<int64_t>((int64_t{box.right} - 1) / kTileWidth, across - 1);
        if (colLo_ > colHi_) return;
        rowLo_ = rowEnd_ = std::max<int64_t>(box.top / kTileHeight, 0);
        while (rowEnd_ < down && Band(rowEnd_)[colLo_].top < box.bottom) ++rowEnd_;
    }

    // Calls visit(tile, intersection) for each tile the box meets, in the
    // order of the walk; a failure stops it.
    template <class Visit>
    int32_t Forward(Visit &&visit) const {
        for (int64_t row = rowLo_; row < rowEnd_; ++row)
            for (int64_t col = colLo_; col <= colHi_; ++col) {
                const int32_t s = Visit1(Band(row)[col], visit);
                if (Failed(s)) return s;
            }
        return kOk;
    }

    // The same tiles, last first.
    template <class Visit>
    int32_t Backward(Visit &&visit) const {
        for (int64_t row = rowEnd_ - 1; row >= rowLo_; --row)
            for (int64_t col = colHi_; col >= colLo_; --col) {
                const int32_t s = Visit1(Band(row)[col], visit);
                if (Failed(s)) return s;
            }
        return kOk;
    }

  private:
    const HVT_TileHdr *Band(int64_t row) const { return slot_.tileHdrs + row * slot_.tilesAcross; }

    template <class Visit>
    int32_t Visit1(const HVT_TileHdr &t, Visit &visit) const {
        const HVT_Box I = IntersectRect(HVT_Box{t.left, t.top, t.right, t.bottom}, box_);
        if (IsEmptyRect(I)) return kOk;
        if (!UsableTile(t, d_)) return kErrFileAccess;
        return visit(t, I);
    }

    const HVT_SubbmpSlot &slot_;
    HVT_Box box_;
    int32_t d_;
    int64_t colLo_ = 0, colHi_ = -1, rowLo_ = 0, rowEnd_ = 0;
};

}  // namespace tessarine::storage
