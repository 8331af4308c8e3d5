// Row and column transfer sessions: band arithmetic, the pending box,
// read-after-write, and what each mode reads and writes.
#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include <tessarine/tessarine.h>

#include "platform/test_hooks.h"
#include "storage/row_services.h"
#include "test_support.h"

namespace {

using tessarine::testing::FileCall;
using tessarine::testing::FileCallCount;
using tessarine::testing::ResetInjection;
using Bytes = std::vector<uint8_t>;

class Session : public tstest::Sandbox {
  protected:
    BI_Bitmap *Make(uint8_t bpp, int32_t width, int32_t height, uint8_t storage = 2) {
        BI_Bitmap *b = nullptr;
        const uint8_t type = bpp == 24 ? 4 : 2;
        EXPECT_EQ(BI_CreateBlankBmp(type, bpp, width, height, 300, 300, 1, 0, nullptr, &b, storage,
                                    0, 0, 0),
                  TS_OK);
        made_.push_back(b);
        return b;
    }
    void TearDown() override {
        for (BI_Bitmap *b : made_) {
            if (b == nullptr) continue;
            HVT_TileFileRowColIOEnd(b);
            BI_DeleteBitmap(&b);
        }
        tstest::Sandbox::TearDown();
    }
    static int64_t Reads() { return FileCallCount(FileCall::Read); }
    static int64_t Writes() { return FileCallCount(FileCall::Write); }
    // Writes row y of an 8-bit gray bitmap with value v everywhere, without a session.
    static void Fill(BI_Bitmap *b, int32_t y, uint8_t v) {
        Bytes row(b->width, v);
        ASSERT_EQ(BI_SetGRow(y, 0, b->width, row.data(), b), TS_OK);
    }
    static uint8_t At(BI_Bitmap *b, int32_t y, int32_t x) {
        uint8_t v = 0;
        EXPECT_EQ(BI_GetGRow(b, y, x, 1, &v), TS_OK);
        return v;
    }
    std::vector<BI_Bitmap *> made_;
};

TEST_F(Session, BitmapInMemoryNeedsNone) {
    BI_Bitmap *m = Make(8, 10, 10, 1);
    EXPECT_EQ(HVT_TileFileRowIOBegin(3, m, nullptr, 2, 0, 0), TS_OK);
    EXPECT_EQ(m->ioSession, nullptr);
    HVT_TileFileRowColIOEnd(m);
    EXPECT_EQ(HVT_RotatedTileFileColIOBegin(1, m, nullptr, 2, 0, 0), TS_OK);
    EXPECT_EQ(m->ioSession, nullptr);
    BI_Bitmap *t = Make(8, 10, 10);
    HVT_TileFileRowColIOEnd(t);  // no session: nothing
    EXPECT_EQ(t->ioSession, nullptr);
}

TEST_F(Session, ThreeThousandRowsOf40000BytesGive512) {
    BI_Bitmap *t = Make(8, 39999, 3000);  // band rows of 39999 + 1 bytes
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, 0), TS_OK);
    HVT_FileInfo *s = t->ioSession;
    ASSERT_NE(s, nullptr);
    EXPECT_EQ(s->bandRowBytes, 40000);
    EXPECT_EQ(s->bandRows, 512);
    EXPECT_EQ(MEM_HdlSize(s->readHandle), 512u * 40000u);
    EXPECT_EQ(s->writeHandle, nullptr);
    EXPECT_EQ(s->readRowBytes, 800);
    EXPECT_EQ(s->writeRowBytes, 800);
    EXPECT_EQ(s->regionBox.right, 39999);
    EXPECT_EQ(s->regionBox.bottom, 3000);
    EXPECT_EQ(s->readBox.top, -1);
    EXPECT_EQ(s->readBox.bottom, -1);
    EXPECT_EQ(s->pendingBox.top, -1);
    HVT_TileFileRowColIOEnd(t);
    EXPECT_EQ(t->ioSession, nullptr);
}

