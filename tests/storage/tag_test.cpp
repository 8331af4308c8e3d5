// The tag layer: appends, inserts, deletes, rewrites and the compacting copy,
// with the behaviours of the chain and cache rules that show through it.
#include <string>
#include <utility>
#include <vector>

#include "block_test_support.h"
#include "core/status.h"
#include "storage/block_file.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;

std::vector<std::pair<FM_BlockAddr, FM_BlockAddr>> g_moves;
int32_t g_answer = 10;

int32_t Record(FM_BlockAddr *from, FM_BlockAddr *to) {
    g_moves.push_back({*from, *to});
    return g_answer;
}

constexpr uint32_t P = 100;  // payload of the files here

class TagTest : public tstest::Sandbox {
  protected:
    void SetUp() override {
        tstest::Sandbox::SetUp();
        g_moves.clear();
        g_answer = 10;
        path_ = Path("t.blk");
        ASSERT_EQ(StatusOf(FM_BlockFileCreate(path_.c_str(), &file_, P, 16, Record)), 10);
    }
    void TearDown() override {
        if (file_ != nullptr) FM_BlockFileClose(&file_);
        FM_Delete(path_.c_str());
        FM_Delete(Path("copy.blk").c_str());
        tstest::Sandbox::TearDown();
    }
    FM_BlockAddr Append(uint8_t kind, uint32_t length) {
        FM_TagHdr h = Tag(kind, length);
        FM_BlockAddr at{};
        EXPECT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &h, &at, nullptr)), 10);
        return at;
    }
    FM_TagHdr Read(FM_BlockAddr at, FM_BlockAddr *next = nullptr) {
        FM_TagHdr h{};
        EXPECT_EQ(StatusOf(FM_TagReadHdr(file_, at.block, at.offset, &h, nullptr, next)), 10);
        return h;
    }
    FM_BlockAddr End() const { return {file_->header.endBlock, file_->header.endOffset}; }
    FM_BlockHdr Hdr(uint32_t index) {
        FM_BlockHdr h{};
        EXPECT_EQ(StatusOf(FM_GetFileBlockHdrByIndex(file_, index, &h)), 10);
        return h;
    }
    void Reopen() {
        ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
        ASSERT_EQ(StatusOf(FM_BlockFileOpen(path_.c_str(), &file_, 16)), 10);
        file_->tagCallback = Record;
    }
    // (kind, length) of each tag from firstBlock to the end position.
    std::vector<std::pair<int, uint32_t>> Walk() {
        std::vector<std::pair<int, uint32_t>> out;
        FM_BlockAddr at = {file_->header.firstBlock, 0};
        if (at == End()) return out;
        while (at.block != 0 && out.size() < 100) {
            FM_BlockAddr next{};
            FM_TagHdr h = Read(at, &next);
            out.push_back({h.kind, h.length});
            at = next;
        }
        return out;
    }
    std::string path_;
    FM_BlockFile *file_ = nullptr;
};

using Tags = std::vector<std::pair<int, uint32_t>>;

TEST_F(TagTest, AppendToEmptyFileMakesBlockOneWithFirstTagZero) {
    FM_TagHdr h = Tag(7, 30);
    FM_BlockAddr at{}, data{};
    ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &h, &at, &data)), 10);
    EXPECT_EQ(at, (FM_BlockAddr{1, 0}));
    EXPECT_EQ(data, (FM_BlockAddr{1, 8}));
    EXPECT_EQ(Hdr(1).firstTag, 0u);
    EXPECT_EQ(End(), (FM_BlockAddr{1, 30}));
    FM_TagHdr back = Read(at);
    EXPECT_EQ(back.kind, 7);
    EXPECT_EQ(back.extra[2], 0xC3);
    EXPECT_EQ(back.length, 30u);
}

