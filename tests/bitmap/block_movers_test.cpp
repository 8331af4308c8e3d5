// The block movers on raw areas, the DIB conversions and the whole-block byte
// fill and complement, against per-row and per-pixel models.
#include <gtest/gtest.h>

#include <cstring>
#include <random>

#include <tessarine/tessarine.h>

#include "row_bits_model.h"
#include "test_support.h"

namespace {

using rowbits::Bytes;

Bytes Random(size_t n, uint32_t seed) {
    std::mt19937 rng(seed);
    Bytes b(n);
    for (auto &v : b) v = static_cast<uint8_t>(rng());
    return b;
}

constexpr int32_t kStride = 40;  // bytes; room for 1 to 32 bits per pixel up to 9 pixels of slack
constexpr int32_t kRows = 12;

const uint8_t *At(const Bytes &area, int d, int32_t x, int32_t y) {
    return area.data() + int64_t{y} * kStride + ((int64_t{d} * x) >> 3);
}
uint8_t *At(Bytes &area, int d, int32_t x, int32_t y) {
    return area.data() + int64_t{y} * kStride + ((int64_t{d} * x) >> 3);
}

// Row by row, what the definition asks of each depth.
void ModelCopy(int d, const RECT &r, const Bytes &src, int32_t x, int32_t y, Bytes &dst) {
    const int w = r.right - r.left;
    for (int row = 0; row < r.bottom - r.top; ++row) {
        const uint8_t *s = At(src, d, r.left, r.top + row);
        uint8_t *t = At(dst, d, x, y + row);
        if (d == 1) rowbits::CopyRow1(w, r.left & 7, s, x & 7, t);
        else if (d == 4) rowbits::CopyRow4(w, r.left & 1, s, x & 1, t);
        else std::memcpy(t, s, static_cast<size_t>(d / 8 * w));
    }
}

void ModelMask(int d, const RECT &r, const Bytes &src, const Bytes &mask, int32_t mx, int32_t my,
               int32_t x, int32_t y, Bytes &dst) {
    const int w = r.right - r.left;
    for (int row = 0; row < r.bottom - r.top; ++row) {
        const uint8_t *s = At(src, d, r.left, r.top + row);
        const uint8_t *m = At(mask, 1, mx, my + row);
        uint8_t *t = At(dst, d, x, y + row);
        if (d == 1) {
            rowbits::MaskRow1(w, r.left & 7, s, mx & 7, m, x & 7, t);
        } else if (d == 4) {
            rowbits::MaskRow4(w, r.left & 1, s, mx & 7, m, x & 1, t);
        } else {
            for (int i = 0; i < w; ++i)
                if (rowbits::Bit(m, (mx & 7) + i))
                    std::memcpy(t + i * d / 8, s + i * d / 8, static_cast<size_t>(d / 8));
        }
    }
}

TEST(BlockMovers, DirectCopyBitsMatchesModelAtEveryDepth) {
    uint32_t seed = 10;
    for (int d : {1, 4, 8, 24, 32})
        for (int left = 0; left < 9; ++left)
            for (int x = 0; x < 9; ++x)
                for (int w : {1, 3, 8, 9}) {
                    const RECT r{left, 2, left + w, 7};
                    const Bytes src = Random(kStride * kRows, seed++);
                    Bytes got = Random(kStride * kRows, seed++), want = got;
                    ASSERT_EQ(BI_MemDirectCopyBits(d, kStride, &r, src.data(), kStride, x, 4, got.data()), TS_OK);
                    ModelCopy(d, r, src, x, 4, want);
                    ASSERT_EQ(got, want) << "d " << d << " left " << left << " x " << x << " w " << w;
                }
}

TEST(BlockMovers, DirectCopyBitsTestsTheDepthFirstThenTheEmptyRectangle) {
    const Bytes src(64, 1);
    Bytes dst(64, 7);
    const RECT empty{5, 5, 5, 9}, flat{0, 3, 4, 3}, some{0, 0, 4, 2};
    EXPECT_EQ(BI_MemDirectCopyBits(16, 8, &some, src.data(), 8, 0, 0, dst.data()), -2);
    EXPECT_EQ(BI_MemDirectCopyBits(16, 8, &empty, src.data(), 8, 0, 0, dst.data()), -2);
    EXPECT_EQ(BI_MemDirectCopyBits(1, 8, &empty, src.data(), 8, 3, 0, dst.data()), TS_OK);
    EXPECT_EQ(BI_MemDirectCopyBits(1, 8, &flat, src.data(), 8, 3, 0, dst.data()), TS_OK);
    EXPECT_EQ(dst, Bytes(64, 7));  // a head at phase 3 would have written
}

TEST(BlockMovers, DirectMaskBitsMatchesModelAtEveryDepth) {
    uint32_t seed = 100;
    for (int d : {1, 4, 8, 24, 32})
        for (int left = 0; left < 9; left += 2)
            for (int x = 0; x < 9; x += 3)
                for (int mx = 0; mx < 17; mx += 3)
                    for (int w : {1, 7, 9, 20}) {
                        if (d == 32 && x + w > 9) continue;
                        const RECT r{left, 1, left + w, 6};
                        const Bytes src = Random(kStride * kRows, seed++);
                        Bytes mask = Random(kStride * kRows, seed++);
                        if (seed % 3 == 0)
                            for (size_t i = 0; i < mask.size(); i += 2) mask[i] = 0;
                        Bytes got = Random(kStride * kRows, seed++), want = got;
                        ASSERT_EQ(BI_MemDirectMaskBits(d, kStride, &r, src.data(), kStride, mx, 2,
                                                       mask.data(), kStride, x, 3, got.data()),
                                  TS_OK);
                        ModelMask(d, r, src, mask, mx, 2, x, 3, want);
                        ASSERT_EQ(got, want) << "d " << d << " left " << left << " x " << x
                                             << " mx " << mx << " w " << w;
                    }
}

TEST(BlockMovers, DirectMaskBitsRefusesOtherDepths) {
    const Bytes src(64, 1), mask(64, 0xFF);
    Bytes dst(64, 7);
    const RECT r{0, 0, 4, 2};
    EXPECT_EQ(BI_MemDirectMaskBits(16, 8, &r, src.data(), 8, 0, 0, mask.data(), 8, 0, 0, dst.data()), -2);
    EXPECT_EQ(dst, Bytes(64, 7));
}

TEST(BlockMovers, DirectMaskBitsHasNoEarlyReturnForAnEmptyWidth) {
    // Rows are walked as written: at phase 2 the 1-bit head still serves the
    // first mask byte's pixels.
    const Bytes src(64, 0xFF), mask(64, 0xFF);
    Bytes dst(64, 0);
    const RECT r{0, 0, 0, 2};
    EXPECT_EQ(BI_MemDirectMaskBits(1, 8, &r, src.data(), 8, 2, 0, mask.data(), 8, 2, 0, dst.data()), TS_OK);
    EXPECT_EQ(dst[0], 0x3F);
    EXPECT_EQ(dst[8], 0x3F);
}

TEST(BlockMovers, MapTableCopyStartsAtTheBytesFirstPixel) {
    uint8_t map[256];
    for (int i = 0; i < 256; ++i) map[i] = static_cast<uint8_t>(255 - i);
    uint32_t seed = 300;
    for (int sd : {1, 4, 8})
        for (int dd : {1, 4, 8})
            for (int left : {0, 3, 9})
                for (int x : {0, 5, 8})
                    for (bool own : {false, true}) {
                        const RECT r{left, 1, left + 11, 4};
                        const Bytes src = Random(kStride * kRows, seed++);
                        Bytes got = Random(kStride * kRows, seed++), want = got;
                        Bytes row(11, 0);
                        ASSERT_EQ(BI_MemMapTableCopyBits(map, sd, kStride, &r, src.data(), dd, kStride,
                                                         x, 2, got.data(), own ? row.data() : nullptr),
                                  TS_OK);
                        for (int y = 0; y < 3; ++y) {
                            const uint8_t *s = At(src, sd, left, 1 + y);
                            uint8_t *t = At(want, dd, x, 2 + y);
                            for (int i = 0; i < 11; ++i) {
                                const int v = sd == 1 ? rowbits::Bit(s, i) : sd == 4 ? rowbits::Nib(s, i) : s[i];
                                const int m = map[v];
                                if (dd == 1) rowbits::SetBit(t, i, m != 0);
                                else if (dd == 4) rowbits::SetNib(t, i, m & 15);
                                else t[i] = static_cast<uint8_t>(m);
                            }
                        }
                        ASSERT_EQ(got, want) << sd << " " << dd << " " << left << " " << x;
                    }
}

TEST(BlockMovers, MapTableCopyStatusesAndAllocation) {
    uint8_t map[256] = {};
    const Bytes src(64, 1);
    Bytes dst(64, 0);
    const RECT r{0, 0, 4, 2};
    EXPECT_EQ(BI_MemMapTableCopyBits(map, 24, 8, &r, src.data(), 8, 8, 0, 0, dst.data(), nullptr), -2);
    EXPECT_EQ(BI_MemMapTableCopyBits(map, 8, 8, &r, src.data(), 32, 8, 0, 0, dst.data(), nullptr), -2);
    const int64_t live = tessarine::testing::LiveBlocks();
    const int64_t made = tstest::ForEachAllocationFailure([&](int64_t) {
        const int32_t s = BI_MemMapTableCopyBits(map, 8, 8, &r, src.data(), 8, 8, 0, 0, dst.data(), nullptr);
        if (tessarine::testing::AllocationFailureHit()) EXPECT_EQ(s, -5);
        else EXPECT_EQ(s, TS_OK);
    });
    EXPECT_EQ(made, 1);
    EXPECT_EQ(tessarine::testing::LiveBlocks(), live);
    Bytes row(4);
    tessarine::testing::FailAllocationAt(1);
    EXPECT_EQ(BI_MemMapTableCopyBits(map, 8, 8, &r, src.data(), 8, 8, 0, 0, dst.data(), row.data()), TS_OK);
    EXPECT_FALSE(tessarine::testing::AllocationFailureHit());
    tessarine::testing::ResetInjection();
}

// A DIB block: header, palette, pixels.
Bytes MakeDib(int bits, int width, int height, uint32_t used) {
    BITMAPINFOHEADER h{};
    h.biSize = 40;
    h.biWidth = width;
    h.biHeight = -height;
    h.biPlanes = 1;
    h.biBitCount = static_cast<uint16_t>(bits);
    h.biClrUsed = used;
    const int64_t entries = bits <= 8 ? (used ? used : 1 << bits) : 0;
    const int64_t stride = ((int64_t{bits} * width + 31) >> 3) & ~3;
    Bytes dib(40 + 4 * entries + stride * height + 4, 0);
    std::memcpy(dib.data(), &h, 40);
    return dib;
}

BI_Bitmap Layout(uint8_t type, uint8_t d, uint8_t model) {
    BI_Bitmap b{};
    b.imageType = type;
    b.bitsPerPixel = d;
    b.colorModel = model;
    return b;
}

TEST(BlockMovers, CmykToDibGivesWhiteLessInks) {
    Bytes dib = MakeDib(24, 2, 1, 0);
    const uint8_t src[8] = {0, 0, 0, 255, 10, 20, 30, 100};
    const BI_Bitmap b = Layout(4, 32, 2);
    const RECT r{0, 0, 2, 1};
    ASSERT_EQ(BI_MemBitsToDIB(&b, 8, &r, src, 0, 0, reinterpret_cast<BITMAPINFOHEADER *>(dib.data())), TS_OK);
    const uint8_t *px = dib.data() + 40;
    EXPECT_EQ(px[0], 0);
    EXPECT_EQ(px[1], 0);
    EXPECT_EQ(px[2], 0);
    // x of the second pixel counted with the bitmap's 32 bits: 4 bytes in.
    Bytes dib2 = MakeDib(24, 4, 1, 0);
    const RECT one{1, 0, 2, 1};
    ASSERT_EQ(BI_MemBitsToDIB(&b, 8, &one, src, 1, 0, reinterpret_cast<BITMAPINFOHEADER *>(dib2.data())), TS_OK);
    EXPECT_EQ(dib2[40 + 4], 125);  // blue
    EXPECT_EQ(dib2[40 + 5], 135);  // green
    EXPECT_EQ(dib2[40 + 6], 145);  // red
}

TEST(BlockMovers, DibToCmykBitmapIsRefused) {
    const Bytes dib = MakeDib(24, 2, 1, 0);
    const BI_Bitmap b = Layout(4, 32, 2);
    Bytes dst(16, 9);
    const RECT r{0, 0, 2, 1};
    EXPECT_EQ(BI_DIBToMemBits(&r, reinterpret_cast<const BITMAPINFOHEADER *>(dib.data()), &b, 8, 0, 0, dst.data()), -2);
    EXPECT_EQ(dst, Bytes(16, 9));
    const BI_Bitmap other = Layout(4, 24, 0);
    Bytes d2 = MakeDib(24, 2, 1, 0);
    EXPECT_EQ(BI_MemBitsToDIB(&other, 8, &r, dst.data(), 0, 0, reinterpret_cast<BITMAPINFOHEADER *>(d2.data())), -2);
}

TEST(BlockMovers, RgbDibRoundTripSwapsTheBytes) {
    const BI_Bitmap b = Layout(4, 24, 1);
    const Bytes src = Random(3 * 5 * 3, 7);
    Bytes dib = MakeDib(24, 5, 3, 0);
    const RECT r{0, 0, 5, 3};
    ASSERT_EQ(BI_MemBitsToDIB(&b, 15, &r, src.data(), 0, 0, reinterpret_cast<BITMAPINFOHEADER *>(dib.data())), TS_OK);
    const int stride = 16;  // (24 * 5 + 31) / 8 rounded down to 4
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 5; ++x)
            for (int c = 0; c < 3; ++c)
                ASSERT_EQ(dib[40 + y * stride + 3 * x + c], src[y * 15 + 3 * x + (2 - c)]);
    Bytes back(45, 0);
    ASSERT_EQ(BI_DIBToMemBits(&r, reinterpret_cast<const BITMAPINFOHEADER *>(dib.data()), &b, 15, 0, 0, back.data()), TS_OK);
    EXPECT_EQ(back, src);
}

