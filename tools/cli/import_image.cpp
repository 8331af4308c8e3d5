// tessarine import: a PNG or TIFF into a tile bitmap file, streamed through a
// row session. Gray in the files means light, in the library ink: the rows
// are turned over on the way in.
#include <algorithm>
#include <cstring>
#include <ostream>

#include "commands.h"
#include "failure.h"
#include "raster.h"
#include "row_pipeline.h"
#include "tile_image.h"

namespace tessarine::cli {
namespace {

const Layout &DefaultLayout(const RasterFormat &f) {
    switch (f.kind) {
        case PixelKind::Gray: return LayoutNamed(f.nativeBits == 4 ? "gray4" : "gray8");
        case PixelKind::Rgb: return LayoutNamed("rgb");
        case PixelKind::Cmyk: return LayoutNamed("cmyk");
        case PixelKind::Palette: return LayoutNamed("indexed");
        default: return LayoutNamed("bw");
    }
}

// Steps of the colour cube that stands in for a palette of an image that has none.
constexpr int kCubeStep = 51;

// The colour table of an indexed layout: the file's own palette, a gray ramp
// for gray, white and black for 1-bit, a 6 by 6 by 6 cube for colour.
std::vector<uint8_t> TableFor(const RasterFormat &f) {
    std::vector<uint8_t> table;
    switch (f.kind) {
        case PixelKind::Palette: table = f.palette; break;
        case PixelKind::Gray:
            for (int i = 0; i < 256; ++i) table.insert(table.end(), {uint8_t(i), uint8_t(i), uint8_t(i)});
            break;
        case PixelKind::Bilevel: table = {255, 255, 255, 0, 0, 0}; break;
        default:
            for (int r = 0; r < 6; ++r)
                for (int g = 0; g < 6; ++g)
                    for (int b = 0; b < 6; ++b)
                        table.insert(table.end(), {uint8_t(r * kCubeStep), uint8_t(g * kCubeStep),
                                                   uint8_t(b * kCubeStep)});
    }
    if (table.empty()) table = {0, 0, 0};
    if (table.size() > 256 * 3) table.resize(256 * 3);
    return table;
}

// Turns rows of the source's kind into rows of the layout and writes them.
class RowImporter {
  public:
    RowImporter(BI_Bitmap *bitmap, const RasterFormat &f, const std::string &file)
        : bitmap_(bitmap), format_(f), file_(file), w_(size_t(f.width)) {
        rgb_.resize(w_ * 3);
        bytes_.resize(w_ + 16);
        planes_.resize(w_ * 4);
        if (f.kind == PixelKind::Palette) {
            for (size_t i = 0; i < 256; ++i) {
                const bool known = i * 3 + 2 < f.palette.size();
                const uint8_t *e = known ? &f.palette[i * 3] : nullptr;
                paletteDensity_[i] = known ? RGB2GrayScale(e[0], e[1], e[2]) : 255;
            }
        }
    }

    void Write(int32_t y, const uint8_t *row) {
        BI_Bitmap *b = bitmap_;
        const int32_t w = int32_t(w_);
        int32_t s = TS_OK;
        const PixelKind kind = format_.kind;
        if (b->imageType == 4 && b->colorModel == 1) {
            s = BI_SetRGBRowInterlace(y, 0, w, ToRgb(row), b);
        } else if (b->imageType == 4) {
            uint8_t *c = planes_.data(), *m = c + w_, *ye = m + w_, *k = ye + w_;
            if (kind == PixelKind::Cmyk) {
                for (size_t x = 0; x < w_; ++x) {
                    c[x] = row[4 * x];
                    m[x] = row[4 * x + 1];
                    ye[x] = row[4 * x + 2];
                    k[x] = row[4 * x + 3];
                }
            } else {
                const uint8_t *rgb = ToRgb(row);
                for (size_t x = 0; x < w_; ++x) {
                    uint8_t in[3] = {rgb[3 * x], rgb[3 * x + 1], rgb[3 * x + 2]}, out[4];
                    CX_SRgb2SWOPCmyk(in, out);
                    c[x] = out[0];
                    m[x] = out[1];
                    ye[x] = out[2];
                    k[x] = out[3];
                }
            }
            s = BI_SetCMYKRow(y, 0, w, c, m, ye, k, b);
        } else if (b->imageType == 3) {
            s = BI_SetIndexRow(y, 0, w, ToIndexes(row), b);
        } else if (b->bitsPerPixel == 1 && kind == PixelKind::Bilevel) {
            s = BI_SetBWPackedRow(y, 0, w, row, b);
        } else if (b->imageType == 2) {
            s = BI_SetGRow(y, 0, w, ToDensity(row), b);
        } else {
            const uint8_t *density = ToDensity(row);
            uint8_t *flags = bytes_.data();
            for (size_t x = 0; x < w_; ++x) flags[x] = density[x] >= 128;
            s = BI_SetBWRow(y, 0, w, flags, b);
        }
        Check(s, file_, "write row " + std::to_string(y));
    }