TEST_F(TagTest, DataAddressOfAHeaderInsideOneBlockIsThatBlockAtEight) {
    Append(1, 20);
    FM_TagHdr h = Tag(2, 30);
    FM_BlockAddr at{}, data{};
    ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &h, &at, &data)), 10);
    EXPECT_EQ(at, (FM_BlockAddr{1, 20}));
    EXPECT_EQ(data, (FM_BlockAddr{1, 8}));  // bytes moved, not the position
    FM_BlockAddr read{};
    FM_TagHdr back{};
    ASSERT_EQ(StatusOf(FM_TagReadHdr(file_, 1, 20, &back, &read, nullptr)), 10);
    EXPECT_EQ(read, (FM_BlockAddr{1, 8}));
    FM_BlockAddr real{};
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, at.block, at.offset, 8, &real)), 10);
    EXPECT_EQ(real, (FM_BlockAddr{1, 28}));
    // A header across a block edge reports the true data position.
    Append(3, 46);  // ends at 96
    ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &h, &at, &data)), 10);
    EXPECT_EQ(at, (FM_BlockAddr{1, 96}));
    EXPECT_EQ(data, (FM_BlockAddr{2, 4}));
}

TEST_F(TagTest, TagEndingAtBlockEndLeavesEndAtZeroAndNextAppendTakesABlock) {
    Append(1, 60);
    Append(1, 40);
    EXPECT_EQ(End(), (FM_BlockAddr{0, 0}));
    EXPECT_EQ(file_->header.nextIndex, 2u);
    FM_BlockAddr at = Append(1, 10);
    EXPECT_EQ(at, (FM_BlockAddr{2, 0}));
    EXPECT_EQ(Hdr(2).firstTag, 0u);
    EXPECT_EQ(End(), (FM_BlockAddr{2, 10}));
}

TEST_F(TagTest, EveryBlockAnAppendAddsIsLinkedRightAfterTheFirst) {
    Append(1, 100);
    Append(2, 100);
    Append(3, 100);
    Append(4, 50);
    EXPECT_EQ(file_->header.lastBlock, 1u);
    EXPECT_EQ(Hdr(1).next, 4u);
    EXPECT_EQ(Hdr(4).next, 3u);
    EXPECT_EQ(Hdr(3).next, 2u);
    EXPECT_EQ(Hdr(2).next, 1u);
    // So the stream from firstBlock meets the newest block second.
    FM_BlockAddr next{};
    Read({1, 0}, &next);
    EXPECT_EQ(next, (FM_BlockAddr{4, 0}));
    EXPECT_EQ(Read(next).kind, 4);
}

TEST_F(TagTest, AppendCrossingBlocksLeavesLaterFirstTagsAlone) {
    Append(1, 50);
    Append(2, 130);  // runs into block 2 up to 80
    EXPECT_EQ(End(), (FM_BlockAddr{2, 80}));
    EXPECT_EQ(Hdr(2).firstTag, P);
}

TEST_F(TagTest, DeletingTheLastTagMovesTheAppendPositionBackWithoutAFreeTag) {
    Append(1, 20);
    FM_BlockAddr b = Append(2, 30);
    FM_BlockAddr next{9, 9};
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &b, &next)), 10);
    EXPECT_EQ(End(), b);
    EXPECT_EQ(next.block, 0u);
    EXPECT_EQ(Read(b).kind, 2);  // no free tag written
    EXPECT_EQ(Walk(), (Tags{{1, 20}}));
}

TEST_F(TagTest, DeletingTheLastTagThatCrossesBlocksKeepsTheBlockItRanInto) {
    Append(1, 50);
    FM_BlockAddr b = Append(2, 80);
    EXPECT_EQ(End(), (FM_BlockAddr{2, 30}));
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &b, nullptr)), 10);
    EXPECT_EQ(End(), (FM_BlockAddr{1, 50}));
    EXPECT_EQ(Hdr(1).next, 2u);
    EXPECT_EQ(file_->header.freeHead, 0u);
}

