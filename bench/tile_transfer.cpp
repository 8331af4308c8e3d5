// A 16384 by 16384 8-bit image saved to and read from a tile file with the
// plain block transfers, against two raw transfers of the same bytes over the
// same stretch of the same file, taken in turn: one call for the whole
// stretch into one run of memory, and one call per tile between the tile's
// bytes and the image rows they belong to (the least any tile-shaped transfer
// of the caller's rows has to do: the same calls, nothing else).
#include <fcntl.h>
#include <sys/uio.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <tessarine/storage.h>

#include "bench_ratio.h"

namespace {

constexpr int32_t kSide = 16384;
constexpr size_t kBytes = size_t{kSide} * kSide;

struct Fixture {
    std::vector<uint8_t> image;
    std::vector<uint8_t> back;
    char tilePath[513] = "";
    int32_t tileFd = -1;
    HVT_FileInfo info;
    int rawFd = -1;      // a descriptor of its own on the tile file
    off_t pixelsAt = 0;  // where the tiles' bytes begin in it

    Fixture() : image(kBytes), back(kBytes) {
        for (size_t i = 0; i < kBytes; i += 4096) image[i] = static_cast<uint8_t>(i >> 12);
        if (HVT_CreateBlankTileBmpFile(2, 8, kSide, kSide, 300, 300, 0, 0, nullptr, tilePath,
                                       &tileFd, 1, 0, 0) != TS_OK)
            std::abort();
        HVT_InitFileInfo(&info);
        BI_Bitmap view;
        std::memset(&view, 0, sizeof view);
        view.tileFile = tileFd;
        std::strcpy(view.tilePath, tilePath);
        if (HVT_TileFileBegin(&view, &info, 0) != TS_OK) std::abort();
        if (HVT_GetSubbmpTileHdrs(0, &info) != TS_OK) std::abort();
        // The raw side moves the same bytes over the same stretch of the same
        // file: the tiles lie one after another from the first one's offset.
        pixelsAt = info.subbmps[0].tileHdrs[0].offset;
        rawFd = ::open(tilePath, O_RDWR | O_CLOEXEC);
        if (rawFd < 0) std::abort();
    }
    ~Fixture() {
        ::close(rawFd);
        HVT_TileFileEnd(&info, 0);
        FM_Close(tileFd);
        FM_Delete(tilePath);
    }
};

Fixture &Get() {
    static Fixture f;
    return f;
}

const HVT_Box kWhole{0, 0, kSide, kSide};

void TileSave(Fixture &f) {
    if (HVT_SaveBlock(0, &f.info, &kWhole, kSide, f.image.data()) != TS_OK) std::abort();
}

void TileRead(Fixture &f) {
    if (HVT_ReadBlock(0, &f.info, &kWhole, kSide, f.back.data()) != TS_OK) std::abort();
}

void RawWrite(Fixture &f) {
    for (size_t done = 0; done < kBytes;) {
        const ssize_t n = ::pwrite(f.rawFd, f.image.data() + done, kBytes - done, f.pixelsAt + off_t(done));
        if (n <= 0) std::abort();
        done += size_t(n);
    }
}

void RawRead(Fixture &f) {
    for (size_t done = 0; done < kBytes;) {
        const ssize_t n = ::pread(f.rawFd, f.back.data() + done, kBytes - done, f.pixelsAt + off_t(done));
        if (n <= 0) std::abort();
        done += size_t(n);
    }
}

// Each tile's rows, in the rows of `pixels` where they belong.
template <class Transfer>
void PerTile(Fixture &f, uint8_t *pixels, Transfer &&transfer) {
    const HVT_SubbmpSlot &slot = f.info.subbmps[0];
    std::vector<iovec> rows;
    for (int32_t i = 0; i < slot.tilesAcross * slot.tilesDown; ++i) {
        const HVT_TileHdr &t = slot.tileHdrs[i];
        const size_t rowBytes = size_t(t.right - t.left);
        rows.clear();
        for (int32_t y = t.top; y < t.bottom; ++y)
            rows.push_back({pixels + size_t(y) * kSide + size_t(t.left), rowBytes});
        for (size_t done = 0; done < rows.size();) {
            const size_t n = std::min<size_t>(rows.size() - done, IOV_MAX);
            const off_t at = t.offset + off_t(done * rowBytes);
            if (transfer(rows.data() + done, int(n), at) != ssize_t(n * rowBytes)) std::abort();
            done += n;
        }
    }
}

void RawWritePerTile(Fixture &f) {
    PerTile(f, f.image.data(), [&](const iovec *v, int n, off_t at) { return ::pwritev(f.rawFd, v, n, at); });
}

void RawReadPerTile(Fixture &f) {
    PerTile(f, f.back.data(), [&](const iovec *v, int n, off_t at) { return ::preadv(f.rawFd, v, n, at); });
}

double Seconds(void (*fn)(Fixture &), Fixture &f) {
    const auto t0 = std::chrono::steady_clock::now();
    fn(f);
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - t0).count();
}

double Median(std::vector<double> v) {
    std::sort(v.begin(), v.end());
    return v[v.size() / 2];
}

// The transfer and its two raw baselines, all warmed first (the file written
// whole, so that no side pays for a growing file), then taken in turn, the
// order rotating; the medians of the per-round ratios are reported.
void Paired(benchmark::State &state, const char *what, void (*subject)(Fixture &),
            void (*raw)(Fixture &), void (*rawPerTile)(Fixture &)) {
    Fixture &f = Get();
    RawWrite(f);
    TileSave(f);
    void (*const sides[3])(Fixture &) = {subject, raw, rawPerTile};
    for (auto side : sides) side(f);
    std::vector<double> vsRaw, vsPerTile, perTileVsRaw;
    int first = 0;
    for (auto _ : state) {
        double t[3];
        for (int k = 0; k < 3; ++k) {
            const int side = (first + k) % 3;
            t[side] = Seconds(sides[side], f);
        }
        first = (first + 1) % 3;
        state.SetIterationTime(t[0]);
        vsRaw.push_back(t[1] / t[0]);
        vsPerTile.push_back(t[2] / t[0]);
        perTileVsRaw.push_back(t[1] / t[2]);
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
    const std::string rounds = ", median of " + std::to_string(vsRaw.size()) + " rounds taken in turn";
    tsbench::RecordRatio(std::string(what) + " vs raw, one call" + rounds, Median(vsRaw), 0.8);
    tsbench::RecordRatio(std::string(what) + " vs raw, one call per tile into the image rows" + rounds,
                         Median(vsPerTile));
    tsbench::RecordRatio(std::string("raw, one call per tile, vs raw, one call (") + what + ")" + rounds,
                         Median(perTileVsRaw));
}

void BM_TileSaveAgainstRawWrite(benchmark::State &state) {
    Paired(state, "HVT_SaveBlock of 16384 x 16384 8-bit, write", TileSave, RawWrite, RawWritePerTile);
}

void BM_TileReadAgainstRawRead(benchmark::State &state) {
    Paired(state, "HVT_ReadBlock of 16384 x 16384 8-bit, read", TileRead, RawRead, RawReadPerTile);
    TileRead(Get());  // the one-call raw side left the bytes in file order
    if (std::memcmp(Get().back.data(), Get().image.data(), kBytes) != 0) std::abort();
}

BENCHMARK(BM_TileSaveAgainstRawWrite)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(11);
BENCHMARK(BM_TileReadAgainstRawRead)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(11);

}  // namespace

TSBENCH_MAIN()
