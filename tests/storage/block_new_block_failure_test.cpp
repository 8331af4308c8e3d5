// A new block whose free-link read or end-of-file seek fails: the node has
// already taken its index, so what the cache writes back at close goes to
// that slot; only the marks of a new block wait for success.
#include <string>
#include <vector>

#include "block_test_support.h"
#include "core/status.h"
#include "platform/test_hooks.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;
namespace th = tessarine::testing;

constexpr uint32_t P = 24, S = P + 12;

std::vector<uint8_t> Slot(const std::vector<uint8_t> &file, uint32_t index) {
    return std::vector<uint8_t>(file.begin() + index * S, file.begin() + (index + 1) * S);
}

// What the node holds before the failing call, to compare with after it.
struct NodeView {
    uintptr_t dirty;
    uint32_t index;
    std::vector<uint8_t> image;
};
NodeView View(const FM_MemBlock *node) {
    return {node->dirty, node->index, std::vector<uint8_t>(node->image, node->image + S)};
}

class NewBlockFailureTest : public BlockFileFixture {
  protected:
    void TearDown() override {
        th::ResetInjection();
        BlockFileFixture::TearDown();
    }
    // Four new blocks fill a cache of four; each gets its own data bytes.
    void FillWithNewBlocks(uint8_t fill) {
        for (int i = 0; i < 4; ++i) {
            FM_MemBlock *node = nullptr;
            ASSERT_EQ(StatusOf(FM_NewBlock(file_, &node)), 10);
            std::vector<uint8_t> data(P, uint8_t(fill + i));
            ASSERT_EQ(StatusOf(FM_BlockWrite(file_, node->index, 0, P, data.data(), nullptr)), 10);
        }
    }
    // A new block with the nth call of `kind` failing: -50, the caller's place
    // untouched, and the recycled node (the head now) named `index` with the
    // dirty mark and image of the block it held before.
    void FailNewBlock(th::FileCall kind, int64_t n, const NodeView &evicted, uint32_t index) {
        th::FailFileCallAt(kind, n);
        FM_MemBlock *node = nullptr;
        EXPECT_EQ(StatusOf(FM_NewBlock(file_, &node)), -50);
        EXPECT_TRUE(th::FileFailureHit(kind));
        th::ResetInjection();
        EXPECT_EQ(node, nullptr);
        const NodeView after = View(file_->cacheHead);
        EXPECT_EQ(after.index, index);
        EXPECT_EQ(after.dirty, evicted.dirty);
        EXPECT_EQ(after.image, evicted.image);
    }
    // Closes the file, which must then be `slots` slots long with `image` in
    // each of `where`; gives its bytes.
    std::vector<uint8_t> CloseAndExpect(uint32_t slots, const std::vector<uint8_t> &image,
                                        std::initializer_list<uint32_t> where) {
        EXPECT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
        std::vector<uint8_t> bytes = ReadAll(path_);
        EXPECT_EQ(bytes.size(), size_t(slots) * S);
        if (bytes.size() != size_t(slots) * S) return bytes;
        for (uint32_t slot : where) EXPECT_EQ(Slot(bytes, slot), image) << slot;
        return bytes;
    }
};

