// Walks round chains that close on themselves: every chain of the format is
// a ring, so a distance longer than the ring goes round it as often as it
// reaches. The result, the status and the file position are those of a walk
// taken one block at a time.
#include <unistd.h>

#include <string>
#include <vector>

#include "block_test_support.h"
#include "core/status.h"
#include "platform/test_hooks.h"
#include "stale_link_file.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;

int32_t Position(const FM_BlockFile *file) {
    return int32_t(lseek(file->descriptor, 0, SEEK_CUR));
}

// The walk of the block layer, step by step over the bytes of a closed file.
struct Expected {
    FM_BlockAddr addr;
    int64_t lastFetched = -1;  // block whose header the last step read
};
Expected WalkBytes(const std::vector<uint8_t> &file, uint32_t block, uint32_t offset,
                   uint32_t distance) {
    const uint32_t payload = Le32(file, 4), stride = Le32(file, 8);
    Expected e;
    e.addr = {block, offset + distance};
    while (e.addr.offset >= payload) {
        e.addr.offset -= payload;
        e.lastFetched = e.addr.block;
        e.addr.block = Le32(file, size_t(e.addr.block) * stride);
    }
    if (e.addr.block == Le32(file, 28) && e.addr.offset >= Le32(file, 32)) e.addr.block = 0;
    return e;
}

class RingWalkTest : public BlockFileFixture {};

// Made by one append of a 16-byte tag: block 1 points at itself.
TEST_F(RingWalkTest, DistanceOfManyTurnsRoundAOneBlockRing) {
    Make(8, 32);
    FM_TagHdr t = Tag(1, 16);
    ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &t, nullptr, nullptr)), 10);
    const int32_t before = Position(file_);
    FM_BlockAddr a{};
    EXPECT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 0, 2080, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{1, 0}));
    EXPECT_EQ(Position(file_), before);  // cached: nothing read, nothing moved

    Reopen(8);
    EXPECT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 0, 2080, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{1, 0}));
    EXPECT_EQ(Position(file_), 44 + 12);  // after the last header read, block 1's
    EXPECT_TRUE(CacheIndexes(file_).empty());
}

// Rings of one to five blocks made by one append each (every new block goes
// in after block 1, so the chain runs 1, n, n-1, ..., 2 and back to 1), and
// distances of up to thousands of steps, from cached and uncached blocks.
TEST_F(RingWalkTest, RingsOfOneAndMoreBlocksMatchAWalkOneStepAtATime) {
    constexpr uint32_t P = 16, S = P + 12;
    for (uint32_t n = 1; n <= 5; ++n) {
        SCOPED_TRACE("ring of " + std::to_string(n));
        Make(8, P);
        FM_TagHdr t = Tag(1, P * (n - 1) + 5);
        ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &t, nullptr, nullptr)), 10);
        ASSERT_EQ(file_->header.endBlock, n);
        Reopen(8);
        const std::vector<uint8_t> bytes = ReadAll(path_);
        for (uint32_t start : {1u, n}) {
            for (uint32_t offset : {0u, 3u, 15u}) {
                for (uint32_t distance :
                     {0u, 12u, 16u, 17u, 2080u, 16u * n * 137 + 9, 9999u, 123457u}) {
                    SCOPED_TRACE(std::to_string(start) + "," + std::to_string(offset) + " by " +
                                 std::to_string(distance));
                    const Expected e = WalkBytes(bytes, start, offset, distance);
                    for (bool cached : {false, true}) {
                        if (cached) {
                            FM_MemBlock *node = nullptr;
                            for (uint32_t b = 1; b <= n; ++b)
                                ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, b, &node)), 10);
                        }
                        const std::vector<uint32_t> order = CacheIndexes(file_);
                        const int32_t before = Position(file_);
                        FM_BlockAddr a{};
                        ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, start, offset, distance, &a)), 10);
                        EXPECT_EQ(a, e.addr);
                        EXPECT_EQ(CacheIndexes(file_), order);
                        if (cached || e.lastFetched < 0)
                            EXPECT_EQ(Position(file_), before);
                        else
                            EXPECT_EQ(Position(file_), e.lastFetched * S + 12);
                    }
                    Reopen(8);
                }
            }
        }
        ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
        ASSERT_EQ(StatusOf(FM_Delete(path_.c_str())), 10);
    }
}

// A chain that leads into a ring after a few blocks: the turns are counted
// from where the ring begins.
TEST_F(RingWalkTest, ChainThatRunsIntoARing) {
    constexpr uint32_t P = 16, S = P + 12;
    Make(8, P);
    FM_TagHdr t = Tag(1, P * 5 + 5);  // blocks 1 to 6
    ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &t, nullptr, nullptr)), 10);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    std::vector<uint8_t> bytes = ReadAll(path_);
    PutLe32(bytes, 3 * S, 5);  // 1, 6, 5, 4, 3, then 5, 4, 3, ...
    WriteAll(path_, bytes);
    ASSERT_EQ(StatusOf(FM_BlockFileOpen(path_.c_str(), &file_, 8)), 10);
    for (uint32_t distance : {0u, 40u, 80u, 81u, 4000u, 4016u, 4032u, 65535u}) {
        SCOPED_TRACE(distance);
        const Expected e = WalkBytes(bytes, 1, 2, distance);
        FM_BlockAddr a{};
        ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 2, distance, &a)), 10);
        EXPECT_EQ(a, e.addr);
        if (e.lastFetched >= 0) {
            EXPECT_EQ(Position(file_), e.lastFetched * S + 12);
        }
    }
}

