#include "platform/file_path_hooks.h"

#include <new>

#include <tessarine/core.h>
#include <tessarine/profile.hpp>

namespace tessarine::platform {

AFilePath *CopyFilePath(const AFilePath &source) {
    void *block = MEM_AllocPtr(0, sizeof(AFilePath));
    if (block == nullptr) return nullptr;
    return new (block) AFilePath(source);
}

void DestroyFilePath(AFilePath *path) {
    if (path == nullptr) return;
    path->~AFilePath();
    MEM_FreeHdl(path);
}

}  // namespace tessarine::platform
