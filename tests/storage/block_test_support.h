// Helpers shared by the block file and tag tests: whole-file byte access and
// views of the cache list.
#pragma once

#include <cstdint>
#include <cstring>
#include <fstream>
#include <iterator>
#include <ostream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tessarine/storage.h>

#include "core/status.h"
#include "test_support.h"

namespace blocktest {

inline std::vector<uint8_t> ReadAll(const std::string &path) {
    std::ifstream in(path, std::ios::binary);
    return std::vector<uint8_t>(std::istreambuf_iterator<char>(in), {});
}

inline void WriteAll(const std::string &path, const std::vector<uint8_t> &bytes) {
    std::ofstream out(path, std::ios::binary | std::ios::trunc);
    out.write(reinterpret_cast<const char *>(bytes.data()), std::streamsize(bytes.size()));
}

inline uint32_t Le32(const std::vector<uint8_t> &b, size_t at) {
    return uint32_t(b.at(at)) | uint32_t(b.at(at + 1)) << 8 | uint32_t(b.at(at + 2)) << 16 |
           uint32_t(b.at(at + 3)) << 24;
}
inline void PutLe32(std::vector<uint8_t> &b, size_t at, uint32_t v) {
    for (int i = 0; i < 4; ++i) b.at(at + i) = uint8_t(v >> (8 * i));
}
inline uint32_t ImageWord(const FM_MemBlock *node, uint32_t at) {
    uint32_t v = 0;
    for (int i = 3; i >= 0; --i) v = v << 8 | node->image[at + i];
    return v;
}
inline uint8_t *Data(FM_MemBlock *node) {
    return node->image + 12;
}

// Block indexes in the cache, most recent first.
inline std::vector<uint32_t> CacheIndexes(const FM_BlockFile *file) {
    std::vector<uint32_t> out;
    if (const FM_MemBlock *head = file->cacheHead) {
        const FM_MemBlock *node = head;
        do {
            out.push_back(node->index);
            node = node->next;
        } while (node != head);
    }
    return out;
}

inline FM_MemBlock *Cached(const FM_BlockFile *file, uint32_t index) {
    if (FM_MemBlock *head = file->cacheHead) {
        FM_MemBlock *node = head;
        do {
            if (node->index == index) return node;
            node = node->next;
        } while (node != head);
    }
    return nullptr;
}

inline FM_TagHdr Tag(uint8_t kind, uint32_t length) {
    FM_TagHdr h{};
    h.kind = kind;
    h.extra[0] = 0xA1;
    h.extra[1] = 0xB2;
    h.extra[2] = 0xC3;
    h.length = length;
    return h;
}

// A block file made in the test's sandbox, closed and removed at the end.
class BlockFileFixture : public tstest::Sandbox {
  protected:
    void Make(uint8_t limit, uint32_t payload = 24) {
        path_ = Path("c.blk");
        ASSERT_EQ(tessarine::StatusOf(
                      FM_BlockFileCreate(path_.c_str(), &file_, payload, limit, nullptr)),
                  10);
    }
    void Reopen(uint8_t limit) {
        ASSERT_EQ(tessarine::StatusOf(FM_BlockFileClose(&file_)), 10);
        ASSERT_EQ(tessarine::StatusOf(FM_BlockFileOpen(path_.c_str(), &file_, limit)), 10);
    }
    void TearDown() override {
        if (file_ != nullptr) FM_BlockFileClose(&file_);
        FM_Delete(path_.c_str());
        tstest::Sandbox::TearDown();
    }
    std::string path_;
    FM_BlockFile *file_ = nullptr;
};

}  // namespace blocktest

inline bool operator==(const FM_BlockAddr &a, const FM_BlockAddr &b) {
    return a.block == b.block && a.offset == b.offset;
}
inline std::ostream &operator<<(std::ostream &os, const FM_BlockAddr &a) {
    return os << "(" << a.block << ", " << a.offset << ")";
}
