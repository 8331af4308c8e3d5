// Colour tables, implied tables, nearest searches, map tables, the colour
// index and the gray rule.
#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include <tessarine/tessarine.h>

#include "bitmap/color_tables.h"
#include "test_support.h"

namespace {

class ColorTable : public tstest::Sandbox {
  protected:
    BI_Bitmap *Make(uint8_t type, uint8_t bpp, uint8_t model = 1, std::vector<uint8_t> table = {}) {
        BI_Bitmap *b = nullptr;
        const int entry = model == 2 ? 4 : 3;
        const int32_t count = static_cast<int32_t>(table.size()) / entry;
        EXPECT_EQ(BI_CreateBlankBmp(type, bpp, 4, 2, 300, 300, model, count,
                                    table.empty() ? nullptr : table.data(), &b, 1, 0, 0, 0),
                  TS_OK);
        made_.push_back(b);
        return b;
    }
    void TearDown() override {
        for (BI_Bitmap *b : made_)
            if (b != nullptr) BI_DeleteBitmap(&b);
        tstest::Sandbox::TearDown();
    }
    std::vector<BI_Bitmap *> made_;
};

TEST_F(ColorTable, GrayRule) {
    EXPECT_EQ(RGB2GrayScale(255, 255, 255), 0);
    EXPECT_EQ(RGB2GrayScale(0, 0, 0), 255);
    EXPECT_EQ(RGB2GrayScale(255, 0, 0), 179);  // 30 * 255 / 100 truncates to 76
    EXPECT_EQ(RGB2GrayScale(7, 7, 7), 248);    // equal channels: 255 - b
    EXPECT_EQ(RGB2GrayScale(0, 255, 0), 255 - 150);
    EXPECT_EQ(RGB2GrayScale(10, 20, 30), 255 - (300 + 1180 + 330) / 100);
}

TEST_F(ColorTable, NearestIndexSearch) {
    EXPECT_EQ(BI_RGBMapToColorIndex(1, 2, 3, 0, nullptr), 0);
    const uint8_t twins[] = {9, 9, 9, 50, 50, 50, 50, 50, 50};
    EXPECT_EQ(BI_RGBMapToColorIndex(50, 50, 50, 3, twins), 1);  // equal entries: the lower
    EXPECT_EQ(BI_RGBMapToColorIndex(0, 0, 0, 3, twins), 0);
    // no early stop on a zero distance, and a tie keeps the first
    const uint8_t ends[] = {0, 0, 0, 255, 255, 255};
    EXPECT_EQ(BI_RGBMapToColorIndex(127, 127, 127, 2, ends), 0);
    EXPECT_EQ(BI_RGBMapToColorIndex(128, 128, 128, 2, ends), 1);
    const uint8_t cmyk[] = {0, 0, 0, 0, 0, 0, 0, 255, 10, 10, 10, 10};
    EXPECT_EQ(tessarine::bitmap::CmykNearest(0, 0, 0, 200, 3, cmyk), 1);
    EXPECT_EQ(tessarine::bitmap::CmykNearest(9, 9, 9, 9, 3, cmyk), 2);
    EXPECT_EQ(tessarine::bitmap::CmykNearest(9, 9, 9, 9, 0, cmyk), 0);
}

TEST_F(ColorTable, ImpliedTablesOfGrayAndBlackAndWhite) {
    uint8_t t[256 * 4];
    int32_t count = -7;
    BI_Bitmap *g8 = Make(2, 8);
    ASSERT_EQ(BI_GetRGBColorTable(g8, &count, t), TS_OK);
    EXPECT_EQ(count, -7);  // not written on this path
    EXPECT_EQ(t[0], 255);
    EXPECT_EQ(t[1], 255);
    EXPECT_EQ(t[3 * 255], 0);
    EXPECT_EQ(t[3 * 100 + 2], 155);
    BI_Bitmap *g4 = Make(2, 4);
    ASSERT_EQ(BI_GetRGBColorTable(g4, &count, t), TS_OK);
    for (int i = 0; i < 16; ++i) { EXPECT_EQ(t[3 * i], (15 - i) * 17); }
    BI_Bitmap *bw = Make(1, 1);
    ASSERT_EQ(BI_GetRGBColorTable(bw, &count, t), TS_OK);
    EXPECT_EQ(std::vector<uint8_t>(t, t + 6), (std::vector<uint8_t>{255, 255, 255, 0, 0, 0}));
    ASSERT_EQ(BI_GetCMYKColorTable(bw, &count, t), TS_OK);
    EXPECT_EQ(std::vector<uint8_t>(t, t + 8), (std::vector<uint8_t>{0, 0, 0, 0, 0, 0, 0, 255}));
    ASSERT_EQ(BI_GetCMYKColorTable(g4, &count, t), TS_OK);
    for (int i = 0; i < 16; ++i) { EXPECT_EQ(t[4 * i + 3], i * 17); }
    ASSERT_EQ(BI_GetCMYKColorTable(g8, &count, t), TS_OK);
    EXPECT_EQ(t[4 * 77 + 3], 77);
    EXPECT_EQ(t[4 * 77], 0);
    EXPECT_EQ(count, -7);
    // a depth with no implied table
    g8->bitsPerPixel = 2;
    EXPECT_EQ(BI_GetRGBColorTable(g8, &count, t), -2);
    EXPECT_EQ(BI_GetCMYKColorTable(g8, &count, t), -2);
}

TEST_F(ColorTable, StoredTables) {
    BI_Bitmap *rgb = Make(3, 8, 1, {1, 2, 3, 4, 5, 6});
    uint8_t t[64];
    int32_t count = 0;
    ASSERT_EQ(BI_GetRGBColorTable(rgb, &count, t), TS_OK);
    EXPECT_EQ(count, 2);
    EXPECT_EQ(std::vector<uint8_t>(t, t + 6), (std::vector<uint8_t>{1, 2, 3, 4, 5, 6}));
    count = 0;
    EXPECT_EQ(BI_GetCMYKColorTable(rgb, &count, t), -1);  // no conversion between models
    EXPECT_EQ(count, 0);
    BI_Bitmap *cmyk = Make(3, 4, 2, {1, 2, 3, 4, 5, 6, 7, 8});
    ASSERT_EQ(BI_GetCMYKColorTable(cmyk, &count, t), TS_OK);
    EXPECT_EQ(count, 2);
    EXPECT_EQ(t[7], 8);
    EXPECT_EQ(BI_GetRGBColorTable(cmyk, &count, t), -1);
    BI_Bitmap *tc = Make(4, 24);
    EXPECT_EQ(BI_GetRGBColorTable(tc, &count, t), -2);
    EXPECT_EQ(BI_GetCMYKColorTable(tc, &count, t), -2);
    tc->imageType = 0;
    EXPECT_EQ(BI_GetRGBColorTable(tc, &count, t), -2);
    // an indexed record that lost its table
    rgb->colorCount = 0;
    EXPECT_EQ(BI_GetRGBColorTable(rgb, &count, t), -1);
    rgb->colorCount = 2;
}

TEST_F(ColorTable, SetTableReplacesOnly) {
    BI_Bitmap *g = Make(2, 8);
    const uint8_t three[] = {10, 20, 30, 40, 50, 60, 70, 80, 90};
    EXPECT_EQ(BI_SetRGBColorTable(g, 3, three), -2);
    BI_Bitmap *cmyk = Make(3, 8, 2, {1, 2, 3, 4});
    EXPECT_EQ(BI_SetRGBColorTable(cmyk, 3, three), -1);
    BI_Bitmap *rgb = Make(3, 8, 1, {1, 2, 3});
    ASSERT_EQ(MakeColorTableIndex(rgb), TS_OK);
    void *index = rgb->colorIndex;
    ASSERT_EQ(BI_SetRGBColorTable(rgb, 3, three), TS_OK);
    EXPECT_EQ(rgb->colorCount, 3);
    EXPECT_EQ(rgb->colorIndex, index);  // left for the caller to rebuild
    EXPECT_EQ(MEM_HdlSize(rgb->colorTable), 9u);
    uint8_t t[16];
    int32_t count = 0;
    ASSERT_EQ(BI_GetRGBColorTable(rgb, &count, t), TS_OK);
    EXPECT_EQ(std::vector<uint8_t>(t, t + 9), std::vector<uint8_t>(three, three + 9));
    // same count: copied over in place
    const uint8_t other[] = {9, 8, 7, 6, 5, 4, 3, 2, 1};
    ASSERT_EQ(BI_SetRGBColorTable(rgb, 3, other), TS_OK);
    ASSERT_EQ(BI_GetRGBColorTable(rgb, &count, t), TS_OK);
    EXPECT_EQ(t[0], 9);
    // no table yet: it cannot give a bitmap its first
    BI_Bitmap *empty = nullptr;
    ASSERT_EQ(BI_NewBitmap(&empty), TS_OK);
    made_.push_back(empty);
    empty->imageType = 3;
    empty->colorModel = 1;
    EXPECT_EQ(BI_SetRGBColorTable(empty, 3, three), -1);
    EXPECT_EQ(BI_SetRGBColorTable(rgb, 0, three), -1);
}

TEST_F(ColorTable, SetTableAllocationFailureKeepsTheOldTable) {
    BI_Bitmap *rgb = Make(3, 8, 1, {1, 2, 3});
    const uint8_t three[] = {10, 20, 30, 40, 50, 60, 70, 80, 90};
    tstest::ForEachAllocationFailure([&](int64_t) {
        const int32_t s = BI_SetRGBColorTable(rgb, rgb->colorCount == 1 ? 3 : 1, three);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(s, -5);
            EXPECT_NE(rgb->colorTable, nullptr);
        } else {
            EXPECT_EQ(s, TS_OK);
        }
    });
}

