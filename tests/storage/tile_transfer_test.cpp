#include <fcntl.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <vector>

#include <tessarine/storage.h>

#include "platform/test_hooks.h"
#include "test_support.h"
#include "tile_test_util.h"

namespace {

using tessarine::testing::FileCall;
using tiletest::TileFile;

inline int GetBit(const uint8_t *row, int64_t bit) { return (row[bit >> 3] >> (7 - (bit & 7))) & 1; }
inline void SetBit(uint8_t *row, int64_t bit, int v) {
    const uint8_t m = static_cast<uint8_t>(0x80 >> (bit & 7));
    row[bit >> 3] = static_cast<uint8_t>(v ? row[bit >> 3] | m : row[bit >> 3] & ~m);
}
int64_t FloorDiv(int64_t a, int64_t b) { return a >= 0 ? a / b : -((-a + b - 1) / b); }
int64_t Mod8(int64_t a) { return a & 7; }

// The image as packed rows, tiles side by side: what the file's pixels must be.
struct Model {
    int32_t w, h, d;
    int64_t rowBytes;
    std::vector<uint8_t> bytes;
    Model(int32_t w_, int32_t h_, int32_t d_)
        : w(w_), h(h_), d(d_), rowBytes((int64_t{w_} * d_ + 7) / 8), bytes(rowBytes * h_) {}
    uint8_t *Row(int64_t y) { return bytes.data() + y * rowBytes; }
};

// A buffer for a box, one byte longer per row than the box needs, with a
// second byte of slack behind the last row.
struct BoxBuffer {
    int64_t stride;
    std::vector<uint8_t> bytes;
    BoxBuffer(const HVT_Box &b, int32_t d, std::mt19937 &rng)
        : stride((int64_t{b.right - b.left} * d + 7) / 8 + 2),
          bytes(stride * (b.bottom - b.top) + 2) {
        for (auto &v : bytes) v = static_cast<uint8_t>(rng());
    }
    uint8_t *Row(int64_t r) { return bytes.data() + r * stride; }
};

struct Clip {
    int64_t left, top, right, bottom;
    bool Empty() const { return left >= right || top >= bottom; }
};
Clip ClipToImage(const HVT_Box &b, const Model &m) {
    return {std::max<int64_t>(b.left, 0), std::max<int64_t>(b.top, 0),
            std::min<int64_t>(b.right, m.w), std::min<int64_t>(b.bottom, m.h)};
}

void ModelPlainSave(Model &m, const HVT_Box &b, BoxBuffer &buf) {
    const Clip c = ClipToImage(b, m);
    if (c.Empty()) return;
    const int64_t base = int64_t{b.left} * m.d / 8;  // exact: left is byte-aligned here
    for (int64_t y = c.top; y < c.bottom; ++y)
        for (int64_t j = c.left * m.d / 8; j < (c.right * m.d + 7) / 8; ++j)
            m.Row(y)[j] = buf.Row(y - b.top)[j - base];
}

void ModelShiftSave(Model &m, const HVT_Box &b, BoxBuffer &buf) {
    const Clip c = ClipToImage(b, m);
    if (c.Empty()) return;
    const int64_t p = Mod8(int64_t{b.left} * m.d);
    for (int64_t y = c.top; y < c.bottom; ++y)
        for (int64_t x = c.left; x < c.right; ++x)
            for (int k = 0; k < m.d; ++k)
                SetBit(m.Row(y), x * m.d + k, GetBit(buf.Row(y - b.top), (x - b.left) * m.d + p + k));
}

// Expected buffer of a read, and which of its bits are known (pad bits of the
// file are not).
struct Expected {
    std::vector<uint8_t> bytes;
    std::vector<uint8_t> care;
};

Expected ModelPlainRead(Model &m, const HVT_Box &b, const BoxBuffer &before) {
    Expected e{before.bytes, std::vector<uint8_t>(before.bytes.size(), 0xFF)};
    const Clip c = ClipToImage(b, m);
    if (c.Empty()) return e;
    const int64_t base = int64_t{b.left} * m.d / 8;
    for (int64_t y = c.top; y < c.bottom; ++y) {
        uint8_t *row = e.bytes.data() + (y - b.top) * before.stride;
        uint8_t *care = e.care.data() + (y - b.top) * before.stride;
        for (int64_t j = c.left * m.d / 8; j < (c.right * m.d + 7) / 8; ++j) {
            row[j - base] = m.Row(y)[j];
            for (int k = 0; k < 8; ++k)
                if (j * 8 + k >= int64_t{m.w} * m.d) SetBit(care, (j - base) * 8 + k, 0);
        }
    }
    return e;
}

// tileBuffer as the text's walk leaves it: each tile's rows of the box at its
// start, T bytes apart, taken from the file as it stands after the transfer.
struct TileBufferModel {
    int fd;
    std::vector<uint8_t> bytes;
    TileBufferModel(const char *path, int32_t d)
        : fd(::open(path, O_RDONLY)), bytes(static_cast<size_t>(d) << 20) {}
    ~TileBufferModel() { ::close(fd); }
    // Calls perTile(tile, I, T) after laying each tile's rows down, in the
    // order of the walk.
    template <class PerTile>
    void Walk(HVT_FileInfo *info, uint8_t sub, const HVT_Box &b, int32_t d, PerTile &&perTile) {
        const HVT_SubbmpSlot &slot = info->subbmps[sub];
        for (int32_t i = 0; i < slot.tilesAcross * slot.tilesDown; ++i) {
            const HVT_TileHdr &t = slot.tileHdrs[i];
            const HVT_Box I{std::max(t.left, b.left), std::max(t.top, b.top),
                            std::min(t.right, b.right), std::min(t.bottom, b.bottom)};
            if (I.left >= I.right || I.top >= I.bottom) continue;
            const int64_t T = (int64_t{t.right - t.left} * d + 7) / 8;
            const int64_t n = T * (I.bottom - I.top);
            EXPECT_EQ(::pread(fd, bytes.data(), static_cast<size_t>(n), t.offset + T * (I.top - t.top)), n);
            perTile(t, I, T);
        }
    }
    void Walk(HVT_FileInfo *info, uint8_t sub, const HVT_Box &b, int32_t d) {
        Walk(info, sub, b, d, [](const HVT_TileHdr &, const HVT_Box &, int64_t) {});
    }
    int Bit(int64_t at) const {
        return at < int64_t(bytes.size()) * 8 ? GetBit(bytes.data(), at) : 0;
    }
};

// The span's pixels from the model; the bits that finish a first byte behind
// a short span from tileBuffer as it lies (the rest of the tile row, then the
// next row in the buffer, and nothing past its end).
Expected ModelShiftRead(Model &m, const HVT_Box &b, const BoxBuffer &before, TileBufferModel &tb,
                        HVT_FileInfo *info, uint8_t sub) {
    Expected e{before.bytes, std::vector<uint8_t>(before.bytes.size(), 0xFF)};
    const int64_t d = m.d;
    tb.Walk(info, sub, b, m.d, [&](const HVT_TileHdr &t, const HVT_Box &I, int64_t T) {
        for (int64_t y = I.top; y < I.bottom; ++y) {
            uint8_t *row = e.bytes.data() + (y - b.top) * before.stride;
            const int64_t to = (int64_t{I.left} - b.left) * d, bits = int64_t{I.right - I.left} * d;
            for (int64_t k = 0; k < bits; ++k) SetBit(row, to + k, GetBit(m.Row(y), I.left * d + k));
            const int64_t from = (y - I.top) * T * 8 + (int64_t{I.left} - t.left) * d;
            for (int64_t k = bits; k < 8 - (to & 7); ++k) SetBit(row, to + k, tb.Bit(from + k));
        }
    });
    return e;
}

void ExpectBuffer(const Expected &e, const BoxBuffer &got, const char *what, const HVT_Box &b) {
    for (size_t i = 0; i < e.bytes.size(); ++i) {
        if ((e.bytes[i] ^ got.bytes[i]) & e.care[i]) {
            ADD_FAILURE() << what << " box (" << b.left << "," << b.top << "," << b.right << ","
                          << b.bottom << ") differs at byte " << i << " (row " << i / got.stride
                          << "): expected " << int(e.bytes[i]) << " got " << int(got.bytes[i]);
            return;
        }
    }
}

// Compares every pixel of the file with the model.
void ExpectFileMatches(TileFile &f, uint8_t sub, Model &m) {
    const auto file = tiletest::FileBytes(f.Path());
    ASSERT_EQ(HVT_GetSubbmpTileHdrs(sub, f.Info()), TS_OK);
    const HVT_SubbmpSlot &slot = f.Info()->subbmps[sub];
    for (int32_t t = 0; t < slot.tilesAcross * slot.tilesDown; ++t) {
        const HVT_TileHdr &th = slot.tileHdrs[t];
        const int64_t T = (int64_t{th.right - th.left} * m.d + 7) / 8;
        const int64_t bits = int64_t{th.right - th.left} * m.d;
        const int64_t whole = bits / 8;  // tiles start on a byte of the image row
        for (int64_t y = th.top; y < th.bottom; ++y) {
            const uint8_t *frow = file.data() + th.offset + T * (y - th.top);
            const uint8_t *mrow = m.Row(y) + th.left * m.d / 8;
            bool same = std::memcmp(frow, mrow, static_cast<size_t>(whole)) == 0;
            for (int64_t k = whole * 8; same && k < bits; ++k)
                same = GetBit(frow, k) == GetBit(mrow, k);
            if (!same) {
                ADD_FAILURE() << "file differs from the model at tile " << t << " row " << y;
                return;
            }
        }
    }
}

HVT_Box RandomBox(std::mt19937 &rng, int32_t w, int32_t h) {
    auto r = [&](int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); };
    int32_t x, y;
    switch (r(0, 3)) {
        case 0:  // around a tile corner
            x = (w > 8192 ? 8192 * r(1, (w - 1) / 8192) : 0) + r(-150, 150);
            y = (h > 1024 ? 1024 * r(1, (h - 1) / 1024) : 0) + r(-60, 60);
            break;
        case 1:  // around the far edges
            x = w + r(-200, 20);
            y = h + r(-70, 5);
            break;
        case 2:  // somewhat outside on the left or top
            x = r(-40, 30);
            y = r(-20, 20);
            break;
        default:
            x = r(0, w - 1);
            y = r(0, h - 1);
    }
    const int32_t width = r(1, 3) == 1 ? r(1, 9) : r(1, 320);
    const int32_t height = r(1, 60);
    return {x - width / 2, y - height / 2, x - width / 2 + width, y - height / 2 + height};
}