TEST_F(Session, BandArithmetic) {
    BI_Bitmap *t = Make(8, 100, 50);
    // 1024 rows when the budget holds them; a region lower than that limits them
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, 0), TS_OK);
    EXPECT_EQ(t->ioSession->bandRows, 50);
    EXPECT_EQ(t->ioSession->bandRowBytes, 101);
    HVT_TileFileRowColIOEnd(t);
    // budget of 10 rows: 1024 halved to 8
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 3, 0, 101 * 10), TS_OK);
    EXPECT_EQ(t->ioSession->bandRows, 8);
    EXPECT_EQ(t->ioSession->sessionMode, 3);
    HVT_TileFileRowColIOEnd(t);
    // mode 1: a window of 30000 bytes; mode 0 and others: one region row
    ASSERT_EQ(HVT_TileFileRowIOBegin(3, t, nullptr, 1, 0, 0), TS_OK);
    EXPECT_EQ(MEM_HdlSize(t->ioSession->readHandle), 30000u);
    EXPECT_EQ(MEM_HdlSize(t->ioSession->writeHandle), 30000u);
    HVT_TileFileRowColIOEnd(t);
    ASSERT_EQ(HVT_TileFileRowIOBegin(2, t, nullptr, 0, 0, 0), TS_OK);
    EXPECT_EQ(MEM_HdlSize(t->ioSession->writeHandle), 101u);
    EXPECT_EQ(t->ioSession->readHandle, nullptr);
    EXPECT_EQ(t->ioSession->bandRows, 0);
    HVT_TileFileRowColIOEnd(t);
}

TEST_F(Session, RegionLeftMovesToItsByte) {
    BI_Bitmap *b1 = Make(1, 100, 10);
    const HVT_Box box{13, 2, 40, 9};
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, b1, &box, 2, 0, 0), TS_OK);
    EXPECT_EQ(b1->ioSession->regionBox.left, 8);
    EXPECT_EQ(b1->ioSession->regionBox.top, 2);
    EXPECT_EQ(b1->ioSession->bandRowBytes, 40 / 8 - 8 / 8 + 1);
    EXPECT_EQ(b1->ioSession->bandRows, 7);
    HVT_TileFileRowColIOEnd(b1);
    BI_Bitmap *b4 = Make(4, 100, 10);
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, b4, &box, 2, 0, 0), TS_OK);
    EXPECT_EQ(b4->ioSession->regionBox.left, 12);
    HVT_TileFileRowColIOEnd(b4);
    // the column session keeps the left edge as given
    ASSERT_EQ(HVT_RotatedTileFileColIOBegin(1, b4, &box, 2, 0, 0), TS_OK);
    EXPECT_EQ(b4->ioSession->regionBox.left, 13);
    EXPECT_EQ(b4->ioSession->readRowBytes, 0);
    EXPECT_EQ(b4->ioSession->writeBox.top, 0);  // not set
    HVT_TileFileRowColIOEnd(b4);
}

TEST_F(Session, ColumnSessionIsReadOnly) {
    BI_Bitmap *t = Make(8, 100, 10);
    ASSERT_EQ(HVT_RotatedTileFileColIOBegin(3, t, nullptr, 1, 0, 0), TS_OK);
    EXPECT_NE(t->ioSession->readHandle, nullptr);
    EXPECT_EQ(t->ioSession->writeHandle, nullptr);
    EXPECT_EQ(MEM_HdlSize(t->ioSession->readHandle), 101u);  // no 30000-byte window
    HVT_TileFileRowColIOEnd(t);
    ASSERT_EQ(HVT_RotatedTileFileColIOBegin(2, t, nullptr, 2, 0, 0), TS_OK);
    EXPECT_EQ(t->ioSession->readHandle, nullptr);
    EXPECT_EQ(t->ioSession->readBox.top, 0);  // returns before the buffers and boxes
    EXPECT_EQ(t->ioSession->bandRows, 0);
    HVT_TileFileRowColIOEnd(t);
}

TEST_F(Session, NoBandFitsGives29) {
    BI_Bitmap *t = Make(8, 100, 10);
    const HVT_Box flat{0, 4, 100, 4};
    EXPECT_EQ(HVT_TileFileRowIOBegin(1, t, &flat, 2, 0, 0), -29);
    EXPECT_EQ(t->ioSession, nullptr);
    EXPECT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, 100), -29);  // below one row of 101
    EXPECT_EQ(t->ioSession, nullptr);
    EXPECT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, -5), -29);
    EXPECT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, 101), TS_OK);
    EXPECT_EQ(t->ioSession->bandRows, 1);
    HVT_TileFileRowColIOEnd(t);
}

