// Filling, moving pixels between memory and a tile file, and DIBs.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <string>
#include <unistd.h>
#include <vector>

#include <tessarine/tessarine.h>

#include "platform/test_hooks.h"
#include "row_model.h"
#include "test_support.h"

namespace {

using rowtest::Image;
using rowtest::Layout;
using rowtest::Route;
using tessarine::testing::AllocationFailureHit;
using tessarine::testing::FileCall;
using tessarine::testing::FileFailureHit;
using Bytes = std::vector<uint8_t>;

class WholeBitmap : public tstest::Sandbox {};

BI_Bitmap *Blank(uint8_t type, uint8_t d, int32_t w, int32_t h, uint8_t model, uint8_t storage,
                 const Bytes &table = {}) {
    BI_Bitmap *b = nullptr;
    EXPECT_EQ(BI_CreateBlankBmp(type, d, w, h, 300, 300, model,
                                static_cast<int32_t>(table.size() / (model == 2 ? 4 : 3)),
                                table.empty() ? nullptr : table.data(), &b, storage, 0, 0, 0),
              TS_OK);
    return b;
}

// ---- Fill -------------------------------------------------------------------

TEST_F(WholeBitmap, FillBlackAndWhiteDarkSetsLightClears) {
    for (uint8_t storage : {1, 2}) {
        BI_Bitmap *b = Blank(1, 1, 21, 5, 1, storage);
        ASSERT_EQ(BI_FillBmp(b, 128, 128, 128), TS_OK);
        Image got = rowtest::ReadImage(b);
        for (int y = 0; y < 5; ++y)
            for (int x = 0; x < 21; ++x) ASSERT_EQ(got.Pixel(y, x), 1u);
        ASSERT_EQ(BI_FillBmp(b, 129, 129, 129), TS_OK);
        got = rowtest::ReadImage(b);
        for (int y = 0; y < 5; ++y)
            for (int x = 0; x < 21; ++x) ASSERT_EQ(got.Pixel(y, x), 0u);
        // a = (r + g + b) / 3 in integers: (128 + 128 + 130) / 3 = 128.
        ASSERT_EQ(BI_FillBmp(b, 128, 128, 130), TS_OK);
        EXPECT_EQ(rowtest::ReadImage(b).Pixel(4, 20), 1u);
        EXPECT_EQ(b->ioSession, nullptr);
        BI_DeleteBitmap(&b);
    }
}

TEST_F(WholeBitmap, FillEveryLayout) {
    const uint8_t r = 200, g = 40, bl = 90;
    const int a = (r + g + bl) / 3;
    for (uint8_t storage : {1, 2}) {
        for (const Layout &l : rowtest::Layouts()) {
            SCOPED_TRACE(testing::Message() << l.name << " storage " << int(storage));
            const Bytes table = rowtest::RandomTable(l, 3);
            BI_Bitmap *b = Blank(l.type, l.d, 37, 9, l.model, storage, table);
            ASSERT_NE(b, nullptr);
            ASSERT_EQ(BI_FillBmp(b, r, g, bl), TS_OK);
            const Image got = rowtest::ReadImage(b);
            for (int y = 0; y < 9; ++y) {
                for (int x = 0; x < 37; ++x) {
                    if (l.type == 1 || (l.type == 2 && l.d == 1)) {
                        // gray at one bit is written by the density rule: 255 - a is above 127
                        const uint32_t want = l.type == 1 ? (a <= 128) : (255 - a > 127);
                        ASSERT_EQ(got.Pixel(y, x), want);
                    } else if (l.type == 2) {
                        const uint32_t v = static_cast<uint32_t>(255 - a);
                        ASSERT_EQ(got.Pixel(y, x), l.d == 8 ? v : v / 17);
                    } else if (l.type == 3) {
                        // The table is read as RGB whatever its model.
                        const int entries = static_cast<int>(table.size() / 3) < l.colors
                                                ? static_cast<int>(table.size() / 3)
                                                : l.colors;
                        uint32_t want = BI_RGBMapToColorIndex(r, g, bl, entries, table.data());
                        if (static_cast<int>(want) >= l.colors) want = 0;
                        if (l.d == 1) want = want != 0;
                        ASSERT_EQ(got.Pixel(y, x), want);
                    } else if (l.model == 1) {
                        const uint8_t *p = got.rows[y].data() + 3 * x;
                        ASSERT_EQ(p[0], r);
                        ASSERT_EQ(p[1], g);
                        ASSERT_EQ(p[2], bl);
                    } else {
                        uint8_t rgb[3] = {r, g, bl}, cmyk[4];
                        CX_SRgb2SWOPCmyk(rgb, cmyk);
                        ASSERT_EQ(std::memcmp(got.rows[y].data() + 4 * x, cmyk, 4), 0);
                    }
                }
            }
            BI_DeleteBitmap(&b);
        }
    }
}

TEST_F(WholeBitmap, FillOutOfRangeTypesAndOtherModels) {
    BI_Bitmap *b = Blank(2, 8, 4, 4, 1, 2);
    const Image before = rowtest::ReadImage(b);
    for (uint8_t type : {0, 5, 9}) {
        b->imageType = type;
        EXPECT_EQ(BI_FillBmp(b, 1, 2, 3), -2);
    }
    b->imageType = 4;
    b->colorModel = 0;
    EXPECT_EQ(BI_FillBmp(b, 1, 2, 3), TS_OK);  // true colour of no model: nothing
    b->imageType = 2;
    b->colorModel = 1;
    EXPECT_TRUE(rowtest::ReadImage(b) == before);
    EXPECT_EQ(b->ioSession, nullptr);
    BI_DeleteBitmap(&b);
}

// A tile bitmap of several tiles and bands, filled whole.
TEST_F(WholeBitmap, FillAcrossTiles) {
    BI_Bitmap *b = Blank(4, 24, 8200, 1030, 1, 2);
    ASSERT_EQ(BI_FillBmp(b, 1, 2, 3), TS_OK);
    for (int y : {0, 1023, 1024, 1029}) {
        Bytes rgb(3 * 8200);
        ASSERT_EQ(BI_GetRGBRowInterlace(b, y, 0, 8200, rgb.data()), TS_OK);
        for (int x : {0, 8191, 8192, 8199}) {
            EXPECT_EQ(rgb[3 * x], 1);
            EXPECT_EQ(rgb[3 * x + 2], 3);
        }
    }
    BI_DeleteBitmap(&b);
}

TEST_F(WholeBitmap, FillFailures) {
    BI_Bitmap *b = Blank(2, 8, 30, 20, 1, 2);
    const int fds = tstest::OpenDescriptorCount();
    int refused = 0;
    const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
        const int32_t s = BI_FillBmp(b, 9, 9, 9);
        // A failed request for large pages is no failure of the band.
        if (s != TS_OK) {
            EXPECT_EQ(s, -5);
            EXPECT_TRUE(AllocationFailureHit());
            ++refused;
        }
        EXPECT_EQ(b->ioSession, nullptr);
        EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
    });
    EXPECT_GE(made, 5);  // the session and its buffers, the row
    EXPECT_GE(refused, 4);
    for (FileCall kind : {FileCall::Read, FileCall::Write, FileCall::Seek}) {
        tstest::ForEachFileFailure(kind, [&](int64_t) {
            const int32_t s = BI_FillBmp(b, 9, 9, 9);
            // The band is saved when the transfer ends, which has no status.
            if (s != TS_OK) {
                EXPECT_EQ(s, -50);
            }
            EXPECT_EQ(b->ioSession, nullptr);
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
        });
    }
    BI_DeleteBitmap(&b);
}

