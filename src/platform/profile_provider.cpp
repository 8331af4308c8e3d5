#include "platform/profile_provider.h"

#include <atomic>

#include "color/lcms_provider.h"

namespace tessarine::platform {
namespace {

std::atomic<const TS_ProfileProvider *> g_provider{nullptr};

}  // namespace

// The provider is read once per operation, so that a class opened by one
// provider is also validated and released by it.
const TS_ProfileProvider &CurrentProfileProvider() {
    const TS_ProfileProvider *provider = g_provider.load();
    return provider != nullptr ? *provider : color::LcmsProfileProvider();
}

int GetAsciiDescription(char const *path, int options, char *buffer, unsigned long size) {
    return CurrentProfileProvider().GetAsciiDescription(path, options, buffer, size);
}

CProfileClass GetProfileClass(char const *path, int options) {
    const TS_ProfileProvider &provider = CurrentProfileProvider();
    return CProfileClass(provider, provider.GetProfileClass(path, options));
}

long XQMatchColors(char const *source, char const *destination, char const *proofing,
                   char const *abstractProfile, void *input, void *output, int intent,
                   unsigned long flags, long reserved, XQProgressFn progress, void *progressData) {
    return CurrentProfileProvider().XQMatchColors(source, destination, proofing, abstractProfile,
                                                  input, output, intent, flags, reserved, progress,
                                                  progressData);
}

long XQProjectOntoGamut(char const *source, char const *device, char const *destination,
                        void *input, void *output, void *outside, int intent, long tolerance,
                        XQProgressFn progress, void *progressData) {
    return CurrentProfileProvider().XQProjectOntoGamut(source, device, destination, input, output,
                                                       outside, intent, tolerance, progress,
                                                       progressData);
}

}  // namespace tessarine::platform

extern "C" TESSARINE_API const TS_ProfileProvider *TS_SetProfileProvider(
    const TS_ProfileProvider *provider) {
    const TS_ProfileProvider *previous = tessarine::platform::g_provider.exchange(provider);
    return previous != nullptr ? previous : &tessarine::color::LcmsProfileProvider();
}

extern "C" TESSARINE_API const TS_ProfileProvider *TS_DefaultProfileProvider(void) {
    return &tessarine::color::LcmsProfileProvider();
}
