// Failure injection on the row functions of a tile-backed bitmap without a
// session: every allocation, read, write and seek they make.
#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

#include <tessarine/tessarine.h>

#include "platform/test_hooks.h"
#include "row_model.h"
#include "storage/row_services.h"
#include "test_support.h"

namespace {

using tessarine::testing::FileCall;
using Bytes = std::vector<uint8_t>;

struct Call {
    const char *name;
    const rowtest::Layout *layout;
    bool writes;
    // Runs the function into (or from) `buffer`; returns its status.
    std::function<int32_t(BI_Bitmap *, uint8_t *)> run;
};

const rowtest::Layout kGray4{"gray4", 2, 4, 1, 0};
const rowtest::Layout kRgb{"rgb24", 4, 24, 1, 0};
const rowtest::Layout kCmyk{"cmyk32", 4, 32, 2, 0};
const rowtest::Layout kBw{"bw1", 1, 1, 1, 0};
const rowtest::Layout kIdx{"idx4rgb", 3, 4, 1, 11};

std::vector<Call> Calls() {
    constexpr int32_t y = 2, x = 3, n = 9;
    return {
        {"GetRGBRow", &kGray4, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetRGBRow(b, y, x, n, p, p + 32, p + 64); }},
        {"GetRGBRowInterlace", &kRgb, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetRGBRowInterlace(b, y, x, n, p); }},
        {"GetBGRRowInterlace", &kIdx, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetBGRRowInterlace(b, y, x, n, p); }},
        {"GetCMYKRow", &kCmyk, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetCMYKRow(b, y, x, n, p, p + 32, p + 64, p + 96); }},
        {"GetIndexRow", &kIdx, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetIndexRow(b, y, x, n, p); }},
        {"GetPaddedIndexRow", &kIdx, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetPaddedIndexRow(b, y, x, n, p); }},
        {"GetGRow", &kGray4, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetGRow(b, y, x, n, p); }},
        {"GetPaddedGRow", &kRgb, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetPaddedGRow(b, y, 0, n, p); }},
        {"GetBWRow", &kBw, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetBWRow(b, y, x, n, p); }},
        {"GetBWPackedRow", &kBw, false, [](BI_Bitmap *b, uint8_t *p) { return BI_GetBWPackedRow(b, y, x, n, p); }},
        {"SetRGBRow", &kIdx, true, [](BI_Bitmap *b, uint8_t *p) { return BI_SetRGBRow(y, x, n, p, p + 32, p + 64, b); }},
        {"SetRGBRowInterlace", &kRgb, true, [](BI_Bitmap *b, uint8_t *p) { return BI_SetRGBRowInterlace(y, x, n, p, b); }},
        {"SetBGRRowInterlace", &kRgb, true, [](BI_Bitmap *b, uint8_t *p) { return BI_SetBGRRowInterlace(y, x, n, p, b); }},
        {"SetCMYKRow", &kCmyk, true, [](BI_Bitmap *b, uint8_t *p) { return BI_SetCMYKRow(y, x, n, p, p + 32, p + 64, p + 96, b); }},
        {"SetIndexRow", &kIdx, true, [](BI_Bitmap *b, uint8_t *p) { return BI_SetIndexRow(y, x, n, p, b); }},
        {"SetGRow", &kGray4, true, [](BI_Bitmap *b, uint8_t *p) { return BI_SetGRow(y, x, n, p, b); }},
        {"SetBWRow", &kBw, true, [](BI_Bitmap *b, uint8_t *p) { return BI_SetBWRow(y, x, n, p, b); }},
        {"SetBWPackedRow", &kBw, true, [](BI_Bitmap *b, uint8_t *p) { return BI_SetBWPackedRow(y, x, n, p, b); }},
    };
}

class RowFailure : public tstest::Sandbox {
  protected:
    // A tile bitmap of the layout with known pixels; the file closed between
    // calls when `ownDescriptor`.
    BI_Bitmap *Make(const rowtest::Layout &l, bool ownDescriptor) {
        const auto img = rowtest::RandomImage(20, 5, l.d, 7);
        const auto table = rowtest::RandomTable(l, 8);
        return rowtest::MakeBitmap(l, ownDescriptor ? rowtest::Route::AloneOwnFd : rowtest::Route::Alone,
                                   img, table);
    }
};

