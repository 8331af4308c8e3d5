// Decoding and encoding beside the tile file's reads and writes: an image
// reader or writer runs on a thread of its own and hands rows over through a
// small ring of row buffers. Only the image library runs on that thread; every
// call of the tile library stays on the caller's.
#pragma once

#include <memory>

#include "raster.h"

namespace tessarine::cli {

// Reads ahead of the caller.
std::unique_ptr<RasterReader> ReadAhead(std::unique_ptr<RasterReader> reader);
// Writes behind the caller; Finish waits for every row and completes the file.
std::unique_ptr<RasterWriter> WriteBehind(std::unique_ptr<RasterWriter> writer, size_t rowBytes);

}  // namespace tessarine::cli
