// Planes, row transfers and profiles for the whole-bitmap copies.
#include "bitmap/copy_steps.h"

#include <tessarine/core.h>
#include <tessarine/profile.hpp>
#include <tessarine/storage.h>

#include "core/status.h"
#include "platform/file_path_hooks.h"

namespace tessarine::bitmap {

Planes::~Planes() {
    for (uint8_t *p : planes_)
        if (p != nullptr) MEM_FreePtr(p);
}

int32_t Planes::Allocate(int count, int64_t width) {
    // A plane of an empty run still exists, so that a row call gets a buffer.
    const int64_t bytes = width > 0 ? width : 1;
    if (bytes > UINT32_MAX) return kErrMemory;
    for (int i = 0; i < count; ++i) {
        planes_[i] = static_cast<uint8_t *>(MEM_AllocPtr(MEM_FLAG_ZERO, static_cast<uint32_t>(bytes)));
        if (planes_[i] == nullptr) return kErrMemory;
    }
    return kOk;
}

bool CopyTransfersFit(const BI_Bitmap *source, const BI_Bitmap *destination) {
    const bool readSource = TileOnly(source), writeDestination = TileOnly(destination);
    return !((readSource && source->ioSession != nullptr) ||
             (writeDestination && destination->ioSession != nullptr) ||
             (source == destination && readSource));
}

int32_t BeginCopyTransfers(BI_Bitmap *source, const RECT *sourceRect, uint8_t sourceSub,
                           BI_Bitmap *destination, const RECT *destinationRect,
                           uint8_t destinationSub) {
    const bool readSource = TileOnly(source), writeDestination = TileOnly(destination);
    if (readSource) {
        const int32_t status = HVT_TileFileRowIOBegin(1, source, sourceRect, 2, sourceSub, 0);
        if (Failed(status)) return status;
    }
    if (writeDestination)
        return HVT_TileFileRowIOBegin(2, destination, destinationRect, 2, destinationSub, 0);
    return kOk;
}

void HandOnProfile(const BI_Bitmap *source, BI_Bitmap *destination) {
    if (source->profilePath == destination->profilePath) return;  // one bitmap, or neither has one
    platform::DestroyFilePath(destination->profilePath);
    destination->profilePath =
        source->profilePath != nullptr ? platform::CopyFilePath(*source->profilePath) : nullptr;
}

void ReplaceProfile(BI_Bitmap *destination, const AFilePath *path) {
    // The copy is made first: the path may be the destination's own.
    AFilePath *fresh = platform::CopyFilePath(path != nullptr ? *path : AFilePath());
    platform::DestroyFilePath(destination->profilePath);
    destination->profilePath = fresh;
}

}  // namespace tessarine::bitmap
