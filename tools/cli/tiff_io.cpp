// TIFF through libtiff, one row at a time (strips) or one row of tiles at a
// time. libtiff's messages are kept for our one-line report, never printed.
#include <tiffio.h>

#include <algorithm>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstring>

#include "failure.h"
#include "raster.h"

namespace tessarine::cli {
namespace {

thread_local char tiffMessage[200];

void OnTiffError(const char *, const char *format, va_list args) {
    std::vsnprintf(tiffMessage, sizeof tiffMessage, format, args);
}
void OnTiffWarning(const char *, const char *, va_list) {}

void QuietTiff() {
    TIFFSetErrorHandler(OnTiffError);
    TIFFSetWarningHandler(OnTiffWarning);
    tiffMessage[0] = '\0';
}

std::string TiffReason(const char *fallback) {
    return tiffMessage[0] != '\0' ? std::string(tiffMessage) : std::string(fallback);
}

constexpr size_t kBandLimit = size_t(256) << 20;

class TiffReader final : public RasterReader {
  public:
    explicit TiffReader(const std::string &path) : path_(path) {}
    ~TiffReader() override {
        if (tiff_ != nullptr) TIFFClose(tiff_);
    }

    void Init() {
        QuietTiff();
        tiff_ = TIFFOpen(path_.c_str(), "r");
        if (tiff_ == nullptr) throw Failure(path_, "bad TIFF: " + TiffReason("cannot open"));
        uint32_t w = 0, h = 0;
        uint16_t bits = 1, samples = 1, photometric = 0, planar = PLANARCONFIG_CONTIG, inkset = INKSET_CMYK;
        if (!TIFFGetField(tiff_, TIFFTAG_IMAGEWIDTH, &w) || !TIFFGetField(tiff_, TIFFTAG_IMAGELENGTH, &h))
            throw Failure(path_, "bad TIFF: no image size");
        TIFFGetFieldDefaulted(tiff_, TIFFTAG_BITSPERSAMPLE, &bits);
        TIFFGetFieldDefaulted(tiff_, TIFFTAG_SAMPLESPERPIXEL, &samples);
        TIFFGetFieldDefaulted(tiff_, TIFFTAG_PLANARCONFIG, &planar);
        if (!TIFFGetField(tiff_, TIFFTAG_PHOTOMETRIC, &photometric))
            throw Failure(path_, "bad TIFF: no photometric interpretation");
        if (w == 0 || h == 0 || w > 0x7fffffff || h > 0x7fffffff) throw Failure(path_, "bad TIFF: image size");
        format_.width = int32_t(w);
        format_.height = int32_t(h);
        format_.nativeBits = bits;
        samples_ = samples;
        if (planar != PLANARCONFIG_CONTIG && samples > 1)
            throw Failure(path_, "TIFF with separate colour planes is not supported");
        if (bits != 8 && !(bits == 1 && samples == 1) && !(bits == 4 && samples == 1))
            throw Failure(path_, "TIFF with " + std::to_string(bits) + " bits a sample is not supported");
        switch (photometric) {
            case PHOTOMETRIC_MINISWHITE:
            case PHOTOMETRIC_MINISBLACK:
                if (samples != 1) throw Failure(path_, "gray TIFF with extra samples is not supported");
                whiteIsZero_ = photometric == PHOTOMETRIC_MINISWHITE;
                format_.kind = bits == 1 ? PixelKind::Bilevel : PixelKind::Gray;
                break;
            case PHOTOMETRIC_RGB:
                if (samples < 3 || bits != 8) throw Failure(path_, "unsupported RGB TIFF");
                format_.kind = PixelKind::Rgb;
                break;
            case PHOTOMETRIC_SEPARATED:
                TIFFGetFieldDefaulted(tiff_, TIFFTAG_INKSET, &inkset);
                if (inkset != INKSET_CMYK || samples < 4 || bits != 8)
                    throw Failure(path_, "only CMYK separated TIFF is supported");
                format_.kind = PixelKind::Cmyk;
                break;
            case PHOTOMETRIC_PALETTE: {
                uint16_t *r = nullptr, *g = nullptr, *b = nullptr;
                if (samples != 1 || !TIFFGetField(tiff_, TIFFTAG_COLORMAP, &r, &g, &b))
                    throw Failure(path_, "bad TIFF: palette image without a colour map");
                format_.kind = PixelKind::Palette;
                for (uint32_t i = 0; i < (1u << bits); ++i) {
                    format_.palette.push_back(uint8_t(r[i] >> 8));
                    format_.palette.push_back(uint8_t(g[i] >> 8));
                    format_.palette.push_back(uint8_t(b[i] >> 8));
                }
                break;
            }
            default:
                throw Failure(path_, "TIFF photometric interpretation " + std::to_string(photometric) +
                                         " is not supported");
        }
        if (bits == 4 && format_.kind == PixelKind::Bilevel) throw Failure(path_, "bad TIFF");
        float xr = 0, yr = 0;
        uint16_t unit = RESUNIT_INCH;
        TIFFGetFieldDefaulted(tiff_, TIFFTAG_RESOLUTIONUNIT, &unit);
        if (TIFFGetField(tiff_, TIFFTAG_XRESOLUTION, &xr) && TIFFGetField(tiff_, TIFFTAG_YRESOLUTION, &yr) &&
            xr > 0 && yr > 0 && xr < 1e6 && yr < 1e6 && unit != RESUNIT_NONE) {
            const double scale = unit == RESUNIT_CENTIMETER ? 2.54 : 1.0;
            format_.xDpi = xr * scale;
            format_.yDpi = yr * scale;
        }
        tiled_ = TIFFIsTiled(tiff_);
        const tmsize_t line = tiled_ ? TIFFTileRowSize(tiff_) : TIFFScanlineSize(tiff_);
        if (line <= 0) throw Failure(path_, "bad TIFF: " + TiffReason("row size"));
        lineBytes_ = size_t(bits) * samples * w / 8 + 1;
        if (tiled_) {
            uint32_t tw = 0, th = 0;
            TIFFGetField(tiff_, TIFFTAG_TILEWIDTH, &tw);
            TIFFGetField(tiff_, TIFFTAG_TILELENGTH, &th);
            if (tw == 0 || th == 0) throw Failure(path_, "bad TIFF: tile size");
            tileWidth_ = tw;
            tileHeight_ = th;
            const size_t across = (w + tw - 1) / tw;
            lineBytes_ = (size_t(bits) * samples * tw * across + 7) / 8;
            if (lineBytes_ * th > kBandLimit || size_t(TIFFTileSize(tiff_)) > kBandLimit)
                throw Failure(path_, "TIFF tiles too large");
            band_.resize(lineBytes_ * th);
            tile_.resize(size_t(TIFFTileSize(tiff_)));
        } else {
            lineBytes_ = std::max(lineBytes_, size_t(line));
            if (lineBytes_ > kBandLimit) throw Failure(path_, "image too wide");
        }
        line_.resize(lineBytes_);
    }

