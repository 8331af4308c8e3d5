#include "color/lcms_session.h"

#include <tessarine/storage.h>

#include "core/status.h"
#include "platform/heap.h"

namespace tessarine::color {

using platform::GlobalAlloc;
using platform::GlobalFree;
using platform::GMEM_FIXED;

namespace {

// Larger files are no profiles we would use.
constexpr int32_t kLargestProfile = 256 * 1024 * 1024;

// Errors are statuses here; nothing is logged.
void IgnoreError(cmsContext, cmsUInt32Number, const char *) {}

class FileGuard {
  public:
    explicit FileGuard(int32_t fd) : fd_(fd) {}
    ~FileGuard() { FM_Close(fd_); }
    FileGuard(FileGuard const &) = delete;
    FileGuard &operator=(FileGuard const &) = delete;

  private:
    int32_t fd_;
};

class BlockGuard {
  public:
    explicit BlockGuard(void *block) : block_(block) {}
    ~BlockGuard() {
        if (block_ != nullptr) GlobalFree(block_);
    }
    BlockGuard(BlockGuard const &) = delete;
    BlockGuard &operator=(BlockGuard const &) = delete;

  private:
    void *block_;
};

}  // namespace

LcmsSession::LcmsSession() {
    context_ = cmsCreateContext(nullptr, nullptr);
    if (context_ == nullptr) {
        outOfMemory_ = true;
        return;
    }
    cmsSetLogErrorHandlerTHR(context_, IgnoreError);
}

LcmsSession::~LcmsSession() {
    if (context_ != nullptr) cmsDeleteContext(context_);
}

cmsHPROFILE LcmsSession::OpenProfile(char const *path) {
    if (context_ == nullptr || path == nullptr || path[0] == '\0') return nullptr;
    int32_t fd = -1;
    if (Failed(FM_Open(path, 0, &fd))) return nullptr;
    FileGuard file(fd);
    int32_t size = 0;
    if (Failed(FM_Seek(fd, 2, 0)) || Failed(FM_Tell(fd, &size))) return nullptr;
    if (size <= 0 || size > kLargestProfile) return nullptr;
    if (Failed(FM_Seek(fd, 0, 0))) return nullptr;
    void *bytes = GlobalAlloc(GMEM_FIXED, static_cast<size_t>(size));
    if (bytes == nullptr) {
        outOfMemory_ = true;
        return nullptr;
    }
    BlockGuard release(bytes);
    if (Failed(FM_Read(fd, bytes, static_cast<uint32_t>(size)))) return nullptr;
    // LittleCMS keeps a copy of its own for the tags it reads later.
    return cmsOpenProfileFromMemTHR(context_, bytes, static_cast<cmsUInt32Number>(size));
}

bool LayoutOf(int16_t format, PixelLayout *layout) {
    switch (format) {
        case CX_FORMAT_RGB:
            *layout = {TYPE_RGB_8, 3, cmsSigRgbData};
            return true;
        case CX_FORMAT_CMYK:
            *layout = {TYPE_CMYK_8, 4, cmsSigCmykData};
            return true;
        case CX_FORMAT_GRAY:
            *layout = {TYPE_GRAY_8, 1, cmsSigGrayData};
            return true;
        default:
            return false;
    }
}

bool UsableBuffer(const CX_ColorBuffer *buffer, PixelLayout *layout) {
    if (buffer == nullptr || !LayoutOf(buffer->format, layout) || buffer->count < 0) return false;
    return buffer->count == 0 || buffer->pixels != nullptr;
}

int LcmsIntent(int intent) {
    switch (intent) {
        case 0:
            return INTENT_PERCEPTUAL;
        case 1:
            return INTENT_RELATIVE_COLORIMETRIC;
        case 2:
            return INTENT_SATURATION;
        case 3:
            return INTENT_ABSOLUTE_COLORIMETRIC;
        case 4:
            return INTENT_PRESERVE_K_ONLY_PERCEPTUAL;
        case 5:
            return INTENT_PRESERVE_K_PLANE_PERCEPTUAL;
        default:
            return -1;
    }
}

}  // namespace tessarine::color
