// The chain and the free list, stepping through blocks, and moving bytes.
#include <string>

#include "block_test_support.h"
#include "core/status.h"
#include "storage/block_file.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;

class BlockChainTest : public BlockFileFixture {
  protected:
    uint32_t Add(uint32_t after) {
        FM_MemBlock *node = nullptr;
        EXPECT_EQ(StatusOf(FM_NewBlock(file_, &node)), 10);
        EXPECT_EQ(StatusOf(FM_InsertBlockAfter(file_, after, node)), 10);
        return node->index;
    }
    FM_BlockHdr Hdr(uint32_t index) {
        FM_BlockHdr h{};
        EXPECT_EQ(StatusOf(FM_GetFileBlockHdrByIndex(file_, index, &h)), 10);
        return h;
    }
};

TEST_F(BlockChainTest, NewBlockStartsUnlinkedDirtyWithNoTag) {
    Make(4);
    FM_MemBlock *node = nullptr;
    ASSERT_EQ(StatusOf(FM_NewBlock(file_, &node)), 10);
    EXPECT_EQ(node->index, 1u);
    EXPECT_EQ(node->dirty, 1u);
    EXPECT_EQ(ImageWord(node, 0), 0u);
    EXPECT_EQ(ImageWord(node, 4), 0u);
    EXPECT_EQ(ImageWord(node, 8), 24u);
    EXPECT_EQ(file_->header.nextIndex, 2u);
    EXPECT_EQ(file_->header.firstBlock, 0u);
    int32_t position = 0;
    ASSERT_EQ(StatusOf(FM_Tell(file_->descriptor, &position)), 10);
    EXPECT_EQ(position, 2 * 36);  // moved, not written
    EXPECT_EQ(ReadAll(path_).size(), 36u);
}

TEST_F(BlockChainTest, FirstBlockLinksToItselfAndLastBlockStaysOnIt) {
    Make(8);
    EXPECT_EQ(Add(0), 1u);
    EXPECT_EQ(Hdr(1).next, 1u);
    EXPECT_EQ(Hdr(1).prev, 0u);
    EXPECT_EQ(file_->header.firstBlock, 1u);
    EXPECT_EQ(file_->header.lastBlock, 1u);
    // Each block added after lastBlock goes right after the first block.
    EXPECT_EQ(Add(file_->header.lastBlock), 2u);
    EXPECT_EQ(Add(file_->header.lastBlock), 3u);
    EXPECT_EQ(Add(file_->header.lastBlock), 4u);
    EXPECT_EQ(file_->header.lastBlock, 1u);
    EXPECT_EQ(Hdr(1).next, 4u);
    EXPECT_EQ(Hdr(4).next, 3u);
    EXPECT_EQ(Hdr(3).next, 2u);
    EXPECT_EQ(Hdr(2).next, 1u);
    EXPECT_EQ(Hdr(1).prev, 2u);
    EXPECT_EQ(Hdr(2).prev, 3u);
    EXPECT_EQ(Hdr(3).prev, 4u);
    EXPECT_EQ(Hdr(4).prev, 1u);
}

TEST_F(BlockChainTest, InsertInFrontKeepsFirstBlock) {
    Make(8);
    Add(0);
    EXPECT_EQ(Add(0), 2u);
    EXPECT_EQ(file_->header.firstBlock, 1u);
    EXPECT_EQ(Hdr(2).next, 1u);
    EXPECT_EQ(Hdr(2).prev, 0u);
    EXPECT_EQ(Hdr(1).prev, 2u);
}

TEST_F(BlockChainTest, AfterLastWithNextZeroMovesLastBlock) {
    Make(8);
    Add(0);
    FM_MemBlock *one = Cached(file_, 1);
    one->image[0] = 0;  // a chain that ends with next 0
    EXPECT_EQ(Add(1), 2u);
    EXPECT_EQ(file_->header.lastBlock, 2u);
    EXPECT_EQ(Hdr(2).next, 0u);
    EXPECT_EQ(Hdr(2).prev, 1u);
}

