// The operations of the closed profile libraries, reached through the
// installed provider (TS_SetProfileProvider).
#pragma once

#include <tessarine/profile.hpp>

namespace tessarine::platform {

const TS_ProfileProvider &CurrentProfileProvider();

int GetAsciiDescription(char const *path, int options, char *buffer, unsigned long size);

// A profile opened for fitness questions, closed by its end.
class CProfileClass {
  public:
    CProfileClass(const TS_ProfileProvider &provider, void *state)
        : provider_(provider), state_(state) {}
    CProfileClass(CProfileClass const &) = delete;
    CProfileClass &operator=(CProfileClass const &) = delete;
    ~CProfileClass() { provider_.ReleaseProfileClass(state_); }

    int ValidateProfileUsingColorSpace(int code) {
        return provider_.ValidateProfileUsingColorSpace(state_, code);
    }

  private:
    const TS_ProfileProvider &provider_;
    void *state_;
};

CProfileClass GetProfileClass(char const *path, int options);

long XQMatchColors(char const *source, char const *destination, char const *proofing,
                   char const *abstractProfile, void *input, void *output, int intent,
                   unsigned long flags, long reserved, XQProgressFn progress, void *progressData);

long XQProjectOntoGamut(char const *source, char const *device, char const *destination,
                        void *input, void *output, void *outside, int intent, long tolerance,
                        XQProgressFn progress, void *progressData);

}  // namespace tessarine::platform
