// Failure injection on the session functions and on rows in a session.
#include <gtest/gtest.h>

#include <vector>

#include <tessarine/tessarine.h>

#include "platform/test_hooks.h"
#include "test_support.h"

namespace {

using tessarine::testing::AllocationFailureHit;
using tessarine::testing::FileCall;
using tessarine::testing::FileFailureHit;
using tessarine::testing::LiveBlocks;
using Bytes = std::vector<uint8_t>;

class SessionFailure : public tstest::Sandbox {
  protected:
    BI_Bitmap *Make(bool ownDescriptor) {
        BI_Bitmap *b = nullptr;
        EXPECT_EQ(BI_CreateBlankBmp(2, 8, 40, 30, 300, 300, 1, 0, nullptr, &b, 2, 0, 0, 0), TS_OK);
        const Bytes row(40, 3);
        for (int y = 0; y < 30; ++y) { EXPECT_EQ(BI_SetGRow(y, 0, 40, row.data(), b), TS_OK); }
        if (ownDescriptor) {
            FM_Close(b->tileFile);
            b->tileFile = -1;
        }
        return b;
    }
    static uint8_t At(BI_Bitmap *b, int y, int x) {
        uint8_t v = 0;
        EXPECT_EQ(BI_GetGRow(b, y, x, 1, &v), TS_OK);
        return v;
    }
};

TEST_F(SessionFailure, BeginAllocationFailures) {
    for (bool own : {false, true}) {
        for (bool rotated : {false, true}) {
            for (uint8_t mode : {0, 1, 2}) {
                BI_Bitmap *b = Make(own);
                const int fds = tstest::OpenDescriptorCount();
                const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
                    const int32_t s = rotated ? HVT_RotatedTileFileColIOBegin(3, b, nullptr, mode, 0, 0)
                                              : HVT_TileFileRowIOBegin(3, b, nullptr, mode, 0, 0);
                    if (AllocationFailureHit()) {
                        EXPECT_EQ(s, -5);
                        EXPECT_EQ(b->ioSession, nullptr);
                        EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
                    } else {
                        EXPECT_EQ(s, TS_OK);
                        HVT_TileFileRowColIOEnd(b);
                    }
                });
                EXPECT_GE(made, rotated ? 4 : 5);  // record, header, tile buffer, buffers
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
                BI_DeleteBitmap(&b);
            }
        }
    }
}

TEST_F(SessionFailure, BeginReadAndSeekFailures) {
    for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
        for (bool own : {false, true}) {
            BI_Bitmap *b = Make(own);
            const int fds = tstest::OpenDescriptorCount();
            const int64_t live = LiveBlocks();
            tstest::ForEachFileFailure(kind, [&](int64_t) {
                const int32_t s = HVT_TileFileRowIOBegin(3, b, nullptr, 2, 0, 0);
                if (FileFailureHit(kind)) {
                    EXPECT_EQ(s, -50);
                    EXPECT_EQ(b->ioSession, nullptr);
                } else {
                    EXPECT_EQ(s, TS_OK);
                    HVT_TileFileRowColIOEnd(b);
                }
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
                EXPECT_EQ(LiveBlocks(), live);
            });
            BI_DeleteBitmap(&b);
        }
    }
}

TEST_F(SessionFailure, BandReadFailuresAreReportedAndRetried) {
    for (uint8_t mode : {0, 1, 2}) {
        for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
            BI_Bitmap *b = Make(false);
            ASSERT_EQ(HVT_TileFileRowIOBegin(1, b, nullptr, mode, 0, 41 * 4), TS_OK);
            uint8_t first;
            ASSERT_EQ(BI_GetGRow(b, 0, 0, 1, &first), TS_OK);  // loads the tile table
            const int64_t live = LiveBlocks();
            tstest::ForEachFileFailure(kind, [&](int64_t) {
                Bytes out(40, 0xEE);
                const int32_t s = BI_GetGRow(b, 7, 2, 30, out.data());
                if (FileFailureHit(kind)) {
                    EXPECT_EQ(s, -50);
                    EXPECT_EQ(out, Bytes(40, 0xEE));
                    EXPECT_EQ(b->ioSession->readBox.top, -1);
                } else {
                    EXPECT_EQ(s, TS_OK);
                    EXPECT_EQ(out[0], 3);
                }
                EXPECT_EQ(LiveBlocks(), live);
            });
            HVT_TileFileRowColIOEnd(b);
            BI_DeleteBitmap(&b);
        }
    }
}

