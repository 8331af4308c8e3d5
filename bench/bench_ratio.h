// Benchmark main that prints, after the runs, the throughput ratio of each
// measured benchmark against a baseline measured in the same run:
// baseline time / measured time, so 1.0 means as fast as the baseline.
#pragma once

#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <map>
#include <string>
#include <vector>

namespace tsbench {

struct RatioPair {
    std::string measured;
    std::string baseline;
    double target;  // printed beside the ratio; 0 for none
};

// A ratio a benchmark measured itself, e.g. from runs of its subject and its
// baseline taken in turn.
struct MeasuredRatio {
    std::string name;
    double ratio;
    double target;
};

inline std::vector<MeasuredRatio> &Measured() {
    static std::vector<MeasuredRatio> ratios;
    return ratios;
}

inline void RecordRatio(const std::string &name, double ratio, double target = 0) {
    Measured().push_back({name, ratio, target});
}

// For benchmarks that time subject and baseline in turn: the library calls
// a benchmark several times while it settles the number of rounds, and only
// the last, longest call's median of the per-round ratios stands.
inline void RecordMedianOfRounds(const std::string &what, std::vector<double> &ratios,
                                 double target = 0) {
    if (ratios.empty()) return;
    std::sort(ratios.begin(), ratios.end());
    const std::string name = what + ", median of rounds taken in turn";
    for (MeasuredRatio &r : Measured()) {
        if (r.name == name) {
            r.ratio = ratios[ratios.size() / 2];
            return;
        }
    }
    RecordRatio(name, ratios[ratios.size() / 2], target);
}

inline double Seconds(std::chrono::steady_clock::time_point a,
                      std::chrono::steady_clock::time_point b) {
    return std::chrono::duration<double>(b - a).count();
}

inline void PrintRatio(const std::string &what, double ratio, double target) {
    if (target > 0)
        std::printf("ratio %s: %.3f (target %.2f: %s)\n", what.c_str(), ratio, target,
                    ratio >= target ? "met" : "NOT met");
    else
        std::printf("ratio %s: %.3f\n", what.c_str(), ratio);
}

inline std::vector<RatioPair> &Pairs() {
    static std::vector<RatioPair> pairs;
    return pairs;
}

// Names are full benchmark names as printed, with their arguments
// (e.g. "BM_MemCopy/1048576").
inline void AddRatio(const std::string &measured, const std::string &baseline,
                     double target = 0) {
    Pairs().push_back({measured, baseline, target});
}

class CapturingReporter : public benchmark::ConsoleReporter {
  public:
    void ReportRuns(const std::vector<Run> &runs) override {
        for (const Run &run : runs) {
            if (run.run_type == Run::RT_Iteration || run.aggregate_name == "mean")
                times_[run.run_name.str()] = run.GetAdjustedRealTime();
        }
        ConsoleReporter::ReportRuns(runs);
    }
    void PrintRatios() const {
        std::printf("\n");  // after the console's last colour reset
        for (const RatioPair &p : Pairs()) {
            auto m = times_.find(p.measured);
            auto b = times_.find(p.baseline);
            if (m == times_.end() || b == times_.end() || m->second <= 0) continue;
            PrintRatio(p.measured + " vs " + p.baseline, b->second / m->second, p.target);
        }
        for (const MeasuredRatio &r : Measured()) PrintRatio(r.name, r.ratio, r.target);
    }

  private:
    std::map<std::string, double> times_;
};

inline int Main(int argc, char **argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    CapturingReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    reporter.PrintRatios();
    benchmark::Shutdown();
    return 0;
}

}  // namespace tsbench

#define TSBENCH_MAIN() \
    int main(int argc, char **argv) { return tsbench::Main(argc, argv); }
