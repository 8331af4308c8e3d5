#include <gtest/gtest.h>

#include <sys/stat.h>
#include <unistd.h>

#include <cstring>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include <tessarine/bitmap.h>
#include <tessarine/storage.h>

#include <tessarine/profile.hpp>

#include "platform/file_path_hooks.h"
#include "platform/test_hooks.h"
#include "test_support.h"

namespace {

using tessarine::testing::FileCall;

class Bitmap : public tstest::Sandbox {};

bool Exists(const char *path) {
    struct stat s{};
    return ::stat(path, &s) == 0;
}

std::vector<uint8_t> FileBytes(const char *path) {
    std::ifstream in(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

BI_Bitmap *Create(uint8_t type, uint8_t bpp, int32_t w, int32_t h, uint8_t storage,
                  uint8_t model = 0, int32_t count = 0, const uint8_t *colors = nullptr,
                  uint8_t user1 = 5, int32_t *status = nullptr) {
    BI_Bitmap *b = nullptr;
    const int32_t s =
        BI_CreateBlankBmp(type, bpp, w, h, 72.0, 96.0, model, count, colors, &b, storage, user1, 6, 7);
    if (status) *status = s;
    return b;
}

TEST_F(Bitmap, NewBitmapIsEmpty) {
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_NewBitmap(&b), TS_OK);
    ASSERT_NE(b, nullptr);
    EXPECT_EQ(b->refCount, 1);
    EXPECT_EQ(b->userByte1, 1);
    EXPECT_EQ(b->tileFile, -1);
    EXPECT_EQ(b->width, 0);
    EXPECT_EQ(b->storage, 0);
    EXPECT_EQ(b->tilePath[0], '\0');
    EXPECT_EQ(b->companionPath[0], '\0');
    EXPECT_EQ(b->pixelHandle, nullptr);
    EXPECT_EQ(b->profilePath, nullptr);
    EXPECT_EQ(b->ioSession, nullptr);
    EXPECT_EQ(BI_IsValidBmp(b), 0) << "a fresh record is not valid";
    BI_DeleteBitmap(&b);
    EXPECT_EQ(b, nullptr);
}

TEST_F(Bitmap, NewBitmapOutOfMemory) {
    tstest::ForEachAllocationFailure([](int64_t) {
        BI_Bitmap *b = reinterpret_cast<BI_Bitmap *>(0x1);
        const int32_t s = BI_NewBitmap(&b);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(s, -5);
            EXPECT_EQ(b, reinterpret_cast<BI_Bitmap *>(0x1));
        } else {
            BI_DeleteBitmap(&b);
        }
    });
}

TEST_F(Bitmap, DeleteDestroysTheProfilePath) {
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_NewBitmap(&b), TS_OK);
    AFilePath source("/colour/profiles/press.icc");
    b->profilePath = tessarine::platform::CopyFilePath(source);
    ASSERT_NE(b->profilePath, nullptr);
    EXPECT_STREQ(static_cast<const char *>(*b->profilePath), "/colour/profiles/press.icc");
    BI_DeleteBitmap(&b);  // the Sandbox checks that nothing leaked
}

TEST_F(Bitmap, StrideIsPaddedToFourBytes) {
    BI_Bitmap *b = Create(1, 1, 33, 2, 1);
    ASSERT_NE(b, nullptr);
    EXPECT_EQ(b->bytesPerRow, 8u);
    EXPECT_EQ(MEM_HdlSize(b->pixelHandle), 16u);
    BI_DeleteBitmap(&b);
    b = Create(1, 1, 32, 2, 1);
    EXPECT_EQ(b->bytesPerRow, 4u);
    BI_DeleteBitmap(&b);
    b = Create(4, 24, 1, 1, 1, 1);
    EXPECT_EQ(b->bytesPerRow, 4u);
    BI_DeleteBitmap(&b);
}

TEST_F(Bitmap, StorageZeroMakesATileFileBitmap) {
    const int fds = tstest::OpenDescriptorCount();
    BI_Bitmap *b = Create(2, 8, 100, 100, 0);
    ASSERT_NE(b, nullptr);
    EXPECT_EQ(b->storage, 2);
    EXPECT_EQ(b->pixelHandle, nullptr);
    EXPECT_GT(b->tileFile, 0) << "the new file stays open";
    EXPECT_EQ(std::string(b->tilePath).rfind(Dir() + "/KLOD", 0), 0u);
    EXPECT_TRUE(Exists(b->tilePath));
    EXPECT_EQ(FileBytes(b->tilePath).size(), 116u + 10000 + 1);
    EXPECT_EQ(tstest::OpenDescriptorCount(), fds + 1);
    const std::string path = b->tilePath;
    BI_DeleteBitmap(&b);
    EXPECT_FALSE(Exists(path.c_str()));
    EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
}

