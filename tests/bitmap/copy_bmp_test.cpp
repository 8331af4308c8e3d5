// BI_CopyBmp over every pair of layouts and storage routes against a
// per-pixel model, and the cases of its routes: direct, map table, searches,
// the profile handed on, failures.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include <tessarine/profile.hpp>
#include <tessarine/tessarine.h>

#include "copy_model.h"
#include "platform/file_path_hooks.h"
#include "platform/test_hooks.h"
#include "row_model.h"
#include "test_support.h"

namespace {

using copytest::Side;
using rowtest::Image;
using rowtest::Layout;
using rowtest::Route;
using tessarine::testing::AllocationFailureHit;
using tessarine::testing::FileCall;
using tessarine::testing::FileFailureHit;
using Bytes = std::vector<uint8_t>;

const std::vector<Layout> &CopyLayouts() {
    static const std::vector<Layout> all = {
        {"bw1", 1, 1, 1, 0},      {"gray4", 2, 4, 1, 0},     {"gray8", 2, 8, 1, 0},
        {"idx1", 3, 1, 1, 2},     {"idx4", 3, 4, 1, 11},     {"idx8", 3, 8, 1, 200},
        {"idx4cmyk", 3, 4, 2, 9}, {"rgb24", 4, 24, 1, 0},    {"cmyk32", 4, 32, 2, 0}};
    return all;
}

class CopyBmp : public tstest::Sandbox {};

struct Pair {
    BI_Bitmap *source = nullptr;
    BI_Bitmap *destination = nullptr;
    Side s, d;
    Image src, dst;
    ~Pair() {
        BI_DeleteBitmap(&source);
        BI_DeleteBitmap(&destination);
    }
};

void MakePair(Pair &p, const Layout &sl, Route sr, const Layout &dl, Route dr, uint32_t seed) {
    p.s = {sl, rowtest::RandomTable(sl, seed)};
    p.d = {dl, rowtest::RandomTable(dl, seed + 1)};
    p.src = rowtest::RandomImage(45, 37, sl.d, seed + 2);
    p.dst = rowtest::RandomImage(50, 40, dl.d, seed + 3);
    p.source = rowtest::MakeBitmap(sl, sr, p.src, p.s.table);
    p.destination = rowtest::MakeBitmap(dl, dr, p.dst, p.d.table);
}

TEST_F(CopyBmp, EveryPairOfLayoutsOnEveryPairOfRoutes) {
    const RECT sr{3, 2, 24, 17}, dr{5, 4, 26, 19};
    uint32_t seed = 100;
    for (const Layout &sl : CopyLayouts()) {
        for (const Layout &dl : CopyLayouts()) {
            for (Route sroute : {Route::Memory, Route::Alone}) {
                for (Route droute : {Route::Memory, Route::AloneOwnFd}) {
                    SCOPED_TRACE(testing::Message() << sl.name << " (" << rowtest::RouteName(sroute)
                                                    << ") to " << dl.name << " ("
                                                    << rowtest::RouteName(droute) << ")");
                    seed += 10;
                    Pair p;
                    MakePair(p, sl, sroute, dl, droute, seed);
                    ASSERT_TRUE(p.source && p.destination);
                    const bool direct = sl.type == dl.type && sl.d == dl.d;
                    if (direct) {
                        // The direct route: the same as a direct copy on a twin.
                        Pair twin;
                        MakePair(twin, sl, sroute, dl, droute, seed);
                        const int32_t want = BI_DirectCopyBmp(&sr, twin.source, &dr, twin.destination, 0, 0);
                        EXPECT_EQ(BI_CopyBmp(&sr, p.source, &dr, p.destination, 0, 0), want);
                        EXPECT_TRUE(rowtest::ReadImage(p.destination) == rowtest::ReadImage(twin.destination));
                        continue;
                    }
                    uint8_t map[256] = {};
                    int32_t mapStatus = TS_OK;
                    if (sl.type != 4 && dl.type != 4) mapStatus = BI_GetMapTable(p.source, p.destination, map);
                    Image want = p.dst;
                    copytest::Expected e =
                        copytest::PlanarModel(p.s, p.src, sr, p.d, want, dr, map, mapStatus);
                    // The CMYK getter reads 4-byte pixels from the 3-byte rows
                    // of an RGB source: in a band, what lies behind a row's
                    // run is the next band row, which the model does not hold.
                    if (sl.type == 4 && sl.d == 24 && dl.type == 4 && dl.model == 2 &&
                        sroute != Route::Memory) {
                        const int32_t st = TS_STATUS(BI_CopyBmp(&sr, p.source, &dr, p.destination, 0, 0));
                        EXPECT_TRUE(st == TS_OK || st == -1) << st;
                        continue;
                    }
                    EXPECT_EQ(TS_STATUS(BI_CopyBmp(&sr, p.source, &dr, p.destination, 0, 0)), e.status);
                    want.MaskTail();
                    const Image got = rowtest::ReadImage(p.destination);
                    for (int y = 0; y < got.h; ++y)
                        EXPECT_EQ(got.rows[y], want.rows[y]) << "row " << y;
                    EXPECT_EQ(p.source->ioSession, nullptr);
                    EXPECT_EQ(p.destination->ioSession, nullptr);
                }
            }
        }
    }
}

TEST_F(CopyBmp, GrayEightToGrayEightIsDirectAndToFourTakesTheMapTable) {
    const Layout g8{"gray8", 2, 8, 1, 0}, g4{"gray4", 2, 4, 1, 0};
    Image src(8, 2, 8);
    for (int x = 0; x < 8; ++x) src.rows[0][x] = static_cast<uint8_t>(x * 30);
    BI_Bitmap *s = rowtest::MakeBitmap(g8, Route::Memory, src, {});
    BI_Bitmap *d8 = rowtest::MakeBitmap(g8, Route::Memory, Image(8, 2, 8), {});
    Image ones(8, 2, 4);
    for (auto &r : ones.rows) std::fill(r.begin(), r.begin() + 4, 0x77);
    BI_Bitmap *d4 = rowtest::MakeBitmap(g4, Route::Memory, ones, {});
    const RECT all{0, 0, 8, 2};
    ASSERT_EQ(BI_CopyBmp(&all, s, &all, d8, 0, 0), TS_OK);
    EXPECT_TRUE(rowtest::ReadImage(d8) == src);  // bytes as they are
    ASSERT_EQ(BI_CopyBmp(&all, s, &all, d4, 0, 0), TS_OK);
    // The map table maps, and the index setter then clears every value at or
    // above a gray destination's colour count, which is 0.
    const Image got = rowtest::ReadImage(d4);
    for (int x = 0; x < 8; ++x) EXPECT_EQ(got.Pixel(0, x), 0u) << x;
    BI_DeleteBitmap(&s);
    BI_DeleteBitmap(&d8);
    BI_DeleteBitmap(&d4);
}

TEST_F(CopyBmp, BlackAndWhiteToRgbGivesWhiteForClearBits) {
    Image bw(16, 1, 1);
    bw.rows[0][0] = 0xF0;
    bw.rows[0][1] = 0x0F;
    BI_Bitmap *s = rowtest::MakeBitmap({"bw1", 1, 1, 1, 0}, Route::Alone, bw, {});
    BI_Bitmap *d = rowtest::MakeBitmap({"rgb24", 4, 24, 1, 0}, Route::Memory, Image(16, 1, 24), {});
    const RECT all{0, 0, 16, 1};
    ASSERT_EQ(BI_CopyBmp(&all, s, &all, d, 0, 0), TS_OK);
    Bytes r(16), g(16), b(16);
    ASSERT_EQ(BI_GetRGBRow(d, 0, 0, 16, r.data(), g.data(), b.data()), TS_OK);
    for (int x = 0; x < 16; ++x) {
        const uint8_t want = (x < 4 || x >= 12) ? 0 : 255;
        EXPECT_EQ(r[x], want) << x;
        EXPECT_EQ(g[x], want);
        EXPECT_EQ(b[x], want);
    }
    BI_DeleteBitmap(&s);
    BI_DeleteBitmap(&d);
}

AFilePath *PathOf(const char *text) { return tessarine::platform::CopyFilePath(AFilePath(text)); }

TEST_F(CopyBmp, EmptyRectangleGivesTenAndStillHandsOnTheProfile) {
    struct Case {
        bool direct;
        Route route;
    };
    for (const Case &c : {Case{true, Route::Alone}, Case{false, Route::Memory}, Case{false, Route::Alone}}) {
        SCOPED_TRACE(testing::Message() << (c.direct ? "direct " : "planar ") << rowtest::RouteName(c.route));
        BI_Bitmap *s = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0}, Route::Memory, Image(4, 4, 8), {});
        BI_Bitmap *d = rowtest::MakeBitmap(c.direct ? Layout{"gray8", 2, 8, 1, 0} : Layout{"rgb24", 4, 24, 1, 0},
                                           c.route, rowtest::RandomImage(4, 4, c.direct ? 8 : 24, 3), {});
        const Image before = rowtest::ReadImage(d);
        s->profilePath = PathOf("/profiles/source.icc");
        d->profilePath = PathOf("/profiles/old.icc");
        for (const RECT &empty : {RECT{1, 1, 1, 3}, RECT{0, 2, 3, 2}}) {
            // A row transfer over a region of no rows cannot begin: on a tile
            // file the planar route gives its -29 (a band of no rows), and
            // still hands on the profile.
            const bool noRows = empty.bottom == empty.top;
            const int32_t want = !c.direct && c.route != Route::Memory && noRows ? -29 : TS_OK;
            EXPECT_EQ(TS_STATUS(BI_CopyBmp(&empty, s, &empty, d, 0, 0)), want);
            ASSERT_NE(d->profilePath, nullptr);
            EXPECT_STREQ(static_cast<const char *>(*d->profilePath), "/profiles/source.icc");
            EXPECT_NE(d->profilePath, s->profilePath);
            EXPECT_EQ(d->ioSession, nullptr);
        }
        EXPECT_TRUE(rowtest::ReadImage(d) == before);
        // A source with none takes the destination's away.
        tessarine::platform::DestroyFilePath(s->profilePath);
        s->profilePath = nullptr;
        const RECT one{0, 0, 1, 1};
        EXPECT_EQ(BI_CopyBmp(&one, s, &one, d, 0, 0), TS_OK);
        EXPECT_EQ(d->profilePath, nullptr);
        BI_DeleteBitmap(&s);
        BI_DeleteBitmap(&d);
    }
}

