#include <gtest/gtest.h>

#include <unistd.h>

#include <cstring>
#include <string>
#include <vector>

#include <tessarine/storage.h>

#include "core/status.h"
#include "platform/test_hooks.h"
#include "storage/tile_format.h"
#include "test_support.h"
#include "tile_test_util.h"

namespace {

using tessarine::testing::FileCall;
using tiletest::FileBytes;
using tiletest::I32;

class TileFileTest : public tstest::Sandbox {
  protected:
    // Creates a file and keeps its path and descriptor for the checks.
    int32_t Create(uint8_t bpp, uint32_t width, uint32_t height, uint8_t model = 0,
                   int32_t count = 0, const uint8_t *colors = nullptr, uint8_t user1 = 9) {
        path_[0] = '\0';
        fd_ = -1;
        return HVT_CreateBlankTileBmpFile(2, bpp, width, height, 300.0, 150.0, model, count, colors,
                                          path_, &fd_, user1, 8, 7);
    }
    void Remove() {
        if (fd_ > 0) FM_Close(fd_);
        fd_ = -1;
        if (path_[0]) FM_Delete(path_);
        path_[0] = '\0';
    }
    void TearDown() override {
        Remove();
        tstest::Sandbox::TearDown();
    }
    HVT_FileHeader HeaderOf() {
        uint8_t raw[80];
        EXPECT_EQ(FM_SeekAndRead(fd_, 0, 0, raw, 80), TS_OK);
        HVT_FileHeader h;
        tessarine::storage::DecodeFileHeader(raw, h);
        return h;
    }
    char path_[513] = "";
    int32_t fd_ = -1;
};

TEST_F(TileFileTest, HundredByHundredAtEightBitsIsByteExact) {
    ASSERT_EQ(Create(8, 100, 100), TS_OK);
    EXPECT_GT(fd_, 0);
    EXPECT_EQ(std::string(path_).rfind(Dir() + "/KLOD", 0), 0u) << path_;
    const auto b = FileBytes(path_);
    ASSERT_EQ(b.size(), 116u + 10000u + 1u);
    const uint8_t stamp[6] = {7, 20, 19, 0x44, 0, 1};
    EXPECT_EQ(std::memcmp(b.data(), stamp, 6), 0);
    EXPECT_EQ(b[6], 9);
    EXPECT_EQ(b[7], 8);
    EXPECT_EQ(b[8], 7);
    EXPECT_EQ(b[9], 8);
    EXPECT_EQ(b[10], 0);
    EXPECT_EQ(b[11], 0);
    double xr, yr;
    std::memcpy(&xr, &b[12], 8);
    std::memcpy(&yr, &b[20], 8);
    EXPECT_EQ(xr, 300.0);
    EXPECT_EQ(yr, 150.0);
    EXPECT_EQ(b[28], 0);
    EXPECT_EQ(b[29] | b[30] | b[31], 0);
    EXPECT_EQ(I32(b, 32), 0);
    EXPECT_EQ(b[36], 2);
    EXPECT_EQ(b[37], 1);
    EXPECT_EQ(b[38] | b[39], 0);
    EXPECT_EQ(I32(b, 40), 80) << "colorCount 0 puts the first sub-bitmap at 80";
    EXPECT_EQ(I32(b, 44), 116 + 10000);
    for (int i = 2; i < 10; ++i) EXPECT_EQ(I32(b, 40 + 4 * i), 0);
    // sub-bitmap header and the one tile
    EXPECT_EQ(I32(b, 80), 100);
    EXPECT_EQ(I32(b, 84), 100);
    EXPECT_EQ(I32(b, 88), 1);
    EXPECT_EQ(I32(b, 92), 1);
    EXPECT_EQ(I32(b, 96), 116);
    EXPECT_EQ(I32(b, 100), 0);
    EXPECT_EQ(I32(b, 104), 0);
    EXPECT_EQ(I32(b, 108), 100);
    EXPECT_EQ(I32(b, 112), 100);
    EXPECT_EQ(b[116 + 10000], '.');
    struct stat st {};
    ASSERT_EQ(::stat(path_, &st), 0);
    EXPECT_EQ(st.st_mode & 0777, 0600u);
}

TEST_F(TileFileTest, ColourTableFollowsTheHeader) {
    const uint8_t rgb[9] = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    ASSERT_EQ(Create(8, 10, 2, 1, 3, rgb), TS_OK);
    auto b = FileBytes(path_);
    EXPECT_EQ(I32(b, 32), 3);
    EXPECT_EQ(b[28], 1);
    EXPECT_EQ(std::memcmp(&b[80], rgb, 9), 0);
    EXPECT_EQ(I32(b, 40), 89);
    EXPECT_EQ(I32(b, 89 + 16), 89 + 16 + 20);  // first tile right behind the table
    EXPECT_EQ(b.back(), '.');
    EXPECT_EQ(b.size(), 89u + 16 + 20 + 20 + 1);
    Remove();

    const uint8_t cmyk[8] = {1, 2, 3, 4, 5, 6, 7, 8};
    ASSERT_EQ(Create(4, 3, 1, 2, 2, cmyk), TS_OK);
    b = FileBytes(path_);
    EXPECT_EQ(std::memcmp(&b[80], cmyk, 8), 0);
    EXPECT_EQ(I32(b, 40), 88);
}

TEST_F(TileFileTest, UnknownColourModelMakesNoFile) {
    const uint8_t colors[8] = {};
    fd_ = -1;
    EXPECT_EQ(HVT_CreateBlankTileBmpFile(3, 8, 10, 10, 1, 1, 3, 2, colors, path_, &fd_, 1, 0, 0),
              -1)
        << "the out descriptor still holds -1 at the end";
    fd_ = 12345;
    EXPECT_EQ(HVT_CreateBlankTileBmpFile(3, 8, 10, 10, 1, 1, 0, 2, colors, path_, &fd_, 1, 0, 0),
              -2);
    EXPECT_EQ(fd_, 12345);
    fd_ = -1;
    EXPECT_TRUE(tstest::DirectoryEntries(Dir()).empty());
}

TEST_F(TileFileTest, UserByteZeroGoesToTheFileAsZero) {
    ASSERT_EQ(Create(1, 5, 5, 0, 0, nullptr, 0), TS_OK);
    EXPECT_EQ(FileBytes(path_)[6], 0);
}

TEST_F(TileFileTest, CrossingTileEdgesMakesFourTiles) {
    ASSERT_EQ(Create(8, 8192, 1024), TS_OK);
    auto b = FileBytes(path_);
    EXPECT_EQ(I32(b, 88), 1);
    EXPECT_EQ(I32(b, 92), 1);
    Remove();

    ASSERT_EQ(Create(8, 8193, 1025), TS_OK);
    b = FileBytes(path_);
    ASSERT_EQ(I32(b, 88), 2);
    ASSERT_EQ(I32(b, 92), 2);
    const int32_t first = 80 + 16 + 4 * 20;
    const int32_t expect[4][5] = {{first, 0, 0, 8192, 1024},
                                  {first + 8192 * 1024, 8192, 0, 8193, 1024},
                                  {first + 8193 * 1024, 0, 1024, 8192, 1025},
                                  {first + 8193 * 1024 + 8192, 8192, 1024, 8193, 1025}};
    for (int t = 0; t < 4; ++t)
        for (int f = 0; f < 5; ++f) EXPECT_EQ(I32(b, 96 + 20 * t + 4 * f), expect[t][f]) << t << f;
    EXPECT_EQ(I32(b, 44), first + 8193 * 1025);
    EXPECT_EQ(b.size(), size_t(first) + 8193 * 1025 + 1);
}

TEST_F(TileFileTest, OneBitTileRowsArePackedToTheByte) {
    ASSERT_EQ(Create(1, 8197, 3), TS_OK);
    const auto b = FileBytes(path_);
    const int32_t first = 80 + 16 + 2 * 20;
    EXPECT_EQ(I32(b, 96), first);
    EXPECT_EQ(I32(b, 116), first + 1024 * 3) << "8192 pixels make rows of 1024 bytes";
    EXPECT_EQ(I32(b, 44), first + 1024 * 3 + 1 * 3) << "5 pixels make rows of 1 byte";
}

TEST_F(TileFileTest, SecondSubBitmapBeginsOnTheOldClosingByte) {
    ASSERT_EQ(Create(8, 100, 100), TS_OK);
    HVT_FileHeader h = HeaderOf();
    HVT_SubbmpHdr hdr{};
    uint8_t index = 99;
    ASSERT_EQ(HVT_AddSubbmp(fd_, &h, 50, 40, &hdr, &index), TS_OK);
    EXPECT_EQ(index, 1);
    EXPECT_EQ(hdr.width, 50);
    EXPECT_EQ(hdr.height, 40);
    EXPECT_EQ(hdr.tilesAcross, 1);
    EXPECT_EQ(hdr.tilesDown, 1);
    EXPECT_EQ(h.subbmpCount, 2);
    const auto b = FileBytes(path_);
    const int32_t second = 116 + 10000;
    EXPECT_EQ(I32(b, 44), second);
    EXPECT_EQ(I32(b, 48), second + 36 + 2000);
    EXPECT_EQ(b[37], 2);
    EXPECT_EQ(I32(b, second), 50);
    EXPECT_EQ(I32(b, second + 16), second + 36);
    EXPECT_EQ(b.size(), size_t(second) + 36 + 2000 + 1);
    EXPECT_EQ(b.back(), '.');
}

TEST_F(TileFileTest, TenthSubBitmapIsRefusedAndWritesNothing) {
    ASSERT_EQ(Create(8, 4, 4), TS_OK);
    HVT_FileHeader h = HeaderOf();
    for (int i = 1; i < 9; ++i) ASSERT_EQ(HVT_AddSubbmp(fd_, &h, 3, 3, nullptr, nullptr), TS_OK);
    EXPECT_EQ(h.subbmpCount, 9);
    const auto before = FileBytes(path_);
    const HVT_FileHeader saved = h;
    HVT_SubbmpHdr hdr{-1, -1, -1, -1};
    uint8_t index = 77;
    EXPECT_EQ(HVT_AddSubbmp(fd_, &h, 3, 3, &hdr, &index), -4);
    EXPECT_EQ(index, 77);
    EXPECT_EQ(hdr.width, -1);
    EXPECT_EQ(std::memcmp(&h, &saved, sizeof h), 0);
    EXPECT_EQ(FileBytes(path_), before);
}

TEST_F(TileFileTest, EndOffsetPastThirtyTwoBitsIsMinus40ByAnyAmount) {
    ASSERT_EQ(Create(8, 4, 4), TS_OK);
    HVT_FileHeader h = HeaderOf();
    const auto before = FileBytes(path_);
    EXPECT_EQ(HVT_AddSubbmp(fd_, &h, 70000, 70000, nullptr, nullptr), -40);
    EXPECT_EQ(HVT_AddSubbmp(fd_, &h, 0xFFFFFFFFu, 0xFFFFFFFFu, nullptr, nullptr), -40);
    EXPECT_EQ(HVT_AddSubbmp(fd_, &h, 0, 10, nullptr, nullptr), -40);
    // One row of 1 pixel: end = start + 16 + 20 + height. One past the limit...
    HVT_FileHeader edge = h;
    const int64_t height = 1000;
    edge.subbmpOffset[edge.subbmpCount] = static_cast<int32_t>(INT32_MAX - 16 - 20 - height + 1);
    EXPECT_EQ(HVT_AddSubbmp(fd_, &edge, 1, height, nullptr, nullptr), -40);
    EXPECT_EQ(FileBytes(path_), before) << "nothing written";
    EXPECT_EQ(h.subbmpCount, 1);
    // ...and exactly at it still makes a (sparse) file.
    edge.subbmpOffset[edge.subbmpCount] = static_cast<int32_t>(INT32_MAX - 16 - 20 - height);
    EXPECT_EQ(HVT_AddSubbmp(fd_, &edge, 1, height, nullptr, nullptr), TS_OK);
    EXPECT_EQ(edge.subbmpOffset[2], INT32_MAX);
    struct stat st {};
    ASSERT_EQ(::fstat(fd_, &st), 0);
    EXPECT_EQ(st.st_size, int64_t{INT32_MAX} + 1);
}

TEST_F(TileFileTest, AddSubbmpAllocatesItsTableBeforeJudgingTheEnd) {
    ASSERT_EQ(Create(8, 4, 4), TS_OK);
    HVT_FileHeader h = HeaderOf();
    const HVT_FileHeader saved = h;
    const auto before = FileBytes(path_);
    // 70000 by 70000 at 8 bits passes the limit, but its table of 9 by 69
    // tiles is asked for first: without memory the status is -5.
    tessarine::testing::FailAllocationAt(1);
    EXPECT_EQ(HVT_AddSubbmp(fd_, &h, 70000, 70000, nullptr, nullptr), -5);
    EXPECT_TRUE(tessarine::testing::AllocationFailureHit());
    tessarine::testing::ResetInjection();
    EXPECT_EQ(HVT_AddSubbmp(fd_, &h, 70000, 70000, nullptr, nullptr), -40);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 1);
    // A table that no 32-bit size holds is -40 without asking.
    tessarine::testing::ResetInjection();
    EXPECT_EQ(HVT_AddSubbmp(fd_, &h, 0xFFFFFFFFu, 0xFFFFFFFFu, nullptr, nullptr), -40);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 0);
    EXPECT_EQ(std::memcmp(&h, &saved, sizeof h), 0);
    EXPECT_EQ(FileBytes(path_), before);
}