// ---- Conversions -------------------------------------------------------------

TEST_F(WholeBitmap, ToMemoryAndBackLeaveEveryPixel) {
    uint32_t seed = 1;
    for (const Layout &l : rowtest::Layouts()) {
        for (Route route : {Route::Alone, Route::AloneOwnFd}) {
            SCOPED_TRACE(testing::Message() << l.name << " " << rowtest::RouteName(route));
            const Image img = rowtest::RandomImage(41, 13, l.d, seed++);
            BI_Bitmap *b = rowtest::MakeBitmap(l, route, img, rowtest::RandomTable(l, seed++));
            ASSERT_NE(b, nullptr);
            const std::string path = b->tilePath;
            const int32_t fd = b->tileFile;
            ASSERT_EQ(BI_ConvertBmpToMem(b), TS_OK);
            EXPECT_EQ(b->storage, 1);
            EXPECT_EQ(b->tilePath[0], '\0');
            EXPECT_EQ(b->tileFile, fd);  // the old number stays
            EXPECT_EQ(b->bytesPerRow, ((l.d * 41u + 31) >> 3) & ~3u);
            EXPECT_NE(access(path.c_str(), F_OK), 0);
            EXPECT_TRUE(rowtest::ReadImage(b) == img);
            b->tileFile = -1;
            ASSERT_EQ(BI_ConvertBmpToTiledFile(b), TS_OK);
            EXPECT_EQ(b->storage, 2);
            EXPECT_EQ(b->pixelHandle, nullptr);
            EXPECT_NE(b->tilePath[0], '\0');
            EXPECT_NE(b->tileFile, -1);
            EXPECT_TRUE(rowtest::ReadImage(b) == img);
            BI_DeleteBitmap(&b);
        }
    }
}

