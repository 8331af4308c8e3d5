// PNG through libpng, one row at a time. libpng reports errors by longjmp:
// every libpng call sits in a small function whose only locals are plain.
#include <png.h>

#include <cerrno>
#include <csetjmp>
#include <cstring>

#include "failure.h"
#include "raster.h"

namespace tessarine::cli {
namespace {

struct PngErrorState {
    char message[200] = {};
};

void OnPngError(png_structp png, png_const_charp text) {
    auto *state = static_cast<PngErrorState *>(png_get_error_ptr(png));
    std::snprintf(state->message, sizeof state->message, "%s", text);
    png_longjmp(png, 1);
}

void OnPngWarning(png_structp, png_const_charp) {}

// Interlaced images cannot be streamed; below this they are read whole.
constexpr size_t kInterlacedLimit = size_t(256) << 20;
constexpr size_t kRowLimit = size_t(256) << 20;

class PngReader final : public RasterReader {
  public:
    PngReader(const std::string &path, FILE *file) : path_(path), file_(file) {}
    // Apart from the constructor, so that a failure here still runs the destructor.
    void Init() {
        png_ = png_create_read_struct(PNG_LIBPNG_VER_STRING, &error_, OnPngError, OnPngWarning);
        if (png_ != nullptr) info_ = png_create_info_struct(png_);
        if (png_ == nullptr || info_ == nullptr) Fail("not enough memory");
        if (!Start()) Fail(error_.message);
        if (rowBytes_ > kRowLimit) throw Failure(path_, "image too wide");
        if (interlaced_) {
            const size_t bytes = rowBytes_ * size_t(format_.height);
            if (bytes > kInterlacedLimit)
                throw Failure(path_, "interlaced PNG too large to stream (save it without interlacing)");
            whole_.resize(bytes);
            rows_.resize(size_t(format_.height));
            for (int32_t y = 0; y < format_.height; ++y) rows_[size_t(y)] = whole_.data() + rowBytes_ * y;
            if (!ReadWhole()) Fail(error_.message);
        }
        raw_.resize(rowBytes_);
    }
    ~PngReader() override {
        png_destroy_read_struct(&png_, info_ ? &info_ : nullptr, nullptr);
        if (file_ != nullptr) std::fclose(file_);
    }

    void ReadRow(uint8_t *row) override {
        const uint8_t *source;
        if (interlaced_) {
            source = rows_[size_t(next_++)];
        } else if (!alpha_ && rowBytes_ == RowBytes(format_)) {
            // Rows as they come out of libpng: decoded where they are wanted.
            if (!ReadOne(row)) Fail(error_.message);
            return;
        } else {
            if (!ReadOne(raw_.data())) Fail(error_.message);
            source = raw_.data();
        }
        Deliver(source, row);
    }

  private:
    [[noreturn]] void Fail(const char *what) {
        std::string text = what;
        if (text.find("Read Error") != std::string::npos || text.find("EOF") != std::string::npos ||
            text.find("Not enough image data") != std::string::npos)
            text = "truncated PNG";
        throw Failure(path_, "bad PNG: " + text);
    }