TEST_F(TileFileTest, CreateTooLargeDeletesTheFileAndKeepsTheDescriptor) {
    EXPECT_EQ(Create(32, 40000, 40000), -40);
    EXPECT_GT(fd_, 0) << "the descriptor is left to the caller";
    EXPECT_EQ(path_[0], '\0');
    EXPECT_TRUE(tstest::DirectoryEntries(Dir()).empty());
}

TEST_F(TileFileTest, ScratchFileThatCannotBeMadeIsMinus1) {
    setenv("TMPDIR", "/nonexistent-dir-for-test", 1);
    // /tmp is the fallback; make that fail too by a path that cannot fit.
    std::string deep = Dir() + "/" + std::string(200, 'd');
    ASSERT_EQ(::mkdir(deep.c_str(), 0700), 0);
    std::string deeper = deep + "/" + std::string(200, 'e');
    ASSERT_EQ(::mkdir(deeper.c_str(), 0700), 0);
    std::string deepest = deeper + "/" + std::string(200, 'f');
    ASSERT_EQ(::mkdir(deepest.c_str(), 0700), 0);
    setenv("TMPDIR", deepest.c_str(), 1);
    EXPECT_EQ(Create(8, 4, 4), -1);
    EXPECT_EQ(fd_, -1);
    EXPECT_TRUE(tstest::DirectoryEntries(deepest).empty());
    ::rmdir(deepest.c_str());
    ::rmdir(deeper.c_str());
    ::rmdir(deep.c_str());
    setenv("TMPDIR", Dir().c_str(), 1);
}

