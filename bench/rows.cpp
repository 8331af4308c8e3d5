// Row access against its baselines in the same run: every row of a 16384 by
// 16384 RGB bitmap through a band session against a raw read of its tile
// file, and against that read in band-sized pieces with a copy of each row; the same rows in memory against memcpy; black-and-white rows
// unpacked and packed against a memcpy of the unpacked bytes.
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include <tessarine/tessarine.h>

#include "bench_ratio.h"

namespace {

constexpr int32_t kSide = 16384;
constexpr int64_t kRowBytes = int64_t{kSide} * 3;

// The two bitmaps, made once and deleted at exit.
struct Images {
    BI_Bitmap *tiled = nullptr;
    BI_Bitmap *memory = nullptr;
    std::vector<uint8_t> r, g, b, row;

    Images() : r(kSide), g(kSide), b(kSide), row(kRowBytes) {
        for (int32_t x = 0; x < kSide; ++x) {
            r[x] = static_cast<uint8_t>(x);
            g[x] = static_cast<uint8_t>(x >> 3);
            b[x] = static_cast<uint8_t>(x * 7);
        }
    }
    ~Images() {
        if (tiled) BI_DeleteBitmap(&tiled);
        if (memory) BI_DeleteBitmap(&memory);
    }
    BI_Bitmap *Tiled() {
        if (tiled) return tiled;
        if (TS_FAILED(BI_CreateBlankBmp(4, 24, kSide, kSide, 300, 300, 1, 0, nullptr, &tiled, 2, 0, 0, 0)))
            std::abort();
        HVT_TileFileRowIOBegin(2, tiled, nullptr, 2, 0, 0);
        for (int32_t y = 0; y < kSide; ++y) BI_SetRGBRow(y, 0, kSide, r.data(), g.data(), b.data(), tiled);
        HVT_TileFileRowColIOEnd(tiled);
        RawRead();  // into the page cache for both sides
        return tiled;
    }
    BI_Bitmap *Memory() {
        if (memory) return memory;
        if (TS_FAILED(BI_CreateBlankBmp(4, 24, kSide, kSide, 300, 300, 1, 0, nullptr, &memory, 1, 0, 0, 0)))
            std::abort();
        auto *p = static_cast<uint8_t *>(MEM_Lock(memory->pixelHandle));
        for (int32_t y = 0; y < kSide; ++y)
            std::memset(p + int64_t{y} * memory->bytesPerRow, y & 0xFF, memory->bytesPerRow);
        MEM_Unlock(memory->pixelHandle);
        return memory;
    }
    int64_t RawRead() {
        const int fd = ::open(tiled->tilePath, O_RDONLY);
        static std::vector<uint8_t> chunk(1 << 20);
        int64_t total = 0;
        for (ssize_t n; (n = ::read(fd, chunk.data(), chunk.size())) > 0;) total += n;
        ::close(fd);
        return total;
    }
};

Images &Shared() {
    static Images images;
    return images;
}

void BM_RawReadTileFile(benchmark::State &state) {
    Images &im = Shared();
    im.Tiled();
    int64_t bytes = 0;
    for (auto _ : state) bytes += im.RawRead();
    state.SetBytesProcessed(bytes);
}

void BM_GetRGBRowTileSession(benchmark::State &state) {
    Images &im = Shared();
    BI_Bitmap *t = im.Tiled();
    for (auto _ : state) {
        HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, static_cast<int32_t>(state.range(0)));
        for (int32_t y = 0; y < kSide; ++y)
            BI_GetRGBRow(t, y, 0, kSide, im.r.data(), im.g.data(), im.b.data());
        HVT_TileFileRowColIOEnd(t);
        benchmark::DoNotOptimize(im.r.data());
    }
    state.SetBytesProcessed(state.iterations() * kRowBytes * kSide);
}

// The session and the raw read taken in turn, so that both meet the same
// load on a shared machine; the median of the per-pair ratios is reported.
void BM_TileSessionPairedWithRawRead(benchmark::State &state) {
    Images &im = Shared();
    BI_Bitmap *t = im.Tiled();
    const auto budget = static_cast<int32_t>(state.range(0));
    std::vector<double> ratios;
    for (auto _ : state) {
        const auto t0 = std::chrono::steady_clock::now();
        benchmark::DoNotOptimize(im.RawRead());
        const auto t1 = std::chrono::steady_clock::now();
        HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, budget);
        for (int32_t y = 0; y < kSide; ++y)
            BI_GetRGBRow(t, y, 0, kSide, im.r.data(), im.g.data(), im.b.data());
        HVT_TileFileRowColIOEnd(t);
        benchmark::DoNotOptimize(im.r.data());
        const auto t2 = std::chrono::steady_clock::now();
        const std::chrono::duration<double> raw = t1 - t0, session = t2 - t1;
        state.SetIterationTime(session.count());
        ratios.push_back(raw.count() / session.count());
    }
    std::sort(ratios.begin(), ratios.end());
    tsbench::RecordRatio("BI_GetRGBRow mode-2 session, budget " + std::to_string(budget) +
                             ", vs raw read, median of " + std::to_string(ratios.size()) +
                             " pairs taken in turn",
                         ratios[ratios.size() / 2], 0.7);
}

