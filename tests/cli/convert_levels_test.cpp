// convert against the library's own row reads, and levels against the
// library's own level making; an interrupted levels leaves a valid file.
#include <tessarine/tessarine.h>

#include <cstring>
#include <fcntl.h>
#include <unistd.h>

#include "cli_test_support.h"
#include "commands.h"
#include "tile_image.h"

namespace clitest {
namespace {

using tessarine::cli::TileImage;

class ConvertLevels : public CliSandbox {
  protected:
    std::string Imported(const std::string &name, const Image &image, const std::string &layout) {
        const std::string png = Made(name + ".png"), tile = Made(name);
        WritePng(png, image);
        std::vector<std::string> args{"import", png, tile};
        if (!layout.empty()) args.insert(args.end(), {"--layout", layout});
        const RunResult r = Cli(args);
        EXPECT_EQ(r.code, 0) << r.err;
        return tile;
    }
    // Converts and checks every row of the copy against the source, both read
    // by the library as the destination's kind of row.
    void ConvertAndCompare(const std::string &source, const std::string &layout) {
        const std::string out = Made("converted-" + layout);
        const RunResult r = Cli({"convert", source, out, "--layout", layout});
        ASSERT_EQ(r.code, 0) << r.err;
        TileImage a(source, TileImage::Access::Read), b(out, TileImage::Access::Read);
        BI_Bitmap *s = a.Bitmap(), *d = b.Bitmap();
        ASSERT_EQ(d->width, s->width);
        const int32_t w = s->width;
        std::vector<uint8_t> p(size_t(w) * 8), q(size_t(w) * 8);
        uint8_t map[256];
        if (d->imageType == 3 && s->imageType != 4) {
            ASSERT_EQ(BI_GetMapTable(s, d, map), 10);
        }
        int32_t count = 0;
        uint8_t table[256 * 3];
        if (d->imageType == 3 && s->imageType == 4) {
            ASSERT_FALSE(TS_FAILED(BI_GetRGBColorTable(d, &count, table)));
        }
        for (int32_t y = 0; y < s->height; y += 7) {
            uint8_t *p0 = p.data(), *q0 = q.data();
            if (d->imageType == 4 && d->colorModel == 1) {
                if (s->colorModel == 2 && s->imageType == 4) {
                    // CMYK comes into RGB through the device formula.
                    ASSERT_EQ(BI_GetCMYKRow(s, y, 0, w, p0, p0 + w, p0 + 2 * w, p0 + 3 * w), 10);
                    ASSERT_EQ(BI_GetRGBRow(d, y, 0, w, q0, q0 + w, q0 + 2 * w), 10);
                    for (int32_t x = 0; x < w; ++x) {
                        const uint8_t cmyk[4] = {p0[x], p0[w + x], p0[2 * w + x], p0[3 * w + x]};
                        uint8_t rgb[3];
                        CX_SWOPCmyk2SRgb(cmyk, rgb);
                        ASSERT_TRUE(rgb[0] == q0[x] && rgb[1] == q0[w + x] && rgb[2] == q0[2 * w + x]) << x;
                    }
                    continue;
                }
                ASSERT_EQ(BI_GetRGBRow(s, y, 0, w, p0, p0 + w, p0 + 2 * w), 10);
                ASSERT_EQ(BI_GetRGBRow(d, y, 0, w, q0, q0 + w, q0 + 2 * w), 10);
                ASSERT_TRUE(std::equal(p0, p0 + 3 * w, q0)) << "row " << y;
            } else if (d->imageType == 4) {
                ASSERT_EQ(BI_GetRGBRow(s, y, 0, w, p0, p0 + w, p0 + 2 * w), 10);
                ASSERT_EQ(BI_GetCMYKRow(d, y, 0, w, q0, q0 + w, q0 + 2 * w, q0 + 3 * w), 10);
                for (int32_t x = 0; x < w; ++x) {
                    uint8_t rgb[3] = {p0[x], p0[w + x], p0[2 * w + x]}, cmyk[4];
                    CX_SRgb2SWOPCmyk(rgb, cmyk);
                    for (int c = 0; c < 4; ++c) ASSERT_EQ(q0[c * w + x], cmyk[c]) << x << "," << y;
                }
            } else if (d->imageType == 2 || d->imageType == 1) {
                // Gray and black and white are written from the source's densities.
                ASSERT_EQ(BI_GetGRow(s, y, 0, w, p0), 10);
                ASSERT_EQ(BI_GetGRow(d, y, 0, w, q0), 10);
                for (int32_t x = 0; x < w; ++x) {
                    const int expected = d->bitsPerPixel == 8 ? p0[x] : d->bitsPerPixel == 4 ? p0[x] / 17 * 17 : (p0[x] >= 128) * 255;
                    ASSERT_EQ(q0[x], expected) << x << "," << y;
                }
            } else if (s->imageType != 4) {
                ASSERT_EQ(BI_GetIndexRow(s, y, 0, w, p0), 10);
                ASSERT_EQ(BI_GetIndexRow(d, y, 0, w, q0), 10);
                for (int32_t x = 0; x < w; ++x) ASSERT_EQ(q0[x], map[p0[x]]) << x << "," << y;
            } else {
                ASSERT_EQ(BI_GetRGBRow(s, y, 0, w, p0, p0 + w, p0 + 2 * w), 10);
                ASSERT_EQ(BI_GetIndexRow(d, y, 0, w, q0), 10);
                for (int32_t x = 0; x < w; ++x)
                    ASSERT_EQ(q0[x], BI_RGBMapToColorIndex(p0[x], p0[w + x], p0[2 * w + x], count, table)) << x;
            }
        }
    }
};

TEST_F(ConvertLevels, ConvertFollowsTheLibrarysRows) {
    const std::string rgb = Imported("rgb.tsr", MakeRgb(8200, 1030), "");
    ConvertAndCompare(rgb, "cmyk");
    ConvertAndCompare(Made("converted-cmyk"), "rgb");
    ConvertAndCompare(rgb, "bw");
    const std::string small = Imported("small.tsr", MakeRgb(300, 60), "");
    ConvertAndCompare(small, "gray8");
    ConvertAndCompare(small, "indexed");
    const std::string gray = Imported("gray.tsr", MakeGray(301, 50, 8), "gray8");
    ConvertAndCompare(gray, "rgb");
    ConvertAndCompare(gray, "gray4");
    const std::string bw = Imported("bw.tsr", MakeGray(301, 50, 1), "bw");
    ConvertAndCompare(bw, "rgb");
    const std::string indexed = Imported("indexed.tsr", MakePalette(301, 50, 40), "");
    ConvertAndCompare(indexed, "rgb");
}

TEST_F(ConvertLevels, ConvertFailsCleanly) {
    const std::string src = Imported("s.tsr", MakeRgb(100, 30), "");
    const RunResult r = Cli({"convert", src, Path("none/out.tsr"), "--layout", "cmyk"});
    EXPECT_EQ(r.code, 1);
    EXPECT_NE(r.err.find("out.tsr"), std::string::npos);
    const std::string out = Path("c.tsr");
    tstest::ForEachFileFailure(tessarine::testing::FileCall::Write, [&](int64_t) {
        const RunResult run = Cli({"convert", src, out, "--layout", "gray8"});
        if (tessarine::testing::FileFailureHit(tessarine::testing::FileCall::Write)) {
            EXPECT_EQ(run.code, 1);
            EXPECT_FALSE(FileExists(out));
        } else {
            EXPECT_EQ(run.code, 0) << run.err;
            std::remove(out.c_str());
        }
    });
}

std::string Copy(const std::string &from, const std::string &to) {
    WriteFile(to, ReadFile(from));
    return to;
}

// The same levels made by calling the library directly.
void LibraryLevels(const std::string &path, int count) {
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_NewBitmap(&b), 10);
    std::strcpy(b->tilePath, path.c_str());
    b->storage = 2;
    b->tileFile = open(path.c_str(), O_RDWR);
    HVT_FileInfo info;
    for (int level = 0; level < count; ++level) {
        HVT_InitFileInfo(&info);
        ASSERT_EQ(HVT_TileFileBegin(b, &info, 0), 10);
        const HVT_SubbmpSlot &last = info.subbmps[info.header->subbmpCount - 1];
        uint8_t sub = 0;
        ASSERT_EQ(HVT_AddSubbmp(b->tileFile, info.header, uint32_t(last.width / 2), uint32_t(last.height / 2), nullptr, &sub), 10);
        HVT_TileFileEnd(&info, 0);
        HVT_InitFileInfo(&info);
        ASSERT_EQ(HVT_TileFileBegin(b, &info, 0), 10);
        ASSERT_EQ(HVT_UpdateLowRes(&info, uint8_t(sub - 1), sub, nullptr), 10);
        HVT_TileFileEnd(&info, 0);
    }
    close(b->tileFile);
    b->tileFile = -1;
    b->tilePath[0] = '\0';
    BI_DeleteBitmap(&b);
}

TEST_F(ConvertLevels, LevelsAreTheLibrarys) {
    for (const char *layout : {"rgb", "bw", "indexed", "gray4"}) {
        const std::string tile = Imported(std::string(layout) + ".tsr", MakeRgb(1030, 1030), layout);
        const std::string twin = Copy(tile, Made(std::string(layout) + "-twin.tsr"));
        const RunResult r = Cli({"levels", tile, "--count", "3", "-q"});
        ASSERT_EQ(r.code, 0) << r.err;
        EXPECT_TRUE(r.err.empty());
        EXPECT_NE(r.out.find("3 levels added, now 4 sub-bitmaps: 1030x1030 515x515 257x257 128x128"),
                  std::string::npos) << r.out;
        LibraryLevels(twin, 3);
        EXPECT_TRUE(ReadFile(tile) == ReadFile(twin)) << layout;
        const RunResult info = Cli({"info", tile});
        EXPECT_EQ(info.code, 0) << info.err;
    }
}

TEST_F(ConvertLevels, MethodMustBeTheLayouts) {
    const std::string bw = Imported("bw.tsr", MakeGray(64, 64, 1), "bw");
    RunResult r = Cli({"levels", bw, "--method", "average"});
    EXPECT_EQ(r.code, 1);
    EXPECT_NE(r.err.find("point sampling"), std::string::npos) << r.err;
    r = Cli({"levels", bw, "--method", "sample", "--count", "2"});
    EXPECT_EQ(r.code, 0) << r.err;
    r = Cli({"levels", bw, "--count", "8"});
    EXPECT_EQ(r.code, 1);
    EXPECT_NE(r.err.find("room for"), std::string::npos) << r.err;
}

double stopAt = 2.0;
void StopPast(double value) {
    if (value > stopAt) tessarine::cli::RequestStop();
}

TEST_F(ConvertLevels, InterruptedLevelsLeaveAValidFile) {
    const std::string tile = Imported("i.tsr", MakeRgb(1200, 1200), "rgb");
    const std::string oneLevel = Copy(tile, Made("one.tsr"));
    ASSERT_EQ(Cli({"levels", oneLevel, "--count", "1"}).code, 0);
    // Three levels weigh 16 : 4 : 1; past 0.8 the second one is under way.
    stopAt = 0.8;
    tessarine::cli::SetProgressObserver(StopPast);
    const RunResult r = Cli({"levels", tile, "--count", "3"});
    tessarine::cli::SetProgressObserver(nullptr);
    tessarine::cli::ClearStop();
    EXPECT_EQ(r.code, 1);
    EXPECT_NE(r.err.find("stopped after 1 levels; the file is left valid"), std::string::npos) << r.err;
    EXPECT_TRUE(ReadFile(tile) == ReadFile(oneLevel));
    const RunResult info = Cli({"info", tile, "--json"});
    ASSERT_EQ(info.code, 0) << info.err;
    EXPECT_EQ(Cli({"export", tile, Made("level1.png"), "--sub", "1"}).code, 0);
    EXPECT_EQ(Cli({"levels", tile, "--count", "2"}).code, 0);
}

}  // namespace
}  // namespace clitest