void AlignLeft(HVT_Box &b, int32_t d) {
    if (d >= 8) return;
    const int32_t per = 8 / d;
    b.left = static_cast<int32_t>(FloorDiv(b.left, per) * per);
}

struct Shape {
    int32_t d, w, h;
};

class TileTransferModel : public tstest::Sandbox, public ::testing::WithParamInterface<Shape> {};

void Exercise(TileFile &f, uint8_t sub, Model &m, std::mt19937 &rng, int rounds) {
    HVT_FileInfo *info = f.Info();
    TileBufferModel tb(f.Path(), m.d);
    // What the buffer holds before the first transfer is the allocator's.
    std::memset(info->tileBuffer, 0, tb.bytes.size());
    const int32_t d = m.d;
    // Fill the whole sub-bitmap first, so that nothing depends on unwritten bytes.
    {
        const HVT_Box all{0, 0, m.w, m.h};
        std::vector<uint8_t> pixels(m.bytes.size());
        uint64_t x = rng() | 1;
        for (auto &v : pixels) {  // xorshift: cheap enough for tens of megabytes
            x ^= x << 13;
            x ^= x >> 7;
            x ^= x << 17;
            v = static_cast<uint8_t>(x >> 24);
        }
        ASSERT_EQ(HVT_SaveBlock(sub, info, &all, static_cast<int32_t>(m.rowBytes), pixels.data()),
                  TS_OK);
        m.bytes = pixels;
        tb.Walk(info, sub, all, d);
    }
    for (int i = 0; i < rounds; ++i) {
        HVT_Box b = RandomBox(rng, m.w, m.h);
        const int op = i % 4;
        if (op == 0 || op == 2) AlignLeft(b, d);
        BoxBuffer buf(b, d, rng);
        const int32_t stride = static_cast<int32_t>(buf.stride);
        switch (op) {
            case 0:
                ASSERT_EQ(HVT_SaveBlock(sub, info, &b, stride, buf.bytes.data()), TS_OK);
                ModelPlainSave(m, b, buf);
                break;
            case 1:
                ASSERT_EQ(HVT_SaveBlockWithBitShift(sub, info, &b, stride, buf.bytes.data()), TS_OK);
                ModelShiftSave(m, b, buf);
                break;
            case 2: {
                const Expected e = ModelPlainRead(m, b, buf);
                ASSERT_EQ(HVT_ReadBlock(sub, info, &b, stride, buf.bytes.data()), TS_OK);
                ExpectBuffer(e, buf, "plain read", b);
                break;
            }
            default: {
                const bool plain = d >= 8 || (int64_t{b.left} * d) % 8 == 0;
                if (plain) {
                    const Expected e = ModelPlainRead(m, b, buf);
                    ASSERT_EQ(HVT_ReadBlockWithBitShift(sub, info, &b, stride, buf.bytes.data()), TS_OK);
                    ExpectBuffer(e, buf, "bit-shift read", b);
                    break;
                }
                ASSERT_EQ(HVT_GetSubbmpTileHdrs(sub, info), TS_OK);
                const Expected e = ModelShiftRead(m, b, buf, tb, info, sub);
                ASSERT_EQ(HVT_ReadBlockWithBitShift(sub, info, &b, stride, buf.bytes.data()), TS_OK);
                ExpectBuffer(e, buf, "bit-shift read", b);
            }
        }
        tb.Walk(info, sub, b, d);
        if (::testing::Test::HasFailure()) return;
    }
    ExpectFileMatches(f, sub, m);
}

