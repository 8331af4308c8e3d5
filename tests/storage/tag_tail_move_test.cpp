// The tail moved by an insert: every tag met while the walk is still in the
// insertion block is reported, also when a step goes round the ring and comes
// back to a smaller offset of that block. Only a walk that would never leave
// the block is stopped.
#include <unistd.h>

#include <algorithm>
#include <utility>
#include <vector>

#include "block_test_support.h"
#include "core/status.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;

std::vector<std::pair<FM_BlockAddr, FM_BlockAddr>> g_moves;

int32_t Record(FM_BlockAddr *from, FM_BlockAddr *to) {
    g_moves.emplace_back(*from, *to);
    return 10;
}

class TailMoveTest : public BlockFileFixture {
  protected:
    void SetUp() override {
        BlockFileFixture::SetUp();
        g_moves.clear();
    }
    // Payload 20: a 9-byte tag rewritten to 8 bytes leaves block 1 pointing at
    // itself; a 36-byte tag goes on at (1, 8), with its first four bytes also
    // read as the length of a tag at (1, 4).
    void MakeFile(const FM_TagHdr &second) {
        Make(16, 20);
        file_->tagCallback = Record;
        FM_TagHdr t = Tag(1, 9);
        ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &t, nullptr, nullptr)), 10);
        t = Tag(1, 8);
        FM_BlockAddr tag{}, data{}, next{};
        ASSERT_EQ(StatusOf(FM_TagRewriteHdr(file_, 1, 0, &t, &tag, &data, &next)), 10);
        ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &second, &tag, nullptr)), 10);
        ASSERT_EQ(tag, (FM_BlockAddr{1, 8}));
        ASSERT_EQ(file_->header.endBlock, 3u);
        ASSERT_EQ(file_->header.endOffset, 4u);
    }
    std::vector<uint8_t> Image(uint32_t block) {
        FM_MemBlock *node = Cached(file_, block);
        EXPECT_NE(node, nullptr);
        return node ? std::vector<uint8_t>(node->image, node->image + 32) : std::vector<uint8_t>{};
    }
};

// The tag at (1, 8) steps to (1, 4) round the ring of blocks 1 and 4; the one
// read there runs on into block 4.
TEST_F(TailMoveTest, StepBackToASmallerOffsetOfTheBlockGoesOn) {
    MakeFile(Tag(2, 36));
    const std::vector<uint8_t> before = Image(1);
    FM_TagHdr t = Tag(5, 20);
    FM_BlockAddr tag{}, data{}, next{};
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, 1, 8, &t, &tag, &data, &next)), 10);
    ASSERT_EQ(g_moves.size(), 2u);
    EXPECT_EQ(g_moves[0].first, (FM_BlockAddr{1, 8}));
    EXPECT_EQ(g_moves[0].second, (FM_BlockAddr{4, 8}));
    EXPECT_EQ(g_moves[1].first, (FM_BlockAddr{1, 4}));
    EXPECT_EQ(g_moves[1].second, (FM_BlockAddr{4, 4}));
    EXPECT_EQ(tag, (FM_BlockAddr{1, 8}));
    EXPECT_EQ(next, (FM_BlockAddr{4, 8}));
    EXPECT_EQ(t.length, 20u);
    EXPECT_EQ(Le32(Image(1), 0), 4u);  // 1, 4, then back to 1
    EXPECT_EQ(Le32(Image(4), 0), 1u);
    EXPECT_EQ(Le32(Image(4), 8), 8u);  // firstTag: the following tag's offset
    const std::vector<uint8_t> moved = Image(4);
    EXPECT_TRUE(std::equal(before.begin() + 12 + 8, before.end(), moved.begin() + 12 + 8));
    EXPECT_EQ(Image(1)[12 + 8], 5);  // the new header at (1, 8)
    EXPECT_EQ(Le32(Image(1), 12 + 12), 20u);
    EXPECT_EQ(file_->header.endBlock, 3u);
    EXPECT_EQ(lseek(file_->descriptor, 0, SEEK_CUR), 5 * 32);  // the new block's seek
}

// The length read at (1, 4) takes the walk 295 steps round the
// ring into block 4: the same two moves.
TEST_F(TailMoveTest, StepOfHundredsOfTurnsThatLeavesTheBlock) {
    MakeFile({0x10, {0x17, 0, 0}, 36});  // the tag at (1, 4) is 0x1710 = 5904 bytes long
    FM_TagHdr t = Tag(5, 20);
    FM_BlockAddr next{};
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, 1, 8, &t, nullptr, nullptr, &next)), 10);
    ASSERT_EQ(g_moves.size(), 2u);
    EXPECT_EQ(g_moves[1].first, (FM_BlockAddr{1, 4}));
    EXPECT_EQ(next, (FM_BlockAddr{4, 8}));
}

// Here it lands back on the tag at (1, 8): the two tags lead to each other
// for ever, and the insert stops with a status after reporting them.
TEST_F(TailMoveTest, TagsThatLeadToEachOtherForEverGiveAStatus) {
    MakeFile({0x74, {0x17, 0, 0}, 36});  // 6004 bytes: 300 steps back to (1, 8)
    FM_TagHdr t = Tag(5, 20);
    FM_BlockAddr next{};
    EXPECT_EQ(StatusOf(FM_TagInsertHdrAt(file_, 1, 8, &t, nullptr, nullptr, &next)), -50);
    ASSERT_GE(g_moves.size(), 2u);
    for (size_t i = 0; i < g_moves.size(); ++i) {
        const uint32_t offset = i % 2 == 0 ? 8 : 4;
        EXPECT_EQ(g_moves[i].first, (FM_BlockAddr{1, offset})) << i;
        EXPECT_EQ(g_moves[i].second, (FM_BlockAddr{4, offset})) << i;
    }
}

}  // namespace
