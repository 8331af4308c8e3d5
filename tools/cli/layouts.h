// The pixel layouts the tool names on its command line.
#pragma once

#include <cstdint>
#include <string>

#include <tessarine/tessarine.h>

namespace tessarine::cli {

struct Layout {
    const char *name;
    uint8_t imageType;
    uint8_t bitsPerPixel;
    uint8_t colorModel;
};

// Throws a UsageFailure for an unknown name.
const Layout &LayoutNamed(const std::string &name);
// The names, for help texts: "rgb|cmyk|...".
std::string LayoutNames();
// The name of a bitmap's layout, or a description of an unnamed one.
std::string LayoutOf(const BI_Bitmap &bitmap);
// Words for an imageType and a colorModel.
const char *ImageTypeName(uint8_t imageType);
const char *ColorModelName(uint8_t colorModel);

}  // namespace tessarine::cli