TEST_F(BlockChainTest, UncachedNeighboursArePatchedInTheFile) {
    Make(4);
    Add(0);
    Add(1);
    Reopen(4);
    EXPECT_TRUE(CacheIndexes(file_).empty());
    EXPECT_EQ(Add(1), 3u);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{3}));
    auto bytes = ReadAll(path_);
    EXPECT_EQ(Le32(bytes, 36 + 0), 3u);      // block 1 next
    EXPECT_EQ(Le32(bytes, 2 * 36 + 4), 3u);  // block 2 prev
    // A cached neighbour is patched in memory without a dirty mark.
    FM_MemBlock *node = nullptr;
    ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 2, &node)), 10);
    EXPECT_EQ(node->dirty, 0u);
    ASSERT_EQ(StatusOf(FM_FreeBlock(file_, 3)), 10);
    EXPECT_EQ(node->dirty, 0u);
    EXPECT_EQ(ImageWord(node, 4), 1u);
    EXPECT_EQ(Le32(ReadAll(path_), 2 * 36 + 4), 3u);
}

TEST_F(BlockChainTest, FreeListIsLastInFirstOut) {
    Make(8);
    Add(0);
    Add(1);
    Add(1);
    ASSERT_EQ(StatusOf(FM_FreeBlock(file_, 2)), 10);
    ASSERT_EQ(StatusOf(FM_FreeBlock(file_, 3)), 10);
    EXPECT_EQ(file_->header.freeHead, 3u);
    EXPECT_EQ(Le32(ReadAll(path_), 3 * 36), 2u);
    EXPECT_EQ(Le32(ReadAll(path_), 2 * 36), 0u);
    EXPECT_EQ(Add(1), 3u);
    EXPECT_EQ(Add(1), 2u);
    EXPECT_EQ(Add(1), 4u);
    EXPECT_EQ(file_->header.freeHead, 0u);
}

TEST_F(BlockChainTest, FreeLinkIsWrittenToTheFileNotToAStaleCachedImage) {
    Make(8);
    Add(0);
    Add(1);
    Reopen(8);
    ASSERT_EQ(StatusOf(FM_FreeBlock(file_, 2)), 10);
    ASSERT_EQ(StatusOf(FM_FreeBlock(file_, 1)), 10);  // free list 1 -> 2
    // A fetch of the free block caches its image; the new block taken from
    // the free list then gets a second node under the same index.
    FM_MemBlock *stale = nullptr;
    ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 1, &stale)), 10);
    ASSERT_EQ(ImageWord(stale, 0), 2u);
    stale->image[0] = 0x77;
    FM_MemBlock *fresh = nullptr;
    ASSERT_EQ(StatusOf(FM_NewBlock(file_, &fresh)), 10);
    ASSERT_EQ(fresh->index, 1u);
    ASSERT_NE(fresh, stale);
    EXPECT_EQ(file_->header.freeHead, 2u);
    EXPECT_EQ(StatusOf(FM_FreeBlock(file_, 1)), 10);  // releases the newer node
    EXPECT_EQ(file_->header.freeHead, 1u);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{1}));
    EXPECT_EQ(stale->image[0], 0x77);
    EXPECT_EQ(Le32(ReadAll(path_), 36), 2u);
}

TEST_F(BlockChainTest, FreeingUnlinksAndMovesFirstAndLast) {
    Make(8);
    Add(0);
    Add(1);  // ring 1 -> 2 -> 1
    ASSERT_EQ(StatusOf(FM_FreeBlock(file_, 1)), 10);
    EXPECT_EQ(file_->header.firstBlock, 2u);
    EXPECT_EQ(file_->header.lastBlock, 2u);  // the old prev of block 1
    EXPECT_EQ(Hdr(2).next, 2u);
    EXPECT_EQ(Hdr(2).prev, 2u);
    // A freed uncached block keeps prev and firstTag in the file.
    Reopen(8);
    ASSERT_EQ(StatusOf(FM_FreeBlock(file_, 2)), 10);
    auto bytes = ReadAll(path_);
    EXPECT_EQ(Le32(bytes, 2 * 36 + 0), 1u);  // the free link
    EXPECT_EQ(Le32(bytes, 2 * 36 + 4), 2u);
    EXPECT_EQ(Le32(bytes, 2 * 36 + 8), 24u);
    EXPECT_EQ(file_->header.freeHead, 2u);
    EXPECT_EQ(StatusOf(FM_FreeBlock(file_, 0)), -4);
}

