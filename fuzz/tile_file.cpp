// Arbitrary bytes as a tile file: open it, load each sub-bitmap's tile table
// and read the whole of each sub-bitmap, plainly and bit-shifted. Any input
// must end in a status, never a crash, a hang or a sanitizer report.
#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "fuzz_input.h"
#include <tessarine/storage.h>

namespace {

const std::string &InputPath() { return ScratchInputPath("tile-fuzz"); }

void WriteInput(const uint8_t *data, size_t size) {
    const int fd = ::open(InputPath().c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
    if (fd < 0) std::abort();
    for (size_t done = 0; done < size;) {
        const ssize_t n = ::write(fd, data + done, size - done);
        if (n <= 0) std::abort();
        done += static_cast<size_t>(n);
    }
    ::close(fd);
}

constexpr int64_t kMaxBuffer = 8 << 20;

void ReadWhole(HVT_FileInfo *info, uint8_t sub) {
    if (HVT_GetSubbmpTileHdrs(sub, info) != TS_OK) return;
    const HVT_SubbmpSlot &slot = info->subbmps[sub];
    const int64_t d = info->header->bitsPerPixel;
    int64_t w = slot.width, h = slot.height;
    if (w <= 0 || h <= 0) {
        w = 16;
        h = 4;
    }
    // One byte more per row than the box needs: the caller's side of the contract.
    const int64_t stride = (w * d + 7) / 8 + 1;
    if (stride > kMaxBuffer / h) {
        w = 64;
        h = 64;
    }
    const int64_t rowBytes = (w * d + 7) / 8 + 1;
    std::vector<uint8_t> buffer(static_cast<size_t>(rowBytes * h + 1));
    const HVT_Box whole{0, 0, static_cast<int32_t>(w), static_cast<int32_t>(h)};
    HVT_ReadBlock(sub, info, &whole, static_cast<int32_t>(rowBytes), buffer.data());
    const HVT_Box shifted{1, 0, static_cast<int32_t>(w), static_cast<int32_t>(h)};
    HVT_ReadBlockWithBitShift(sub, info, &shifted, static_cast<int32_t>(rowBytes), buffer.data());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    WriteInput(data, size);
    BI_Bitmap view;
    std::memset(&view, 0, sizeof view);
    view.tileFile = -1;
    std::snprintf(view.tilePath, sizeof view.tilePath, "%s", InputPath().c_str());
    HVT_FileInfo info;
    HVT_InitFileInfo(&info);
    if (HVT_TileFileBegin(&view, &info, 1) == TS_OK) {
        const int count = info.header->subbmpCount;
        for (int sub = 0; sub <= count && sub < HVT_MAX_SUBBMPS; ++sub)
            ReadWhole(&info, static_cast<uint8_t>(sub));
        ReadWhole(&info, HVT_MAX_SUBBMPS);  // refused
    }
    HVT_TileFileEnd(&info, 1);
    ::unlink(InputPath().c_str());
    return 0;
}
