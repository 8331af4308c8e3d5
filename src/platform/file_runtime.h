// The C runtime's descriptor calls, with the original flag words mapped by
// meaning onto POSIX. Offsets stay 32-bit. Reads, writes and seeks can be made
// to fail from tests.
#pragma once

#include <cstdint>

namespace tessarine::platform {

// Flag words of the runtime.
inline constexpr int32_t kO_RDONLY = 0x0000;
inline constexpr int32_t kO_WRONLY = 0x0001;
inline constexpr int32_t kO_RDWR = 0x0002;
inline constexpr int32_t kO_APPEND = 0x0008;
inline constexpr int32_t kO_CREAT = 0x0100;
inline constexpr int32_t kO_TRUNC = 0x0200;
inline constexpr int32_t kO_EXCL = 0x0400;
inline constexpr int32_t kO_TEXT = 0x4000;
inline constexpr int32_t kO_BINARY = 0x8000;
// Permission word: owner read (0x100) and write (0x80).
inline constexpr int32_t kS_IREAD = 0x0100;
inline constexpr int32_t kS_IWRITE = 0x0080;

// Every descriptor is close-on-exec. Access 3 is invalid (EINVAL).
int32_t _open(const char *path, int32_t flags, int32_t permission = 0);
// Bytes moved (whole count unless end of file), or -1.
int32_t _read(int32_t fd, void *buffer, uint32_t count);
int32_t _write(int32_t fd, const void *buffer, uint32_t count);
// New position, or -1 (also when it would pass a signed 32-bit offset).
int32_t _lseek(int32_t fd, int32_t offset, int32_t origin);
int32_t _tell(int32_t fd);
// Length of the open file, or -1.
int64_t _filelength(int32_t fd);
// Reads `rows` runs of `rowBytes` bytes that follow one another in the file,
// from the current position, into memory rows `stride` bytes apart; counts as
// one read. Bytes moved, or -1.
int64_t _readrows(int32_t fd, unsigned char *rows0, int64_t stride, uint32_t rowBytes,
                  uint32_t rows);
// The opposite: memory rows `stride` apart to one run in the file; one write.
int64_t _writerows(int32_t fd, const unsigned char *rows0, int64_t stride, uint32_t rowBytes,
                   uint32_t rows);
int32_t _close(int32_t fd);
int32_t _unlink(const char *path);
// A fresh name in the scratch directory with the prefix: $TMPDIR when it names
// a directory, otherwise /tmp. `directory`, the original's preference, does
// not exist here and is not consulted. Freed with GlobalFree. Null on failure.
char *_tempnam(const char *directory, const char *prefix);

}  // namespace tessarine::platform