TEST_F(TileFileTest, CreateFailsCleanlyAtEveryAllocation) {
    tstest::ForEachAllocationFailure([&](int64_t n) {
        const int32_t s = Create(8, 9000, 1100);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_TRUE(s == -5 || (n == 1 && s == -1)) << n << " " << s;
            EXPECT_TRUE(tstest::DirectoryEntries(Dir()).empty());
        } else {
            EXPECT_EQ(s, TS_OK);
        }
        Remove();
    });
}

TEST_F(TileFileTest, CreateFailsCleanlyAtEveryWriteAndSeek) {
    const uint8_t rgb[6] = {1, 2, 3, 4, 5, 6};
    for (FileCall kind : {FileCall::Write, FileCall::Seek}) {
        const int64_t calls = tstest::ForEachFileFailure(kind, [&](int64_t) {
            const int32_t s = Create(8, 9000, 1100, 1, 2, rgb);
            if (tessarine::testing::FileFailureHit(kind)) {
                EXPECT_EQ(s, -50);
                EXPECT_GT(fd_, 0) << "descriptor stays with the caller";
                EXPECT_EQ(path_[0], '\0');
                EXPECT_TRUE(tstest::DirectoryEntries(Dir()).empty());
            } else {
                EXPECT_EQ(s, TS_OK);
            }
            Remove();
        });
        EXPECT_EQ(calls, kind == FileCall::Write ? 5 : 4)
            << "colour table, sub-bitmap header, tile table, '.', header";
    }
}

