// MEM_Copy and MEM_Fill against memcpy and memset of the same sizes, in the
// same run.
#include <cstdint>
#include <cstring>
#include <vector>

#include <tessarine/core.h>

#include "bench_ratio.h"

namespace {

constexpr int64_t kSizes[] = {64, 4096, 1 << 20, 16 << 20};

struct Buffers {
    explicit Buffers(size_t n) : from(n, 0x5A), to(n, 0) {}
    std::vector<uint8_t> from, to;
};

void BM_MemCopy(benchmark::State &state) {
    const auto n = static_cast<size_t>(state.range(0));
    Buffers b(n);
    for (auto _ : state) {
        MEM_Copy(b.from.data(), b.to.data(), static_cast<int32_t>(n));
        benchmark::DoNotOptimize(b.to.data());
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(n));
}

void BM_memcpy(benchmark::State &state) {
    const auto n = static_cast<size_t>(state.range(0));
    Buffers b(n);
    for (auto _ : state) {
        std::memcpy(b.to.data(), b.from.data(), n);
        benchmark::DoNotOptimize(b.to.data());
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(n));
}

void BM_MemFill(benchmark::State &state) {
    const auto n = static_cast<size_t>(state.range(0));
    Buffers b(n);
    int32_t value = 0;
    for (auto _ : state) {
        MEM_Fill(b.to.data(), static_cast<int32_t>(n), ++value);
        benchmark::DoNotOptimize(b.to.data());
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(n));
}

void BM_memset(benchmark::State &state) {
    const auto n = static_cast<size_t>(state.range(0));
    Buffers b(n);
    int value = 0;
    for (auto _ : state) {
        std::memset(b.to.data(), ++value & 0xFF, n);
        benchmark::DoNotOptimize(b.to.data());
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(n));
}

// A copy to a destination a little above its source in the same block keeps
// its forward smear; memmove of the same size is the yardstick.
void BM_MemCopySmear(benchmark::State &state) {
    const auto n = static_cast<size_t>(state.range(0));
    std::vector<uint8_t> block(n + 64, 0x5A);
    for (auto _ : state) {
        MEM_Copy(block.data(), block.data() + 64, static_cast<int32_t>(n));
        benchmark::DoNotOptimize(block.data());
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(n));
}

void BM_memmove(benchmark::State &state) {
    const auto n = static_cast<size_t>(state.range(0));
    std::vector<uint8_t> block(n + 64, 0x5A);
    for (auto _ : state) {
        std::memmove(block.data() + 64, block.data(), n);
        benchmark::DoNotOptimize(block.data());
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(n));
}

void Register() {
    for (int64_t size : kSizes) {
        benchmark::RegisterBenchmark("BM_memcpy", BM_memcpy)->Arg(size);
        benchmark::RegisterBenchmark("BM_MemCopy", BM_MemCopy)->Arg(size);
        benchmark::RegisterBenchmark("BM_memset", BM_memset)->Arg(size);
        benchmark::RegisterBenchmark("BM_MemFill", BM_MemFill)->Arg(size);
        std::string arg = std::to_string(size);
        arg.insert(arg.begin(), '/');
        const double target = size == (1 << 20) ? 0.8 : 0;
        tsbench::AddRatio("BM_MemCopy" + arg, "BM_memcpy" + arg, target);
        tsbench::AddRatio("BM_MemFill" + arg, "BM_memset" + arg, target);
    }
    benchmark::RegisterBenchmark("BM_memmove", BM_memmove)->Arg(1 << 20);
    benchmark::RegisterBenchmark("BM_MemCopySmear", BM_MemCopySmear)->Arg(1 << 20);
    tsbench::AddRatio("BM_MemCopySmear/1048576", "BM_memmove/1048576");
}

const bool kRegistered = (Register(), true);

}  // namespace

TSBENCH_MAIN()
