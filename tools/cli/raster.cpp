#include "raster.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <strings.h>
#include <sys/stat.h>

#include "failure.h"

namespace tessarine::cli {

size_t RowBytes(const RasterFormat &format) {
    const size_t w = size_t(format.width);
    switch (format.kind) {
        case PixelKind::Gray:
        case PixelKind::Palette: return w;
        case PixelKind::Gray4: return (w + 1) / 2;
        case PixelKind::Rgb: return w * 3;
        case PixelKind::Cmyk: return w * 4;
        case PixelKind::Bilevel: return (w + 7) / 8;
    }
    return w;
}

std::unique_ptr<RasterReader> OpenRaster(const std::string &path) {
    FILE *file = std::fopen(path.c_str(), "rb");
    if (file == nullptr) throw Failure(path, std::strerror(errno));
    struct stat st {};
    if (fstat(fileno(file), &st) == 0 && S_ISDIR(st.st_mode)) {
        std::fclose(file);
        throw Failure(path, "is a folder");
    }
    uint8_t magic[8] = {};
    const size_t got = std::fread(magic, 1, sizeof magic, file);
    static const uint8_t kPng[8] = {0x89, 'P', 'N', 'G', '\r', '\n', 0x1A, '\n'};
    if (got == 8 && std::memcmp(magic, kPng, 8) == 0) {
        std::rewind(file);
        return OpenPng(path, file); // takes the file
    }
    std::fclose(file);
    if (got >= 4 && ((magic[0] == 'I' && magic[1] == 'I' && (magic[2] == 42 || magic[2] == 43) && magic[3] == 0) ||
                     (magic[0] == 'M' && magic[1] == 'M' && magic[2] == 0 && (magic[3] == 42 || magic[3] == 43))))
        return OpenTiff(path);
    if (got == 0) throw Failure(path, "empty file");
    throw Failure(path, "not a PNG or TIFF image");
}

FileType FileTypeOfName(const std::string &path) {
    const size_t dot = path.find_last_of('.');
    const std::string ext = dot == std::string::npos ? "" : path.substr(dot + 1);
    if (strcasecmp(ext.c_str(), "png") == 0) return FileType::Png;
    if (strcasecmp(ext.c_str(), "tif") == 0 || strcasecmp(ext.c_str(), "tiff") == 0) return FileType::Tiff;
    throw UsageFailure(path + ": the output name must end in .png, .tif or .tiff");
}

std::unique_ptr<RasterWriter> CreateRaster(FileType type, const std::string &writePath,
                                           const std::string &displayPath,
                                           const RasterFormat &format) {
    return type == FileType::Png ? CreatePng(writePath, displayPath, format)
                                 : CreateTiff(writePath, displayPath, format);
}

}  // namespace tessarine::cli