TEST_F(ColorTable, ColorIndexIsSortedByKey) {
    BI_Bitmap *rgb = Make(3, 8, 1, {0, 0, 9, 5, 0, 0, 0, 7, 0, 1, 1, 1});
    ASSERT_EQ(MakeColorTableIndex(rgb), TS_OK);
    ASSERT_NE(rgb->colorIndex, nullptr);
    const auto *e = static_cast<const tessarine::bitmap::ColorIndexEntry *>(rgb->colorIndex);
    const uint32_t keys[] = {5, 0x010101, 0x0700, 0x090000};
    const uint8_t places[] = {1, 3, 2, 0};
    std::vector<uint32_t> got;
    for (int i = 0; i < 4; ++i) got.push_back(e[i].key);
    EXPECT_EQ(got, (std::vector<uint32_t>{5, 0x0700, 0x010101, 0x090000}));
    (void)keys;
    (void)places;
    EXPECT_EQ(e[0].index, 1);
    EXPECT_EQ(e[1].index, 2);
    EXPECT_EQ(e[2].index, 3);
    EXPECT_EQ(e[3].index, 0);
    // a second build replaces the first
    ASSERT_EQ(MakeColorTableIndex(rgb), TS_OK);
    BI_Bitmap *g = Make(2, 8);
    EXPECT_EQ(MakeColorTableIndex(g), -2);
    BI_Bitmap *wide = Make(3, 8, 1, {1, 2, 3});
    wide->bitsPerPixel = 24;
    EXPECT_EQ(MakeColorTableIndex(wide), -2);
    wide->bitsPerPixel = 8;
}

