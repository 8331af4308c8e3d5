// tessarine export: a sub-bitmap of a tile file into a PNG or TIFF, from any
// layout. CMYK becomes RGB through the device formulas or through profiles.
#include <algorithm>
#include <cstring>
#include <ostream>
#include <tessarine/profile.hpp>

#include "commands.h"
#include "failure.h"
#include "output_file.h"
#include "raster.h"
#include "row_pipeline.h"
#include "tile_image.h"

namespace tessarine::cli {
namespace {

constexpr const char *kDefaultRgbProfile = "/usr/share/color/icc/ghostscript/srgb.icc";

// CMYK to RGB, by the device formulas or by a colour match between profiles.
class CmykToRgb {
  public:
    CmykToRgb(const std::string &profile, const std::string &rgbProfile)
        : useProfiles_(!profile.empty()), source_(profile.c_str()), destination_(rgbProfile.c_str()),
          profileName_(profile), rgbName_(rgbProfile) {
        if (!useProfiles_) return;
        EICCProfileType cmyk = eICCProfileCMYKSource, rgb = eICCProfileRGBOutput;
        if (!source_.exists()) throw Failure(profileName_, "no such profile");
        if (ValidateProfileType(source_, cmyk) != 1)
            throw Failure(profileName_, "not a CMYK profile that colours can be converted from");
        if (!destination_.exists()) throw Failure(rgbName_, "no such profile");
        if (ValidateProfileType(destination_, rgb) != 1)
            throw Failure(rgbName_, "not an RGB profile that colours can be converted to");
    }
    bool UsesProfiles() const { return useProfiles_; }
    void Convert(uint8_t *cmyk, uint8_t *rgb, int32_t count) {
        if (!useProfiles_) {
            for (int32_t i = 0; i < count; ++i) CX_SWOPCmyk2SRgb(cmyk + 4 * i, rgb + 3 * i);
            return;
        }
        CX_ColorBuffer in{CX_FORMAT_CMYK, count, cmyk}, out{CX_FORMAT_RGB, count, rgb};
        const long result = R27_XQMatchColors(&source_, &destination_, nullptr, nullptr, &in, &out, 0,
                                              getICCProfileFlags(1, 0, 0, 0, 0), 0);
        if (result != 0)
            throw Failure(profileName_, "colour conversion failed (" + std::to_string(result) + ")");
    }

