// Allocation, read, write and seek failures injected at each call of each
// block file and tag function: the stated status, the caller's out values
// left alone, nothing leaked and no descriptor left open.
#include <unistd.h>

#include <functional>
#include <string>

#include "block_test_support.h"
#include "core/status.h"
#include "platform/test_hooks.h"
#include "storage/block_file.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;
namespace th = tessarine::testing;

enum class Fault { Alloc, Read, Write, Seek };
const char *Name(Fault f) {
    switch (f) {
        case Fault::Alloc:
            return "allocation";
        case Fault::Read:
            return "read";
        case Fault::Write:
            return "write";
        case Fault::Seek:
            return "seek";
    }
    return "";
}
th::FileCall Kind(Fault f) {
    return f == Fault::Read    ? th::FileCall::Read
           : f == Fault::Write ? th::FileCall::Write
                               : th::FileCall::Seek;
}
void Arm(Fault f, int64_t n) {
    th::ResetInjection();
    if (f == Fault::Alloc)
        th::FailAllocationAt(n);
    else
        th::FailFileCallAt(Kind(f), n);
}
bool Hit(Fault f) {
    return f == Fault::Alloc ? th::AllocationFailureHit() : th::FileFailureHit(Kind(f));
}

int32_t NoMoves(FM_BlockAddr *, FM_BlockAddr *) {
    return 10;
}

constexpr uint32_t P = 40;

class BlockFailureTest : public tstest::Sandbox {
  protected:
    void SetUp() override {
        tstest::Sandbox::SetUp();
        work_ = Path("w.blk");
        // A (1,0) 20, B (1,20) 30 into block 2, a free tag (2,10) 10, D (2,20) 15.
        FM_BlockFile *f = nullptr;
        ASSERT_EQ(StatusOf(FM_BlockFileCreate(work_.c_str(), &f, P, 16, NoMoves)), 10);
        FM_BlockAddr c{};
        for (uint32_t length : {20u, 30u, 10u, 15u}) {
            FM_TagHdr t = Tag(uint8_t(length), length);
            ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(f, &t, &c, nullptr)), 10);
        }
        c = {2, 10};
        ASSERT_EQ(StatusOf(FM_TagDelete(f, &c, nullptr)), 10);
        ASSERT_EQ(StatusOf(FM_BlockFileClose(&f)), 10);
        template_ = ReadAll(work_);
    }
    void TearDown() override {
        unlink(work_.c_str());
        unlink(Path("dup.blk").c_str());
        tstest::Sandbox::TearDown();
    }
    // The template, opened, with `prepare` run on it before the fault is armed.
    FM_BlockFile *Open(uint8_t limit, const std::function<void(FM_BlockFile *)> &prepare) {
        WriteAll(work_, template_);
        FM_BlockFile *f = nullptr;
        EXPECT_EQ(StatusOf(FM_BlockFileOpen(work_.c_str(), &f, limit)), 10);
        if (f != nullptr) {
            f->tagCallback = NoMoves;
            if (prepare) prepare(f);
        }
        return f;
    }

    // Runs `op` with the nth call of the fault's kind failing, n = 1, 2, ...
    // until a run passes without reaching it. A hit must give `failure` (or,
    // where a cache may recycle a node instead, also 10); a run without a hit
    // must give 10. Each run starts from the template and must end with the
    // heap and the descriptors where they were.
    int64_t Each(Fault fault, uint8_t limit, const std::function<void(FM_BlockFile *)> &prepare,
                 const std::function<int32_t(FM_BlockFile *)> &op, bool mayRecycle = false) {
        const int32_t failure = fault == Fault::Alloc ? -5 : -50;
        for (int64_t n = 1; n < 10000; ++n) {
            SCOPED_TRACE(std::string(Name(fault)) + " failure at call " + std::to_string(n));
            const int64_t live = th::LiveBlocks();
            const int fds = tstest::OpenDescriptorCount();
            FM_BlockFile *f = Open(limit, prepare);
            if (f == nullptr) return -1;
            Arm(fault, n);
            const int32_t status = op(f);
            const bool hit = Hit(fault);
            th::ResetInjection();
            FM_BlockFileClose(&f);
            EXPECT_EQ(th::LiveBlocks(), live) << "leak";
            EXPECT_EQ(tstest::OpenDescriptorCount(), fds) << "descriptor left open";
            if (!hit) {
                EXPECT_EQ(StatusOf(status), 10);
                return n - 1;
            }
            if (mayRecycle && StatusOf(status) == 10) continue;
            EXPECT_EQ(StatusOf(status), failure);
            if (HasFailure()) return -1;
        }
        ADD_FAILURE() << "did not end";
        return -1;
    }
    void All(uint8_t limit, const std::function<void(FM_BlockFile *)> &prepare,
             const std::function<int32_t(FM_BlockFile *)> &op, bool mayRecycle = false,
             int64_t *counts = nullptr) {
        for (Fault fault : {Fault::Alloc, Fault::Read, Fault::Write, Fault::Seek}) {
            const int64_t n = Each(fault, limit, prepare, op, mayRecycle);
            if (counts != nullptr) *counts++ = n;
            if (HasFailure()) return;
        }
    }

    std::string work_;
    std::vector<uint8_t> template_;
};

