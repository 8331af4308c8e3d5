// Streamed PNG and TIFF images: a reader hands out one row at a time and a
// writer takes one row at a time, so memory stays bounded whatever the size.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace tessarine::cli {

// How a row of a raster is laid out, as the tool passes it around.
enum class PixelKind {
    Gray,    // 1 byte a pixel, light: 0 black, 255 white (Gray4 packs two a byte)
    Gray4,   // 4 bits a pixel, light, leftmost in the high nibble (writers only)
    Rgb,     // r, g, b
    Cmyk,    // c, m, y, k; 255 full ink
    Palette, // 1 byte a pixel, an index into `palette` (r, g, b triples)
    Bilevel, // 1 bit a pixel, leftmost in the high bit; a set bit is black
};

struct RasterFormat {
    int32_t width = 0;
    int32_t height = 0;
    PixelKind kind = PixelKind::Rgb;
    int nativeBits = 8;           // bits per sample in the file (for choosing a layout)
    std::vector<uint8_t> palette; // Palette: entries of r, g, b
    double xDpi = 0, yDpi = 0;    // 0 when the file does not say
};

// Bytes of one row of the format.
size_t RowBytes(const RasterFormat &format);

class RasterReader {
  public:
    virtual ~RasterReader() = default;
    const RasterFormat &Format() const { return format_; }
    // The next row, top first; throws a Failure naming the file.
    virtual void ReadRow(uint8_t *row) = 0;

  protected:
    RasterFormat format_;
};

class RasterWriter {
  public:
    virtual ~RasterWriter() = default;
    virtual void WriteRow(const uint8_t *row) = 0;
    // Completes the file; throws a Failure if anything could not be written.
    virtual void Finish() = 0;
};

enum class FileType { Png, Tiff };

// Opens a PNG or a TIFF, told apart by its first bytes.
std::unique_ptr<RasterReader> OpenRaster(const std::string &path);
// The file type an output name asks for (.png, .tif, .tiff); throws a
// UsageFailure for any other name.
FileType FileTypeOfName(const std::string &path);
// A writer into `writePath`; messages name `displayPath`.
std::unique_ptr<RasterWriter> CreateRaster(FileType type, const std::string &writePath,
                                           const std::string &displayPath,
                                           const RasterFormat &format);

std::unique_ptr<RasterReader> OpenPng(const std::string &path, FILE *file);
std::unique_ptr<RasterWriter> CreatePng(const std::string &writePath, const std::string &displayPath,
                                        const RasterFormat &format);
std::unique_ptr<RasterReader> OpenTiff(const std::string &path);
std::unique_ptr<RasterWriter> CreateTiff(const std::string &writePath, const std::string &displayPath,
                                         const RasterFormat &format);

}  // namespace tessarine::cli
