// Stroking and fitting of cubics. VC_StrokeBezierCurve (error tolerance) is
// timed in turn with cairo's path flattening of the same curves at the same
// tolerance, and the points of both are counted; BezierToArc is timed in turn
// with sampling each curve at 64 points. The median of the per-round ratios
// baseline time / subject time is printed, and curves per second stand in
// the benchmark's own line.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <random>
#include <string>
#include <vector>

#include <cairo.h>

#include <tessarine/curves.h>

#include "bench_ratio.h"

namespace {

struct Curve {
    double v[8];
};

// Curves of a few hundred units, as a sign's glyph outline in device units.
std::vector<Curve> MakeCurves(uint64_t seed, int n, double extent) {
    std::mt19937_64 rng(seed);
    std::uniform_real_distribution<double> pos(-extent, extent);
    std::vector<Curve> curves(n);
    for (Curve &c : curves)
        for (double &x : c.v) x = pos(rng);
    return curves;
}

using tsbench::Seconds;

class Cairo {
  public:
    explicit Cairo(double tolerance) {
        surface_ = cairo_image_surface_create(CAIRO_FORMAT_A8, 1, 1);
        cr_ = cairo_create(surface_);
        cairo_set_tolerance(cr_, tolerance);
    }
    ~Cairo() {
        cairo_destroy(cr_);
        cairo_surface_destroy(surface_);
    }
    // Points of the flattened curve (the move and every line end).
    int64_t Flatten(const Curve &c) {
        cairo_new_path(cr_);
        cairo_move_to(cr_, c.v[0], c.v[1]);
        cairo_curve_to(cr_, c.v[2], c.v[3], c.v[4], c.v[5], c.v[6], c.v[7]);
        cairo_path_t *path = cairo_copy_path_flat(cr_);
        int64_t points = 0;
        for (int i = 0; i < path->num_data; i += path->data[i].header.length) ++points;
        cairo_path_destroy(path);
        return points;
    }

  private:
    cairo_surface_t *surface_;
    cairo_t *cr_;
};

int64_t Stroke(const VC_StrokeSpec &spec, const Curve &c) {
    int32_t count = 0;
    BZ_Point *points = nullptr;
    if (VC_StrokeBezierCurve(spec, c.v[0], c.v[1], c.v[2], c.v[3], c.v[4], c.v[5], c.v[6], c.v[7],
                             &count, &points, nullptr) != 10)
        return 0;
    if (count > 0) MEM_FreeHdl(points);
    return count;
}

void BM_StrokeVsCairo(benchmark::State &state) {
    const double tolerance = state.range(0) / 1000.0;
    const std::vector<Curve> curves = MakeCurves(46, 256, 300);
    VC_StrokeSpec spec{};
    spec.method = 0;
    spec.tolerance = tolerance;
    Cairo cairo(tolerance);
    int64_t ours = 0;
    int64_t theirs = 0;
    for (const Curve &c : curves) ours += Stroke(spec, c), theirs += cairo.Flatten(c);
    std::vector<double> ratios;
    for (auto _ : state) {
        const auto t0 = std::chrono::steady_clock::now();
        for (const Curve &c : curves) benchmark::DoNotOptimize(cairo.Flatten(c));
        const auto t1 = std::chrono::steady_clock::now();
        for (const Curve &c : curves) benchmark::DoNotOptimize(Stroke(spec, c));
        const auto t2 = std::chrono::steady_clock::now();
        state.SetIterationTime(Seconds(t1, t2));
        ratios.push_back(Seconds(t0, t1) / Seconds(t1, t2));
    }
    state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(curves.size()));
    state.counters["points"] = static_cast<double>(ours);
    state.counters["cairo_points"] = static_cast<double>(theirs);
    char what[160];
    std::snprintf(what, sizeof what,
                  "VC_StrokeBezierCurve vs cairo_copy_path_flat at tolerance %g (points %lld vs %lld)",
                  tolerance, static_cast<long long>(ours), static_cast<long long>(theirs));
    tsbench::RecordMedianOfRounds(what, ratios, 1.0);
}

void Sample(const Curve &c) {
    double x = 0, y = 0;
    for (int i = 0; i < 64; ++i) {
        TOV_FindBezierPoint(c.v[0], c.v[1], c.v[2], c.v[3], c.v[4], c.v[5], c.v[6], c.v[7],
                            i / 63.0, &x, &y);
        benchmark::DoNotOptimize(x);
        benchmark::DoNotOptimize(y);
    }
}

void BM_BezierToArc(benchmark::State &state) {
    const double tolerance = state.range(0) / 1000.0;
    const std::vector<Curve> curves = MakeCurves(55, 256, 100);
    ArcFitEntry entries[101];
    int16_t count = 0;
    int64_t elements = 0;
    int64_t fitted = 0;
    auto fit = [&](const Curve &c) {
        const int32_t ok = BezierToArc(tolerance, c.v[0], c.v[1], c.v[2], c.v[3], c.v[4], c.v[5],
                                       c.v[6], c.v[7], entries, &count);
        benchmark::DoNotOptimize(entries);
        return ok;
    };
    for (const Curve &c : curves) {
        fitted += fit(c);
        elements += count;
        Sample(c);
    }
    std::vector<double> ratios;
    for (auto _ : state) {
        const auto t0 = std::chrono::steady_clock::now();
        for (const Curve &c : curves) Sample(c);
        const auto t1 = std::chrono::steady_clock::now();
        for (const Curve &c : curves) benchmark::DoNotOptimize(fit(c));
        const auto t2 = std::chrono::steady_clock::now();
        state.SetIterationTime(Seconds(t1, t2));
        ratios.push_back(Seconds(t0, t1) / Seconds(t1, t2));
    }
    state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(curves.size()));
    state.counters["elements"] = static_cast<double>(elements);
    state.counters["fitted"] = static_cast<double>(fitted);
    char what[160];
    std::snprintf(what, sizeof what,
                  "BezierToArc curves at tolerance %g vs sampling each at 64 points", tolerance);
    tsbench::RecordMedianOfRounds(what, ratios);
}

BENCHMARK(BM_StrokeVsCairo)->Arg(100)->Arg(250)->Arg(1000)->UseManualTime();
BENCHMARK(BM_BezierToArc)->Arg(10)->Arg(100)->UseManualTime();

}  // namespace

TSBENCH_MAIN()