// What a band session has to do at least: the file read in order in pieces
// of one band (512 rows of 49153 bytes at the default budget) into one
// buffer, and each row's bytes copied out of it.
int64_t BandSizedReadAndRowCopies(Images &im) {
    constexpr int64_t kBandBytes = 512 * (kRowBytes + 1);
    static std::vector<uint8_t> band(kBandBytes);
    const int fd = ::open(im.tiled->tilePath, O_RDONLY);
    int64_t total = 0;
    for (;;) {
        int64_t got = 0;
        for (ssize_t n; got < kBandBytes && (n = ::read(fd, band.data() + got, kBandBytes - got)) > 0;)
            got += n;
        for (int64_t at = 0; at + kRowBytes <= got; at += kRowBytes + 1)
            std::memcpy(im.row.data(), band.data() + at, kRowBytes);
        benchmark::DoNotOptimize(im.row.data());
        total += got;
        if (got < kBandBytes) break;
    }
    ::close(fd);
    return total;
}

double SessionSeconds(Images &im, BI_Bitmap *t, bool planes) {
    const auto t0 = std::chrono::steady_clock::now();
    HVT_TileFileRowIOBegin(1, t, nullptr, 2, 0, 0);
    for (int32_t y = 0; y < kSide; ++y) {
        if (planes)
            BI_GetRGBRow(t, y, 0, kSide, im.r.data(), im.g.data(), im.b.data());
        else
            BI_GetRGBRowInterlace(t, y, 0, kSide, im.row.data());
    }
    HVT_TileFileRowColIOEnd(t);
    benchmark::DoNotOptimize(im.r.data());
    benchmark::DoNotOptimize(im.row.data());
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - t0).count();
}

// The session (default budget) against the band-sized read with row copies,
// taken in turn with the order alternating, both warmed first; the median
// of the per-pair ratios. Arg 0: rows as interlaced bytes (a copy of each
// row, like the baseline); arg 1: rows split into planes.
void BM_TileSessionPairedWithBandRead(benchmark::State &state) {
    Images &im = Shared();
    BI_Bitmap *t = im.Tiled();
    const bool planes = state.range(0) != 0;
    BandSizedReadAndRowCopies(im);
    SessionSeconds(im, t, planes);
    std::vector<double> ratios;
    bool sessionFirst = false;
    for (auto _ : state) {
        double session = 0;
        if (sessionFirst) session = SessionSeconds(im, t, planes);
        const auto t0 = std::chrono::steady_clock::now();
        benchmark::DoNotOptimize(BandSizedReadAndRowCopies(im));
        const double base = std::chrono::duration<double>(std::chrono::steady_clock::now() - t0).count();
        if (!sessionFirst) session = SessionSeconds(im, t, planes);
        sessionFirst = !sessionFirst;
        state.SetIterationTime(session);
        ratios.push_back(base / session);
    }
    std::sort(ratios.begin(), ratios.end());
    tsbench::RecordRatio(std::string(planes ? "BI_GetRGBRow" : "BI_GetRGBRowInterlace") +
                             " mode-2 session vs band-sized raw read plus row copies, median of " +
                             std::to_string(ratios.size()) + " pairs taken in turn",
                         ratios[ratios.size() / 2], 0.8);
}

void BM_MemcpyRowsOut(benchmark::State &state) {
    Images &im = Shared();
    BI_Bitmap *m = im.Memory();
    for (auto _ : state) {
        auto *p = static_cast<uint8_t *>(MEM_Lock(m->pixelHandle));
        for (int32_t y = 0; y < kSide; ++y)
            std::memcpy(im.row.data(), p + int64_t{y} * m->bytesPerRow, kRowBytes);
        MEM_Unlock(m->pixelHandle);
        benchmark::DoNotOptimize(im.row.data());
    }
    state.SetBytesProcessed(state.iterations() * kRowBytes * kSide);
}

void BM_MemcpyRowsIn(benchmark::State &state) {
    Images &im = Shared();
    BI_Bitmap *m = im.Memory();
    for (auto _ : state) {
        auto *p = static_cast<uint8_t *>(MEM_Lock(m->pixelHandle));
        for (int32_t y = 0; y < kSide; ++y)
            std::memcpy(p + int64_t{y} * m->bytesPerRow, im.row.data(), kRowBytes);
        MEM_Unlock(m->pixelHandle);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * kRowBytes * kSide);
}

