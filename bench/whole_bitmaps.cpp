// Whole-bitmap work against baselines taken in turn in the same run, the
// median ratio reported:
// - a half-size level by box averaging of a 16384 by 16384 8-bit tile file
//   against `vips shrink 2 2` (the same box average) and `vips reduce 2 2` on
//   the same pixels (libvips-tools; skipped when `vips` is not on the path);
// - BI_CopyBmp of a 16384 by 16384 RGB tile bitmap into a CMYK one (and back)
//   against a raw read of the source file plus a write of the same bytes;
//   RGB to CMYK reads each RGB row as 4-byte pixels, which leaves a band
//   buffer at its last row, so between tile files it stops there with -1
//   (printed as its status); the same copy from an RGB bitmap in memory, all
//   rows but the last (whose run would leave the pixel block), into a CMYK
//   tile bitmap runs whole, against a raw write of the bytes it writes;
// - BI_ConvertBmpToMem of the RGB bitmap against a raw read of its file.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <tessarine/tessarine.h>

#include "bench_ratio.h"

namespace {

constexpr int32_t kSide = 16384;
using Clock = std::chrono::steady_clock;

double Seconds(Clock::time_point a, Clock::time_point b) {
    return std::chrono::duration<double>(b - a).count();
}

std::string ScratchDir() {
    const char *t = std::getenv("TMPDIR");
    return t != nullptr && *t ? t : "/tmp";
}

// Reads a file whole in 1 MiB chunks; with `to` open, writes each chunk there.
int64_t RawPass(const char *path, int to = -1) {
    const int fd = ::open(path, O_RDONLY);
    if (fd < 0) std::abort();
    static std::vector<uint8_t> chunk(1 << 20);
    int64_t total = 0;
    for (ssize_t n; (n = ::read(fd, chunk.data(), chunk.size())) > 0;) {
        total += n;
        if (to >= 0 && ::write(to, chunk.data(), static_cast<size_t>(n)) != n) std::abort();
    }
    ::close(fd);
    return total;
}

double Median(std::vector<double> v) {
    std::sort(v.begin(), v.end());
    return v[v.size() / 2];
}

// Every row of a bitmap written through a band session.
template <class Row>
void WriteRows(BI_Bitmap *b, Row &&row) {
    HVT_TileFileRowIOBegin(2, b, nullptr, 2, 0, 0);
    for (int32_t y = 0; y < b->height; ++y) row(y);
    HVT_TileFileRowColIOEnd(b);
}

// ---- Levels -------------------------------------------------------------------

struct LevelFile {
    BI_Bitmap *bitmap = nullptr;
    HVT_FileInfo info;
    std::string raw, vin, vout;
    bool haveVips = false;

