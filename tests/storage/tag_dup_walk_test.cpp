// The copy of a tag stream follows its steps in their order: each live tag is
// appended and its data copied before the walk steps on, a copy that runs off
// the chain fails as a block read does, and a walk that comes back into a
// block it has passed goes on to the end position.
#include <algorithm>
#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include "block_test_support.h"
#include "core/status.h"
#include "stale_link_file.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;

// `count` bytes of the stream from (block, offset), following the next links
// in the bytes of a closed file.
std::vector<uint8_t> ChainBytes(const std::vector<uint8_t> &file, uint32_t block, uint32_t offset,
                                uint32_t count) {
    const uint32_t payload = Le32(file, 4), stride = Le32(file, 8);
    std::vector<uint8_t> out;
    while (out.size() < count) {
        if (offset == payload) {
            block = Le32(file, size_t(block) * stride);
            offset = 0;
        }
        out.push_back(file.at(size_t(block) * stride + 12 + offset));
        ++offset;
    }
    return out;
}

struct LiveTag {
    FM_TagHdr header;
    std::vector<uint8_t> data;
};

// The live tags of a closed file, read from its bytes with the walk of the
// block layer given as (block, offset) of each tag.
LiveTag TagAt(const std::vector<uint8_t> &file, FM_BlockAddr at) {
    const std::vector<uint8_t> h = ChainBytes(file, at.block, at.offset, 8);
    LiveTag t;
    t.header.kind = h[0];
    std::memcpy(t.header.extra, &h[1], 3);
    t.header.length = Le32(h, 4);
    t.data = ChainBytes(file, at.block, at.offset, t.header.length);
    t.data.erase(t.data.begin(), t.data.begin() + 8);
    return t;
}

class DupWalkTest : public TagFileFixture {
  protected:
    void TearDown() override {
        FM_Delete(Copy().c_str());
        BlockFileFixture::TearDown();
    }
    std::string Copy() const { return Path("copy.blk"); }
    // What the copy must hold: the tags appended to a new file in order, and
    // of the last one only the first `lastData` bytes of data (all if -1),
    // each moved in pieces of a block's worth as the copy moves them.
    std::vector<uint8_t> Model(uint32_t payload, const std::vector<LiveTag> &tags,
                               int64_t lastData = -1) {
        const std::string path = Path("model.blk");
        FM_BlockFile *f = nullptr;
        EXPECT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &f, payload, 8, nullptr)), 10);
        if (f == nullptr) return {};
        for (size_t i = 0; i < tags.size(); ++i) {
            FM_BlockAddr tag{}, to{};
            EXPECT_EQ(StatusOf(FM_TagAppendHdrAtEnd(f, &tags[i].header, &tag, nullptr)), 10);
            EXPECT_EQ(StatusOf(FM_GetNextAddr(f, tag.block, tag.offset, 8, &to)), 10);
            size_t count = tags[i].data.size();
            if (i + 1 == tags.size() && lastData >= 0) count = size_t(lastData);
            for (size_t done = 0; done < count;) {
                const size_t n = std::min<size_t>(payload, count - done);
                EXPECT_EQ(StatusOf(FM_BlockWrite(f, to.block, to.offset, int32_t(n),
                                                 tags[i].data.data() + done, &to)),
                          10);
                done += n;
            }
        }
        EXPECT_EQ(StatusOf(FM_BlockFileClose(&f)), 10);
        std::vector<uint8_t> bytes = ReadAll(path);
        FM_Delete(path.c_str());
        return bytes;
    }
    int32_t Dup() { return StatusOf(FM_DupTagBlockFile(path_.c_str(), Copy().c_str())); }
    // Closes the file and sets the next link of a block in its bytes.
    std::vector<uint8_t> CloseAndLink(uint32_t block, uint32_t next) {
        EXPECT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
        std::vector<uint8_t> bytes = ReadAll(path_);
        PutLe32(bytes, size_t(block) * Le32(bytes, 8), next);
        WriteAll(path_, bytes);
        return bytes;
    }
};

