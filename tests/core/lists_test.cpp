// Circular doubly linked lists on lists of 0, 1, 2 and 5 nodes.
#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include <tessarine/core.h>

#include "hook_recorder.h"
#include "test_support.h"

namespace {

ListNode *const kUntouched = reinterpret_cast<ListNode *>(uintptr_t{0x5A5A5A50});

struct Item {
    ListNode link;
    int32_t value;
};

// Nodes on the stack of the test, with their data word set to their index.
struct Nodes {
    explicit Nodes(int n) : items(static_cast<size_t>(n) + 4) {
        for (size_t i = 0; i < items.size(); ++i) {
            items[i].link.data = i;
            items[i].link.next = items[i].link.prev = nullptr;
            items[i].value = static_cast<int32_t>(i);
        }
    }
    ListNode *operator[](size_t i) { return &items[i].link; }
    // A list of the first n nodes, in order.
    ListNode *List(int n) {
        ListNode *head = nullptr;
        for (int i = 0; i < n; ++i) ListAppend((*this)[static_cast<size_t>(i)], &head);
        return head;
    }
    std::vector<Item> items;
};

// Walks from the head, checks both directions agree, and gives the data words.
std::vector<uintptr_t> Walk(ListNode *head) {
    std::vector<uintptr_t> order;
    if (head == nullptr) return order;
    ListNode *node = head;
    do {
        EXPECT_EQ(node->next->prev, node);
        EXPECT_EQ(node->prev->next, node);
        order.push_back(node->data);
        node = node->next;
        if (order.size() > 100) {
            ADD_FAILURE() << "list does not close";
            break;
        }
    } while (node != head);
    return order;
}

std::vector<uintptr_t> Range(uintptr_t from, uintptr_t to) {
    std::vector<uintptr_t> r;
    for (uintptr_t i = from; i < to; ++i) r.push_back(i);
    return r;
}

void ExpectSelfLinked(ListNode *node) {
    EXPECT_EQ(node->next, node);
    EXPECT_EQ(node->prev, node);
}

class Sizes : public ::testing::TestWithParam<int> {};
INSTANTIATE_TEST_SUITE_P(Lists, Sizes, ::testing::Values(0, 1, 2, 5));

TEST_P(Sizes, AppendAddsAtTheEnd) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    EXPECT_EQ(ListAppend(nodes[n], &head), 10);
    EXPECT_EQ(Walk(head), Range(0, n + 1));
    EXPECT_EQ(head, nodes[0]);
}

TEST_P(Sizes, AppendOfNullDoesNothing) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    EXPECT_EQ(ListAppend(nullptr, &head), 10);
    EXPECT_EQ(Walk(head), Range(0, n));
}

TEST_P(Sizes, InsertHeadMakesTheNodeTheHead) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    EXPECT_EQ(ListInsertHead(nodes[n], &head), 10);
    EXPECT_EQ(head, nodes[n]);
    std::vector<uintptr_t> expected{static_cast<uintptr_t>(n)};
    for (uintptr_t i = 0; i < static_cast<uintptr_t>(n); ++i) expected.push_back(i);
    EXPECT_EQ(Walk(head), expected);
}

TEST_P(Sizes, InsertHeadOfNullLeavesANullHead) {
    // As ListAppend (nothing added), then the node, null, becomes the head.
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    EXPECT_EQ(ListInsertHead(nullptr, &head), 10);
    EXPECT_EQ(head, nullptr);
    if (n > 0) {
        EXPECT_EQ(Walk(nodes[0]), Range(0, n));  // the nodes keep their ring
    }
}

TEST_P(Sizes, InsertAfterEveryCursor) {
    const int n = GetParam();
    for (int at = 0; at < n; ++at) {
        Nodes nodes(n);
        ListNode *head = nodes.List(n);
        ListNode *cursor = nodes[at];
        EXPECT_EQ(ListInsertAfter(nodes[n], &cursor), 10);
        EXPECT_EQ(cursor, nodes[at]);
        EXPECT_EQ(head, nodes[0]);
        std::vector<uintptr_t> expected = Range(0, at + 1);
        expected.push_back(n);
        for (int i = at + 1; i < n; ++i) expected.push_back(i);
        EXPECT_EQ(Walk(head), expected);
    }
}

