// The processor probe, run once while the library loads.
#include "bitmap/cpu_features.h"

namespace tessarine {
namespace {

#ifdef TESSARINE_SHUFFLE_PATH
struct PathProbe {
    VectorPath path;
    bool (*present)();
};

// What each path needs beyond the paths before it, slowest first.
constexpr PathProbe kPathProbes[] = {
    {VectorPath::kShuffle, [] { return __builtin_cpu_supports("ssse3") != 0; }},
    {VectorPath::kWide, [] { return __builtin_cpu_supports("avx2") != 0; }},
    {VectorPath::kPermute,
     [] {
         return __builtin_cpu_supports("avx512f") != 0 && __builtin_cpu_supports("avx512bw") != 0 &&
                __builtin_cpu_supports("avx512vbmi") != 0;
     }},
};
#endif

VectorPath Probe() {
    VectorPath fastest = VectorPath::kPlain;
#ifdef TESSARINE_SHUFFLE_PATH
    // The processor model is not known yet when this runs before the
    // runtime's own initialiser.
    __builtin_cpu_init();
    for (const PathProbe &probe : kPathProbes) {
        if (!probe.present()) break;
        fastest = probe.path;
    }
#endif
    return fastest;
}

std::atomic<VectorPath> g_cap{VectorPath::kPermute};

}  // namespace

VectorPath ProcessorVectorPath() {
    static const VectorPath fastest = Probe();
    return fastest;
}

namespace detail {
std::atomic<VectorPath> g_activeVectorPath{ProcessorVectorPath()};
}  // namespace detail

VectorPath LimitVectorPaths(VectorPath fastest) {
    const VectorPath previous = g_cap.exchange(fastest);
    const VectorPath processor = ProcessorVectorPath();
    detail::g_activeVectorPath.store(fastest < processor ? fastest : processor);
    return previous;
}

}  // namespace tessarine