TEST_F(TileFileTest, AddSubbmpFailuresLeaveTheHeaderAsStated) {
    ASSERT_EQ(Create(8, 100, 100), TS_OK);
    const HVT_FileHeader start = HeaderOf();
    tstest::ForEachFileFailure(FileCall::Write, [&](int64_t n) {
        HVT_FileHeader h = start;
        uint8_t index = 99;
        HVT_SubbmpHdr hdr{-1, -1, -1, -1};
        const int32_t s = HVT_AddSubbmp(fd_, &h, 20, 20, &hdr, &index);
        if (!tessarine::testing::FileFailureHit(FileCall::Write)) return;
        EXPECT_EQ(s, -50);
        EXPECT_EQ(index, 1) << "the number is stored first";
        EXPECT_EQ(hdr.width, -1) << "the header out place only on success";
        // writes 1 and 2 (sub-bitmap header, table) come before the count goes up;
        // after a failed '.' or header write the memory is one sub-bitmap ahead
        EXPECT_EQ(h.subbmpCount, n <= 2 ? 1 : 2) << n;
        EXPECT_EQ(h.subbmpOffset[2], n <= 2 ? 0 : 10116 + 16 + 20 + 400) << n;
    });
    tstest::ForEachFileFailure(FileCall::Seek, [&](int64_t n) {
        HVT_FileHeader h = start;
        const int32_t s = HVT_AddSubbmp(fd_, &h, 20, 20, nullptr, nullptr);
        if (!tessarine::testing::FileFailureHit(FileCall::Seek)) return;
        EXPECT_EQ(s, -50);
        // seeks: sub-bitmap header, '.', file header
        EXPECT_EQ(h.subbmpCount, n <= 1 ? 1 : 2) << n;
    });
    tstest::ForEachAllocationFailure([&](int64_t) {
        HVT_FileHeader h = start;
        const int32_t s = HVT_AddSubbmp(fd_, &h, 20, 20, nullptr, nullptr);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(s, -5);
        }
    });
}

