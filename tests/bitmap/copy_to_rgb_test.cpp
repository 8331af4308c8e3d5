// Copying into RGB true colour: the device formula without a match record,
// and the match through the profile services with one (a recording provider
// stands in for the default one here).
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include <tessarine/profile.hpp>
#include <tessarine/tessarine.h>

#include "platform/file_path_hooks.h"
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

struct Call {
    std::string paths[4];
    int16_t inFormat, outFormat;
    int32_t inCount, outCount;
    Bytes input;
    int intent;
    unsigned long flags;
    long reserved;
};
std::vector<Call> g_calls;

// A match anyone can check: each output channel is a fixed function of the
// colour's first input byte and the channel.
uint8_t MatchedChannel(uint8_t first, int k) { return static_cast<uint8_t>(first * 3 + k * 50 + 1); }

long RecordMatch(char const *s, char const *d, char const *p, char const *a, void *in, void *out,
                 int intent, unsigned long flags, long reserved, XQProgressFn, void *) {
    const auto *i = static_cast<const CX_ColorBuffer *>(in);
    const auto *o = static_cast<const CX_ColorBuffer *>(out);
    Call c{{s ? s : "(null)", d ? d : "(null)", p ? p : "(null)", a ? a : "(null)"},
           i->format, o->format, i->count, o->count, {}, intent, flags, reserved};
    const int size = i->format == CX_FORMAT_CMYK ? 4 : i->format == CX_FORMAT_RGB ? 3 : 1;
    const auto *px = static_cast<const uint8_t *>(i->pixels);
    c.input.assign(px, px + int64_t{i->count} * size);
    auto *rgb = static_cast<uint8_t *>(o->pixels);
    for (int32_t n = 0; n < o->count; ++n)
        for (int k = 0; k < 3; ++k) rgb[3 * n + k] = MatchedChannel(px[size * n], k);
    g_calls.push_back(std::move(c));
    return 77;  // not looked at
}

class CopyToRgb : public tstest::Sandbox {
  protected:
    void SetUp() override {
        tstest::Sandbox::SetUp();
        provider_ = *TS_DefaultProfileProvider();
        provider_.XQMatchColors = RecordMatch;
        previous_ = TS_SetProfileProvider(&provider_);
        g_calls.clear();
    }
    void TearDown() override {
        TS_SetProfileProvider(previous_);
        g_calls.clear();
        tstest::Sandbox::TearDown();
    }
    TS_ProfileProvider provider_{};
    const TS_ProfileProvider *previous_ = nullptr;
};

BI_Bitmap *Rgb(int32_t w, int32_t h, Route route) {
    return rowtest::MakeBitmap({"rgb24", 4, 24, 1, 0}, route, rowtest::RandomImage(w, h, 24, 99), {});
}

Image SwopOf(const Image &cmyk, int32_t w) {
    Image out(w, cmyk.h, 24);
    for (int y = 0; y < cmyk.h; ++y)
        for (int x = 0; x < w; ++x) CX_SWOPCmyk2SRgb(cmyk.rows[y].data() + 4 * x, out.rows[y].data() + 3 * x);
    return out;
}

TEST_F(CopyToRgb, WithoutAMatchOnEveryRoute) {
    for (Route sr : {Route::Memory, Route::Alone}) {
        for (Route dr : {Route::Memory, Route::AloneOwnFd}) {
            SCOPED_TRACE(testing::Message() << rowtest::RouteName(sr) << " to " << rowtest::RouteName(dr));
            const RECT all{0, 0, 23, 11};
            // True-colour CMYK, through the device formula pixel by pixel.
            const Image cmyk = rowtest::RandomImage(23, 11, 32, 5);
            BI_Bitmap *s = rowtest::MakeBitmap({"cmyk32", 4, 32, 2, 0}, sr, cmyk, {});
            BI_Bitmap *d = Rgb(23, 11, dr);
            ASSERT_EQ(BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, nullptr), TS_OK);
            EXPECT_TRUE(rowtest::ReadImage(d) == SwopOf(cmyk, 23));
            EXPECT_EQ(d->profilePath, nullptr);
            BI_DeleteBitmap(&s);
            // Indexed CMYK: the table through the formula, entry by entry.
            const Layout ic{"idx4cmyk", 3, 4, 2, 9};
            const Bytes table = rowtest::RandomTable(ic, 6);
            Image idx = rowtest::RandomImage(23, 11, 4, 7);
            for (auto &row : idx.rows)
                for (auto &byte : row) byte = static_cast<uint8_t>(((byte >> 4) % 9) << 4 | ((byte & 15) % 9));
            idx.MaskTail();
            s = rowtest::MakeBitmap(ic, sr, idx, table);
            ASSERT_EQ(BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, nullptr), TS_OK);
            Image want(23, 11, 24);
            for (int y = 0; y < 11; ++y)
                for (int x = 0; x < 23; ++x)
                    CX_SWOPCmyk2SRgb(table.data() + 4 * idx.Pixel(y, x), want.rows[y].data() + 3 * x);
            EXPECT_TRUE(rowtest::ReadImage(d) == want);
            BI_DeleteBitmap(&s);
            // Gray: the planes as the RGB getter gives them.
            const Image gray = rowtest::RandomImage(23, 11, 8, 8);
            s = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0}, sr, gray, {});
            ASSERT_EQ(BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, nullptr), TS_OK);
            for (int y = 0; y < 11; ++y)
                for (int x = 0; x < 23; ++x) {
                    const uint8_t v = static_cast<uint8_t>(255 - gray.rows[y][x]);
                    want.rows[y][3 * x] = want.rows[y][3 * x + 1] = want.rows[y][3 * x + 2] = v;
                }
            EXPECT_TRUE(rowtest::ReadImage(d) == want);
            EXPECT_TRUE(g_calls.empty());
            BI_DeleteBitmap(&s);
            BI_DeleteBitmap(&d);
        }
    }
}