TEST_F(WholeBitmap, ConversionsOfOtherStoragesChangeNothing) {
    BI_Bitmap *m = Blank(2, 8, 4, 4, 1, 1);
    BI_Bitmap *t = Blank(2, 8, 4, 4, 1, 2);
    for (uint8_t storage : {1, 3}) {
        m->storage = storage;
        const BI_Bitmap before = *m;
        EXPECT_EQ(BI_ConvertBmpToMem(m), TS_OK);
        EXPECT_EQ(std::memcmp(&before, m, sizeof before), 0);
    }
    m->storage = 1;
    for (uint8_t storage : {2, 3}) {
        t->storage = storage;
        const BI_Bitmap before = *t;
        EXPECT_EQ(BI_ConvertBmpToTiledFile(t), TS_OK);
        EXPECT_EQ(std::memcmp(&before, t, sizeof before), 0);
    }
    t->storage = 2;
    BI_DeleteBitmap(&m);
    BI_DeleteBitmap(&t);
}

TEST_F(WholeBitmap, LargeImageThroughBothConversions) {
    const Image img = rowtest::RandomImage(8250, 1050, 8, 44);
    BI_Bitmap *b = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0}, Route::Alone, img, {});
    ASSERT_EQ(BI_ConvertBmpToMem(b), TS_OK);
    EXPECT_TRUE(rowtest::ReadImage(b) == img);
    b->tileFile = -1;
    ASSERT_EQ(BI_ConvertBmpToTiledFile(b), TS_OK);
    EXPECT_TRUE(rowtest::ReadImage(b) == img);
    BI_DeleteBitmap(&b);
}

TEST_F(WholeBitmap, ToMemoryFailures) {
    for (bool own : {false, true}) {
        const Image img = rowtest::RandomImage(20, 9, 8, 2);
        BI_Bitmap *b = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0}, own ? Route::AloneOwnFd : Route::Alone,
                                           img, {});
        const int fds = tstest::OpenDescriptorCount();
        const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
            const int32_t s = BI_ConvertBmpToMem(b);
            if (AllocationFailureHit()) {
                EXPECT_EQ(s, -5);
                EXPECT_EQ(b->storage, 2);
                EXPECT_NE(b->tilePath[0], '\0');
                // A block had before the failure stays with the bitmap; free
                // it, so that the heap is where it was.
                if (b->pixelHandle != nullptr) {
                    MEM_FreeHdl(b->pixelHandle);
                    b->pixelHandle = nullptr;
                }
            } else {
                EXPECT_EQ(s, TS_OK);
            }
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds - (b->storage == 1 && !own ? 1 : 0));
        });
        EXPECT_GE(made, 4);  // record, pixels, header, tile buffer
        EXPECT_TRUE(rowtest::ReadImage(b) == img);
        BI_DeleteBitmap(&b);
        for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
            BI_Bitmap *t = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0},
                                               own ? Route::AloneOwnFd : Route::Alone, img, {});
            const int fdsBefore = tstest::OpenDescriptorCount();
            tstest::ForEachFileFailure(kind, [&](int64_t) {
                const int32_t s = BI_ConvertBmpToMem(t);
                if (FileFailureHit(kind)) {
                    EXPECT_EQ(s, -50);
                    EXPECT_EQ(t->storage, 2);
                    EXPECT_NE(t->pixelHandle, nullptr);  // stays set, storage still 2
                    EXPECT_EQ(tstest::OpenDescriptorCount(), fdsBefore);
                } else {
                    EXPECT_EQ(s, TS_OK);
                }
            });
            EXPECT_TRUE(rowtest::ReadImage(t) == img);
            BI_DeleteBitmap(&t);
        }
    }
}

// After a failed conversion the new file stays under tilePath; the test
// takes it away again before the next attempt.
void DropFile(BI_Bitmap *b) {
    if (b->tileFile != -1) FM_Close(b->tileFile);
    b->tileFile = -1;
    if (b->tilePath[0] != '\0') FM_Delete(b->tilePath);
    b->tilePath[0] = '\0';
}