TEST_F(TileFileTest, PixelInWhichTile) {
    EXPECT_EQ(HVT_PixelInWhichTile(3, 8191, 0), 0);
    EXPECT_EQ(HVT_PixelInWhichTile(3, 8192, 0), 1);
    EXPECT_EQ(HVT_PixelInWhichTile(3, 8192, 1023), 1);
    EXPECT_EQ(HVT_PixelInWhichTile(3, 8192, 1024), 4);
    EXPECT_EQ(HVT_PixelInWhichTile(3, -1, -1), 0) << "division truncates towards zero";
    EXPECT_EQ(HVT_PixelInWhichTile(3, -8192, 0), -1);
}

// ---- Opening ------------------------------------------------------------------

class TileOpenTest : public TileFileTest {
  protected:
    BI_Bitmap View(int32_t fd) {
        BI_Bitmap b{};
        b.tileFile = fd;
        std::snprintf(b.tilePath, sizeof b.tilePath, "%s", path_);
        return b;
    }
    void Poke(int32_t at, const void *bytes, uint32_t n) {
        ASSERT_EQ(FM_SeekAndWrite(fd_, at, 0, bytes, n), TS_OK);
    }
};

TEST_F(TileOpenTest, OpensOnItsOwnDescriptorAndClosesIt) {
    const uint8_t rgb[6] = {1, 2, 3, 4, 5, 6};
    ASSERT_EQ(Create(24, 9000, 10, 1, 2, rgb), TS_OK);
    const int fds = tstest::OpenDescriptorCount();
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    EXPECT_EQ(info.descriptor, -1);
    BI_Bitmap view = View(-1);
    ASSERT_EQ(HVT_TileFileBegin(&view, &info, 1), TS_OK);
    EXPECT_GT(info.descriptor, 0);
    EXPECT_NE(info.descriptor, fd_);
    EXPECT_EQ(tstest::OpenDescriptorCount(), fds + 1);
    ASSERT_NE(info.header, nullptr);
    EXPECT_EQ(info.header->subbmpCount, 1);
    EXPECT_EQ(info.header->bitsPerPixel, 24);
    EXPECT_EQ(info.header->userByte1, 9);
    ASSERT_NE(info.colorTable, nullptr);
    EXPECT_EQ(std::memcmp(info.colorTable, rgb, 6), 0);
    EXPECT_EQ(info.subbmps[0].width, 9000);
    EXPECT_EQ(info.subbmps[0].height, 10);
    EXPECT_EQ(info.subbmps[0].tilesAcross, 2);
    EXPECT_EQ(info.subbmps[0].tilesDown, 1);
    EXPECT_EQ(info.subbmps[0].tileHdrs, nullptr) << "tables load lazily";
    ASSERT_NE(info.tileBuffer, nullptr);
    EXPECT_EQ(MEM_HdlSize(info.tileBuffer), 24u << 20);
    HVT_TileFileEnd(&info, 1);
    EXPECT_EQ(info.descriptor, -1);
    EXPECT_EQ(info.header, nullptr);
    EXPECT_EQ(info.colorTable, nullptr);
    EXPECT_EQ(info.tileBuffer, nullptr);
    EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
}

TEST_F(TileOpenTest, UsesTheOwnersDescriptorAndLeavesItOpen) {
    ASSERT_EQ(Create(8, 10, 10), TS_OK);
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    BI_Bitmap view = View(fd_);
    ASSERT_EQ(HVT_TileFileBegin(&view, &info, 0), TS_OK);
    EXPECT_EQ(info.descriptor, fd_);
    HVT_TileFileEnd(&info, 0);
    EXPECT_EQ(info.descriptor, fd_);
    EXPECT_EQ(FM_Seek(fd_, 0, 0), TS_OK) << "still open";
}

