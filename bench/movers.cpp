// The pixel movers against their baselines, each pair taken in turn so that
// both meet the same load: a 1-bit row copy at a phase shift against memcpy
// of the same bytes; a direct copy between two 16384 by 16384 24-bit tile
// files against a raw read and write of the same bytes; and mask compositing
// of 8-bit gray over RGB in memory, in pixels per second.
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include <tessarine/tessarine.h>

#include "bench_ratio.h"

namespace {

using Clock = std::chrono::steady_clock;

double Seconds(Clock::time_point a, Clock::time_point b) {
    return std::chrono::duration<double>(b - a).count();
}

double Median(std::vector<double> v) {
    std::sort(v.begin(), v.end());
    return v.empty() ? 0 : v[v.size() / 2];
}

// ---- Row copy at a phase shift ------------------------------------------------

constexpr int32_t kRowBytes = 64 * 1024;

void BM_CopyRow1PairedWithMemcpy(benchmark::State &state) {
    std::vector<uint8_t> src(kRowBytes + 16), dst(kRowBytes + 16), dst2(kRowBytes + 16);
    std::mt19937 rng(1);
    for (auto &v : src) v = static_cast<uint8_t>(rng());
    const int32_t pixels = kRowBytes * 8;
    std::vector<double> ratios;
    for (int i = 0; i < 50; ++i) {  // warm both
        BI_CopyRow1BPPBits(pixels, 3, src.data(), 0, dst.data());
        std::memcpy(dst2.data(), src.data(), kRowBytes);
    }
    for (auto _ : state) {
        constexpr int kReps = 64;
        const auto t0 = Clock::now();
        for (int i = 0; i < kReps; ++i) {
            std::memcpy(dst2.data(), src.data(), kRowBytes);
            benchmark::ClobberMemory();
        }
        const auto t1 = Clock::now();
        for (int i = 0; i < kReps; ++i) {
            BI_CopyRow1BPPBits(pixels, 3, src.data(), 0, dst.data());
            benchmark::ClobberMemory();
        }
        const auto t2 = Clock::now();
        state.SetIterationTime(Seconds(t1, t2));
        ratios.push_back(Seconds(t0, t1) / Seconds(t1, t2));
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * 64 * kRowBytes);
    tsbench::RecordRatio("BI_CopyRow1BPPBits, phase 3 to 0, 64 KiB rows, vs memcpy, median of " +
                             std::to_string(ratios.size()) + " pairs taken in turn",
                         Median(ratios), 0.5);
}

// ---- Direct copy between tile files --------------------------------------------

constexpr int32_t kSide = 16384;

struct TilePair {
    BI_Bitmap *src = nullptr, *dst = nullptr;
    std::string rawIn, rawOut;
    TilePair() {
        if (BI_CreateBlankBmp(4, 24, kSide, kSide, 300, 300, 1, 0, nullptr, &src, 2, 0, 0, 0) != TS_OK ||
            BI_CreateBlankBmp(4, 24, kSide, kSide, 300, 300, 1, 0, nullptr, &dst, 2, 0, 0, 0) != TS_OK)
            std::abort();
        // Pixels in every tile of the source, so that nothing is read as a hole.
        std::vector<uint8_t> rgb(size_t{kSide} * 3);
        for (size_t i = 0; i < rgb.size(); ++i) rgb[i] = static_cast<uint8_t>(i * 7);
        if (HVT_TileFileRowIOBegin(2, src, nullptr, 2, 0, 0) != TS_OK) std::abort();
        for (int32_t y = 0; y < kSide; ++y)
            if (BI_SetRGBRowInterlace(y, 0, kSide, rgb.data(), src) != TS_OK) std::abort();
        HVT_TileFileRowColIOEnd(src);
        const RECT all{0, 0, kSide, kSide};
        if (BI_DirectCopyBmp(&all, src, &all, dst, 0, 0) != TS_OK) std::abort();  // fill the holes
        // The raw baseline: a copy of the source file's bytes, read and written
        // to a file beside the tile files.
        rawIn = std::string(src->tilePath);
        rawOut = std::string(dst->tilePath) + ".raw";
    }
    ~TilePair() {
        ::unlink(rawOut.c_str());
        BI_DeleteBitmap(&src);
        BI_DeleteBitmap(&dst);
    }
    void RawCopy() const {
        const int in = ::open(rawIn.c_str(), O_RDONLY | O_CLOEXEC);
        const int out = ::open(rawOut.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
        static std::vector<uint8_t> chunk(size_t{8192} * 3 * 1024);  // one tile
        for (ssize_t n; (n = ::read(in, chunk.data(), chunk.size())) > 0;)
            if (::write(out, chunk.data(), static_cast<size_t>(n)) != n) std::abort();
        ::close(in);
        ::close(out);
    }
};

void BM_DirectCopyTileToTilePairedWithRawCopy(benchmark::State &state) {
    TilePair pair;
    const RECT all{0, 0, kSide, kSide};
    pair.RawCopy();  // warm
    std::vector<double> ratios;
    // Which side goes first alternates, so that neither always meets the
    // write-back of the other's pages.
    bool rawFirst = true;
    for (auto _ : state) {
        double raw = 0, copy = 0;
        for (int side = 0; side < 2; ++side) {
            const auto t0 = Clock::now();
            if ((side == 0) == rawFirst) {
                pair.RawCopy();
                raw = Seconds(t0, Clock::now());
            } else {
                if (BI_DirectCopyBmp(&all, pair.src, &all, pair.dst, 0, 0) != TS_OK) std::abort();
                copy = Seconds(t0, Clock::now());
            }
        }
        rawFirst = !rawFirst;
        state.SetIterationTime(copy);
        ratios.push_back(raw / copy);
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kSide * kSide * 3);
    tsbench::RecordRatio("BI_DirectCopyBmp tile file to tile file, 16384 x 16384 x 24 bits, vs raw "
                         "read + write, median of " +
                             std::to_string(ratios.size()) + " pairs taken in turn",
                         Median(ratios), 0.7);
}

// ---- Mask compositing ---------------------------------------------------------

void BM_MaskBmpGrayOverRgb(benchmark::State &state) {
    const int32_t w = 4096, h = 1024;
    BI_Bitmap *gray = nullptr, *rgb = nullptr;
    if (BI_CreateBlankBmp(2, 8, w, h, 300, 300, 1, 0, nullptr, &gray, 1, 0, 0, 0) != TS_OK ||
        BI_CreateBlankBmp(4, 24, w, h, 300, 300, 1, 0, nullptr, &rgb, 1, 0, 0, 0) != TS_OK)
        std::abort();
    const int32_t stride = w / 8;
    std::vector<uint8_t> mask(size_t{stride} * h);
    std::mt19937 rng(3);
    for (auto &v : mask) v = static_cast<uint8_t>(rng() % 4 == 0 ? 0 : rng());
    const RECT r{0, 0, w, h};
    for (auto _ : state)
        if (BI_MaskBmp(&r, gray, stride, 0, 0, mask.data(), &r, rgb) != TS_OK) std::abort();
    state.counters["pixels/s"] = benchmark::Counter(double(state.iterations()) * w * h,
                                                    benchmark::Counter::kIsRate);
    BI_DeleteBitmap(&gray);
    BI_DeleteBitmap(&rgb);
}

}  // namespace

BENCHMARK(BM_CopyRow1PairedWithMemcpy)->UseManualTime()->Iterations(400);
BENCHMARK(BM_DirectCopyTileToTilePairedWithRawCopy)->UseManualTime()->Iterations(6)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_MaskBmpGrayOverRgb)->Unit(benchmark::kMillisecond);

TSBENCH_MAIN()