TEST_P(TileTransferModel, RandomBoxesAgreeWithTheModel) {
    const Shape s = GetParam();
    TileFile f(static_cast<uint8_t>(s.d), s.w, s.h);
    ASSERT_EQ(f.Status(), TS_OK);
    std::mt19937 rng(1234 + s.d * 7 + s.w);
    Model m(s.w, s.h, s.d);
    Exercise(f, 0, m, rng, 160);
}

class TileTransferSubbmp : public TileTransferModel {};

TEST_P(TileTransferSubbmp, SubBitmapAddedAfterTheFirst) {
    const Shape s = GetParam();
    TileFile f(static_cast<uint8_t>(s.d), 300, 200);
    ASSERT_EQ(f.Status(), TS_OK);
    ASSERT_EQ(f.AddSubbmp(static_cast<uint32_t>(s.w), static_cast<uint32_t>(s.h)), TS_OK);
    std::mt19937 rng(99 + s.d);
    Model first(300, 200, s.d), second(s.w, s.h, s.d);
    Exercise(f, 0, first, rng, 20);
    Exercise(f, 1, second, rng, 60);
    ExpectFileMatches(f, 0, first);
}

std::string ShapeName(const ::testing::TestParamInfo<Shape> &info) {
    return "d" + std::to_string(info.param.d) + "_" + std::to_string(info.param.w) + "x" +
           std::to_string(info.param.h);
}

