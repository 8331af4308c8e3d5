// Status values that the library raises. A status is read from the low 16
// bits of a result, as a signed value.
#pragma once

#include <cstdint>

namespace tessarine {

inline constexpr int32_t kOk = 10;
inline constexpr int32_t kErrGeneral = -1;
inline constexpr int32_t kErrUnsupported = -2;
inline constexpr int32_t kErrDegenerate = -3;
inline constexpr int32_t kErrArgument = -4;
inline constexpr int32_t kErrMemory = -5;
inline constexpr int32_t kErrEmptyList = -6;
inline constexpr int32_t kErrNoRealRoot = -7;
inline constexpr int32_t kErrSelector = -14;
inline constexpr int32_t kErrTooComplex = -21;
inline constexpr int32_t kErrCancelled = -18;
inline constexpr int32_t kErrBudget = -29;
inline constexpr int32_t kErrTooLarge = -40;
inline constexpr int32_t kErrFileAccess = -50;
inline constexpr int32_t kErrStackOverflow = -56;

inline constexpr int16_t StatusOf(int32_t result) { return static_cast<int16_t>(result); }
inline constexpr bool Failed(int32_t result) { return StatusOf(result) < 0; }

}  // namespace tessarine
