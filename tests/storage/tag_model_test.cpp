// Long random sequences of tag operations, checked step by step against a
// small model of the block file and tag rules written here from the rules
// alone: a byte vector for the file, a list of images for the cache, and the
// header words.
#include <algorithm>
#include <cstring>
#include <list>
#include <map>
#include <random>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "block_test_support.h"
#include "core/status.h"
#include "test_support.h"

namespace {

using namespace blocktest;
using tessarine::StatusOf;
using Addr = FM_BlockAddr;
using Bytes = std::vector<uint8_t>;

uint32_t Get32(const uint8_t *p) {
    return uint32_t(p[0]) | p[1] << 8 | p[2] << 16 | uint32_t(p[3]) << 24;
}
void Put32(uint8_t *p, uint32_t v) {
    for (int i = 0; i < 4; ++i) p[i] = uint8_t(v >> (8 * i));
}

// ---- the model -------------------------------------------------------------

// The library's guard on walks of tags that would go round for ever: the walk
// is stopped once it stands on a point saved at doubling distances. Kept the
// same here so that the reads made before it stops match.
struct Circle {
    Addr saved;
    uint64_t since = 0, span = 1;
    bool Back(Addr now) {
        ++since;
        if (now.block == saved.block && now.offset == saved.offset) return true;
        if (since == span) saved = now, span *= 2, since = 0;
        return false;
    }
};

struct Calls {
    std::vector<std::pair<Addr, Addr>> list;
    int32_t answer = 10;
};

class Model {
  public:
    struct Node {
        uintptr_t dirty = 0;
        uint32_t index = 0;
        Bytes img;
    };
    struct Head {
        uint32_t payload, stride, nextIndex, first, last, freeHead, endBlock, endOffset;
    };

    Model(uint32_t payload, uint8_t limit, Calls *calls)
        : P(payload), S(payload + 12), limit_(limit) {
        h = {P, S, 1, 0, 0, 0, 0, 0};
        calls_ = calls;
        WriteHeader();
    }

    // What a close leaves in the file; the model then stands for a fresh open.
    void Close() {
        for (Node &n : cache)
            if (n.dirty != 0) Write(uint64_t(n.index) * S, n.img.data(), S);
        WriteHeader();
        cache.clear();
        counted = 0;
    }
    void SetLimit(uint8_t limit) { limit_ = limit; }
    void SetCallback(bool on) { callback_ = on; }