INSTANTIATE_TEST_SUITE_P(Depths, TileTransferModel,
                         ::testing::Values(Shape{1, 8193, 1025}, Shape{4, 8193, 1025},
                                           Shape{8, 8193, 1025}, Shape{24, 8193, 1025},
                                           Shape{32, 8193, 1025}, Shape{1, 16385, 2049},
                                           Shape{4, 16390, 2100}),
                         ShapeName);
INSTANTIATE_TEST_SUITE_P(Depths, TileTransferSubbmp,
                         ::testing::Values(Shape{1, 8193, 1025}, Shape{4, 8193, 1025},
                                           Shape{8, 8193, 1025}, Shape{24, 8193, 1025},
                                           Shape{32, 8193, 1025}),
                         ShapeName);

// ---- The stated cases -------------------------------------------------------------------

class TileTransfer : public tstest::Sandbox {};

TEST_F(TileTransfer, OnePixelAt32BitsMovesFourBytesAndRewritesOneTileRow) {
    TileFile f(32, 100, 10);
    ASSERT_EQ(f.Status(), TS_OK);
    ASSERT_EQ(HVT_GetSubbmpTileHdrs(0, f.Info()), TS_OK);
    std::vector<uint8_t> image(400 * 10);
    for (size_t i = 0; i < image.size(); ++i) image[i] = static_cast<uint8_t>(i * 7 + 1);
    const HVT_Box all{0, 0, 100, 10};
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &all, 400, image.data()), TS_OK);
    const HVT_Box b{7, 3, 8, 4};
    const uint8_t px[4] = {1, 2, 3, 4};
    tessarine::testing::ResetInjection();
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &b, 0, px), TS_OK);
    EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Read), 1);
    EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Write), 1);
    const auto bytes = tiletest::FileBytes(f.Path());
    EXPECT_EQ(std::memcmp(&bytes[116 + 400 * 3 + 28], px, 4), 0);
    // The rest of the tile row was read and written back as it was.
    std::memcpy(&image[400 * 3 + 28], px, 4);
    EXPECT_EQ(std::memcmp(&bytes[116], image.data(), image.size()), 0);
    uint8_t back[8] = {9, 9, 9, 9, 9, 9, 9, 9};
    ASSERT_EQ(HVT_ReadBlock(0, f.Info(), &b, 0, back), TS_OK);
    EXPECT_EQ(std::memcmp(back, px, 4), 0);
    EXPECT_EQ(back[4], 9);
}

TEST_F(TileTransfer, FourTilesAreServedInReadingOrder) {
    TileFile f(8, 8193, 1025);
    ASSERT_EQ(f.Status(), TS_OK);
    const HVT_Box b{8190, 1022, 8193, 1025};  // 3 by 3 across all four tiles
    std::vector<uint8_t> buf(9, 0xEE);
    ASSERT_EQ(HVT_GetSubbmpTileHdrs(0, f.Info()), TS_OK);
    auto pixel = [&](int x, int y) {
        const auto bytes = tiletest::FileBytes(f.Path());
        const HVT_TileHdr *t = f.Info()->subbmps[0].tileHdrs;
        const int tile = HVT_PixelInWhichTile(2, x, y);
        const int T = t[tile].right - t[tile].left;
        return bytes[t[tile].offset + T * (y - t[tile].top) + (x - t[tile].left)];
    };
    const int corner[4][2] = {{8190, 1022}, {8192, 1022}, {8190, 1024}, {8192, 1024}};
    for (int failAt = 2; failAt <= 4; ++failAt) {
        buf.assign(9, static_cast<uint8_t>(failAt));
        tessarine::testing::FailFileCallAt(FileCall::Write, failAt);
        EXPECT_EQ(HVT_SaveBlock(0, f.Info(), &b, 3, buf.data()), -50);
        tessarine::testing::ResetInjection();
        for (int t = 0; t < 4; ++t)
            EXPECT_EQ(pixel(corner[t][0], corner[t][1]) == failAt, t < failAt - 1)
                << "write " << failAt << " tile " << t;
    }
}

TEST_F(TileTransfer, WholeTileWidthSavesWithoutReading) {
    TileFile f(8, 9000, 30);
    ASSERT_EQ(f.Status(), TS_OK);
    ASSERT_EQ(HVT_GetSubbmpTileHdrs(0, f.Info()), TS_OK);
    std::vector<uint8_t> rows(8192 * 5, 0x42);
    const HVT_Box b{0, 3, 8192, 8};
    tessarine::testing::ResetInjection();
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &b, 8192, rows.data()), TS_OK);
    EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Read), 0);
    EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Write), 1);
    tessarine::testing::ResetInjection();
    ASSERT_EQ(HVT_SaveBlockWithBitShift(0, f.Info(), &b, 8192, rows.data()), TS_OK);
    EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Read), 0);
}