TEST_P(Sizes, InsertAfterOnEmptyAndNull) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *cursor = nullptr;
    EXPECT_EQ(ListInsertAfter(nodes[n], &cursor), 10);
    EXPECT_EQ(cursor, nodes[n]);
    ExpectSelfLinked(nodes[n]);
    ListNode *head = nodes.List(n);
    ListNode *c = head;
    EXPECT_EQ(ListInsertAfter(nullptr, &c), 10);
    EXPECT_EQ(c, head);
    EXPECT_EQ(Walk(head), Range(0, n));
}

int32_t g_compareCalls = 0;
int32_t ByValue(ListNode *node, ListNode *current) {
    ++g_compareCalls;
    return reinterpret_cast<Item *>(node)->value - reinterpret_cast<Item *>(current)->value;
}
int32_t AlwaysZero(ListNode *, ListNode *) {
    ++g_compareCalls;
    return 0;
}
int32_t HighBitsOnly(ListNode *, ListNode *) {
    return 0x10000;
}
int32_t NegativeInLowHalf(ListNode *, ListNode *) {
    return 0x7FFF8000;
}

TEST_P(Sizes, InsertSortKeepsAscendingAndStable) {
    const int n = GetParam();
    for (int32_t key = -1; key <= 2 * n + 1; ++key) {
        Nodes nodes(n);
        for (int i = 0; i < n; ++i) nodes.items[static_cast<size_t>(i)].value = 2 * i;
        nodes.items[static_cast<size_t>(n)].value = key;
        ListNode *head = nodes.List(n);
        EXPECT_EQ(ListInsertSort(ByValue, nodes[n], &head), 10);
        std::vector<int32_t> values;
        for (uintptr_t d : Walk(head)) values.push_back(nodes.items[d].value);
        ASSERT_EQ(values.size(), static_cast<size_t>(n + 1));
        for (size_t i = 1; i < values.size(); ++i) EXPECT_LE(values[i - 1], values[i]);
        // Equal keys: the new node lands behind the equal one.
        if (key % 2 == 0 && key >= 0 && key < 2 * n) {
            const std::vector<uintptr_t> order = Walk(head);
            size_t pos = 0;
            while (order[pos] != static_cast<uintptr_t>(n)) ++pos;
            EXPECT_EQ(order[pos - 1], static_cast<uintptr_t>(key / 2));
        }
        if (key < 0) {
            EXPECT_EQ(head, nodes[n]);
        }
    }
}

TEST_P(Sizes, InsertSortWithZeroComparatorAppends) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    g_compareCalls = 0;
    EXPECT_EQ(ListInsertSort(AlwaysZero, nodes[n], &head), 10);
    EXPECT_EQ(Walk(head), Range(0, n + 1));
    EXPECT_EQ(g_compareCalls, n);  // none on an empty list
}

TEST_P(Sizes, InsertSortReadsOnlyTheLowSixteenBits) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    EXPECT_EQ(ListInsertSort(HighBitsOnly, nodes[n], &head), 10);
    EXPECT_EQ(Walk(head), Range(0, n + 1));
    Nodes again(n);
    ListNode *h = again.List(n);
    EXPECT_EQ(ListInsertSort(NegativeInLowHalf, again[n], &h), 10);
    EXPECT_EQ(h, again[n]);  // 0x8000 is negative: goes in front of the head
}

TEST_P(Sizes, InsertSortRefusesANullNode) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    ListNode *const before = head;
    g_compareCalls = 0;
    EXPECT_EQ(ListInsertSort(AlwaysZero, nullptr, &head), -4);
    EXPECT_EQ(head, before);
    EXPECT_EQ(g_compareCalls, 0);
    EXPECT_EQ(Walk(head), Range(0, n));
}

TEST_P(Sizes, ConnectJoinsBehindTheEnd) {
    const int n = GetParam();
    for (int m : {1, 2, 3}) {
        Nodes nodes(n + m);
        ListNode *head = nodes.List(n);
        ListNode *other = nullptr;
        for (int i = n; i < n + m; ++i) ListAppend(nodes[i], &other);
        EXPECT_EQ(ListConnect(other, &head), 10);
        EXPECT_EQ(head, nodes[0]);
        EXPECT_EQ(Walk(head), Range(0, n + m));
    }
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    EXPECT_EQ(ListConnect(nullptr, &head), 10);
    EXPECT_EQ(Walk(head), Range(0, n));
}