TEST_F(Session, BandsAlignToRowZeroOfTheImage) {
    BI_Bitmap *t = Make(8, 16, 40);
    for (int y = 0; y < 40; ++y) Fill(t, y, static_cast<uint8_t>(y));
    const HVT_Box region{0, 6, 16, 37};
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, t, &region, 2, 0, 16 * 8 + 8 * 8), TS_OK);
    HVT_FileInfo *s = t->ioSession;
    ASSERT_EQ(s->bandRows, 8);
    EXPECT_EQ(At(t, 6, 3), 6);
    EXPECT_EQ(s->readBox.top, 6);  // band 0..8, cut at the region's top
    EXPECT_EQ(s->readBox.bottom, 8);
    EXPECT_EQ(At(t, 9, 0), 9);
    EXPECT_EQ(s->readBox.top, 8);
    EXPECT_EQ(s->readBox.bottom, 16);
    EXPECT_EQ(At(t, 36, 15), 36);
    EXPECT_EQ(s->readBox.top, 32);
    EXPECT_EQ(s->readBox.bottom, 37);
    uint8_t v;
    // outside the region: -1 in the low 16 bits only
    EXPECT_EQ(BI_GetGRow(t, 37, 0, 1, &v), 0xFFFF);
    EXPECT_EQ(TS_STATUS(BI_GetGRow(t, 5, 0, 1, &v)), -1);
    HVT_TileFileRowColIOEnd(t);
}

TEST_F(Session, ReadsTheFileOncePerBand) {
    BI_Bitmap *t = Make(8, 64, 2100);
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, 0), TS_OK);
    ASSERT_EQ(t->ioSession->bandRows, 1024);
    uint8_t row[64];
    ASSERT_EQ(BI_GetGRow(t, 0, 0, 64, row), TS_OK);
    ResetInjection();
    ASSERT_EQ(BI_GetGRow(t, 1, 0, 64, row), TS_OK);
    ASSERT_EQ(BI_GetGRow(t, 2, 0, 64, row), TS_OK);
    ASSERT_EQ(BI_GetGRow(t, 1023, 0, 64, row), TS_OK);
    EXPECT_EQ(Reads(), 0);  // all in the band of row 0
    ASSERT_EQ(BI_GetGRow(t, 1024, 0, 64, row), TS_OK);
    const int64_t band = Reads();
    EXPECT_GE(band, 1);
    ASSERT_EQ(BI_GetGRow(t, 1023, 0, 64, row), TS_OK);
    EXPECT_EQ(Reads(), 2 * band);
    HVT_TileFileRowColIOEnd(t);
}

TEST_F(Session, WritesGoInOrderWithNoGap) {
    BI_Bitmap *t = Make(8, 16, 40);
    ASSERT_EQ(HVT_TileFileRowIOBegin(2, t, nullptr, 2, 0, 0), TS_OK);
    const Bytes row(16, 7);
    for (int y : {5, 6, 7}) { ASSERT_EQ(BI_SetGRow(y, 0, 16, row.data(), t), TS_OK); }
    EXPECT_EQ(BI_SetGRow(20, 0, 16, row.data(), t), 0xFFFF);
    EXPECT_EQ(TS_STATUS(BI_SetGRow(3, 0, 16, row.data(), t)), -1);
    EXPECT_EQ(BI_SetGRow(6, 0, 16, row.data(), t), TS_OK);  // a pending row again
    EXPECT_EQ(BI_SetGRow(8, 0, 16, row.data(), t), TS_OK);
    EXPECT_EQ(t->ioSession->pendingBox.top, 5);
    EXPECT_EQ(t->ioSession->pendingBox.bottom, 9);
    EXPECT_EQ(TS_STATUS(BI_SetGRow(40, 0, 16, row.data(), t)), -1);  // outside the region
    HVT_TileFileRowColIOEnd(t);
}