TEST_F(TileTransfer, OneBitShiftedSaveChangesOnlyItsPixels) {
    TileFile f(1, 64, 1);
    ASSERT_EQ(f.Status(), TS_OK);
    const HVT_Box row{0, 0, 64, 1};
    const uint8_t zeros[8] = {};
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &row, 0, zeros), TS_OK);
    const HVT_Box b{3, 0, 5, 1};
    const uint8_t src[1] = {0x18};  // bits 3 and 4 set: pixels 3 and 4 at bit 3 of the buffer
    ASSERT_EQ(HVT_SaveBlockWithBitShift(0, f.Info(), &b, 0, src), TS_OK);
    uint8_t back[8];
    ASSERT_EQ(HVT_ReadBlock(0, f.Info(), &row, 0, back), TS_OK);
    EXPECT_EQ(back[0], 0x18);
    const uint8_t other[1] = {0xE7};  // everything but bits 3 and 4
    ASSERT_EQ(HVT_SaveBlockWithBitShift(0, f.Info(), &b, 0, other), TS_OK);
    ASSERT_EQ(HVT_ReadBlock(0, f.Info(), &row, 0, back), TS_OK);
    EXPECT_EQ(back[0], 0x00);
}

TEST_F(TileTransfer, OneBitShiftedReadStartsAtTheTopBitAndFinishesTheByte) {
    TileFile f(1, 64, 1);
    ASSERT_EQ(f.Status(), TS_OK);
    const HVT_Box row{0, 0, 64, 1};
    const uint8_t pixels[8] = {0x13, 0xA5};  // 0001 0011  1010 0101
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &row, 0, pixels), TS_OK);
    const HVT_Box b{3, 0, 5, 1};
    uint8_t out[2] = {0x00, 0x77};
    ASSERT_EQ(HVT_ReadBlockWithBitShift(0, f.Info(), &b, 0, out), TS_OK);
    // pixels 3.. : 1 0 0 1 1 1 0 1  (pixels 3 to 10)
    EXPECT_EQ(out[0], 0x9D) << "pixel 3 on top, the rest of the byte from the row";
    EXPECT_EQ(out[1], 0x77);
    // A longer span keeps the bits after its end.
    const HVT_Box longer{3, 0, 13, 1};
    out[0] = 0xFF;
    out[1] = 0xFF;
    ASSERT_EQ(HVT_ReadBlockWithBitShift(0, f.Info(), &longer, 0, out), TS_OK);
    EXPECT_EQ(out[0], 0x9D);
    EXPECT_EQ(out[1], 0x3F) << "pixels 11, 12 then six kept bits";
}

TEST_F(TileTransfer, ByteAlignedBoxEndingAtTheWidthTakesThePlainSave) {
    TileFile f(1, 13, 1);
    ASSERT_EQ(f.Status(), TS_OK);
    const HVT_Box b{0, 0, 13, 1};
    const uint8_t ones[2] = {0xFF, 0xFF};
    ASSERT_EQ(HVT_SaveBlockWithBitShift(0, f.Info(), &b, 0, ones), TS_OK);
    const auto bytes = tiletest::FileBytes(f.Path());
    EXPECT_EQ(bytes[116], 0xFF);
    EXPECT_EQ(bytes[117], 0xFF) << "whole bytes: the pad bits come from the buffer";
}

TEST_F(TileTransfer, PlainFormsCarryNeighboursInEdgeBytes) {
    TileFile f(1, 32, 1);
    ASSERT_EQ(f.Status(), TS_OK);
    const HVT_Box row{0, 0, 32, 1};
    const uint8_t zeros[4] = {};
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &row, 0, zeros), TS_OK);
    const HVT_Box b{3, 0, 5, 1};
    const uint8_t ones[1] = {0xFF};
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &b, 0, ones), TS_OK);
    uint8_t back[4];
    ASSERT_EQ(HVT_ReadBlock(0, f.Info(), &row, 0, back), TS_OK);
    EXPECT_EQ(back[0], 0xFF) << "the whole edge byte is overwritten";
}

TEST_F(TileTransfer, PlainReadOfAnUnalignedBoxPlacesLaterTilesByTruncation) {
    TileFile f(1, 8200, 1);
    ASSERT_EQ(f.Status(), TS_OK);
    std::vector<uint8_t> row(1025);
    for (size_t i = 0; i < row.size(); ++i) row[i] = static_cast<uint8_t>(i);
    const HVT_Box all{0, 0, 8200, 1};
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &all, 0, row.data()), TS_OK);
    // From x = 3 the second tile's bytes go to ((8192 - 3) * 1) / 8 = 1023,
    // over the first tile's last byte.
    const HVT_Box b{3, 0, 8200, 1};
    std::vector<uint8_t> out(1030, 0xEE);
    ASSERT_EQ(HVT_ReadBlock(0, f.Info(), &b, 0, out.data()), TS_OK);
    EXPECT_EQ(out[0], row[0]);
    EXPECT_EQ(out[1022], row[1022]);
    EXPECT_EQ(out[1023], row[1024]);
    EXPECT_EQ(out[1024], 0xEE);
}