// Fills a cache of four with dirty new blocks, so that the next node taken
// must first be written back.
void FourDirty(FM_BlockFile *f) {
    FM_MemBlock *n = nullptr;
    for (int i = 0; i < 4; ++i) {
        ASSERT_EQ(StatusOf(FM_NewBlock(f, &n)), 10);
        ASSERT_EQ(StatusOf(FM_InsertBlockAfter(f, 1, n)), 10);
    }
}

TEST_F(BlockFailureTest, Create) {
    const std::string path = Path("new.blk");
    for (Fault fault : {Fault::Alloc, Fault::Read, Fault::Write, Fault::Seek}) {
        for (int64_t n = 1;; ++n) {
            SCOPED_TRACE(std::string(Name(fault)) + " " + std::to_string(n));
            FM_BlockFile *f = reinterpret_cast<FM_BlockFile *>(0x9);
            Arm(fault, n);
            const int32_t s = FM_BlockFileCreate(path.c_str(), &f, P, 4, NoMoves);
            const bool hit = Hit(fault);
            th::ResetInjection();
            if (!hit) {
                ASSERT_EQ(StatusOf(s), 10);
                FM_BlockFileDelete(&f);
                break;
            }
            EXPECT_EQ(StatusOf(s), fault == Fault::Alloc ? -5 : -50);
            EXPECT_EQ(f, reinterpret_cast<FM_BlockFile *>(0x9));
            EXPECT_NE(access(path.c_str(), F_OK), 0) << "the path is deleted";
        }
    }
}

TEST_F(BlockFailureTest, Open) {
    for (Fault fault : {Fault::Alloc, Fault::Read, Fault::Write, Fault::Seek}) {
        for (int64_t n = 1;; ++n) {
            SCOPED_TRACE(std::string(Name(fault)) + " " + std::to_string(n));
            WriteAll(work_, template_);
            FM_BlockFile *f = reinterpret_cast<FM_BlockFile *>(0x9);
            Arm(fault, n);
            const int32_t s = FM_BlockFileOpen(work_.c_str(), &f, 4);
            const bool hit = Hit(fault);
            th::ResetInjection();
            if (!hit) {
                ASSERT_EQ(StatusOf(s), 10);
                FM_BlockFileClose(&f);
                break;
            }
            EXPECT_EQ(StatusOf(s), fault == Fault::Alloc ? -5 : -50);
            EXPECT_EQ(f, reinterpret_cast<FM_BlockFile *>(0x9));
            if (fault == Fault::Read) {
                // The failed open still closes through the record: what it
                // held, here nothing read, goes over the header.
                EXPECT_EQ(Le32(ReadAll(work_), 0), 0u);
            }
        }
    }
}

TEST_F(BlockFailureTest, CloseLeavesTheRecordBehindOnAFailedWrite) {
    for (Fault fault : {Fault::Write, Fault::Seek}) {
        int64_t n = 1;
        for (;; ++n) {
            SCOPED_TRACE(std::string(Name(fault)) + " " + std::to_string(n));
            const int64_t live = th::LiveBlocks();
            FM_BlockFile *f = Open(16, [](FM_BlockFile *file) {
                FM_TagHdr t = Tag(9, 90);  // two new dirty blocks
                ASSERT_EQ(StatusOf(FM_TagAppendHdrAtEnd(file, &t, nullptr, nullptr)), 10);
            });
            FM_BlockFile *kept = f;
            Arm(fault, n);
            const int32_t s = FM_BlockFileClose(&f);
            const bool hit = Hit(fault);
            th::ResetInjection();
            EXPECT_EQ(f, nullptr);
            if (!hit) {
                EXPECT_EQ(StatusOf(s), 10);
                EXPECT_EQ(th::LiveBlocks(), live);
                break;
            }
            EXPECT_EQ(StatusOf(s), -50);
            // Open and allocated, and out of the caller's reach; freed here.
            EXPECT_GT(th::LiveBlocks(), live);
            EXPECT_EQ(FM_Close(kept->descriptor), 10);
            FreeEntireList(reinterpret_cast<ListNode **>(&kept->cacheHead));
            MEM_FreeHdl(kept);
        }
        EXPECT_EQ(n, 5);  // three new blocks and the header, then a clean run
    }
}

