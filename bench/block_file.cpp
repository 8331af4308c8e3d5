// Appending 100000 tags of 100 bytes (8-byte header and 92 data bytes) to a
// block file with 64 KiB blocks and reading them back, against writing and
// reading the same bytes as 100-byte records with raw file calls.
#include <unistd.h>

#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <tessarine/tessarine.h>

#include "bench_ratio.h"

namespace {

constexpr int kTags = 100000;
constexpr uint32_t kTagBytes = 100;
constexpr uint32_t kData = kTagBytes - 8;
constexpr uint32_t kPayload = 64 * 1024;
constexpr uint8_t kCache = 16;

std::string ScratchPath(const char *name) {
    const char *dir = std::getenv("TMPDIR");
    return std::string(dir != nullptr && *dir != '\0' ? dir : "/tmp") + "/" + name + "-" +
           std::to_string(getpid());
}

int32_t NoMoves(FM_BlockAddr *, FM_BlockAddr *) {
    return 10;
}

// Fills the file; the tag addresses go to `where`.
void AppendAll(const std::string &path, std::vector<FM_BlockAddr> &where, const uint8_t *data) {
    FM_BlockFile *file = nullptr;
    if (TS_FAILED(FM_BlockFileCreate(path.c_str(), &file, kPayload, kCache, NoMoves))) std::abort();
    for (int i = 0; i < kTags; ++i) {
        FM_TagHdr tag = {1, {0, 0, 0}, kTagBytes};
        FM_BlockAddr at, to;
        if (TS_FAILED(FM_TagAppendHdrAtEnd(file, &tag, &at, nullptr)) ||
            TS_FAILED(FM_GetNextAddr(file, at.block, at.offset, 8, &to)) ||
            TS_FAILED(FM_BlockWrite(file, to.block, to.offset, kData, data, nullptr)))
            std::abort();
        where[i] = at;
    }
    if (TS_FAILED(FM_BlockFileClose(&file))) std::abort();
}

void ReadAll(const std::string &path, const std::vector<FM_BlockAddr> &where, uint8_t *data) {
    FM_BlockFile *file = nullptr;
    if (TS_FAILED(FM_BlockFileOpen(path.c_str(), &file, kCache))) std::abort();
    for (int i = 0; i < kTags; ++i) {
        FM_TagHdr tag;
        FM_BlockAddr from;
        if (TS_FAILED(
                FM_TagReadHdr(file, where[i].block, where[i].offset, &tag, nullptr, nullptr)) ||
            TS_FAILED(FM_GetNextAddr(file, where[i].block, where[i].offset, 8, &from)) ||
            TS_FAILED(FM_BlockRead(file, from.block, from.offset, kData, data, nullptr)))
            std::abort();
    }
    FM_BlockFileClose(&file);
}

void BM_BlockFileAppend(benchmark::State &state) {
    const std::string path = ScratchPath("bench-block");
    std::vector<FM_BlockAddr> where(kTags);
    std::vector<uint8_t> data(kData, 0x5A);
    for (auto _ : state) {
        AppendAll(path, where, data.data());
        state.PauseTiming();
        FM_Delete(path.c_str());
        state.ResumeTiming();
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kTags * kTagBytes);
}

void BM_BlockFileReadBack(benchmark::State &state) {
    const std::string path = ScratchPath("bench-block");
    std::vector<FM_BlockAddr> where(kTags);
    std::vector<uint8_t> data(kData, 0x5A);
    AppendAll(path, where, data.data());
    for (auto _ : state) ReadAll(path, where, data.data());
    benchmark::DoNotOptimize(data.data());
    FM_Delete(path.c_str());
    state.SetBytesProcessed(int64_t(state.iterations()) * kTags * kTagBytes);
}

void BM_RawWrite(benchmark::State &state) {
    const std::string path = ScratchPath("bench-raw");
    std::vector<uint8_t> record(kTagBytes, 0x5A);
    for (auto _ : state) {
        int32_t fd = -1;
        if (TS_FAILED(FM_Create(path.c_str(), 2, &fd))) std::abort();
        for (int i = 0; i < kTags; ++i)
            if (TS_FAILED(FM_Write(fd, record.data(), kTagBytes))) std::abort();
        FM_Close(fd);
        state.PauseTiming();
        FM_Delete(path.c_str());
        state.ResumeTiming();
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * kTags * kTagBytes);
}

void BM_RawRead(benchmark::State &state) {
    const std::string path = ScratchPath("bench-raw");
    std::vector<uint8_t> record(kTagBytes, 0x5A);
    int32_t fd = -1;
    if (TS_FAILED(FM_Create(path.c_str(), 2, &fd))) std::abort();
    for (int i = 0; i < kTags; ++i) FM_Write(fd, record.data(), kTagBytes);
    FM_Close(fd);
    for (auto _ : state) {
        if (TS_FAILED(FM_Open(path.c_str(), 2, &fd))) std::abort();
        for (int i = 0; i < kTags; ++i)
            if (TS_FAILED(FM_Read(fd, record.data(), kTagBytes))) std::abort();
        FM_Close(fd);
    }
    benchmark::DoNotOptimize(record.data());
    FM_Delete(path.c_str());
    state.SetBytesProcessed(int64_t(state.iterations()) * kTags * kTagBytes);
}

BENCHMARK(BM_BlockFileAppend)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_RawWrite)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_BlockFileReadBack)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_RawRead)->Unit(benchmark::kMillisecond);

const bool kRatios = [] {
    tsbench::AddRatio("BM_BlockFileAppend", "BM_RawWrite");
    tsbench::AddRatio("BM_BlockFileReadBack", "BM_RawRead");
    return true;
}();

}  // namespace

TSBENCH_MAIN()