TEST_F(Session, PendingGrowsUpwardsByOne) {
    BI_Bitmap *t = Make(8, 16, 40);
    for (int y = 0; y < 40; ++y) Fill(t, y, 1);
    ASSERT_EQ(HVT_TileFileRowIOBegin(2, t, nullptr, 2, 0, 0), TS_OK);
    const Bytes row(16, 9);
    for (int y : {5, 6, 4, 3}) ASSERT_EQ(BI_SetGRow(y, 0, 16, row.data(), t), TS_OK) << y;
    EXPECT_EQ(t->ioSession->pendingBox.top, 3);
    EXPECT_EQ(t->ioSession->pendingBox.bottom, 7);
    HVT_TileFileRowColIOEnd(t);
    for (int y = 0; y < 10; ++y) EXPECT_EQ(At(t, y, 8), y >= 3 && y < 7 ? 9 : 1) << y;
}

TEST_F(Session, ABandChangeSavesWhatIsPending) {
    BI_Bitmap *t = Make(8, 16, 3000);
    ASSERT_EQ(HVT_TileFileRowIOBegin(2, t, nullptr, 2, 0, 0), TS_OK);
    const Bytes row(16, 42);
    ResetInjection();
    ASSERT_EQ(BI_SetGRow(10, 0, 16, row.data(), t), TS_OK);
    ASSERT_EQ(BI_SetGRow(11, 0, 16, row.data(), t), TS_OK);
    EXPECT_EQ(Writes(), 0);  // still in the buffer
    ASSERT_EQ(BI_SetGRow(2000, 0, 16, row.data(), t), TS_OK);
    EXPECT_GE(Writes(), 1);
    ResetInjection();
    HVT_TileFileRowColIOEnd(t);
    EXPECT_GE(Writes(), 1);
    EXPECT_EQ(At(t, 10, 0), 42);
    EXPECT_EQ(At(t, 11, 15), 42);
    EXPECT_EQ(At(t, 2000, 3), 42);
}

TEST_F(Session, EndWithNothingPendingWritesNothing) {
    BI_Bitmap *t = Make(8, 16, 40);
    ASSERT_EQ(HVT_TileFileRowIOBegin(3, t, nullptr, 2, 0, 0), TS_OK);
    uint8_t v[16];
    ASSERT_EQ(BI_GetGRow(t, 3, 0, 16, v), TS_OK);
    ResetInjection();
    HVT_TileFileRowColIOEnd(t);
    EXPECT_EQ(Writes(), 0);
}

TEST_F(Session, ReadAfterWriteOfARowTheReadBandHolds) {
    BI_Bitmap *t = Make(8, 16, 40);
    for (int y = 0; y < 40; ++y) Fill(t, y, 1);
    for (uint8_t mode : {1, 2}) {
        ASSERT_EQ(HVT_TileFileRowIOBegin(3, t, nullptr, mode, 0, 0), TS_OK);
        uint8_t v[16];
        ASSERT_EQ(BI_GetGRow(t, 4, 0, 16, v), TS_OK);  // the band (or window) is read first
        const Bytes row(16, static_cast<uint8_t>(50 + mode));
        ASSERT_EQ(BI_SetGRow(4, 0, 16, row.data(), t), TS_OK);
        ASSERT_EQ(BI_GetGRow(t, 4, 0, 16, v), TS_OK);
        EXPECT_EQ(Bytes(v, v + 16), row) << int(mode);
        HVT_TileFileRowColIOEnd(t);
    }
}

// A write into a band that no read has loaded yet is not in the read buffer:
// the band read that follows comes from the file, which has not seen the
// write. After the end of the session the file has it.
TEST_F(Session, ReadOfAWrittenRowBeforeItsBandWasRead) {
    BI_Bitmap *t = Make(8, 16, 40);
    for (int y = 0; y < 40; ++y) Fill(t, y, 1);
    ASSERT_EQ(HVT_TileFileRowIOBegin(3, t, nullptr, 2, 0, 0), TS_OK);
    const Bytes row(16, 77);
    ASSERT_EQ(BI_SetGRow(4, 0, 16, row.data(), t), TS_OK);
    uint8_t v[16];
    ASSERT_EQ(BI_GetGRow(t, 4, 0, 16, v), TS_OK);
    EXPECT_EQ(v[0], 1);
    HVT_TileFileRowColIOEnd(t);
    EXPECT_EQ(At(t, 4, 0), 77);
}