// A step into a block the file does not hold still fails where a walk one
// block at a time fails, with the result left half-way.
TEST_F(RingWalkTest, StepOutOfTheFileFailsHalfWay) {
    constexpr uint32_t P = 16, S = P + 12;
    Make(8, P);
    FM_TagHdr t = Tag(1, P * 2 + 5);  // blocks 1, 3, 2
    ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &t, nullptr, nullptr)), 10);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    std::vector<uint8_t> bytes = ReadAll(path_);
    PutLe32(bytes, 2 * S, 40);  // block 2 leads past the end of the file
    WriteAll(path_, bytes);
    ASSERT_EQ(StatusOf(FM_BlockFileOpen(path_.c_str(), &file_, 8)), 10);
    FM_BlockAddr a{};
    EXPECT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 0, 16 * 300, &a)), -50);
    EXPECT_EQ(a, (FM_BlockAddr{40, 16 * 300 - 4 * 16}));
}

// A read failing at any header fetch of a walk hundreds of steps round an
// uncached ring: -50, with the result half-way where a walk one block at a
// time stands when that step's fetch fails.
TEST_F(RingWalkTest, ReadFailureAtEachFetchLeavesTheResultHalfWay) {
    constexpr uint32_t P = 16, distance = 16 * 300 + 5;
    Make(8, P);
    FM_TagHdr t = Tag(1, P * 2 + 5);  // blocks 1, 3, 2
    ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &t, nullptr, nullptr)), 10);
    Reopen(8);
    const std::vector<uint8_t> bytes = ReadAll(path_);
    for (int64_t n = 1;; ++n) {
        SCOPED_TRACE(n);
        Reopen(8);
        tessarine::testing::FailFileCallAt(tessarine::testing::FileCall::Read, n);
        FM_BlockAddr a{};
        const int32_t status = StatusOf(FM_GetNextAddr(file_, 1, 3, distance, &a));
        const bool hit = tessarine::testing::FileFailureHit(tessarine::testing::FileCall::Read);
        tessarine::testing::ResetInjection();
        if (!hit) {
            EXPECT_EQ(status, 10);
            EXPECT_EQ(a, WalkBytes(bytes, 1, 3, distance).addr);
            break;
        }
        ASSERT_EQ(status, -50);
        // Step j subtracted its payload and then failed to fetch the block the
        // walk stood on after j - 1 steps.
        ASSERT_EQ((3 + distance - a.offset) % P, 0u);
        const uint32_t j = (3 + distance - a.offset) / P;
        ASSERT_GE(j, 1u);
        EXPECT_EQ(a.block, WalkBytes(bytes, 1, 3, (j - 1) * P).addr.block);
        ASSERT_LT(n, 100);
    }
}

// Made by tag calls (MakeStaleLink, LinkFreedBlockToItself): block 1 leads
// into block 10, which is linked to itself, and the end position is (10, 26).
// Walks from blocks 1 and 10, some running off the end, some hundreds of
// turns round the ring of one block.
class StaleLinkWalkTest : public TagFileFixture {};

TEST_F(StaleLinkWalkTest, ChainIntoARingOfOneBlock) {
    constexpr uint32_t P = kStaleLinkPayload, S = P + 12;
    ASSERT_NO_FATAL_FAILURE(MakeStaleLink(105));
    FM_BlockAddr second{}, third{};
    ASSERT_NO_FATAL_FAILURE(LinkFreedBlockToItself(&second, &third));
    Reopen(4);
    const std::vector<uint8_t> bytes = ReadAll(path_);
    ASSERT_EQ(Le32(bytes, 1 * S), 10u);
    ASSERT_EQ(Le32(bytes, 10 * S), 10u);
    for (const FM_BlockAddr from : {FM_BlockAddr{1, 0}, FM_BlockAddr{1, 40}, FM_BlockAddr{10, 9}}) {
        for (uint32_t distance : {0u, 8u, 48u, 105u, P * 300 + 5, P * 300 + 30, 123457u}) {
            SCOPED_TRACE(std::to_string(from.block) + "," + std::to_string(from.offset) + " by " +
                         std::to_string(distance));
            const Expected e = WalkBytes(bytes, from.block, from.offset, distance);
            Reopen(4);
            const int32_t before = Position(file_);
            FM_BlockAddr a{};
            ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, from.block, from.offset, distance, &a)), 10);
            EXPECT_EQ(a, e.addr);
            EXPECT_EQ(Position(file_), e.lastFetched < 0 ? before : e.lastFetched * S + 12);
        }
    }
}