// The free list runs 1, 2, 3, 4, 99 and slot 99 lies beyond the file: the
// fifth new block evicts block 1 and its read at slot 99 comes up short.
TEST_F(NewBlockFailureTest, FreeListRunningPastTheFileGivesTheNodeItsIndex) {
    Make(4, P);
    FillWithNewBlocks(0x10);
    for (uint32_t b : {4u, 3u, 2u, 1u}) ASSERT_EQ(StatusOf(FM_FreeBlock(file_, b)), 10);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    std::vector<uint8_t> bytes = ReadAll(path_);
    ASSERT_EQ(Le32(bytes, 4 * S), 0u);
    PutLe32(bytes, 4 * S, 99);
    WriteAll(path_, bytes);

    ASSERT_EQ(StatusOf(FM_BlockFileOpen(path_.c_str(), &file_, 4)), 10);
    ASSERT_EQ(file_->header.freeHead, 1u);
    FM_MemBlock *node = nullptr;
    for (uint32_t expected : {1u, 2u, 3u, 4u}) {
        ASSERT_EQ(StatusOf(FM_NewBlock(file_, &node)), 10);
        ASSERT_EQ(node->index, expected);
        std::vector<uint8_t> data(P, uint8_t(0x50 + expected));
        ASSERT_EQ(StatusOf(FM_BlockWrite(file_, expected, 0, P, data.data(), nullptr)), 10);
    }
    const NodeView before = View(Cached(file_, 1));
    ASSERT_EQ(file_->cacheHead->prev->index, 1u);  // the least recently used

    FM_MemBlock *sentinel = reinterpret_cast<FM_MemBlock *>(0x9);
    node = sentinel;
    EXPECT_EQ(StatusOf(FM_NewBlock(file_, &node)), -50);
    EXPECT_EQ(node, sentinel);
    EXPECT_EQ(file_->header.freeHead, 99u);
    EXPECT_EQ(file_->header.nextIndex, 5u);
    EXPECT_EQ(file_->cachedCount, 4u);
    EXPECT_EQ(CacheIndexes(file_), (std::vector<uint32_t>{99, 4, 3, 2}));
    const NodeView after = View(file_->cacheHead);
    EXPECT_EQ(after.index, 99u);
    EXPECT_EQ(after.dirty, before.dirty);
    EXPECT_EQ(after.image, before.image);

    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    bytes = ReadAll(path_);
    ASSERT_EQ(bytes.size(), 100u * S);
    EXPECT_EQ(Slot(bytes, 1), before.image);   // written when it was evicted
    EXPECT_EQ(Slot(bytes, 99), before.image);  // and again under its new index at close
    EXPECT_EQ(Le32(bytes, 24), 99u);           // freeHead
    EXPECT_EQ(Le32(bytes, 12), 5u);            // nextIndex
}

// A dirty node recycled for a block from the free list, with the read of the
// free link failing (or its seek): the node carries the free head's index.
TEST_F(NewBlockFailureTest, InjectedFailureOfTheFreeLinkRead) {
    for (th::FileCall kind : {th::FileCall::Read, th::FileCall::Seek}) {
        SCOPED_TRACE(kind == th::FileCall::Read ? "read" : "seek");
        Make(4, P);
        FillWithNewBlocks(0x20);  // blocks 1 to 4
        ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
        ASSERT_EQ(StatusOf(FM_BlockFileOpen(path_.c_str(), &file_, 4)), 10);
        FillWithNewBlocks(0x40);                           // blocks 5 to 8, all dirty
        ASSERT_EQ(StatusOf(FM_FreeBlock(file_, 2)), 10);  // not cached: free head 2
        const NodeView evicted = View(Cached(file_, 5));

        // The eviction's write seeks first; the read's seek is the second.
        FailNewBlock(kind, kind == th::FileCall::Read ? 1 : 2, evicted, 2);
        EXPECT_EQ(file_->header.freeHead, 2u);
        EXPECT_EQ(file_->header.nextIndex, 9u);

        const std::vector<uint8_t> bytes = CloseAndExpect(9, evicted.image, {5, 2});
        EXPECT_EQ(Le32(bytes, 24), 2u);
        ASSERT_EQ(StatusOf(FM_Delete(path_.c_str())), 10);
    }
}

// From the end of the file: the index is taken and nextIndex rises before
// the seek that fails.
TEST_F(NewBlockFailureTest, InjectedFailureOfTheSeekPastTheEnd) {
    Make(4, P);
    FillWithNewBlocks(0x60);  // blocks 1 to 4, all dirty
    const NodeView evicted = View(Cached(file_, 1));
    FailNewBlock(th::FileCall::Seek, 2, evicted, 5);  // the seek after the eviction's write
    EXPECT_EQ(file_->header.nextIndex, 6u);

    const std::vector<uint8_t> bytes = CloseAndExpect(6, evicted.image, {1, 5});
    EXPECT_EQ(Le32(bytes, 12), 6u);
}

}  // namespace
