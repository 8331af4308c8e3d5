// Arbitrary bytes as an SVG document: read into outlines or refused with a
// Failure, never a crash, a hang or a sanitizer report.
#include <cstdint>
#include <string>

#include "failure.h"
#include "svg_document.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    try {
        tessarine::cli::ParseSvg(std::string(reinterpret_cast<const char *>(data), size), "fuzz.svg");
    } catch (const tessarine::cli::Failure &) {
    }
    return 0;
}
