// Demo: a block file with a tag stream: append, insert, delete, read back,
// and a compacted copy.
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include <tessarine/tessarine.h>

#include "demo.h"

namespace {

int32_t TellMove(FM_BlockAddr *from, FM_BlockAddr *to) {
    std::printf("  tag moved from (%u, %u) to (%u, %u)\n", from->block, from->offset, to->block,
                to->offset);
    return 10;
}

void PrintStream(FM_BlockFile *file) {
    FM_BlockAddr at = {file->header.firstBlock, 0};
    std::printf("  stream:");
    for (int i = 0; at.block != 0 && i < 32; ++i) {
        FM_TagHdr tag;
        FM_BlockAddr next;
        if (TS_FAILED(FM_TagReadHdr(file, at.block, at.offset, &tag, nullptr, &next))) break;
        std::printf(" [%s %u at (%u, %u)]", tag.kind ? "tag" : "free", tag.length, at.block,
                    at.offset);
        at = next;
    }
    std::printf("\n");
}

}  // namespace

void DemoBlockFile() {
    std::puts("Block file and tags:");
    const char *tmp = std::getenv("TMPDIR");
    const std::string dir = tmp != nullptr && *tmp != '\0' ? tmp : "/tmp";
    const std::string path = dir + "/tessarine-demo-" + std::to_string(getpid()) + ".blk";
    const std::string copy = path + ".copy";

    FM_BlockFile *file = nullptr;
    int32_t s = FM_BlockFileCreate(path.c_str(), &file, 100, 8, TellMove);
    std::printf("  created with 100-byte blocks (status %d)\n", TS_STATUS(s));
    if (TS_FAILED(s)) return;
    const char *texts[] = {"first record", "second record", "third record"};
    FM_BlockAddr where[3];
    for (int i = 0; i < 3; ++i) {
        FM_TagHdr tag = {uint8_t(i + 1), {0, 0, 0}, uint32_t(8 + std::strlen(texts[i]) + 1)};
        FM_BlockAddr data;
        FM_TagAppendHdrAtEnd(file, &tag, &where[i], nullptr);
        // The data lies 8 bytes on from the tag's address.
        FM_GetNextAddr(file, where[i].block, where[i].offset, 8, &data);
        FM_BlockWrite(file, data.block, data.offset, int32_t(tag.length - 8), texts[i], nullptr);
    }
    PrintStream(file);
    FM_TagDelete(file, &where[1], nullptr);
    std::puts("  deleted the second tag:");
    PrintStream(file);
    FM_TagHdr big = {9, {0, 0, 0}, 100};
    s = FM_TagInsertHdrAt(file, where[2].block, where[2].offset, &big, nullptr, nullptr, nullptr);
    std::printf("  inserted a 100-byte tag in front of the third (status %d):\n", TS_STATUS(s));
    PrintStream(file);
    FM_BlockFileClose(&file);

    s = FM_DupTagBlockFile(path.c_str(), copy.c_str());
    std::printf("  compacted copy (status %d):\n", TS_STATUS(s));
    if (!TS_FAILED(FM_BlockFileOpen(copy.c_str(), &file, 8))) {
        PrintStream(file);
        FM_BlockFileClose(&file);
    }
    FM_Delete(path.c_str());
    FM_Delete(copy.c_str());
}