    // -- block layer --
    int32_t FreeNode(Node **out) {
        if (counted < limit_) {
            cache.push_front(Node{0, 0, Bytes(S, 0)});
            ++counted;
            *out = &cache.front();
            return 10;
        }
        if (cache.empty() || counted < 4) return -5;
        Node &oldest = cache.back();
        if (oldest.dirty != 0) {
            int32_t s = Write(uint64_t(oldest.index) * S, oldest.img.data(), S);
            if (s < 0) return s;
        }
        cache.splice(cache.begin(), cache, std::prev(cache.end()));
        *out = &cache.front();
        return 10;
    }
    int32_t Fetch(uint32_t index, Node **out) {
        if (index == 0) return -4;
        for (auto it = cache.begin(); it != cache.end(); ++it) {
            if (it->index == index) {
                cache.splice(cache.begin(), cache, it);
                *out = &cache.front();
                return 10;
            }
        }
        Node *n = nullptr;
        int32_t s = FreeNode(&n);
        if (s < 0) return s;
        s = Read(uint64_t(index) * S, n->img.data(), S);
        if (s < 0) return s;
        n->dirty = 0;
        n->index = index;
        *out = n;
        return 10;
    }
    Node *Find(uint32_t index) {
        for (Node &n : cache)
            if (n.index == index) return &n;
        return nullptr;
    }
    int32_t Word(uint32_t index, uint32_t field, uint32_t *v) {
        if (Node *n = Find(index)) {
            *v = Get32(n->img.data() + field);
            return 10;
        }
        uint8_t b[4];
        int32_t s = Read(uint64_t(index) * S + field, b, 4);
        if (s < 0) return s;
        *v = Get32(b);
        return 10;
    }
    int32_t SetWord(uint32_t index, uint32_t field, uint32_t v) {
        if (Node *n = Find(index)) {
            Put32(n->img.data() + field, v);
            return 10;
        }
        uint8_t b[4];
        Put32(b, v);
        return Write(uint64_t(index) * S + field, b, 4);
    }
    int32_t NewBlock(Node **out) {
        Node *n = nullptr;
        int32_t s = FreeNode(&n);
        if (s < 0) return s;
        // The index is the node's before the read or seek that may fail.
        n->index = h.freeHead;
        if (h.freeHead != 0) {
            uint8_t b[4];
            s = Read(uint64_t(h.freeHead) * S, b, 4);
            if (s >= 0) h.freeHead = Get32(b);
        } else {
            n->index = h.nextIndex++;
            if ((uint64_t(n->index) + 1) * S > uint64_t(INT32_MAX)) s = -50;
        }
        if (s < 0) {
            if (uint64_t(n->index) * S > uint64_t(INT32_MAX)) n->dirty = 0;
            return s;
        }
        n->dirty = 1;
        Put32(n->img.data(), 0);
        Put32(n->img.data() + 4, 0);
        Put32(n->img.data() + 8, P);
        *out = n;
        return 10;
    }
    int32_t LinkAfter(uint32_t after, Node *n) {
        int32_t s = 10;
        if (after != 0) {
            uint32_t oldNext = 0;
            s = Word(after, 0, &oldNext);
            if (s >= 0) s = SetWord(after, 0, n->index);
            if (s < 0) return s;
            Put32(n->img.data(), oldNext);
            Put32(n->img.data() + 4, after);
            if (oldNext == 0) {
                h.last = n->index;
                return 10;
            }
            return SetWord(oldNext, 4, n->index);
        }
        if (h.first == 0) {
            h.first = h.last = n->index;
        } else {
            s = SetWord(h.first, 4, n->index);
            if (s < 0) return s;
        }
        Put32(n->img.data(), h.first);
        Put32(n->img.data() + 4, 0);
        return 10;
    }
    int32_t FreeBlock(uint32_t index) {
        if (index == 0) return -4;
        uint32_t next = 0, prev = 0;
        auto it = std::find_if(cache.begin(), cache.end(),
                               [&](const Node &n) { return n.index == index; });
        if (it != cache.end()) {
            next = Get32(it->img.data());
            prev = Get32(it->img.data() + 4);
            cache.erase(it);
        } else {
            uint8_t b[12];
            int32_t s = Read(uint64_t(index) * S, b, 12);
            if (s < 0) return s;
            next = Get32(b);
            prev = Get32(b + 4);
        }
        if (h.first == index) h.first = next;
        if (h.last == index) h.last = prev;
        int32_t s = 10;
        if (prev != 0 && (s = SetWord(prev, 0, next)) < 0) return s;
        if (next != 0 && (s = SetWord(next, 4, prev)) < 0) return s;
        uint8_t b[4];
        Put32(b, h.freeHead);
        s = Write(uint64_t(index) * S, b, 4);
        if (s < 0) return s;
        h.freeHead = index;
        return 10;
    }
    int32_t NextAddr(uint32_t block, uint32_t offset, uint32_t distance, Addr *r) {
        r->block = block;
        r->offset = offset + distance;
        // Every chain is a ring: once a block comes back, whole turns are
        // skipped. The step at which the walk first stood on each block:
        std::map<uint32_t, uint64_t> first = {{block, 0}};
        uint64_t steps = 0;
        while (r->offset >= P) {
            r->offset -= P;
            uint32_t next = 0;
            int32_t s = Word(r->block, 0, &next);
            if (s < 0) return s;
            r->block = next;
            auto [it, fresh] = first.emplace(next, ++steps);
            if (!fresh) {
                const uint64_t circle = steps - it->second;
                r->offset -= uint32_t(r->offset / P / circle * circle * P);
            }
        }
        if (r->block == h.endBlock && r->offset >= h.endOffset) r->block = 0;
        return 10;
    }
    int32_t Move(bool write, uint32_t block, uint32_t offset, int32_t count, uint8_t *buffer,
                 Addr *last) {
        if (count < 1) return 10;
        if (offset > P) return -4;
        uint32_t left = uint32_t(count), moved = 0;
        for (;;) {
            Node *n = nullptr;
            int32_t s = Fetch(block, &n);
            if (s < 0) return s;
            moved = std::min(P - offset, left);
            if (write)
                std::memcpy(n->img.data() + 12 + offset, buffer, moved);
            else
                std::memcpy(buffer, n->img.data() + 12 + offset, moved);
            buffer += moved;
            left -= moved;
            if (left == 0) break;
            block = Get32(n->img.data());
            offset = 0;
        }
        if (last != nullptr) *last = {block, moved};
        return 10;
    }

