// Internal services of the raw file layer.
#pragma once

#include <cstddef>
#include <cstdint>

namespace tessarine::storage {

// Makes a scratch file in the scratch directory with the prefix "KLOD", puts
// its path in `path` (at least 513 bytes) and its descriptor in `fd`.
// Returns 10 or -50.
int16_t FM_CreateScratchFile(char *path, int32_t *fd);

// Longest scratch path that fits a bitmap's tilePath, terminator included.
inline constexpr size_t kScratchPathBytes = 513;

// Positions at `offset` and reads `rows` runs of `rowBytes` bytes that follow
// one another in the file into memory rows `stride` apart: one seek and one
// read, with the statuses and errno of FM_SeekAndRead.
int32_t FM_SeekAndReadRows(int32_t fd, int32_t offset, unsigned char *rows0, int64_t stride,
                           uint32_t rowBytes, uint32_t rows);
// The same from memory rows to one run in the file.
int32_t FM_SeekAndWriteRows(int32_t fd, int32_t offset, const unsigned char *rows0,
                            int64_t stride, uint32_t rowBytes, uint32_t rows);

// Copies a zero-terminated text, terminator included; the caller's buffer
// decides the bound.
void FM_CopyPath(const char *source, char *destination);

}  // namespace tessarine::storage
