// Damaged and hostile block files: every walk ends with a status, bounded by
// what the file holds.
#include <string>

#include "block_test_support.h"
#include "core/status.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;

constexpr uint32_t P = 40, S = 52;

std::vector<uint8_t> Header(uint32_t payload, uint32_t stride, uint32_t next, uint32_t endBlock,
                            uint32_t endOffset) {
    std::vector<uint8_t> b(36);
    b[0] = 0x54, b[1] = 0x5E, b[2] = 0xD8, b[3] = 0x07;
    const uint32_t w[8] = {payload, stride, next, 1, 1, 0, endBlock, endOffset};
    for (int i = 0; i < 8; ++i) PutLe32(b, 4 + 4 * i, w[i]);
    return b;
}

// Block `index` of a file of stride S: links and tags (kind, length) laid end
// to end from offset 0.
void PutBlock(std::vector<uint8_t> &file, uint32_t index, uint32_t next,
              std::initializer_list<std::pair<uint8_t, uint32_t>> tags) {
    file.resize(std::max<size_t>(file.size(), (index + 1) * S), 0);
    PutLe32(file, index * S, next);
    PutLe32(file, index * S + 8, 0);
    uint32_t at = index * S + 12;
    for (auto [kind, length] : tags) {
        file[at] = kind;
        PutLe32(file, at + 4, length);
        at += length >= 8 ? length : 8;
    }
}

class BlockHostileTest : public tstest::Sandbox {
  protected:
    void TearDown() override {
        FM_Delete(Path("h.blk").c_str());
        FM_Delete(Path("copy.blk").c_str());
        tstest::Sandbox::TearDown();
    }
    FM_BlockFile *Open(const std::vector<uint8_t> &bytes) {
        WriteAll(Path("h.blk"), bytes);
        FM_BlockFile *f = nullptr;
        EXPECT_EQ(StatusOf(FM_BlockFileOpen(Path("h.blk").c_str(), &f, 5)), 10);
        if (f != nullptr)
            f->tagCallback = [](FM_BlockAddr *, FM_BlockAddr *) { return int32_t(10); };
        return f;
    }
    int32_t Dup() { return FM_DupTagBlockFile(Path("h.blk").c_str(), Path("copy.blk").c_str()); }
};

TEST_F(BlockHostileTest, StrideOfZeroOrBelowTwelveIsRefused) {
    for (uint32_t stride : {0u, 1u, 11u}) {
        auto bytes = Header(P, stride, 2, 1, 10);
        bytes.resize(200);
        WriteAll(Path("h.blk"), bytes);
        FM_BlockFile *f = nullptr;
        EXPECT_EQ(StatusOf(FM_BlockFileOpen(Path("h.blk").c_str(), &f, 5)), -50) << stride;
        EXPECT_EQ(StatusOf(Dup()), -50);
    }
}

TEST_F(BlockHostileTest, RingOfFreeTagsThatNeverReachesTheEnd) {
    auto bytes = Header(P, S, 2, 0, 0);
    PutBlock(bytes, 1, 1, {{0, 8}, {0, 8}, {0, 8}, {0, 8}, {0, 8}});
    FM_BlockFile *f = Open(bytes);
    FM_BlockAddr at = {1, 0}, next{};
    EXPECT_EQ(StatusOf(FM_TagDelete(f, &at, &next)), -50);
    FM_TagHdr t = Tag(1, 16);
    EXPECT_EQ(StatusOf(FM_TagInsertHdrAt(f, 1, 0, &t, nullptr, nullptr, nullptr)), -50);
    FM_BlockFileClose(&f);
    EXPECT_EQ(StatusOf(Dup()), 10);  // all free, and the full block ends the walk
}

TEST_F(BlockHostileTest, ZeroLengthTagIsRefusedByWalks) {
    auto bytes = Header(P, S, 2, 1, 39);
    PutBlock(bytes, 1, 1, {{0, 0}});
    FM_BlockFile *f = Open(bytes);
    FM_BlockAddr at = {1, 0};
    EXPECT_EQ(StatusOf(FM_TagDelete(f, &at, nullptr)), -50);
    FM_TagHdr t = Tag(1, 16);
    EXPECT_EQ(StatusOf(FM_TagInsertHdrAt(f, 1, 0, &t, nullptr, nullptr, nullptr)), -50);
    FM_BlockFileClose(&f);
    EXPECT_EQ(StatusOf(Dup()), -50);
}

