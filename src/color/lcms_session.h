// LittleCMS work: each operation runs in a context of its own (its alarm
// colour and error handler touch no other caller), and profiles are read
// through the raw file layer into the library's heap.
//
// The engine's internal memory stays on the engine's own allocator. Routed
// through the heap layer, an injected failure inside LittleCMS 2.14's
// pipeline optimiser leaves a half-joined pipeline behind and crashes it; on
// its own allocator such a failure is as rare as anywhere else. A failure
// inside the engine shows as a profile or transform failure.
#pragma once

#include <lcms2.h>

#include <cstdint>

#include <tessarine/color.h>
#include <tessarine/profile.hpp>

namespace tessarine::color {

class LcmsSession {
  public:
    LcmsSession();
    ~LcmsSession();
    LcmsSession(LcmsSession const &) = delete;
    LcmsSession &operator=(LcmsSession const &) = delete;

    cmsContext Context() const { return context_; }
    bool Valid() const { return context_ != nullptr; }
    // True once an allocation of ours in this session has failed.
    bool OutOfMemory() const { return outOfMemory_; }
    // The failure to report: memory when it ran out, `otherwise` if not.
    long Failure(long otherwise) const { return outOfMemory_ ? XQ_ERR_MEMORY : otherwise; }

    // Reads a profile file whole and opens it from memory; null when the
    // file cannot be read or is no profile.
    cmsHPROFILE OpenProfile(char const *path);

  private:
    cmsContext context_ = nullptr;
    bool outOfMemory_ = false;
};

class ProfileHandle {
  public:
    ProfileHandle() = default;
    explicit ProfileHandle(cmsHPROFILE profile) : profile_(profile) {}
    ~ProfileHandle() {
        if (profile_ != nullptr) cmsCloseProfile(profile_);
    }
    ProfileHandle(ProfileHandle const &) = delete;
    ProfileHandle &operator=(ProfileHandle const &) = delete;
    void Reset(cmsHPROFILE profile) {
        if (profile_ != nullptr) cmsCloseProfile(profile_);
        profile_ = profile;
    }
    cmsHPROFILE Get() const { return profile_; }
    explicit operator bool() const { return profile_ != nullptr; }

  private:
    cmsHPROFILE profile_ = nullptr;
};

class TransformHandle {
  public:
    TransformHandle() = default;
    explicit TransformHandle(cmsHTRANSFORM transform) : transform_(transform) {}
    ~TransformHandle() {
        if (transform_ != nullptr) cmsDeleteTransform(transform_);
    }
    TransformHandle(TransformHandle const &) = delete;
    TransformHandle &operator=(TransformHandle const &) = delete;
    void Reset(cmsHTRANSFORM transform) {
        if (transform_ != nullptr) cmsDeleteTransform(transform_);
        transform_ = transform;
    }
    cmsHTRANSFORM Get() const { return transform_; }
    explicit operator bool() const { return transform_ != nullptr; }

  private:
    cmsHTRANSFORM transform_ = nullptr;
};

// The shape of a colour buffer descriptor's format.
struct PixelLayout {
    cmsUInt32Number lcmsFormat;
    uint32_t bytesPerColour;
    cmsColorSpaceSignature space;
};

// False for a format other than 1, 2 and 11.
bool LayoutOf(int16_t format, PixelLayout *layout);

// Checks a descriptor: known format, count not negative, pixels present when
// there are colours.
bool UsableBuffer(const CX_ColorBuffer *buffer, PixelLayout *layout);

// LittleCMS intent for 0 to 5; -1 for any other.
int LcmsIntent(int intent);

// Colours per run between progress calls.
inline constexpr int32_t kColoursPerRun = 65536;

// Tells the caller's progress callback how far a run of `count` colours has
// come; true when it asks to stop.
inline bool ProgressSaysStop(XQProgressFn progress, void *progressData, int32_t done,
                             int32_t count) {
    return progress != nullptr &&
           !progress(static_cast<int>(static_cast<int64_t>(done) * 100 / count), progressData);
}

}  // namespace tessarine::color
