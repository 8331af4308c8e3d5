// The block cache: limits, eviction, most-recently-used order, dirty rule.
#include <string>

#include "block_test_support.h"
#include "core/status.h"
#include "platform/test_hooks.h"
#include "storage/block_file.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;

class BlockCacheTest : public BlockFileFixture {
  protected:
    // Appends `n` new blocks to the chain, each one filled with its index.
    void Grow(int n) {
        for (int i = 0; i < n; ++i) {
            FM_MemBlock *node = nullptr;
            ASSERT_EQ(StatusOf(FM_NewBlock(file_, &node)), 10);
            ASSERT_EQ(StatusOf(FM_InsertBlockAfter(file_, file_->header.lastBlock, node)), 10);
            std::memset(Data(node), int(node->index), file_->header.payloadSize);
        }
    }
};

TEST_F(BlockCacheTest, LimitZeroFailsEveryNodeRequest) {
    Make(0);
    FM_MemBlock *node = nullptr;
    EXPECT_EQ(StatusOf(FM_NewBlock(file_, &node)), -5);
    EXPECT_EQ(node, nullptr);
    EXPECT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 1, &node)), -5);
    FM_TagHdr tag = Tag(1, 10);
    EXPECT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file_, &tag, nullptr, nullptr)), -5);
}

TEST_F(BlockCacheTest, LimitThreeFailsOnTheFourthBlock) {
    Make(3);
    Grow(3);
    FM_MemBlock *node = nullptr;
    EXPECT_EQ(StatusOf(FM_NewBlock(file_, &node)), -5);
    EXPECT_EQ(file_->cachedCount, 3u);
    Reopen(3);
    for (uint32_t i = 1; i <= 3; ++i)
        ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, i, &node)), 10);
    EXPECT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 4, &node)), -5);
    // A cached block is still found.
    EXPECT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 2, &node)), 10);
}

TEST_F(BlockCacheTest, LimitFourEvictsTheLeastRecentlyUsedOnTheFifth) {
    Make(4);
    Grow(5);
    EXPECT_EQ(file_->cachedCount, 4u);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{5, 4, 3, 2}));
    // Block 1 was dirty and went to the file when its node was taken.
    auto bytes = ReadAll(path_);
    ASSERT_GE(bytes.size(), 2u * 36);
    EXPECT_EQ(bytes[36 + 12], 1);
}

TEST_F(BlockCacheTest, FetchMovesToHeadHeaderFetchDoesNot) {
    Make(5);
    Grow(4);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{4, 3, 2, 1}));
    FM_BlockHdr hdr{};
    ASSERT_EQ(StatusOf(FM_GetFileBlockHdrByIndex(file_, 2, &hdr)), 10);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{4, 3, 2, 1}));
    FM_MemBlock *node = nullptr;
    ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 2, &node)), 10);
    EXPECT_EQ(node->index, 2u);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{2, 4, 3, 1}));
    EXPECT_EQ(file_->cacheHead, node);
}

TEST_F(BlockCacheTest, IndexZeroIsRefusedByFetchButHeaderFetchReadsFileStart) {
    Make(4);
    FM_MemBlock *node = nullptr;
    EXPECT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 0, &node)), -4);
    EXPECT_EQ(node, nullptr);
    FM_BlockHdr hdr{};
    ASSERT_EQ(StatusOf(FM_GetFileBlockHdrByIndex(file_, 0, &hdr)), 10);
    EXPECT_EQ(hdr.next, 0x07D85E54u);  // the magic
    EXPECT_EQ(hdr.prev, 24u);
    EXPECT_EQ(hdr.firstTag, 36u);
}

TEST_F(BlockCacheTest, FetchedCleanBlockIsNotDirtyAndWriteDoesNotMarkIt) {
    Make(4);
    Grow(1);
    Reopen(4);
    FM_MemBlock *node = nullptr;
    ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 1, &node)), 10);
    EXPECT_EQ(node->dirty, 0u);
    const uint8_t text[4] = {9, 8, 7, 6};
    FM_BlockAddr last{};
    ASSERT_EQ(StatusOf(FM_BlockWrite(file_, 1, 2, 4, text, &last)), 10);
    EXPECT_EQ(node->dirty, 0u);
    uint8_t back[4] = {};
    ASSERT_EQ(StatusOf(FM_BlockRead(file_, 1, 2, 4, back, nullptr)), 10);
    EXPECT_EQ(back[0], 9);  // visible in the cache
    Reopen(4);
    ASSERT_EQ(StatusOf(FM_BlockRead(file_, 1, 2, 4, back, nullptr)), 10);
    EXPECT_EQ(back[0], 1);  // never reached the file
}

