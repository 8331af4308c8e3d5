// Arbitrary bytes as SVG path data and as a number list: the parser ends in
// commands or an error, never a crash, a hang or a sanitizer report, and
// every number it hands out is finite.
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <string_view>
#include <vector>

#include "svg_path.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    const std::string_view text(reinterpret_cast<const char *>(data), size);
    std::vector<tessarine::cli::PathCommand> commands;
    tessarine::cli::PathError error;
    const bool ok = tessarine::cli::ParsePathData(text, commands, error);
    if (!ok && error.offset > size) std::abort();
    if (commands.size() > size) std::abort();
    for (const auto &c : commands)
        for (double v : c.v)
            if (!std::isfinite(v)) std::abort();
    std::vector<double> numbers;
    tessarine::cli::ParseNumberList(text, numbers, error);
    return 0;
}