TEST_F(BlockChainTest, NextAddrStepsThroughBlocksAndStopsAtTheEnd) {
    Make(8);
    Add(0);
    Add(1);
    Add(1);  // 1 -> 3 -> 2 -> 1
    FM_BlockAddr a{};
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 18, 6, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{3, 0}));  // exactly payloadSize: next block at 0
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 3, 56, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{2, 11}));
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 3, 4, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{1, 7}));
    file_->header.endBlock = 3;
    file_->header.endOffset = 5;
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 20, 10, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{0, 6}));  // past the written end; offset stays
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 20, 10 + 24, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{2, 6}));
}

TEST_F(BlockChainTest, ReadAndWriteReportBytesMovedInTheLastBlock) {
    Make(8);
    Add(0);
    Add(1);  // 1 -> 2 -> 1
    uint8_t text[60];
    for (int i = 0; i < 60; ++i) text[i] = uint8_t(i + 1);
    FM_BlockAddr last{77, 77};
    ASSERT_EQ(StatusOf(FM_BlockWrite(file_, 1, 10, 4, text, &last)), 10);
    EXPECT_EQ(last, (FM_BlockAddr{1, 4}));  // not 14
    ASSERT_EQ(StatusOf(FM_BlockWrite(file_, 1, 20, 10, text, &last)), 10);
    EXPECT_EQ(last, (FM_BlockAddr{2, 6}));
    uint8_t back[60] = {};
    ASSERT_EQ(StatusOf(FM_BlockRead(file_, 1, 20, 10, back, &last)), 10);
    EXPECT_EQ(last, (FM_BlockAddr{2, 6}));
    EXPECT_EQ(0, std::memcmp(back, text, 10));
    EXPECT_EQ(Data(Cached(file_, 2))[5], 10);
    // Through the ring and back into block 1.
    ASSERT_EQ(StatusOf(FM_BlockWrite(file_, 1, 0, 60, text, &last)), 10);
    EXPECT_EQ(last, (FM_BlockAddr{1, 12}));
    EXPECT_EQ(Data(Cached(file_, 1))[0], 49);
    // A count below 1 does nothing and leaves the out address alone.
    last = {77, 77};
    EXPECT_EQ(StatusOf(FM_BlockRead(file_, 0, 0, 0, back, &last)), 10);
    EXPECT_EQ(StatusOf(FM_BlockWrite(file_, 0, 0, -3, back, &last)), 10);
    EXPECT_EQ(last, (FM_BlockAddr{77, 77}));
}

TEST_F(BlockChainTest, ReadRunningOffAChainEndIsArgumentFailure) {
    Make(8);
    Add(0);
    Cached(file_, 1)->image[0] = 0;
    uint8_t buffer[30];
    std::memset(buffer, 0xAB, sizeof buffer);
    EXPECT_EQ(StatusOf(FM_BlockWrite(file_, 1, 0, 30, buffer, nullptr)), -4);
    EXPECT_EQ(Data(Cached(file_, 1))[23], 0xAB);  // moved so far stays moved
    EXPECT_EQ(StatusOf(FM_BlockRead(file_, 1, 0, 30, buffer, nullptr)), -4);
    EXPECT_EQ(StatusOf(FM_BlockRead(file_, 0, 0, 1, buffer, nullptr)), -4);
}

TEST_F(BlockChainTest, OffsetBeyondTheBlockIsRefused) {
    Make(8);
    Add(0);
    uint8_t b[4] = {};
    EXPECT_EQ(StatusOf(FM_BlockRead(file_, 1, 25, 4, b, nullptr)), -4);
    EXPECT_EQ(StatusOf(FM_BlockWrite(file_, 1, 25, 4, b, nullptr)), -4);
}

TEST_F(BlockChainTest, NextAddrGoesRoundACircleAsFarAsTheDistanceReaches) {
    Make(8);
    Add(0);  // block 1 points at itself
    FM_BlockAddr a{};
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 0, 0xFFFFFFF0u, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{1, 0xFFFFFFF0u % 24}));
    ASSERT_EQ(StatusOf(FM_GetNextAddr(file_, 1, 0, 24 * 3, &a)), 10);
    EXPECT_EQ(a, (FM_BlockAddr{1, 0}));
}

}  // namespace