TEST_F(ColorTable, ColorIndexAllocationFailure) {
    BI_Bitmap *rgb = Make(3, 8, 1, {1, 2, 3, 4, 5, 6});
    ASSERT_EQ(MakeColorTableIndex(rgb), TS_OK);
    // The old index goes before the new one is asked for: a failure leaves none.
    tessarine::testing::FailAllocationAt(1);
    EXPECT_EQ(MakeColorTableIndex(rgb), -5);
    EXPECT_TRUE(tessarine::testing::AllocationFailureHit());
    tessarine::testing::ResetInjection();
    EXPECT_EQ(rgb->colorIndex, nullptr);
    ASSERT_EQ(MakeColorTableIndex(rgb), TS_OK);
    EXPECT_NE(rgb->colorIndex, nullptr);
}

TEST_F(ColorTable, MapTablesBetweenLevels) {
    uint8_t map[256];
    BI_Bitmap *b1 = Make(1, 1), *g1 = Make(2, 1), *g4 = Make(2, 4), *g8 = Make(2, 8);
    ASSERT_EQ(BI_GetMapTable(b1, g1, map), TS_OK);
    EXPECT_EQ(map[0], 0);
    EXPECT_EQ(map[1], 1);
    ASSERT_EQ(BI_GetMapTable(g8, g4, map), TS_OK);
    EXPECT_EQ(map[255], 15);
    EXPECT_EQ(map[15], 0);
    EXPECT_EQ(map[16], 1);
    ASSERT_EQ(BI_GetMapTable(g1, g8, map), TS_OK);
    EXPECT_EQ(map[1], 255);
    ASSERT_EQ(BI_GetMapTable(g4, g8, map), TS_OK);
    EXPECT_EQ(map[3], 51);
    ASSERT_EQ(BI_GetMapTable(g8, b1, map), TS_OK);
    EXPECT_EQ(map[127], 0);
    EXPECT_EQ(map[128], 1);
    ASSERT_EQ(BI_GetMapTable(g8, g8, map), TS_OK);
    for (int i = 0; i < 256; ++i) { ASSERT_EQ(map[i], i); }
}

