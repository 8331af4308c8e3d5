// A 16384 by 16384 8-bit image saved to and read from a tile file with the
// plain block transfers, against a raw write and read of the same bytes over
// the same stretch of the same file, taken in turn.
#include <fcntl.h>
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

double Seconds(void (*fn)(Fixture &), Fixture &f) {
    const auto t0 = std::chrono::steady_clock::now();
    fn(f);
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - t0).count();
}

// The transfer and its raw baseline, both warmed first (the file written
// whole, so that neither side pays for a growing file), then taken in turn,
// the order alternating; the median of the per-pair ratios is reported.
void Paired(benchmark::State &state, const char *what, void (*subject)(Fixture &),
            void (*baseline)(Fixture &)) {
    Fixture &f = Get();
    RawWrite(f);
    TileSave(f);
    subject(f);
    baseline(f);
    std::vector<double> ratios;
    bool subjectFirst = false;
    for (auto _ : state) {
        double base, subj;
        if (subjectFirst) {
            subj = Seconds(subject, f);
            base = Seconds(baseline, f);
        } else {
            base = Seconds(baseline, f);
            subj = Seconds(subject, f);
        }
        subjectFirst = !subjectFirst;
        state.SetIterationTime(subj);
        ratios.push_back(base / subj);
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
    std::sort(ratios.begin(), ratios.end());
    tsbench::RecordRatio(std::string(what) + ", median of " + std::to_string(ratios.size()) +
                             " pairs taken in turn",
                         ratios[ratios.size() / 2], 0.8);
}

void BM_TileSaveAgainstRawWrite(benchmark::State &state) {
    Paired(state, "HVT_SaveBlock of 16384 x 16384 8-bit vs raw write", TileSave, RawWrite);
}

void BM_TileReadAgainstRawRead(benchmark::State &state) {
    Paired(state, "HVT_ReadBlock of 16384 x 16384 8-bit vs raw read", TileRead, RawRead);
    TileRead(Get());  // the raw side left the bytes in file order
    if (std::memcmp(Get().back.data(), Get().image.data(), kBytes) != 0) std::abort();
}

BENCHMARK(BM_TileSaveAgainstRawWrite)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(11);
BENCHMARK(BM_TileReadAgainstRawRead)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(11);

}  // namespace

TSBENCH_MAIN()