TEST_F(BlockCacheTest, WriteToANewBlockReachesTheFileByItsDirtyMark) {
    Make(4);
    Grow(1);
    const uint8_t text[4] = {9, 8, 7, 6};
    ASSERT_EQ(StatusOf(FM_BlockWrite(file_, 1, 0, 4, text, nullptr)), 10);
    Reopen(4);
    uint8_t back[4] = {};
    ASSERT_EQ(StatusOf(FM_BlockRead(file_, 1, 0, 4, back, nullptr)), 10);
    EXPECT_EQ(back[3], 6);
}

TEST_F(BlockCacheTest, EvictionWritesOnlyDirtyNodesAndKeepsTheirMarks) {
    Make(4);
    Grow(4);
    Reopen(4);
    FM_MemBlock *node = nullptr;
    for (uint32_t i = 1; i <= 4; ++i)
        ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, i, &node)), 10);
    const uint8_t z = 0xCC;
    ASSERT_EQ(StatusOf(FM_BlockWrite(file_, 1, 0, 1, &z, nullptr)), 10);  // 1 is now newest
    ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 2, &node)), 10);
    // Order 2,1,4,3; block 3 is evicted clean when block 5 (new) needs a node.
    ASSERT_EQ(StatusOf(FM_NewBlock(file_, &node)), 10);
    EXPECT_EQ(node->index, 5u);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{5, 2, 1, 4}));
    Reopen(4);
    uint8_t back = 0;
    ASSERT_EQ(StatusOf(FM_BlockRead(file_, 1, 0, 1, &back, nullptr)), 10);
    EXPECT_EQ(back, 1);
}

TEST_F(BlockCacheTest, FreedCachedBlockKeepsCountingAgainstTheLimit) {
    Make(4);
    Grow(3);
    ASSERT_EQ(StatusOf(FM_FreeBlock(file_, 2)), 10);
    EXPECT_EQ(file_->cachedCount, 3u);
    EXPECT_EQ(CacheIndexes(file_).size(), 2u);
    FM_MemBlock *node = nullptr;
    ASSERT_EQ(StatusOf(FM_NewBlock(file_, &node)), 10);  // a fresh node: count 4
    EXPECT_EQ(node->index, 2u);
    EXPECT_EQ(file_->cachedCount, 4u);
    EXPECT_EQ(CacheIndexes(file_).size(), 3u);
    // The limit is reached with three nodes: the next request turns the ring.
    ASSERT_EQ(StatusOf(FM_NewBlock(file_, &node)), 10);
    EXPECT_EQ(node->index, 4u);
    EXPECT_EQ(CacheIndexes(file_).size(), 3u);
}

TEST_F(BlockCacheTest, CountBelowFourAfterFailedAllocationIsMemoryFailure) {
    Make(10);
    Grow(3);
    FM_MemBlock *node = nullptr;
    tessarine::testing::FailAllocationAt(1);
    EXPECT_EQ(StatusOf(FM_NewBlock(file_, &node)), -5);
    tessarine::testing::ResetInjection();
    Grow(1);
    // Four cached: a failed allocation below the limit recycles the oldest.
    tessarine::testing::FailAllocationAt(1);
    ASSERT_EQ(StatusOf(FM_NewBlock(file_, &node)), 10);
    tessarine::testing::ResetInjection();
    EXPECT_EQ(node->index, 5u);
    EXPECT_EQ(file_->cachedCount, 4u);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{5, 4, 3, 2}));
}

TEST_F(BlockCacheTest, RecycledNodeKeepsIndexAndDirtyWhenItsReadFails) {
    Make(4);
    Grow(4);
    Reopen(4);
    FM_MemBlock *node = nullptr;
    for (uint32_t i = 1; i <= 4; ++i)
        ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, i, &node)), 10);
    // Block 9 lies past the end of the file: the read comes up short.
    EXPECT_EQ(StatusOf(FM_GetMemBlockByIndex(file_, 9, &node)), -50);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{1, 4, 3, 2}));
}

}  // namespace
