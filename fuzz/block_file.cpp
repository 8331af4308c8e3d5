// Opens arbitrary bytes as a block file, walks every tag from firstBlock to
// the end reading its data, makes a compacted copy, and edits the stream a
// little. Every outcome must be a status: no crash, no hang, no leak.
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <tessarine/tessarine.h>

namespace {

std::string ScratchPath(const char *name) {
    const char *dir = std::getenv("TMPDIR");
    return std::string(dir != nullptr && *dir != '\0' ? dir : "/tmp") + "/" + name + "-" +
           std::to_string(getpid());
}

uint32_t Le32(const uint8_t *p) {
    return uint32_t(p[0]) | uint32_t(p[1]) << 8 | uint32_t(p[2]) << 16 | uint32_t(p[3]) << 24;
}

int32_t Moved(FM_BlockAddr *, FM_BlockAddr *) {
    return 10;
}

// Walks the stream the way a reader of the format does: from firstBlock at
// offset 0 to the end position, never more steps than the file has bytes,
// and never more data than the file holds.
void WalkTags(FM_BlockFile *file, size_t fileSize) {
    const FM_BlockFileHdr &h = file->header;
    FM_BlockAddr at = {h.firstBlock, 0};
    std::vector<uint8_t> data;
    for (size_t step = 0; at.block != 0 && step < fileSize / 8 + 2; ++step) {
        FM_TagHdr tag;
        FM_BlockAddr next;
        if (TS_FAILED(FM_TagReadHdr(file, at.block, at.offset, &tag, nullptr, &next))) return;
        if (tag.length > 8) {
            FM_BlockAddr from;
            if (TS_FAILED(FM_GetNextAddr(file, at.block, at.offset, 8, &from)) || from.block == 0)
                return;
            uint32_t left = tag.length - 8;
            if (left > fileSize) left = uint32_t(fileSize);
            data.resize(left);
            if (TS_FAILED(FM_BlockRead(file, from.block, from.offset, int32_t(left), data.data(),
                                       nullptr)))
                return;
        }
        if (next.block == at.block && next.offset <= at.offset) return;  // no progress
        at = next;
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *bytes, size_t size) {
    // Strides above 1 MiB would only test the allocator's limit.
    if (size >= 12 && Le32(bytes + 8) > (1u << 20)) return 0;
    const std::string path = ScratchPath("fuzz-block");
    const std::string copy = ScratchPath("fuzz-block-copy");
    FILE *out = std::fopen(path.c_str(), "wb");
    if (out == nullptr) return 0;
    if (size > 0) std::fwrite(bytes, 1, size, out);
    std::fclose(out);

    const uint8_t limit = size > 0 ? uint8_t(bytes[size - 1] % 8) : 5;
    FM_BlockFile *file = nullptr;
    if (!TS_FAILED(FM_BlockFileOpen(path.c_str(), &file, limit))) {
        WalkTags(file, size);
        FM_BlockFileClose(&file);
    }
    FM_DupTagBlockFile(path.c_str(), copy.c_str());
    std::remove(copy.c_str());

    if (!TS_FAILED(FM_BlockFileOpen(path.c_str(), &file, 5))) {
        file->tagCallback = Moved;
        const FM_BlockFileHdr &h = file->header;
        FM_TagHdr tag = {1, {0, 0, 0}, h.payloadSize};
        FM_BlockAddr first = {h.firstBlock, 0}, next;
        if (first.block != 0) {
            FM_TagInsertHdrAt(file, first.block, first.offset, &tag, nullptr, nullptr, &next);
            FM_TagDelete(file, &first, &next);
        }
        tag.length = 24;
        FM_TagAppendHdrAtEnd(file, &tag, nullptr, nullptr);
        WalkTags(file, size);
        FM_BlockFileClose(&file);
    }
    std::remove(path.c_str());
    return 0;
}
