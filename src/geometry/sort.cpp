// Selection sort of small key and tag arrays; a tie keeps the earlier entry.
#include "geometry/kernel.h"

extern "C" TESSARINE_API void Sort_a(BZ_SortEntry *entries, int16_t count) {
    for (int i = 0; i < count; ++i) {
        int least = i;
        for (int j = i + 1; j < count; ++j)
            if (entries[j].key < entries[least].key) least = j;
        const double key = entries[i].key;
        const int16_t tag = entries[i].tag;
        entries[i].key = entries[least].key;
        entries[i].tag = entries[least].tag;
        entries[least].key = key;
        entries[least].tag = tag;
    }
}