TEST_F(TagTest, DeletingTheOnlyTagOfABlockAtOffsetZeroFreesTheBlock) {
    Append(1, 100);
    FM_BlockAddr b = Append(2, 30);
    EXPECT_EQ(b, (FM_BlockAddr{2, 0}));
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &b, nullptr)), 10);
    EXPECT_EQ(End(), (FM_BlockAddr{0, 0}));
    EXPECT_EQ(file_->header.freeHead, 2u);
    EXPECT_EQ(Hdr(1).next, 1u);
    EXPECT_EQ(Append(3, 10), (FM_BlockAddr{2, 0}));  // the freed block again
}

TEST_F(TagTest, DeleteMergesFollowingFreeTagsIntoOne) {
    Append(1, 20);
    FM_BlockAddr b = Append(2, 20);
    FM_BlockAddr c = Append(3, 20);
    Append(4, 20);
    FM_BlockAddr next{};
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &c, &next)), 10);
    EXPECT_EQ(next, (FM_BlockAddr{1, 60}));
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &b, &next)), 10);
    EXPECT_EQ(next, (FM_BlockAddr{1, 60}));
    FM_TagHdr h = Read(b);
    EXPECT_EQ(h.kind, 0);
    EXPECT_EQ(h.length, 40u);
    EXPECT_EQ(h.extra[0], 0xA1);  // the rest of the header stays
    EXPECT_EQ(Walk(), (Tags{{1, 20}, {0, 40}, {4, 20}}));
}

TEST_F(TagTest, InsertFiveBytesSmallerThanAFreeTagTakesItAll) {
    Append(1, 20);
    FM_BlockAddr b = Append(2, 40);
    Append(3, 20);
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &b, nullptr)), 10);
    FM_TagHdr h = Tag(5, 35);
    FM_BlockAddr at{}, data{}, next{};
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, b.block, b.offset, &h, &at, &data, &next)), 10);
    EXPECT_EQ(h.length, 40u);  // the caller's header grew
    EXPECT_EQ(at, b);
    EXPECT_EQ(data, (FM_BlockAddr{1, 8}));
    EXPECT_EQ(next, (FM_BlockAddr{1, 60}));
    EXPECT_EQ(Walk(), (Tags{{1, 20}, {5, 40}, {3, 20}}));
}

TEST_F(TagTest, InsertEightBytesSmallerLeavesAnEightByteFreeTag) {
    Append(1, 20);
    FM_BlockAddr b = Append(2, 40);
    Append(3, 20);
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &b, nullptr)), 10);
    FM_TagHdr h = Tag(5, 32);
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, b.block, b.offset, &h, nullptr, nullptr, nullptr)),
              10);
    EXPECT_EQ(h.length, 32u);
    EXPECT_EQ(Walk(), (Tags{{1, 20}, {5, 32}, {0, 8}, {3, 20}}));
    FM_TagHdr gap = Read({1, 52});
    EXPECT_EQ(gap.extra[0], 0);
}

TEST_F(TagTest, InsertAtTheAppendPositionAppendsAndLeavesDataAndNextAlone) {
    Append(1, 20);
    FM_TagHdr h = Tag(2, 30);
    FM_BlockAddr at{}, data{5, 5}, next{6, 6};
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, 1, 20, &h, &at, &data, &next)), 10);
    EXPECT_EQ(at, (FM_BlockAddr{1, 20}));
    EXPECT_EQ(data, (FM_BlockAddr{5, 5}));
    EXPECT_EQ(next, (FM_BlockAddr{6, 6}));
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, 0, 77, &h, &at, &data, &next)), 10);
    EXPECT_EQ(at, (FM_BlockAddr{1, 50}));
    EXPECT_EQ(next, (FM_BlockAddr{6, 6}));
    EXPECT_EQ(Walk(), (Tags{{1, 20}, {2, 30}, {2, 30}}));
}

