// The row converters on rows in memory, and the stated cases of the row
// functions on bitmaps.
#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <vector>

#include <tessarine/tessarine.h>

#include "bitmap/rgb_rows.h"
#include "bitmap/rgb_split.h"
#include "row_model.h"
#include "test_support.h"
#include "vector_paths.h"

namespace {

using Bytes = std::vector<uint8_t>;

class RowConvert : public tstest::Sandbox {
  protected:
    BI_Bitmap *Make(uint8_t type, uint8_t bpp, int32_t width, uint8_t storage = 1, uint8_t model = 1,
                    Bytes table = {}) {
        BI_Bitmap *b = nullptr;
        const int entry = model == 2 ? 4 : 3;
        EXPECT_EQ(BI_CreateBlankBmp(type, bpp, width, 3, 300, 300, model,
                                    static_cast<int32_t>(table.size()) / entry,
                                    table.empty() ? nullptr : table.data(), &b, storage, 0, 0, 0),
                  TS_OK);
        if (b != nullptr && b->pixelHandle != nullptr) {
            void *p = MEM_Lock(b->pixelHandle);
            std::memset(p, 0, MEM_HdlSize(b->pixelHandle));
            MEM_Unlock(b->pixelHandle);
        }
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

TEST_F(RowConvert, Gray4UnpacksNibble15To0x0F) {
    const uint8_t row[] = {0x0F, 0x8F};
    uint8_t r[4], g[4], b[4];
    ASSERT_EQ(BI_UnpackRGBRow(2, 4, nullptr, row, 0, 4, r, g, b), TS_OK);
    EXPECT_EQ(Bytes(r, r + 4), (Bytes{255, 0x0F, 0x7F, 0x0F}));
    EXPECT_EQ(Bytes(b, b + 4), (Bytes{255, 0x0F, 0x7F, 0x0F}));
    uint8_t tri[6];
    ASSERT_EQ(BI_UnpackRGBRowInterlace(2, 4, nullptr, row, 1, 2, tri), TS_OK);
    EXPECT_EQ(Bytes(tri, tri + 6), (Bytes{15, 15, 15, 0x7F, 0x7F, 0x7F}));
}

TEST_F(RowConvert, BlackAndWhiteAndGrayToRgb) {
    const uint8_t row[] = {0xA0};
    uint8_t r[4], g[4], b[4];
    ASSERT_EQ(BI_UnpackRGBRow(1, 8, nullptr, row, 0, 4, r, g, b), TS_OK);  // type 1 at any depth
    EXPECT_EQ(Bytes(g, g + 4), (Bytes{0, 255, 0, 255}));
    ASSERT_EQ(BI_UnpackRGBRow(2, 1, nullptr, row, 2, 2, r, g, b), TS_OK);
    EXPECT_EQ(Bytes(r, r + 2), (Bytes{0, 255}));
    const uint8_t gray[] = {0, 200};
    ASSERT_EQ(BI_UnpackRGBRow(2, 8, nullptr, gray, 0, 2, r, g, b), TS_OK);
    EXPECT_EQ(Bytes(r, r + 2), (Bytes{255, 55}));
}

TEST_F(RowConvert, IndexedRowsThroughTheTable) {
    MEM_Handle t = MEM_AllocHdl(0, 6);
    auto *e = static_cast<uint8_t *>(MEM_Lock(t));
    const uint8_t entries[] = {1, 2, 3, 4, 5, 6};
    std::memcpy(e, entries, 6);
    MEM_Unlock(t);
    const uint8_t row[] = {0x10};  // 4 bits: 1, 0
    uint8_t r[2], g[2], b[2], tri[6];
    ASSERT_EQ(BI_UnpackRGBRow(3, 4, t, row, 0, 2, r, g, b), TS_OK);
    EXPECT_EQ(Bytes(r, r + 2), (Bytes{4, 1}));
    EXPECT_EQ(Bytes(b, b + 2), (Bytes{6, 3}));
    // odd x starts in the low nibble
    ASSERT_EQ(BI_UnpackRGBRow(3, 4, t, row, 1, 1, r, g, b), TS_OK);
    EXPECT_EQ(r[0], 1);
    ASSERT_EQ(BI_UnpackBGRRowInterlace(3, 4, t, row, 0, 2, tri), TS_OK);
    EXPECT_EQ(Bytes(tri, tri + 6), (Bytes{6, 5, 4, 3, 2, 1}));
    ASSERT_EQ(BI_UnpackRGBRowInterlace(3, 4, t, row, 0, 2, tri), TS_OK);
    EXPECT_EQ(Bytes(tri, tri + 6), (Bytes{4, 5, 6, 1, 2, 3}));
    // a value past the table reads as 0
    const uint8_t far[] = {0x70};
    ASSERT_EQ(BI_UnpackRGBRow(3, 4, t, far, 0, 1, r, g, b), TS_OK);
    EXPECT_EQ(r[0], 0);
    // the table is unlocked after the row
    EXPECT_EQ(MEM_Unlock(t), 0);
    // a bad depth keeps the table locked
    EXPECT_EQ(BI_UnpackRGBRow(3, 2, t, row, 0, 1, r, g, b), -2);
    EXPECT_EQ(BI_UnpackGRow(3, 1, 2, t, row, 0, 1, r), -2);
    uint8_t k[2];
    EXPECT_EQ(BI_UnpackCMYKRow(3, 24, t, row, 0, 1, r, g, b, k), -2);
    EXPECT_NE(MEM_Unlock(t), 0);
    EXPECT_NE(MEM_Unlock(t), 0);
    EXPECT_EQ(MEM_Unlock(t), 0);
    MEM_FreeHdl(t);
}

TEST_F(RowConvert, TrueColourAndLayoutsOutsideTheTables) {
    const uint8_t px[] = {1, 2, 3, 4, 5, 6};
    uint8_t r[2], g[2], b[2], tri[6], k[2];
    ASSERT_EQ(BI_UnpackRGBRow(4, 24, nullptr, px, 7, 2, r, g, b), TS_OK);
    EXPECT_EQ(Bytes(g, g + 2), (Bytes{2, 5}));
    ASSERT_EQ(BI_UnpackBGRRowInterlace(4, 24, nullptr, px, 0, 2, tri), TS_OK);
    EXPECT_EQ(Bytes(tri, tri + 6), Bytes(px, px + 6));  // not swapped
    EXPECT_EQ(BI_UnpackRGBRow(0, 8, nullptr, px, 0, 1, r, g, b), -2);
    EXPECT_EQ(BI_UnpackRGBRow(5, 8, nullptr, px, 0, 1, r, g, b), -2);
    EXPECT_EQ(BI_UnpackRGBRowInterlace(2, 2, nullptr, px, 0, 1, tri), -2);
    EXPECT_EQ(BI_UnpackCMYKRow(2, 8, nullptr, px, 0, 1, r, g, b, k), -2);
    EXPECT_EQ(BI_UnpackCMYKRow(1, 1, nullptr, px, 0, 1, r, g, b, k), -2);
    ASSERT_EQ(BI_UnpackCMYKRow(4, 32, nullptr, px, 0, 1, r, g, b, k), TS_OK);
    EXPECT_EQ(k[0], 4);
    // a count below 1 does nothing
    r[0] = 77;
    EXPECT_EQ(BI_UnpackRGBRow(0, 8, nullptr, px, 0, 0, r, g, b), TS_OK);
    EXPECT_EQ(BI_UnpackRGBRow(4, 24, nullptr, px, 0, -3, r, g, b), TS_OK);
    EXPECT_EQ(r[0], 77);
}

TEST_F(RowConvert, GrayOfEveryLayout) {
    uint8_t out[4];
    const uint8_t cyan[] = {255, 0, 0, 0, 10, 200, 30, 255};
    ASSERT_EQ(BI_UnpackGRow(4, 2, 32, nullptr, cyan, 0, 2, out), TS_OK);
    EXPECT_EQ(out[0], 153);
    EXPECT_EQ(out[1], 255);  // full black whatever the other inks
    const uint8_t red[] = {255, 0, 0};
    ASSERT_EQ(BI_UnpackGRow(4, 1, 24, nullptr, red, 0, 1, out), TS_OK);
    EXPECT_EQ(out[0], 179);
    EXPECT_EQ(BI_UnpackGRow(4, 3, 24, nullptr, red, 0, 1, out), -2);
    const uint8_t bits[] = {0x40};
    ASSERT_EQ(BI_UnpackGRow(1, 0, 8, nullptr, bits, 0, 2, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 2), (Bytes{0, 255}));
    const uint8_t nib[] = {0x3F};
    ASSERT_EQ(BI_UnpackGRow(2, 1, 4, nullptr, nib, 0, 2, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 2), (Bytes{51, 255}));
    EXPECT_EQ(BI_UnpackGRow(2, 1, 2, nullptr, nib, 0, 1, out), -2);
    EXPECT_EQ(BI_UnpackGRow(0, 1, 8, nullptr, nib, 0, 1, out), -2);
    EXPECT_EQ(BI_UnpackGRow(6, 1, 8, nullptr, nib, 0, 1, out), -2);
    // an indexed CMYK table is still read by 3-byte entries
    MEM_Handle t = MEM_AllocHdl(0, 8);
    const uint8_t entries[] = {0, 0, 0, 255, 7, 7, 7, 0};
    std::memcpy(MEM_Lock(t), entries, 8);
    MEM_Unlock(t);
    const uint8_t one[] = {1};
    ASSERT_EQ(BI_UnpackGRow(3, 2, 8, t, one, 0, 1, out), TS_OK);
    EXPECT_EQ(out[0], RGB2GrayScale(255, 7, 7));
    MEM_FreeHdl(t);
}

TEST_F(RowConvert, PackingIndexesAndDensities) {
    uint8_t row[3] = {0xFF, 0xFF, 0xFF};
    const uint8_t v[] = {0, 5, 0, 0, 1, 0, 0, 0, 3};
    ASSERT_EQ(BI_PackIndexRow(1, v, 2, 9, row), TS_OK);  // non-zero counts as 1
    EXPECT_EQ(Bytes(row, row + 3), (Bytes{0xC0 | 0x10 | 0x02, 0x3F, 0xFF}));
    uint8_t n4[2] = {0xAB, 0xCD};
    const uint8_t w[] = {0x17, 0x02};
    ASSERT_EQ(BI_PackIndexRow(4, w, 1, 2, n4), TS_OK);  // low four bits; neighbours stay
    EXPECT_EQ(Bytes(n4, n4 + 2), (Bytes{0xA7, 0x2D}));
    EXPECT_EQ(BI_PackIndexRow(2, w, 0, 1, n4), -2);
    EXPECT_EQ(BI_PackIndexRow(24, w, 0, 1, n4), -2);
    uint8_t out[4];
    EXPECT_EQ(BI_UnpackIndexRow(32, n4, 0, 1, out), -2);
    ASSERT_EQ(BI_UnpackIndexRow(4, n4, 1, 2, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 2), (Bytes{7, 2}));
    // densities: above 127 is black; nibbles are the density / 17
    uint8_t g1 = 0;
    const uint8_t d[] = {127, 128, 255, 0};
    ASSERT_EQ(BI_PackGRow(1, d, 0, 4, &g1), TS_OK);
    EXPECT_EQ(g1, 0x60);
    uint8_t g4[2] = {0, 0};
    const uint8_t e[] = {255, 16, 34, 50};
    ASSERT_EQ(BI_PackGRow(4, e, 0, 4, g4), TS_OK);
    EXPECT_EQ(Bytes(g4, g4 + 2), (Bytes{0xF0, 0x22}));
    EXPECT_EQ(BI_PackGRow(3, e, 0, 4, g4), -2);
    // only the low bits of x matter: 201 is odd
    uint8_t g5 = 0xF0;
    ASSERT_EQ(BI_PackGRow(4, e, static_cast<int8_t>(201 & 0xFF), 1, &g5), TS_OK);
    EXPECT_EQ(g5, 0xFF);
}

TEST_F(RowConvert, BlackAndWhiteFlagsWithTheSingleByteOverlap) {
    const uint8_t row[] = {0b10110010, 0b01000001, 0xFF};
    uint8_t out[24];
    std::memset(out, 9, sizeof out);
    ASSERT_EQ(BI_UnpackBWRow(row, 3, 10, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 10), (Bytes{1, 0, 0, 1, 0, 0, 1, 0, 0, 0}));
    EXPECT_EQ(out[10], 9);
    // a run inside one byte: 8 - s flags, then e + 1 flags of the same byte
    std::memset(out, 9, sizeof out);
    ASSERT_EQ(BI_UnpackBWRow(row, 2, 3, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 11), (Bytes{1, 1, 0, 0, 1, 0, 1, 0, 1, 1, 0}));
    EXPECT_EQ(out[11], 9);

    uint8_t dst[3] = {0xFF, 0x00, 0xFF};
    const uint8_t f[] = {0, 1, 0, 0, 0, 0, 0, 0, 1, 1};
    ASSERT_EQ(BI_PackBWRow(f, 3, 10, dst), TS_OK);
    EXPECT_EQ(Bytes(dst, dst + 3), (Bytes{0b11101000, 0b00011000, 0xFF}));
    // one byte: the head writes from s to the end of the byte, the tail
    // rewrites the top e + 1 bits from the flags after those
    uint8_t one = 0b10101010;
    const uint8_t g[] = {1, 1, 1, 1, 1, 0, 1, 0, 1, 0, 1, 0};
    ASSERT_EQ(BI_PackBWRow(g, 2, 3, &one), TS_OK);
    EXPECT_EQ(one, 0b10101110);
    // any non-zero flag is black
    uint8_t z = 0;
    const uint8_t h[] = {7, 0, 200, 0, 0, 0, 0, 1, 7, 0, 200, 0, 0, 0, 0, 1};  // x 0, 8 pixels: one byte, so head and tail
    ASSERT_EQ(BI_PackBWRow(h, 0, 8, &z), TS_OK);
    EXPECT_EQ(z, 0b10100001);
}

TEST_F(RowConvert, BlackAndWhiteFromRgbAtDensity128) {
    BI_Bitmap *bw = Make(1, 1, 16);
    const uint8_t c127[] = {127, 127}, c128[] = {128, 128};
    ASSERT_EQ(BI_SetRGBRow(0, 0, 2, c127, c127, c127, bw), TS_OK);  // density 128: set
    ASSERT_EQ(BI_SetRGBRow(0, 2, 2, c128, c128, c128, bw), TS_OK);  // density 127: clear
    uint8_t packed[2];
    ASSERT_EQ(BI_GetBWPackedRow(bw, 0, 0, 16, packed), TS_OK);
    EXPECT_EQ(packed[0], 0xC0);
}

TEST_F(RowConvert, SetRgbRowWithCountZeroGives10) {
    BI_Bitmap *m = Make(4, 24, 4);
    const uint8_t p[] = {1};
    EXPECT_EQ(BI_SetRGBRow(0, 0, 0, p, p, p, m), TS_OK);
    EXPECT_EQ(MEM_Unlock(m->pixelHandle), 0);  // locked and unlocked again
    BI_Bitmap *t = Make(4, 24, 4, 2);
    EXPECT_EQ(BI_SetRGBRow(0, 0, 0, p, p, p, t), TS_OK);
}

TEST_F(RowConvert, GetRgbRowAtX3OfATileFile) {
    BI_Bitmap *t = Make(1, 1, 16, 2);
    const uint8_t bits[] = {0b00001000, 0b11111111};
    ASSERT_EQ(BI_SetBWPackedRow(1, 0, 16, bits, t), TS_OK);
    uint8_t r[4], g[4], b[4];
    ASSERT_EQ(BI_GetRGBRow(t, 1, 3, 4, r, g, b), TS_OK);
    EXPECT_EQ(Bytes(r, r + 4), (Bytes{255, 0, 255, 255}));  // pixel 4 holds the set bit
}

TEST_F(RowConvert, SetIndexRowClearsValuesWithoutAnEntry) {
    BI_Bitmap *idx = Make(3, 8, 4, 1, 1, {1, 1, 1, 2, 2, 2});
    uint8_t v[] = {0, 1, 2};
    ASSERT_EQ(BI_SetIndexRow(0, 0, 3, v, idx), TS_OK);
    EXPECT_EQ(Bytes(v, v + 3), (Bytes{0, 1, 0}));
    uint8_t out[3];
    ASSERT_EQ(BI_GetIndexRow(idx, 0, 0, 3, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 3), (Bytes{0, 1, 0}));
    // gray and black-and-white have no entries: zeros are written
    for (BI_Bitmap *b : {Make(2, 8, 4), Make(1, 1, 4), Make(2, 4, 4, 2)}) {
        uint8_t w[] = {9, 200, 1, 255};
        ASSERT_EQ(BI_SetIndexRow(1, 0, 4, w, b), TS_OK);
        EXPECT_EQ(Bytes(w, w + 4), (Bytes{0, 0, 0, 0}));
        uint8_t back[4] = {7, 7, 7, 7};
        ASSERT_EQ(BI_GetIndexRow(b, 1, 0, 4, back), TS_OK);
        EXPECT_EQ(Bytes(back, back + 4), (Bytes{0, 0, 0, 0}));
    }
    // the array is changed even when the row cannot be written
    uint8_t w[] = {5, 6};
    EXPECT_EQ(BI_SetIndexRow(99, 0, 2, w, idx), -1);
    EXPECT_EQ(Bytes(w, w + 2), (Bytes{0, 0}));
}

TEST_F(RowConvert, Gray4RoundTrip) {
    for (uint8_t storage : {1, 2}) {
        BI_Bitmap *g = Make(2, 4, 6, storage);
        const uint8_t v[] = {255, 16, 17, 0, 128, 254};
        ASSERT_EQ(BI_SetGRow(2, 0, 6, v, g), TS_OK);
        uint8_t out[6];
        ASSERT_EQ(BI_GetGRow(g, 2, 0, 6, out), TS_OK);
        EXPECT_EQ(Bytes(out, out + 6), (Bytes{255, 0, 17, 0, 119, 238}));
    }
}

TEST_F(RowConvert, PaddedReadsRepeatTheEdges) {
    BI_Bitmap *g = Make(2, 8, 5);
    const uint8_t v[] = {10, 20, 30, 40, 50};
    ASSERT_EQ(BI_SetGRow(0, 0, 5, v, g), TS_OK);
    uint8_t out[8];
    ASSERT_EQ(BI_GetPaddedGRow(g, 0, 0, 5, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 7), (Bytes{10, 10, 20, 30, 40, 50, 50}));
    ASSERT_EQ(BI_GetPaddedGRow(g, 0, 1, 3, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 5), (Bytes{10, 20, 30, 40, 50}));
    ASSERT_EQ(BI_GetPaddedIndexRow(g, 0, 0, 2, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 4), (Bytes{10, 10, 20, 30}));
    ASSERT_EQ(BI_GetPaddedIndexRow(g, 0, 3, 2, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 4), (Bytes{30, 40, 50, 50}));
    // the copies follow only a successful read
    std::memset(out, 0xEE, sizeof out);
    EXPECT_EQ(BI_GetPaddedGRow(g, 7, 0, 5, out), -1);
    EXPECT_EQ(out[0], 0xEE);
}

TEST_F(RowConvert, SetBwPackedRowClearsThePixelsBeforeX) {
    BI_Bitmap *bw = Make(1, 1, 40);
    const uint8_t ones[] = {0xFF, 0xFF, 0xFF, 0xFF, 0xFF};
    ASSERT_EQ(BI_SetBWPackedRow(0, 0, 40, ones, bw), TS_OK);
    const uint8_t run[] = {0xFF, 0xC0, 0x00};  // ten pixels
    ASSERT_EQ(BI_SetBWPackedRow(0, 3, 10, run, bw), TS_OK);
    uint8_t back[5];
    ASSERT_EQ(BI_GetBWPackedRow(bw, 0, 0, 40, back), TS_OK);
    // 000 then ten ones, then the byte after the run masked to its low bits
    EXPECT_EQ(back[0], 0x1F);
    EXPECT_EQ(back[1], 0xF8);
    EXPECT_EQ(back[2], 0x00 & (0xFF >> 4));
    EXPECT_EQ(back[3], 0xFF);
    // whole bytes from x = 8: the trailing bits of the last byte come from the source
    const uint8_t three[] = {0x00, 0x0F};
    ASSERT_EQ(BI_SetBWPackedRow(0, 8, 12, three, bw), TS_OK);
    ASSERT_EQ(BI_GetBWPackedRow(bw, 0, 8, 16, back), TS_OK);
    EXPECT_EQ(back[0], 0x00);
    EXPECT_EQ(back[1], 0x0F);
    // the packed read keeps the first pixel's bit position
    ASSERT_EQ(BI_GetBWPackedRow(bw, 0, 5, 4, back), TS_OK);
    EXPECT_EQ(back[0], 0x1F);
    EXPECT_EQ(back[1], 0x00);
}

TEST_F(RowConvert, PackRgbRowFindsIndexesAndFallsBackToTheNearest) {
    namespace bm = tessarine::bitmap;
    BI_Bitmap *idx = Make(3, 4, 4, 1, 1, {0, 0, 0, 255, 255, 255, 200, 0, 0});
    ASSERT_EQ(MakeColorTableIndex(idx), TS_OK);
    const uint8_t r[] = {200, 250, 255, 10}, g[] = {0, 250, 255, 0}, b[] = {0, 250, 255, 0};
    ASSERT_EQ(BI_SetRGBRow(0, 0, 4, r, g, b, idx), TS_OK);
    uint8_t out[4];
    ASSERT_EQ(BI_GetIndexRow(idx, 0, 0, 4, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 4), (Bytes{2, 1, 1, 0}));  // 250s and 10: not in the table
    // no index built: the nearest entry
    MEM_FreeHdl(idx->colorIndex);
    idx->colorIndex = nullptr;
    ASSERT_EQ(BI_SetRGBRow(1, 1, 3, r, g, b, idx), TS_OK);
    ASSERT_EQ(BI_GetIndexRow(idx, 1, 1, 3, out), TS_OK);
    EXPECT_EQ(Bytes(out, out + 3), (Bytes{2, 1, 1}));
    uint8_t row[2] = {0xAB, 0xCD};
    EXPECT_EQ(bm::BI_PackRGBRow(3, 2, r, g, b, 0, 1, row, 0, nullptr), -2);
    EXPECT_EQ(bm::BI_PackRGBRow(2, 24, r, g, b, 0, 1, row, 0, nullptr), -2);
    EXPECT_EQ(bm::BI_PackRGBRow(0, 8, r, g, b, 0, 1, row, 0, nullptr), -2);
    // gray at 4 bits: the density's high four bits, the other nibble stays
    ASSERT_EQ(bm::BI_PackRGBRow(2, 4, r, g, b, 1, 1, row, 0, nullptr), TS_OK);
    EXPECT_EQ(row[0], 0xA0 | (RGB2GrayScale(200, 0, 0) >> 4));
    ASSERT_EQ(bm::BI_PackRGBRow(2, 4, r, g, b, 0, 1, row, 0, nullptr), TS_OK);
    EXPECT_EQ(row[0], (RGB2GrayScale(200, 0, 0) & 0xF0) | (row[0] & 0x0F));
}

TEST_F(RowConvert, RunsOutsideTheBitmapAreRefused) {
    for (uint8_t storage : {1, 2}) {
        BI_Bitmap *g = Make(2, 8, 8, storage);
        uint8_t v[16] = {};
        EXPECT_EQ(BI_GetGRow(g, 3, 0, 1, v), -1);
        EXPECT_EQ(BI_GetGRow(g, -1, 0, 1, v), -1);
        EXPECT_EQ(BI_GetGRow(g, 0, 5, 4, v), -1);
        EXPECT_EQ(BI_GetGRow(g, 0, -1, 2, v), -1);
        EXPECT_EQ(BI_SetGRow(0, 7, 2, v, g), -1);
        EXPECT_EQ(BI_SetGRow(0, 0, 9, v, g), -1);
        // more bytes than the pixels hold: 3-byte triples into an 8-bit row
        if (storage == 1) { EXPECT_EQ(BI_SetRGBRowInterlace(2, 0, 8, v, g), -1); }
    }
}

}  // namespace

namespace {

TEST_F(RowConvert, LongTrueColourRowsThroughPlanesAndBack) {
    for (int64_t n : {1, 15, 16, 17, 47, 1000, 4099}) {
        Bytes rgb(n * 3), cmyk(n * 4);
        for (int64_t i = 0; i < n * 3; ++i) rgb[i] = static_cast<uint8_t>(i * 7 + 3);
        for (int64_t i = 0; i < n * 4; ++i) cmyk[i] = static_cast<uint8_t>(i * 5 + 1);
        Bytes p[4] = {Bytes(n), Bytes(n), Bytes(n), Bytes(n)};
        ASSERT_EQ(BI_UnpackRGBRow(4, 24, nullptr, rgb.data(), 0, static_cast<int32_t>(n), p[0].data(),
                                  p[1].data(), p[2].data()),
                  TS_OK);
        for (int64_t i = 0; i < n; ++i)
            for (int k = 0; k < 3; ++k) ASSERT_EQ(p[k][i], rgb[3 * i + k]) << n << " " << i;
        ASSERT_EQ(BI_UnpackCMYKRow(4, 32, nullptr, cmyk.data(), 0, static_cast<int32_t>(n), p[0].data(),
                                   p[1].data(), p[2].data(), p[3].data()),
                  TS_OK);
        for (int64_t i = 0; i < n; ++i)
            for (int k = 0; k < 4; ++k) ASSERT_EQ(p[k][i], cmyk[4 * i + k]) << n << " " << i;
    }
}

}  // namespace

namespace {

// Every 3-byte path this processor has, each plane at every address phase
// (the widest path aligns its stores), lengths around the block edges, and
// not a byte written outside the run.
TEST_F(RowConvert, TrueColourPlanesAtEveryAddressPhase) {
    constexpr uint8_t kFill = 0xA5;
    constexpr int64_t kPad = 80;
    tstest::ForEachVectorPath([&] {
        for (int64_t n : {0, 1, 31, 32, 63, 64, 255, 256, 257, 319, 320, 383, 700, 1024, 1097}) {
            Bytes rgb(n * 3 + 2 * kPad);
            for (size_t i = 0; i < rgb.size(); ++i) rgb[i] = static_cast<uint8_t>(i * 7 + 3);
            for (int64_t phase = 0; phase < 64; phase += (n > 300 ? 9 : 1)) {
                const int64_t at[3] = {phase, (phase + 17) % 64, (phase + 40) % 64};
                const int64_t from = phase % 3;
                Bytes planes[3];
                uint8_t *p[3];
                for (int k = 0; k < 3; ++k) {
                    planes[k].assign(n + 2 * kPad, kFill);
                    p[k] = planes[k].data() + kPad + at[k];
                }
                tessarine::bitmap::SplitRgb(rgb.data() + kPad + from, n, p[0], p[1], p[2]);
                for (int k = 0; k < 3; ++k) {
                    for (int64_t i = 0; i < n; ++i)
                        ASSERT_EQ(p[k][i], rgb[kPad + from + 3 * i + k])
                            << n << " " << phase << " " << i;
                    for (int64_t i = 0; i < static_cast<int64_t>(planes[k].size()); ++i) {
                        if (planes[k].data() + i < p[k] || planes[k].data() + i >= p[k] + n) {
                            ASSERT_EQ(planes[k][i], kFill) << n << " " << phase << " " << i;
                        }
                    }
                }
                Bytes back(n * 3 + 2 * kPad, kFill);
                uint8_t *out = back.data() + kPad + phase;
                tessarine::bitmap::JoinRgb(p[0], p[1], p[2], n, out);
                for (int64_t i = 0; i < static_cast<int64_t>(back.size()); ++i) {
                    if (back.data() + i < out || back.data() + i >= out + 3 * n) {
                        ASSERT_EQ(back[i], kFill) << n << " " << phase << " " << i;
                    } else {
                        ASSERT_EQ(back[i], rgb[kPad + from + (back.data() + i - out)])
                            << n << " " << phase;
                    }
                }
            }
        }
    });
}

// The 4-byte split and join on every path this processor has: lengths
// around the 16-pixel blocks, planes and pixels at several address phases,
// and not a byte written outside the run.
TEST_F(RowConvert, CmykPlanesOnEveryVectorPath) {
    constexpr uint8_t kFill = 0x3C;
    constexpr int64_t kPad = 32;
    tstest::ForEachVectorPath([&] {
        for (int64_t n : {0, 1, 15, 16, 17, 31, 32, 33, 255, 1000, 1097}) {
            Bytes cmyk(n * 4 + 2 * kPad);
            for (size_t i = 0; i < cmyk.size(); ++i) cmyk[i] = static_cast<uint8_t>(i * 11 + 5);
            for (int64_t phase = 0; phase < 16; phase += 3) {
                const uint8_t *from = cmyk.data() + kPad + phase;
                Bytes planes[4];
                uint8_t *p[4];
                for (int k = 0; k < 4; ++k) {
                    planes[k].assign(n + 2 * kPad, kFill);
                    p[k] = planes[k].data() + kPad + (phase * (k + 1)) % 16;
                }
                tessarine::bitmap::SplitCmyk(from, n, p);
                for (int k = 0; k < 4; ++k)
                    for (int64_t i = 0; i < static_cast<int64_t>(planes[k].size()); ++i) {
                        const int64_t at = planes[k].data() + i - p[k];
                        ASSERT_EQ(planes[k][i], at >= 0 && at < n ? from[4 * at + k] : kFill)
                            << n << " " << phase << " " << k << " " << at;
                    }
                Bytes back(n * 4 + 2 * kPad, kFill);
                uint8_t *out = back.data() + kPad + (phase * 5) % 16;
                const uint8_t *const q[4] = {p[0], p[1], p[2], p[3]};
                tessarine::bitmap::JoinCmyk(q, n, out);
                for (int64_t i = 0; i < static_cast<int64_t>(back.size()); ++i) {
                    const int64_t at = back.data() + i - out;
                    ASSERT_EQ(back[i], at >= 0 && at < 4 * n ? from[at] : kFill)
                        << n << " " << phase << " " << at;
                }
            }
        }
    });
}

}  // namespace

namespace {

TEST_F(RowConvert, LongBlackAndWhiteRowsPackAndUnpackExactly) {
    tstest::ForEachVectorPath([] {
        std::mt19937 rng(5);
        for (int32_t x : {0, 3, 8, 13}) {
            for (int32_t n : {64, 129, 1000, 4097}) {
                Bytes v(n + 16);
                for (auto &f : v) f = rng() % 3 == 0 ? 0 : static_cast<uint8_t>(rng());
                const int64_t bytes = ((x + n + 7) >> 3) + 1;
                Bytes bw(bytes, 0x5A), idx(bytes, 0x5A), gray(bytes, 0x5A);
                ASSERT_EQ(BI_PackBWRow(v.data(), x, n, bw.data() + (x >> 3)), TS_OK);
                ASSERT_EQ(BI_PackIndexRow(1, v.data(), x, n, idx.data() + (x >> 3)), TS_OK);
                ASSERT_EQ(BI_PackGRow(1, v.data(), static_cast<int8_t>(x), n, gray.data() + (x >> 3)), TS_OK);
                for (int64_t p = 0; p < bytes * 8; ++p) {
                    const bool in = p >= x && p < x + n;
                    const int old = (0x5A >> (7 - (p & 7))) & 1;
                    const int bit = (bw[p >> 3] >> (7 - (p & 7))) & 1;
                    ASSERT_EQ(bit, in ? v[p - x] != 0 : old) << x << " " << n << " " << p;
                    ASSERT_EQ((idx[p >> 3] >> (7 - (p & 7))) & 1, in ? v[p - x] != 0 : old);
                    ASSERT_EQ((gray[p >> 3] >> (7 - (p & 7))) & 1, in ? v[p - x] > 127 : old);
                }
                Bytes back(n + 16, 9);
                ASSERT_EQ(BI_UnpackBWRow(bw.data() + (x >> 3), x, n, back.data()), TS_OK);
                for (int32_t i = 0; i < n; ++i) ASSERT_EQ(back[i], v[i] != 0);
                EXPECT_EQ(back[n], 9);
            }
        }
    });
}

}  // namespace
