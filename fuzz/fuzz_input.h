// What several fuzz targets share: a byte reader that gives zeros past the
// input's end, and a scratch path for targets that hand the input over as a
// file.
#pragma once

#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

struct ByteReader {
    const uint8_t *p;
    size_t n;
    uint8_t U8() { return n ? (--n, *p++) : 0; }
    int32_t I16() { return static_cast<int16_t>(U8() | U8() << 8); }
};

// A path in the scratch folder, free when made and the same for the whole
// run; the input lives there only while one input runs.
inline const std::string &ScratchInputPath(const char *stem) {
    static const std::string path = [stem] {
        const char *dir = std::getenv("TMPDIR");
        std::string p = std::string(dir && *dir ? dir : "/tmp") + "/" + stem + "-XXXXXX";
        const int fd = ::mkstemp(p.data());
        if (fd < 0) std::abort();
        ::close(fd);
        ::unlink(p.c_str());
        return p;
    }();
    return path;
}