TEST_F(TagTest, InsertAtALiveTagMovesTheTailToANewBlockAndTellsTheCaller) {
    Append(1, 30);
    FM_BlockAddr b = Append(2, 30);
    Append(3, 20);
    FM_TagHdr h = Tag(9, 100);
    FM_BlockAddr at{}, data{}, next{};
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, b.block, b.offset, &h, &at, &data, &next)), 10);
    EXPECT_EQ(at, (FM_BlockAddr{1, 30}));
    EXPECT_EQ(data, (FM_BlockAddr{1, 8}));
    EXPECT_EQ(next, (FM_BlockAddr{2, 30}));
    ASSERT_EQ(g_moves.size(), 2u);
    EXPECT_EQ(g_moves[0].first, (FM_BlockAddr{1, 30}));
    EXPECT_EQ(g_moves[0].second, (FM_BlockAddr{2, 30}));
    EXPECT_EQ(g_moves[1].first, (FM_BlockAddr{1, 60}));
    EXPECT_EQ(g_moves[1].second, (FM_BlockAddr{2, 60}));
    EXPECT_EQ(End(), (FM_BlockAddr{2, 80}));
    EXPECT_EQ(Hdr(2).firstTag, 30u);
    EXPECT_EQ(Hdr(1).next, 2u);  // linked behind the insertion block
    EXPECT_EQ(Hdr(2).prev, 1u);
    EXPECT_EQ(Walk(), (Tags{{1, 30}, {9, 100}, {2, 30}, {3, 20}}));
}

TEST_F(TagTest, InsertAtOffsetZeroPutsABlockInFrontWhichTheChainStartMisses) {
    FM_BlockAddr a = Append(1, 30);
    FM_TagHdr h = Tag(9, 100);
    FM_BlockAddr at{}, next{};
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, a.block, a.offset, &h, &at, nullptr, &next)), 10);
    EXPECT_EQ(at, (FM_BlockAddr{2, 0}));
    EXPECT_EQ(next, (FM_BlockAddr{1, 0}));
    EXPECT_TRUE(g_moves.empty());
    EXPECT_EQ(file_->header.firstBlock, 1u);
    EXPECT_EQ(Hdr(2).next, 1u);
    EXPECT_EQ(Hdr(2).prev, 0u);
    EXPECT_EQ(Hdr(2).firstTag, 0u);
    EXPECT_EQ(Hdr(1).prev, 2u);
    FM_BlockAddr after{};
    EXPECT_EQ(Read(at, &after).kind, 9);
    EXPECT_EQ(after, (FM_BlockAddr{1, 0}));
}

TEST_F(TagTest, InsertAtOffsetZeroLinksFurtherBlocksBehindTheBlockInFront) {
    FM_BlockAddr a = Append(1, 30);
    FM_TagHdr h = Tag(9, 2 * P);
    FM_BlockAddr at{}, data{}, next{};
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, a.block, a.offset, &h, &at, &data, &next)), 10);
    EXPECT_EQ(at, (FM_BlockAddr{2, 0}));
    EXPECT_EQ(data, (FM_BlockAddr{2, 8}));
    EXPECT_EQ(next, (FM_BlockAddr{1, 0}));
    EXPECT_EQ(h.length, 2 * P);
    EXPECT_TRUE(g_moves.empty());
    EXPECT_EQ(Hdr(2).next, 3u);  // the block in front, then the one behind it
    EXPECT_EQ(Hdr(2).prev, 0u);
    EXPECT_EQ(Hdr(3).next, 1u);
    EXPECT_EQ(Hdr(3).prev, 2u);
    EXPECT_EQ(Hdr(1).prev, 3u);
    EXPECT_EQ(Hdr(2).firstTag, 0u);
    EXPECT_EQ(Hdr(3).firstTag, 0u);  // the offset of the following tag
    EXPECT_EQ(file_->header.firstBlock, 1u);
    EXPECT_EQ(End(), (FM_BlockAddr{1, 30}));
    FM_BlockAddr after{};
    EXPECT_EQ(Read(at, &after).kind, 9);
    EXPECT_EQ(after, (FM_BlockAddr{1, 0}));
}