TEST_F(WholeBitmap, ToTiledFileFailures) {
    const Image img = rowtest::RandomImage(20, 9, 24, 2);
    BI_Bitmap *b = rowtest::MakeBitmap({"rgb24", 4, 24, 1, 0}, Route::Memory, img, {});
    const int fds = tstest::OpenDescriptorCount();
    const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
        const int32_t s = BI_ConvertBmpToTiledFile(b);
        if (AllocationFailureHit()) {
            // The scratch file's own failure ends as -1: its descriptor is -1.
            EXPECT_TRUE(s == -5 || s == -1) << s;
            EXPECT_EQ(b->storage, 1);
            EXPECT_NE(b->pixelHandle, nullptr);
            DropFile(b);
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
        } else {
            EXPECT_EQ(s, TS_OK);
        }
    });
    EXPECT_GE(made, 4);
    EXPECT_TRUE(rowtest::ReadImage(b) == img);
    BI_DeleteBitmap(&b);
    for (FileCall kind : {FileCall::Read, FileCall::Write, FileCall::Seek}) {
        BI_Bitmap *m = rowtest::MakeBitmap({"rgb24", 4, 24, 1, 0}, Route::Memory, img, {});
        tstest::ForEachFileFailure(kind, [&](int64_t) {
            const int32_t s = BI_ConvertBmpToTiledFile(m);
            if (FileFailureHit(kind)) {
                EXPECT_TRUE(s == -50 || s == -1) << s;
                EXPECT_EQ(m->storage, 1);
                DropFile(m);
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            } else {
                EXPECT_EQ(s, TS_OK);
            }
        });
        EXPECT_TRUE(rowtest::ReadImage(m) == img);
        BI_DeleteBitmap(&m);
    }
}

// ---- DIBs --------------------------------------------------------------------

uint32_t U32(const uint8_t *p) { return p[0] | p[1] << 8 | p[2] << 16 | uint32_t{p[3]} << 24; }

TEST_F(WholeBitmap, CreateDibHeaderAndPalette) {
    const uint8_t colors[6] = {1, 2, 3, 250, 251, 252};
    BITMAPINFOHEADER *dib = nullptr;
    ASSERT_EQ(BI_CreateDIB(8, 13, 10, 2, colors, &dib), TS_OK);
    const auto *bytes = reinterpret_cast<const uint8_t *>(dib);
    const uint8_t header[40] = {40, 0, 0, 0, 13, 0, 0, 0, 0xF6, 0xFF, 0xFF, 0xFF, 1, 0, 8, 0,
                                0,  0, 0, 0, 160, 0, 0, 0, 44, 1, 0, 0, 44, 1, 0, 0,
                                2,  0, 0, 0, 0, 0, 0, 0};
    EXPECT_EQ(std::memcmp(bytes, header, 40), 0);  // biSizeImage 16 * 10, biHeight -10
    EXPECT_EQ(dib->biHeight, -10);
    const uint8_t palette[8] = {3, 2, 1, 0, 252, 251, 250, 0};
    EXPECT_EQ(std::memcmp(bytes + 40, palette, 8), 0);
    MEM_FreePtr(dib);
    ASSERT_EQ(BI_CreateDIB(1, 33, 3, 0, nullptr, &dib), TS_OK);
    EXPECT_EQ(dib->biSizeImage, 8u * 3);
    EXPECT_EQ(dib->biClrUsed, 0u);
    EXPECT_EQ(U32(reinterpret_cast<const uint8_t *>(dib) + 32), 0u);
    MEM_FreePtr(dib);
}

TEST_F(WholeBitmap, CreateDibFailures) {
    BITMAPINFOHEADER *dib = reinterpret_cast<BITMAPINFOHEADER *>(uintptr_t{0x1234});
    tessarine::testing::FailAllocationAt(1);
    EXPECT_EQ(BI_CreateDIB(24, 5, 5, 0, nullptr, &dib), -5);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(dib, reinterpret_cast<BITMAPINFOHEADER *>(uintptr_t{0x1234}));
    EXPECT_EQ(BI_CreateDIB(24, -5, 5, 0, nullptr, &dib), -4);
    EXPECT_EQ(BI_CreateDIB(24, 5, -5, 0, nullptr, &dib), -4);
    EXPECT_EQ(BI_CreateDIB(8, 5, 5, -1, nullptr, &dib), -4);
    EXPECT_EQ(BI_CreateDIB(32, 100000, 100000, 0, nullptr, &dib), -4);
    EXPECT_EQ(dib, reinterpret_cast<BITMAPINFOHEADER *>(uintptr_t{0x1234}));
}