TEST_F(CopyBmp, ProfileHandedOnAfterAFailureToo) {
    // Gray to CMYK true colour fails in the CMYK getter.
    BI_Bitmap *s = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0}, Route::Memory, Image(4, 4, 8), {});
    BI_Bitmap *d = rowtest::MakeBitmap({"cmyk32", 4, 32, 2, 0}, Route::Memory, Image(4, 4, 32), {});
    s->profilePath = PathOf("/p/a.icc");
    const RECT all{0, 0, 4, 4};
    EXPECT_EQ(BI_CopyBmp(&all, s, &all, d, 0, 0), -2);
    ASSERT_NE(d->profilePath, nullptr);
    EXPECT_STREQ(static_cast<const char *>(*d->profilePath), "/p/a.icc");
    // A copy of the path that cannot get its memory leaves the profile null.
    tessarine::testing::FailAllocationsFrom(1);
    EXPECT_EQ(BI_CopyBmp(&all, s, &all, d, 0, 0), -5);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(d->profilePath, nullptr);
    BI_DeleteBitmap(&s);
    BI_DeleteBitmap(&d);
}

// True colour into gray and black-and-white: the nearest search runs over
// 1 << d implied entries, and the index setter clears what it finds.
TEST_F(CopyBmp, TrueColourIntoLevelsAndIndexed) {
    const Layout idx{"idx4", 3, 4, 1, 3};
    const Bytes table = {0, 0, 0, 255, 255, 255, 200, 10, 10};
    Image rgb(3, 1, 24);
    const uint8_t px[9] = {250, 250, 250, 190, 20, 0, 5, 5, 5};
    std::memcpy(rgb.rows[0].data(), px, 9);
    BI_Bitmap *s = rowtest::MakeBitmap({"rgb24", 4, 24, 1, 0}, Route::Memory, rgb, {});
    BI_Bitmap *d = rowtest::MakeBitmap(idx, Route::Memory, Image(3, 1, 4), table);
    const RECT all{0, 0, 3, 1};
    ASSERT_EQ(BI_CopyBmp(&all, s, &all, d, 0, 0), TS_OK);
    const Image got = rowtest::ReadImage(d);
    EXPECT_EQ(got.Pixel(0, 0), 1u);
    EXPECT_EQ(got.Pixel(0, 1), 2u);
    EXPECT_EQ(got.Pixel(0, 2), 0u);
    // An indexed CMYK destination has no RGB table: the getter's -1.
    BI_Bitmap *dc = rowtest::MakeBitmap({"idx4cmyk", 3, 4, 2, 2}, Route::Memory, Image(3, 1, 4),
                                        Bytes(8, 9));
    EXPECT_EQ(TS_STATUS(BI_CopyBmp(&all, s, &all, dc, 0, 0)), -1);
    BI_DeleteBitmap(&s);
    BI_DeleteBitmap(&d);
    BI_DeleteBitmap(&dc);
}