// Before block 10 comes back (MakeStaleLink alone): chain 1, 10, then the free
// link 0, whose next is what the file's first four bytes give. A walk reaches
// that block and stops there; one that goes on fails half-way as it fetches it.
TEST_F(StaleLinkWalkTest, StepThroughAFreedBlockOutOfTheFileFailsHalfWay) {
    constexpr uint32_t P = kStaleLinkPayload, distance = 150 + P * 300;
    ASSERT_NO_FATAL_FAILURE(MakeStaleLink(150));
    const uint32_t beyond = Le32(ReadAll(path_), 0);
    FM_BlockAddr a{};
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 0, 150, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{beyond, 6}));
    EXPECT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 0, distance, &a)), -50);
    EXPECT_EQ(a, (FM_BlockAddr{beyond, distance - 4 * P}));
}

// Made by ordinary calls: a tag rewritten to 8 bytes in a block that points
// at itself, then a second tag at (1, 8). The bytes at (1, 4) read as a tag
// whose length is the second tag's first four bytes: 6004, three hundred
// turns round the ring to land on the second tag.
class LongTagTest : public BlockFileFixture {
  protected:
    void MakeOverlap() {
        Make(16, 20);
        file_->tagCallback = [](FM_BlockAddr *, FM_BlockAddr *) { return int32_t(10); };
        FM_TagHdr t = Tag(1, 9);
        ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &t, nullptr, nullptr)), 10);
        t.length = 8;
        FM_BlockAddr tag{}, data{}, next{};
        ASSERT_EQ(StatusOf(FM_TagRewriteHdr(file_, 1, 0, &t, &tag, &data, &next)), 10);
        FM_TagHdr second = {0x74, {0x17, 0, 0}, 36};
        ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &second, &tag, nullptr)), 10);
        ASSERT_EQ(tag, (FM_BlockAddr{1, 8}));
        ASSERT_EQ(Le32(Bytes(1), 0), 1u);  // block 1 points at itself
    }
    std::vector<uint8_t> Bytes(uint32_t block) {
        FM_MemBlock *node = Cached(file_, block);
        EXPECT_NE(node, nullptr);
        return node ? std::vector<uint8_t>(node->image, node->image + 32) : std::vector<uint8_t>{};
    }
};

TEST_F(LongTagTest, ReadHeaderFindsTheNextTagHundredsOfTurnsOn) {
    MakeOverlap();
    const int32_t before = Position(file_);
    FM_TagHdr h{};
    FM_BlockAddr data{}, next{};
    ASSERT_EQ(StatusOf(FM_TagReadHdr(file_, 1, 4, &h, &data, &next)), 10);
    EXPECT_EQ(h.kind, 8);
    EXPECT_EQ(h.length, 6004u);
    EXPECT_EQ(data, (FM_BlockAddr{1, 8}));
    EXPECT_EQ(next, (FM_BlockAddr{1, 8}));
    EXPECT_EQ(Position(file_), before);
}

TEST_F(LongTagTest, DeleteWritesAFreeTagOfTheWholeLength) {
    MakeOverlap();
    const int32_t before = Position(file_);
    FM_BlockAddr at = {1, 4}, next{};
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &at, &next)), 10);
    EXPECT_EQ(next, (FM_BlockAddr{1, 8}));
    const std::vector<uint8_t> b = Bytes(1);
    EXPECT_EQ(b[12 + 4], 0);              // kind 0
    EXPECT_EQ(Le32(b, 12 + 8), 6004u);  // length
    EXPECT_EQ(Position(file_), before);
    EXPECT_EQ(file_->header.freeHead, 0u);
}

TEST_F(LongTagTest, RewriteDeletesAndPutsBackInTheRoom) {
    MakeOverlap();
    const int32_t before = Position(file_);
    FM_TagHdr t = Tag(9, 8);
    FM_BlockAddr tag{}, data{}, next{};
    ASSERT_EQ(StatusOf(FM_TagRewriteHdr(file_, 1, 4, &t, &tag, &data, &next)), 10);
    EXPECT_EQ(tag, (FM_BlockAddr{1, 4}));
    EXPECT_EQ(data, (FM_BlockAddr{1, 8}));  // block and bytes moved, as the block write gives
    EXPECT_EQ(next, (FM_BlockAddr{1, 8}));
    EXPECT_EQ(t.length, 8u);
    const std::vector<uint8_t> b = Bytes(1);
    EXPECT_EQ(b[12 + 4], 9);
    EXPECT_EQ(Le32(b, 12 + 8), 8u);
    EXPECT_EQ(b[12 + 12], 0);              // a free tag behind it
    EXPECT_EQ(Le32(b, 12 + 16), 5996u);  // with the rest of the room
    EXPECT_EQ(Position(file_), before);
}

}  // namespace