    bool Start() {
        if (setjmp(png_jmpbuf(png_))) return false;
        png_init_io(png_, file_);
        png_set_user_limits(png_, 0x7fffffff, 0x7fffffff);
        png_read_info(png_, info_);
        png_uint_32 w = 0, h = 0;
        int depth = 0, color = 0, interlace = 0;
        png_get_IHDR(png_, info_, &w, &h, &depth, &color, &interlace, nullptr, nullptr);
        format_.width = int32_t(w);
        format_.height = int32_t(h);
        format_.nativeBits = depth;
        png_uint_32 xppu = 0, yppu = 0;
        int unit = 0;
        if (png_get_pHYs(png_, info_, &xppu, &yppu, &unit) && unit == PNG_RESOLUTION_METER) {
            format_.xDpi = xppu * 0.0254;
            format_.yDpi = yppu * 0.0254;
        }
        if (depth == 16) png_set_strip_16(png_);
        channels_ = 1;
        switch (color) {
            case PNG_COLOR_TYPE_PALETTE: {
                format_.kind = PixelKind::Palette;
                png_colorp entries = nullptr;
                int count = 0;
                png_get_PLTE(png_, info_, &entries, &count);
                for (int i = 0; i < count; ++i) {
                    format_.palette.push_back(entries[i].red);
                    format_.palette.push_back(entries[i].green);
                    format_.palette.push_back(entries[i].blue);
                }
                if (depth < 8) png_set_packing(png_);
                break;
            }
            case PNG_COLOR_TYPE_GRAY:
                if (png_get_valid(png_, info_, PNG_INFO_tRNS)) {
                    png_set_expand_gray_1_2_4_to_8(png_);
                    png_set_tRNS_to_alpha(png_);
                    format_.kind = PixelKind::Gray;
                    alpha_ = true;
                    channels_ = 2;
                } else if (depth == 1) {
                    format_.kind = PixelKind::Bilevel;
                    png_set_invert_mono(png_); // PNG's 1 is white; ours is black
                } else {
                    if (depth < 8) png_set_expand_gray_1_2_4_to_8(png_);
                    format_.kind = PixelKind::Gray;
                }
                break;
            case PNG_COLOR_TYPE_GRAY_ALPHA:
                format_.kind = PixelKind::Gray;
                alpha_ = true;
                channels_ = 2;
                break;
            case PNG_COLOR_TYPE_RGB:
                format_.kind = PixelKind::Rgb;
                channels_ = 3;
                if (png_get_valid(png_, info_, PNG_INFO_tRNS)) {
                    png_set_tRNS_to_alpha(png_);
                    alpha_ = true;
                    channels_ = 4;
                }
                break;
            case PNG_COLOR_TYPE_RGB_ALPHA:
                format_.kind = PixelKind::Rgb;
                alpha_ = true;
                channels_ = 4;
                break;
            default: png_error(png_, "unknown colour type");
        }
        interlaced_ = png_set_interlace_handling(png_) > 1;
        png_read_update_info(png_, info_);
        rowBytes_ = png_get_rowbytes(png_, info_);
        return true;
    }

    bool ReadOne(uint8_t *row) {
        if (setjmp(png_jmpbuf(png_))) return false;
        png_read_row(png_, row, nullptr);
        return true;
    }

    bool ReadWhole() {
        if (setjmp(png_jmpbuf(png_))) return false;
        png_read_image(png_, rows_.data());
        return true;
    }

    // Alpha is laid over white paper.
    void Deliver(const uint8_t *source, uint8_t *row) const {
        const size_t w = size_t(format_.width);
        if (!alpha_) {
            std::memcpy(row, source, RowBytes(format_));
            return;
        }
        const int colours = channels_ - 1;
        for (size_t x = 0; x < w; ++x) {
            const unsigned a = source[x * channels_ + colours];
            for (int c = 0; c < colours; ++c) {
                const unsigned v = source[x * channels_ + c];
                row[x * colours + c] = uint8_t((v * a + 255u * (255u - a) + 127u) / 255u);
            }
        }
    }