TEST_F(CopyBmp, TrueColourOfAnotherModelDoesNothing) {
    BI_Bitmap *s = nullptr, *d = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(4, 24, 4, 4, 300, 300, 1, 0, nullptr, &s, 1, 0, 0, 0), TS_OK);
    ASSERT_EQ(BI_CreateBlankBmp(2, 8, 4, 4, 300, 300, 1, 0, nullptr, &d, 1, 0, 0, 0), TS_OK);
    const Image before = rowtest::ReadImage(d);
    const RECT all{0, 0, 4, 4};
    s->colorModel = 0;
    EXPECT_EQ(BI_CopyBmp(&all, s, &all, d, 0, 0), TS_OK);
    EXPECT_TRUE(rowtest::ReadImage(d) == before);
    // A true-colour destination of another model: nothing either.
    d->colorModel = 0;
    d->imageType = 4;
    s->colorModel = 1;
    s->imageType = 2;
    s->bitsPerPixel = 8;
    EXPECT_EQ(BI_CopyBmp(&all, s, &all, d, 0, 0), TS_OK);
    d->imageType = 2;
    s->imageType = 4;
    s->bitsPerPixel = 24;
    BI_DeleteBitmap(&s);
    BI_DeleteBitmap(&d);
}

// Rectangles that cross tile columns and band rows on both sides.
TEST_F(CopyBmp, LargeRectanglesAcrossTilesAndBands) {
    const Layout sl{"idx8", 3, 8, 1, 200}, dl{"rgb24", 4, 24, 1, 0};
    const Side s{sl, rowtest::RandomTable(sl, 5)}, d{dl, {}};
    const Image src = rowtest::RandomImage(8300, 1100, 8, 6);
    const Image dst = rowtest::RandomImage(8300, 1100, 24, 7);
    BI_Bitmap *sb = rowtest::MakeBitmap(sl, Route::Alone, src, s.table);
    BI_Bitmap *db = rowtest::MakeBitmap(dl, Route::Alone, dst, {});
    const RECT sr{8000, 1000, 8250, 1090}, dr{10, 3, 260, 93};
    Image want = dst;
    copytest::PlanarModel(s, src, sr, d, want, dr, nullptr, TS_OK);
    ASSERT_EQ(BI_CopyBmp(&sr, sb, &dr, db, 0, 0), TS_OK);
    EXPECT_TRUE(rowtest::ReadImage(db) == want);
    BI_DeleteBitmap(&sb);
    BI_DeleteBitmap(&db);
}