    void ReadRow(uint8_t *row) override {
        tiffMessage[0] = '\0';
        const uint8_t *source;
        if (tiled_) {
            if (next_ % tileHeight_ == 0) LoadTileRow();
            source = band_.data() + lineBytes_ * (next_ % tileHeight_);
        } else {
            if (TIFFReadScanline(tiff_, line_.data(), next_, 0) < 0) Fail();
            source = line_.data();
        }
        ++next_;
        Deliver(source, row);
    }

  private:
    [[noreturn]] void Fail() { throw Failure(path_, "bad or truncated TIFF: " + TiffReason("read error")); }

    // One row of tiles, laid out as whole rows.
    void LoadTileRow() {
        const uint32_t bits = uint32_t(format_.nativeBits) * samples_;
        const size_t tileLine = (size_t(bits) * tileWidth_ + 7) / 8;
        for (uint32_t x = 0; x < uint32_t(format_.width); x += tileWidth_) {
            if (TIFFReadTile(tiff_, tile_.data(), x, next_, 0, 0) < 0) Fail();
            const size_t at = size_t(bits) * x / 8;
            for (uint32_t r = 0; r < tileHeight_; ++r)
                std::memcpy(band_.data() + lineBytes_ * r + at, tile_.data() + tileLine * r, tileLine);
        }
    }

    void Deliver(const uint8_t *source, uint8_t *row) const {
        const size_t w = size_t(format_.width);
        switch (format_.kind) {
            case PixelKind::Bilevel: // ours: a set bit is black
                for (size_t i = 0; i < (w + 7) / 8; ++i) row[i] = whiteIsZero_ ? source[i] : uint8_t(~source[i]);
                return;
            case PixelKind::Gray:
            case PixelKind::Palette:
                if (format_.nativeBits == 1) {
                    for (size_t x = 0; x < w; ++x) row[x] = (source[x / 8] >> (7 - (x & 7))) & 1;
                } else if (format_.nativeBits == 4) {
                    for (size_t x = 0; x < w; ++x) {
                        const uint8_t n = (source[x / 2] >> (x & 1 ? 0 : 4)) & 15;
                        row[x] = format_.kind == PixelKind::Palette ? n : uint8_t(n * 17);
                    }
                } else {
                    std::memcpy(row, source, w);
                }
                if (format_.kind == PixelKind::Gray && whiteIsZero_)
                    for (size_t x = 0; x < w; ++x) row[x] = uint8_t(255 - row[x]);
                return;
            case PixelKind::Rgb:
            case PixelKind::Cmyk: {
                const size_t n = format_.kind == PixelKind::Rgb ? 3 : 4;
                if (samples_ == n) {
                    std::memcpy(row, source, w * n);
                } else {
                    for (size_t x = 0; x < w; ++x) std::memcpy(row + x * n, source + x * samples_, n);
                }
                return;
            }
            case PixelKind::Gray4: return;
        }
    }

