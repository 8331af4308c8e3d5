// The tool's import and export of a 16384 by 16384 RGB PNG against libpng
// alone in the same run: decoding the same PNG (import) and encoding the same
// pixels with the same settings (export). Each side runs as its own process,
// taken in turn, so that times and peak memory (the child's maximum resident
// set) are measured alike; the median of the per-pair ratios is reported.
// The previous round's tile file is deleted before each timed import (not
// timed): the import then starts, as the decode does, with no 805 MB file to
// free when it renames its output into place.
#include <png.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "bench_ratio.h"

extern char **environ;

namespace {

constexpr int kSide = 16384;

// The test picture: smooth ramps with some fine detail, as a scan might be.
void FillRow(int y, std::vector<uint8_t> &row) {
    for (int x = 0; x < kSide; ++x) {
        row[3 * size_t(x)] = uint8_t(x >> 6);
        row[3 * size_t(x) + 1] = uint8_t(y >> 6);
        row[3 * size_t(x) + 2] = uint8_t(((x ^ y) & 63) + ((x + y) >> 8));
    }
}

int EncodeOnly(const char *path) {
    FILE *f = std::fopen(path, "wb");
    if (f == nullptr) return 1;
    png_structp png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    png_init_io(png, f);
    png_set_IHDR(png, info, kSide, kSide, 8, PNG_COLOR_TYPE_RGB, PNG_INTERLACE_NONE,
                 PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
    png_set_compression_level(png, 3); // as the tool writes
    png_write_info(png, info);
    std::vector<uint8_t> row(size_t(kSide) * 3);
    for (int y = 0; y < kSide; ++y) {
        FillRow(y, row);
        png_write_row(png, row.data());
    }
    png_write_end(png, nullptr);
    png_destroy_write_struct(&png, &info);
    return std::fclose(f) == 0 ? 0 : 1;
}

int DecodeOnly(const char *path) {
    FILE *f = std::fopen(path, "rb");
    if (f == nullptr) return 1;
    png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    png_init_io(png, f);
    png_read_info(png, info);
    std::vector<uint8_t> row(png_get_rowbytes(png, info));
    unsigned sum = 0;
    for (uint32_t y = 0; y < png_get_image_height(png, info); ++y) {
        png_read_row(png, row.data(), nullptr);
        sum += row[y % row.size()];
    }
    png_destroy_read_struct(&png, &info, nullptr);
    std::fclose(f);
    return sum == 0xFFFFFFFFu ? 1 : 0;
}

struct Outcome {
    double seconds;
    double peakMiB;
};

Outcome Spawn(const std::vector<std::string> &args) {
    std::vector<char *> argv;
    for (const auto &a : args) argv.push_back(const_cast<char *>(a.c_str()));
    argv.push_back(nullptr);
    const auto start = std::chrono::steady_clock::now();
    pid_t pid = 0;
    if (posix_spawn(&pid, argv[0], nullptr, nullptr, argv.data(), environ) != 0) std::abort();
    int status = 0;
    rusage usage{};
    wait4(pid, &status, 0, &usage);
    const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) {
        std::fprintf(stderr, "%s failed\n", args[0].c_str());
        std::abort();
    }
    return {seconds, usage.ru_maxrss / 1024.0};
}

std::string Scratch(const char *name) {
    const char *dir = std::getenv("TMPDIR");
    return std::string(dir && *dir ? dir : "/tmp") + "/cli-bench-" + std::to_string(getpid()) + "-" + name;
}

std::string Self() {
    char buffer[4096];
    const ssize_t n = readlink("/proc/self/exe", buffer, sizeof buffer - 1);
    if (n <= 0) std::abort();
    return std::string(buffer, size_t(n));
}

void Report(const char *what, std::vector<double> ratios, double peakSubject, double peakBaseline, double target) {
    std::sort(ratios.begin(), ratios.end());
    tsbench::RecordRatio(std::string(what) + " vs libpng alone, median of " + std::to_string(ratios.size()) +
                             " pairs taken in turn",
                         ratios[ratios.size() / 2], target);
    std::printf("peak memory %s: %.1f MiB (libpng alone %.1f MiB; target under 64 MiB: %s)\n", what,
                peakSubject, peakBaseline, peakSubject < 64 ? "met" : "NOT met");
}

void BM_ImportAndExportPairedWithLibpng(benchmark::State &state) {
    const std::string png = Scratch("in.png"), tile = Scratch("image.tsr"), out = Scratch("out.png"),
                      plain = Scratch("plain.png"), self = Self();
    Spawn({self, "--encode-only", png}); // the picture, and a warm-up of both sides
    Spawn({TESSARINE_CLI_BINARY, "import", png, tile});
    std::vector<double> importRatios, exportRatios;
    double importPeak = 0, exportPeak = 0, decodePeak = 0, encodePeak = 0;
    for (auto _ : state) {
        std::remove(tile.c_str());
        const Outcome decode = Spawn({self, "--decode-only", png});
        const Outcome import = Spawn({TESSARINE_CLI_BINARY, "import", png, tile});
        const Outcome encode = Spawn({self, "--encode-only", plain});
        const Outcome exported = Spawn({TESSARINE_CLI_BINARY, "export", tile, out});
        importRatios.push_back(decode.seconds / import.seconds);
        exportRatios.push_back(encode.seconds / exported.seconds);
        importPeak = std::max(importPeak, import.peakMiB);
        exportPeak = std::max(exportPeak, exported.peakMiB);
        decodePeak = std::max(decodePeak, decode.peakMiB);
        encodePeak = std::max(encodePeak, encode.peakMiB);
        state.SetIterationTime(import.seconds + exported.seconds);
    }
    for (const auto &p : {png, tile, out, plain}) std::remove(p.c_str());
    // Target: the tool within 1.2 times libpng's time, a ratio of 1 / 1.2.
    Report("import", importRatios, importPeak, decodePeak, 1 / 1.2);
    Report("export", exportRatios, exportPeak, encodePeak, 1 / 1.2);
}

BENCHMARK(BM_ImportAndExportPairedWithLibpng)->Unit(benchmark::kSecond)->UseManualTime()->Iterations(5);

}  // namespace

int main(int argc, char **argv) {
    if (argc == 3 && std::strcmp(argv[1], "--encode-only") == 0) return EncodeOnly(argv[2]);
    if (argc == 3 && std::strcmp(argv[1], "--decode-only") == 0) return DecodeOnly(argv[2]);
    return tsbench::Main(argc, argv);
}
