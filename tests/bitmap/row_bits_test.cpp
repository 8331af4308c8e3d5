// The 1-bit and 4-bit row movers against the bit models, at every phase pair
// and every count from 0 to 40 (and long runs for the word paths), and the
// worked cases of their definitions.
#include <gtest/gtest.h>

#include <random>

#include <tessarine/tessarine.h>

#include "bitmap/row_bits.h"
#include "row_bits_model.h"

namespace {

using rowbits::Bytes;

Bytes Random(size_t n, std::mt19937 &rng) {
    Bytes b(n);
    for (auto &v : b) v = static_cast<uint8_t>(rng());
    return b;
}

// Room on both sides of a run: the movers read and write past its ends.
constexpr size_t kRoom = 64;
constexpr int kFront = 8;

TEST(RowBits, CopyRow1MatchesModelAtEveryPhasePair) {
    std::mt19937 rng(1);
    for (int sp = 0; sp < 8; ++sp)
        for (int dp = 0; dp < 8; ++dp)
            for (int count = 0; count <= 40; ++count) {
                const Bytes src = Random(kRoom, rng);
                const Bytes dst = Random(kRoom, rng);
                Bytes got = dst, want = dst;
                BI_CopyRow1BPPBits(count, sp, src.data() + kFront, dp, got.data() + kFront);
                rowbits::CopyRow1(count, sp, src.data() + kFront, dp, want.data() + kFront);
                ASSERT_EQ(got, want) << "sp " << sp << " dp " << dp << " count " << count;
            }
}

TEST(RowBits, CopyRow1LongRunsMatchModel) {
    std::mt19937 rng(2);
    for (int sp = 0; sp < 8; ++sp)
        for (int dp = 0; dp < 8; ++dp)
            for (int count : {63, 64, 65, 71, 72, 129, 200, 517, 1000}) {
                const Bytes src = Random(200, rng);
                Bytes got = Random(200, rng), want = got;
                BI_CopyRow1BPPBits(count, sp, src.data() + kFront, dp, got.data() + kFront);
                rowbits::CopyRow1(count, sp, src.data() + kFront, dp, want.data() + kFront);
                ASSERT_EQ(got, want) << "sp " << sp << " dp " << dp << " count " << count;
            }
}

TEST(RowBits, CopyRow4MatchesModelAtEveryPhasePair) {
    std::mt19937 rng(3);
    for (int sp = 0; sp < 2; ++sp)
        for (int dp = 0; dp < 2; ++dp)
            for (int count : {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 15, 16, 17, 31, 32, 33, 40, 41,
                              127, 128, 129, 300}) {
                const Bytes src = Random(400, rng);
                Bytes got = Random(400, rng), want = got;
                BI_CopyRow4BPPBits(count, sp, src.data() + kFront, dp, got.data() + kFront);
                rowbits::CopyRow4(count, sp, src.data() + kFront, dp, want.data() + kFront);
                ASSERT_EQ(got, want) << "sp " << sp << " dp " << dp << " count " << count;
            }
}

TEST(RowBits, MaskRow1MatchesModelAtEveryPhaseTriple) {
    std::mt19937 rng(4);
    for (int sp = 0; sp < 8; ++sp)
        for (int mp = 0; mp < 8; ++mp)
            for (int dp = 0; dp < 8; ++dp)
                for (int count = 0; count <= 40; ++count)
                    for (int kind = 0; kind < 3; ++kind) {
                        const Bytes src = Random(kRoom, rng);
                        Bytes mask = Random(kRoom, rng);
                        if (kind == 1) mask.assign(kRoom, 0xFF);
                        if (kind == 2)  // sparse: whole zero bytes between set ones
                            for (size_t i = 0; i < mask.size(); ++i)
                                if (i % 3 != 0) mask[i] = 0;
                        Bytes got = Random(kRoom, rng), want = got;
                        BI_MaskRow1BPPBits(count, sp, src.data() + kFront, mp, mask.data() + kFront,
                                           dp, got.data() + kFront);
                        rowbits::MaskRow1(count, sp, src.data() + kFront, mp, mask.data() + kFront,
                                          dp, want.data() + kFront);
                        ASSERT_EQ(got, want) << "sp " << sp << " mp " << mp << " dp " << dp
                                             << " count " << count << " kind " << kind;
                    }
}

TEST(RowBits, MaskRow4MatchesModelAtEveryPhaseTriple) {
    std::mt19937 rng(5);
    for (int sp = 0; sp < 2; ++sp)
        for (int mp = 0; mp < 8; ++mp)
            for (int dp = 0; dp < 2; ++dp)
                for (int count = 0; count <= 40; ++count)
                    for (int kind = 0; kind < 3; ++kind) {
                        const Bytes src = Random(kRoom, rng);
                        Bytes mask = Random(kRoom, rng);
                        if (kind == 1) mask.assign(kRoom, 0xFF);
                        if (kind == 2)
                            for (size_t i = 0; i < mask.size(); ++i)
                                if (i % 3 != 0) mask[i] = 0;
                        Bytes got = Random(kRoom, rng), want = got;
                        BI_MaskRow4BPPBits(count, sp, src.data() + kFront, mp, mask.data() + kFront,
                                           dp, got.data() + kFront);
                        rowbits::MaskRow4(count, sp, src.data() + kFront, mp, mask.data() + kFront,
                                          dp, want.data() + kFront);
                        ASSERT_EQ(got, want) << "sp " << sp << " mp " << mp << " dp " << dp
                                             << " count " << count << " kind " << kind;
                    }
}

// Inside the blocks, the fenced form gives byte for byte what the raw form
// gives; outside them it neither writes nor reads.
TEST(RowBits, FencedFormsMatchRawInsideTheBlocks) {
    namespace bm = tessarine::bitmap;
    std::mt19937 rng(6);
    for (int sp = 0; sp < 8; ++sp)
        for (int mp = 0; mp < 8; mp += 3)
            for (int dp = 0; dp < 8; ++dp)
                for (int count = 0; count <= 40; count += 3) {
                    const Bytes src = Random(kRoom, rng), mask = Random(kRoom, rng);
                    const Bytes dst = Random(kRoom, rng);
                    const bm::Fence sf{src.data() + kFront, 32}, df{dst.data() + kFront, 32};
                    auto check = [&](auto run, const char *what) {
                        Bytes raw = dst, fenced = dst;
                        const bm::Fence f{fenced.data() + kFront, 32};
                        run(bm::RawBytes{}, raw.data());
                        run(bm::FencedBytes(sf, f, mask.data(), kRoom), fenced.data());
                        ASSERT_EQ(raw, fenced) << what << " sp " << sp << " dp " << dp << " count " << count;
                    };
                    (void)df;
                    check([&](const auto &a, uint8_t *t) { bm::CopyRow1(a, count, sp, src.data() + kFront, dp, t + kFront); }, "copy1");
                    check([&](const auto &a, uint8_t *t) { bm::CopyRow4(a, count, sp & 1, src.data() + kFront, dp & 1, t + kFront); }, "copy4");
                    check([&](const auto &a, uint8_t *t) { bm::MaskRow1(a, count, sp, src.data() + kFront, mp, mask.data() + kFront, dp, t + kFront); }, "mask1");
                    check([&](const auto &a, uint8_t *t) { bm::MaskRow4(a, count, sp & 1, src.data() + kFront, mp, mask.data() + kFront, dp & 1, t + kFront); }, "mask4");
                }
    // At the block's end: the byte after it is neither written nor trusted.
    Bytes src(5, 0xFF), dst(6, 0x00);
    const bm::Fence sf{src.data(), 4}, df{dst.data(), 5};
    const Bytes ones(8, 0xFF);
    bm::MaskRow1(bm::FencedBytes(sf, df, ones.data(), 8), 40, 0, src.data(), 0, ones.data(), 0,
                 dst.data());
    EXPECT_EQ(dst, (Bytes{0xFF, 0xFF, 0xFF, 0xFF, 0x00, 0x00}));
}

TEST(RowBits, CopyRow1EqualPhasesZeroCountEightCopiesOneByte) {
    const uint8_t src[3] = {0xA5, 0x3C, 0x77};
    uint8_t dst[3] = {0x00, 0x11, 0x22};
    BI_CopyRow1BPPBits(8, 0, src, 0, dst);
    EXPECT_EQ(dst[0], 0xA5);
    EXPECT_EQ(dst[1], 0x11);
    EXPECT_EQ(dst[2], 0x22);
}

TEST(RowBits, CopyRow1CountThreeChangesOnlyTopThreeBits) {
    const uint8_t src[3] = {0xFF, 0xFF, 0xFF};
    uint8_t dst[3] = {0x00, 0x00, 0x00};
    BI_CopyRow1BPPBits(3, 0, src, 0, dst);
    EXPECT_EQ(dst[0], 0xE0);
    EXPECT_EQ(dst[1], 0x00);
}

TEST(RowBits, CopyRow1PhaseThreeToOneMovesBitsTwoPlacesLeft) {
    // Source pixels from bit 3: 1 0 1 1 0 | 1 1 0 0 1 ... across the byte edge.
    const uint8_t src[4] = {0x16, 0xC9, 0x5A, 0x00};
    uint8_t dst[4] = {0x80, 0x00, 0x00, 0x00};
    BI_CopyRow1BPPBits(16, 3, src, 1, dst);
    // The 16-bit value shifted left by 2, bit 0 of dst[0] kept.
    const unsigned moved = ((0x16C95Au << 2) >> 8) & 0xFFFF;  // bits from source bit 1 on
    EXPECT_EQ(dst[0], 0x80 | ((moved >> 8) & 0x7F));
    EXPECT_EQ(dst[1], moved & 0xFF);
    EXPECT_EQ(dst[2] & 0x80, (0x5A << 2) & 0x80);
}

TEST(RowBits, CopyRow1HeadWritesTheWholeFirstByteWhateverTheCount) {
    const uint8_t src[3] = {0xFF, 0xFF, 0xFF};
    uint8_t dst[3] = {0x00, 0x00, 0x00};
    BI_CopyRow1BPPBits(1, 2, src, 2, dst);
    EXPECT_EQ(dst[0], 0x3F);  // six bits from phase 2, not one
    EXPECT_EQ(dst[1], 0x00);
}

TEST(RowBits, CopyRow4EqualPhasesOneCountOneChangesOnlyLowNibble) {
    const uint8_t src[2] = {0xAB, 0xCD};
    uint8_t dst[2] = {0x12, 0x34};
    BI_CopyRow4BPPBits(1, 1, src, 1, dst);
    EXPECT_EQ(dst[0], 0x1B);
    EXPECT_EQ(dst[1], 0x34);
}

TEST(RowBits, CopyRow4PhaseOneToZeroSkipsTwoSourcePixels) {
    const uint8_t src[4] = {0x12, 0x34, 0x56, 0x78};
    uint8_t dst[3] = {0, 0, 0};
    BI_CopyRow4BPPBits(4, 1, src, 0, dst);
    // Meant to start at pixel 1 (value 2); starts at pixel 3 (value 4).
    EXPECT_EQ(dst[0], 0x45);
    EXPECT_EQ(dst[1], 0x67);
}

TEST(RowBits, MaskRow1ZeroMaskLeavesDestination) {
    std::mt19937 rng(7);
    for (int sp = 0; sp < 8; ++sp)
        for (int mp = 0; mp < 8; ++mp)
            for (int dp = 0; dp < 8; ++dp) {
                const Bytes src = Random(16, rng), mask(16, 0);
                const Bytes dst = Random(16, rng);
                Bytes got = dst;
                BI_MaskRow1BPPBits(60, sp, src.data(), mp, mask.data(), dp, got.data());
                ASSERT_EQ(got, dst);
            }
}

TEST(RowBits, MaskRow4BothColumnsEvenGivesZeroF) {
    const uint8_t src[1] = {0xCD}, mask[2] = {0x80, 0x00};
    uint8_t dst[2] = {0xAB, 0x00};
    BI_MaskRow4BPPBits(1, 0, src, 0, mask, 0, dst);
    EXPECT_EQ(dst[0], 0x0F);
}

TEST(RowBits, MaskRow4FirstMaskByteServesTwice) {
    // Mask phase 5, first byte 0x07: pixels 0-2 set, then 8 pixels from the
    // same byte's top, of which 8, 9, 10 are set.
    uint8_t src[8];
    for (int i = 0; i < 8; ++i) src[i] = static_cast<uint8_t>(0x11 * (2 * i) + 1);  // nibbles 2i, 2i+1
    const uint8_t mask[3] = {0x07, 0x00, 0x00};
    uint8_t dst[8] = {};
    BI_MaskRow4BPPBits(11, 1, src, 5, mask, 0, dst);
    for (int j = 0; j < 11; ++j) {
        const bool set = j < 3 || j >= 8;
        EXPECT_EQ(rowbits::Nib(dst, j), set ? rowbits::Nib(src, 1 + j) : 0) << j;
    }
}

TEST(RowBits, OutOfRangePhasesMoveNothing) {
    const uint8_t src[4] = {1, 2, 3, 4}, mask[4] = {0xFF, 0xFF, 0xFF, 0xFF};
    uint8_t dst[4] = {9, 9, 9, 9};
    BI_CopyRow1BPPBits(8, 8, src, 0, dst);
    BI_CopyRow4BPPBits(2, 0, src, 2, dst);
    BI_MaskRow1BPPBits(8, 0, src, 9, mask, 0, dst);
    BI_MaskRow4BPPBits(2, 2, src, 0, mask, 0, dst);
    EXPECT_EQ(dst[0], 9);
    EXPECT_EQ(dst[3], 9);
}

}  // namespace
