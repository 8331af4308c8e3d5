#include "platform/file_runtime.h"

#include <fcntl.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "platform/heap.h"
#include "platform/injection.h"

namespace tessarine::platform {
namespace {

bool FailInjected(injection::Slot slot) {
    if (!injection::ShouldFail(slot)) return false;
    errno = EIO;
    return true;
}

bool IsDirectory(const char *path) {
    struct stat st{};
    return path != nullptr && *path != '\0' && ::stat(path, &st) == 0 && S_ISDIR(st.st_mode);
}

const char *ScratchDirectory() {
    const char *tmpdir = std::getenv("TMPDIR");
    if (IsDirectory(tmpdir)) return tmpdir;
    return IsDirectory("/tmp") ? "/tmp" : nullptr;
}

// Gathers up to IOV_MAX rows at a time; a short transfer ends the loop.
template <class Byte, class Call>
int64_t TransferRows(Byte *rows0, int64_t stride, uint32_t rowBytes, uint32_t rows, Call call) {
    constexpr uint32_t kBatch = 512;
    int64_t done = 0;
    for (uint32_t row = 0; row < rows;) {
        const uint32_t batch = rows - row < kBatch ? rows - row : kBatch;
        iovec iov[kBatch];
        for (uint32_t i = 0; i < batch; ++i) {
            iov[i].iov_base = const_cast<unsigned char *>(rows0 + (int64_t{row} + i) * stride);
            iov[i].iov_len = rowBytes;
        }
        const size_t want = size_t{batch} * rowBytes;
        size_t got = 0;
        iovec *at = iov;
        int left = static_cast<int>(batch);
        while (got < want) {
            const ssize_t n = call(at, left);
            if (n < 0) {
                if (errno == EINTR) continue;
                return done + static_cast<int64_t>(got) > 0 ? done + static_cast<int64_t>(got) : -1;
            }
            if (n == 0) return done + static_cast<int64_t>(got);
            got += static_cast<size_t>(n);
            size_t skip = static_cast<size_t>(n);
            while (left > 0 && skip >= at->iov_len) {
                skip -= at->iov_len;
                ++at;
                --left;
            }
            if (left > 0 && skip > 0) {
                at->iov_base = static_cast<unsigned char *>(at->iov_base) + skip;
                at->iov_len -= skip;
            }
        }
        done += static_cast<int64_t>(got);
        row += batch;
    }
    return done;
}

}  // namespace

int32_t _open(const char *path, int32_t flags, int32_t permission) {
    int posixFlags = O_CLOEXEC;
    switch (flags & 3) {
        case kO_RDONLY: posixFlags |= O_RDONLY; break;
        case kO_WRONLY: posixFlags |= O_WRONLY; break;
        case kO_RDWR: posixFlags |= O_RDWR; break;
        default: errno = EINVAL; return -1;
    }
    if (flags & kO_APPEND) posixFlags |= O_APPEND;
    if (flags & kO_CREAT) posixFlags |= O_CREAT;
    if (flags & kO_TRUNC) posixFlags |= O_TRUNC;
    if (flags & kO_EXCL) posixFlags |= O_EXCL;
    mode_t mode = 0;
    if (permission & kS_IREAD) mode |= S_IRUSR;
    if (permission & kS_IWRITE) mode |= S_IWUSR;
    if (path == nullptr) {
        errno = EFAULT;
        return -1;
    }
    return ::open(path, posixFlags, mode);
}

int32_t _read(int32_t fd, void *buffer, uint32_t count) {
    if (FailInjected(injection::kRead)) return -1;
    if (count > INT32_MAX) {
        errno = EINVAL;
        return -1;
    }
    auto *at = static_cast<unsigned char *>(buffer);
    uint32_t done = 0;
    while (done < count) {
        const ssize_t n = ::read(fd, at + done, count - done);
        if (n < 0) {
            if (errno == EINTR) continue;
            return -1;
        }
        if (n == 0) break;
        done += static_cast<uint32_t>(n);
    }
    return static_cast<int32_t>(done);
}

int32_t _write(int32_t fd, const void *buffer, uint32_t count) {
    if (FailInjected(injection::kWrite)) return -1;
    if (count > INT32_MAX) {
        errno = EINVAL;
        return -1;
    }
    const auto *at = static_cast<const unsigned char *>(buffer);
    uint32_t done = 0;
    while (done < count) {
        const ssize_t n = ::write(fd, at + done, count - done);
        if (n < 0) {
            if (errno == EINTR) continue;
            return done ? static_cast<int32_t>(done) : -1;
        }
        if (n == 0) break;
        done += static_cast<uint32_t>(n);
    }
    return static_cast<int32_t>(done);
}

int32_t _lseek(int32_t fd, int32_t offset, int32_t origin) {
    if (FailInjected(injection::kSeek)) return -1;
    int whence;
    switch (origin) {
        case 0: whence = SEEK_SET; break;
        case 1: whence = SEEK_CUR; break;
        case 2: whence = SEEK_END; break;
        default: errno = EINVAL; return -1;
    }
    if (whence != SEEK_SET) {
        // Refuse before moving when the result would pass a 32-bit offset;
        // a refused seek leaves the position where it was.
        off_t base;
        if (whence == SEEK_CUR) {
            base = ::lseek(fd, 0, SEEK_CUR);
        } else {
            struct stat st{};
            base = ::fstat(fd, &st) == 0 ? st.st_size : -1;
        }
        if (base < 0) return -1;
        const off_t target = base + offset;
        if (target < 0 || target > INT32_MAX) {
            errno = target < 0 ? EINVAL : EOVERFLOW;
            return -1;
        }
        return static_cast<int32_t>(::lseek(fd, target, SEEK_SET));
    }
    const off_t at = ::lseek(fd, offset, SEEK_SET);
    return at < 0 ? -1 : static_cast<int32_t>(at);
}

int32_t _tell(int32_t fd) {
    if (FailInjected(injection::kSeek)) return -1;
    const off_t at = ::lseek(fd, 0, SEEK_CUR);
    if (at > INT32_MAX) {
        errno = EOVERFLOW;
        return -1;
    }
    return at < 0 ? -1 : static_cast<int32_t>(at);
}

int64_t _filelength(int32_t fd) {
    struct stat st{};
    return ::fstat(fd, &st) == 0 ? static_cast<int64_t>(st.st_size) : -1;
}

int64_t _readrows(int32_t fd, unsigned char *rows0, int64_t stride, uint32_t rowBytes,
                  uint32_t rows) {
    if (FailInjected(injection::kRead)) return -1;
    return TransferRows(rows0, stride, rowBytes, rows,
                        [fd](iovec *iov, int n) { return ::readv(fd, iov, n); });
}

int64_t _writerows(int32_t fd, const unsigned char *rows0, int64_t stride, uint32_t rowBytes,
                   uint32_t rows) {
    if (FailInjected(injection::kWrite)) return -1;
    return TransferRows(rows0, stride, rowBytes, rows,
                        [fd](iovec *iov, int n) { return ::writev(fd, iov, n); });
}

int32_t _close(int32_t fd) { return ::close(fd); }

int32_t _unlink(const char *path) { return path ? ::unlink(path) : -1; }

char *_tempnam(const char *directory, const char *prefix) {
    (void)directory;
    const char *dir = ScratchDirectory();
    if (dir == nullptr) return nullptr;
    static constexpr char kAlphabet[] = "abcdefghijklmnopqrstuvwxyz0123456789";
    const size_t bytes = std::strlen(dir) + 1 + std::strlen(prefix) + 12 + 1;
    auto *name = static_cast<char *>(GlobalAlloc(GMEM_FIXED, bytes));
    if (name == nullptr) return nullptr;
    for (int attempt = 0; attempt < 64; ++attempt) {
        unsigned char noise[12];
        if (getrandom(noise, sizeof noise, 0) != static_cast<ssize_t>(sizeof noise)) break;
        char suffix[13];
        for (size_t i = 0; i < 12; ++i) suffix[i] = kAlphabet[noise[i] % 36];
        suffix[12] = '\0';
        std::snprintf(name, bytes, "%s/%s%s", dir, prefix, suffix);
        struct stat st{};
        if (::lstat(name, &st) != 0 && errno == ENOENT) return name;
    }
    GlobalFree(name);
    return nullptr;
}

}  // namespace tessarine::platform
