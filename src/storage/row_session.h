// What the row services and the session functions share.
#pragma once

#include <cstdint>

#include <tessarine/storage.h>

namespace tessarine::storage {

// Default buffer budget of a band session, in bytes.
inline constexpr int32_t kDefaultBandBudget = 33554432;
// Highest band, one tile row.
inline constexpr int32_t kMaxBandRows = 1024;
// Buffer of a small-window session: 100 by 100 pixels of 3 bytes.
inline constexpr int32_t kWindowBufferBytes = 30000;
// Something has been handed out for writing and not yet saved.
bool HasPending(const HVT_FileInfo *session);
// Saves the pending rows from the write buffer.
int32_t SavePending(HVT_FileInfo *session);

}  // namespace tessarine::storage