TEST(BlockMovers, PackedDibsFollowThePaletteRuleAndTheRowMovers) {
    for (int bits : {1, 4, 8})
        for (uint32_t used : {0u, 3u}) {
            const BI_Bitmap b = Layout(bits == 8 ? 2 : 3, static_cast<uint8_t>(bits), 1);
            const Bytes src = Random(kStride * kRows, bits + used);
            Bytes dib = MakeDib(bits, 30, 4, used);
            const RECT r{3, 1, 20, 4};
            ASSERT_EQ(BI_MemBitsToDIB(&b, kStride, &r, src.data(), 5, 1,
                                      reinterpret_cast<BITMAPINFOHEADER *>(dib.data())), TS_OK);
            const int64_t entries = used ? used : 1 << bits;
            const int64_t stride = ((int64_t{bits} * 30 + 31) >> 3) & ~3;
            Bytes want = MakeDib(bits, 30, 4, used);
            for (int y = 0; y < 3; ++y) {
                uint8_t *t = want.data() + 40 + 4 * entries + (1 + y) * stride + ((bits * 5) >> 3);
                const uint8_t *s = At(src, bits, 3, 1 + y);
                if (bits == 1) rowbits::CopyRow1(17, 3, s, 5, t);
                else if (bits == 4) rowbits::CopyRow4(17, 1, s, 1, t);
                else std::memcpy(t, s, 17);
            }
            ASSERT_EQ(dib, want) << bits << " " << used;
            // And back, the rectangle now on the DIB.
            Bytes got = Random(kStride * kRows, 99), expect = got;
            const RECT onDib{5, 1, 22, 4};
            ASSERT_EQ(BI_DIBToMemBits(&onDib, reinterpret_cast<const BITMAPINFOHEADER *>(dib.data()), &b,
                                      kStride, 2, 0, got.data()), TS_OK);
            for (int y = 0; y < 3; ++y) {
                const uint8_t *s = dib.data() + 40 + 4 * entries + (1 + y) * stride + ((bits * 5) >> 3);
                uint8_t *t = At(expect, bits, 2, y);
                if (bits == 1) rowbits::CopyRow1(17, 5, s, 2, t);
                else if (bits == 4) rowbits::CopyRow4(17, 1, s, 0, t);
                else std::memcpy(t, s, 17);
            }
            ASSERT_EQ(got, expect) << bits << " " << used;
        }
    const BI_Bitmap odd = Layout(2, 16, 1);
    Bytes dib = MakeDib(8, 4, 1, 0);
    const Bytes src(16, 0);
    const RECT r{0, 0, 2, 1};
    EXPECT_EQ(BI_MemBitsToDIB(&odd, 8, &r, src.data(), 0, 0, reinterpret_cast<BITMAPINFOHEADER *>(dib.data())), -2);
}

TEST(BlockMovers, FillAndReverseCoverTheRowFiller) {
    BI_Bitmap *b = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(1, 1, 13, 5, 300, 300, 1, 0, nullptr, &b, 1, 0, 0, 0), TS_OK);
    BI_FillByte(b, 0x5A);
    const int64_t n = int64_t{b->height} * b->bytesPerRow;
    auto *p = static_cast<uint8_t *>(MEM_Lock(b->pixelHandle));
    for (int64_t i = 0; i < n; ++i) ASSERT_EQ(p[i], 0x5A) << i;
    MEM_Unlock(b->pixelHandle);
    BI_ReverseByte(b);
    p = static_cast<uint8_t *>(MEM_Lock(b->pixelHandle));
    for (int64_t i = 0; i < n; ++i) ASSERT_EQ(p[i], 0xA5) << i;
    MEM_Unlock(b->pixelHandle);
    BI_DeleteBitmap(&b);
}

}  // namespace
