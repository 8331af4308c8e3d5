#include <tessarine/profile.hpp>

TESSARINE_API int RenderingIntentR27ToColorDev(int const &intent) {
    return intent >= 0 && intent <= 5 ? intent : -1;
}

// Each flag after the first needs b: they refine what b switches on.
TESSARINE_API unsigned long getICCProfileFlags(int a, int b, int c, int d, int e) {
    unsigned long flags = 0;
    if (a != 0) flags |= 1;
    if (b != 0) {
        flags |= 2;
        if (c != 0) {
            flags |= 4;
            if (d != 0) flags |= 8;
        }
        if (e != 0) flags |= 16;
    }
    return flags;
}