TEST_F(TagTest, InsertShortageThatIsNoWholeBlockIsRefusedUnchanged) {
    Append(1, 30);
    FM_BlockAddr b = Append(2, 30);
    const auto before = file_->header;
    const auto cache = CacheIndexes(file_);
    FM_TagHdr h = Tag(9, 130);
    EXPECT_EQ(StatusOf(FM_TagInsertHdrAt(file_, b.block, b.offset, &h, nullptr, nullptr, nullptr)),
              -4);
    EXPECT_EQ(0, std::memcmp(&before, &file_->header, sizeof before));
    EXPECT_EQ(CacheIndexes(file_), cache);
    EXPECT_EQ(h.length, 130u);
}

TEST_F(TagTest, InsertThatMustMoveTagsWithoutCallbackFailsAfterCopying) {
    Append(1, 30);
    FM_BlockAddr b = Append(2, 30);
    Reopen();
    file_->tagCallback = nullptr;
    FM_TagHdr h = Tag(9, 100);
    EXPECT_EQ(StatusOf(FM_TagInsertHdrAt(file_, b.block, b.offset, &h, nullptr, nullptr, nullptr)),
              -6);
    EXPECT_EQ(file_->header.nextIndex, 3u);  // the chain stays longer
    uint8_t moved[8];
    ASSERT_EQ(StatusOf(FM_BlockRead(file_, 2, 30, 8, moved, nullptr)), 10);
    EXPECT_EQ(moved[0], 2);
}

TEST_F(TagTest, InsertFailingInTheBlockLayerLeavesTheChainLonger) {
    Append(1, 30);
    FM_BlockAddr b = Append(2, 30);
    file_->cacheLimit = 3;  // the third new block finds no node
    FM_TagHdr h = Tag(9, 3 * P);
    FM_BlockAddr at{7, 7}, data{7, 7}, next{7, 7};
    EXPECT_EQ(StatusOf(FM_TagInsertHdrAt(file_, b.block, b.offset, &h, &at, &data, &next)), -5);
    EXPECT_EQ(at, (FM_BlockAddr{7, 7}));
    EXPECT_EQ(data, (FM_BlockAddr{7, 7}));
    EXPECT_EQ(next, (FM_BlockAddr{7, 7}));
    EXPECT_EQ(file_->header.nextIndex, 4u);
    EXPECT_EQ(Hdr(1).next, 2u);
    EXPECT_EQ(Hdr(2).next, 3u);
    EXPECT_EQ(Hdr(3).next, 1u);
    EXPECT_TRUE(g_moves.empty());
    EXPECT_EQ(End(), (FM_BlockAddr{1, 60}));
    EXPECT_EQ(Walk(), (Tags{{1, 30}, {2, 30}}));
}

TEST_F(TagTest, NegativeCallbackStopsTheMove) {
    Append(1, 30);
    FM_BlockAddr b = Append(2, 30);
    Append(3, 20);
    g_answer = -7;
    FM_TagHdr h = Tag(9, 100);
    EXPECT_EQ(StatusOf(FM_TagInsertHdrAt(file_, b.block, b.offset, &h, nullptr, nullptr, nullptr)),
              -7);
    EXPECT_EQ(g_moves.size(), 1u);
    EXPECT_EQ(End(), (FM_BlockAddr{1, 80}));
}