TEST_F(CopyToRgb, OtherSourcesGiveMinusTwo) {
    for (const Layout &l : {Layout{"rgb24", 4, 24, 1, 0}, Layout{"bw1", 1, 1, 1, 0},
                            Layout{"idx8", 3, 8, 1, 4}}) {
        BI_Bitmap *s = rowtest::MakeBitmap(l, Route::Alone, Image(4, 4, l.d), rowtest::RandomTable(l, 1));
        BI_Bitmap *d = Rgb(4, 4, Route::Memory);
        const Image before = rowtest::ReadImage(d);
        const RECT all{0, 0, 4, 4};
        EXPECT_EQ(BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, nullptr), -2) << l.name;
        EXPECT_TRUE(rowtest::ReadImage(d) == before);
        EXPECT_EQ(s->ioSession, nullptr);
        BI_DeleteBitmap(&s);
        BI_DeleteBitmap(&d);
    }
}

struct Paths {
    AFilePath source{"/icc/source.icc"}, destination{"/icc/destination.icc"}, proofing{"/icc/proof.icc"};
};

TEST_F(CopyToRgb, MatchOfTrueColourCmykRowByRow) {
    Paths p;
    const BI_ColorMatch match{&p.source, &p.destination, &p.proofing, nullptr, 3, 0x13};
    const Image cmyk = rowtest::RandomImage(9, 4, 32, 2);
    BI_Bitmap *s = rowtest::MakeBitmap({"cmyk32", 4, 32, 2, 0}, Route::Alone, cmyk, {});
    BI_Bitmap *d = Rgb(12, 6, Route::Alone);
    const RECT sr{2, 1, 8, 4}, dr{5, 2, 11, 5};
    ASSERT_EQ(BI_CopyBmpToRGBTrueColor(&sr, s, &dr, d, 0, 0, &match), TS_OK);
    ASSERT_EQ(g_calls.size(), 3u);  // one call per row
    for (size_t row = 0; row < 3; ++row) {
        const Call &c = g_calls[row];
        EXPECT_EQ(c.paths[0], "/icc/source.icc");
        EXPECT_EQ(c.paths[1], "/icc/destination.icc");
        EXPECT_EQ(c.paths[2], "/icc/proof.icc");
        EXPECT_EQ(c.paths[3], "(null)");
        EXPECT_EQ(c.inFormat, CX_FORMAT_CMYK);
        EXPECT_EQ(c.outFormat, CX_FORMAT_RGB);
        EXPECT_EQ(c.inCount, 6);
        EXPECT_EQ(c.outCount, 6);
        EXPECT_EQ(c.intent, 3);
        EXPECT_EQ(c.flags, 0x13u);
        EXPECT_EQ(c.reserved, 0);
        // The four planes interleaved, as the source holds them.
        EXPECT_EQ(0, std::memcmp(c.input.data(), cmyk.rows[1 + row].data() + 8, 24));
    }
    const Image got = rowtest::ReadImage(d);
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 6; ++x)
            for (int k = 0; k < 3; ++k)
                EXPECT_EQ(got.rows[2 + y][3 * (5 + x) + k], MatchedChannel(cmyk.rows[1 + y][4 * (2 + x)], k));
    // The destination keeps a copy of the record's second path.
    ASSERT_NE(d->profilePath, nullptr);
    EXPECT_NE(d->profilePath, &p.destination);
    EXPECT_STREQ(static_cast<const char *>(*d->profilePath), "/icc/destination.icc");
    BI_DeleteBitmap(&s);
    BI_DeleteBitmap(&d);
}

