// The few AFilePath operations that code outside the path class needs.
#pragma once

#include <tessarine/platform.h>

namespace tessarine::platform {

// Destroys and frees a path that a bitmap owns. Null does nothing.
void DestroyFilePath(AFilePath *path);

}  // namespace tessarine::platform
