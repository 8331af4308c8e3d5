// info of files the library made, as text and as JSON (parsed back).
#include <nlohmann/json.hpp>

#include <tessarine/tessarine.h>

#include "cli_test_support.h"

namespace clitest {
namespace {

class Info : public CliSandbox {
  protected:
    // An indexed 8-bit file of 9000 by 1100 (four tiles) with a second,
    // smaller sub-bitmap, made by the library alone.
    std::string MakeFile() {
        uint8_t colors[5 * 3];
        for (int i = 0; i < 15; ++i) colors[i] = uint8_t(i * 17);
        BI_Bitmap *b = nullptr;
        EXPECT_EQ(BI_CreateBlankBmp(3, 8, 9000, 1100, 300.0, 150.0, 1, 5, colors, &b, 2, 7, 8, 9), 10);
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        EXPECT_EQ(HVT_TileFileBegin(b, &info, 0), 10);
        uint8_t sub = 0;
        EXPECT_EQ(HVT_AddSubbmp(b->tileFile, info.header, 100, 50, nullptr, &sub), 10);
        HVT_TileFileEnd(&info, 0);
        const std::string path = Made("made.tsr");
        WriteFile(path, ReadFile(b->tilePath));
        BI_DeleteBitmap(&b);
        return path;
    }
};

TEST_F(Info, JsonParsesBack) {
    const std::string path = MakeFile();
    const RunResult r = Cli({"info", "--json", path});
    ASSERT_EQ(r.code, 0) << r.err;
    const auto j = nlohmann::json::parse(r.out);
    EXPECT_EQ(j["file"], path);
    EXPECT_EQ(j["layout"], "indexed");
    EXPECT_EQ(j["imageType"], 3);
    EXPECT_EQ(j["bitsPerPixel"], 8);
    EXPECT_EQ(j["colorModel"], 1);
    EXPECT_EQ(j["xResolution"], 300.0);
    EXPECT_EQ(j["yResolution"], 150.0);
    EXPECT_EQ(j["userBytes"], nlohmann::json::array({7, 8, 9}));
    ASSERT_EQ(j["colorTable"].size(), 5u);
    EXPECT_EQ(j["colorTable"][1], nlohmann::json::array({51, 68, 85}));
    ASSERT_EQ(j["subBitmaps"].size(), 2u);
    const auto &s0 = j["subBitmaps"][0];
    EXPECT_EQ(s0["offset"], 80 + 15);
    EXPECT_EQ(s0["width"], 9000);
    EXPECT_EQ(s0["height"], 1100);
    EXPECT_EQ(s0["tilesAcross"], 2);
    EXPECT_EQ(s0["tilesDown"], 2);
    ASSERT_EQ(s0["tiles"].size(), 4u);
    // The tiles follow the table, one after another, rows packed to the byte.
    EXPECT_EQ(s0["tiles"][0]["offset"], 95 + 16 + 4 * 20);
    EXPECT_EQ(s0["tiles"][0]["bytes"], 8192 * 1024);
    EXPECT_EQ(s0["tiles"][1]["left"], 8192);
    EXPECT_EQ(s0["tiles"][1]["right"], 9000);
    EXPECT_EQ(s0["tiles"][1]["offset"], 95 + 16 + 80 + 8192 * 1024);
    EXPECT_EQ(s0["tiles"][3]["bytes"], 808 * 76);
    const auto &s1 = j["subBitmaps"][1];
    const int end0 = 95 + 16 + 80 + 9000 * 1100;
    EXPECT_EQ(s1["offset"], end0);
    EXPECT_EQ(s1["width"], 100);
    EXPECT_EQ(s1["tiles"][0]["offset"], end0 + 16 + 20);
    EXPECT_EQ(j["end"], end0 + 36 + 5000);
    EXPECT_EQ(j["bytes"], end0 + 36 + 5000 + 1);
}

TEST_F(Info, Text) {
    const std::string path = MakeFile();
    const RunResult r = Cli({"info", path});
    ASSERT_EQ(r.code, 0) << r.err;
    EXPECT_TRUE(r.err.empty());
    for (const char *line : {"layout:       indexed (indexed, 8-bit, RGB)", "resolution:   300 x 150",
                             "user bytes:   7 8 9", "colour table: 5 entries", "    1: 51 68 85",
                             "sub-bitmaps:  2", "sub-bitmap 0: 9000 x 1100, 2 x 2 tiles, header at 95",
                             "tile 1: (8192, 0) to (9000, 1024), 827392 bytes at 8388799",
                             "sub-bitmap 1: 100 x 50, 1 x 1 tiles"})
        EXPECT_NE(r.out.find(line), std::string::npos) << line << "\n" << r.out;
}

}  // namespace
}  // namespace clitest