TEST_F(TagTest, InsertIntoLargeFreeSpaceGivesWholeFreeBlocksBack) {
    Append(1, 20);
    FM_BlockAddr n = Append(2, 20);
    FM_TagHdr h = Tag(3, 100);
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, n.block, n.offset, &h, nullptr, nullptr, nullptr)),
              10);  // 1 -> 2, tag 2 now at (2, 20)
    FM_BlockAddr x = {2, 20};
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, x.block, x.offset, &h, nullptr, nullptr, nullptr)),
              10);  // 1 -> 2 -> 3, tag 2 now at (3, 20)
    EXPECT_EQ(Walk(), (Tags{{1, 20}, {3, 100}, {3, 100}, {2, 20}}));
    EXPECT_EQ(End(), (FM_BlockAddr{3, 40}));
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &n, nullptr)), 10);
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &x, nullptr)), 10);
    EXPECT_EQ(Walk(), (Tags{{1, 20}, {0, 100}, {0, 100}, {2, 20}}));
    FM_TagHdr small = Tag(4, 20);
    FM_BlockAddr next{};
    ASSERT_EQ(
        StatusOf(FM_TagInsertHdrAt(file_, n.block, n.offset, &small, nullptr, nullptr, &next)), 10);
    EXPECT_EQ(next, (FM_BlockAddr{3, 20}));
    EXPECT_EQ(file_->header.freeHead, 2u);
    EXPECT_EQ(Hdr(1).next, 3u);
    EXPECT_EQ(Walk(), (Tags{{1, 20}, {4, 20}, {0, 80}, {2, 20}}));
}

TEST_F(TagTest, FreeTagFirstTagIsSetOnTheCachedNodeWithoutADirtyMark) {
    Append(1, 50);
    FM_BlockAddr b = Append(2, 100);  // (1, 50) to (2, 50)
    Append(3, 30);
    Reopen();
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &b, nullptr)), 10);
    FM_TagHdr h = Tag(5, 60);
    ASSERT_EQ(StatusOf(FM_TagInsertHdrAt(file_, b.block, b.offset, &h, nullptr, nullptr, nullptr)),
              10);
    FM_MemBlock *two = Cached(file_, 2);
    ASSERT_NE(two, nullptr);
    EXPECT_EQ(ImageWord(two, 8), 10u);
    EXPECT_EQ(two->dirty, 0u);
    EXPECT_EQ(Walk(), (Tags{{1, 50}, {5, 60}, {0, 40}, {3, 30}}));
    // Nothing of it was marked, so none of it reaches the file.
    Reopen();
    EXPECT_EQ(Hdr(2).firstTag, P);
    EXPECT_EQ(Walk(), (Tags{{1, 50}, {2, 100}, {3, 30}}));
}

TEST_F(TagTest, RewriteOfAFollowedTagDeletesAndInsertsInPlace) {
    Append(1, 20);
    FM_BlockAddr b = Append(2, 40);
    Append(3, 20);
    FM_TagHdr h = Tag(6, 24);
    FM_BlockAddr at{}, data{}, next{};
    ASSERT_EQ(StatusOf(FM_TagRewriteHdr(file_, b.block, b.offset, &h, &at, &data, &next)), 10);
    EXPECT_EQ(at, b);
    EXPECT_EQ(next, (FM_BlockAddr{1, 60}));
    EXPECT_EQ(Walk(), (Tags{{1, 20}, {6, 24}, {0, 16}, {3, 20}}));
}

TEST_F(TagTest, RewriteOfTheLastTagClearsNextAndAppends) {
    Append(1, 20);
    FM_BlockAddr b = Append(2, 40);
    FM_TagHdr h = Tag(6, 70);
    FM_BlockAddr at{}, data{}, next{4, 4};
    ASSERT_EQ(StatusOf(FM_TagRewriteHdr(file_, b.block, b.offset, &h, &at, &data, &next)), 10);
    EXPECT_EQ(at, b);
    EXPECT_EQ(data, (FM_BlockAddr{1, 8}));
    EXPECT_EQ(next, (FM_BlockAddr{0, 0}));
    EXPECT_EQ(End(), (FM_BlockAddr{1, 90}));
    EXPECT_EQ(Walk(), (Tags{{1, 20}, {6, 70}}));
}