TEST_F(RowFailure, AllocationFailures) {
    for (bool own : {false, true}) {
        for (const Call &c : Calls()) {
            SCOPED_TRACE(std::string(c.name) + (own ? " file closed" : " file open"));
            BI_Bitmap *b = Make(*c.layout, own);
            const auto before = rowtest::ReadImage(b);
            const int fds = tstest::OpenDescriptorCount();
            const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
                Bytes buf(160, 0x5A);
                const int32_t s = c.run(b, buf.data());
                if (tessarine::testing::AllocationFailureHit()) {
                    if (c.writes && s == TS_OK) {
                        // the tile table of the save, in the unlock: not reported
                        EXPECT_TRUE(rowtest::ReadImage(b) == before);
                    } else {
                        EXPECT_EQ(s, -5);
                        if (!c.writes) {
                            EXPECT_EQ(buf, Bytes(160, 0x5A));  // outputs keep what they held
                        }
                    }
                } else {
                    EXPECT_EQ(s, TS_OK);
                }
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            });
            EXPECT_GE(made, 2);  // the file's state and the temporary row at least
            if (!c.writes) { EXPECT_TRUE(rowtest::ReadImage(b) == before); }
            BI_DeleteBitmap(&b);
        }
    }
}

TEST_F(RowFailure, ReadAndSeekFailures) {
    for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
        for (bool own : {false, true}) {
            for (const Call &c : Calls()) {
                SCOPED_TRACE(std::string(c.name) + (kind == FileCall::Read ? " read" : " seek") +
                             (own ? " file closed" : " file open"));
                BI_Bitmap *b = Make(*c.layout, own);
                const auto before = rowtest::ReadImage(b);
                const int fds = tstest::OpenDescriptorCount();
                const int64_t live = tessarine::testing::LiveBlocks();
                const int64_t calls = tstest::ForEachFileFailure(kind, [&](int64_t) {
                    Bytes buf(160, 0x5A);
                    const int32_t s = c.run(b, buf.data());
                    if (tessarine::testing::FileFailureHit(kind)) {
                        if (c.writes && s == TS_OK) {
                            // the save failed in the unlock, which the setter does not
                            // report: the file is as it was
                            EXPECT_TRUE(rowtest::ReadImage(b) == before);
                        } else {
                            EXPECT_EQ(s, -50);
                            if (!c.writes) { EXPECT_EQ(buf, Bytes(160, 0x5A)); }
                        }
                    } else {
                        EXPECT_EQ(s, TS_OK);
                    }
                    EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
                    EXPECT_EQ(tessarine::testing::LiveBlocks(), live);
                });
                EXPECT_GE(calls, 1);
                if (!c.writes) { EXPECT_TRUE(rowtest::ReadImage(b) == before); }
                BI_DeleteBitmap(&b);
            }
        }
    }
}

// The save of a row happens in the unlock, whose status the setters do not
// report: a failed write gives 10 and leaves the file as it was.
TEST_F(RowFailure, WriteFailuresAreNotReportedBySetters) {
    for (bool own : {false, true}) {
        for (const Call &c : Calls()) {
            if (!c.writes) continue;
            SCOPED_TRACE(std::string(c.name) + (own ? " file closed" : " file open"));
            BI_Bitmap *b = Make(*c.layout, own);
            const auto before = rowtest::ReadImage(b);
            const int fds = tstest::OpenDescriptorCount();
            const int64_t live = tessarine::testing::LiveBlocks();
            const int64_t calls = tstest::ForEachFileFailure(FileCall::Write, [&](int64_t) {
                Bytes buf(160, 0x5A);
                EXPECT_EQ(c.run(b, buf.data()), TS_OK);
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
                EXPECT_EQ(tessarine::testing::LiveBlocks(), live);
                if (tessarine::testing::FileFailureHit(FileCall::Write)) {
                    EXPECT_TRUE(rowtest::ReadImage(b) == before);
                }
            });
            EXPECT_EQ(calls, 1);
            BI_DeleteBitmap(&b);
        }
    }
}

TEST_F(RowFailure, BlockReadFailures) {
    BI_Bitmap *b = Make(kGray4, false);
    const HVT_Box box{3, 0, 4, 5};
    tstest::ForEachAllocationFailure([&](int64_t) {
        int32_t stride = -1;
        uint8_t *p = nullptr;
        void *temp = nullptr;
        const int32_t s = tessarine::storage::BI_LockBlockRead(b, &box, &stride, &p, &temp);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(s, -5);
            EXPECT_EQ(temp, nullptr);
        } else {
            ASSERT_EQ(s, TS_OK);
            MEM_FreePtr(temp);
        }
    });
    for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
        tstest::ForEachFileFailure(kind, [&](int64_t) {
            int32_t stride = -1;
            uint8_t *p = nullptr;
            void *temp = nullptr;
            const int32_t s = tessarine::storage::BI_LockBlockRead(b, &box, &stride, &p, &temp);
            if (tessarine::testing::FileFailureHit(kind)) {
                EXPECT_EQ(s, -50);
                EXPECT_EQ(temp, nullptr);
            } else {
                ASSERT_EQ(s, TS_OK);
                MEM_FreePtr(temp);
            }
        });
    }
    BI_DeleteBitmap(&b);
}

}  // namespace
