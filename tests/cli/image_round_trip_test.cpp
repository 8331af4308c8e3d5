// PNG and TIFF through a tile bitmap file and back: the pixels come back as
// they went in, for every layout the image maps to without loss.
#include <tiffio.h>

#include <cstring>

#include <tessarine/tessarine.h>

#include "cli_test_support.h"

namespace clitest {
namespace {

class RoundTrip : public CliSandbox {
  protected:
    // PNG -> tile file -> PNG with the given layout (empty: the default).
    Image ThroughPng(const Image &in, const std::string &layout) {
        const std::string png = Made("in.png"), tile = Made("image.tsr"), back = Made("back.png");
        WritePng(png, in);
        std::vector<std::string> args{"import", png, tile};
        if (!layout.empty()) args.insert(args.end(), {"--layout", layout});
        RunResult r = Cli(args);
        EXPECT_EQ(r.code, 0) << r.err;
        r = Cli({"export", tile, back});
        EXPECT_EQ(r.code, 0) << r.err;
        return ReadPng(back);
    }
    Image ThroughTiff(const Image &in, const std::vector<std::string> &exportFlags, bool tiled = false) {
        const std::string tif = Made("in.tif"), tile = Made("image.tsr"), back = Made("back.tif");
        WriteTiff(tif, in, tiled);
        RunResult r = Cli({"import", tif, tile});
        EXPECT_EQ(r.code, 0) << r.err;
        std::vector<std::string> args{"export", tile, back};
        args.insert(args.end(), exportFlags.begin(), exportFlags.end());
        r = Cli(args);
        EXPECT_EQ(r.code, 0) << r.err;
        return ReadTiff(back);
    }
};

void ExpectSamePixels(const Image &a, const Image &b) {
    ASSERT_EQ(a.width, b.width);
    ASSERT_EQ(a.height, b.height);
    ASSERT_EQ(a.rows.size(), b.rows.size());
    for (size_t y = 0; y < a.rows.size(); ++y) ASSERT_EQ(a.rows[y], b.rows[y]) << "row " << y;
}

// Wide and tall enough to cross a tile's right edge (8192) and several bands.
TEST_F(RoundTrip, RgbPngAcrossTileEdges) {
    const Image in = MakeRgb(8200, 1100);
    const Image out = ThroughPng(in, "");
    EXPECT_EQ(out.colorType, 2);
    ExpectSamePixels(in, out);
}

TEST_F(RoundTrip, Gray8PngAcrossTileEdges) {
    const Image in = MakeGray(8195, 1030, 8);
    const Image out = ThroughPng(in, "gray8");
    EXPECT_EQ(out.colorType, 0);
    EXPECT_EQ(out.depth, 8);
    ExpectSamePixels(in, out);
}

TEST_F(RoundTrip, OneBitPngAsBlackAndWhite) {
    const Image in = MakeGray(8197, 1029, 1);
    const Image out = ThroughPng(in, "bw");
    EXPECT_EQ(out.depth, 1);
    ExpectSamePixels(in, out);
}

TEST_F(RoundTrip, OneBitPngAsOneBitGray) {
    const Image in = MakeGray(333, 77, 1);
    ExpectSamePixels(in, ThroughPng(in, "gray1"));
}

TEST_F(RoundTrip, FourBitGrayPng) {
    const Image in = MakeGray(301, 45, 4);
    const Image out = ThroughPng(in, "gray4");
    EXPECT_EQ(out.depth, 4);
    ExpectSamePixels(in, out);
}

TEST_F(RoundTrip, PalettePngAsIndexed) {
    const Image in = MakePalette(517, 63, 200);
    const Image out = ThroughPng(in, "indexed");
    EXPECT_EQ(out.colorType, 3);
    ASSERT_GE(out.palette.size(), in.palette.size());
    EXPECT_TRUE(std::equal(in.palette.begin(), in.palette.end(), out.palette.begin()));
    ExpectSamePixels(in, out);
}

TEST_F(RoundTrip, PalettePngAsRgb) {
    const Image in = MakePalette(64, 9, 16);
    const Image out = ThroughPng(in, "rgb");
    ASSERT_EQ(out.colorType, 2);
    for (int y = 0; y < in.height; ++y)
        for (int x = 0; x < in.width; ++x)
            for (int c = 0; c < 3; ++c)
                ASSERT_EQ(out.rows[y][3 * x + c], in.palette[in.rows[y][x] * 3 + c]);
}

TEST_F(RoundTrip, RgbTiff) {
    Image in = MakeRgb(8193, 1025);
    in.colorType = 3;
    in.photometric = PHOTOMETRIC_RGB;
    ExpectSamePixels(in, ThroughTiff(in, {}));
}

TEST_F(RoundTrip, TiledRgbTiff) {
    Image in = MakeRgb(300, 100);
    in.colorType = 3;
    in.photometric = PHOTOMETRIC_RGB;
    ExpectSamePixels(in, ThroughTiff(in, {}, true));
}

TEST_F(RoundTrip, Gray8Tiff) {
    Image in = MakeGray(1000, 1100, 8);
    in.colorType = 1;
    in.photometric = PHOTOMETRIC_MINISBLACK;
    const Image out = ThroughTiff(in, {});
    EXPECT_EQ(out.photometric, PHOTOMETRIC_MINISBLACK);
    ExpectSamePixels(in, out);
}

TEST_F(RoundTrip, OneBitTiffBothPhotometrics) {
    Image in = MakeGray(8199, 40, 1);
    in.colorType = 1;
    in.photometric = PHOTOMETRIC_MINISWHITE;
    const Image out = ThroughTiff(in, {});
    EXPECT_EQ(out.photometric, PHOTOMETRIC_MINISWHITE);
    ExpectSamePixels(in, out);
    // Black-is-zero comes back white-is-zero: the same pixels, bits turned over.
    in.photometric = PHOTOMETRIC_MINISBLACK;
    Image flipped = ThroughTiff(in, {});
    for (auto &row : flipped.rows)
        for (size_t i = 0; i < row.size(); ++i) row[i] = uint8_t(~row[i]);
    for (auto &row : flipped.rows)
        if (in.width % 8) row.back() &= uint8_t(0xFF << (8 - in.width % 8));
    ExpectSamePixels(in, flipped);
}

TEST_F(RoundTrip, CmykTiffKeptCmyk) {
    Image in{8200, 1030, 4, 8, PHOTOMETRIC_SEPARATED, {}, {}};
    for (int y = 0; y < in.height; ++y) {
        std::vector<uint8_t> row(size_t(in.width) * 4);
        for (size_t i = 0; i < row.size(); ++i) row[i] = uint8_t(i * 3 + y * 11);
        in.rows.push_back(row);
    }
    const Image out = ThroughTiff(in, {"--tiff-cmyk"});
    EXPECT_EQ(out.photometric, PHOTOMETRIC_SEPARATED);
    ExpectSamePixels(in, out);
}

TEST_F(RoundTrip, CmykToRgbByTheDeviceFormula) {
    Image in{50, 20, 4, 8, PHOTOMETRIC_SEPARATED, {}, {}};
    for (int y = 0; y < in.height; ++y) {
        std::vector<uint8_t> row(size_t(in.width) * 4);
        for (size_t i = 0; i < row.size(); ++i) row[i] = uint8_t(i * 5 + y * 13);
        in.rows.push_back(row);
    }
    const Image out = ThroughTiff(in, {});
    ASSERT_EQ(out.photometric, PHOTOMETRIC_RGB);
    for (int y = 0; y < in.height; ++y)
        for (int x = 0; x < in.width; ++x) {
            uint8_t rgb[3];
            CX_SWOPCmyk2SRgb(&in.rows[y][4 * x], rgb);
            ASSERT_EQ(0, std::memcmp(rgb, &out.rows[y][3 * x], 3)) << x << "," << y;
        }
}

TEST_F(RoundTrip, CmykToRgbThroughProfiles) {
    Image in{40, 10, 4, 8, PHOTOMETRIC_SEPARATED, {}, {}};
    for (int y = 0; y < in.height; ++y) in.rows.push_back(std::vector<uint8_t>(size_t(in.width) * 4, uint8_t(y * 20)));
    const std::string tif = Made("in.tif"), tile = Made("image.tsr"), back = Made("back.png");
    WriteTiff(tif, in);
    ASSERT_EQ(Cli({"import", tif, tile}).code, 0);
    const RunResult r = Cli({"export", tile, back, "--profile", "/usr/share/color/icc/ghostscript/default_cmyk.icc"});
    ASSERT_EQ(r.code, 0) << r.err;
    const Image out = ReadPng(back);
    ASSERT_EQ(out.height, 10);
    // No ink is paper white; more ink is darker.
    EXPECT_GT(out.rows[0][0], 240);
    EXPECT_LT(out.rows[9][0], out.rows[1][0]);
    // An RGB profile is no CMYK source.
    const RunResult bad = Cli({"export", tile, Made("bad.png"), "--profile", "/usr/share/color/icc/ghostscript/srgb.icc"});
    EXPECT_EQ(bad.code, 1);
    EXPECT_NE(bad.err.find("srgb.icc"), std::string::npos) << bad.err;
    EXPECT_FALSE(FileExists(Path("bad.png")));
}

// Gray in an image file is light; in the library it is ink.
TEST_F(RoundTrip, GrayIsStoredAsInk) {
    const Image in = MakeGray(40, 3, 8);
    const std::string png = Made("in.png"), tile = Made("image.tsr");
    WritePng(png, in);
    ASSERT_EQ(Cli({"import", png, tile}).code, 0);
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_NewBitmap(&b), 10);
    b->imageType = 2;
    b->bitsPerPixel = 8;
    b->width = 40;
    b->height = 3;
    b->storage = 2;
    std::strcpy(b->tilePath, tile.c_str());
    uint8_t density[40];
    ASSERT_EQ(BI_GetGRow(b, 2, 0, 40, density), 10);
    for (int x = 0; x < 40; ++x) EXPECT_EQ(density[x], 255 - in.rows[2][x]);
    b->tilePath[0] = '\0';
    BI_DeleteBitmap(&b);
}

// True colour into gray goes through the library's gray density.
TEST_F(RoundTrip, RgbToGrayUsesTheLibrarysDensity) {
    const Image in = MakeRgb(70, 4);
    const Image out = ThroughPng(in, "gray8");
    for (int y = 0; y < in.height; ++y)
        for (int x = 0; x < in.width; ++x) {
            const uint8_t *p = &in.rows[y][3 * x];
            ASSERT_EQ(out.rows[y][x], 255 - RGB2GrayScale(p[0], p[1], p[2]));
        }
}

TEST_F(RoundTrip, RgbToCmykThroughTheDeviceFormula) {
    const Image in = MakeRgb(30, 5);
    const std::string png = Made("in.png"), tile = Made("image.tsr"), back = Made("back.tif");
    WritePng(png, in);
    ASSERT_EQ(Cli({"import", png, tile, "--layout", "cmyk"}).code, 0);
    ASSERT_EQ(Cli({"export", tile, back, "--tiff-cmyk"}).code, 0);
    const Image out = ReadTiff(back);
    for (int y = 0; y < in.height; ++y)
        for (int x = 0; x < in.width; ++x) {
            uint8_t rgb[3] = {in.rows[y][3 * x], in.rows[y][3 * x + 1], in.rows[y][3 * x + 2]}, cmyk[4];
            CX_SRgb2SWOPCmyk(rgb, cmyk);
            ASSERT_EQ(0, std::memcmp(cmyk, &out.rows[y][4 * x], 4));
        }
}

}  // namespace
}  // namespace clitest