TEST_F(CopyBmp, OpenTransfersAreRefused) {
    BI_Bitmap *s = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0}, Route::Alone, Image(4, 4, 8), {});
    BI_Bitmap *d = rowtest::MakeBitmap({"rgb24", 4, 24, 1, 0}, Route::Alone, Image(4, 4, 24), {});
    const RECT all{0, 0, 4, 4};
    ASSERT_EQ(HVT_TileFileRowIOBegin(1, s, nullptr, 2, 0, 0), TS_OK);
    HVT_FileInfo *session = s->ioSession;
    EXPECT_EQ(BI_CopyBmp(&all, s, &all, d, 0, 0), -4);
    EXPECT_EQ(s->ioSession, session);  // the caller's transfer is left alone
    HVT_TileFileRowColIOEnd(s);
    ASSERT_EQ(HVT_TileFileRowIOBegin(2, d, nullptr, 2, 0, 0), TS_OK);
    session = d->ioSession;
    EXPECT_EQ(BI_CopyBmp(&all, s, &all, d, 0, 0), -4);
    EXPECT_EQ(d->ioSession, session);
    HVT_TileFileRowColIOEnd(d);
    EXPECT_EQ(BI_CopyBmp(&all, s, &all, d, 0, 0), TS_OK);
    BI_DeleteBitmap(&s);
    BI_DeleteBitmap(&d);
}