TEST(Lists, ConnectOntoEmptyTakesOtherAsItStands) {
    Nodes nodes(3);
    ListNode *other = nodes.List(3);
    ListNode *head = nullptr;
    EXPECT_EQ(ListConnect(other, &head), 10);
    EXPECT_EQ(head, nodes[0]);
    EXPECT_EQ(nodes[0]->next, nodes[1]);
    EXPECT_EQ(nodes[0]->prev, nodes[2]);
    EXPECT_EQ(Walk(head), Range(0, 3));
    // A node in the middle of a ring is taken as it stands too.
    ListNode *h2 = nullptr;
    EXPECT_EQ(ListConnect(nodes[1], &h2), 10);
    EXPECT_EQ(h2, nodes[1]);
}

TEST_P(Sizes, RemoveEveryPosition) {
    const int n = GetParam();
    for (int at = 0; at < n; ++at) {
        Nodes nodes(n);
        ListNode *head = nodes.List(n);
        EXPECT_EQ(ListRemove(nodes[at], &head), 10);
        ExpectSelfLinked(nodes[at]);
        std::vector<uintptr_t> expected;
        for (int i = 0; i < n; ++i)
            if (i != at) expected.push_back(i);
        EXPECT_EQ(Walk(head), expected);
        if (n == 1) {
            EXPECT_EQ(head, nullptr);
        }
        if (at == 0 && n > 1) {
            EXPECT_EQ(head, nodes[1]);
        }
        if (at != 0) {
            EXPECT_EQ(head, nodes[0]);
        }
    }
}

TEST_P(Sizes, RemoveFromEmptyOrOfNull) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    EXPECT_EQ(ListRemove(nullptr, &head), -6);
    EXPECT_EQ(Walk(head), Range(0, n));
    ListNode *empty = nullptr;
    EXPECT_EQ(ListRemove(nodes[n], &empty), -6);
    EXPECT_EQ(empty, nullptr);
}

TEST(Lists, RemoveOfOnlyNode) {
    Nodes nodes(1);
    ListNode *head = nodes.List(1);
    EXPECT_EQ(ListRemove(nodes[0], &head), 10);
    EXPECT_EQ(head, nullptr);
    ExpectSelfLinked(nodes[0]);
}

TEST_P(Sizes, RemoveHead) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    ListNode *out = kUntouched;
    if (n == 0) {
        EXPECT_EQ(ListRemoveHead(&head, &out), -6);
        EXPECT_EQ(out, kUntouched);
        EXPECT_EQ(head, nullptr);
        return;
    }
    EXPECT_EQ(ListRemoveHead(&head, &out), 10);
    EXPECT_EQ(out, nodes[0]);
    ExpectSelfLinked(out);
    EXPECT_EQ(Walk(head), Range(1, n));
    EXPECT_EQ(head, n > 1 ? nodes[1] : nullptr);
}

TEST(Lists, RemoveHeadOfTwoLeavesSelfLinkedOne) {
    Nodes nodes(2);
    ListNode *head = nodes.List(2);
    ListNode *out = nullptr;
    EXPECT_EQ(ListRemoveHead(&head, &out), 10);
    EXPECT_EQ(head, nodes[1]);
    ExpectSelfLinked(nodes[1]);
    ExpectSelfLinked(nodes[0]);
}

TEST_P(Sizes, RemoveTail) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    ListNode *out = kUntouched;
    if (n == 0) {
        EXPECT_EQ(ListRemoveTail(&head, &out), -6);
        EXPECT_EQ(out, kUntouched);
        return;
    }
    EXPECT_EQ(ListRemoveTail(&head, &out), 10);
    EXPECT_EQ(out, nodes[n - 1]);
    ExpectSelfLinked(out);
    EXPECT_EQ(Walk(head), Range(0, n - 1));
    EXPECT_EQ(head, n > 1 ? nodes[0] : nullptr);
}

TEST_P(Sizes, SplitAtEveryNode) {
    const int n = GetParam();
    for (int at = 0; at < n; ++at) {
        Nodes nodes(n);
        ListNode *head = nodes.List(n);
        ListNode *second = nodes[at];
        EXPECT_EQ(ListSplit(&head, &second), 10);
        if (at == 0) {
            EXPECT_EQ(head, nullptr);
            EXPECT_EQ(second, nodes[0]);
            EXPECT_EQ(Walk(second), Range(0, n));
        } else {
            EXPECT_EQ(head, nodes[0]);
            EXPECT_EQ(Walk(head), Range(0, at));
            EXPECT_EQ(second, nodes[at]);
            EXPECT_EQ(Walk(second), Range(at, n));
        }
    }
}

