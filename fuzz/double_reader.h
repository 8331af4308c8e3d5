// Reads a fuzz input as a run of doubles and bytes; past its end, zeros.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

struct DoubleReader {
    const uint8_t *data;
    size_t size;
    double Next() {
        double v = 0;
        if (size >= sizeof v) {
            std::memcpy(&v, data, sizeof v);
            data += sizeof v;
            size -= sizeof v;
        }
        return v;
    }
    uint8_t Byte() {
        if (size == 0) return 0;
        const uint8_t b = *data;
        ++data;
        --size;
        return b;
    }
};
