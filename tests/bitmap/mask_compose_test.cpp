// Mask compositing for every pair of layouts, against a model that runs the
// definition's steps through the public row functions on a twin of the
// destination; the mask point, the restored mask bytes, and failures.
#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <vector>

#include <tessarine/tessarine.h>

#include "bitmap/color_tables.h"
#include "platform/test_hooks.h"
#include "row_bits_model.h"
#include "row_model.h"
#include "test_support.h"

namespace {

using rowtest::Image;
using rowtest::Layout;
using rowtest::Route;
using Bytes = std::vector<uint8_t>;
namespace th = tessarine::testing;

constexpr int32_t kW = 37, kH = 9;

struct Owned {
    BI_Bitmap *b = nullptr;
    ~Owned() {
        if (b) BI_DeleteBitmap(&b);
    }
};

struct MaskArea {
    Bytes bytes;
    int32_t stride = 16, x = 0, y = 0;
};

MaskArea MakeMask(int kind, uint32_t seed, int32_t x, int32_t y) {
    MaskArea m;
    m.x = x;
    m.y = y;
    m.bytes.resize(16 * 16);
    std::mt19937 rng(seed);
    for (auto &v : m.bytes) v = kind == 0 ? 0 : kind == 1 ? 0xFF : static_cast<uint8_t>(rng() % 4 ? rng() : 0);
    return m;
}

// The definition's own steps for unlike layouts, on the twin.
int32_t Model(const RECT &sr, BI_Bitmap *src, const MaskArea &mask, const RECT &dr, BI_Bitmap *dst) {
    const int32_t w = sr.right - sr.left;
    Bytes p[8];
    for (auto &q : p) q.assign(w, 0);
    const bool rgbDst = dst->imageType == 4 && dst->colorModel == 1;
    const bool cmykDst = dst->imageType == 4 && dst->colorModel == 2;
    if (dst->imageType == 4 && !rgbDst && !cmykDst) return TS_OK;
    if (dst->imageType != 4 && src->imageType == 4 && src->colorModel != 1 && src->colorModel != 2) return TS_OK;
    int32_t st = TS_OK;
    uint8_t table[1024] = {};
    int32_t count = dst->bitsPerPixel <= 8 ? 1 << dst->bitsPerPixel : 0;
    uint8_t map[256] = {};
    if (!rgbDst && !cmykDst) {
        if (src->imageType == 4 && src->colorModel == 1) st = BI_GetRGBColorTable(dst, &count, table);
        else if (src->imageType == 4) st = BI_GetCMYKColorTable(dst, &count, table);
        else st = BI_GetMapTable(src, dst, map);
        if (TS_FAILED(st)) return st;
    }
    const int phase = mask.x & 7;
    for (int32_t r = 0; r < sr.bottom - sr.top; ++r) {
        const int32_t sy = sr.top + r, dy = dr.top + r;
        const uint8_t *m = mask.bytes.data() + int64_t{mask.y + r} * mask.stride + phase;
        auto bit = [&](int32_t i) { return rowbits::Bit(m, phase + i); };
        if (rgbDst) {
            if (TS_FAILED(st = BI_GetRGBRow(src, sy, sr.left, w, p[0].data(), p[1].data(), p[2].data()))) return st;
            if (TS_FAILED(st = BI_GetRGBRow(dst, dy, dr.left, w, p[3].data(), p[4].data(), p[5].data()))) return st;
            for (int32_t i = 0; i < w; ++i)
                if (bit(i)) p[3][i] = p[0][i], p[4][i] = p[1][i], p[5][i] = p[2][i];
            if (TS_FAILED(st = BI_SetRGBRow(dy, dr.left, w, p[3].data(), p[4].data(), p[5].data(), dst))) return st;
        } else if (cmykDst) {
            if (TS_FAILED(st = BI_GetCMYKRow(src, sy, sr.left, w, p[0].data(), p[1].data(), p[2].data(), p[3].data()))) return st;
            if (TS_FAILED(st = BI_GetCMYKRow(dst, dy, dr.left, w, p[4].data(), p[5].data(), p[6].data(), p[7].data()))) return st;
            for (int32_t i = 0; i < w; ++i)
                if (bit(i))
                    for (int c = 0; c < 4; ++c) p[4 + c][i] = p[c][i];
            if (TS_FAILED(st = BI_SetCMYKRow(dy, dr.left, w, p[4].data(), p[5].data(), p[6].data(), p[7].data(), dst))) return st;
        } else if (src->imageType == 4 && src->colorModel == 1) {
            if (TS_FAILED(st = BI_GetRGBRow(src, sy, sr.left, w, p[0].data(), p[1].data(), p[2].data()))) return st;
            if (TS_FAILED(st = BI_GetIndexRow(dst, dy, dr.left, w, p[3].data()))) return st;
            for (int32_t i = 0; i < w; ++i)
                if (bit(i)) p[3][i] = BI_RGBMapToColorIndex(p[0][i], p[1][i], p[2][i], count, table);
            if (TS_FAILED(st = BI_SetIndexRow(dy, dr.left, w, p[3].data(), dst))) return st;
        } else if (src->imageType == 4) {
            if (TS_FAILED(st = BI_GetCMYKRow(src, sy, sr.left, w, p[0].data(), p[1].data(), p[2].data(), p[3].data()))) return st;
            if (TS_FAILED(st = BI_GetIndexRow(dst, dy, dr.left, w, p[4].data()))) return st;
            for (int32_t i = 0; i < w; ++i)
                if (bit(i)) p[4][i] = tessarine::bitmap::CmykNearest(p[0][i], p[1][i], p[2][i], p[3][i], count, table);
            if (TS_FAILED(st = BI_SetIndexRow(dy, dr.left, w, p[4].data(), dst))) return st;
        } else {
            if (TS_FAILED(st = BI_GetIndexRow(src, sy, sr.left, w, p[0].data()))) return st;
            if (TS_FAILED(st = BI_GetIndexRow(dst, dy, dr.left, w, p[1].data()))) return st;
            for (int32_t i = 0; i < w; ++i)
                if (bit(i)) p[1][i] = map[p[0][i]];
            if (TS_FAILED(st = BI_SetIndexRow(dy, dr.left, w, p[1].data(), dst))) return st;
        }
    }
    return st;
}

class MaskCompose : public tstest::Sandbox {};

BI_Bitmap *Make(const Layout &l, Route route, uint32_t seed) {
    return rowtest::MakeBitmap(l, route, rowtest::RandomImage(kW, kH, l.d, seed), rowtest::RandomTable(l, seed + 7));
}

TEST_F(MaskCompose, EveryPairOfLayoutsInMemory) {
    const RECT sr{3, 1, 30, 7}, dr{6, 2, 33, 8};
    uint32_t seed = 1;
    int painted = 0;
    for (const Layout &ls : rowtest::Layouts())
        for (const Layout &ld : rowtest::Layouts())
            for (int kind = 0; kind < 3; ++kind) {
                Owned src{Make(ls, Route::Memory, seed)}, dst{Make(ld, Route::Memory, seed + 1)},
                    twin{Make(ld, Route::Memory, seed + 1)};
                ++seed;
                MaskArea mask = MakeMask(kind, seed, 3, 2);
                const Bytes before = mask.bytes;
                const int32_t got = BI_MaskBmp(&sr, src.b, mask.stride, mask.x, mask.y, mask.bytes.data(), &dr, dst.b);
                EXPECT_EQ(mask.bytes, before);
                const bool direct = ls.type == ld.type && ls.d == ld.d;
                const int32_t want =
                    direct ? BI_DirectMaskBmp(&sr, src.b, mask.stride, mask.x, mask.y, mask.bytes.data(), &dr, twin.b)
                           : Model(sr, src.b, mask, dr, twin.b);
                EXPECT_EQ(TS_STATUS(got), TS_STATUS(want)) << ls.name << " over " << ld.name;
                if (!TS_FAILED(want)) ++painted;
                EXPECT_TRUE(rowtest::ReadImage(dst.b) == rowtest::ReadImage(twin.b))
                    << ls.name << " over " << ld.name << " mask kind " << kind;
            }
    EXPECT_GT(painted, 15 * 15 * 3 / 2);  // most pairs have a way
}

TEST_F(MaskCompose, TileFilesOnEitherSide) {
    const RECT sr{3, 1, 30, 7}, dr{6, 2, 33, 8};
    const std::vector<Layout> &all = rowtest::Layouts();
    const std::vector<std::pair<int, int>> pairs = {{13, 4}, {4, 13}, {14, 12}, {9, 14}, {0, 13}, {4, 14}, {3, 9}};
    uint32_t seed = 500;
    for (auto [a, b] : pairs)
        for (int sides = 1; sides < 4; ++sides) {
            const Route rs = sides & 2 ? Route::Alone : Route::Memory;
            const Route rd = sides & 1 ? Route::Alone : Route::Memory;
            Owned src{Make(all[a], rs, seed)}, dst{Make(all[b], rd, seed + 1)}, twin{Make(all[b], Route::Memory, seed + 1)};
            ++seed;
            MaskArea mask = MakeMask(2, seed, 5, 1);
            const Bytes before = mask.bytes;
            const int32_t got = BI_MaskBmp(&sr, src.b, mask.stride, mask.x, mask.y, mask.bytes.data(), &dr, dst.b);
            EXPECT_EQ(mask.bytes, before);
            Owned srcMem{Make(all[a], Route::Memory, seed - 1)};
            EXPECT_EQ(TS_STATUS(got), TS_STATUS(Model(sr, srcMem.b, mask, dr, twin.b)))
                << all[a].name << " over " << all[b].name << " sides " << sides;
            EXPECT_TRUE(rowtest::ReadImage(dst.b) == rowtest::ReadImage(twin.b)) << all[a].name << " over " << all[b].name << " sides " << sides;
            EXPECT_EQ(dst.b->ioSession, nullptr);
            EXPECT_EQ(src.b->ioSession, nullptr);
        }
}

TEST_F(MaskCompose, AZeroMaskOverGrayOfAnotherLayoutWritesZeros) {
    const Layout &rgb = rowtest::Layouts()[13], &gray = rowtest::Layouts()[4], &bw = rowtest::Layouts()[0];
    for (const Layout *d : {&gray, &bw}) {
        Owned src{Make(rgb, Route::Memory, 3)}, dst{Make(*d, Route::Memory, 4)};
        MaskArea zero = MakeMask(0, 1, 0, 0);
        const RECT r{0, 0, kW, kH};
        ASSERT_EQ(BI_MaskBmp(&r, src.b, zero.stride, 0, 0, zero.bytes.data(), &r, dst.b), TS_OK);
        // The rows are read and written back; the index values of a bitmap
        // with no colour table are all set to 0 on the way.
        const Image got = rowtest::ReadImage(dst.b);
        EXPECT_TRUE(got == Image(kW, kH, d->d)) << d->name;
    }
    // Over an RGB destination the rewritten rows are what they were.
    Owned src{Make(gray, Route::Memory, 5)}, dst{Make(rgb, Route::Alone, 6)};
    const Image was = rowtest::ReadImage(dst.b);
    MaskArea zero = MakeMask(0, 1, 0, 0);
    const RECT r{0, 0, kW, kH};
    th::ResetInjection();
    ASSERT_EQ(BI_MaskBmp(&r, src.b, zero.stride, 0, 0, zero.bytes.data(), &r, dst.b), TS_OK);
    EXPECT_GT(th::FileCallCount(th::FileCall::Write), 0);  // rewritten all the same
    th::ResetInjection();
    EXPECT_TRUE(rowtest::ReadImage(dst.b) == was);
}

TEST_F(MaskCompose, EqualFourBitLayoutsTakeTheDirectMask) {
    const Layout &g4 = rowtest::Layouts()[3], &g4c = rowtest::Layouts()[5];
    Owned src{Make(g4, Route::Memory, 8)}, dst{Make(g4c, Route::Memory, 9)}, twin{Make(g4c, Route::Memory, 9)};
    MaskArea m = MakeMask(2, 3, 11, 1);  // x of 11: the direct mask reads byte 1, phase 3
    const RECT sr{1, 0, 20, 5}, dr{4, 2, 23, 7};
    ASSERT_EQ(BI_MaskBmp(&sr, src.b, m.stride, m.x, m.y, m.bytes.data(), &dr, dst.b), TS_OK);
    const RECT area{0, 0, 0, 0};
    (void)area;
    auto *s = static_cast<uint8_t *>(MEM_Lock(src.b->pixelHandle));
    auto *t = static_cast<uint8_t *>(MEM_Lock(twin.b->pixelHandle));
    ASSERT_EQ(BI_MemDirectMaskBits(4, src.b->bytesPerRow, &sr, s, m.stride, m.x, m.y, m.bytes.data(),
                                   twin.b->bytesPerRow, dr.left, dr.top, t), TS_OK);
    MEM_Unlock(src.b->pixelHandle);
    MEM_Unlock(twin.b->pixelHandle);
    EXPECT_TRUE(rowtest::ReadImage(dst.b) == rowtest::ReadImage(twin.b));
}

TEST_F(MaskCompose, MaskPointXThreeUsesTheLowFiveBitsFirstAndRestoresTheByte) {
    const Layout &rgb = rowtest::Layouts()[13], &cmyk = rowtest::Layouts()[14];
    Owned src{Make(rgb, Route::Memory, 10)}, dst{Make(cmyk, Route::Memory, 11)}, twin{Make(cmyk, Route::Memory, 11)};
    MaskArea m = MakeMask(2, 4, 3, 0);
    m.bytes[3] = 0xE5;  // the row's first byte: the phase is a byte count
    const RECT r{0, 0, 20, 1};
    ASSERT_EQ(BI_MaskBmp(&r, src.b, m.stride, 3, 0, m.bytes.data(), &r, dst.b), TS_OK);
    EXPECT_EQ(m.bytes[3], 0xE5);
    // Pixels 0 to 4 follow the low five bits of 0xE5: 0 0 1 0 1.
    Bytes c(20), mm(20), y(20), k(20), c0(20), m0(20), y0(20), k0(20);
    ASSERT_EQ(BI_GetCMYKRow(dst.b, 0, 0, 20, c.data(), mm.data(), y.data(), k.data()), TS_OK);
    ASSERT_EQ(BI_GetCMYKRow(twin.b, 0, 0, 20, c0.data(), m0.data(), y0.data(), k0.data()), TS_OK);
    Bytes sc(20), sm(20), sy(20), sk(20);
    ASSERT_EQ(BI_GetCMYKRow(src.b, 0, 0, 20, sc.data(), sm.data(), sy.data(), sk.data()), TS_OK);
    const int want[5] = {0, 0, 1, 0, 1};
    for (int i = 0; i < 5; ++i) EXPECT_EQ(k[i], want[i] ? sk[i] : k0[i]) << i;
    EXPECT_EQ(Model(r, src.b, m, r, twin.b), TS_OK);
    EXPECT_TRUE(rowtest::ReadImage(dst.b) == rowtest::ReadImage(twin.b));
}

TEST_F(MaskCompose, MaskPointXElevenHasPhaseThreeAndStartsAtByteThree) {
    const Layout &gray = rowtest::Layouts()[4], &rgb = rowtest::Layouts()[13];
    Owned src{Make(gray, Route::Memory, 12)}, dst{Make(rgb, Route::Memory, 13)}, twin{Make(rgb, Route::Memory, 13)};
    MaskArea m = MakeMask(0, 0, 11, 0);
    m.bytes[3] = 0x1F;  // byte 3, from bit 3: five set pixels
    m.bytes[1] = 0xFF;  // where x >> 3 would have started: not used
    const RECT r{0, 0, 20, 1};
    ASSERT_EQ(BI_MaskBmp(&r, src.b, m.stride, 11, 0, m.bytes.data(), &r, dst.b), TS_OK);
    EXPECT_EQ(Model(r, src.b, m, r, twin.b), TS_OK);
    EXPECT_TRUE(rowtest::ReadImage(dst.b) == rowtest::ReadImage(twin.b));
    Bytes a(20), b(20), c(20), a0(20), b0(20), c0(20);
    ASSERT_EQ(BI_GetRGBRow(dst.b, 0, 0, 20, a.data(), b.data(), c.data()), TS_OK);
    Owned fresh{Make(rgb, Route::Memory, 13)};
    ASSERT_EQ(BI_GetRGBRow(fresh.b, 0, 0, 20, a0.data(), b0.data(), c0.data()), TS_OK);
    for (int i = 5; i < 20; ++i) EXPECT_EQ(a[i], a0[i]) << i;
}

TEST_F(MaskCompose, BitsBeyondTheWidthAreIgnored) {
    const Layout &gray = rowtest::Layouts()[4], &rgb = rowtest::Layouts()[13];
    Owned src{Make(gray, Route::Memory, 14)}, dst{Make(rgb, Route::Memory, 15)};
    const Image was = rowtest::ReadImage(dst.b);
    MaskArea ones = MakeMask(1, 0, 0, 0);
    const RECT r{0, 0, 10, 3};
    ASSERT_EQ(BI_MaskBmp(&r, src.b, ones.stride, 0, 0, ones.bytes.data(), &r, dst.b), TS_OK);
    const Image now = rowtest::ReadImage(dst.b);
    for (int y = 0; y < kH; ++y)
        for (int x = 10 * 3; x < kW * 3; ++x) ASSERT_EQ(now.rows[y][x], was.rows[y][x]) << x;
}

TEST_F(MaskCompose, AnOtherColourModelPaintsNothing) {
    const Layout &gray = rowtest::Layouts()[4], &rgb = rowtest::Layouts()[13];
    Owned src{Make(gray, Route::Memory, 16)}, dst{Make(rgb, Route::Memory, 17)};
    const Image was = rowtest::ReadImage(dst.b);
    dst.b->colorModel = 3;
    MaskArea ones = MakeMask(1, 0, 0, 0);
    const RECT r{0, 0, 10, 3};
    EXPECT_EQ(BI_MaskBmp(&r, src.b, ones.stride, 0, 0, ones.bytes.data(), &r, dst.b), TS_OK);
    dst.b->colorModel = 1;
    EXPECT_TRUE(rowtest::ReadImage(dst.b) == was);
}

TEST_F(MaskCompose, FailuresGiveTheirStatusAndRestoreTheMask) {
    const std::vector<Layout> &all = rowtest::Layouts();
    const RECT sr{3, 1, 30, 7}, dr{6, 2, 33, 8};
    for (auto [a, b] : std::vector<std::pair<int, int>>{{13, 4}, {14, 12}, {4, 13}, {9, 2}})
        for (int sides = 0; sides < 4; ++sides) {
            const Route rs = sides & 2 ? Route::Alone : Route::Memory;
            const Route rd = sides & 1 ? Route::Alone : Route::Memory;
            Owned src{Make(all[a], rs, 40)}, dst{Make(all[b], rd, 41)};
            MaskArea m = MakeMask(2, 9, 3, 0);
            const Bytes before = m.bytes;
            const int fds = tstest::OpenDescriptorCount();
            auto run = [&] { return BI_MaskBmp(&sr, src.b, m.stride, m.x, m.y, m.bytes.data(), &dr, dst.b); };
            tstest::ForEachAllocationFailure([&](int64_t) {
                const int32_t s = run();
                if (th::AllocationFailureHit()) EXPECT_EQ(TS_STATUS(s), -5) << sides;
                else EXPECT_EQ(s, TS_OK);
                EXPECT_EQ(m.bytes, before);
                EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
                EXPECT_EQ(dst.b->ioSession, nullptr);
            });
            if (sides == 0) continue;
            for (auto kind : {th::FileCall::Read, th::FileCall::Write, th::FileCall::Seek})
                tstest::ForEachFileFailure(kind, [&](int64_t) {
                    const int32_t s = run();
                    // The band a session still holds is written when the
                    // session ends, and that end has no status to give.
                    if (th::FileFailureHit(kind)) EXPECT_TRUE(TS_STATUS(s) == -50 || s == TS_OK) << sides << " " << s;
                    else EXPECT_EQ(s, TS_OK);
                    EXPECT_EQ(m.bytes, before);
                    EXPECT_EQ(tstest::OpenDescriptorCount(), fds);
                });
        }
}

TEST_F(MaskCompose, ATableGetterFailureIsTheStatus) {
    const std::vector<Layout> &all = rowtest::Layouts();
    // A 24-bit gray bitmap has no implied table.
    Owned src{Make(all[13], Route::Memory, 50)}, dst{Make(all[4], Route::Memory, 51)};
    dst.b->bitsPerPixel = 2;
    MaskArea m = MakeMask(1, 0, 0, 0);
    const RECT r{0, 0, 4, 1};
    EXPECT_EQ(TS_STATUS(BI_MaskBmp(&r, src.b, m.stride, 0, 0, m.bytes.data(), &r, dst.b)), -2);
    dst.b->bitsPerPixel = 8;
}

}  // namespace
