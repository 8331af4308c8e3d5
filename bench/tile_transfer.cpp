// A 16384 by 16384 8-bit image saved to and read from a tile file with the
// plain block transfers, against a raw write and read of the same bytes to a
// file in the same folder.
#include <fcntl.h>
#include <unistd.h>

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
    std::string rawPath;
    int rawFd = -1;

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
        // The raw file sits beside the tile file.
        rawPath = std::string(tilePath) + ".raw";
        rawFd = ::open(rawPath.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
        if (rawFd < 0) std::abort();
    }
    ~Fixture() {
        HVT_TileFileEnd(&info, 0);
        FM_Close(tileFd);
        FM_Delete(tilePath);
        ::close(rawFd);
        ::unlink(rawPath.c_str());
    }
};

Fixture &Get() {
    static Fixture f;
    return f;
}

const HVT_Box kWhole{0, 0, kSide, kSide};

void BM_TileSave(benchmark::State &state) {
    Fixture &f = Get();
    for (auto _ : state)
        if (HVT_SaveBlock(0, &f.info, &kWhole, kSide, f.image.data()) != TS_OK) std::abort();
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

void BM_TileRead(benchmark::State &state) {
    Fixture &f = Get();
    for (auto _ : state)
        if (HVT_ReadBlock(0, &f.info, &kWhole, kSide, f.back.data()) != TS_OK) std::abort();
    if (std::memcmp(f.back.data(), f.image.data(), kBytes) != 0) std::abort();
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

void BM_RawWrite(benchmark::State &state) {
    Fixture &f = Get();
    for (auto _ : state) {
        if (::lseek(f.rawFd, 0, SEEK_SET) != 0) std::abort();
        for (size_t done = 0; done < kBytes;) {
            const ssize_t n = ::write(f.rawFd, f.image.data() + done, kBytes - done);
            if (n <= 0) std::abort();
            done += size_t(n);
        }
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

void BM_RawRead(benchmark::State &state) {
    Fixture &f = Get();
    for (auto _ : state) {
        if (::lseek(f.rawFd, 0, SEEK_SET) != 0) std::abort();
        for (size_t done = 0; done < kBytes;) {
            const ssize_t n = ::read(f.rawFd, f.back.data() + done, kBytes - done);
            if (n <= 0) std::abort();
            done += size_t(n);
        }
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kBytes);
}

// Writes before reads, so that each read finds its file written. Five
// repetitions each: the ratio is of the means.
BENCHMARK(BM_RawWrite)->Unit(benchmark::kMillisecond)->Repetitions(5)->ReportAggregatesOnly(true);
BENCHMARK(BM_TileSave)->Unit(benchmark::kMillisecond)->Repetitions(5)->ReportAggregatesOnly(true);
BENCHMARK(BM_RawRead)->Unit(benchmark::kMillisecond)->Repetitions(5)->ReportAggregatesOnly(true);
BENCHMARK(BM_TileRead)->Unit(benchmark::kMillisecond)->Repetitions(5)->ReportAggregatesOnly(true);

const bool kRatios = [] {
    tsbench::AddRatio("BM_TileSave/repeats:5", "BM_RawWrite/repeats:5", 0.8);
    tsbench::AddRatio("BM_TileRead/repeats:5", "BM_RawRead/repeats:5", 0.8);
    return true;
}();

}  // namespace

TSBENCH_MAIN()
