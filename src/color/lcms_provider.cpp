#include "color/lcms_provider.h"

#include <new>

#include "color/lcms_session.h"
#include "platform/heap.h"

namespace tessarine::color {
namespace {

// What GetProfileClass hands out: the profile and the context it lives in.
struct ProfileClassState {
    LcmsSession session;
    ProfileHandle profile;
};

bool ServesAsSource(cmsProfileClassSignature deviceClass) {
    return deviceClass == cmsSigInputClass || deviceClass == cmsSigDisplayClass ||
           deviceClass == cmsSigOutputClass || deviceClass == cmsSigColorSpaceClass;
}

bool ServesAsDestination(cmsProfileClassSignature deviceClass) {
    return deviceClass == cmsSigDisplayClass || deviceClass == cmsSigOutputClass ||
           deviceClass == cmsSigColorSpaceClass;
}

}  // namespace

int LcmsGetAsciiDescription(char const *path, int, char *buffer, unsigned long size) {
    if (buffer == nullptr || size == 0) return 0;
    LcmsSession session;
    ProfileHandle profile(session.OpenProfile(path));
    if (!profile) return 0;
    const cmsUInt32Number limit =
        size > 0xFFFFFFFFul ? 0xFFFFFFFFu : static_cast<cmsUInt32Number>(size);
    buffer[0] = '\0';
    const cmsUInt32Number written =
        cmsGetProfileInfoASCII(profile.Get(), cmsInfoDescription, "en", "US", buffer, limit);
    // An empty description is as good as none: the caller's fallback says more.
    return written != 0 && buffer[0] != '\0' ? 1 : 0;
}

void *LcmsGetProfileClass(char const *path, int) {
    void *block = platform::GlobalAlloc(platform::GMEM_FIXED, sizeof(ProfileClassState));
    if (block == nullptr) return nullptr;
    auto *state = new (block) ProfileClassState;
    state->profile.Reset(state->session.OpenProfile(path));
    if (!state->profile) {
        LcmsReleaseProfileClass(state);
        return nullptr;
    }
    return state;
}

int LcmsValidateProfileUsingColorSpace(void *profileClass, int code) {
    auto *state = static_cast<ProfileClassState *>(profileClass);
    PixelLayout layout;
    if (state == nullptr || !LayoutOf(static_cast<int16_t>(code & 0xFFFF), &layout)) return 0;
    const cmsHPROFILE profile = state->profile.Get();
    if (cmsGetColorSpace(profile) != layout.space) return 0;
    const cmsProfileClassSignature deviceClass = cmsGetDeviceClass(profile);
    switch (static_cast<unsigned>(code) >> 16) {
        case 1:
            return ServesAsSource(deviceClass) &&
                           cmsIsIntentSupported(profile, INTENT_PERCEPTUAL, LCMS_USED_AS_INPUT)
                       ? 1
                       : 0;
        case 2:
            return ServesAsDestination(deviceClass) &&
                           cmsIsIntentSupported(profile, INTENT_PERCEPTUAL, LCMS_USED_AS_OUTPUT)
                       ? 1
                       : 0;
        default:
            return 0;
    }
}

void LcmsReleaseProfileClass(void *profileClass) {
    auto *state = static_cast<ProfileClassState *>(profileClass);
    if (state == nullptr) return;
    state->~ProfileClassState();
    platform::GlobalFree(state);
}

const TS_ProfileProvider &LcmsProfileProvider() {
    static constexpr TS_ProfileProvider provider = {
        LcmsGetAsciiDescription, LcmsGetProfileClass, LcmsValidateProfileUsingColorSpace,
        LcmsReleaseProfileClass, LcmsMatchColors,     LcmsProjectOntoGamut,
    };
    return provider;
}

}  // namespace tessarine::color