TEST_F(TileTransfer, BoxesOutsideFindNothing) {
    TileFile f(8, 8193, 1025);
    ASSERT_EQ(f.Status(), TS_OK);
    std::vector<uint8_t> buf(64 * 64, 0x5A);
    ASSERT_EQ(HVT_GetSubbmpTileHdrs(0, f.Info()), TS_OK);
    const HVT_Box outside[] = {
        {0, 1025, 10, 1030},           // top at the height
        {0, 5000, 10, 5010},           // far below
        {-100, -100, -10, -10},        // left of and above
        {9000, 0, 9010, 10},           // right of the last tile column
        {20000, 1020, 20010, 1030},    // far right, in the last band
        {-20000, -5000, -19990, -4990},
        {5, 5, 5, 9},                  // empty
    };
    for (const HVT_Box &b : outside) {
        tessarine::testing::ResetInjection();
        EXPECT_EQ(HVT_ReadBlock(0, f.Info(), &b, 64, buf.data()), TS_OK);
        EXPECT_EQ(HVT_SaveBlock(0, f.Info(), &b, 64, buf.data()), TS_OK);
        EXPECT_EQ(HVT_ReadBlockWithBitShift(0, f.Info(), &b, 64, buf.data()), TS_OK);
        EXPECT_EQ(HVT_SaveBlockWithBitShift(0, f.Info(), &b, 64, buf.data()), TS_OK);
        EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Read), 0);
        EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Write), 0);
    }
    for (uint8_t v : buf) ASSERT_EQ(v, 0x5A);
    EXPECT_EQ(HVT_ReadBlock(10, f.Info(), &outside[0], 64, buf.data()), -4);
}

TEST_F(TileTransfer, EveryFailureStopsTheWalkWithItsStatus) {
    TileFile f(4, 8193, 1025);
    ASSERT_EQ(f.Status(), TS_OK);
    const HVT_Box b{8180, 1000, 8193, 1025};
    const HVT_Box odd{8181, 1000, 8193, 1025};
    std::vector<uint8_t> buf(16 * 25 + 8, 0x33);
    using Fn = int32_t (*)(uint8_t, HVT_FileInfo *, const HVT_Box *, int32_t, void *);
    const Fn reads[] = {HVT_ReadBlock, HVT_ReadBlockWithBitShift};
    const Fn saves[] = {
        [](uint8_t s, HVT_FileInfo *i, const HVT_Box *x, int32_t st, void *p) {
            return HVT_SaveBlock(s, i, x, st, p);
        },
        [](uint8_t s, HVT_FileInfo *i, const HVT_Box *x, int32_t st, void *p) {
            return HVT_SaveBlockWithBitShift(s, i, x, st, p);
        }};
    auto check = [&](Fn fn, const HVT_Box &box, FileCall kind) {
        tstest::ForEachFileFailure(kind, [&](int64_t) {
            const int32_t s = fn(0, f.Info(), &box, 16, buf.data());
            EXPECT_EQ(s, tessarine::testing::FileFailureHit(kind) ? -50 : TS_OK);
        });
        tstest::ForEachAllocationFailure([&](int64_t) {
            HVT_FileInfo info;
            HVT_InitFileInfo(&info);
            BI_Bitmap view{};
            view.tileFile = f.Fd();
            std::snprintf(view.tilePath, sizeof view.tilePath, "%s", f.Path());
            int32_t s = HVT_TileFileBegin(&view, &info, 0);
            if (s == TS_OK) s = fn(0, &info, &box, 16, buf.data());
            EXPECT_EQ(s, tessarine::testing::AllocationFailureHit() ? -5 : TS_OK);
            HVT_TileFileEnd(&info, 0);
        });
    };
    for (const HVT_Box *box : {&b, &odd}) {
        for (Fn fn : reads)
            for (FileCall k : {FileCall::Read, FileCall::Seek}) check(fn, *box, k);
        for (Fn fn : saves)
            for (FileCall k : {FileCall::Read, FileCall::Write, FileCall::Seek}) check(fn, *box, k);
    }
}

// ---- The shifted read finishes a first byte from tileBuffer as it lies ---------------

class ShiftedRead : public tstest::Sandbox {
  protected:
    // A 16 by 15 one-bit indexed image: byte 0 of row y is 0x10 * (y & 15) | 3,
    // byte 1 is 0xA0 | y.
    static uint8_t Byte0(int y) { return static_cast<uint8_t>(0x10 * (y & 15) | 3); }
    static uint8_t Byte1(int y) { return static_cast<uint8_t>(0xA0 | y); }
    static void FillSmall(TileFile &f) {
        std::vector<uint8_t> image(30);
        for (int y = 0; y < 15; ++y) {
            image[2 * y] = Byte0(y);
            image[2 * y + 1] = Byte1(y);
        }
        const HVT_Box all{0, 0, 16, 15};
        ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &all, 2, image.data()), TS_OK);
    }
};

