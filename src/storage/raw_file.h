// Internal services of the raw file layer.
#pragma once

#include <cstdint>

namespace tessarine::storage {

// Makes a scratch file in the scratch directory with the prefix "KLOD", puts
// its path in `path` (at least 513 bytes) and its descriptor in `fd`.
// Returns 10 or -50.
int16_t FM_CreateScratchFile(char *path, int32_t *fd);

// Copies a zero-terminated text, terminator included; the caller's buffer
// decides the bound.
void FM_CopyPath(const char *source, char *destination);

}  // namespace tessarine::storage