    // -- tag layer --
    int32_t ReadTag(uint32_t block, uint32_t offset, FM_TagHdr *t, Addr *data, Addr *next) {
        uint8_t b[8];
        Addr d{};
        int32_t s = Move(false, block, offset, 8, b, &d);
        if (s < 0) return s;
        t->kind = b[0];
        std::memcpy(t->extra, b + 1, 3);
        t->length = Get32(b + 4);
        if (data) *data = d;
        if (next) return NextAddr(block, offset, t->length, next);
        return 10;
    }
    int32_t WriteTag(Addr at, const FM_TagHdr &t, Addr *data) {
        uint8_t b[8];
        b[0] = t.kind;
        std::memcpy(b + 1, t.extra, 3);
        Put32(b + 4, t.length);
        return Move(true, at.block, at.offset, 8, b, data);
    }
    int32_t Append(const FM_TagHdr &t, Addr *tag, Addr *data) {
        if (h.endBlock != 0 && h.endOffset >= P) return -50;
        Node *n = nullptr;
        int32_t s = 10;
        if (h.endBlock == 0) {
            if ((s = NewBlock(&n)) < 0 || (s = LinkAfter(h.last, n)) < 0) return s;
            h.endBlock = n->index;
            h.endOffset = 0;
            Put32(n->img.data() + 8, 0);
        }
        Addr at = {h.endBlock, h.endOffset};
        h.endOffset += t.length;
        while (h.endOffset > P) {
            if ((s = NewBlock(&n)) < 0 || (s = LinkAfter(h.last, n)) < 0) return s;
            h.endBlock = n->index;
            h.endOffset -= P;
        }
        if (h.endOffset == P) h.endBlock = h.endOffset = 0;
        s = WriteTag(at, t, data);
        if (s >= 0 && tag) *tag = at;
        return s;
    }
    int32_t Insert(uint32_t block, uint32_t offset, FM_TagHdr *t, Addr *tag, Addr *data,
                   Addr *next) {
        if (block == 0 || (block == h.endBlock && offset == h.endOffset))
            return Append(*t, tag, nullptr);
        FM_TagHdr found{};
        Addr follow{};
        int32_t s = ReadTag(block, offset, &found, nullptr, &follow);
        if (s < 0) return s;
        uint32_t room = 0;
        if (found.kind == 0) {
            Circle circle{{block, offset}};
            for (;;) {
                room += found.length;
                if (follow.block == 0) break;
                if (circle.Back(follow)) return -50;
                Addr after{};
                if ((s = ReadTag(follow.block, follow.offset, &found, nullptr, &after)) < 0)
                    return s;
                if (found.kind != 0) break;
                follow = after;
            }
        } else {
            follow = {block, offset};
        }
        if (room < t->length) {
            uint32_t short_ = t->length - room;
            if (short_ % P != 0) return -4;
            Node *n = nullptr;
            if (follow.offset == 0 && follow.block == block) {
                uint32_t prev = 0;
                uint8_t b[12];
                if (Node *c = Find(block)) {
                    prev = Get32(c->img.data() + 4);
                } else {
                    if ((s = Read(uint64_t(block) * S, b, 12)) < 0) return s;
                    prev = Get32(b + 4);
                }
                if ((s = NewBlock(&n)) < 0 || (s = LinkAfter(prev, n)) < 0) return s;
                Put32(n->img.data() + 8, 0);
                block = n->index;
                offset = 0;
                short_ -= P;
                room += P;
            }
            uint32_t last = block;
            while (short_ != 0) {
                if ((s = NewBlock(&n)) < 0 || (s = LinkAfter(last, n)) < 0) return s;
                last = n->index;
                short_ -= P;
                room += P;
            }
            Put32(n->img.data() + 8, follow.offset);
            if (follow.block == block) {
                Bytes tail(P - follow.offset);
                s = Move(false, block, follow.offset, int32_t(tail.size()), tail.data(), nullptr);
                if (s >= 0)
                    s = Move(true, last, follow.offset, int32_t(tail.size()), tail.data(), nullptr);
                if (s < 0) return s;
                if (!callback_) return -6;
                Addr at = follow;
                Circle circle{at};
                while (at.block == block) {
                    Addr from = at, to = {last, at.offset};
                    calls_->list.push_back({from, to});
                    if (int16_t(calls_->answer) < 0) return calls_->answer;
                    FM_TagHdr x{};
                    Addr nx{};
                    if ((s = ReadTag(at.block, at.offset, &x, nullptr, &nx)) < 0) return s;
                    if (nx.block == block && circle.Back(nx)) return -50;
                    at = nx;
                }
                if (h.endBlock == block) h.endBlock = last;
                follow.block = last;
            }
        }
        if (uint64_t(room) >= uint64_t(t->length) + P &&
            uint64_t(room) + offset >= 2ull * P + follow.offset) {
            uint32_t excess = room - t->length;
            uint32_t b = 0;
            if ((s = Word(block, 0, &b)) < 0) return s;
            while (excess >= P && b != follow.block) {
                uint32_t after = 0;
                if ((s = Word(b, 0, &after)) < 0 || (s = FreeBlock(b)) < 0) return s;
                excess -= P;
                room -= P;
                b = after;
            }
        }
        if (room - t->length < 8) t->length = room;
        Addr d{};
        if ((s = WriteTag({block, offset}, *t, &d)) < 0) return s;
        if (t->length < room) {
            Addr rest{};
            if ((s = NextAddr(block, offset, t->length, &rest)) < 0) return s;
            if (rest.block != block) {
                Node *n = nullptr;
                if ((s = Fetch(rest.block, &n)) < 0) return s;
                Put32(n->img.data() + 8, rest.offset);
            }
            FM_TagHdr gap{};
            gap.length = room - t->length;
            if ((s = WriteTag(rest, gap, nullptr)) < 0) return s;
        }
        if (tag) *tag = {block, offset};
        if (data) *data = d;
        if (next) *next = follow;
        return 10;
    }
    int32_t Delete(Addr at, Addr *next) {
        FM_TagHdr t{};
        Addr follow{};
        int32_t s = ReadTag(at.block, at.offset, &t, nullptr, &follow);
        if (s < 0) return s;
        uint32_t size = t.length;
        Circle circle{at};
        while (follow.block != 0) {
            if (circle.Back(follow)) return -50;
            FM_TagHdr f{};
            Addr after{};
            if ((s = ReadTag(follow.block, follow.offset, &f, nullptr, &after)) < 0) return s;
            if (f.kind != 0) break;
            size += f.length;
            follow = after;
        }
        if (follow.block != 0) {
            if (follow.block != at.block) {
                uint32_t b = 0;
                if ((s = Word(at.block, 0, &b)) < 0) return s;
                while (b != follow.block) {
                    if (size < P) return -50;
                    uint32_t after = 0;
                    if ((s = Word(b, 0, &after)) < 0 || (s = FreeBlock(b)) < 0) return s;
                    size -= P;
                    b = after;
                }
            }
            t.kind = 0;
            t.length = size;
            if ((s = WriteTag(at, t, nullptr)) < 0) return s;
        } else if (at.offset == 0) {
            if ((s = FreeBlock(at.block)) < 0) return s;
            h.endBlock = h.endOffset = 0;
        } else {
            h.endBlock = at.block;
            h.endOffset = at.offset;
        }
        if (next) *next = follow;
        return 10;
    }
    int32_t Rewrite(Addr at, FM_TagHdr *t, Addr *tag, Addr *data, Addr *next) {
        Addr follow{};
        int32_t s = Delete(at, &follow);
        if (s < 0) return s;
        if (follow.block != 0) return Insert(at.block, at.offset, t, tag, data, next);
        *next = {0, 0};
        return Append(*t, tag, data);
    }

