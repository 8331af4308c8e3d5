#include "platform/file_path_hooks.h"

namespace tessarine::platform {

// MERGE: placeholder until the AFilePath class lands; it must destroy and
// free the path. Nothing creates a path yet, so only null reaches here.
void DestroyFilePath(AFilePath *path) {
    if (path == nullptr) return;
}

}  // namespace tessarine::platform
