#include <tessarine/profile.hpp>

#include "platform/profile_provider.h"

TESSARINE_API AString getProfileInfo(AFilePath &profile, AString &fallback) {
    char description[256];
    description[0] = '\0';
    const int found =
        tessarine::platform::GetAsciiDescription(profile, 0, description, sizeof description);
    // A provider that fills the buffer to the brim still leaves a text.
    description[sizeof description - 1] = '\0';
    return found ? AString(description) : AString(fallback);
}
