// tessarine convert: one tile bitmap file into another layout, through the
// library's whole-bitmap copy.
#include <climits>
#include <ostream>

#include "commands.h"
#include "failure.h"
#include "tile_image.h"

namespace tessarine::cli {
namespace {

// The colour table of an indexed destination: the source's own when it has
// an RGB one, a gray ramp for gray, white and black for 1-bit, and a colour
// cube for true colour.
std::vector<uint8_t> TableFor(const BI_Bitmap &source, const std::vector<uint8_t> &sourceColors) {
    std::vector<uint8_t> table;
    if (source.imageType == 3 && source.colorModel == 1) return sourceColors;
    if (source.imageType == 3) {
        for (size_t i = 0; i + 3 < sourceColors.size(); i += 4) {
            uint8_t rgb[3];
            CX_SWOPCmyk2SRgb(&sourceColors[i], rgb);
            table.insert(table.end(), rgb, rgb + 3);
        }
        return table;
    }
    if (source.imageType == 1 || source.bitsPerPixel == 1) return {255, 255, 255, 0, 0, 0};
    if (source.imageType == 2) {
        for (int i = 0; i < 256; ++i) table.insert(table.end(), {uint8_t(255 - i), uint8_t(255 - i), uint8_t(255 - i)});
        return table;
    }
    for (int r = 0; r < 6; ++r)
        for (int g = 0; g < 6; ++g)
            for (int b = 0; b < 6; ++b) table.insert(table.end(), {uint8_t(r * 51), uint8_t(g * 51), uint8_t(b * 51)});
    return table;
}

enum class Route { Copy, CopyToRgb, Rows };

// The whole-bitmap copy writes index values for every destination that is not
// true colour, and clears those at or above the destination's colour count:
// a gray or black-and-white destination (count 0) would come out white. Into
// CMYK it reads any source as CMYK pixels, and into RGB a CMYK source as RGB.
// Those destinations take the library's row functions instead, and CMYK into
// RGB its copy through the device formulas.
Route RouteFor(const BI_Bitmap &s, const Layout &d) {
    const bool sameLayout = s.imageType == d.imageType && s.bitsPerPixel == d.bitsPerPixel &&
                            (s.imageType != 4 || s.colorModel == d.colorModel);
    if (sameLayout) return Route::Copy;
    const bool cmykSource = s.colorModel == 2 && (s.imageType == 4 || s.imageType == 3);
    if (d.imageType == 4 && d.colorModel == 1) return cmykSource ? Route::CopyToRgb : Route::Copy;
    if (d.imageType == 3) return Route::Copy;
    return Route::Rows;
}

void CopyRows(BI_Bitmap *s, BI_Bitmap *d, const std::string &in, const std::string &out) {
    RowSession reading(s, 1, 0, in);
    RowSession writing(d, 2, 0, out);
    const int32_t w = s->width;
    const size_t n = size_t(w);
    std::vector<uint8_t> planes(n * 4 + 16), values(n + 16);
    uint8_t *p0 = planes.data(), *p1 = p0 + n, *p2 = p1 + n, *p3 = p2 + n;
    for (int32_t y = 0; y < s->height; ++y) {
        const std::string row = "row " + std::to_string(y);
        if (d->imageType == 4) {
            if (s->colorModel == 2) {
                Check(BI_GetCMYKRow(s, y, 0, w, p0, p1, p2, p3), in, "read " + row);
            } else {
                Check(BI_GetRGBRow(s, y, 0, w, p0, p1, p2), in, "read " + row);
                for (size_t x = 0; x < n; ++x) {
                    uint8_t rgb[3] = {p0[x], p1[x], p2[x]}, cmyk[4];
                    CX_SRgb2SWOPCmyk(rgb, cmyk);
                    p0[x] = cmyk[0], p1[x] = cmyk[1], p2[x] = cmyk[2], p3[x] = cmyk[3];
                }
            }
            Check(BI_SetCMYKRow(y, 0, w, p0, p1, p2, p3, d), out, "write " + row);
            continue;
        }
        Check(BI_GetGRow(s, y, 0, w, values.data()), in, "read " + row);
        if (d->imageType == 2) {
            Check(BI_SetGRow(y, 0, w, values.data(), d), out, "write " + row);
        } else {
            for (size_t x = 0; x < n; ++x) values[x] = values[x] >= 128;
            Check(BI_SetBWRow(y, 0, w, values.data(), d), out, "write " + row);
        }
    }
    writing.End();
}

}  // namespace

void RunConvert(const ConvertOptions &options, std::ostream &out) {
    const Layout &layout = LayoutNamed(options.layout);
    TileImage source(options.input, TileImage::Access::Read);
    BI_Bitmap *s = source.Bitmap();
    const std::vector<uint8_t> table =
        layout.imageType == 3 ? TableFor(*s, source.Facts().colors) : std::vector<uint8_t>{};
    NewTileImage destination(options.output, layout, s->width, s->height, s->xResolution, s->yResolution, table);
    const Route route = RouteFor(*s, layout);
    if (route == Route::Rows) {
        CopyRows(s, destination.Bitmap(), options.input, options.output);
    } else {
        const RECT whole{0, 0, s->width, s->height};
        // The copy ends its own row sessions, which drop the status of the
        // last band: a file failure shows in the errno the file layer keeps.
        constexpr int32_t kUntouched = INT32_MIN;
        FM_LastErrno = kUntouched;
        const int32_t status = route == Route::Copy
                                   ? BI_CopyBmp(&whole, s, &whole, destination.Bitmap(), 0, 0)
                                   : BI_CopyBmpToRGBTrueColor(&whole, s, &whole, destination.Bitmap(), 0, 0, nullptr);
        const int32_t error = FM_LastErrno;
        FM_LastErrno = 0;
        if (TS_FAILED(status) || error != kUntouched) {
            if (!TS_FAILED(status) || TS_STATUS(status) == -50) {
                FM_LastErrno = error == kUntouched ? 0 : error;
                throw Failure(options.output, std::string("cannot convert: ") + StatusText(-50));
            }
            FailStatus(options.output, "convert", status);
        }
    }
    destination.Commit();
    out << options.input << " -> " << options.output << ": " << s->width << " x " << s->height << ", "
        << LayoutOf(*s) << " to " << layout.name << "\n";
}

}  // namespace tessarine::cli
