// Decoding and encoding beside the tile file's reads and writes: an image
// reader or writer runs on a thread of its own and hands rows over through a
// ring of row buffers. Only the image library runs on that thread; every call
// of the tile library stays on the caller's.
#pragma once

#include <memory>

#include "raster.h"

namespace tessarine::cli {

// A reader running ahead of the caller; rows can be taken in place.
class RowsAhead : public RasterReader {
  public:
    // The next row, top first, in the ring itself: valid until the next call
    // (of NextRow or ReadRow). Throws what the reader threw.
    virtual const uint8_t *NextRow() = 0;
};

// A writer running behind the caller; rows can be built in place.
class RowsBehind : public RasterWriter {
  public:
    // The ring's buffer for the next row (of the row bytes given to
    // WriteBehind), valid until the next WriteRow, which takes it without a
    // copy. WriteRow of any other buffer copies it in as before.
    virtual uint8_t *NextSlot() = 0;
};

std::unique_ptr<RowsAhead> ReadAhead(std::unique_ptr<RasterReader> reader);
// Finish waits for every row and completes the file.
std::unique_ptr<RowsBehind> WriteBehind(std::unique_ptr<RasterWriter> writer, size_t rowBytes);

}  // namespace tessarine::cli
