// Creating, opening, closing and deleting block files.
#include <unistd.h>

#include <string>

#include "block_test_support.h"
#include "core/status.h"
#include "storage/block_file.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;

class BlockFileTest : public tstest::Sandbox {};

TEST_F(BlockFileTest, NewFileHasHeaderOnlyAndPositionAtStride) {
    const std::string path = Path("a.blk");
    FM_BlockFile *file = nullptr;
    ASSERT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &file, 100, 4, nullptr)), 10);
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(file->header.nextIndex, 1u);
    EXPECT_EQ(file->header.payloadSize, 100u);
    EXPECT_EQ(file->header.stride, 112u);
    EXPECT_EQ(file->nodeBytes, offsetof(FM_MemBlock, image) + 112);
    EXPECT_EQ(file->descriptor > 0, true);
    EXPECT_EQ(file->cachedCount, 0u);
    EXPECT_EQ(file->cacheHead, nullptr);
    EXPECT_EQ(file->cacheLimit, 4);
    EXPECT_EQ(std::string(file->path), path);
    int32_t position = 0;
    ASSERT_EQ(StatusOf(FM_Tell(file->descriptor, &position)), 10);
    EXPECT_EQ(position, 112);
    const auto bytes = ReadAll(path);
    ASSERT_EQ(bytes.size(), 36u);
    EXPECT_EQ(bytes[0], 0x54);
    EXPECT_EQ(bytes[1], 0x5E);
    EXPECT_EQ(bytes[2], 0xD8);
    EXPECT_EQ(bytes[3], 0x07);
    EXPECT_EQ(Le32(bytes, 4), 100u);
    EXPECT_EQ(Le32(bytes, 8), 112u);
    EXPECT_EQ(Le32(bytes, 12), 1u);
    for (size_t at = 16; at < 36; at += 4) EXPECT_EQ(Le32(bytes, at), 0u);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file)), 10);
    EXPECT_EQ(file, nullptr);
    FM_Delete(path.c_str());
}

TEST_F(BlockFileTest, CloseWritesHeaderAndDirtyBlocksOpenReadsThemBack) {
    const std::string path = Path("a.blk");
    FM_BlockFile *file = nullptr;
    ASSERT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &file, 24, 4, nullptr)), 10);
    FM_MemBlock *node = nullptr;
    ASSERT_EQ(StatusOf(FM_NewBlock(file, &node)), 10);
    ASSERT_EQ(StatusOf(FM_InsertBlockAfter(file, 0, node)), 10);
    std::memset(Data(node), 0x5A, 24);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file)), 10);
    auto bytes = ReadAll(path);
    ASSERT_EQ(bytes.size(), 72u);
    EXPECT_EQ(Le32(bytes, 12), 2u);      // nextIndex
    EXPECT_EQ(Le32(bytes, 16), 1u);      // firstBlock
    EXPECT_EQ(Le32(bytes, 20), 1u);      // lastBlock
    EXPECT_EQ(Le32(bytes, 36 + 0), 1u);  // block 1 next: itself
    EXPECT_EQ(Le32(bytes, 36 + 4), 0u);
    EXPECT_EQ(Le32(bytes, 36 + 8), 24u);  // firstTag: none begins
    EXPECT_EQ(bytes[48], 0x5A);

    ASSERT_EQ(StatusOf(FM_BlockFileOpen(path.c_str(), &file, 7)), 10);
    EXPECT_EQ(file->header.payloadSize, 24u);
    EXPECT_EQ(file->header.nextIndex, 2u);
    EXPECT_EQ(file->cacheLimit, 7);
    EXPECT_EQ(file->tagCallback, nullptr);
    EXPECT_EQ(file->nodeBytes, offsetof(FM_MemBlock, image) + 36);
    uint8_t back[24];
    ASSERT_EQ(StatusOf(FM_BlockRead(file, 1, 0, 24, back, nullptr)), 10);
    EXPECT_EQ(back[23], 0x5A);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file)), 10);
    FM_Delete(path.c_str());
}

TEST_F(BlockFileTest, SmallPayloadLetsTheHeaderOverlapBlockOne) {
    // The header is 36 bytes and slot 0 only stride bytes: with a payload
    // below 24 the header written at close lands on block 1's first words.
    const std::string path = Path("small.blk");
    FM_BlockFile *file = nullptr;
    ASSERT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &file, 20, 4, nullptr)), 10);
    FM_MemBlock *node = nullptr;
    ASSERT_EQ(StatusOf(FM_NewBlock(file, &node)), 10);
    ASSERT_EQ(StatusOf(FM_InsertBlockAfter(file, 0, node)), 10);
    EXPECT_EQ(ImageWord(node, 0), 1u);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file)), 10);
    const auto bytes = ReadAll(path);
    ASSERT_EQ(bytes.size(), 64u);
    EXPECT_EQ(Le32(bytes, 32), 0u);  // endOffset, where block 1's next was
    FM_Delete(path.c_str());
}

