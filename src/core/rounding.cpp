// Rounding to integers; the caller takes the low half it needs.
#include <tessarine/core.h>

#include "core/rounding.h"

extern "C" {

TESSARINE_API int32_t ShortRound(double x) {
    return tessarine::detail::ShortRoundRule(x);
}

TESSARINE_API int32_t LongRound(double x) {
    return tessarine::detail::LongRoundRule(x);
}

}  // extern "C"
