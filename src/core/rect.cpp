// Integer rectangles, right and bottom exclusive. Edges are never normalised;
// arithmetic on them wraps as 32-bit words do instead of overflowing.
#include <algorithm>

#include <tessarine/core.h>

#include "core/rect_ops.h"

namespace {

int32_t WrapAdd(int32_t a, int32_t b) {
    return static_cast<int32_t>(static_cast<uint32_t>(a) + static_cast<uint32_t>(b));
}

int32_t WrapSub(int32_t a, int32_t b) {
    return static_cast<int32_t>(static_cast<uint32_t>(a) - static_cast<uint32_t>(b));
}

}  // namespace

extern "C" {

TESSARINE_API void IM_SetRECT(int32_t left, int32_t top, int32_t right, int32_t bottom, RECT *out) {
    *out = RECT{left, top, right, bottom};
}

TESSARINE_API int32_t IM_EmptyRECT(const RECT *rect) {
    return tessarine::IsEmptyRect(*rect) ? 1 : 0;
}

// Out is written even when the intersection is empty.
TESSARINE_API int32_t IM_FindRECTInt(const RECT *a, const RECT *b, RECT *out) {
    const RECT r = tessarine::IntersectRect(*a, *b);
    *out = r;
    return tessarine::IsEmptyRect(r) ? 0 : 1;
}

TESSARINE_API int32_t IM_IsRECTEnclosed(const RECT *inner, const RECT *outer) {
    return outer->left <= inner->left && outer->top <= inner->top && inner->right <= outer->right &&
                   inner->bottom <= outer->bottom
               ? 1
               : 0;
}

// An empty rectangle takes part like any other.
TESSARINE_API void IM_UnionRECT(const RECT *a, RECT *b) {
    const RECT r{std::min(a->left, b->left), std::min(a->top, b->top), std::max(a->right, b->right),
                 std::max(a->bottom, b->bottom)};
    *b = r;
}

TESSARINE_API void IM_ExpandRECT(int32_t amount, RECT *rect) {
    rect->left = WrapSub(rect->left, amount);
    rect->top = WrapSub(rect->top, amount);
    rect->right = WrapAdd(rect->right, amount);
    rect->bottom = WrapAdd(rect->bottom, amount);
}

TESSARINE_API void IM_TranslateRECT(int32_t dx, int32_t dy, RECT *rect) {
    rect->left = WrapAdd(rect->left, dx);
    rect->right = WrapAdd(rect->right, dx);
    rect->top = WrapAdd(rect->top, dy);
    rect->bottom = WrapAdd(rect->bottom, dy);
}

}  // extern "C"