TEST_F(Session, WindowReadOverPendingRowsSavesThemFirst) {
    BI_Bitmap *t = Make(8, 32, 40);
    for (int y = 0; y < 40; ++y) Fill(t, y, 1);
    ASSERT_EQ(HVT_TileFileRowIOBegin(3, t, nullptr, 1, 0, 0), TS_OK);
    HVT_FileInfo *s = t->ioSession;
    const Bytes row(8, 33);
    ASSERT_EQ(BI_SetGRow(10, 4, 8, row.data(), t), TS_OK);
    ASSERT_EQ(BI_SetGRow(11, 4, 8, row.data(), t), TS_OK);
    EXPECT_EQ(s->writeBox.top, 10);
    EXPECT_EQ(s->writeBox.bottom, 18);  // a window of count rows
    EXPECT_EQ(s->writeRowBytes, 8);
    EXPECT_EQ(s->pendingBox.bottom, 12);
    // a row past the pending ones raises the bottom by one
    ASSERT_EQ(BI_SetGRow(14, 4, 8, row.data(), t), TS_OK);
    EXPECT_EQ(s->pendingBox.bottom, 13);
    ResetInjection();
    uint8_t v[4];
    ASSERT_EQ(BI_GetGRow(t, 11, 0, 4, v), TS_OK);  // (0..4) does not meet the pending columns
    EXPECT_EQ(Writes(), 0);
    ASSERT_EQ(BI_GetGRow(t, 11, 2, 4, v), TS_OK);
    EXPECT_GE(Writes(), 1);
    EXPECT_EQ(s->pendingBox.top, -1);
    EXPECT_EQ(s->writeBox.top, -1);
    EXPECT_EQ(Bytes(v, v + 4), (Bytes{1, 1, 33, 33}));
    EXPECT_EQ(s->readRowBytes, 4);
    EXPECT_EQ(s->readBox.bottom, 15);
    HVT_TileFileRowColIOEnd(t);
    EXPECT_EQ(At(t, 11, 4), 33);
    EXPECT_EQ(At(t, 14, 4), 1);  // past the pending rows when they were saved: lost
}

TEST_F(Session, ModeZeroWritesEachRowAtOnce) {
    BI_Bitmap *t = Make(1, 64, 4);
    const uint8_t ones[8] = {0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF};
    ASSERT_EQ(BI_SetBWPackedRow(1, 0, 64, ones, t), TS_OK);
    ASSERT_EQ(HVT_TileFileRowIOBegin(3, t, nullptr, 0, 0, 0), TS_OK);
    ResetInjection();
    const uint8_t flags[16] = {};
    ASSERT_EQ(BI_SetBWRow(1, 5, 6, flags, t), TS_OK);
    EXPECT_GE(Writes(), 1);
    uint8_t packed[8];
    ASSERT_EQ(BI_GetBWPackedRow(t, 1, 0, 16, packed), TS_OK);
    EXPECT_EQ(packed[0], 0xF8);
    EXPECT_EQ(packed[1], 0x1F);
    HVT_TileFileRowColIOEnd(t);
}

TEST_F(Session, ASessionPresentIsReplacedWithoutALook) {
    BI_Bitmap *t = Make(8, 16, 8);
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, 0), TS_OK);
    HVT_FileInfo *first = t->ioSession;
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 0, 0, 0), TS_OK);
    EXPECT_NE(t->ioSession, first);
    HVT_TileFileRowColIOEnd(t);
    // the first is the caller's to clean up now
    HVT_TileFileEnd(first, 0);
    MEM_FreePtr(first);
}