// Walks go round the one-block circle as far as the length reaches; only the
// copy refuses a live tag longer than the file holds.
TEST_F(BlockHostileTest, LengthRunningPastTheFile) {
    auto bytes = Header(P, S, 2, 1, 30);
    PutBlock(bytes, 1, 1, {{1, 0x7FFFFFF0u}});
    FM_BlockFile *f = Open(bytes);
    FM_TagHdr h{};
    FM_BlockAddr next{};
    EXPECT_EQ(StatusOf(FM_TagReadHdr(f, 1, 0, &h, nullptr, &next)), 10);
    EXPECT_EQ(next, (FM_BlockAddr{0, 0x7FFFFFF0u % P}));  // at or past the end position
    FM_BlockAddr at = {1, 0};
    EXPECT_EQ(StatusOf(FM_TagDelete(f, &at, &next)), 10);
    EXPECT_EQ(next, (FM_BlockAddr{0, 0x7FFFFFF0u % P}));
    EXPECT_EQ(f->header.endBlock, 0u);  // the only tag, at offset 0: its block is freed
    EXPECT_EQ(f->header.freeHead, 1u);
    FM_BlockFileClose(&f);
    EXPECT_EQ(StatusOf(Dup()), -50);
}

TEST_F(BlockHostileTest, LengthThatWrapsTheOffsetIsNotCopied) {
    auto bytes = Header(P, S, 2, 1, 30);
    PutBlock(bytes, 1, 1, {{0, 8}, {0xCF, 0xFFFFFFFFu}});
    WriteAll(Path("h.blk"), bytes);
    EXPECT_EQ(StatusOf(Dup()), -50);
    FM_BlockFile *f = nullptr;
    ASSERT_EQ(StatusOf(FM_BlockFileOpen(Path("copy.blk").c_str(), &f, 5)), 10);
    EXPECT_EQ(f->header.nextIndex, 1u);  // nothing was appended
    FM_BlockFileClose(&f);
}

TEST_F(BlockHostileTest, ChainInACircleThatMissesTheEnd) {
    auto bytes = Header(P, S, 3, 7, 5);
    PutBlock(bytes, 1, 2, {{2, 40}});
    PutBlock(bytes, 2, 1, {{2, 40}});
    WriteAll(Path("h.blk"), bytes);
    EXPECT_EQ(StatusOf(Dup()), -50);
    FM_BlockFile *f = Open(bytes);
    FM_BlockAddr at = {1, 0}, next{};
    // Every tag is live: the walk of a delete stops at the first.
    EXPECT_EQ(StatusOf(FM_TagDelete(f, &at, &next)), 10);
    EXPECT_EQ(next, (FM_BlockAddr{2, 0}));
    FM_BlockFileClose(&f);
}

TEST_F(BlockHostileTest, ChainRunningIntoBlockZeroOrPastTheFile) {
    auto bytes = Header(P, S, 3, 9, 5);
    PutBlock(bytes, 1, 0, {{2, 40}});  // next 0
    FM_BlockFile *f = Open(bytes);
    uint8_t b[60];
    EXPECT_EQ(StatusOf(FM_BlockRead(f, 1, 0, 60, b, nullptr)), -4);
    FM_BlockFileClose(&f);
    // A next of 0 ends the walk: no tag follows the one that fills block 1.
    EXPECT_EQ(StatusOf(Dup()), 10);
    f = nullptr;
    ASSERT_EQ(StatusOf(FM_BlockFileOpen(Path("copy.blk").c_str(), &f, 5)), 10);
    EXPECT_EQ(f->header.nextIndex, 2u);
    FM_TagHdr h{};
    EXPECT_EQ(StatusOf(FM_TagReadHdr(f, 1, 0, &h, nullptr, nullptr)), 10);
    EXPECT_EQ(h.kind, 2);
    EXPECT_EQ(h.length, 40u);
    FM_BlockFileClose(&f);
    PutLe32(bytes, S, 1000);  // next far past the end of the file
    f = Open(bytes);
    EXPECT_EQ(StatusOf(FM_BlockRead(f, 1, 0, 60, b, nullptr)), -50);
    FM_BlockFileClose(&f);
    EXPECT_EQ(StatusOf(Dup()), -50);
}