TEST_F(Bitmap, BothStoragesMakeMemoryAndFile) {
    BI_Bitmap *b = Create(4, 24, 10, 10, 3, 1);
    ASSERT_NE(b, nullptr);
    EXPECT_EQ(b->storage, 3);
    EXPECT_NE(b->pixelHandle, nullptr);
    EXPECT_TRUE(Exists(b->tilePath));
    BI_DeleteBitmap(&b);
}

TEST_F(Bitmap, UserByteZeroIsOneInTheRecordAndZeroInTheFile) {
    BI_Bitmap *b = Create(2, 8, 4, 4, 2, 0, 0, nullptr, 0);
    ASSERT_NE(b, nullptr);
    EXPECT_EQ(b->userByte1, 1);
    const auto bytes = FileBytes(b->tilePath);
    EXPECT_EQ(bytes[6], 0);
    EXPECT_EQ(bytes[7], 6);
    EXPECT_EQ(bytes[8], 7);
    // A blank copy passes the record's values: 1 in its file.
    BI_Bitmap *c = nullptr;
    const RECT r{0, 0, 3, 3};
    ASSERT_EQ(BI_GetBlankBmp(b, &r, &c, 0), TS_OK);
    EXPECT_EQ(c->storage, 2) << "the source's storage";
    EXPECT_EQ(FileBytes(c->tilePath)[6], 1);
    BI_DeleteBitmap(&c);
    BI_DeleteBitmap(&b);
}

TEST_F(Bitmap, ColourTableNeedsAKnownModel) {
    const uint8_t colors[12] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12};
    BI_Bitmap *b = reinterpret_cast<BI_Bitmap *>(0x1);
    EXPECT_EQ(BI_CreateBlankBmp(3, 8, 4, 4, 1, 1, 0, 3, colors, &b, 1, 1, 0, 0), -2);
    EXPECT_EQ(b, reinterpret_cast<BI_Bitmap *>(0x1));
    EXPECT_EQ(BI_CreateBlankBmp(3, 8, 4, 4, 1, 1, 9, 3, colors, &b, 2, 1, 0, 0), -2);
    EXPECT_EQ(b, reinterpret_cast<BI_Bitmap *>(0x1));
    b = Create(3, 8, 4, 4, 1, 2, 3, colors);
    ASSERT_NE(b, nullptr);
    EXPECT_EQ(MEM_HdlSize(b->colorTable), 12u);
    EXPECT_EQ(std::memcmp(MEM_Lock(b->colorTable), colors, 12), 0);
    MEM_Unlock(b->colorTable);
    BI_DeleteBitmap(&b);
}

TEST_F(Bitmap, BlankCopyOfAnIndexedBitmapOwnsItsTable) {
    const uint8_t rgb[6] = {10, 20, 30, 40, 50, 60};
    BI_Bitmap *src = Create(3, 4, 50, 40, 1, 1, 2, rgb);
    ASSERT_NE(src, nullptr);
    src->colorIndex = MEM_AllocPtr(0, 16);
    BI_Bitmap *b = nullptr;
    const RECT r{5, 6, 25, 16};
    ASSERT_EQ(BI_GetBlankBmp(src, &r, &b, 0), TS_OK);
    EXPECT_EQ(b->width, 20);
    EXPECT_EQ(b->height, 10);
    EXPECT_EQ(b->storage, 1);
    EXPECT_EQ(b->bytesPerRow, 12u);
    EXPECT_EQ(b->imageType, 3);
    EXPECT_EQ(b->userByte1, 5);
    EXPECT_EQ(b->userByte2, 6);
    EXPECT_EQ(b->xResolution, 72.0);
    EXPECT_NE(b->colorTable, src->colorTable);
    EXPECT_EQ(std::memcmp(MEM_Lock(b->colorTable), rgb, 6), 0);
    MEM_Unlock(b->colorTable);
    EXPECT_EQ(b->colorIndex, nullptr);
    EXPECT_NE(b->pixelHandle, nullptr);
    BI_DeleteBitmap(&b);
    // the source's table is untouched and unlocked
    EXPECT_EQ(MEM_Unlock(src->colorTable), 0);
    BI_DeleteBitmap(&src);
}

