// Paths that a bitmap owns live in fixed blocks of the library heap: made by
// CopyFilePath, ended by DestroyFilePath.
#pragma once

#include <tessarine/platform.h>

namespace tessarine::platform {

// A new path copied from `source`, or null when its block cannot be had.
AFilePath *CopyFilePath(const AFilePath &source);
// Destroys and frees a path made by CopyFilePath. Null does nothing.
void DestroyFilePath(AFilePath *path);

}  // namespace tessarine::platform