TEST_F(TileOpenTest, EndReleasesTheSessionBuffers) {
    ASSERT_EQ(Create(8, 10, 10), TS_OK);
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    BI_Bitmap view = View(fd_);
    ASSERT_EQ(HVT_TileFileBegin(&view, &info, 0), TS_OK);
    ASSERT_EQ(HVT_GetSubbmpTileHdrs(0, &info), TS_OK);
    info.readHandle = MEM_AllocHdl(0, 64);
    info.writeHandle = MEM_AllocHdl(0, 32);
    ASSERT_NE(info.readHandle, nullptr);
    ASSERT_NE(info.writeHandle, nullptr);
    info.readBuffer = static_cast<uint8_t *>(MEM_Lock(info.readHandle));
    info.writeBuffer = static_cast<uint8_t *>(MEM_Lock(info.writeHandle));
    HVT_TileFileEnd(&info, 0);  // locked handles are unlocked and freed: the Sandbox sees no leak
    EXPECT_EQ(info.readHandle, nullptr);
    EXPECT_EQ(info.writeHandle, nullptr);
    EXPECT_EQ(info.readBuffer, nullptr);
    EXPECT_EQ(info.writeBuffer, nullptr);
    EXPECT_EQ(info.subbmps[0].tileHdrs, nullptr);
    EXPECT_EQ(info.tileBuffer, nullptr);
    EXPECT_EQ(info.descriptor, fd_);
}

TEST_F(TileOpenTest, CorruptedStampOpensWithoutComplaint) {
    ASSERT_EQ(Create(8, 10, 10), TS_OK);
    const uint8_t junk[6] = {0xFF, 0xFE, 0xFD, 0, 0, 0};
    Poke(0, junk, 6);
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    BI_Bitmap view = View(fd_);
    EXPECT_EQ(HVT_TileFileBegin(&view, &info, 0), TS_OK);
    HVT_TileFileEnd(&info, 0);
}

TEST_F(TileOpenTest, HostileHeadersAreRefusedAndTheRecordClosed) {
    ASSERT_EQ(Create(8, 10, 10), TS_OK);
    struct Case {
        int32_t at;
        std::vector<uint8_t> bytes;
        int32_t status;
    };
    const Case cases[] = {
        {37, {10}, -50},                      // sub-bitmap count above 9
        {28, {1}, -50},                       // colour count set below: does not fit the file
        {28, {7}, -2},                        // colour count with an unknown model
        {40, {0xF0, 0xFF, 0xFF, 0xFF}, -50},  // negative sub-bitmap offset
    };
    const auto original = FileBytes(path_);
    for (const Case &c : cases) {
        Poke(0, original.data(), 80);
        if (c.at == 28) {
            const uint8_t many[4] = {0xFF, 0xFF, 0xFF, 0x7F};
            Poke(32, many, 4);
            if (c.status == -2) {
                const uint8_t two[4] = {2, 0, 0, 0};
                Poke(32, two, 4);
            }
        }
        Poke(c.at, c.bytes.data(), static_cast<uint32_t>(c.bytes.size()));
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        BI_Bitmap view = View(-1);
        EXPECT_EQ(HVT_TileFileBegin(&view, &info, 1), c.status) << c.at;
        EXPECT_EQ(info.descriptor, -1);
        EXPECT_EQ(info.header, nullptr);
        EXPECT_EQ(info.colorTable, nullptr);
    }
}

TEST_F(TileOpenTest, MissingFileIsMinus50) {
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    BI_Bitmap view{};
    view.tileFile = -1;
    std::snprintf(view.tilePath, sizeof view.tilePath, "%s", Path("absent").c_str());
    EXPECT_EQ(HVT_TileFileBegin(&view, &info, 1), -50);
    EXPECT_EQ(info.header, nullptr);
}

TEST_F(TileOpenTest, FailuresAtEveryCallCloseTheRecord) {
    const uint8_t rgb[6] = {1, 2, 3, 4, 5, 6};
    ASSERT_EQ(Create(8, 9000, 1100, 1, 2, rgb), TS_OK);
    HVT_FileHeader h = HeaderOf();
    ASSERT_EQ(HVT_AddSubbmp(fd_, &h, 30, 30, nullptr, nullptr), TS_OK);
    const int fds = tstest::OpenDescriptorCount();
    auto attempt = [&](auto hitFn, int32_t expected) {
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        BI_Bitmap view = View(-1);
        const int32_t s = HVT_TileFileBegin(&view, &info, 1);
        if (hitFn()) {
            EXPECT_EQ(s, expected);
            EXPECT_EQ(info.descriptor, -1);
            EXPECT_EQ(info.header, nullptr);
            EXPECT_EQ(info.colorTable, nullptr);
            EXPECT_EQ(info.tileBuffer, nullptr);
        } else {
            EXPECT_EQ(s, TS_OK);
        }
        HVT_TileFileEnd(&info, 1);
        EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
    };
    EXPECT_EQ(tstest::ForEachAllocationFailure([&](int64_t) {
                  attempt([] { return tessarine::testing::AllocationFailureHit(); }, -5);
              }),
              3);
    EXPECT_EQ(tstest::ForEachFileFailure(
                  FileCall::Read,
                  [&](int64_t) {
                      attempt([] { return tessarine::testing::FileFailureHit(FileCall::Read); },
                              -50);
                  }),
              4)
        << "header, colour table, two sub-bitmap headers";
    EXPECT_EQ(tstest::ForEachFileFailure(
                  FileCall::Seek,
                  [&](int64_t) {
                      attempt([] { return tessarine::testing::FileFailureHit(FileCall::Seek); },
                              -50);
                  }),
              3);
}