TEST_F(Bitmap, BlankCopyOfATableWithAnUnknownModelIsMinus2) {
    const uint8_t rgb[6] = {10, 20, 30, 40, 50, 60};
    BI_Bitmap *src = Create(3, 8, 8, 8, 1, 1, 2, rgb);
    ASSERT_NE(src, nullptr);
    src->colorModel = 7;
    const RECT r{0, 0, 4, 4};
    for (uint8_t storage : {1, 2}) {
        BI_Bitmap *b = reinterpret_cast<BI_Bitmap *>(0x1);
        EXPECT_EQ(BI_GetBlankBmp(src, &r, &b, storage), -2);
        EXPECT_EQ(b, reinterpret_cast<BI_Bitmap *>(0x1)) << "out unwritten";
    }
    EXPECT_TRUE(tstest::DirectoryEntries(Dir()).empty()) << "no tile file made";
    BI_DeleteBitmap(&src);
}

TEST_F(Bitmap, BlankCopyDoesNotRejectNegativeSizes) {
    BI_Bitmap *src = Create(2, 8, 10, 10, 1);
    BI_Bitmap *b = nullptr;
    const RECT r{10, 0, 0, 0};
    ASSERT_EQ(BI_GetBlankBmp(src, &r, &b, 1), TS_OK);
    EXPECT_EQ(b->width, -10);
    EXPECT_EQ(b->height, 0);
    BI_DeleteBitmap(&b);
    BI_DeleteBitmap(&src);
}

TEST_F(Bitmap, ValidityTable) {
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_NewBitmap(&b), TS_OK);
    struct Row {
        uint8_t type, model;
        int32_t count;
        uint8_t bpp;
        int32_t valid;
    };
    const Row rows[] = {
        {1, 0, 0, 1, 1},  {1, 7, -3, 1, 1}, {1, 0, 0, 8, 0},  {1, 0, 1, 1, 0},
        {2, 0, 0, 1, 1},  {2, 0, 0, 4, 1},  {2, 2, 0, 8, 1},  {2, 0, 0, 24, 0},
        {2, 1, 2, 8, 0},  // gray with a colour table
        {3, 1, 1, 1, 1},  {3, 2, 5, 8, 1},  {3, 1, 2, 4, 1},  {3, 0, 2, 8, 0},
        {3, 1, 0, 8, 0},  // indexed without a table
        {3, 1, 2, 24, 0}, {4, 1, 0, 24, 1}, {4, 2, 0, 32, 1}, {4, 1, 0, 32, 0},
        {4, 2, 0, 24, 0}, {4, 1, 3, 24, 0}, {4, 0, 0, 24, 0}, {0, 1, 0, 8, 0},
        {5, 1, 0, 8, 0},
    };
    for (const Row &r : rows) {
        b->imageType = r.type;
        b->colorModel = r.model;
        b->colorCount = r.count;
        b->bitsPerPixel = r.bpp;
        EXPECT_EQ(BI_IsValidBmp(b), r.valid)
            << int(r.type) << " " << int(r.model) << " " << r.count << " " << int(r.bpp);
    }
    BI_DeleteBitmap(&b);
}

TEST_F(Bitmap, SharedRecordDiesWithTheLastReference) {
    BI_Bitmap *a = Create(2, 8, 4, 4, 1);
    BI_Bitmap *b = a, *c = a;
    BI_UseBitmap(a);
    BI_UseBitmap(a);
    EXPECT_EQ(a->refCount, 3);
    const int64_t live = tessarine::testing::LiveBlocks();
    BI_DeleteBitmap(&b);
    EXPECT_EQ(b, nullptr);
    EXPECT_EQ(tessarine::testing::LiveBlocks(), live);
    BI_DeleteBitmap(&c);
    EXPECT_EQ(c, nullptr);
    EXPECT_EQ(a->refCount, 1);
    BI_DeleteBitmap(&a);
    EXPECT_EQ(a, nullptr);
    EXPECT_EQ(tessarine::testing::LiveBlocks(), live - 2);
}

TEST_F(Bitmap, RefCountWrapsAfter255Uses) {
    BI_Bitmap *a = Create(2, 8, 4, 4, 1);
    for (int i = 0; i < 255; ++i) BI_UseBitmap(a);
    EXPECT_EQ(a->refCount, 0);
    const int64_t live = tessarine::testing::LiveBlocks();
    BI_DeleteBitmap(&a);
    EXPECT_EQ(tessarine::testing::LiveBlocks(), live - 2) << "the next delete frees";
}

TEST_F(Bitmap, DeleteWithAClosedTileFileDeletesWithoutClosing) {
    BI_Bitmap *b = Create(2, 8, 4, 4, 2);
    ASSERT_NE(b, nullptr);
    ASSERT_EQ(FM_Close(b->tileFile), TS_OK);
    b->tileFile = -1;
    const std::string path = b->tilePath;
    const int fds = tstest::OpenDescriptorCount();
    BI_DeleteBitmap(&b);
    EXPECT_FALSE(Exists(path.c_str()));
    EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
}