TEST_F(CopyToRgb, MatchOfIndexedCmykInOneCallAndGrayPerRow) {
    Paths p;
    const BI_ColorMatch match{&p.source, nullptr, nullptr, &p.proofing, 1, 0};
    const Layout ic{"idx8cmyk", 3, 8, 2, 5};
    const Bytes table = rowtest::RandomTable(ic, 3);
    Image idx(6, 3, 8);
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 6; ++x) idx.rows[y][x] = static_cast<uint8_t>((x * 2 + y) % 5);
    BI_Bitmap *s = rowtest::MakeBitmap(ic, Route::Memory, idx, table);
    BI_Bitmap *d = Rgb(6, 3, Route::Memory);
    d->profilePath = tessarine::platform::CopyFilePath(AFilePath("/old.icc"));
    const RECT all{0, 0, 6, 3};
    ASSERT_EQ(BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, &match), TS_OK);
    ASSERT_EQ(g_calls.size(), 1u);
    EXPECT_EQ(g_calls[0].inFormat, CX_FORMAT_CMYK);
    EXPECT_EQ(g_calls[0].inCount, 5);
    EXPECT_EQ(g_calls[0].outCount, 5);
    EXPECT_EQ(g_calls[0].input, table);
    EXPECT_EQ(g_calls[0].paths[1], "(null)");
    const Image got = rowtest::ReadImage(d);
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 6; ++x)
            EXPECT_EQ(got.rows[y][3 * x + 1], MatchedChannel(table[4 * idx.rows[y][x]], 1));
    // A null second path leaves an empty path with the destination.
    ASSERT_NE(d->profilePath, nullptr);
    EXPECT_STREQ(static_cast<const char *>(*d->profilePath), "");
    BI_DeleteBitmap(&s);

    g_calls.clear();
    const Image gray = rowtest::RandomImage(6, 3, 8, 4);
    s = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0}, Route::Memory, gray, {});
    ASSERT_EQ(BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, &match), TS_OK);
    ASSERT_EQ(g_calls.size(), 3u);
    for (int y = 0; y < 3; ++y) {
        EXPECT_EQ(g_calls[y].inFormat, CX_FORMAT_GRAY);
        EXPECT_EQ(g_calls[y].inCount, 6);
        for (int x = 0; x < 6; ++x) EXPECT_EQ(g_calls[y].input[x], 255 - gray.rows[y][x]);
    }
    const Image got2 = rowtest::ReadImage(d);
    EXPECT_EQ(got2.rows[2][3 * 5 + 2], MatchedChannel(static_cast<uint8_t>(255 - gray.rows[2][5]), 2));
    BI_DeleteBitmap(&s);
    BI_DeleteBitmap(&d);
}

TEST_F(CopyToRgb, OneTileBitmapOnBothSidesIsRefused) {
    BI_Bitmap *g = rowtest::MakeBitmap({"gray8", 2, 8, 1, 0}, Route::Alone, Image(4, 4, 8), {});
    const RECT all{0, 0, 4, 4};
    EXPECT_EQ(BI_CopyBmpToRGBTrueColor(&all, g, &all, g, 0, 0, nullptr), -4);
    EXPECT_EQ(g->ioSession, nullptr);
    BI_DeleteBitmap(&g);
}

TEST_F(CopyToRgb, AllocationAndFileFailures) {
    Paths p;
    const BI_ColorMatch match{&p.source, &p.destination, nullptr, nullptr, 0, 0};
    for (const BI_ColorMatch *m : {static_cast<const BI_ColorMatch *>(nullptr), &match}) {
        BI_Bitmap *s = rowtest::MakeBitmap({"cmyk32", 4, 32, 2, 0}, Route::AloneOwnFd,
                                           rowtest::RandomImage(20, 12, 32, 3), {});
        BI_Bitmap *d = Rgb(20, 12, Route::Alone);
        const RECT all{0, 0, 20, 12};
        ASSERT_EQ(BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, m), TS_OK);
        const Image want = rowtest::ReadImage(d);
        const int fds = tstest::OpenDescriptorCount();
        const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
            const int32_t st = BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, m);
            if (st != TS_OK) {
                EXPECT_EQ(st, -5);
                EXPECT_TRUE(AllocationFailureHit());
            }
            // A path copy that failed leaves none, or one without its text:
            // put the whole one back, so that the heap is where it was.
            if (m != nullptr && (d->profilePath == nullptr ||
                                 static_cast<const char *>(*d->profilePath)[0] == '\0')) {
                tessarine::platform::DestroyFilePath(d->profilePath);
                d->profilePath = tessarine::platform::CopyFilePath(p.destination);
            }
            EXPECT_EQ(s->ioSession, nullptr);
            EXPECT_EQ(d->ioSession, nullptr);
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
        });
        EXPECT_GE(made, m ? 8 : 6);
        EXPECT_TRUE(rowtest::ReadImage(d) == want);
        for (FileCall kind : {FileCall::Read, FileCall::Seek}) {
            int failed = 0;
            tstest::ForEachFileFailure(kind, [&](int64_t) {
                const int32_t st = BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, m);
                if (st != TS_OK) {
                    EXPECT_EQ(st, -50);
                    ++failed;
                }
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
            });
            EXPECT_GE(failed, 1);
        }
        BI_DeleteBitmap(&s);
        BI_DeleteBitmap(&d);
    }
}

}  // namespace
