// The default profile provider, on LittleCMS 2.
#pragma once

#include <tessarine/profile.hpp>

namespace tessarine::color {

const TS_ProfileProvider &LcmsProfileProvider();

int LcmsGetAsciiDescription(char const *path, int options, char *buffer, unsigned long size);
void *LcmsGetProfileClass(char const *path, int options);
int LcmsValidateProfileUsingColorSpace(void *profileClass, int code);
void LcmsReleaseProfileClass(void *profileClass);
long LcmsMatchColors(char const *source, char const *destination, char const *proofing,
                     char const *abstractProfile, void *input, void *output, int intent,
                     unsigned long flags, long reserved, XQProgressFn progress, void *progressData);
long LcmsProjectOntoGamut(char const *source, char const *device, char const *destination,
                          void *input, void *output, void *outside, int intent, long tolerance,
                          XQProgressFn progress, void *progressData);

}  // namespace tessarine::color
