// The registry of swap elements: modules of the application register what
// they can give up, and the application asks them for memory back. Nothing in
// the library itself registers or squeezes.
#include <tessarine/core.h>

#include "core/status.h"
#include "platform/heap.h"

using tessarine::kErrArgument;
using tessarine::kErrGeneral;
using tessarine::kErrMemory;
using tessarine::kOk;

namespace {

struct SwapNode {
    ListNode link;  // link.data is the element
    uint8_t locked;
    MEM_SqueezeFn squeeze;
};

constexpr uint8_t kNotSqueezable = 1;

// The registry head is made at first use and never released.
ListNode **g_registry = nullptr;

SwapNode *FindElement(uintptr_t element) {
    ListNode *first = *g_registry;
    if (first == nullptr) return nullptr;
    ListNode *node = first;
    do {
        if (node->data == element) return reinterpret_cast<SwapNode *>(node);
        node = node->next;
    } while (node != first);
    return nullptr;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t MEM_InitMemManager(void) {
    if (g_registry != nullptr) return kOk;
    auto **head = static_cast<ListNode **>(
        tessarine::platform::GlobalAlloc(tessarine::platform::GMEM_FIXED, sizeof(ListNode *)));
    if (head == nullptr) return kErrMemory;
    *head = nullptr;
    g_registry = head;
    return kOk;
}

TESSARINE_API int32_t MEM_RegisterSwapElement(uintptr_t element, MEM_SqueezeFn squeeze) {
    if (element == 0 || squeeze == nullptr) return kErrArgument;
    const int32_t status = MEM_InitMemManager();
    if (tessarine::Failed(status)) return status;
    auto *node = static_cast<SwapNode *>(
        tessarine::platform::GlobalAlloc(tessarine::platform::GPTR, sizeof(SwapNode)));
    if (node == nullptr) {
        tessarine::platform::NewMemoryHandler(sizeof(SwapNode));
        return kErrMemory;
    }
    node->link.data = element;
    node->squeeze = squeeze;
    node->locked = 0;
    ListAppend(&node->link, g_registry);
    return kOk;
}

TESSARINE_API int32_t MEM_DeleteSwapElement(uintptr_t element) {
    if (g_registry == nullptr) return kErrGeneral;
    if (SwapNode *node = FindElement(element)) {
        ListRemove(&node->link, g_registry);
        tessarine::platform::GlobalFree(node);
    }
    return kOk;
}

TESSARINE_API int32_t MEM_LockSwapElement(uintptr_t element) {
    if (g_registry == nullptr) return kErrGeneral;
    if (SwapNode *node = FindElement(element)) node->locked |= kNotSqueezable;
    return kOk;
}

TESSARINE_API int32_t MEM_UnlockSwapElement(uintptr_t element) {
    if (g_registry == nullptr) return kErrGeneral;
    if (SwapNode *node = FindElement(element)) node->locked = 0;
    return kOk;
}

TESSARINE_API int32_t MEM_SqueezMemory(int32_t argument) {
    if (g_registry == nullptr) return kErrGeneral;
    int32_t result = kOk;
    // The walk is bounded by the count at entry and steps by the saved next
    // node, so that a callback may delete its own element (even the first)
    // without cutting the walk short or making it run on.
    ListNode *node = *g_registry;
    for (int32_t left = ListNumber(node); left > 0 && *g_registry != nullptr; --left) {
        auto *swap = reinterpret_cast<SwapNode *>(node);
        ListNode *next = node->next;
        if ((swap->locked & kNotSqueezable) == 0) {
            result = swap->squeeze(node->data, argument);
            if (result < 0) return result;  // the whole word, not the low half
        }
        node = next;
    }
    return result;
}

}  // extern "C"
