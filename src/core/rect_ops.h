// Rectangle arithmetic shared by the exported rectangle functions and by the
// tile and row code: right and bottom exclusive, edges never normalised.
#pragma once

#include <algorithm>

#include <tessarine/platform.h>

namespace tessarine {

inline bool IsEmptyRect(const RECT &r) { return !(r.left < r.right && r.top < r.bottom); }

// The common part of two rectangles; empty (by IsEmptyRect) when they do not meet.
inline RECT IntersectRect(const RECT &a, const RECT &b) {
    return RECT{std::max(a.left, b.left), std::max(a.top, b.top), std::min(a.right, b.right),
                std::min(a.bottom, b.bottom)};
}

inline bool RectsOverlap(const RECT &a, const RECT &b) { return !IsEmptyRect(IntersectRect(a, b)); }

}  // namespace tessarine