    LevelFile() {
        if (TS_FAILED(BI_CreateBlankBmp(2, 8, kSide, kSide, 300, 300, 1, 0, nullptr, &bitmap, 2, 0, 0, 0)))
            std::abort();
        std::vector<uint8_t> row(kSide);
        const std::string dir = ScratchDir();
        raw = dir + "/tessarine-bench-level.raw";
        vin = dir + "/tessarine-bench-level-in.v";
        vout = dir + "/tessarine-bench-level-out.v";
        FILE *rawFile = std::fopen(raw.c_str(), "wb");
        WriteRows(bitmap, [&](int32_t y) {
            for (int32_t x = 0; x < kSide; ++x) row[x] = static_cast<uint8_t>((x * 7 + y * 3) ^ (x >> 5));
            BI_SetGRow(y, 0, kSide, row.data(), bitmap);
            std::fwrite(row.data(), 1, row.size(), rawFile);
        });
        std::fclose(rawFile);
        HVT_InitFileInfo(&info);
        if (TS_FAILED(HVT_TileFileBegin(bitmap, &info, 0))) std::abort();
        HVT_FileHeader header = *info.header;
        if (TS_FAILED(HVT_AddSubbmp(bitmap->tileFile, &header, kSide / 2, kSide / 2, nullptr, nullptr)))
            std::abort();
        HVT_TileFileEnd(&info, 0);
        HVT_InitFileInfo(&info);
        if (TS_FAILED(HVT_TileFileBegin(bitmap, &info, 0))) std::abort();
        haveVips = std::system("command -v vips >/dev/null 2>&1") == 0;
        if (haveVips) {
            const std::string load = "vips rawload " + raw + " " + vin + " " + std::to_string(kSide) +
                                     " " + std::to_string(kSide) + " 1";
            haveVips = std::system(load.c_str()) == 0;
        }
        std::remove(raw.c_str());
    }
    ~LevelFile() {
        HVT_TileFileEnd(&info, 0);
        BI_DeleteBitmap(&bitmap);
        std::remove(vin.c_str());
        std::remove(vout.c_str());
    }
    double Level() {
        const auto t0 = Clock::now();
        if (TS_FAILED(HVT_UpdateLowRes(&info, 0, 1, nullptr))) std::abort();
        return Seconds(t0, Clock::now());
    }
    double Vips(const char *operation) {
        const std::string command = std::string("vips ") + operation + " " + vin + " " + vout + " 2 2";
        const auto t0 = Clock::now();
        if (std::system(command.c_str()) != 0) std::abort();
        const double s = Seconds(t0, Clock::now());
        std::remove(vout.c_str());
        return s;
    }
};

LevelFile &Levels() {
    static LevelFile file;
    return file;
}

void BM_HalfLevelByAveraging(benchmark::State &state) {
    LevelFile &f = Levels();
    f.Level();  // warm
    for (auto _ : state) state.SetIterationTime(f.Level());
    state.SetBytesProcessed(state.iterations() * int64_t{kSide} * kSide);
}

void BM_VipsShrink(benchmark::State &state) {
    LevelFile &f = Levels();
    if (!f.haveVips) {
        state.SkipWithError("vips not found");
        return;
    }
    f.Vips("shrink");
    for (auto _ : state) state.SetIterationTime(f.Vips("shrink"));
    state.SetBytesProcessed(state.iterations() * int64_t{kSide} * kSide);
}

void BM_VipsReduce(benchmark::State &state) {
    LevelFile &f = Levels();
    if (!f.haveVips) {
        state.SkipWithError("vips not found");
        return;
    }
    f.Vips("reduce");
    for (auto _ : state) state.SetIterationTime(f.Vips("reduce"));
    state.SetBytesProcessed(state.iterations() * int64_t{kSide} * kSide);
}

// The level and both vips operations taken in turn.
void BM_LevelPairedWithVips(benchmark::State &state) {
    LevelFile &f = Levels();
    if (!f.haveVips) {
        state.SkipWithError("vips not found");
        return;
    }
    f.Level();
    f.Vips("shrink");
    f.Vips("reduce");
    std::vector<double> shrink, reduce;
    for (auto _ : state) {
        const double a = f.Vips("shrink");
        const double ours = f.Level();
        const double b = f.Vips("reduce");
        state.SetIterationTime(ours);
        shrink.push_back(a / ours);
        reduce.push_back(b / ours);
    }
    const std::string pairs = std::to_string(shrink.size());
    tsbench::RecordRatio("half level by averaging vs vips shrink 2 2, median of " + pairs +
                             " taken in turn", Median(shrink), 1.0);
    tsbench::RecordRatio("half level by averaging vs vips reduce 2 2, median of " + pairs +
                             " taken in turn", Median(reduce), 1.0);
}

// ---- Copy and conversion ------------------------------------------------------------

struct RgbFile {
    BI_Bitmap *rgb = nullptr;
    BI_Bitmap *cmyk = nullptr;
    std::string scratch;