TEST_F(BlockFileTest, OpenWithWrongMagicFailsAndKeepsFirstBytes) {
    const std::string path = Path("bad.blk");
    std::vector<uint8_t> bytes(50);
    for (size_t i = 0; i < bytes.size(); ++i) bytes[i] = uint8_t(i * 7 + 1);
    WriteAll(path, bytes);
    FM_BlockFile *file = reinterpret_cast<FM_BlockFile *>(0x1);
    EXPECT_EQ(StatusOf(FM_BlockFileOpen(path.c_str(), &file, 4)), -50);
    EXPECT_EQ(file, reinterpret_cast<FM_BlockFile *>(0x1));
    EXPECT_EQ(ReadAll(path), bytes);
    // One wrong byte among the four is enough.
    bytes = ReadAll(path);
    bytes[0] = 0x54, bytes[1] = 0x5E, bytes[2] = 0xD8, bytes[3] = 0x08;
    WriteAll(path, bytes);
    EXPECT_EQ(StatusOf(FM_BlockFileOpen(path.c_str(), &file, 4)), -50);
    EXPECT_EQ(ReadAll(path), bytes);
    FM_Delete(path.c_str());
}

TEST_F(BlockFileTest, OpenOfShortFileWritesItOutTo36Bytes) {
    const std::string path = Path("short.blk");
    const std::vector<uint8_t> bytes = {0x54, 0x5E, 0xD8, 0x07, 9, 9};
    WriteAll(path, bytes);
    FM_BlockFile *file = nullptr;
    EXPECT_EQ(StatusOf(FM_BlockFileOpen(path.c_str(), &file, 4)), -50);
    auto after = ReadAll(path);
    ASSERT_EQ(after.size(), 36u);
    EXPECT_TRUE(std::equal(bytes.begin(), bytes.end(), after.begin()));
    for (size_t i = bytes.size(); i < 36; ++i) EXPECT_EQ(after[i], 0) << i;
    FM_Delete(path.c_str());
}

TEST_F(BlockFileTest, OpenTakesStrideOnTrustButRefusesUnusableSizes) {
    const std::string path = Path("s.blk");
    auto make = [&](uint32_t payload, uint32_t stride) {
        std::vector<uint8_t> b(36);
        b[0] = 0x54, b[1] = 0x5E, b[2] = 0xD8, b[3] = 0x07;
        PutLe32(b, 4, payload);
        PutLe32(b, 8, stride);
        PutLe32(b, 12, 1);
        WriteAll(path, b);
    };
    FM_BlockFile *file = nullptr;
    make(10, 40);  // wider than payload + 12: used as it stands
    ASSERT_EQ(StatusOf(FM_BlockFileOpen(path.c_str(), &file, 4)), 10);
    EXPECT_EQ(file->header.stride, 40u);
    EXPECT_EQ(file->nodeBytes, offsetof(FM_MemBlock, image) + 40);
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file)), 10);
    for (auto [payload, stride] : {std::pair{10u, 0u},
                                   {10u, 11u},
                                   {10u, 21u},
                                   {0u, 12u},
                                   {0u, 40u},
                                   {0xFFFFFFF4u, 0u},
                                   {10u, 0x80000000u}}) {
        make(payload, stride);
        EXPECT_EQ(StatusOf(FM_BlockFileOpen(path.c_str(), &file, 4)), -50)
            << payload << " " << stride;
    }
    FM_Delete(path.c_str());
}

TEST_F(BlockFileTest, OpenOfMissingFileIsAccessFailure) {
    FM_BlockFile *file = nullptr;
    EXPECT_EQ(StatusOf(FM_BlockFileOpen(Path("none.blk").c_str(), &file, 4)), -50);
    EXPECT_EQ(file, nullptr);
}

TEST_F(BlockFileTest, PathTooLongForTheRecordIsRefused) {
    std::string path = Path(std::string(600, 'x'));
    FM_BlockFile *file = nullptr;
    EXPECT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &file, 10, 4, nullptr)), -4);
    EXPECT_EQ(StatusOf(FM_BlockFileOpen(path.c_str(), &file, 4)), -4);
    EXPECT_EQ(file, nullptr);
    // 511 characters still fit.
    std::string longest = Dir() + "/";
    longest += std::string(511 - longest.size(), 'y');
    ASSERT_EQ(longest.size(), 511u);
    if (longest.size() - Dir().size() - 1 <= 255) {
        ASSERT_EQ(StatusOf(FM_BlockFileCreate(longest.c_str(), &file, 10, 4, nullptr)), 10);
        FM_BlockFileDelete(&file);
    }
}

