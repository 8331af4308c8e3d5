#include "cli_test_support.h"

#include <png.h>
#include <tiffio.h>

#include <cstdio>
#include <fstream>
#include <sstream>
#include <sys/stat.h>

#include "commands.h"

namespace clitest {

RunResult Cli(const std::vector<std::string> &args) {
    std::vector<const char *> argv{"tessarine"};
    for (const auto &a : args) argv.push_back(a.c_str());
    std::ostringstream out, err;
    RunResult r;
    r.code = tessarine::cli::RunTool(int(argv.size()), argv.data(), out, err);
    r.out = out.str();
    r.err = err.str();
    return r;
}

void WritePng(const std::string &path, const Image &im) {
    FILE *f = std::fopen(path.c_str(), "wb");
    ASSERT_NE(f, nullptr);
    png_structp png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    png_init_io(png, f);
    png_set_IHDR(png, info, im.width, im.height, im.depth, im.colorType, PNG_INTERLACE_NONE,
                 PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
    std::vector<png_color> entries;
    for (size_t i = 0; i + 2 < im.palette.size(); i += 3)
        entries.push_back({im.palette[i], im.palette[i + 1], im.palette[i + 2]});
    if (im.colorType == PNG_COLOR_TYPE_PALETTE) png_set_PLTE(png, info, entries.data(), int(entries.size()));
    png_write_info(png, info);
    for (const auto &row : im.rows) png_write_row(png, row.data());
    png_write_end(png, nullptr);
    png_destroy_write_struct(&png, &info);
    std::fclose(f);
}

Image ReadPng(const std::string &path) {
    Image im;
    FILE *f = std::fopen(path.c_str(), "rb");
    if (f == nullptr) return im;
    png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    png_init_io(png, f);
    png_read_info(png, info);
    im.width = int(png_get_image_width(png, info));
    im.height = int(png_get_image_height(png, info));
    im.depth = png_get_bit_depth(png, info);
    im.colorType = png_get_color_type(png, info);
    png_colorp entries = nullptr;
    int count = 0;
    if (png_get_PLTE(png, info, &entries, &count))
        for (int i = 0; i < count; ++i)
            im.palette.insert(im.palette.end(), {entries[i].red, entries[i].green, entries[i].blue});
    const size_t bytes = png_get_rowbytes(png, info);
    im.rows.assign(size_t(im.height), std::vector<uint8_t>(bytes));
    for (auto &row : im.rows) png_read_row(png, row.data(), nullptr);
    png_destroy_read_struct(&png, &info, nullptr);
    std::fclose(f);
    return im;
}

void WriteTiff(const std::string &path, const Image &im, bool tiled) {
    TIFF *t = TIFFOpen(path.c_str(), "w");
    ASSERT_NE(t, nullptr);
    TIFFSetField(t, TIFFTAG_IMAGEWIDTH, uint32_t(im.width));
    TIFFSetField(t, TIFFTAG_IMAGELENGTH, uint32_t(im.height));
    TIFFSetField(t, TIFFTAG_BITSPERSAMPLE, uint16_t(im.depth));
    TIFFSetField(t, TIFFTAG_SAMPLESPERPIXEL, uint16_t(im.colorType));
    TIFFSetField(t, TIFFTAG_PHOTOMETRIC, uint16_t(im.photometric));
    TIFFSetField(t, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG);
    TIFFSetField(t, TIFFTAG_COMPRESSION, COMPRESSION_LZW);
    if (im.photometric == PHOTOMETRIC_SEPARATED) TIFFSetField(t, TIFFTAG_INKSET, INKSET_CMYK);
    if (im.photometric == PHOTOMETRIC_PALETTE) {
        std::vector<uint16_t> r(1u << im.depth), g(r.size()), b(r.size());
        for (size_t i = 0; i < r.size() && 3 * i + 2 < im.palette.size(); ++i) {
            r[i] = uint16_t(im.palette[3 * i] * 257);
            g[i] = uint16_t(im.palette[3 * i + 1] * 257);
            b[i] = uint16_t(im.palette[3 * i + 2] * 257);
        }
        TIFFSetField(t, TIFFTAG_COLORMAP, r.data(), g.data(), b.data());
    }
    if (tiled) {
        const uint32_t tw = 64, th = 32;
        TIFFSetField(t, TIFFTAG_TILEWIDTH, tw);
        TIFFSetField(t, TIFFTAG_TILELENGTH, th);
        const size_t bpp = size_t(im.depth) * im.colorType;
        std::vector<uint8_t> tile(size_t(TIFFTileSize(t)));
        for (uint32_t y = 0; y < uint32_t(im.height); y += th)
            for (uint32_t x = 0; x < uint32_t(im.width); x += tw) {
                std::fill(tile.begin(), tile.end(), 0);
                for (uint32_t r = 0; r < th && y + r < uint32_t(im.height); ++r) {
                    const size_t start = x * bpp / 8, line = tw * bpp / 8;
                    const auto &row = im.rows[y + r];
                    for (size_t i = 0; i < line && start + i < row.size(); ++i) tile[r * line + i] = row[start + i];
                }
                TIFFWriteTile(t, tile.data(), x, y, 0, 0);
            }
    } else {
        TIFFSetField(t, TIFFTAG_ROWSPERSTRIP, 16u);
        for (int y = 0; y < im.height; ++y) {
            std::vector<uint8_t> row = im.rows[size_t(y)];
            TIFFWriteScanline(t, row.data(), uint32_t(y), 0);
        }
    }
    TIFFClose(t);
}

Image ReadTiff(const std::string &path) {
    Image im;
    TIFF *t = TIFFOpen(path.c_str(), "r");
    if (t == nullptr) return im;
    uint32_t w = 0, h = 0;
    uint16_t bits = 1, samples = 1, photometric = 0;
    TIFFGetField(t, TIFFTAG_IMAGEWIDTH, &w);
    TIFFGetField(t, TIFFTAG_IMAGELENGTH, &h);
    TIFFGetFieldDefaulted(t, TIFFTAG_BITSPERSAMPLE, &bits);
    TIFFGetFieldDefaulted(t, TIFFTAG_SAMPLESPERPIXEL, &samples);
    TIFFGetField(t, TIFFTAG_PHOTOMETRIC, &photometric);
    im.width = int(w);
    im.height = int(h);
    im.depth = bits;
    im.colorType = samples;
    im.photometric = photometric;
    if (photometric == PHOTOMETRIC_PALETTE) {
        uint16_t *r, *g, *b;
        TIFFGetField(t, TIFFTAG_COLORMAP, &r, &g, &b);
        for (uint32_t i = 0; i < (1u << bits); ++i)
            im.palette.insert(im.palette.end(), {uint8_t(r[i] >> 8), uint8_t(g[i] >> 8), uint8_t(b[i] >> 8)});
    }
    im.rows.assign(h, std::vector<uint8_t>(size_t(TIFFScanlineSize(t))));
    for (uint32_t y = 0; y < h; ++y) TIFFReadScanline(t, im.rows[y].data(), y, 0);
    TIFFClose(t);
    return im;
}

Image MakeRgb(int w, int h) {
    Image im{w, h, PNG_COLOR_TYPE_RGB, 8, 0, {}, {}};
    for (int y = 0; y < h; ++y) {
        std::vector<uint8_t> row(size_t(w) * 3);
        for (int x = 0; x < w; ++x) {
            row[3 * x] = uint8_t(x * 7 + y);
            row[3 * x + 1] = uint8_t(y * 5 + (x >> 3));
            row[3 * x + 2] = uint8_t((x * y) ^ 0x5A);
        }
        im.rows.push_back(row);
    }
    return im;
}

Image MakeGray(int w, int h, int depth) {
    Image im{w, h, PNG_COLOR_TYPE_GRAY, depth, 0, {}, {}};
    const size_t bytes = (size_t(w) * depth + 7) / 8;
    for (int y = 0; y < h; ++y) {
        std::vector<uint8_t> row(bytes);
        for (size_t i = 0; i < bytes; ++i) row[i] = uint8_t(i * 13 + y * 29 + (i * y >> 4));
        // The padding bits of a last partial byte carry nothing.
        const int spare = int(bytes * 8 - size_t(w) * depth);
        if (spare > 0) row[bytes - 1] &= uint8_t(0xFF << spare);
        im.rows.push_back(row);
    }
    return im;
}

Image MakePalette(int w, int h, int colours) {
    Image im{w, h, PNG_COLOR_TYPE_PALETTE, 8, 0, {}, {}};
    for (int i = 0; i < colours; ++i)
        im.palette.insert(im.palette.end(), {uint8_t(i * 37), uint8_t(255 - i * 11), uint8_t(i * i)});
    for (int y = 0; y < h; ++y) {
        std::vector<uint8_t> row(static_cast<size_t>(w));
        for (int x = 0; x < w; ++x) row[size_t(x)] = uint8_t((x / 3 + y) % colours);
        im.rows.push_back(row);
    }
    return im;
}

bool FileExists(const std::string &path) {
    struct stat st {};
    return stat(path.c_str(), &st) == 0;
}

std::string ReadFile(const std::string &path) {
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void WriteFile(const std::string &path, const std::string &bytes) {
    std::ofstream(path, std::ios::binary) << bytes;
}

void CliSandbox::TearDown() {
    for (const auto &path : made_) std::remove(path.c_str());
    tstest::Sandbox::TearDown();
}

}  // namespace clitest