// Save (0,4)-(5,11), then read (12,4)-(16,9): the low four bits of each first
// byte are the first pixels of the next row in the buffer, for the last row
// read too (row 9, left there by the save).
TEST_F(ShiftedRead, ShortSpanTakesTheNextRowInTheBuffer) {
    const uint8_t colors[6] = {0, 0, 0, 255, 255, 255};
    TileFile f(1, 16, 15, 3, 1, 2, colors);
    ASSERT_EQ(f.Status(), TS_OK);
    FillSmall(f);
    const HVT_Box save{0, 4, 5, 11};
    const uint8_t saved[7] = {0x9F, 0x2E, 0xC1, 0x77, 0x58, 0xE4, 0x3B};
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &save, 1, saved), TS_OK);
    auto firstByte = [&](int y) { return y >= 4 && y < 11 ? saved[y - 4] : Byte0(y); };
    const HVT_Box read{12, 4, 16, 9};
    uint8_t out[5] = {};
    ASSERT_EQ(HVT_ReadBlockWithBitShift(0, f.Info(), &read, 1, out), TS_OK);
    for (int y = 4; y < 9; ++y)
        EXPECT_EQ(out[y - 4], ((Byte1(y) & 0x0F) << 4) | (firstByte(y + 1) >> 4)) << y;
}

// The same after transfers that go between the file and the caller without
// a copy: the buffer still holds what the text's walk leaves in it.
TEST_F(ShiftedRead, WholeRowTransfersLeaveTheirRowsInTheBuffer) {
    TileFile f(1, 16, 15);
    ASSERT_EQ(f.Status(), TS_OK);
    FillSmall(f);
    // A save of whole rows 4 to 11.
    uint8_t rows[16];
    for (int i = 0; i < 16; ++i) rows[i] = static_cast<uint8_t>(0x5C + 29 * i);
    const HVT_Box whole{0, 4, 16, 12};
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &whole, 2, rows), TS_OK);
    const HVT_Box read{12, 4, 16, 9};
    uint8_t out[5] = {};
    ASSERT_EQ(HVT_ReadBlockWithBitShift(0, f.Info(), &read, 1, out), TS_OK);
    for (int y = 4; y < 9; ++y)
        EXPECT_EQ(out[y - 4], ((rows[2 * (y - 4) + 1] & 0x0F) << 4) | (rows[2 * (y - 3)] >> 4)) << y;
    // A read of all 15 rows, then a shifted read of rows 2 to 5: behind row 5
    // the buffer holds row 4 of the earlier read.
    FillSmall(f);
    std::vector<uint8_t> all(30);
    const HVT_Box image{0, 0, 16, 15};
    ASSERT_EQ(HVT_ReadBlock(0, f.Info(), &image, 2, all.data()), TS_OK);
    const HVT_Box upper{12, 2, 16, 6};
    ASSERT_EQ(HVT_ReadBlockWithBitShift(0, f.Info(), &upper, 1, out), TS_OK);
    for (int y = 2; y < 5; ++y)
        EXPECT_EQ(out[y - 2], ((Byte1(y) & 0x0F) << 4) | (Byte0(y + 1) >> 4)) << y;
    EXPECT_EQ(out[3], ((Byte1(5) & 0x0F) << 4) | (Byte0(4) >> 4));
}

// Past the end of the buffer there is nothing to take: a full one-bit tile
// fills it, and its last row's short span is finished with zeros.
TEST_F(ShiftedRead, NothingIsTakenPastTheEndOfTheBuffer) {
    TileFile f(1, 8192, 1024);
    ASSERT_EQ(f.Status(), TS_OK);
    std::vector<uint8_t> image(1024 * 1024, 0xFF);
    for (int y = 0; y < 1024; ++y) image[int64_t{y} * 1024] = static_cast<uint8_t>(y * 37 | 0x80);
    const HVT_Box all{0, 0, 8192, 1024};
    ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &all, 1024, image.data()), TS_OK);
    const HVT_Box read{8189, 0, 8192, 1024};
    std::vector<uint8_t> out(1024, 0xFF);
    ASSERT_EQ(HVT_ReadBlockWithBitShift(0, f.Info(), &read, 1, out.data()), TS_OK);
    for (int y = 0; y < 1023; ++y)
        ASSERT_EQ(out[y], 0xE0 | (image[int64_t{y + 1} * 1024] >> 3)) << y;
    EXPECT_EQ(out[1023], 0xE0);
}

