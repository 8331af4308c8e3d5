// The raw file layer: the runtime's descriptor calls folded into statuses.
// Every failure is -50; seek, tell, read and write failures keep errno.
#include <cerrno>

#include <tessarine/storage.h>

#include "core/status.h"
#include "platform/file_runtime.h"
#include "storage/raw_file.h"

namespace rt = tessarine::platform;
using tessarine::kErrFileAccess;
using tessarine::kOk;

extern "C" {

TESSARINE_API int32_t FM_LastErrno = 0;

}

namespace {

constexpr int32_t kCreateFlags = rt::kO_BINARY | rt::kO_CREAT;  // 0x8100
constexpr int32_t kOwnerReadWrite = rt::kS_IREAD | rt::kS_IWRITE;  // 0x180

int32_t RecordErrno() {
    FM_LastErrno = errno;
    return kErrFileAccess;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t FM_Create(const char *path, int8_t mode, int32_t *fd) {
    *fd = rt::_open(path, static_cast<int32_t>(mode) | kCreateFlags, kOwnerReadWrite);
    return *fd < 1 ? kErrFileAccess : kOk;
}

TESSARINE_API int32_t FM_Open(const char *path, int8_t mode, int32_t *fd) {
    *fd = rt::_open(path, static_cast<int32_t>(mode) | rt::kO_BINARY);
    return *fd < 1 ? kErrFileAccess : kOk;
}

TESSARINE_API int32_t FM_Delete(const char *path) {
    return rt::_unlink(path) != 0 ? kErrFileAccess : kOk;
}

TESSARINE_API int32_t FM_Seek(int32_t fd, int32_t origin, int32_t offset) {
    return rt::_lseek(fd, offset, origin) == -1 ? RecordErrno() : kOk;
}

TESSARINE_API int32_t FM_Tell(int32_t fd, int32_t *position) {
    *position = rt::_tell(fd);
    return *position == -1 ? RecordErrno() : kOk;
}

TESSARINE_API int32_t FM_Close(int32_t fd) {
    if (fd < 1) return kOk;
    return rt::_close(fd) != 0 ? kErrFileAccess : kOk;
}

TESSARINE_API int32_t FM_Read(int32_t fd, void *buffer, uint32_t count) {
    const int32_t n = rt::_read(fd, buffer, count);
    return n < 0 || static_cast<uint32_t>(n) != count ? RecordErrno() : kOk;
}

TESSARINE_API int32_t FM_Write(int32_t fd, const void *buffer, uint32_t count) {
    const int32_t n = rt::_write(fd, buffer, count);
    return n < 0 || static_cast<uint32_t>(n) != count ? RecordErrno() : kOk;
}

TESSARINE_API int32_t FM_SeekAndRead(int32_t fd, int32_t offset, int32_t origin, void *buffer,
                                     uint32_t count) {
    if (rt::_lseek(fd, offset, origin) == -1) return RecordErrno();
    return FM_Read(fd, buffer, count);
}

TESSARINE_API int32_t FM_SeekAndWrite(int32_t fd, int32_t offset, int32_t origin,
                                      const void *buffer, uint32_t count) {
    if (rt::_lseek(fd, offset, origin) == -1) return RecordErrno();
    return FM_Write(fd, buffer, count);
}

}  // extern "C"

namespace tessarine::storage {

int32_t FM_SeekAndReadRows(int32_t fd, int32_t offset, unsigned char *rows0, int64_t stride,
                           uint32_t rowBytes, uint32_t rows) {
    if (rt::_lseek(fd, offset, 0) == -1) return RecordErrno();
    const int64_t n = rt::_readrows(fd, rows0, stride, rowBytes, rows);
    return n != int64_t{rowBytes} * rows ? RecordErrno() : kOk;
}

int32_t FM_SeekAndWriteRows(int32_t fd, int32_t offset, const unsigned char *rows0,
                            int64_t stride, uint32_t rowBytes, uint32_t rows) {
    if (rt::_lseek(fd, offset, 0) == -1) return RecordErrno();
    const int64_t n = rt::_writerows(fd, rows0, stride, rowBytes, rows);
    return n != int64_t{rowBytes} * rows ? RecordErrno() : kOk;
}

}  // namespace tessarine::storage
