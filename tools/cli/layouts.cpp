#include "layouts.h"

#include "failure.h"

namespace tessarine::cli {
namespace {

// Gray and black-and-white pixels are ink whatever the model; 1 is recorded.
constexpr Layout kLayouts[] = {
    {"rgb", 4, 24, 1},   {"cmyk", 4, 32, 2},  {"gray8", 2, 8, 1}, {"gray4", 2, 4, 1},
    {"gray1", 2, 1, 1},  {"bw", 1, 1, 1},     {"indexed", 3, 8, 1},
};

}  // namespace

const Layout &LayoutNamed(const std::string &name) {
    for (const Layout &layout : kLayouts)
        if (name == layout.name) return layout;
    throw UsageFailure("unknown layout '" + name + "' (expected " + LayoutNames() + ")");
}

std::string LayoutNames() {
    std::string names;
    for (const Layout &layout : kLayouts) {
        if (!names.empty()) names += '|';
        names += layout.name;
    }
    return names;
}

std::string LayoutOf(const BI_Bitmap &bitmap) {
    for (const Layout &layout : kLayouts) {
        if (layout.imageType != bitmap.imageType || layout.bitsPerPixel != bitmap.bitsPerPixel) continue;
        if (layout.imageType == 4 && layout.colorModel != bitmap.colorModel) continue;
        if (layout.imageType == 3 && bitmap.colorModel == 2) return "indexed (CMYK table)";
        if (layout.imageType == 3 && bitmap.bitsPerPixel != 8) break;
        return layout.name;
    }
    return std::string(ImageTypeName(bitmap.imageType)) + " " +
           std::to_string(bitmap.bitsPerPixel) + "-bit";
}

const char *ImageTypeName(uint8_t imageType) {
    switch (imageType) {
        case 1: return "black and white";
        case 2: return "gray";
        case 3: return "indexed";
        case 4: return "true colour";
        default: return "unknown";
    }
}

const char *ColorModelName(uint8_t colorModel) {
    switch (colorModel) {
        case 1: return "RGB";
        case 2: return "CMYK";
        case 0: return "not set";
        default: return "unknown";
    }
}

}  // namespace tessarine::cli