TEST_F(SessionFailure, SavingPendingRowsOnABandChange) {
    for (FileCall kind : {FileCall::Write, FileCall::Seek}) {
        BI_Bitmap *b = Make(false);
        ASSERT_EQ(HVT_TileFileRowIOBegin(2, b, nullptr, 2, 0, 40 * 8 + 8 * 8), TS_OK);
        ASSERT_EQ(b->ioSession->bandRows, 8);
        const Bytes row(40, 9);
        // part of row 0 first: its read loads the tile table, which a failed
        // load would leave unusable for the rest of the session
        ASSERT_EQ(BI_SetGRow(0, 0, 20, row.data(), b), TS_OK);
        ASSERT_EQ(BI_SetGRow(0, 0, 40, row.data(), b), TS_OK);
        tessarine::testing::FailFileCallAt(kind, 1);
        EXPECT_EQ(BI_SetGRow(8, 0, 40, row.data(), b), -50);  // the save of rows 0 to 1
        EXPECT_TRUE(FileFailureHit(kind));
        tessarine::testing::ResetInjection();
        // the pending rows are still there and go at the next chance
        EXPECT_EQ(BI_SetGRow(8, 0, 40, row.data(), b), TS_OK);
        HVT_TileFileRowColIOEnd(b);
        EXPECT_EQ(At(b, 0, 5), 9);
        EXPECT_EQ(At(b, 8, 5), 9);
        BI_DeleteBitmap(&b);
    }
}

TEST_F(SessionFailure, EndDropsAFailedSave) {
    for (bool own : {false, true}) {
        for (FileCall kind : {FileCall::Write, FileCall::Seek, FileCall::Read}) {
            BI_Bitmap *b = Make(own);
            const int fds = tstest::OpenDescriptorCount();
            ASSERT_EQ(HVT_TileFileRowIOBegin(2, b, nullptr, 2, 0, 0), TS_OK);
            const Bytes row(10, 9);
            ASSERT_EQ(BI_SetGRow(4, 5, 10, row.data(), b), TS_OK);  // part of a row: read first
            tessarine::testing::FailFileCallAt(kind, 1);
            HVT_TileFileRowColIOEnd(b);
            const bool hit = FileFailureHit(kind);
            tessarine::testing::ResetInjection();
            EXPECT_EQ(b->ioSession, nullptr);
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            if (kind != FileCall::Read) { EXPECT_TRUE(hit); }
            EXPECT_EQ(At(b, 4, 6), hit ? 3 : 9);
            BI_DeleteBitmap(&b);
        }
    }
}

TEST_F(SessionFailure, PartialRowReadFirstInABand) {
    BI_Bitmap *b = Make(false);
    ASSERT_EQ(HVT_TileFileRowIOBegin(3, b, nullptr, 2, 0, 41 * 4), TS_OK);
    uint8_t first;
    ASSERT_EQ(BI_GetGRow(b, 0, 0, 1, &first), TS_OK);  // loads the tile table
    const Bytes row(10, 9);
    tessarine::testing::FailFileCallAt(FileCall::Read, 1);
    EXPECT_EQ(BI_SetGRow(4, 5, 10, row.data(), b), -50);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(b->ioSession->pendingBox.bottom, 4);  // not taken
    EXPECT_EQ(BI_SetGRow(4, 5, 10, row.data(), b), TS_OK);
    HVT_TileFileRowColIOEnd(b);
    EXPECT_EQ(At(b, 4, 4), 3);
    EXPECT_EQ(At(b, 4, 5), 9);
    BI_DeleteBitmap(&b);
}

TEST_F(SessionFailure, WindowModeSaveAndReadFailures) {
    BI_Bitmap *b = Make(false);
    ASSERT_EQ(HVT_TileFileRowIOBegin(3, b, nullptr, 1, 0, 0), TS_OK);
    const Bytes row(8, 9);
    ASSERT_EQ(BI_SetGRow(10, 4, 8, row.data(), b), TS_OK);
    uint8_t v[8];
    tessarine::testing::FailFileCallAt(FileCall::Write, 1);
    EXPECT_EQ(BI_GetGRow(b, 10, 6, 4, v), -50);  // the pending rows go first, and fail
    tessarine::testing::ResetInjection();
    tessarine::testing::FailFileCallAt(FileCall::Read, 1);
    EXPECT_EQ(BI_GetGRow(b, 10, 6, 4, v), -50);
    tessarine::testing::ResetInjection();
    ASSERT_EQ(BI_GetGRow(b, 10, 6, 4, v), TS_OK);
    EXPECT_EQ(v[0], 9);
    HVT_TileFileRowColIOEnd(b);
    BI_DeleteBitmap(&b);
}

TEST_F(SessionFailure, ModeZeroWriteFailureIsNotReported) {
    BI_Bitmap *b = Make(false);
    ASSERT_EQ(HVT_TileFileRowIOBegin(2, b, nullptr, 0, 0, 0), TS_OK);
    const Bytes row(40, 9);
    tessarine::testing::FailFileCallAt(FileCall::Write, 1);
    EXPECT_EQ(BI_SetGRow(3, 0, 40, row.data(), b), TS_OK);
    EXPECT_TRUE(FileFailureHit(FileCall::Write));
    tessarine::testing::ResetInjection();
    HVT_TileFileRowColIOEnd(b);
    EXPECT_EQ(At(b, 3, 0), 3);
    BI_DeleteBitmap(&b);
}

}  // namespace
