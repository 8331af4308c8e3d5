// Which vector paths this processor can take, and the one cap on them that
// tests turn down. Every fast path of the library (the 3- and 4-byte plane
// splits, the 1-bit row packing, the CMYK to sRGB formula) asks here.
#pragma once

#include <atomic>
#include <cstdint>

#if defined(__x86_64__) || defined(__i386__)
#include <immintrin.h>
#define TESSARINE_SHUFFLE_PATH 1
#endif

namespace tessarine {

// Slowest first; a processor that has a path has every one before it.
enum class VectorPath : uint8_t {
    kPlain,    // scalar code only
    kShuffle,  // 128-bit byte shuffles (SSSE3)
    kWide,     // 256-bit vectors (AVX2)
    kPermute,  // 512-bit byte permutes (AVX-512 F, BW and VBMI)
};

namespace detail {
extern std::atomic<VectorPath> g_activeVectorPath;
}  // namespace detail

// The fastest path a call may take. Set once while the library loads; a
// call made before that (from another initialiser) reads kPlain and takes
// the plain path, which gives the same bytes.
inline VectorPath ActiveVectorPath() {
    return detail::g_activeVectorPath.load(std::memory_order_relaxed);
}

// The fastest path this processor has.
VectorPath ProcessorVectorPath();

// Caps every fast path at `fastest` (kPlain turns them all off) and returns
// the previous cap; a path the processor lacks stays off whatever the cap.
// For tests, which run each path the processor has.
VectorPath LimitVectorPaths(VectorPath fastest);

}  // namespace tessarine
