// Which vector paths this processor can take; asked once.
#pragma once

#if defined(__x86_64__) || defined(__i386__)
#include <immintrin.h>
#define TESSARINE_SHUFFLE_PATH 1
#endif

namespace tessarine::bitmap {

#ifdef TESSARINE_SHUFFLE_PATH
// Byte shuffles (SSSE3). The probe runs at first call, after the processor
// model is known, rather than in a static initialiser that may run first.
inline bool HasByteShuffle() {
    static const bool has = [] {
        __builtin_cpu_init();
        return __builtin_cpu_supports("ssse3") != 0;
    }();
    return has;
}

// 256-bit byte shuffles (AVX2).
inline bool HasWideShuffle() {
    static const bool has = HasByteShuffle() && __builtin_cpu_supports("avx2") != 0;
    return has;
}

// 512-bit byte permutes (AVX-512 VBMI).
inline bool HasBytePermute() {
    static const bool has = HasWideShuffle() && __builtin_cpu_supports("avx512f") != 0 &&
                            __builtin_cpu_supports("avx512bw") != 0 &&
                            __builtin_cpu_supports("avx512vbmi") != 0;
    return has;
}
#endif

}  // namespace tessarine::bitmap