    std::string path_;
    FILE *file_;
    png_structp png_ = nullptr;
    png_infop info_ = nullptr;
    PngErrorState error_;
    bool alpha_ = false;
    bool interlaced_ = false;
    int channels_ = 1;
    size_t rowBytes_ = 0;
    std::vector<uint8_t> raw_;
    std::vector<uint8_t> whole_;
    std::vector<uint8_t *> rows_;
    int32_t next_ = 0;
};

class PngWriter final : public RasterWriter {
  public:
    PngWriter(const std::string &displayPath, const RasterFormat &format)
        : path_(displayPath), format_(format) {}
    void Init(const std::string &writePath) {
        file_ = std::fopen(writePath.c_str(), "wb");
        if (file_ == nullptr) throw Failure(path_, std::string("cannot write: ") + std::strerror(errno));
        png_ = png_create_write_struct(PNG_LIBPNG_VER_STRING, &error_, OnPngError, OnPngWarning);
        if (png_ != nullptr) info_ = png_create_info_struct(png_);
        if (png_ == nullptr || info_ == nullptr) throw Failure(path_, "not enough memory");
        if (!Start()) Fail();
    }
    ~PngWriter() override {
        png_destroy_write_struct(&png_, info_ ? &info_ : nullptr);
        if (file_ != nullptr) std::fclose(file_);
    }
    void WriteRow(const uint8_t *row) override {
        if (!WriteOne(row)) Fail();
    }
    void Finish() override {
        if (!End()) Fail();
        FILE *file = file_;
        file_ = nullptr;
        const bool flushed = std::fflush(file) == 0 && !std::ferror(file);
        const int error = errno;
        if (std::fclose(file) != 0 || !flushed)
            throw Failure(path_, std::string("cannot write: ") + std::strerror(flushed ? errno : error));
    }

  private:
    [[noreturn]] void Fail() {
        std::string text = error_.message;
        if (std::ferror(file_)) text = std::strerror(errno);
        throw Failure(path_, "cannot write: " + text);
    }
    bool Start() {
        if (setjmp(png_jmpbuf(png_))) return false;
        png_init_io(png_, file_);
        int color = PNG_COLOR_TYPE_RGB, depth = 8;
        switch (format_.kind) {
            case PixelKind::Gray: color = PNG_COLOR_TYPE_GRAY; break;
            case PixelKind::Gray4: color = PNG_COLOR_TYPE_GRAY; depth = 4; break;
            case PixelKind::Bilevel: color = PNG_COLOR_TYPE_GRAY; depth = 1; break;
            case PixelKind::Palette: color = PNG_COLOR_TYPE_PALETTE; break;
            case PixelKind::Rgb: break;
            case PixelKind::Cmyk: png_error(png_, "PNG holds no CMYK");
        }
        png_set_IHDR(png_, info_, png_uint_32(format_.width), png_uint_32(format_.height), depth,
                     color, PNG_INTERLACE_NONE, PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
        if (format_.kind == PixelKind::Palette) {
            std::vector<png_color> entries(format_.palette.size() / 3);
            for (size_t i = 0; i < entries.size(); ++i)
                entries[i] = {format_.palette[3 * i], format_.palette[3 * i + 1], format_.palette[3 * i + 2]};
            png_set_PLTE(png_, info_, entries.data(), int(entries.size()));
        }
        if (format_.xDpi > 0 && format_.yDpi > 0)
            png_set_pHYs(png_, info_, png_uint_32(format_.xDpi / 0.0254 + 0.5),
                         png_uint_32(format_.yDpi / 0.0254 + 0.5), PNG_RESOLUTION_METER);
        // Large prints: speed matters more than the last few per cent of size.
        png_set_compression_level(png_, 3);
        png_write_info(png_, info_);
        if (format_.kind == PixelKind::Bilevel) png_set_invert_mono(png_);
        return true;
    }
    bool WriteOne(const uint8_t *row) {
        if (setjmp(png_jmpbuf(png_))) return false;
        png_write_row(png_, row);
        return true;
    }
    bool End() {
        if (setjmp(png_jmpbuf(png_))) return false;
        png_write_end(png_, nullptr);
        return true;
    }

    std::string path_;
    RasterFormat format_;
    FILE *file_ = nullptr;
    png_structp png_ = nullptr;
    png_infop info_ = nullptr;
    PngErrorState error_;
};

}  // namespace

std::unique_ptr<RasterReader> OpenPng(const std::string &path, FILE *file) {
    auto reader = std::make_unique<PngReader>(path, file);
    reader->Init();
    return reader;
}

std::unique_ptr<RasterWriter> CreatePng(const std::string &writePath, const std::string &displayPath,
                                        const RasterFormat &format) {
    auto writer = std::make_unique<PngWriter>(displayPath, format);
    writer->Init(writePath);
    return writer;
}

}  // namespace tessarine::cli
