// Profile services on arbitrary file contents: a description or the fallback,
// a fitness of 0 or 1, a match result; never a crash.
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

#include <tessarine/profile.hpp>

namespace {

const std::string &ScratchPath() {
    static const std::string path = [] {
        const char *dir = std::getenv("TMPDIR");
        std::string name = std::string(dir != nullptr && *dir != '\0' ? dir : "/tmp") +
                           "/tessarine-fuzz-profile-XXXXXX";
        const int fd = mkstemp(name.data());
        if (fd < 0) std::abort();
        close(fd);
        return name;
    }();
    return path;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    const std::string &path = ScratchPath();
    FILE *file = std::fopen(path.c_str(), "wb");
    if (file == nullptr) return 0;
    std::fwrite(data, 1, size, file);
    std::fclose(file);

    AFilePath profile(path.c_str());
    AString fallback("fallback");
    const AString description = getProfileInfo(profile, fallback);
    if (static_cast<char const *>(description)[0] == '\0') std::abort();
    for (int kind = 0; kind <= 5; ++kind) {
        const int fit = ValidateProfileType(profile, static_cast<EICCProfileType>(kind));
        if (fit != 0 && fit != 1) std::abort();
    }
    uint8_t in[12] = {0, 0, 0, 255, 255, 255, 200, 30, 60, 1, 2, 3};
    uint8_t out[16];
    const int16_t formats[] = {CX_FORMAT_RGB, CX_FORMAT_CMYK, CX_FORMAT_GRAY};
    for (int16_t format : formats) {
        CX_ColorBuffer a{format, 3, in};
        CX_ColorBuffer b{CX_FORMAT_RGB, 3, out};
        const long result =
            R27_XQMatchColors(&profile, &profile, nullptr, nullptr, &a, &b, 0, 1, 0);
        if (result > 0 || result < XQ_ERR_CANCELLED) std::abort();
    }
    std::remove(path.c_str());
    return 0;
}