  private:
    bool useProfiles_;
    AFilePath source_, destination_;
    std::string profileName_, rgbName_;
};

}  // namespace

void RunExport(const ExportOptions &options, std::ostream &out) {
    const FileType type = FileTypeOfName(options.output);
    if (options.tiffCmyk && type != FileType::Tiff)
        throw UsageFailure("--tiff-cmyk needs a .tif or .tiff output");
    TileImage image(options.input, TileImage::Access::Read);
    const SubbmpFacts &sub = image.Sub(options.sub);
    BI_Bitmap *b = image.Bitmap();
    const bool cmyk = b->colorModel == 2 && (b->imageType == 4 || b->imageType == 3);
    if (options.tiffCmyk && !(cmyk && b->imageType == 4))
        throw Failure(options.input, "--tiff-cmyk: the image is not CMYK true colour");
    if (!options.profile.empty() && !cmyk)
        throw Failure(options.input, "--profile: the image is not CMYK");
    const std::string rgbProfile = options.rgbProfile.empty() ? kDefaultRgbProfile : options.rgbProfile;
    CmykToRgb toRgb(cmyk && !options.tiffCmyk ? options.profile : std::string(), rgbProfile);

    RasterFormat f;
    f.width = sub.header.width;
    f.height = sub.header.height;
    f.xDpi = b->xResolution * f.width / b->width;
    f.yDpi = b->yResolution * f.height / b->height;
    const size_t w = size_t(f.width);
    std::vector<uint8_t> indexTable; // indexed CMYK as RGB entries
    if (b->imageType == 4) {
        f.kind = options.tiffCmyk ? PixelKind::Cmyk : PixelKind::Rgb;
    } else if (b->imageType == 3) {
        const std::vector<uint8_t> &colors = image.Facts().colors;
        if (b->colorModel == 2) {
            f.kind = PixelKind::Rgb;
            std::vector<uint8_t> entries(colors);
            indexTable.resize(entries.size() / 4 * 3);
            toRgb.Convert(entries.data(), indexTable.data(), int32_t(entries.size() / 4));
        } else {
            f.kind = PixelKind::Palette;
            f.palette = colors;
        }
    } else if (b->bitsPerPixel == 1) {
        f.kind = PixelKind::Bilevel;
    } else {
        f.kind = b->bitsPerPixel == 4 ? PixelKind::Gray4 : PixelKind::Gray;
    }

    PendingOutput pending(options.output);
    auto writer = WriteBehind(CreateRaster(type, pending.TempPath(), options.output, f), RowBytes(f) + 8);
    // A colour match costs a transform each call: rows go to it in batches.
    const bool batched = b->imageType == 4 && cmyk && !options.tiffCmyk && toRgb.UsesProfiles();
    const size_t batchRows = batched ? std::max<size_t>(1, (size_t(4) << 20) / (w * 4)) : 1;
    std::vector<uint8_t> bytes(w * 4 + 16), interleaved(w * 4 * batchRows);
    std::vector<uint8_t> batchRgb(batched ? w * 3 * batchRows : 0);
    size_t batchedRows = 0;
    auto flushBatch = [&] {
        if (batchedRows == 0) return;
        toRgb.Convert(interleaved.data(), batchRgb.data(), int32_t(batchedRows * w));
        for (size_t i = 0; i < batchedRows; ++i) writer->WriteRow(batchRgb.data() + i * w * 3);
        batchedRows = 0;
    };
    {
        RowSession session(b, 1, uint8_t(options.sub), options.input);
        const int32_t n = f.width;
        for (int32_t y = 0; y < f.height; ++y) {
            const std::string doing = "read row " + std::to_string(y);
            uint8_t *row = writer->NextSlot(); // the row is built in the writer's ring
            if (b->imageType == 4 && b->colorModel == 1) {
                Check(BI_GetRGBRowInterlace(b, y, 0, n, row), options.input, doing);
            } else if (b->imageType == 4) {
                uint8_t *c = bytes.data(), *m = c + w, *ye = m + w, *k = ye + w;
                Check(BI_GetCMYKRow(b, y, 0, n, c, m, ye, k), options.input, doing);
                uint8_t *target = options.tiffCmyk ? row : interleaved.data() + batchedRows * w * 4;
                for (size_t x = 0; x < w; ++x) {
                    target[4 * x] = c[x];
                    target[4 * x + 1] = m[x];
                    target[4 * x + 2] = ye[x];
                    target[4 * x + 3] = k[x];
                }
                if (batched) {
                    if (++batchedRows == batchRows) flushBatch();
                    continue;
                }
                if (!options.tiffCmyk) toRgb.Convert(target, row, n);
            } else if (b->imageType == 3) {
                Check(BI_GetIndexRow(b, y, 0, n, bytes.data()), options.input, doing);
                if (indexTable.empty()) {
                    std::memcpy(row, bytes.data(), w);
                } else {
                    const size_t entries = indexTable.size() / 3;
                    for (size_t x = 0; x < w; ++x) {
                        const size_t i = bytes[x] < entries ? bytes[x] : 0;
                        std::memcpy(&row[3 * x], &indexTable[3 * i], 3);
                    }
                }
            } else if (b->bitsPerPixel == 1) {
                Check(BI_GetBWPackedRow(b, y, 0, n, row), options.input, doing);
                if (w % 8) row[w / 8] &= uint8_t(0xFF00 >> (w % 8));
            } else {
                Check(BI_GetGRow(b, y, 0, n, bytes.data()), options.input, doing);
                if (b->bitsPerPixel == 8) {
                    for (size_t x = 0; x < w; ++x) row[x] = uint8_t(255 - bytes[x]);
                } else {
                    std::memset(row, 0, (w + 1) / 2);
                    for (size_t x = 0; x < w; ++x)
                        row[x / 2] |= uint8_t((15 - bytes[x] / 17) << (x & 1 ? 0 : 4));
                }
            }
            writer->WriteRow(row);
        }
        flushBatch();
        session.End();
    }
    writer->Finish();
    writer.reset();
    pending.Commit();
    out << options.input << " -> " << options.output << ": sub-bitmap " << options.sub << ", "
        << f.width << " x " << f.height << ", " << LayoutOf(*b) << "\n";
}

}  // namespace tessarine::cli