// Block 1's next is 0 and a 64-byte live tag fills blocks 1 and 2: the tag is
// appended to the copy, whose read then runs off the chain.
TEST_F(DupWalkTest, TagWhoseDataRunsOffTheChainIsAppendedAndItsCopyFails) {
    Make(8, 32);
    const FM_BlockAddr tag = Append(1, 64, Pattern(56, 3));
    ASSERT_EQ(file_->header.endBlock, 0u);
    const std::vector<uint8_t> source = CloseAndLink(1, 0);
    EXPECT_EQ(Dup(), -4);
    EXPECT_EQ(ReadAll(path_), source);  // the source is only read
    const std::vector<uint8_t> copy = ReadAll(Copy());
    ASSERT_EQ(copy.size(), 132u);
    EXPECT_EQ(Le32(copy, 12), 3u);  // nextIndex: two blocks taken
    EXPECT_EQ(Le32(copy, 28), 0u);  // the tag fills them
    EXPECT_EQ(copy, Model(32, {TagAt(source, tag)}, 0));
}

// The same over a ring of four blocks, after a tag that copies whole: two
// pieces of the long tag's data arrive, the third runs off the chain.
TEST_F(DupWalkTest, CopyRunningOffALongerChainKeepsWhatWasCopied) {
    Make(8, 32);
    const FM_BlockAddr first = Append(7, 20, Pattern(12, 40));
    const FM_BlockAddr second = Append(1, 96, Pattern(88, 9));  // blocks 1, 4, 3, 2
    const std::vector<uint8_t> source = CloseAndLink(3, 0);
    EXPECT_EQ(Dup(), -4);
    EXPECT_EQ(ReadAll(Copy()), Model(32, {TagAt(source, first), TagAt(source, second)}, 64));
}

// A file laid out by hand, block by block: `blocks` slots of payload 48,
// each with its next link and tags (kind, length) at given offsets; the rest
// of the data is a pattern.
constexpr uint32_t kP = 48, kS = kP + 12;
static_assert(kP == kStaleLinkPayload);
struct LaidTag {
    uint32_t block, offset;
    uint8_t kind;
    uint32_t length;
};
std::vector<uint8_t> LayOut(uint32_t blocks, const std::vector<std::pair<uint32_t, uint32_t>> &next,
                            FM_BlockAddr end, const std::vector<LaidTag> &tags) {
    std::vector<uint8_t> b((blocks + 1) * kS, 0);
    const uint32_t header[9] = {0, kP, kS, blocks + 1, 1, blocks, 0, end.block, end.offset};
    for (int i = 1; i < 9; ++i) PutLe32(b, 4 * i, header[i]);
    b[0] = 0x54, b[1] = 0x5E, b[2] = 0xD8, b[3] = 0x07;
    for (uint32_t i = 1; i <= blocks; ++i)
        for (uint32_t j = 0; j < kP; ++j) b[i * kS + 12 + j] = uint8_t(i * 31 + j * 5);
    for (auto [block, link] : next) PutLe32(b, block * kS, link);
    for (const LaidTag &t : tags) {
        const size_t at = t.block * kS + 12 + t.offset;
        b[at] = t.kind, b[at + 1] = 0xE1, b[at + 2] = 0xE2, b[at + 3] = t.kind;
        PutLe32(b, at + 4, t.length);
    }
    return b;
}

// Chain 1, 10, 10 (block 10 points at itself), end position (10, 26): the
// 105-byte tag at (1, 0) steps into block 10 twice and lands on (10, 9), and
// two more live tags lead to the end.
TEST_F(DupWalkTest, StepIntoAPassedBlockGoesOnToTheEndPosition) {
    Make(8, kP);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    const std::vector<uint8_t> source =
        LayOut(10, {{1, 10}, {10, 10}}, {10, 26}, {{1, 0, 1, 105}, {10, 9, 2, 8}, {10, 17, 3, 9}});
    WriteAll(path_, source);
    EXPECT_EQ(Dup(), 10);
    EXPECT_EQ(ReadAll(path_), source);
    EXPECT_EQ(ReadAll(Copy()),
              Model(kP, {TagAt(source, {1, 0}), TagAt(source, {10, 9}), TagAt(source, {10, 17})}));
}