  private:
    const uint8_t *ToRgb(const uint8_t *row) {
        uint8_t *out = rgb_.data();
        switch (format_.kind) {
            case PixelKind::Rgb: return row;
            case PixelKind::Gray:
                for (size_t x = 0; x < w_; ++x) out[3 * x] = out[3 * x + 1] = out[3 * x + 2] = row[x];
                break;
            case PixelKind::Cmyk:
                for (size_t x = 0; x < w_; ++x) CX_SWOPCmyk2SRgb(row + 4 * x, out + 3 * x);
                break;
            case PixelKind::Palette:
                for (size_t x = 0; x < w_; ++x) {
                    const size_t i = size_t(row[x]) * 3;
                    for (int c = 0; c < 3; ++c) out[3 * x + c] = i + 2 < format_.palette.size() ? format_.palette[i + c] : 0;
                }
                break;
            case PixelKind::Bilevel:
            case PixelKind::Gray4:
                for (size_t x = 0; x < w_; ++x) {
                    const uint8_t v = (row[x >> 3] >> (7 - (x & 7))) & 1 ? 0 : 255;
                    out[3 * x] = out[3 * x + 1] = out[3 * x + 2] = v;
                }
                break;
        }
        return out;
    }

    // Ink densities, 0 white and 255 black, as the library keeps gray.
    uint8_t *ToDensity(const uint8_t *row) {
        uint8_t *out = bytes_.data();
        switch (format_.kind) {
            case PixelKind::Gray:
                for (size_t x = 0; x < w_; ++x) out[x] = uint8_t(255 - row[x]);
                break;
            case PixelKind::Rgb: Check(BI_UnpackGRow(4, 1, 24, nullptr, row, 0, int32_t(w_), out), file_, "convert a row"); break;
            case PixelKind::Cmyk: Check(BI_UnpackGRow(4, 2, 32, nullptr, row, 0, int32_t(w_), out), file_, "convert a row"); break;
            case PixelKind::Palette:
                for (size_t x = 0; x < w_; ++x) out[x] = paletteDensity_[row[x]];
                break;
            case PixelKind::Bilevel:
            case PixelKind::Gray4:
                for (size_t x = 0; x < w_; ++x) out[x] = (row[x >> 3] >> (7 - (x & 7))) & 1 ? 255 : 0;
                break;
        }
        return out;
    }

    uint8_t *ToIndexes(const uint8_t *row) {
        uint8_t *out = bytes_.data();
        switch (format_.kind) {
            case PixelKind::Palette:
            case PixelKind::Gray: std::memcpy(out, row, w_); break;
            case PixelKind::Bilevel:
            case PixelKind::Gray4:
                for (size_t x = 0; x < w_; ++x) out[x] = (row[x >> 3] >> (7 - (x & 7))) & 1;
                break;
            default: {
                const uint8_t *rgb = ToRgb(row);
                auto step = [](uint8_t v) { return (v + kCubeStep / 2) / kCubeStep; };
                for (size_t x = 0; x < w_; ++x)
                    out[x] = uint8_t(step(rgb[3 * x]) * 36 + step(rgb[3 * x + 1]) * 6 + step(rgb[3 * x + 2]));
            }
        }
        return out;
    }

    BI_Bitmap *bitmap_;
    const RasterFormat &format_;
    const std::string &file_;
    size_t w_;
    std::vector<uint8_t> rgb_, bytes_, planes_;
    uint8_t paletteDensity_[256] = {};
};

}  // namespace

void RunImport(const ImportOptions &options, std::ostream &out) {
    auto reader = ReadAhead(OpenRaster(options.input));
    const RasterFormat &f = reader->Format();
    const Layout &layout = options.layout.empty() ? DefaultLayout(f) : LayoutNamed(options.layout);
    const std::vector<uint8_t> table = layout.imageType == 3 ? TableFor(f) : std::vector<uint8_t>{};
    const double xDpi = f.xDpi > 0 ? f.xDpi : 72.0, yDpi = f.yDpi > 0 ? f.yDpi : 72.0;
    const int64_t bytes = ((int64_t(f.width) * layout.bitsPerPixel + 7) >> 3) * f.height;
    if (bytes > 0x7fff0000)
        throw Failure(options.output, "the image is too large for a tile file (over 2 GiB in " +
                                          std::string(layout.name) + ")");

    NewTileImage image(options.output, layout, f.width, f.height, xDpi, yDpi, table);
    {
        RowSession session(image.Bitmap(), 2, 0, options.output);
        RowImporter importer(image.Bitmap(), f, options.output);
        // Each row goes from the reader's ring straight to the library.
        for (int32_t y = 0; y < f.height; ++y) importer.Write(y, reader->NextRow());
        session.End();
    }
    image.Commit();
    out << options.input << " -> " << options.output << ": " << f.width << " x " << f.height << ", "
        << layout.name << "\n";
}

}  // namespace tessarine::cli
