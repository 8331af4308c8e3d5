#include <tessarine/profile.hpp>

#include "platform/profile_provider.h"

namespace {

// (use << 16) | buffer format; see EICCProfileType.
int FitnessCode(EICCProfileType kind) {
    switch (kind) {
        case 1:
            return 0x10001;
        case 2:
            return 0x10002;
        case 3:
            return 0x1000B;
        case 4:
            return 0x20001;
        case 5:
            return 0x20002;
        default:
            return 0;
    }
}

tessarine::platform::CProfileClass OpenClass(AFilePath const &profile) {
    const AString path(profile);
    return tessarine::platform::GetProfileClass(path, 0);
}

}  // namespace

TESSARINE_API int ValidateProfileType(AFilePath const &profile, EICCProfileType const &kind) {
    tessarine::platform::CProfileClass profileClass = OpenClass(profile);
    const int code = FitnessCode(kind);
    return code == 0 ? 0 : profileClass.ValidateProfileUsingColorSpace(code);
}