// A file made by tag calls (MakeStaleLink), chain 1, 10, 0 and no end
// position: the step of a 150-byte tag at (1, 0) goes through block 10 and
// the free link 0 on to the next that the file's first bytes give. The tag is
// appended to the copy, whose second piece of data runs off the chain.
TEST_F(DupWalkTest, TagThatStepsThroughAFreedBlockIsAppendedAndItsCopyFails) {
    ASSERT_NO_FATAL_FAILURE(MakeStaleLink(150));
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    const std::vector<uint8_t> source = ReadAll(path_);
    ASSERT_EQ(source.size(), 11u * kS);
    EXPECT_EQ(Le32(source, 16), 1u);       // firstBlock
    EXPECT_EQ(Le32(source, 24), 10u);      // freeHead
    EXPECT_EQ(Le32(source, 28), 0u);       // endBlock
    EXPECT_EQ(Le32(source, 1 * kS), 10u);  // chain 1, 10, 0
    EXPECT_EQ(Le32(source, 10 * kS), 0u);
    EXPECT_EQ(source[kS + 12], 1);  // the tag at (1, 0)
    EXPECT_EQ(Le32(source, kS + 12 + 4), 150u);
    // Of its data only the first piece reaches the copy.
    LiveTag first;
    first.header = Tag(1, 150);
    first.data = ChainBytes(source, 1, 8, kP);
    EXPECT_EQ(Dup(), -4);
    EXPECT_EQ(ReadAll(path_), source);
    EXPECT_EQ(ReadAll(Copy()), Model(kP, {first}));
}

// Then block 10 linked to itself. Chain 1, 10, 10 and end position (10, 26):
// the 105-byte tag at (1, 0) steps into block 10 twice and lands on (10, 9),
// and two live tags lead to the end. The walk passes over the tag at (10, 0).
TEST_F(DupWalkTest, StepIntoAPassedBlockOfAFileMadeByTagCalls) {
    ASSERT_NO_FATAL_FAILURE(MakeStaleLink(105));
    FM_BlockAddr second{}, third{};
    ASSERT_NO_FATAL_FAILURE(LinkFreedBlockToItself(&second, &third));
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    const std::vector<uint8_t> source = ReadAll(path_);
    ASSERT_EQ(source.size(), 11u * kS);
    EXPECT_EQ(Le32(source, 12), 11u);  // nextIndex
    EXPECT_EQ(Le32(source, 16), 1u);   // firstBlock
    EXPECT_EQ(Le32(source, 24), 0u);   // freeHead
    EXPECT_EQ(Le32(source, 28), 10u);  // end position
    EXPECT_EQ(Le32(source, 32), 26u);
    EXPECT_EQ(Le32(source, 1 * kS), 10u);  // chain 1, 10, 10
    EXPECT_EQ(Le32(source, 10 * kS), 10u);
    const LiveTag first = TagAt(source, {1, 0});
    EXPECT_EQ(first.header.kind, 1);
    EXPECT_EQ(first.header.length, 105u);
    EXPECT_EQ(Dup(), 10);
    EXPECT_EQ(ReadAll(path_), source);
    EXPECT_EQ(ReadAll(Copy()), Model(kP, {first, TagAt(source, second), TagAt(source, third)}));
}

// A free tag at (1, 0) five hundred steps long, round the ring of blocks 2
// and 3 that block 1 leads into: the live tags it lands on are copied.
TEST_F(DupWalkTest, FreeTagGoingHundredsOfStepsRoundARing) {
    Make(8, kP);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    const std::vector<uint8_t> source =
        LayOut(3, {{1, 2}, {2, 3}, {3, 2}}, {3, 30},
               {{1, 0, 0, kP * 500 + 5}, {3, 5, 4, 10}, {3, 15, 5, 15}});
    WriteAll(path_, source);
    EXPECT_EQ(Dup(), 10);
    EXPECT_EQ(ReadAll(Copy()), Model(kP, {TagAt(source, {3, 5}), TagAt(source, {3, 15})}));
}

// Free tags that lead to each other round a ring of two blocks never reach
// the end position: the copy stops with a status.
TEST_F(DupWalkTest, TagsThatCircleForEverGiveAStatus) {
    Make(8, kP);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file_)), 10);
    WriteAll(path_, LayOut(2, {{1, 2}, {2, 1}}, {2, 40},
                           {{1, 0, 6, 20}, {1, 20, 0, 48}, {2, 20, 0, 48}}));
    EXPECT_EQ(Dup(), -50);
}

}  // namespace
