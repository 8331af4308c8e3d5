// Circular doubly linked lists whose links live in the caller's nodes. The
// list head is the caller's pointer to the first node; null is empty.
#include <tessarine/core.h>

#include "core/status.h"

using tessarine::kErrArgument;
using tessarine::kErrEmptyList;
using tessarine::kOk;

namespace {

void SelfLink(ListNode *node) { node->next = node->prev = node; }

// Puts `node` between `before` and `before->next`.
void LinkAfter(ListNode *node, ListNode *before) {
    node->prev = before;
    node->next = before->next;
    before->next->prev = node;
    before->next = node;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t ListAppend(ListNode *node, ListNode **head) {
    if (node == nullptr) return kOk;
    if (*head == nullptr) {
        SelfLink(node);
        *head = node;
    } else {
        LinkAfter(node, (*head)->prev);
    }
    return kOk;
}

// A null node appends nothing and then still becomes the head: the list is
// dropped from the head variable, as callers of this family have always seen.
TESSARINE_API int32_t ListInsertHead(ListNode *node, ListNode **head) {
    ListAppend(node, head);
    *head = node;
    return kOk;
}

TESSARINE_API int32_t ListInsertAfter(ListNode *node, ListNode **cursor) {
    if (node == nullptr) return kOk;
    if (*cursor == nullptr) {
        SelfLink(node);
        *cursor = node;
    } else {
        LinkAfter(node, *cursor);
    }
    return kOk;
}

// A null node has no links to set: refused rather than written through.
TESSARINE_API int32_t ListInsertSort(ListCompareFn compare, ListNode *node, ListNode **head) {
    if (node == nullptr) return kErrArgument;
    if (*head == nullptr) {
        SelfLink(node);
        *head = node;
        return kOk;
    }
    ListNode *current = *head;
    do {
        if (tessarine::StatusOf(compare(node, current)) < 0) {
            LinkAfter(node, current->prev);
            if (current == *head) *head = node;
            return kOk;
        }
        current = current->next;
    } while (current != *head);
    LinkAfter(node, (*head)->prev);
    return kOk;
}

TESSARINE_API int32_t ListConnect(ListNode *other, ListNode **head) {
    if (other == nullptr) return kOk;
    if (*head == nullptr) {
        *head = other;
        return kOk;
    }
    ListNode *first = *head;
    ListNode *last = first->prev;
    ListNode *otherLast = other->prev;
    last->next = other;
    other->prev = last;
    otherLast->next = first;
    first->prev = otherLast;
    return kOk;
}

TESSARINE_API int32_t ListRemove(ListNode *node, ListNode **head) {
    if (*head == nullptr || node == nullptr) return kErrEmptyList;
    node->prev->next = node->next;
    node->next->prev = node->prev;
    if (node == *head) *head = node->next == node ? nullptr : node->next;
    SelfLink(node);
    return kOk;
}

TESSARINE_API int32_t ListRemoveHead(ListNode **head, ListNode **out) {
    if (*head == nullptr) return kErrEmptyList;
    ListNode *node = *head;
    ListRemove(node, head);
    *out = node;
    return kOk;
}

TESSARINE_API int32_t ListRemoveTail(ListNode **head, ListNode **out) {
    if (*head == nullptr) return kErrEmptyList;
    ListNode *node = (*head)->prev;
    ListRemove(node, head);
    *out = node;
    return kOk;
}

TESSARINE_API int32_t ListSplit(ListNode **head, ListNode **node) {
    ListNode *first = *head;
    ListNode *cut = *node;
    if (first == nullptr || cut == nullptr) return kOk;
    if (cut == first) {
        *head = nullptr;
        return kOk;
    }
    ListNode *last = first->prev;
    ListNode *beforeCut = cut->prev;
    beforeCut->next = first;
    first->prev = beforeCut;
    last->next = cut;
    cut->prev = last;
    return kOk;
}

TESSARINE_API int32_t ListSplitHalf(ListNode *first, ListNode **out) {
    if (first == nullptr || first->next == first) return kErrArgument;
    const int32_t half = ListNumber(first) / 2;
    ListNode *second = first;
    for (int32_t i = 0; i < half; ++i) second = second->next;
    ListNode *head = first;
    ListSplit(&head, &second);
    *out = second;
    return kOk;
}

TESSARINE_API int32_t ListNumber(ListNode *first) {
    if (first == nullptr) return 0;
    int32_t count = 0;
    ListNode *node = first;
    do {
        ++count;
        node = node->next;
    } while (node != first);
    return count;
}

TESSARINE_API int32_t ListReverse(ListNode **head) {
    ListNode *first = *head;
    if (first == nullptr) return kOk;
    ListNode *node = first;
    do {
        ListNode *next = node->next;
        node->next = node->prev;
        node->prev = next;
        node = next;
    } while (node != first);
    *head = first->next;  // the former last node
    return kOk;
}

TESSARINE_API int32_t FreeEntireList(ListNode **head) {
    ListNode *node = nullptr;
    while (*head != nullptr) {
        ListRemoveHead(head, &node);
        MEM_FreeHdl(node);
    }
    *head = nullptr;
    return kOk;
}

TESSARINE_API int32_t ListCopy(ListCopyFn copy, ListReleaseFn release, ListNode *first,
                               ListNode **out) {
    *out = nullptr;
    ListNode *fresh = nullptr;
    ListNode *copied = nullptr;
    int32_t status = kOk;
    if (first != nullptr) {
        ListNode *node = first;
        do {
            fresh = nullptr;
            const int32_t result = copy(node, &fresh);
            if (tessarine::StatusOf(result) < 0) {
                status = tessarine::StatusOf(result);
                break;
            }
            if (fresh != nullptr) {
                ListAppend(fresh, &copied);
                fresh = nullptr;
            }
            node = node->next;
        } while (node != first);
        if (status == kOk) {
            *out = copied;
            copied = nullptr;
        }
    }
    release(&fresh);
    release(&copied);
    return status;
}

}  // extern "C"