    uint32_t P, S;
    Head h;
    std::list<Node> cache;
    uint32_t counted = 0;
    Bytes disk;

  private:
    int32_t Write(uint64_t at, const uint8_t *p, size_t n) {
        if (disk.size() < at + n) disk.resize(at + n, 0);
        std::memcpy(disk.data() + at, p, n);
        return 10;
    }
    int32_t Read(uint64_t at, uint8_t *p, size_t n) {
        size_t have = at < disk.size() ? std::min(n, size_t(disk.size() - at)) : 0;
        if (have > 0) std::memcpy(p, disk.data() + at, have);
        return have == n ? 10 : -50;
    }
    void WriteHeader() {
        uint8_t b[36] = {0x54, 0x5E, 0xD8, 0x07};
        const uint32_t w[8] = {h.payload, h.stride,   h.nextIndex, h.first,
                               h.last,    h.freeHead, h.endBlock,  h.endOffset};
        for (int i = 0; i < 8; ++i) Put32(b + 4 + 4 * i, w[i]);
        Write(0, b, 36);
    }
    uint8_t limit_;
    bool callback_ = true;
    Calls *calls_;
};

// ---- views of the state, taken without touching the cache order -------------

struct View {
    Model::Head h;
    std::vector<std::pair<uint32_t, uintptr_t>> order;  // index and dirty, newest first
    std::vector<Bytes> images;
    uint32_t counted;
    Bytes disk;