TEST_F(CopyBmp, AllocationFailures) {
    // Each planar route on tile files: the sessions, the planes, the rows.
    const std::vector<std::pair<Layout, Layout>> pairs = {
        {{"gray8", 2, 8, 1, 0}, {"rgb24", 4, 24, 1, 0}},
        {{"idx4cmyk", 3, 4, 2, 9}, {"cmyk32", 4, 32, 2, 0}},
        {{"gray8", 2, 8, 1, 0}, {"idx4", 3, 4, 1, 11}},
        {{"rgb24", 4, 24, 1, 0}, {"idx8", 3, 8, 1, 200}},
        {{"cmyk32", 4, 32, 2, 0}, {"idx4cmyk", 3, 4, 2, 9}}};
    for (const auto &[sl, dl] : pairs) {
        SCOPED_TRACE(testing::Message() << sl.name << " to " << dl.name);
        Pair p;
        MakePair(p, sl, Route::AloneOwnFd, dl, Route::Alone, 9);
        p.source->profilePath = PathOf("/p/s.icc");
        const RECT sr{1, 1, 30, 20}, dr{0, 2, 29, 21};
        Pair ref;
        MakePair(ref, sl, Route::AloneOwnFd, dl, Route::Alone, 9);
        ASSERT_EQ(BI_CopyBmp(&sr, ref.source, &dr, ref.destination, 0, 0), TS_OK);
        const Image want = rowtest::ReadImage(ref.destination);
        // The destination takes the source's profile on the first copy.
        ASSERT_EQ(BI_CopyBmp(&sr, p.source, &dr, p.destination, 0, 0), TS_OK);
        const int fds = tstest::OpenDescriptorCount();
        const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
            const int32_t s = BI_CopyBmp(&sr, p.source, &dr, p.destination, 0, 0);
            if (AllocationFailureHit()) {
                // The path copy at the end fails silently; anything else is -5.
                if (s != TS_OK) {
                    EXPECT_EQ(s, -5);
                }
            } else {
                EXPECT_EQ(s, TS_OK);
            }
            // A path copy that failed left the profile null: give it back,
            // so that the heap is where it was.
            if (p.destination->profilePath == nullptr) p.destination->profilePath = PathOf("/p/s.icc");
            EXPECT_EQ(p.source->ioSession, nullptr);
            EXPECT_EQ(p.destination->ioSession, nullptr);
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
        });
        EXPECT_GE(made, 4);
        EXPECT_TRUE(rowtest::ReadImage(p.destination) == want);
    }
}

TEST_F(CopyBmp, FileFailures) {
    for (FileCall kind : {FileCall::Read, FileCall::Write, FileCall::Seek}) {
        Pair p;
        MakePair(p, {"idx8", 3, 8, 1, 200}, Route::AloneOwnFd, {"rgb24", 4, 24, 1, 0}, Route::Alone, 21);
        const RECT sr{1, 1, 30, 20}, dr{0, 2, 29, 21};
        const int fds = tstest::OpenDescriptorCount();
        int failed = 0;
        tstest::ForEachFileFailure(kind, [&](int64_t n) {
            const int32_t s = BI_CopyBmp(&sr, p.source, &dr, p.destination, 0, 0);
            SCOPED_TRACE(testing::Message() << "call " << n << " kind " << static_cast<int>(kind));
            // The save of the pending rows when the write transfer ends has
            // no status to carry: a failure there leaves the copy at 10.
            if (s != TS_OK) {
                EXPECT_EQ(s, -50);
                EXPECT_TRUE(FileFailureHit(kind));
                ++failed;
            }
            EXPECT_EQ(p.source->ioSession, nullptr);
            EXPECT_EQ(p.destination->ioSession, nullptr);
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
        });
        EXPECT_GE(failed, kind == FileCall::Write ? 0 : 2);
    }
}

}  // namespace