TEST_F(WholeBitmap, DibFromBitmapsByteForByte) {
    // Indexed: the palette is the table; the pixels come by BI_MemBitsToDIB.
    const Layout idx{"idx8", 3, 8, 1, 3};
    const Bytes table = {10, 20, 30, 40, 50, 60, 70, 80, 90};
    Image img(5, 3, 8);
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 5; ++x) img.rows[y][x] = static_cast<uint8_t>((x + y) % 3);
    BI_Bitmap *b = rowtest::MakeBitmap(idx, Route::Memory, img, table);
    const RECT all{0, 0, 5, 3};
    BITMAPINFOHEADER *dib = nullptr;
    ASSERT_EQ(BI_CreateDIBFromBmp(b, &all, &dib), TS_OK);
    EXPECT_EQ(dib->biClrUsed, 3u);
    EXPECT_EQ(dib->biBitCount, 8);
    EXPECT_EQ(dib->biWidth, 5);
    EXPECT_EQ(dib->biHeight, -3);
    const auto *bytes = reinterpret_cast<const uint8_t *>(dib);
    const uint8_t palette[12] = {30, 20, 10, 0, 60, 50, 40, 0, 90, 80, 70, 0};
    EXPECT_EQ(std::memcmp(bytes + 40, palette, 12), 0);
    {
        auto *base = static_cast<const uint8_t *>(MEM_Lock(b->pixelHandle));
        ASSERT_EQ(BI_MemBitsToDIB(b, static_cast<int32_t>(b->bytesPerRow), &all, base, 0, 0, dib), TS_OK);
        MEM_Unlock(b->pixelHandle);
    }
    for (int y = 0; y < 3; ++y) EXPECT_EQ(std::memcmp(bytes + 52 + 8 * y, img.rows[y].data(), 5), 0);
    MEM_FreePtr(dib);
    BI_DeleteBitmap(&b);

    // Gray: no count, no palette in the header; the block keeps room for the
    // palette the pixel rule assumes, so the pixels land inside it.
    Image gray = rowtest::RandomImage(7, 4, 8, 3);
    BI_Bitmap *g = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0}, Route::Memory, gray, {});
    const RECT part{1, 1, 6, 4};
    ASSERT_EQ(BI_CreateDIBFromBmp(g, &part, &dib), TS_OK);
    EXPECT_EQ(dib->biClrUsed, 0u);
    EXPECT_EQ(dib->biWidth, 5);
    EXPECT_EQ(dib->biHeight, -3);
    EXPECT_EQ(dib->biSizeImage, 8u * 3);
    {
        auto *base = static_cast<const uint8_t *>(MEM_Lock(g->pixelHandle));
        ASSERT_EQ(BI_MemBitsToDIB(g, static_cast<int32_t>(g->bytesPerRow), &part, base, 0, 0, dib), TS_OK);
        MEM_Unlock(g->pixelHandle);
    }
    const uint8_t *pixels = reinterpret_cast<const uint8_t *>(dib) + 40 + 256 * 4;
    for (int y = 0; y < 3; ++y) EXPECT_EQ(std::memcmp(pixels + 8 * y, gray.rows[y + 1].data() + 1, 5), 0);
    MEM_FreePtr(dib);
    BI_DeleteBitmap(&g);

    // CMYK true colour: 32 bits, no palette.
    BI_Bitmap *c = Blank(4, 32, 3, 2, 2, 1);
    const RECT cr{0, 0, 3, 2};
    ASSERT_EQ(BI_CreateDIBFromBmp(c, &cr, &dib), TS_OK);
    EXPECT_EQ(dib->biBitCount, 32);
    EXPECT_EQ(dib->biClrUsed, 0u);
    EXPECT_EQ(dib->biSizeImage, 12u * 2);
    MEM_FreePtr(dib);
    BI_DeleteBitmap(&c);

    // Indexed CMYK: the RGB getter's -1, and nothing made.
    BI_Bitmap *ic = Blank(3, 8, 3, 2, 2, 1, Bytes(8, 1));
    dib = nullptr;
    EXPECT_EQ(TS_STATUS(BI_CreateDIBFromBmp(ic, &cr, &dib)), -1);
    EXPECT_EQ(dib, nullptr);
    BI_DeleteBitmap(&ic);
}

}  // namespace
