// A Set row function with a count of 0 still builds the box (x, y, x, y + 1),
// locks the row and unlocks it, and gives 10: on every storage route, and in
// a session that writes, the row is handed out like any other.
#include <gtest/gtest.h>

#include <vector>

#include <tessarine/tessarine.h>

#include "platform/test_hooks.h"
#include "row_model.h"
#include "test_support.h"

namespace {

using namespace rowtest;
using tessarine::testing::FileCall;
using tessarine::testing::FileCallCount;
using tessarine::testing::ResetInjection;

enum class SetFn { RGB, RGBI, BGRI, CMYK, Index, Gray, BW, BWPacked };
const SetFn kSetters[] = {SetFn::RGB, SetFn::RGBI,  SetFn::BGRI, SetFn::CMYK,
                          SetFn::Index, SetFn::Gray, SetFn::BW,   SetFn::BWPacked};

const char *Name(SetFn f) {
    const char *names[] = {"SetRGBRow", "SetRGBRowInterlace", "SetBGRRowInterlace", "SetCMYKRow",
                           "SetIndexRow", "SetGRow", "SetBWRow", "SetBWPackedRow"};
    return names[static_cast<int>(f)];
}

// The layout each setter is made for.
Layout LayoutFor(SetFn f) {
    switch (f) {
        case SetFn::RGB: return {"gray8", 2, 8, 1, 0};
        case SetFn::RGBI:
        case SetFn::BGRI: return {"rgb24", 4, 24, 1, 0};
        case SetFn::CMYK: return {"cmyk32", 4, 32, 2, 0};
        case SetFn::Index: return {"idx4rgb", 3, 4, 1, 11};
        case SetFn::Gray: return {"gray4", 2, 4, 1, 0};
        case SetFn::BW:
        case SetFn::BWPacked: return {"bw1", 1, 1, 1, 0};
    }
    return {"gray8", 2, 8, 1, 0};
}

int32_t CallSet(SetFn f, BI_Bitmap *b, int32_t y, int32_t x, int32_t count) {
    uint8_t v[16] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16};
    switch (f) {
        case SetFn::RGB: return BI_SetRGBRow(y, x, count, v, v, v, b);
        case SetFn::RGBI: return BI_SetRGBRowInterlace(y, x, count, v, b);
        case SetFn::BGRI: return BI_SetBGRRowInterlace(y, x, count, v, b);
        case SetFn::CMYK: return BI_SetCMYKRow(y, x, count, v, v, v, v, b);
        case SetFn::Index: return BI_SetIndexRow(y, x, count, v, b);
        case SetFn::Gray: return BI_SetGRow(y, x, count, v, b);
        case SetFn::BW: return BI_SetBWRow(y, x, count, v, b);
        case SetFn::BWPacked: return BI_SetBWPackedRow(y, x, count, v, b);
    }
    return 0;
}

class CountZero : public tstest::Sandbox {};

constexpr int32_t kWidth = 16, kHeight = 10;

TEST_F(CountZero, EverySetterOnEveryRouteLocksAndGives10) {
    uint32_t seed = 3;
    for (SetFn f : kSetters) {
        const Layout l = LayoutFor(f);
        const Image img = RandomImage(kWidth, kHeight, l.d, seed++);
        const auto table = RandomTable(l, seed++);
        for (Route route : Routes()) {
            SCOPED_TRACE(std::string(Name(f)) + " " + RouteName(route));
            BI_Bitmap *b = MakeBitmap(l, route, img, table);
            ASSERT_NE(b, nullptr);
            ASSERT_EQ(BeginRoute(route, b, 2), TS_OK);
            const int fds = tstest::OpenDescriptorCount();
            ResetInjection();
            for (int32_t x : {3, 8}) EXPECT_EQ(CallSet(f, b, 5, x, 0), TS_OK) << x;
            // Below 8 bits a window holds the byte of x, so the second window
            // saves the first one's pending row (as it was read).
            const bool savedWindow = route == Route::Mode1 && l.d < 8;
            EXPECT_EQ(FileCallCount(FileCall::Write), savedWindow ? 1 : 0);
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            HVT_FileInfo *s = b->ioSession;
            switch (route) {
                case Route::Memory:
                    EXPECT_EQ(MEM_Unlock(b->pixelHandle), 0);  // locked and unlocked again
                    break;
                case Route::Alone:
                case Route::AloneOwnFd:
                    EXPECT_GE(FileCallCount(FileCall::Read), 2);  // the file was opened, twice
                    break;
                case Route::Mode0:
                    EXPECT_EQ(s->pendingBox.top, -1);
                    break;
                case Route::Mode1: {
                    // The window of x = 8: no rows of its own, row 5 pending.
                    const int32_t per = 8 / std::min<int32_t>(l.d, 8);
                    const int32_t right = l.d < 8 ? 8 + per - 1 : 8;
                    EXPECT_EQ(s->writeBox.left, 8);
                    EXPECT_EQ(s->writeBox.right, right);
                    EXPECT_EQ(s->writeBox.top, 5);
                    EXPECT_EQ(s->writeBox.bottom, 5);
                    EXPECT_EQ(s->pendingBox.top, 5);
                    EXPECT_EQ(s->pendingBox.bottom, 6);
                    break;
                }
                case Route::Mode2:
                case Route::Mode3:
                    EXPECT_EQ(s->pendingBox.top, 5);
                    EXPECT_EQ(s->pendingBox.bottom, 6);
                    // Rows go in order with no gap: 7 is refused, 6 and 4 follow on.
                    EXPECT_EQ(CallSet(f, b, 7, 0, 1), 0xFFFF);
                    EXPECT_EQ(CallSet(f, b, 7, 0, 0), 0xFFFF);
                    EXPECT_EQ(CallSet(f, b, 6, 0, 0), TS_OK);
                    EXPECT_EQ(CallSet(f, b, 4, 0, 0), TS_OK);
                    EXPECT_EQ(s->pendingBox.top, 4);
                    EXPECT_EQ(s->pendingBox.bottom, 7);
                    break;
            }
            HVT_TileFileRowColIOEnd(b);
            Image after = ReadImage(b);
            EXPECT_TRUE(after == img) << "a count of 0 changed the pixels";
            BI_DeleteBitmap(&b);
        }
    }
}