TEST_F(Session, ReachesSubBitmapsAndTilesAcross) {
    BI_Bitmap *t = Make(8, 8200, 1030);
    Bytes row(8200);
    ASSERT_EQ(HVT_TileFileRowIOBegin(2, t, nullptr, 2, 0, 8201 * 16), TS_OK);
    ASSERT_EQ(t->ioSession->bandRows, 16);
    for (int y = 0; y < 1030; ++y) {
        for (int x = 0; x < 8200; ++x) row[x] = static_cast<uint8_t>(x * 7 + y);
        ASSERT_EQ(BI_SetGRow(y, 0, 8200, row.data(), t), TS_OK);
    }
    HVT_TileFileRowColIOEnd(t);
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, 0), TS_OK);
    for (int y : {0, 1023, 1024, 1029}) {
        ASSERT_EQ(BI_GetGRow(t, y, 8180, 20, row.data()), TS_OK);
        for (int x = 0; x < 20; ++x) { ASSERT_EQ(row[x], static_cast<uint8_t>((8180 + x) * 7 + y)); }
    }
    HVT_TileFileRowColIOEnd(t);
    // a second sub-bitmap through its own session
    HVT_FileHeader header;
    {
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        ASSERT_EQ(HVT_TileFileBegin(t, &info, 0), TS_OK);
        header = *info.header;
        HVT_TileFileEnd(&info, 0);
    }
    uint8_t sub = 0;
    ASSERT_EQ(HVT_AddSubbmp(t->tileFile, &header, 30, 20, nullptr, &sub), TS_OK);
    ASSERT_EQ(sub, 1);
    ASSERT_EQ(HVT_TileFileRowIOBegin(3, t, nullptr, 2, 1, 0), TS_OK);
    EXPECT_EQ(t->ioSession->regionBox.right, 30);
    EXPECT_EQ(t->ioSession->bandRows, 20);
    const Bytes small(30, 99);
    for (int y = 0; y < 20; ++y) { ASSERT_EQ(BI_SetGRow(y, 0, 30, small.data(), t), TS_OK); }
    HVT_TileFileRowColIOEnd(t);
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 1, 0), TS_OK);
    ASSERT_EQ(BI_GetGRow(t, 19, 0, 30, row.data()), TS_OK);
    EXPECT_EQ(Bytes(row.begin(), row.begin() + 30), small);
    HVT_TileFileRowColIOEnd(t);
    EXPECT_EQ(At(t, 19, 0), static_cast<uint8_t>(19));  // sub-bitmap 0 untouched
    EXPECT_EQ(HVT_TileFileRowIOBegin(1, t, nullptr, 2, 10, 0), -4);
}

TEST_F(Session, BlockReadGivesAColumn) {
    for (uint8_t storage : {1, 2}) {
        BI_Bitmap *t = Make(8, 16, 10, storage);
        for (int y = 0; y < 10; ++y) Fill(t, y, static_cast<uint8_t>(y * 3));
        const HVT_Box column{5, 2, 6, 9};
        int32_t stride = 0;
        uint8_t *p = nullptr;
        void *temp = nullptr;
        ASSERT_EQ(tessarine::storage::BI_LockBlockRead(t, &column, &stride, &p, &temp), TS_OK);
        for (int i = 0; i < 7; ++i) { EXPECT_EQ(p[i * stride], (i + 2) * 3); }
        if (storage == 1) {
            EXPECT_EQ(stride, 16);
            EXPECT_EQ(temp, nullptr);
            MEM_Unlock(t->pixelHandle);
        } else {
            EXPECT_EQ(stride, 1);
            ASSERT_NE(temp, nullptr);
            MEM_FreePtr(temp);
        }
        const HVT_Box outside{5, 2, 17, 9};
        EXPECT_EQ(tessarine::storage::BI_LockBlockRead(t, &outside, &stride, &p, &temp), -1);
    }
}

TEST_F(Session, InternalRowServiceShapes) {
    namespace ts = tessarine::storage;
    BI_Bitmap *t = Make(8, 16, 10);
    HVT_Box box{2, 3, 6, 4};
    uint8_t *row = nullptr;
    void *temp = nullptr;
    HVT_FileInfo *alone = nullptr;
    ASSERT_EQ(ts::BI_LockRowWrite(t, &box, &row, &temp, &alone), TS_OK);
    ASSERT_NE(alone, nullptr);
    std::memset(row, 5, 4);
    EXPECT_EQ(ts::BI_UnlockRowWrite(t, &alone, &box, row, &temp), TS_OK);
    EXPECT_EQ(temp, nullptr);
    EXPECT_EQ(alone, nullptr);
    ASSERT_EQ(ts::BI_LockRowRead(t, 3, 2, 4, &row, &temp), TS_OK);
    EXPECT_EQ(Bytes(row, row + 4), Bytes(4, 5));
    MEM_FreePtr(temp);
}

}  // namespace