    std::string path_;
    TIFF *tiff_ = nullptr;
    size_t samples_ = 1;
    bool whiteIsZero_ = false;
    bool tiled_ = false;
    uint32_t tileWidth_ = 0, tileHeight_ = 0;
    size_t lineBytes_ = 0;
    std::vector<uint8_t> line_, band_, tile_;
    uint32_t next_ = 0;
};

class TiffWriter final : public RasterWriter {
  public:
    TiffWriter(const std::string &displayPath, const RasterFormat &format)
        : path_(displayPath), format_(format) {}
    ~TiffWriter() override {
        if (tiff_ != nullptr) TIFFClose(tiff_);
    }
    void Init(const std::string &writePath) {
        QuietTiff();
        tiff_ = TIFFOpen(writePath.c_str(), format_.width > 0 && RowBytes(format_) * size_t(format_.height) > (size_t(3) << 30) ? "w8" : "w");
        if (tiff_ == nullptr) throw Failure(path_, "cannot write: " + TiffReason(std::strerror(errno)));
        uint16_t bits = 8, samples = 1, photometric = PHOTOMETRIC_MINISBLACK;
        switch (format_.kind) {
            case PixelKind::Gray: break;
            case PixelKind::Gray4: bits = 4; break;
            case PixelKind::Bilevel: bits = 1; photometric = PHOTOMETRIC_MINISWHITE; break;
            case PixelKind::Rgb: samples = 3; photometric = PHOTOMETRIC_RGB; break;
            case PixelKind::Cmyk: samples = 4; photometric = PHOTOMETRIC_SEPARATED; break;
            case PixelKind::Palette: photometric = PHOTOMETRIC_PALETTE; break;
        }
        TIFFSetField(tiff_, TIFFTAG_IMAGEWIDTH, uint32_t(format_.width));
        TIFFSetField(tiff_, TIFFTAG_IMAGELENGTH, uint32_t(format_.height));
        TIFFSetField(tiff_, TIFFTAG_BITSPERSAMPLE, bits);
        TIFFSetField(tiff_, TIFFTAG_SAMPLESPERPIXEL, samples);
        TIFFSetField(tiff_, TIFFTAG_PHOTOMETRIC, photometric);
        TIFFSetField(tiff_, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG);
        TIFFSetField(tiff_, TIFFTAG_COMPRESSION, COMPRESSION_ADOBE_DEFLATE);
        TIFFSetField(tiff_, TIFFTAG_ZIPQUALITY, 3);
        if (format_.kind == PixelKind::Cmyk) TIFFSetField(tiff_, TIFFTAG_INKSET, INKSET_CMYK);
        if (format_.kind == PixelKind::Palette) {
            std::vector<uint16_t> r(256, 0), g(256, 0), b(256, 0);
            for (size_t i = 0; i < format_.palette.size() / 3 && i < 256; ++i) {
                r[i] = uint16_t(format_.palette[3 * i] * 257);
                g[i] = uint16_t(format_.palette[3 * i + 1] * 257);
                b[i] = uint16_t(format_.palette[3 * i + 2] * 257);
            }
            TIFFSetField(tiff_, TIFFTAG_COLORMAP, r.data(), g.data(), b.data());
        }
        if (format_.xDpi > 0 && format_.yDpi > 0) {
            TIFFSetField(tiff_, TIFFTAG_RESOLUTIONUNIT, RESUNIT_INCH);
            TIFFSetField(tiff_, TIFFTAG_XRESOLUTION, float(format_.xDpi));
            TIFFSetField(tiff_, TIFFTAG_YRESOLUTION, float(format_.yDpi));
        }
        TIFFSetField(tiff_, TIFFTAG_ROWSPERSTRIP, TIFFDefaultStripSize(tiff_, 0));
        line_.resize(RowBytes(format_));
    }
    void WriteRow(const uint8_t *row) override {
        tiffMessage[0] = '\0';
        // libtiff may encode in place: it gets a copy.
        std::memcpy(line_.data(), row, line_.size());
        if (TIFFWriteScanline(tiff_, line_.data(), next_++, 0) < 0) Fail();
    }
    void Finish() override {
        tiffMessage[0] = '\0';
        errno = 0;
        const int flushed = TIFFFlush(tiff_);
        TIFF *tiff = tiff_;
        tiff_ = nullptr;
        TIFFClose(tiff);
        if (!flushed) Fail();
    }

  private:
    [[noreturn]] void Fail() {
        throw Failure(path_, "cannot write: " + TiffReason(errno != 0 ? std::strerror(errno) : "write error"));
    }
    std::string path_;
    RasterFormat format_;
    TIFF *tiff_ = nullptr;
    std::vector<uint8_t> line_;
    uint32_t next_ = 0;
};

}  // namespace

std::unique_ptr<RasterReader> OpenTiff(const std::string &path) {
    auto reader = std::make_unique<TiffReader>(path);
    reader->Init();
    return reader;
}

std::unique_ptr<RasterWriter> CreateTiff(const std::string &writePath, const std::string &displayPath,
                                         const RasterFormat &format) {
    auto writer = std::make_unique<TiffWriter>(displayPath, format);
    writer->Init(writePath);
    return writer;
}

}  // namespace tessarine::cli