// The example of a 16 by 10 8-bit gray bitmap in a mode-2 write session.
TEST_F(CountZero, ARowOfNoPixelsIsPendingAndAGapAfterItIsRefused) {
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(2, 8, 16, 10, 300, 300, 1, 0, nullptr, &b, 2, 0, 0, 0), TS_OK);
    ASSERT_EQ(HVT_TileFileRowIOBegin(2, b, nullptr, 2, 0, 0), TS_OK);
    const uint8_t p[16] = {};
    EXPECT_EQ(BI_SetRGBRow(5, 0, 0, p, p, p, b), TS_OK);
    EXPECT_EQ(b->ioSession->pendingBox.top, 5);
    EXPECT_EQ(b->ioSession->pendingBox.bottom, 6);
    EXPECT_EQ(BI_SetRGBRow(7, 0, 16, p, p, p, b), 0xFFFF);
    HVT_TileFileRowColIOEnd(b);
    BI_DeleteBitmap(&b);
}

// Without a session a count of 0 opens the file: an allocation or file
// failure in the lock is the caller's status; one in the unlock's save (the
// tile table it loads) is not, as the unlock's status never is.
TEST_F(CountZero, FailuresWithoutASession) {
    for (SetFn f : {SetFn::Gray, SetFn::Index}) {
        const Layout l = LayoutFor(f);
        const Image img = RandomImage(kWidth, kHeight, l.d, 11);
        const auto table = RandomTable(l, 12);
        BI_Bitmap *b = MakeBitmap(l, Route::Alone, img, table);
        ASSERT_NE(b, nullptr);
        std::vector<int32_t> statuses;
        const int64_t total = tstest::ForEachAllocationFailure([&](int64_t) {
            const int32_t s = CallSet(f, b, 5, 3, 0);
            if (tessarine::testing::AllocationFailureHit()) statuses.push_back(s);
            else EXPECT_EQ(s, TS_OK);
        });
        ASSERT_EQ(static_cast<int64_t>(statuses.size()), total);
        for (int64_t n = 0; n + 1 < total; ++n) EXPECT_EQ(statuses[n], -5) << Name(f) << " " << n;
        EXPECT_EQ(statuses.back(), TS_OK) << "the tile table of the save";
        for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
            statuses.clear();
            const int fds = tstest::OpenDescriptorCount();
            tstest::ForEachFileFailure(kind, [&](int64_t) {
                const int32_t s = CallSet(f, b, 5, 3, 0);
                if (tessarine::testing::FileFailureHit(kind)) statuses.push_back(s);
                else EXPECT_EQ(s, TS_OK);
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            });
            ASSERT_GE(statuses.size(), 2u);
            for (size_t n = 0; n + 1 < statuses.size(); ++n) EXPECT_EQ(statuses[n], -50) << n;
            EXPECT_EQ(statuses.back(), TS_OK);
        }
        EXPECT_TRUE(ReadImage(b) == img);
        BI_DeleteBitmap(&b);
    }
}

}  // namespace
