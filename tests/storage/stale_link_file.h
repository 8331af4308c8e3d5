// A tag file made by ordinary calls whose chain leads from block 1 into a
// block that was freed, and then into that block linked to itself.
#pragma once

#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include <tessarine/storage.h>

#include "block_test_support.h"
#include "core/status.h"

namespace blocktest {

inline std::vector<uint8_t> Pattern(size_t n, uint8_t seed) {
    std::vector<uint8_t> v(n);
    for (size_t i = 0; i < n; ++i) v[i] = uint8_t(seed + 7 * i);
    return v;
}

inline constexpr uint32_t kStaleLinkPayload = 48;

class TagFileFixture : public BlockFileFixture {
  protected:
    // Appends a live tag and fills its data.
    FM_BlockAddr Append(uint8_t kind, uint32_t length, const std::vector<uint8_t> &data) {
        FM_TagHdr t = Tag(kind, length);
        FM_BlockAddr tag{}, at{};
        EXPECT_EQ(tessarine::StatusOf(FM_TagAppendHdrAtEnd(file_, &t, &tag, &at)), 10);
        EXPECT_EQ(tessarine::StatusOf(FM_GetNextAddr(file_, tag.block, tag.offset, 8, &at)), 10);
        if (!data.empty()) {
            EXPECT_EQ(tessarine::StatusOf(FM_BlockWrite(
                          file_, at.block, at.offset, int32_t(data.size()), data.data(), nullptr)),
                      10);
        }
        return tag;
    }

    // Payload 48 and a cache of four blocks. Every new block goes in after
    // block 1, so block 1 leads to the newest: a tag of `firstLength` bytes at
    // (1, 0), tags up to the end of block 9, and a 20-byte tag alone at
    // (10, 0). After a reopen the first tag is read, which caches block 1
    // clean. Deleting the tag at (10, 0) frees block 10 and gives block 1 its
    // new next in that clean image only, which the next reopen drops: in the
    // file block 1 still leads to block 10, whose next is now the free link 0.
    // The stream has no end position.
    void MakeStaleLink(uint32_t firstLength) {
        constexpr uint32_t P = kStaleLinkPayload;
        Make(4, P);
        ASSERT_EQ(Append(1, firstLength, Pattern(firstLength - 8, 1)), (FM_BlockAddr{1, 0}));
        Append(2, P - file_->header.endOffset, Pattern(P - file_->header.endOffset - 8, 2));
        ASSERT_EQ(file_->header.endBlock, 0u);  // the first tag's last block is full
        for (uint8_t kind = 3; file_->header.nextIndex < 10; ++kind)
            Append(kind, P, Pattern(P - 8, kind));
        const FM_BlockAddr alone = Append(9, 20, Pattern(12, 9));
        ASSERT_EQ(alone, (FM_BlockAddr{10, 0}));
        ASSERT_EQ(file_->header.lastBlock, 1u);
        Reopen(4);
        FM_TagHdr first{};
        ASSERT_EQ(tessarine::StatusOf(FM_TagReadHdr(file_, 1, 0, &first, nullptr, nullptr)), 10);
        ASSERT_EQ(first.length, firstLength);
        FM_BlockAddr next{};
        ASSERT_EQ(tessarine::StatusOf(FM_TagDelete(file_, &alone, &next)), 10);
        ASSERT_EQ(next.block, 0u);
        ASSERT_EQ(file_->header.freeHead, 10u);
        ASSERT_EQ(file_->header.endBlock, 0u);
        FM_MemBlock *one = Cached(file_, 1);
        ASSERT_NE(one, nullptr);
        ASSERT_EQ(one->dirty, 0u);
        ASSERT_EQ(ImageWord(one, 0), 9u);
        Reopen(4);
    }

    // Three more tags after MakeStaleLink: block 10 comes back from the free
    // list and goes in after block 1, whose next in the file is already 10, so
    // it is linked to itself. A tag at (10, 0), then `second` at (10, 9) and
    // `third` at (10, 17), and the end position (10, 26).
    void LinkFreedBlockToItself(FM_BlockAddr *second, FM_BlockAddr *third) {
        ASSERT_EQ(Append(10, 9, Pattern(1, 10)), (FM_BlockAddr{10, 0}));
        *second = Append(11, 8, {});
        *third = Append(12, 9, Pattern(1, 12));
        ASSERT_EQ(*second, (FM_BlockAddr{10, 9}));
        ASSERT_EQ(*third, (FM_BlockAddr{10, 17}));
        ASSERT_EQ(file_->header.endBlock, 10u);
        ASSERT_EQ(file_->header.endOffset, 26u);
    }
};

}  // namespace blocktest
