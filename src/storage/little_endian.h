// Little-endian fields of the on-disk records, read and written byte by byte
// so that no record layout of this machine reaches a file.
#pragma once

#include <bit>
#include <cstdint>

namespace tessarine::storage {

inline void PutU32(uint8_t *at, uint32_t v) {
    at[0] = static_cast<uint8_t>(v);
    at[1] = static_cast<uint8_t>(v >> 8);
    at[2] = static_cast<uint8_t>(v >> 16);
    at[3] = static_cast<uint8_t>(v >> 24);
}
inline uint32_t GetU32(const uint8_t *at) {
    return uint32_t{at[0]} | uint32_t{at[1]} << 8 | uint32_t{at[2]} << 16 | uint32_t{at[3]} << 24;
}
inline void PutI32(uint8_t *at, int32_t v) { PutU32(at, static_cast<uint32_t>(v)); }
inline int32_t GetI32(const uint8_t *at) { return static_cast<int32_t>(GetU32(at)); }
inline void PutF64(uint8_t *at, double v) {
    const auto bits = std::bit_cast<uint64_t>(v);
    PutU32(at, static_cast<uint32_t>(bits));
    PutU32(at + 4, static_cast<uint32_t>(bits >> 32));
}
inline double GetF64(const uint8_t *at) {
    return std::bit_cast<double>(uint64_t{GetU32(at)} | uint64_t{GetU32(at + 4)} << 32);
}

}  // namespace tessarine::storage
