// Row and column transfer sessions: what the session functions and the row
// services share.
//
// A session is an HVT_FileInfo on the heap, held in the bitmap's ioSession;
// the library keeps nothing else of it. Its fields are public because the
// record is the tile file's open state, which callers own and may look at.
// Between calls:
// - regionBox is the area the session may touch; it does not change.
// - readBox names what readBuffer holds, top and bottom -1 for nothing. In
//   the band modes it is a whole band: aligned to a multiple of bandRows from
//   row 0 of the image, cut by regionBox, read whole on the miss that placed
//   it. In the window mode it is the last window read, readRowBytes apart.
// - writeBox names the band or window that writeBuffer stands for, and
//   pendingBox the rows of it handed out for writing and not yet saved: one
//   run with no gap, top and bottom -1 for none. Pending rows count only
//   within regionBox's rows, and only they are ever saved.
// - readHandle exists only when the session reads, writeHandle only when it
//   writes; both stay locked, as readBuffer and writeBuffer, until the end.
#pragma once

#include <cstdint>

#include <tessarine/storage.h>

#include "storage/tile_format.h"

namespace tessarine::storage {

// sessionMode: how rows are cached.
enum SessionMode : uint8_t {
    kModeOneRow = 0,  // nothing cached: each row goes to or from the file at once
    kModeWindow = 1,  // small windows around the requested row
    kModeBand = 2,    // bands of bandRows rows
    kModeBandToo = 3, // accepted, and the same as kModeBand
};
// sessionFlags.
inline constexpr uint8_t kSessionReads = 1;
inline constexpr uint8_t kSessionWrites = 2;

inline bool IsBandMode(uint8_t mode) { return mode == kModeBand || mode == kModeBandToo; }
// The modes that keep rows in the session's buffers.
inline bool CachesRows(uint8_t mode) { return mode == kModeWindow || IsBandMode(mode); }

// Default buffer budget of a band session, in bytes.
inline constexpr int32_t kDefaultBandBudget = 33554432;
// Highest band: one tile row, so that a band read touches each tile once.
inline constexpr int32_t kMaxBandRows = kTileHeight;
// A small window: 100 by 100 pixels of 3 bytes at the most.
inline constexpr int32_t kWindowSide = 100;
inline constexpr int32_t kWindowBufferBytes = kWindowSide * kWindowSide * 3;

// The band of bandRows rows, aligned from row 0 of the image, that holds y;
// limited to the region.
HVT_Box BandOf(const HVT_FileInfo *session, int64_t y);
// Row stride of the write buffer: the window's in the window mode, the
// band's otherwise.
int64_t WriteStride(const HVT_FileInfo *session);
// Something has been handed out for writing and not yet saved.
bool HasPending(const HVT_FileInfo *session);
// Saves the pending rows from the write buffer.
int32_t SavePending(HVT_FileInfo *session);

}  // namespace tessarine::storage