// ---- Tile tables and tile rows ---------------------------------------------------------

TEST_F(TileFileTest, TileTableLoadsOnceAndAFailedReadIsNotRetried) {
    tiletest::TileFile f(8, 8193, 1025);
    ASSERT_EQ(f.Status(), TS_OK);
    HVT_FileInfo *info = f.Info();
    tessarine::testing::FailFileCallAt(FileCall::Read, 1);
    EXPECT_EQ(HVT_GetSubbmpTileHdrs(0, info), -50);
    EXPECT_NE(info->subbmps[0].tileHdrs, nullptr);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(HVT_GetSubbmpTileHdrs(0, info), TS_OK);
    EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Read), 0) << "not tried again";
}

TEST_F(TileFileTest, TileTableMatchesTheFile) {
    tiletest::TileFile f(8, 8193, 1025);
    ASSERT_EQ(f.Status(), TS_OK);
    ASSERT_EQ(HVT_GetSubbmpTileHdrs(0, f.Info()), TS_OK);
    const HVT_TileHdr *t = f.Info()->subbmps[0].tileHdrs;
    EXPECT_EQ(t[3].offset, 176 + 8193 * 1024 + 8192);
    EXPECT_EQ(t[3].left, 8192);
    EXPECT_EQ(t[3].top, 1024);
    EXPECT_EQ(t[3].right, 8193);
    EXPECT_EQ(t[3].bottom, 1025);
    EXPECT_EQ(HVT_GetSubbmpTileHdrs(10, f.Info()), -4);
}

TEST_F(TileFileTest, TileTableFailures) {
    tiletest::TileFile f(8, 8193, 1025);
    ASSERT_EQ(f.Status(), TS_OK);
    HVT_FileInfo *info = f.Info();
    auto drop = [&] {
        MEM_FreeHdl(info->subbmps[0].tileHdrs);
        info->subbmps[0].tileHdrs = nullptr;
    };
    tstest::ForEachAllocationFailure([&](int64_t) {
        const int32_t s = HVT_GetSubbmpTileHdrs(0, info);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(s, -5);
            EXPECT_EQ(info->subbmps[0].tileHdrs, nullptr);
        } else {
            drop();
        }
    });
    for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
        tstest::ForEachFileFailure(kind, [&](int64_t) {
            const int32_t s = HVT_GetSubbmpTileHdrs(0, info);
            if (tessarine::testing::FileFailureHit(kind)) {
                EXPECT_EQ(s, -50);
            }
            drop();
        });
    }
}

TEST_F(TileOpenTest, TileTableThatCannotFitTheFileIsRefused) {
    ASSERT_EQ(Create(8, 10, 10), TS_OK);
    const int32_t huge[2] = {INT32_MAX, INT32_MAX};
    Poke(80 + 8, huge, 8);
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    BI_Bitmap view = View(fd_);
    ASSERT_EQ(HVT_TileFileBegin(&view, &info, 0), TS_OK);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(HVT_GetSubbmpTileHdrs(0, &info), -50);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 0) << "refused before allocating";
    EXPECT_EQ(info.subbmps[0].tileHdrs, nullptr);
    const HVT_Box box{0, 0, 10, 10};
    uint8_t buf[200];
    EXPECT_EQ(HVT_ReadBlock(0, &info, &box, 20, buf), -50);
    HVT_TileFileEnd(&info, 0);
}