TEST_F(BlockFailureTest, NewBlockFromTheEndWithWriteBack) {
    FM_MemBlock *sentinel = reinterpret_cast<FM_MemBlock *>(0x9);
    FM_MemBlock *node = sentinel;
    All(4, FourDirty, [&](FM_BlockFile *f) {
        node = sentinel;
        int32_t s = FM_NewBlock(f, &node);
        if (TS_FAILED(s)) {
            EXPECT_EQ(node, sentinel);
        }
        return s;
    });
}

TEST_F(BlockFailureTest, NewBlockFromTheFreeList) {
    All(
        16, [](FM_BlockFile *f) { ASSERT_EQ(StatusOf(FM_FreeBlock(f, 2)), 10); },
        [](FM_BlockFile *f) {
            FM_MemBlock *node = nullptr;
            return FM_NewBlock(f, &node);
        });
}

TEST_F(BlockFailureTest, FreeBlockUncachedAndCached) {
    All(16, nullptr, [](FM_BlockFile *f) { return FM_FreeBlock(f, 2); });
    All(
        16,
        [](FM_BlockFile *f) {
            FM_MemBlock *n = nullptr;
            ASSERT_EQ(StatusOf(FM_GetMemBlockByIndex(f, 2, &n)), 10);
        },
        [](FM_BlockFile *f) { return FM_FreeBlock(f, 2); });
}

TEST_F(BlockFailureTest, InsertBlockAfterWithUncachedNeighbours) {
    FM_MemBlock *node = nullptr;
    auto prepare = [&](FM_BlockFile *f) { ASSERT_EQ(StatusOf(FM_NewBlock(f, &node)), 10); };
    All(16, prepare, [&](FM_BlockFile *f) { return FM_InsertBlockAfter(f, 1, node); });
    All(16, prepare, [&](FM_BlockFile *f) { return FM_InsertBlockAfter(f, 0, node); });
}

TEST_F(BlockFailureTest, FetchWithWriteBack) {
    FM_MemBlock *sentinel = reinterpret_cast<FM_MemBlock *>(0x9);
    All(
        4, FourDirty,
        [&](FM_BlockFile *f) {
            FM_MemBlock *node = sentinel;
            int32_t s = FM_GetMemBlockByIndex(f, 2, &node);
            if (TS_FAILED(s)) {
                EXPECT_EQ(node, sentinel);
            }
            return s;
        },
        true);
    All(16, nullptr, [&](FM_BlockFile *f) {
        FM_MemBlock *node = sentinel;
        int32_t s = FM_GetMemBlockByIndex(f, 2, &node);
        if (TS_FAILED(s)) {
            EXPECT_EQ(node, sentinel);
        }
        return s;
    });
}

TEST_F(BlockFailureTest, HeaderFetchAndNextAddr) {
    All(16, nullptr, [](FM_BlockFile *f) {
        FM_BlockHdr h{};
        return FM_GetFileBlockHdrByIndex(f, 2, &h);
    });
    All(16, nullptr, [](FM_BlockFile *f) {
        FM_BlockAddr a{};
        return FM_GetNextAddr(f, 1, 30, 50, &a);
    });
}

TEST_F(BlockFailureTest, ReadAndWriteAcrossBlocks) {
    All(16, nullptr, [](FM_BlockFile *f) {
        uint8_t b[60];
        FM_BlockAddr a = {7, 7};
        int32_t s = FM_BlockRead(f, 1, 10, 60, b, &a);
        if (TS_FAILED(s)) {
            EXPECT_EQ(a, (FM_BlockAddr{7, 7}));
        }
        return s;
    });
    All(
        4, FourDirty,
        [](FM_BlockFile *f) {
            uint8_t b[60] = {};
            return FM_BlockWrite(f, 1, 10, 60, b, nullptr);
        },
        true);
}