TEST_F(Bitmap, DeleteRemovesTheCompanionFile) {
    BI_Bitmap *b = Create(2, 8, 4, 4, 1);
    const std::string companion = Path("companion");
    std::ofstream(companion) << "x";
    std::snprintf(b->companionPath, sizeof b->companionPath, "%s", companion.c_str());
    BI_DeleteBitmap(&b);
    EXPECT_FALSE(Exists(companion.c_str()));
}

TEST_F(Bitmap, DeleteDoesNotLookAtFailedRemovals) {
    BI_Bitmap *b = Create(2, 8, 4, 4, 2);
    ASSERT_NE(b, nullptr);
    const std::string path = b->tilePath;
    ASSERT_EQ(FM_Delete(b->tilePath), TS_OK);  // gone already: FM_Delete fails inside
    std::snprintf(b->companionPath, sizeof b->companionPath, "%s", Path("never-made").c_str());
    const int fds = tstest::OpenDescriptorCount();
    BI_DeleteBitmap(&b);
    EXPECT_EQ(b, nullptr);
    EXPECT_EQ(tstest::OpenDescriptorCount(), fds - 1) << "the tile file was still closed";
    EXPECT_FALSE(Exists(path.c_str()));
}

TEST_F(Bitmap, TileFileBitmapRoundTripsPixels) {
    BI_Bitmap *b = Create(2, 8, 9000, 1100, 2);
    ASSERT_NE(b, nullptr);
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    ASSERT_EQ(HVT_TileFileBegin(b, &info, b->tileFile == -1), TS_OK);
    std::vector<uint8_t> rows(300 * 50);
    for (size_t i = 0; i < rows.size(); ++i) rows[i] = static_cast<uint8_t>(i * 13);
    const HVT_Box box{8100, 1000, 8400, 1050};
    ASSERT_EQ(HVT_SaveBlock(0, &info, &box, 300, rows.data()), TS_OK);
    std::vector<uint8_t> back(rows.size());
    ASSERT_EQ(HVT_ReadBlock(0, &info, &box, 300, back.data()), TS_OK);
    EXPECT_EQ(back, rows);
    HVT_TileFileEnd(&info, b->tileFile == -1);
    BI_DeleteBitmap(&b);
}

void ExpectCleanFailures(const std::function<int32_t(BI_Bitmap **)> &make, bool file) {
    auto check = [&](auto hit, std::initializer_list<int32_t> allowed) {
        BI_Bitmap *b = reinterpret_cast<BI_Bitmap *>(0x1);
        const int32_t s = make(&b);
        if (hit()) {
            bool ok = false;
            for (int32_t a : allowed) ok = ok || s == a;
            EXPECT_TRUE(ok) << s;
            EXPECT_EQ(b, reinterpret_cast<BI_Bitmap *>(0x1)) << "out unwritten";
        } else {
            ASSERT_EQ(s, TS_OK);
            BI_DeleteBitmap(&b);
        }
    };
    const int fds = tstest::OpenDescriptorCount();
    tstest::ForEachAllocationFailure([&](int64_t) {
        check([] { return tessarine::testing::AllocationFailureHit(); }, {-5, -1});
    });
    if (file) {
        for (FileCall kind : {FileCall::Write, FileCall::Seek}) {
            const int64_t calls = tstest::ForEachFileFailure(kind, [&](int64_t) {
                check([kind] { return tessarine::testing::FileFailureHit(kind); }, {-50});
            });
            EXPECT_GT(calls, 2);
        }
    }
    EXPECT_EQ(tstest::OpenDescriptorCount(), fds) << "no descriptor left open";
}

TEST_F(Bitmap, CreationFailsCleanlyEverywhere) {
    const uint8_t rgb[9] = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    for (uint8_t storage : {1, 2, 3}) {
        ExpectCleanFailures(
            [&](BI_Bitmap **out) {
                return BI_CreateBlankBmp(3, 8, 9000, 1100, 1, 1, 1, 3, rgb, out, storage, 0, 0, 0);
            },
            storage & 2);
    }
}

TEST_F(Bitmap, BlankCopyFailsCleanlyEverywhere) {
    const uint8_t rgb[9] = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    BI_Bitmap *src = Create(3, 8, 20, 20, 1, 1, 3, rgb);
    ASSERT_NE(src, nullptr);
    const RECT r{0, 0, 9000, 1100};
    for (uint8_t storage : {1, 2, 3})
        ExpectCleanFailures([&](BI_Bitmap **out) { return BI_GetBlankBmp(src, &r, out, storage); },
                            storage & 2);
    BI_DeleteBitmap(&src);
}

}  // namespace