void BM_GetRGBRowMemory(benchmark::State &state) {
    Images &im = Shared();
    BI_Bitmap *m = im.Memory();
    for (auto _ : state) {
        for (int32_t y = 0; y < kSide; ++y)
            BI_GetRGBRow(m, y, 0, kSide, im.r.data(), im.g.data(), im.b.data());
        benchmark::DoNotOptimize(im.r.data());
    }
    state.SetBytesProcessed(state.iterations() * kRowBytes * kSide);
}

void BM_SetRGBRowMemory(benchmark::State &state) {
    Images &im = Shared();
    BI_Bitmap *m = im.Memory();
    for (auto _ : state) {
        for (int32_t y = 0; y < kSide; ++y)
            BI_SetRGBRow(y, 0, kSide, im.r.data(), im.g.data(), im.b.data(), m);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * kRowBytes * kSide);
}

constexpr int32_t kLong = 1 << 20;  // pixels of a long 1-bit row

struct BwRows {
    std::vector<uint8_t> packed, flags, copy;
    BwRows() : packed(kLong / 8 + 2), flags(kLong + 16), copy(kLong + 16) {
        for (size_t i = 0; i < packed.size(); ++i) packed[i] = static_cast<uint8_t>(i * 37);
        for (size_t i = 0; i < flags.size(); ++i) flags[i] = (i * 13) & 1;
    }
};

BwRows &Bw() {
    static BwRows rows;
    return rows;
}

void BM_MemcpyUnpackedBW(benchmark::State &state) {
    BwRows &w = Bw();
    for (auto _ : state) {
        std::memcpy(w.copy.data(), w.flags.data(), kLong);
        benchmark::DoNotOptimize(w.copy.data());
    }
    state.SetBytesProcessed(state.iterations() * kLong);
}

void BM_UnpackBWRow(benchmark::State &state) {
    BwRows &w = Bw();
    for (auto _ : state) {
        BI_UnpackBWRow(w.packed.data(), 3, kLong - 3, w.copy.data());
        benchmark::DoNotOptimize(w.copy.data());
    }
    state.SetBytesProcessed(state.iterations() * kLong);
}

void BM_PackBWRow(benchmark::State &state) {
    BwRows &w = Bw();
    for (auto _ : state) {
        BI_PackBWRow(w.flags.data(), 3, kLong - 3, w.packed.data());
        benchmark::DoNotOptimize(w.packed.data());
    }
    state.SetBytesProcessed(state.iterations() * kLong);
}

BENCHMARK(BM_RawReadTileFile)->Unit(benchmark::kMillisecond)->MinTime(2);
// The default budget (bands of 512 rows here) and budgets whose bands stay in cache.
BENCHMARK(BM_GetRGBRowTileSession)->Unit(benchmark::kMillisecond)->MinTime(2)->Arg(0)->Arg(1 << 20)->Arg(4 << 20);
BENCHMARK(BM_TileSessionPairedWithRawRead)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(15)->Arg(0)->Arg(1 << 20);
BENCHMARK(BM_TileSessionPairedWithBandRead)->Unit(benchmark::kMillisecond)->UseManualTime()->Iterations(15)->Arg(0)->Arg(1);
BENCHMARK(BM_MemcpyRowsOut)->Unit(benchmark::kMillisecond)->MinTime(1);
BENCHMARK(BM_GetRGBRowMemory)->Unit(benchmark::kMillisecond)->MinTime(1);
BENCHMARK(BM_MemcpyRowsIn)->Unit(benchmark::kMillisecond)->MinTime(1);
BENCHMARK(BM_SetRGBRowMemory)->Unit(benchmark::kMillisecond)->MinTime(1);
BENCHMARK(BM_MemcpyUnpackedBW)->MinTime(0.5);
BENCHMARK(BM_UnpackBWRow)->MinTime(0.5);
BENCHMARK(BM_PackBWRow)->MinTime(0.5);

const bool kRatios = [] {
    for (const char *budget : {"0", "1048576", "4194304"})
        tsbench::AddRatio(std::string("BM_GetRGBRowTileSession/") + budget + "/min_time:2.000",
                          "BM_RawReadTileFile/min_time:2.000", 0.7);
    tsbench::AddRatio("BM_GetRGBRowMemory/min_time:1.000", "BM_MemcpyRowsOut/min_time:1.000", 0.5);
    tsbench::AddRatio("BM_SetRGBRowMemory/min_time:1.000", "BM_MemcpyRowsIn/min_time:1.000", 0.5);
    tsbench::AddRatio("BM_UnpackBWRow/min_time:0.500", "BM_MemcpyUnpackedBW/min_time:0.500");
    tsbench::AddRatio("BM_PackBWRow/min_time:0.500", "BM_MemcpyUnpackedBW/min_time:0.500");
    return true;
}();

}  // namespace

TSBENCH_MAIN()
