// Scratch files: a fresh file of a unique name in the scratch directory
// ($TMPDIR when it names a directory, else /tmp), created exclusively so that
// no one else's file is ever taken; and the path copy with which the tile
// and block files hand a path back (no bound: the name made here is checked
// against the caller's field before it is copied).
#include <cstring>

#include "core/status.h"
#include "platform/file_runtime.h"
#include "platform/heap.h"
#include "storage/raw_file.h"

namespace tessarine::storage {
namespace {

constexpr char kScratchDirectory[] = "c:\\tmp";
constexpr char kScratchPrefix[] = "KLOD";
// Binary, read and write, create; exclusive so that a scratch name is never
// shared with a file someone else made in the meantime.
constexpr int32_t kScratchFlags =
    platform::kO_BINARY | platform::kO_CREAT | platform::kO_RDWR | platform::kO_EXCL;
constexpr int32_t kOwnerReadWrite = platform::kS_IREAD | platform::kS_IWRITE;

}  // namespace

int16_t FM_CreateScratchFile(char *path, int32_t *fd) {
    char *name = platform::_tempnam(kScratchDirectory, kScratchPrefix);
    if (name == nullptr) return kErrFileAccess;
    if (std::strlen(name) >= kScratchPathBytes) {  // would not fit the caller's field
        platform::GlobalFree(name);
        return kErrFileAccess;
    }
    FM_CopyPath(name, path);
    *fd = platform::_open(path, kScratchFlags, kOwnerReadWrite);
    platform::GlobalFree(name);
    if (*fd < 1) {
        // The exclusive open failed: whatever has that name is not ours, and
        // a caller that deletes a set path after a failure must leave it be.
        path[0] = '\0';
        return kErrFileAccess;
    }
    return kOk;
}

void FM_CopyPath(const char *source, char *destination) {
    while ((*destination++ = *source++) != '\0') {
    }
}

}  // namespace tessarine::storage