TEST_F(TagTest, DupOfAFileWithFreeTagsIsShorterWithTheSameLiveTags) {
    const std::string copy = Path("copy.blk");
    Append(1, 60);
    FM_BlockAddr b = Append(2, 60);
    FM_BlockAddr c = Append(3, 30);
    uint8_t text[60];
    for (int i = 0; i < 60; ++i) text[i] = uint8_t(100 + i);
    FM_BlockAddr d{};
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 0, 8, &d)), 10);
    ASSERT_EQ(StatusOf(FM_BlockWrite(file_, d.block, d.offset, 52, text, nullptr)), 10);
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, c.block, c.offset, 8, &d)), 10);
    ASSERT_EQ(StatusOf(FM_BlockWrite(file_, d.block, d.offset, 22, text + 1, nullptr)), 10);
    ASSERT_EQ(StatusOf(FM_TagDelete(file_, &b, nullptr)), 10);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);

    ASSERT_EQ(StatusOf(FM_DupTagBlockFile(path_.c_str(), copy.c_str())), 10);
    EXPECT_LT(ReadAll(copy).size(), ReadAll(path_).size());
    ASSERT_EQ(StatusOf(FM_BlockFileOpen(copy.c_str(), &file_, 16)), 10);
    EXPECT_EQ(Walk(), (Tags{{1, 60}, {3, 30}}));
    uint8_t back[60] = {};
    ASSERT_EQ(StatusOf(FM_BlockRead(file_, 1, 8, 52, back, nullptr)), 10);
    EXPECT_EQ(0, std::memcmp(back, text, 52));
    ASSERT_EQ(StatusOf(FM_BlockRead(file_, 1, 68, 22, back, nullptr)), 10);
    EXPECT_EQ(0, std::memcmp(back, text + 1, 22));
    EXPECT_EQ(file_->tagCallback, nullptr);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    ASSERT_EQ(StatusOf(FM_BlockFileOpen(path_.c_str(), &file_, 16)), 10);
}

TEST_F(TagTest, DupEndsWhereAFullLastBlockWouldStepIntoAPassedBlock) {
    const std::string copy = Path("copy.blk");
    Append(1, 40);
    Append(2, 60);
    EXPECT_EQ(End(), (FM_BlockAddr{0, 0}));
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    ASSERT_EQ(StatusOf(FM_DupTagBlockFile(path_.c_str(), copy.c_str())), 10);
    EXPECT_EQ(ReadAll(copy), ReadAll(path_));
    ASSERT_EQ(StatusOf(FM_BlockFileOpen(path_.c_str(), &file_, 16)), 10);
}

TEST_F(TagTest, AppendRefusesAnAppendPositionBeyondItsBlock) {
    Append(1, 20);
    file_->header.endOffset = 0xFFFFFFF0u;  // as a damaged header would have it
    const uint32_t next = file_->header.nextIndex;
    FM_TagHdr h = Tag(2, 10);
    EXPECT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &h, nullptr, nullptr)), -50);
    EXPECT_EQ(file_->header.nextIndex, next);
    file_->header.endOffset = 20;
}

TEST_F(TagTest, DupOfAnEmptyFileGivesAnEmptyFile) {
    const std::string copy = Path("copy.blk");
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    ASSERT_EQ(StatusOf(FM_DupTagBlockFile(path_.c_str(), copy.c_str())), 10);
    EXPECT_EQ(ReadAll(copy), ReadAll(path_));
    EXPECT_EQ(StatusOf(FM_DupTagBlockFile(Path("missing.blk").c_str(), copy.c_str())), -50);
    ASSERT_EQ(StatusOf(FM_BlockFileOpen(path_.c_str(), &file_, 16)), 10);
}

}  // namespace