TEST_P(Sizes, SplitOfEmptyOrNullChangesNothing) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    ListNode *none = nullptr;
    EXPECT_EQ(ListSplit(&head, &none), 10);
    EXPECT_EQ(none, nullptr);
    EXPECT_EQ(Walk(head), Range(0, n));
    ListNode *empty = nullptr;
    ListNode *node = nodes[n];
    node->next = node->prev = node;
    EXPECT_EQ(ListSplit(&empty, &node), 10);
    EXPECT_EQ(empty, nullptr);
    EXPECT_EQ(node, nodes[n]);
}

TEST_P(Sizes, SplitHalf) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    ListNode *out = kUntouched;
    if (n < 2) {
        EXPECT_EQ(ListSplitHalf(head, &out), -4);
        EXPECT_EQ(out, kUntouched);
        EXPECT_EQ(Walk(head), Range(0, n));
        return;
    }
    EXPECT_EQ(ListSplitHalf(head, &out), 10);
    EXPECT_EQ(Walk(head), Range(0, n / 2));
    EXPECT_EQ(out, nodes[n / 2]);
    EXPECT_EQ(Walk(out), Range(n / 2, n));
}

TEST(Lists, SplitHalfOfFiveAndTwo) {
    Nodes five(5);
    ListNode *out = nullptr;
    EXPECT_EQ(ListSplitHalf(five.List(5), &out), 10);
    EXPECT_EQ(ListNumber(five[0]), 2);
    EXPECT_EQ(ListNumber(out), 3);
    Nodes two(2);
    EXPECT_EQ(ListSplitHalf(two.List(2), &out), 10);
    EXPECT_EQ(ListNumber(two[0]), 1);
    EXPECT_EQ(ListNumber(out), 1);
    EXPECT_EQ(out, two[1]);
}

TEST_P(Sizes, Number) {
    const int n = GetParam();
    Nodes nodes(n);
    EXPECT_EQ(ListNumber(nodes.List(n)), n);
}

TEST_P(Sizes, ReverseMakesTheLastNodeTheHead) {
    const int n = GetParam();
    Nodes nodes(n);
    ListNode *head = nodes.List(n);
    EXPECT_EQ(ListReverse(&head), 10);
    std::vector<uintptr_t> expected;
    for (int i = n - 1; i >= 0; --i) expected.push_back(i);
    EXPECT_EQ(Walk(head), expected);
    EXPECT_EQ(head, n > 0 ? nodes[n - 1] : nullptr);
}

class HeapLists : public tstest::Sandbox, public ::testing::WithParamInterface<int> {};
INSTANTIATE_TEST_SUITE_P(Lists, HeapLists, ::testing::Values(0, 1, 2, 5));

ListNode *HeapList(int n) {
    ListNode *head = nullptr;
    for (int i = 0; i < n; ++i) {
        auto *item = static_cast<Item *>(MEM_AllocPtr(MEM_FLAG_ZERO, sizeof(Item)));
        item->link.data = static_cast<uintptr_t>(i);
        item->value = i * 10;
        ListAppend(&item->link, &head);
    }
    return head;
}

TEST_P(HeapLists, FreeEntireListFreesEveryNode) {
    const int n = GetParam();
    const int64_t live = tessarine::testing::LiveBlocks();
    ListNode *head = HeapList(n);
    EXPECT_EQ(tessarine::testing::LiveBlocks(), live + n);
    EXPECT_EQ(FreeEntireList(&head), 10);
    EXPECT_EQ(head, nullptr);
    EXPECT_EQ(tessarine::testing::LiveBlocks(), live);
}

int32_t g_releaseCalls = 0;
std::vector<bool> g_releaseSawNull;
int32_t g_copyCalls = 0;
int32_t g_failAtCopy = -1;  // copy call (0-based) that fails
int32_t g_failStatus = -5;
int32_t g_skipCopy = -1;  // copy call that leaves null