// Counts that fit a large (sparse) file but not one read are refused before
// anything is allocated for them, so no shorter block stands for them.
TEST_F(TileOpenTest, TablesPastOneReadAreRefusedOnALargeFile) {
    ASSERT_EQ(Create(8, 10, 10), TS_OK);
    ASSERT_EQ(::ftruncate(fd_, int64_t{6} << 30), 0);
    const int32_t manyTiles[2] = {0x10000, 0x1000};  // 2^28 tiles: 5 GiB of table
    Poke(80 + 8, manyTiles, 8);
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    BI_Bitmap view = View(fd_);
    ASSERT_EQ(HVT_TileFileBegin(&view, &info, 0), TS_OK);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(HVT_GetSubbmpTileHdrs(0, &info), -50);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 0);
    EXPECT_EQ(info.subbmps[0].tileHdrs, nullptr);
    const HVT_Box box{0, 0, 10, 10};
    uint8_t buf[200];
    EXPECT_EQ(HVT_ReadBlock(0, &info, &box, 20, buf), -50);
    HVT_TileFileEnd(&info, 0);

    // 0x50000000 CMYK entries: 5 GiB of colour table.
    const uint8_t cmyk = 2;
    const int32_t colors = 0x50000000;
    Poke(28, &cmyk, 1);
    Poke(32, &colors, 4);
    HVT_InitFileInfo(&info);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(HVT_TileFileBegin(&view, &info, 0), -50);
    EXPECT_EQ(tessarine::testing::AllocationCount(), 1) << "the header only";
    EXPECT_EQ(info.header, nullptr);
    EXPECT_EQ(info.colorTable, nullptr);
}

TEST_F(TileOpenTest, HostileTileRecordsAreRefusedWhenUsed) {
    ASSERT_EQ(Create(8, 10, 10), TS_OK);
    const int32_t wide[5] = {116, -100000, 0, 2000000000, 10};
    Poke(96, wide, 20);
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    BI_Bitmap view = View(fd_);
    ASSERT_EQ(HVT_TileFileBegin(&view, &info, 0), TS_OK);
    const HVT_Box box{0, 0, 10, 10};
    uint8_t buf[200];
    EXPECT_EQ(HVT_ReadBlock(0, &info, &box, 20, buf), -50);
    EXPECT_EQ(HVT_SaveBlockWithBitShift(0, &info, &box, 20, buf), -50);
    HVT_TileFileEnd(&info, 0);
}

TEST_F(TileFileTest, TileRowsAreWrittenAndReadWhole) {
    tiletest::TileFile f(1, 8197, 20);
    ASSERT_EQ(f.Status(), TS_OK);
    uint8_t rows[3 * 1024];
    for (int i = 0; i < 3 * 1024; ++i) rows[i] = static_cast<uint8_t>(i * 7);
    ASSERT_EQ(HVT_SaveTile(0, f.Info(), 0, 5, 3, rows), TS_OK);
    const auto b = FileBytes(f.Path());
    const int32_t first = 80 + 16 + 40;
    EXPECT_EQ(std::memcmp(&b[first + 1024 * 5], rows, 3 * 1024), 0);
    uint8_t back[3 * 1024] = {};
    ASSERT_EQ(HVT_ReadTile(0, f.Info(), 0, 5, 2, back), TS_OK);
    EXPECT_EQ(std::memcmp(back, rows, 2 * 1024), 0);
    const uint8_t small[2] = {0xAB, 0xCD};
    ASSERT_EQ(HVT_SaveTile(0, f.Info(), 1, 17, 2, small), TS_OK);  // 5 pixels: 1 byte
    EXPECT_EQ(FileBytes(f.Path())[first + 1024 * 20 + 18], 0xCD);
    EXPECT_EQ(HVT_ReadTile(0, f.Info(), 2, 0, 1, back), -4) << "outside the table";
    // A table not yet loaded is loaded first; without memory that is -5.
    HVT_FileInfo *info = f.Info();
    auto drop = [&] {
        MEM_FreeHdl(info->subbmps[0].tileHdrs);
        info->subbmps[0].tileHdrs = nullptr;
    };
    drop();
    for (int write = 0; write < 2; ++write) {
        tstest::ForEachAllocationFailure([&](int64_t) {
            const int32_t s = write ? HVT_SaveTile(0, info, 0, 0, 2, rows)
                                    : HVT_ReadTile(0, info, 0, 0, 2, back);
            EXPECT_EQ(s, tessarine::testing::AllocationFailureHit() ? -5 : TS_OK);
            drop();
        });
    }
    for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
        tstest::ForEachFileFailure(kind, [&](int64_t) {
            const int32_t s = HVT_ReadTile(0, f.Info(), 0, 0, 2, back);
            if (tessarine::testing::FileFailureHit(kind)) {
                EXPECT_EQ(s, -50);
            }
        });
    }
    for (FileCall kind : {FileCall::Write, FileCall::Seek}) {
        tstest::ForEachFileFailure(kind, [&](int64_t) {
            const int32_t s = HVT_SaveTile(0, f.Info(), 0, 0, 2, rows);
            if (tessarine::testing::FileFailureHit(kind)) {
                EXPECT_EQ(s, -50);
            }
        });
    }
}

}  // namespace
