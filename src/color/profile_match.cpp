#include <tessarine/profile.hpp>

#include "platform/profile_provider.h"

namespace {

char const *TextOf(AFilePath *path) {
    return path != nullptr ? static_cast<char const *>(*path) : nullptr;
}

}  // namespace

TESSARINE_API long R27_XQMatchColors(AFilePath *source, AFilePath *destination, AFilePath *proofing,
                                     AFilePath *abstractProfile, void *input, void *output,
                                     int intent, unsigned long flags, long reserved) {
    return tessarine::platform::XQMatchColors(TextOf(source), TextOf(destination), TextOf(proofing),
                                              TextOf(abstractProfile), input, output, intent, flags,
                                              reserved, nullptr, nullptr);
}

TESSARINE_API long R27_XQProjectOntoGamut(AFilePath *source, AFilePath *device,
                                          AFilePath *destination, void *input, void *output,
                                          void *outside, int intent, long tolerance) {
    return tessarine::platform::XQProjectOntoGamut(TextOf(source), TextOf(device),
                                                   TextOf(destination), input, output, outside,
                                                   intent, tolerance, nullptr, nullptr);
}