int32_t CopyItem(ListNode *source, ListNode **copy) {
    const int32_t call = g_copyCalls++;
    if (call == g_skipCopy) return 10;
    auto *item = static_cast<Item *>(MEM_AllocPtr(MEM_FLAG_ZERO, sizeof(Item)));
    if (item == nullptr) return -5;
    item->link.data = source->data;
    item->value = reinterpret_cast<Item *>(source)->value + 1;
    item->link.next = item->link.prev = &item->link;  // a valid one-node list
    *copy = &item->link;
    if (call == g_failAtCopy) return g_failStatus;  // fails after making a node
    return 10;
}

int32_t Release(ListNode **head) {
    ++g_releaseCalls;
    g_releaseSawNull.push_back(*head == nullptr);
    return FreeEntireList(head);
}

void ResetCopyCounters() {
    g_releaseCalls = g_copyCalls = 0;
    g_releaseSawNull.clear();
    g_failAtCopy = g_skipCopy = -1;
    g_failStatus = -5;
}

TEST_P(HeapLists, CopyMakesADeepCopy) {
    const int n = GetParam();
    ResetCopyCounters();
    ListNode *source = HeapList(n);
    ListNode *out = kUntouched;
    EXPECT_EQ(ListCopy(CopyItem, Release, source, &out), 10);
    EXPECT_EQ(Walk(out), Range(0, n));
    EXPECT_EQ(g_copyCalls, n);
    EXPECT_EQ(g_releaseCalls, 2);
    EXPECT_EQ(g_releaseSawNull, std::vector<bool>({true, true}));
    if (n > 0) {
        EXPECT_NE(out, source);
    }
    if (n > 0) {
        EXPECT_EQ(reinterpret_cast<Item *>(out)->value, 1);
    }
    FreeEntireList(&out);
    FreeEntireList(&source);
}

TEST(Lists, CopyOfNullGivesNullAndStillReleasesTwice) {
    ResetCopyCounters();
    ListNode *out = kUntouched;
    EXPECT_EQ(ListCopy(CopyItem, Release, nullptr, &out), 10);
    EXPECT_EQ(out, nullptr);
    EXPECT_EQ(g_copyCalls, 0);
    EXPECT_EQ(g_releaseCalls, 2);
    EXPECT_EQ(g_releaseSawNull, std::vector<bool>({true, true}));
}

TEST_P(HeapLists, CopySkipsNodesLeftNull) {
    const int n = GetParam();
    if (n == 0) return;
    ResetCopyCounters();
    g_skipCopy = 0;
    ListNode *source = HeapList(n);
    ListNode *out = nullptr;
    EXPECT_EQ(ListCopy(CopyItem, Release, source, &out), 10);
    EXPECT_EQ(Walk(out), Range(1, n));
    FreeEntireList(&out);
    FreeEntireList(&source);
}

TEST_P(HeapLists, CopyFailureAtEachNodeReleasesThePartialCopy) {
    const int n = GetParam();
    ListNode *source = HeapList(n);
    for (int at = 0; at < n; ++at) {
        ResetCopyCounters();
        g_failAtCopy = at;
        g_failStatus = static_cast<int32_t>(0x0003FFF0);  // low half -16
        const int64_t live = tessarine::testing::LiveBlocks();
        ListNode *out = kUntouched;
        EXPECT_EQ(ListCopy(CopyItem, Release, source, &out), -16);  // sign-extended
        EXPECT_EQ(out, nullptr);
        EXPECT_EQ(g_copyCalls, at + 1);
        EXPECT_EQ(g_releaseCalls, 2);
        // The failing call's node is released first, then the partial copy.
        EXPECT_EQ(g_releaseSawNull, std::vector<bool>({false, at == 0}));
        EXPECT_EQ(tessarine::testing::LiveBlocks(), live);
    }
    FreeEntireList(&source);
}

TEST_P(HeapLists, CopyUnderAllocationFailure) {
    const int n = GetParam();
    ListNode *source = HeapList(n);
    tstest::ForEachAllocationFailure([&](int64_t) {
        ResetCopyCounters();
        ListNode *out = kUntouched;
        const int32_t status = ListCopy(CopyItem, Release, source, &out);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(status, -5);
            EXPECT_EQ(out, nullptr);
        } else {
            EXPECT_EQ(status, 10);
            EXPECT_EQ(ListNumber(out), n);
            FreeEntireList(&out);
        }
    });
    FreeEntireList(&source);
}

}  // namespace