    // A block header word: the first cached node with that index, else the file.
    bool Word(uint32_t index, uint32_t field, uint32_t *v) const {
        for (size_t i = 0; i < order.size(); ++i)
            if (order[i].first == index) {
                *v = Get32(images[i].data() + field);
                return true;
            }
        const uint64_t at = uint64_t(index) * h.stride + field;
        if (at + 4 > disk.size()) return false;
        *v = Get32(disk.data() + at);
        return true;
    }
    bool Byte(uint32_t block, uint32_t offset, uint8_t *v) const {
        for (size_t i = 0; i < order.size(); ++i)
            if (order[i].first == block) {
                *v = images[i][12 + offset];
                return true;
            }
        const uint64_t at = uint64_t(block) * h.stride + 12 + offset;
        if (at >= disk.size()) return false;
        *v = disk[at];
        return true;
    }
    // The tag headers from firstBlock to the end position. The walk stops at
    // the end, on a broken header, or on stepping into a block it has passed.
    struct Seen {
        Addr at;
        FM_TagHdr tag;
    };
    std::vector<Seen> Stream() const {
        std::vector<Seen> out;
        if (h.first == 0 || (h.first == h.endBlock && h.endOffset == 0)) return out;
        std::vector<uint32_t> passed = {h.first};
        Addr at = {h.first, 0};
        while (at.block != 0 && out.size() < 2000) {
            uint8_t b[8];
            Addr p = at;
            for (int i = 0; i < 8; ++i) {
                if (p.offset >= h.payload) {
                    if (!Word(p.block, 0, &p.block) || p.block == 0) return out;
                    p.offset = 0;
                }
                if (!Byte(p.block, p.offset, &b[i])) return out;
                ++p.offset;
            }
            FM_TagHdr t{};
            t.kind = b[0];
            std::memcpy(t.extra, b + 1, 3);
            t.length = Get32(b + 4);
            out.push_back({at, t});
            if (t.length < 8) return out;
            Addr n = {at.block, at.offset + t.length};
            while (n.offset >= h.payload) {
                n.offset -= h.payload;
                if (!Word(n.block, 0, &n.block) || n.block == 0) return out;
                if (std::find(passed.begin(), passed.end(), n.block) != passed.end()) return out;
                passed.push_back(n.block);
            }
            if (n.block == h.endBlock && n.offset >= h.endOffset) n.block = 0;
            at = n;
        }
        return out;
    }
    std::vector<uint32_t> FirstTags() const {
        std::vector<uint32_t> out;
        for (uint32_t i = 1; i < h.nextIndex && i < 512; ++i) {
            uint32_t v = 0xFFFFFFFF;
            Word(i, 8, &v);
            out.push_back(v);
        }
        return out;
    }
    std::vector<uint32_t> FreeList() const {
        std::vector<uint32_t> out;
        for (uint32_t b = h.freeHead; b != 0 && out.size() < 512;) {
            out.push_back(b);
            const uint64_t at = uint64_t(b) * h.stride;
            if (at + 4 > disk.size()) break;
            b = Get32(disk.data() + at);
        }
        return out;
    }
};

View ViewOf(const Model &m) {
    View v{m.h, {}, {}, m.counted, m.disk};
    for (const auto &n : m.cache) {
        v.order.push_back({n.index, n.dirty});
        v.images.push_back(n.img);
    }
    return v;
}

View ViewOf(const FM_BlockFile *f, const std::string &path) {
    const FM_BlockFileHdr &x = f->header;
    View v{{x.payloadSize, x.stride, x.nextIndex, x.firstBlock, x.lastBlock, x.freeHead, x.endBlock,
            x.endOffset},
           {},
           {},
           f->cachedCount,
           ReadAll(path)};
    if (const FM_MemBlock *head = f->cacheHead) {
        const FM_MemBlock *n = head;
        do {
            v.order.push_back({n->index, n->dirty});
            v.images.emplace_back(n->image, n->image + x.stride);
            n = n->next;
        } while (n != head);
    }
    return v;
}

std::string Describe(const std::vector<View::Seen> &s) {
    std::ostringstream os;
    for (const auto &e : s) os << e.at << ":" << int(e.tag.kind) << "/" << e.tag.length << " ";
    return os.str();
}

void ExpectSame(const View &real, const View &model, const std::string &where) {
    SCOPED_TRACE(where);
    EXPECT_EQ(0, std::memcmp(&real.h, &model.h, sizeof real.h)) << "header words";
    EXPECT_EQ(real.h.endBlock, model.h.endBlock);
    EXPECT_EQ(real.h.endOffset, model.h.endOffset);
    EXPECT_EQ(real.counted, model.counted);
    EXPECT_EQ(real.order, model.order) << "cache order and dirty marks";
    EXPECT_TRUE(real.images == model.images) << "cache images";
    EXPECT_TRUE(real.disk == model.disk)
        << "file bytes (" << real.disk.size() << " vs " << model.disk.size() << ")";
    const auto rs = real.Stream(), ms = model.Stream();
    EXPECT_EQ(Describe(rs), Describe(ms)) << "tag stream";
    EXPECT_EQ(real.FirstTags(), model.FirstTags()) << "firstTag of each block";
    EXPECT_EQ(real.FreeList(), model.FreeList()) << "free list";
}

// ---- the driver --------------------------------------------------------------

Calls g_calls;
int32_t RecordMove(FM_BlockAddr *from, FM_BlockAddr *to) {
    g_calls.list.push_back({*from, *to});
    return g_calls.answer;
}

struct Config {
    uint32_t payload;
    uint8_t limit;
    uint32_t seed;
    // Keeps appends to block crossings that the chain rules follow (a crossing
    // from a block other than lastBlock writes into the wrong block).
    bool sane;
};

class TagModelTest : public tstest::Sandbox, public ::testing::WithParamInterface<Config> {};

TEST_P(TagModelTest, RandomSequenceFollowsTheRules) {
    const Config c = GetParam();
    const std::string path = Path("m.blk");
    std::mt19937 rng(c.seed * 7919u + c.payload * 31u + c.limit);
    auto pick = [&](uint32_t lo, uint32_t hi) {
        return std::uniform_int_distribution<uint32_t>(lo, hi)(rng);
    };
    const uint32_t P = c.payload;

    g_calls = Calls{};
    Calls modelCalls;
    FM_BlockFile *file = nullptr;
    ASSERT_EQ(StatusOf(FM_BlockFileCreate(path.c_str(), &file, P, c.limit, RecordMove)), 10);
    Model model(P, c.limit, &modelCalls);
    bool callback = true;
    int failures = 0;
    bool intact = c.sane;
    int intactSteps = 0;
    int steps = 0;

    for (int step = 0; step < 400 && !HasFailure(); ++step) {
        steps = step;
        const auto stream = ViewOf(model).Stream();
        std::vector<size_t> live, freeTags;
        for (size_t i = 0; i < stream.size(); ++i)
            (stream[i].tag.kind ? live : freeTags).push_back(i);
        const uint32_t roll = pick(0, 99);
        g_calls.answer = modelCalls.answer = pick(0, 99) < 4 ? -7 : 10;
        std::ostringstream what;
        int32_t rs = 0, ms = 0;
        Addr ra[3] = {{1111, 1}, {2222, 2}, {3333, 3}}, ma[3] = {{1111, 1}, {2222, 2}, {3333, 3}};
        FM_TagHdr rt{}, mt{};

        // Longest append that the chain rules keep readable.
        const auto &mh = model.h;
        const uint32_t saneAppend = mh.endBlock == 0         ? P
                                    : mh.endBlock == mh.last ? 2 * P - mh.endOffset
                                                             : P - mh.endOffset;
        // Nor may it fill a block exactly: an end position of block 0 sends
        // the walks of delete and insert round the ring.
        auto readable = [&](uint32_t length, uint32_t from) {
            if (!c.sane) return length;
            length = std::min(length, saneAppend);
            if ((from + length) % P == 0) --length;
            return length;
        };
        const uint32_t endOffset = mh.endBlock == 0 ? 0 : mh.endOffset;
        if (c.sane) g_calls.answer = modelCalls.answer = 10;
        if ((roll < 30 || stream.empty()) && (!c.sane || readable(saneAppend, endOffset) >= 8)) {
            uint32_t length = pick(0, 3) == 0 ? pick(8, 2 * P) : pick(8, P / 2 + 8);
            length = readable(length, endOffset);
            FM_TagHdr t = Tag(uint8_t(pick(1, 255)), length);
            what << "append " << t.length;
            rs = FM_TagAppendHdrAtEnd(file, &t, &ra[0], &ra[1]);
            ms = model.Append(t, &ma[0], &ma[1]);
        } else if (roll < 45 && !live.empty()) {
            const auto &e = stream[live[pick(0, uint32_t(live.size() - 1))]];
            uint32_t length = pick(0, 9) < 7 ? P * pick(1, 2) : pick(8, 2 * P);
            rt = mt = Tag(uint8_t(pick(1, 255)), length);
            what << "insert at live " << e.at << " length " << length;
            rs = FM_TagInsertHdrAt(file, e.at.block, e.at.offset, &rt, &ra[0], &ra[1], &ra[2]);
            ms = model.Insert(e.at.block, e.at.offset, &mt, &ma[0], &ma[1], &ma[2]);
        } else if (roll < 60 && !freeTags.empty()) {
            const size_t i = freeTags[pick(0, uint32_t(freeTags.size() - 1))];
            uint32_t room = 0;
            for (size_t j = i; j < stream.size() && stream[j].tag.kind == 0; ++j)
                room += stream[j].tag.length;
            const uint32_t r = pick(0, 9);
            uint32_t length = r < 6   ? pick(8, std::max(8u, room))
                              : r < 8 ? room + P * pick(1, 2)
                                      : pick(8, 2 * P);
            rt = mt = Tag(uint8_t(pick(1, 255)), length);
            what << "insert at free " << stream[i].at << " room " << room << " length " << length;
            rs = FM_TagInsertHdrAt(file, stream[i].at.block, stream[i].at.offset, &rt, &ra[0],
                                   &ra[1], &ra[2]);
            ms = model.Insert(stream[i].at.block, stream[i].at.offset, &mt, &ma[0], &ma[1], &ma[2]);
        } else if (roll < 80 && !stream.empty() &&
                   !(c.sane && stream.back().at.offset == 0 && stream.size() > 1)) {
            const auto &e = stream[pick(0, uint32_t(stream.size() - 1))];
            what << "delete " << e.at;
            rs = FM_TagDelete(file, &e.at, &ra[0]);
            ms = model.Delete(e.at, &ma[0]);
        } else if (roll < 88 && !stream.empty()) {
            const auto &e = stream[pick(0, uint32_t(stream.size() - 1))];
            uint32_t length = pick(8, P);
            if (c.sane)
                length = std::max(8u, readable(std::min(length, P - e.at.offset), e.at.offset));
            rt = mt = Tag(uint8_t(pick(1, 255)), length);
            what << "rewrite " << e.at << " length " << rt.length;
            rs = FM_TagRewriteHdr(file, e.at.block, e.at.offset, &rt, &ra[0], &ra[1], &ra[2]);
            ms = model.Rewrite(e.at, &mt, &ma[0], &ma[1], &ma[2]);
        } else if (roll < 94 && !live.empty()) {
            // Data goes 8 bytes on from the tag's address.
            const auto &e = stream[live[pick(0, uint32_t(live.size() - 1))]];
            Bytes data(e.tag.length > 8 ? std::min<uint32_t>(e.tag.length - 8, 3 * P) : 0);
            for (auto &b : data) b = uint8_t(pick(0, 255));
            what << "data " << e.at << " bytes " << data.size();
            rs = FM_GetNextAddr(file, e.at.block, e.at.offset, 8, &ra[0]);
            ms = model.NextAddr(e.at.block, e.at.offset, 8, &ma[0]);
            if (!TS_FAILED(rs) && ra[0].block != 0) {
                Bytes copy = data;
                rs = FM_BlockWrite(file, ra[0].block, ra[0].offset, int32_t(data.size()),
                                   data.data(), &ra[1]);
                ms = model.Move(true, ma[0].block, ma[0].offset, int32_t(copy.size()), copy.data(),
                                &ma[1]);
            }
        } else if (roll < 97) {
            const uint32_t index = pick(1, std::max(1u, model.h.nextIndex));
            what << "fetch " << index;
            FM_MemBlock *node = nullptr;
            Model::Node *mnode = nullptr;
            rs = FM_GetMemBlockByIndex(file, index, &node);
            ms = model.Fetch(index, &mnode);
        } else {
            // Close, compare the bytes, open again; the callback may stay unset.
            what << "reopen";
            rs = FM_BlockFileClose(&file);
            model.Close();
            ASSERT_EQ(StatusOf(rs), 10);
            EXPECT_TRUE(ReadAll(path) == model.disk) << "bytes after close, step " << step;
            ASSERT_EQ(StatusOf(FM_BlockFileOpen(path.c_str(), &file, c.limit)), 10);
            callback = c.sane || pick(0, 3) != 0;
            file->tagCallback = callback ? RecordMove : nullptr;
            model.SetCallback(callback);
            ms = rs;
        }
        SCOPED_TRACE("step " + std::to_string(step) + ": " + what.str());
        ASSERT_EQ(StatusOf(rs), StatusOf(ms));
        if (TS_FAILED(rs)) ++failures;
        // Counts the steps before the stream first stops being readable: a
        // failed step leaves its changes half made, and an end position of
        // block 0 leaves the walks no end mark.
        if (TS_FAILED(rs) && StatusOf(rs) != -4) intact = false;
        if (model.h.endBlock == 0 && model.h.first != 0) intact = false;
        if (intact) ++intactSteps;
        if (getenv("TAGMODEL_STATS"))
            fprintf(stderr, "%s -> %d blocks %u stream %zu calls %zu\n", what.str().c_str(),
                    StatusOf(rs), model.h.nextIndex, stream.size(), g_calls.list.size());
        for (int i = 0; i < 3; ++i) EXPECT_EQ(ra[i], ma[i]) << "out " << i;
        EXPECT_EQ(rt.length, mt.length);
        EXPECT_EQ(g_calls.list, modelCalls.list) << "callback calls";
        ExpectSame(ViewOf(file, path), ViewOf(model), "after the step");
    }
    ASSERT_EQ(StatusOf(FM_BlockFileClose(&file)), 10);
    model.Close();
    EXPECT_TRUE(ReadAll(path) == model.disk) << "bytes after the last close";
    RecordProperty("failures", failures);
    RecordProperty("steps", steps);
    RecordProperty("intact", intactSteps);
    if (getenv("TAGMODEL_STATS")) fprintf(stderr, "intact steps %d\n", intactSteps);
    FM_Delete(path.c_str());
}

std::vector<Config> Configs() {
    std::vector<Config> out;
    for (uint32_t payload : {24u, 40u, 100u, 256u})
        for (uint8_t limit : {0, 3, 4, 5, 16, 255})
            for (uint32_t seed : {1u, 2u, 3u})
                for (bool sane : {false, true}) out.push_back({payload, limit, seed, sane});
    return out;
}

INSTANTIATE_TEST_SUITE_P(Sequences, TagModelTest, ::testing::ValuesIn(Configs()),
                         [](const ::testing::TestParamInfo<Config> &i) {
                             return "payload" + std::to_string(i.param.payload) + "_limit" +
                                    std::to_string(i.param.limit) + "_seed" +
                                    std::to_string(i.param.seed) +
                                    (i.param.sane ? "_readable" : "_any");
                         });

}  // namespace