TEST_F(ColorTable, MapTablesToAndFromIndexes) {
    uint8_t map[256];
    BI_Bitmap *g8 = Make(2, 8);
    BI_Bitmap *wb = Make(3, 8, 1, {255, 255, 255, 0, 0, 0});
    ASSERT_EQ(BI_GetMapTable(g8, wb, map), TS_OK);
    EXPECT_EQ(map[0], 0);
    EXPECT_EQ(map[255], 1);
    EXPECT_EQ(map[127], 0);  // colour 128: nearer to white
    // level to index under CMYK: all the value goes to K
    BI_Bitmap *kk = Make(3, 8, 2, {0, 0, 0, 0, 0, 0, 0, 255, 0, 0, 0, 100});
    BI_Bitmap *g4 = Make(2, 4);
    ASSERT_EQ(BI_GetMapTable(g4, kk, map), TS_OK);
    EXPECT_EQ(map[0], 0);
    EXPECT_EQ(map[6], 2);  // 102 is nearest 100
    EXPECT_EQ(map[15], 1);
    // index to level: CMYK goes through the implied table of the destination
    ASSERT_EQ(BI_GetMapTable(kk, g4, map), TS_OK);
    EXPECT_EQ(map[0], 0);
    EXPECT_EQ(map[1], 15);
    EXPECT_EQ(map[2], 6);
    // RGB: success, and the map stays as it was
    std::memset(map, 0xEE, sizeof map);
    ASSERT_EQ(BI_GetMapTable(wb, g8, map), TS_OK);
    EXPECT_EQ(map[0], 0xEE);
    EXPECT_EQ(map[1], 0xEE);
    // index to index by the destination's model
    BI_Bitmap *bw = Make(3, 4, 1, {0, 0, 0, 250, 250, 250});
    ASSERT_EQ(BI_GetMapTable(wb, bw, map), TS_OK);
    EXPECT_EQ(map[0], 1);
    EXPECT_EQ(map[1], 0);
    // an RGB source read as 4-byte entries: the bytes past its table are 0
    BI_Bitmap *k2 = Make(3, 4, 2, {255, 255, 255, 0, 0, 0, 0, 0});
    BI_Bitmap *src = Make(3, 4, 1, {255, 255, 255, 0, 0, 0});
    ASSERT_EQ(BI_GetMapTable(src, k2, map), TS_OK);
    EXPECT_EQ(map[0], 0);  // (255, 255, 255, 0)
    EXPECT_EQ(map[1], 1);  // (0, 0, 0, 0)
    // a destination model other than 1 and 2 writes nothing
    std::memset(map, 0xEE, sizeof map);
    k2->colorModel = 5;
    ASSERT_EQ(BI_GetMapTable(src, k2, map), TS_OK);
    EXPECT_EQ(map[0], 0xEE);
    k2->colorModel = 2;
}

TEST_F(ColorTable, MapTableFailures) {
    uint8_t map[256];
    BI_Bitmap *g8 = Make(2, 8), *tc = Make(4, 24), *idx = Make(3, 8, 1, {1, 2, 3});
    EXPECT_EQ(BI_GetMapTable(tc, g8, map), -2);
    EXPECT_EQ(BI_GetMapTable(g8, tc, map), -2);
    EXPECT_EQ(BI_GetMapTable(tc, idx, map), -2);
    idx->colorModel = 7;
    EXPECT_EQ(BI_GetMapTable(g8, idx, map), -2);  // level to index, model
    EXPECT_EQ(BI_GetMapTable(idx, g8, map), -2);  // index to level, model
    idx->colorModel = 1;
    g8->bitsPerPixel = 2;
    EXPECT_EQ(BI_GetMapTable(g8, idx, map), -2);  // no implied table at 2 bits
    EXPECT_EQ(BI_GetMapTable(idx, g8, map), -2);
    g8->bitsPerPixel = 24;
    EXPECT_EQ(BI_GetMapTable(g8, g8, map), -2);  // more values than a map holds
    g8->bitsPerPixel = 8;
    g8->imageType = 0;
    EXPECT_EQ(BI_GetMapTable(g8, idx, map), -2);
    g8->imageType = 2;
}

}  // namespace