TEST_F(BlockFailureTest, TagReadAppendDeleteRewrite) {
    All(16, nullptr, [](FM_BlockFile *f) {
        FM_TagHdr h{};
        FM_BlockAddr d{}, n{};
        return FM_TagReadHdr(f, 1, 20, &h, &d, &n);
    });
    All(
        16, nullptr,
        [](FM_BlockFile *f) {
            FM_TagHdr t = Tag(1, 90);
            FM_BlockAddr at = {7, 7};
            int32_t s = FM_TagAppendHdrAtEnd(f, &t, &at, nullptr);
            if (TS_FAILED(s)) {
                EXPECT_EQ(at, (FM_BlockAddr{7, 7}));
            }
            return s;
        },
        true);
    All(16, nullptr, [](FM_BlockFile *f) {
        FM_BlockAddr at = {1, 20}, next = {7, 7};
        int32_t s = FM_TagDelete(f, &at, &next);
        if (TS_FAILED(s)) {
            EXPECT_EQ(next, (FM_BlockAddr{7, 7}));
        }
        return s;
    });
    All(16, nullptr, [](FM_BlockFile *f) {
        FM_BlockAddr at = {2, 20};  // the last tag: delete, then append
        return FM_TagDelete(f, &at, nullptr);
    });
    All(16, nullptr, [](FM_BlockFile *f) {
        FM_TagHdr t = Tag(3, 16);
        FM_BlockAddr a{}, d{}, n{};
        return FM_TagRewriteHdr(f, 1, 20, &t, &a, &d, &n);
    });
    All(16, nullptr, [](FM_BlockFile *f) {
        FM_TagHdr t = Tag(3, 60);
        FM_BlockAddr a{}, d{}, n{};
        return FM_TagRewriteHdr(f, 2, 20, &t, &a, &d, &n);
    });
}

TEST_F(BlockFailureTest, TagInsertWithTailMoveFrontBlockAndFreeSpace) {
    auto insert = [](uint32_t block, uint32_t offset, uint32_t length) {
        return [=](FM_BlockFile *f) {
            FM_TagHdr t = Tag(5, length);
            FM_BlockAddr a = {7, 7}, d = {7, 7}, n = {7, 7};
            int32_t s = FM_TagInsertHdrAt(f, block, offset, &t, &a, &d, &n);
            if (TS_FAILED(s)) {
                EXPECT_EQ(a, (FM_BlockAddr{7, 7}));
                EXPECT_EQ(n, (FM_BlockAddr{7, 7}));
            }
            return s;
        };
    };
    All(16, nullptr, insert(2, 10, 50));  // free room 10 plus a block: D moves
    All(16, nullptr, insert(1, 20, 40));  // at a live tag: B's tail moves
    All(16, nullptr, insert(1, 0, 40));   // at offset 0: a block in front
    All(16, nullptr, insert(2, 10, 10));  // into the free tag
    All(4, FourDirty, insert(2, 10, 50), true);
}

TEST_F(BlockFailureTest, DupTagBlockFile) {
    const std::string dup = Path("dup.blk");
    // The copy has two dirty blocks: its close writes them and its header,
    // and the source's close writes its header. A failed write or seek there
    // leaves that record behind on purpose (see the close test), so those
    // last four calls are left out here.
    constexpr int64_t kCloseCalls = 4;
    int64_t clean[4] = {};
    WriteAll(work_, template_);
    th::ResetInjection();
    ASSERT_EQ(StatusOf(FM_DupTagBlockFile(work_.c_str(), dup.c_str())), 10);
    clean[2] = th::FileCallCount(th::FileCall::Write);
    clean[3] = th::FileCallCount(th::FileCall::Seek);
    unlink(dup.c_str());
    for (Fault fault : {Fault::Alloc, Fault::Read, Fault::Write, Fault::Seek}) {
        const bool closing = fault == Fault::Write || fault == Fault::Seek;
        const int64_t last = closing ? clean[int(fault)] - kCloseCalls : INT64_MAX;
        for (int64_t n = 1; n <= last; ++n) {
            SCOPED_TRACE(std::string(Name(fault)) + " " + std::to_string(n));
            WriteAll(work_, template_);
            const int64_t live = th::LiveBlocks();
            Arm(fault, n);
            const int32_t s = FM_DupTagBlockFile(work_.c_str(), dup.c_str());
            const bool hit = Hit(fault);
            th::ResetInjection();
            unlink(dup.c_str());
            if (!hit) {
                EXPECT_EQ(StatusOf(s), 10);
                break;
            }
            EXPECT_EQ(StatusOf(s), fault == Fault::Alloc ? -5 : -50);
            EXPECT_EQ(th::LiveBlocks(), live);
        }
    }
}

}  // namespace
