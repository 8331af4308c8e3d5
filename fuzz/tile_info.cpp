// Arbitrary bytes as a tile bitmap file given to `tessarine info`, as text and
// as JSON: a report or a one-line failure, never a crash, a hang or a
// sanitizer report.
#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <string>

#include "fuzz_input.h"
#include "commands.h"

namespace {

const std::string &InputPath() { return ScratchInputPath("info-fuzz"); }

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    const std::string &path = InputPath();
    FILE *file = std::fopen(path.c_str(), "wb");
    if (file == nullptr) std::abort();
    if (size > 0 && std::fwrite(data, 1, size, file) != size) std::abort();
    std::fclose(file);
    for (const char *json : {"", "--json"}) {
        std::ostringstream out, err;
        const char *argv[] = {"tessarine", "info", path.c_str(), json};
        const int code = tessarine::cli::RunTool(json[0] ? 4 : 3, argv, out, err);
        if (code != 0 && code != 1) std::abort();
        if (code == 1 && err.str().find(path) == std::string::npos) std::abort();
    }
    std::remove(path.c_str());
    return 0;
}