TEST_F(BlockFileTest, CreateRefusesPayloadThatCannotWalk) {
    FM_BlockFile *file = nullptr;
    EXPECT_EQ(StatusOf(FM_BlockFileCreate(Path("z.blk").c_str(), &file, 0, 4, nullptr)), -4);
    for (uint32_t payload : {0x7FFFFFF4u, 0xFFFFFFF4u, 0xFFFFFFFFu})
        EXPECT_EQ(StatusOf(FM_BlockFileCreate(Path("z.blk").c_str(), &file, payload, 4, nullptr)),
                  -50)
            << payload;
    EXPECT_EQ(file, nullptr);
}

TEST_F(BlockFileTest, CreateTakesAnyPayloadWhoseFirstBlockStartsWithinAnOffset) {
    const std::string path = Path("big.blk");
    for (uint32_t payload : {0x40000000u, 0x7FFFFFF3u}) {
        FM_BlockFile *file = nullptr;
        ASSERT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &file, payload, 4, nullptr)), 10);
        EXPECT_EQ(file->header.stride, payload + 12);
        EXPECT_EQ(file->nodeBytes, offsetof(FM_MemBlock, image) + payload + 12);
        int32_t position = 0;
        ASSERT_EQ(StatusOf(FM_Tell(file->descriptor, &position)), 10);
        EXPECT_EQ(uint32_t(position), payload + 12);
        ASSERT_EQ(StatusOf(FM_BlockFileClose(&file)), 10);
        EXPECT_EQ(ReadAll(path).size(), 36u);
        ASSERT_EQ(StatusOf(FM_BlockFileOpen(path.c_str(), &file, 4)), 10);
        EXPECT_EQ(file->header.payloadSize, payload);
        ASSERT_EQ(StatusOf(FM_BlockFileClose(&file)), 10);
        FM_Delete(path.c_str());
    }
}

TEST_F(BlockFileTest, CreateFailureDeletesThePathAndLeavesOutUntouched) {
    FM_BlockFile *file = reinterpret_cast<FM_BlockFile *>(0x2);
    EXPECT_EQ(StatusOf(FM_BlockFileCreate(Path("no/such/dir.blk").c_str(), &file, 10, 4, nullptr)),
              -50);
    EXPECT_EQ(file, reinterpret_cast<FM_BlockFile *>(0x2));
}

TEST_F(BlockFileTest, CreateOverExistingFileKeepsItsLength) {
    const std::string path = Path("old.blk");
    WriteAll(path, std::vector<uint8_t>(300, 0xEE));
    FM_BlockFile *file = nullptr;
    ASSERT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &file, 10, 4, nullptr)), 10);
    auto bytes = ReadAll(path);
    EXPECT_EQ(bytes.size(), 300u);
    EXPECT_EQ(bytes[0], 0x54);
    EXPECT_EQ(bytes[36], 0xEE);
    FM_BlockFileDelete(&file);
}

TEST_F(BlockFileTest, CloseOfNullPlaceOrHandleSucceeds) {
    EXPECT_EQ(StatusOf(FM_BlockFileClose(nullptr)), 10);
    FM_BlockFile *file = nullptr;
    EXPECT_EQ(StatusOf(FM_BlockFileClose(&file)), 10);
    FM_BlockFileDelete(nullptr);
    FM_BlockFileDelete(&file);
}

TEST_F(BlockFileTest, DeleteLosesDirtyBlocksAndRemovesTheFile) {
    const std::string path = Path("d.blk");
    FM_BlockFile *file = nullptr;
    ASSERT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &file, 10, 4, nullptr)), 10);
    FM_MemBlock *node = nullptr;
    ASSERT_EQ(StatusOf(FM_NewBlock(file, &node)), 10);
    EXPECT_NE(node->dirty, 0u);
    FM_BlockFileDelete(&file);
    EXPECT_EQ(file, nullptr);
    EXPECT_NE(access(path.c_str(), F_OK), 0);
}

TEST_F(BlockFileTest, DeleteOfAFileWhoseDirtyBlocksWereNotWrittenWritesNothing) {
    // The file keeps the bytes it had: Delete removes it without a write,
    // which shows on a second name of the same file.
    const std::string path = Path("d.blk");
    const std::string other = Path("d2.blk");
    FM_BlockFile *file = nullptr;
    ASSERT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &file, 10, 4, nullptr)), 10);
    ASSERT_EQ(link(path.c_str(), other.c_str()), 0);
    FM_MemBlock *node = nullptr;
    ASSERT_EQ(StatusOf(FM_NewBlock(file, &node)), 10);
    FM_BlockFileDelete(&file);
    EXPECT_EQ(ReadAll(other).size(), 36u);
    unlink(other.c_str());
}

}  // namespace