// Every source phase and every span that ends inside the first byte, with
// destination phases from a second tile column, on the last row of a tile,
// the rows before it and the last row read, at 1 and 4 bits per pixel.
TEST_F(ShiftedRead, EveryPhaseAndShortSpanAgainstTheText) {
    for (int32_t d : {1, 4}) {
        const int32_t w = 8192 + 5, h = 1030;
        TileFile f(static_cast<uint8_t>(d), w, h);
        ASSERT_EQ(f.Status(), TS_OK);
        Model m(w, h, d);
        uint32_t x = 0x9E3779B9u;
        for (auto &v : m.bytes) {
            x = x * 1664525u + 1013904223u;
            v = static_cast<uint8_t>(x >> 24);
        }
        const HVT_Box all{0, 0, w, h};
        ASSERT_EQ(HVT_SaveBlock(0, f.Info(), &all, static_cast<int32_t>(m.rowBytes), m.bytes.data()),
                  TS_OK);
        TileBufferModel tb(f.Path(), d);
        tb.Walk(f.Info(), 0, all, d);
        std::mt19937 rng(d);
        const int32_t per = 8 / d;
        const int32_t rowRanges[][2] = {{1019, 1024}, {1, 6}, {1024, 1030}, {1020, 1027}};
        int cases = 0;
        for (const auto &rows : rowRanges) {
            for (int32_t left = 1; left < 2 * per; ++left) {
                if (left % per == 0) continue;
                // In the first tile column: spans of 1 pixel up to past the byte.
                for (int32_t span = 1; span <= per + 1; ++span) {
                    for (int32_t base : {0, 8, 4096, 8192 - 2 * per}) {
                        const HVT_Box b{base + left, rows[0], base + left + span, rows[1]};
                        BoxBuffer buf(b, d, rng);
                        const Expected e = ModelShiftRead(m, b, buf, tb, f.Info(), 0);
                        ASSERT_EQ(HVT_ReadBlockWithBitShift(0, f.Info(), &b, static_cast<int32_t>(buf.stride),
                                                            buf.bytes.data()),
                                  TS_OK);
                        ExpectBuffer(e, buf, "shifted read", b);
                        ++cases;
                    }
                }
                // Across the tile edge: the second column starts at destination
                // phase (8192 - left) * d mod 8 and its span is 1 to 5 pixels.
                for (int32_t tail = 1; tail <= 5; ++tail) {
                    const HVT_Box b{8192 - left, rows[0], 8192 + tail, rows[1]};
                    BoxBuffer buf(b, d, rng);
                    const Expected e = ModelShiftRead(m, b, buf, tb, f.Info(), 0);
                    ASSERT_EQ(HVT_ReadBlockWithBitShift(0, f.Info(), &b, static_cast<int32_t>(buf.stride),
                                                        buf.bytes.data()),
                              TS_OK);
                    ExpectBuffer(e, buf, "shifted read across tiles", b);
                    ++cases;
                }
                if (HasFailure()) return;
            }
        }
        EXPECT_GT(cases, 100);
    }
}

// A band session's record serves the transfers too: its band reads go
// straight into the band buffer, and tileBuffer still holds what their walks
// leave in it when a shifted read looks, after bands of the same height and
// after a shorter last band.
TEST_F(ShiftedRead, AfterTheBandReadsOfASession) {
    for (int32_t d : {1, 4}) {
        const int32_t w = 8200, h = 40;
        BI_Bitmap *b = nullptr;
        ASSERT_EQ(BI_CreateBlankBmp(2, static_cast<uint8_t>(d), w, h, 300, 300, 1, 0, nullptr, &b, 2, 0, 0, 0),
                  TS_OK);
        Model m(w, h, d);
        std::mt19937 rng(40 + d);
        for (auto &v : m.bytes) v = static_cast<uint8_t>(rng());
        {
            HVT_FileInfo info;
            HVT_InitFileInfo(&info);
            ASSERT_EQ(HVT_TileFileBegin(b, &info, 0), TS_OK);
            const HVT_Box all{0, 0, w, h};
            ASSERT_EQ(HVT_SaveBlock(0, &info, &all, static_cast<int32_t>(m.rowBytes), m.bytes.data()), TS_OK);
            HVT_TileFileEnd(&info, 0);
        }
        const int32_t bandRowBytes = w * d / 8 + 1;
        ASSERT_EQ(HVT_TileFileRowIOBegin(1, b, nullptr, 2, 0, bandRowBytes * 16), TS_OK);
        HVT_FileInfo *s = b->ioSession;
        ASSERT_EQ(s->bandRows, 16);
        TileBufferModel tb(b->tilePath, d);
        std::memset(s->tileBuffer, 0, tb.bytes.size());
        auto shifted = [&](const HVT_Box &box) {
            BoxBuffer buf(box, d, rng);
            const Expected e = ModelShiftRead(m, box, buf, tb, s, 0);
            ASSERT_EQ(HVT_ReadBlockWithBitShift(0, s, &box, static_cast<int32_t>(buf.stride), buf.bytes.data()),
                      TS_OK);
            ExpectBuffer(e, buf, "shifted read on the session's record", box);
        };
        uint8_t v = 0;
        ASSERT_EQ(BI_GetGRow(b, 3, 0, 1, &v), TS_OK);
        tb.Walk(s, 0, {0, 0, w, 16}, d);
        shifted({8189, 20, 8192, 22});
        ASSERT_EQ(BI_GetGRow(b, 3, 0, 1, &v), TS_OK);   // a new band read
        tb.Walk(s, 0, {0, 0, w, 16}, d);
        ASSERT_EQ(BI_GetGRow(b, 20, 0, 1, &v), TS_OK);  // the same height
        tb.Walk(s, 0, {0, 16, w, 32}, d);
        ASSERT_EQ(BI_GetGRow(b, 35, 0, 1, &v), TS_OK);  // shorter: 8 rows
        tb.Walk(s, 0, {0, 32, w, 40}, d);
        shifted({8189, 0, 8192, 9});
        shifted({8197, 1, 8199, 3});
        HVT_TileFileRowColIOEnd(b);
        BI_DeleteBitmap(&b);
    }
}

}  // namespace