// With the last block full there is no end mark: the copy ends after the tag
// that would step into a passed block, wherever in that block it lands.
TEST_F(BlockHostileTest, FullLastBlockWalkEndsOnStepIntoAPassedBlockAtAnyOffset) {
    for (uint32_t length : {48u, 100u}) {
        SCOPED_TRACE(length);
        auto bytes = Header(P, S, 3, 0, 0);
        PutBlock(bytes, 1, 2, {{1, 40}});
        PutBlock(bytes, 2, 1, {{2, length}});  // runs on into block 1
        WriteAll(Path("h.blk"), bytes);
        EXPECT_EQ(StatusOf(Dup()), 10);
        FM_BlockFile *f = nullptr;
        ASSERT_EQ(StatusOf(FM_BlockFileOpen(Path("copy.blk").c_str(), &f, 5)), 10);
        FM_TagHdr h{};
        EXPECT_EQ(StatusOf(FM_TagReadHdr(f, 2, 0, &h, nullptr, nullptr)), 10);
        EXPECT_EQ(h.kind, 2);
        EXPECT_EQ(h.length, length);
        EXPECT_EQ(f->header.endBlock, length == 48 ? 3u : 4u);
        EXPECT_EQ(f->header.endOffset, length % P);
        FM_BlockFileClose(&f);
        FM_Delete(Path("copy.blk").c_str());
        // With an end position that the circle misses, the same walk fails.
        PutLe32(bytes, 28, 2);
        PutLe32(bytes, 32, 39);
        WriteAll(Path("h.blk"), bytes);
        EXPECT_EQ(StatusOf(Dup()), -50);
    }
}

TEST_F(BlockHostileTest, HugeFreeHeadOrNextIndexGivesAStatus) {
    auto bytes = Header(P, S, 0xFFFFFFFFu, 1, 10);
    PutBlock(bytes, 1, 1, {{1, 10}});
    FM_BlockFile *f = Open(bytes);
    FM_MemBlock *node = nullptr;
    EXPECT_EQ(StatusOf(FM_NewBlock(f, &node)), -50);
    f->header.freeHead = 0x7FFFFFFF;
    EXPECT_EQ(StatusOf(FM_NewBlock(f, &node)), -50);
    FM_TagHdr t = Tag(1, 100);
    EXPECT_EQ(StatusOf(FM_TagAppendHdrAtEnd(f, &t, nullptr, nullptr)), -50);
    EXPECT_EQ(StatusOf(FM_BlockFileClose(&f)), 10);
}

// A free tag as long as a damaged file can make it, in a block that points at
// itself and heads a free list that does too: the room it gives would have
// the block freed again and again, tens of millions of times.
TEST_F(BlockHostileTest, RoomThatWouldFreeOneBlockOverAndOver) {
    auto bytes = Header(P, S, 2, 1, 10);
    PutLe32(bytes, 24, 1);  // freeHead
    PutBlock(bytes, 1, 1, {{0, 0x7FFFFFF0u}});
    FM_BlockFile *f = Open(bytes);
    FM_TagHdr t = Tag(1, 16);
    EXPECT_EQ(StatusOf(FM_TagInsertHdrAt(f, 1, 0, &t, nullptr, nullptr, nullptr)), -50);
    FM_BlockFileClose(&f);
}

// A dirty node recycled for a free head that no file offset reaches takes
// that index but not the write-back: the close still succeeds and frees all.
TEST_F(BlockHostileTest, RecycledDirtyNodeForAnUnreachableFreeHead) {
    auto bytes = Header(P, S, 2, 1, 10);
    PutBlock(bytes, 1, 1, {{1, 10}});
    FM_BlockFile *f = Open(bytes);
    FM_MemBlock *node = nullptr;
    for (int i = 0; i < 5; ++i) ASSERT_EQ(StatusOf(FM_NewBlock(f, &node)), 10);
    f->header.freeHead = 0x7FFFFFFF;
    EXPECT_EQ(StatusOf(FM_NewBlock(f, &node)), -50);
    EXPECT_EQ(f->cacheHead->index, 0x7FFFFFFFu);
    EXPECT_EQ(f->cacheHead->dirty, 0u);
    EXPECT_EQ(StatusOf(FM_BlockFileClose(&f)), 10);
}

}  // namespace
