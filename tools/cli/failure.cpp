#include "failure.h"

#include <cstring>

#include <tessarine/tessarine.h>

namespace tessarine::cli {

std::string StatusText(int32_t status) {
    switch (static_cast<int16_t>(status)) {
        case -5: return "not enough memory";
        case -2: return "this pixel layout is not supported";
        case -18: return "stopped";
        case -29: return "the image has no rows";
        case -40: return "the image is too large for a tile file (over 2 GiB)";
        case -50: {
            std::string text = "the file cannot be read or written";
            if (FM_LastErrno != 0) text += std::string(" (") + std::strerror(FM_LastErrno) + ")";
            return text;
        }
        case -1: return "the file cannot be made or reached";
        default: return "failed with status " + std::to_string(static_cast<int16_t>(status));
    }
}

void FailStatus(const std::string &file, const std::string &doing, int32_t status) {
    throw Failure(file, "cannot " + doing + ": " + StatusText(status));
}

}  // namespace tessarine::cli