    RgbFile() {
        if (TS_FAILED(BI_CreateBlankBmp(4, 24, kSide, kSide, 300, 300, 1, 0, nullptr, &rgb, 2, 0, 0, 0)) ||
            TS_FAILED(BI_CreateBlankBmp(4, 32, kSide, kSide, 300, 300, 2, 0, nullptr, &cmyk, 2, 0, 0, 0)))
            std::abort();
        std::vector<uint8_t> r(kSide), g(kSide), b(kSide);
        WriteRows(rgb, [&](int32_t y) {
            for (int32_t x = 0; x < kSide; ++x) {
                r[x] = static_cast<uint8_t>(x + y);
                g[x] = static_cast<uint8_t>(x >> 3);
                b[x] = static_cast<uint8_t>(y * 7);
            }
            BI_SetRGBRow(y, 0, kSide, r.data(), g.data(), b.data(), rgb);
        });
        scratch = ScratchDir() + "/tessarine-bench-copy.raw";
    }
    ~RgbFile() {
        BI_DeleteBitmap(&rgb);
        BI_DeleteBitmap(&cmyk);
        std::remove(scratch.c_str());
    }
    // The scratch file stays between rounds, so that the raw side writes over
    // bytes that are there, as the copy writes over the destination's tiles.
    double RawReadWrite(const char *from) {
        const auto t0 = Clock::now();
        const int to = ::open(scratch.c_str(), O_WRONLY | O_CREAT, 0600);
        RawPass(from, to);
        ::close(to);
        return Seconds(t0, Clock::now());
    }
    double Copy(BI_Bitmap *from, BI_Bitmap *to, int32_t *status) {
        const RECT all{0, 0, kSide, kSide};
        const auto t0 = Clock::now();
        *status = TS_STATUS(BI_CopyBmp(&all, from, &all, to, 0, 0));
        return Seconds(t0, Clock::now());
    }
};

RgbFile &Rgb() {
    static RgbFile file;
    return file;
}

// Between tile files RGB to CMYK stops at the first band's last row, so
// only its status and time are printed; CMYK to RGB runs whole.
void BM_CopyRgbToCmykTileFiles(benchmark::State &state) {
    RgbFile &f = Rgb();
    const RECT all{0, 0, kSide, kSide};
    int32_t status = 0;
    for (auto _ : state) {
        const auto t0 = Clock::now();
        status = TS_STATUS(BI_CopyBmp(&all, f.rgb, &all, f.cmyk, 0, 0));
        state.SetIterationTime(Seconds(t0, Clock::now()));
    }
    std::printf("BI_CopyBmp RGB to CMYK between 16384 x 16384 tile files: status %d (no ratio)\n",
                int(status));
}

void BM_CopyCmykToRgbPairedWithRaw(benchmark::State &state) {
    RgbFile &f = Rgb();
    BI_Bitmap *from = f.cmyk;
    BI_Bitmap *to = f.rgb;
    int32_t status = 0;
    f.Copy(from, to, &status);  // warm, and the far side's file written once
    f.RawReadWrite(from->tilePath);
    std::vector<double> ratios;
    for (auto _ : state) {
        const double raw = f.RawReadWrite(from->tilePath);
        const double ours = f.Copy(from, to, &status);
        state.SetIterationTime(ours);
        ratios.push_back(raw / ours);
    }
    tsbench::RecordRatio("BI_CopyBmp CMYK to RGB tile files (status " + std::to_string(status) +
                             ") vs raw read + write of the source's bytes, median of " +
                             std::to_string(ratios.size()) + " taken in turn",
                         Median(ratios));
}

// RGB in memory to CMYK in a tile file: the rows the routed CMYK read can
// take whole (it reads 4 bytes a pixel from 3-byte rows, so a full-width run
// of the last row would leave the pixel block), against a raw write of as
// many bytes as the copy writes into the destination's tiles.
void BM_CopyRgbMemoryToCmykTilePairedWithRawWrite(benchmark::State &state) {
    RgbFile &f = Rgb();
    BI_Bitmap *memory = nullptr;
    if (TS_FAILED(BI_CreateBlankBmp(4, 24, kSide, kSide, 300, 300, 1, 0, nullptr, &memory, 1, 0, 0, 0)))
        std::abort();
    const RECT rows{0, 0, kSide, kSide - 1};
    const RECT all{0, 0, kSide, kSide};
    if (TS_FAILED(BI_CopyBmp(&all, f.rgb, &all, memory, 0, 0))) std::abort();
    const int64_t written = int64_t{kSide} * (kSide - 1) * 4;
    std::vector<uint8_t> bytes(1 << 20, 0x5a);
    const auto rawWrite = [&] {
        const auto t0 = Clock::now();
        const int to = ::open(f.scratch.c_str(), O_WRONLY | O_CREAT, 0600);
        for (int64_t done = 0; done < written;) {
            const size_t n = size_t(std::min<int64_t>(written - done, int64_t(bytes.size())));
            if (::write(to, bytes.data(), n) != ssize_t(n)) std::abort();
            done += int64_t(n);
        }
        ::close(to);
        return Seconds(t0, Clock::now());
    };
    int32_t status = TS_STATUS(BI_CopyBmp(&rows, memory, &rows, f.cmyk, 0, 0));  // warm
    rawWrite();
    std::vector<double> ratios;
    for (auto _ : state) {
        const double raw = rawWrite();
        const auto t0 = Clock::now();
        status = TS_STATUS(BI_CopyBmp(&rows, memory, &rows, f.cmyk, 0, 0));
        const double ours = Seconds(t0, Clock::now());
        state.SetIterationTime(ours);
        ratios.push_back(raw / ours);
    }
    BI_DeleteBitmap(&memory);
    std::remove(f.scratch.c_str());
    tsbench::RecordRatio("BI_CopyBmp RGB in memory to CMYK tile file, 16384 x 16383 (status " +
                             std::to_string(status) + ") vs raw write of the bytes it writes, median of " +
                             std::to_string(ratios.size()) + " taken in turn",
                         Median(ratios));
}

// A tile-only bitmap over a fresh copy of the RGB file, for one conversion.
BI_Bitmap *FreshTileCopy(RgbFile &f) {
    BI_Bitmap *b = nullptr;
    if (TS_FAILED(BI_CreateBlankBmp(4, 24, 16, 16, 300, 300, 1, 0, nullptr, &b, 2, 0, 0, 0))) std::abort();
    ::close(b->tileFile);
    b->tileFile = -1;
    b->width = kSide;
    b->height = kSide;
    const int to = ::open(b->tilePath, O_WRONLY | O_TRUNC);
    RawPass(f.rgb->tilePath, to);
    ::close(to);
    return b;
}

void BM_ConvertToMemPairedWithRawRead(benchmark::State &state) {
    RgbFile &f = Rgb();
    std::vector<double> ratios;
    for (auto _ : state) {
        BI_Bitmap *b = FreshTileCopy(f);
        const auto t0 = Clock::now();
        benchmark::DoNotOptimize(RawPass(b->tilePath));
        const auto t1 = Clock::now();
        if (TS_FAILED(BI_ConvertBmpToMem(b))) std::abort();
        const auto t2 = Clock::now();
        BI_DeleteBitmap(&b);
        state.SetIterationTime(Seconds(t1, t2));
        ratios.push_back(Seconds(t0, t1) / Seconds(t1, t2));
    }
    tsbench::RecordRatio("BI_ConvertBmpToMem of the RGB tile bitmap vs raw read of its file, median of " +
                             std::to_string(ratios.size()) + " taken in turn",
                         Median(ratios));
}

BENCHMARK(BM_HalfLevelByAveraging)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(5);
BENCHMARK(BM_VipsShrink)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(5);
BENCHMARK(BM_VipsReduce)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(5);
BENCHMARK(BM_LevelPairedWithVips)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(7);
BENCHMARK(BM_CopyRgbToCmykTileFiles)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(1);
BENCHMARK(BM_CopyCmykToRgbPairedWithRaw)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(3);
BENCHMARK(BM_CopyRgbMemoryToCmykTilePairedWithRawWrite)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(3);
BENCHMARK(BM_ConvertToMemPairedWithRawRead)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(3);

}  // namespace

TSBENCH_MAIN()
