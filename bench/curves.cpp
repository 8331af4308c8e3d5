// Throughput of the curve toolkit: curve pairs per second through the
// intersection for crossing, disjoint, touching and coincident pairs, and arcs
// per second through ConvertArcToBezier. Each subject is timed in turn with a
// baseline over the same data (sampling both curves at 64 points; for arcs,
// the sines and cosines of five angles), and the median of the per-round
// ratios baseline time / subject time is printed.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <random>
#include <string>
#include <vector>

#include <tessarine/curves.h>

#include "bench_ratio.h"

namespace {

constexpr int kPairs = 64;

struct Pair {
    double a[8], b[8];
};

// A pair moved and turned at random, so that no two rounds see the same
// numbers and the branch predictor cannot learn one figure.
Pair Place(const double (&a)[8], const double (&b)[8], std::mt19937_64 &rng) {
    std::uniform_real_distribution<double> pos(-100, 100), ang(0, 6.283185307179586),
        scale(0.5, 20);
    const double dx = pos(rng), dy = pos(rng), s = scale(rng), t = ang(rng);
    const double c = std::cos(t) * s, n = std::sin(t) * s;
    Pair p;
    for (int i = 0; i < 8; i += 2) {
        p.a[i] = a[i] * c - a[i + 1] * n + dx;
        p.a[i + 1] = a[i] * n + a[i + 1] * c + dy;
        p.b[i] = b[i] * c - b[i + 1] * n + dx;
        p.b[i + 1] = b[i] * n + b[i + 1] * c + dy;
    }
    return p;
}

enum Figure { kCrossing, kDisjoint, kTouching, kCoincident };

const std::vector<Pair> &Pairs(Figure f) {
    static std::vector<Pair> sets[4];
    std::vector<Pair> &v = sets[f];
    if (!v.empty()) return v;
    static const double arch[8] = {0, 0, 1, 2, 3, 2, 4, 0};
    static const double dip[8] = {0, 1, 1, -1, 3, -1, 4, 1};
    static const double above[8] = {0, 1.6, 1, 3.6, 3, 3.6, 4, 1.6};
    static const double top[8] = {0, 1.5, 1, 1.5, 3, 1.5, 4, 1.5};
    static const double back[8] = {4, 0, 3, 2, 1, 2, 0, 0};
    const double(*other[4])[8] = {&dip, &above, &top, &back};
    std::mt19937_64 rng(15 + f);
    for (int i = 0; i < kPairs; ++i) v.push_back(Place(arch, *other[f], rng));
    return v;
}

void SampleBoth(const Pair &p) {
    double x = 0, y = 0;
    for (int i = 0; i < 64; ++i) {
        const double t = i / 63.0;
        TOV_FindBezierPoint(p.a[0], p.a[1], p.a[2], p.a[3], p.a[4], p.a[5], p.a[6], p.a[7], t, &x,
                            &y);
        benchmark::DoNotOptimize(x);
        TOV_FindBezierPoint(p.b[0], p.b[1], p.b[2], p.b[3], p.b[4], p.b[5], p.b[6], p.b[7], t, &x,
                            &y);
        benchmark::DoNotOptimize(y);
    }
}

void Intersect(const Pair &p) {
    double tA[14], tB[14];
    BZ_Point pts[14];
    uint16_t count = 0;
    int16_t kind = 0;
    benchmark::DoNotOptimize(NewCurveCurveIntersect(p.a, p.b, tA, tB, pts, &count, 1e-6, &kind));
    benchmark::DoNotOptimize(pts);
}

double Seconds(std::chrono::steady_clock::time_point a, std::chrono::steady_clock::time_point b) {
    return std::chrono::duration<double>(b - a).count();
}

// The library calls a benchmark several times while it settles the number of
// rounds; only the last, longest call's median stands.
void RecordMedian(const std::string &what, std::vector<double> &ratios) {
    std::sort(ratios.begin(), ratios.end());
    const std::string name = what + ", median of rounds taken in turn";
    for (tsbench::MeasuredRatio &r : tsbench::Measured()) {
        if (r.name == name) {
            r.ratio = ratios[ratios.size() / 2];
            return;
        }
    }
    tsbench::RecordRatio(name, ratios[ratios.size() / 2]);
}

const char *const kNames[4] = {"crossing", "disjoint", "touching", "coincident"};

void BM_CurvePairs(benchmark::State &state) {
    const Figure f = static_cast<Figure>(state.range(0));
    const std::vector<Pair> &pairs = Pairs(f);
    for (const Pair &p : pairs) SampleBoth(p), Intersect(p);  // warm both sides
    std::vector<double> ratios;
    for (auto _ : state) {
        const auto t0 = std::chrono::steady_clock::now();
        for (const Pair &p : pairs) SampleBoth(p);
        const auto t1 = std::chrono::steady_clock::now();
        for (const Pair &p : pairs) Intersect(p);
        const auto t2 = std::chrono::steady_clock::now();
        state.SetIterationTime(Seconds(t1, t2));
        ratios.push_back(Seconds(t0, t1) / Seconds(t1, t2));
    }
    state.SetItemsProcessed(state.iterations() * kPairs);
    RecordMedian(std::string("NewCurveCurveIntersect ") + kNames[f] +
                     " pairs vs sampling both curves at 64 points",
                 ratios);
}

struct ArcInput {
    double radius, cx, cy, start, sweep;
};

void BM_ConvertArcToBezier(benchmark::State &state) {
    std::vector<ArcInput> arcs;
    std::mt19937_64 rng(5);
    std::uniform_real_distribution<double> pos(-100, 100), rad(0.1, 50), ang(0, 6.283185307179586),
        sweep(-7, 7);
    for (int i = 0; i < 256; ++i)
        arcs.push_back({rad(rng), pos(rng), pos(rng), ang(rng), sweep(rng)});
    BZ_Point nodes[18];
    int16_t count = 0;
    auto subject = [&] {
        for (const ArcInput &a : arcs) {
            ConvertArcToBezier(a.radius, a.cx, a.cy, a.start, a.sweep, nodes, &count);
            benchmark::DoNotOptimize(nodes);
        }
    };
    auto baseline = [&] {
        double s = 0, c = 0;
        for (const ArcInput &a : arcs)
            for (int k = 0; k < 5; ++k) {
                GetSinCos(a.start + k * 1.5707963267948966, &s, &c);
                benchmark::DoNotOptimize(s);
                benchmark::DoNotOptimize(c);
            }
    };
    subject();
    baseline();
    std::vector<double> ratios;
    for (auto _ : state) {
        const auto t0 = std::chrono::steady_clock::now();
        baseline();
        const auto t1 = std::chrono::steady_clock::now();
        subject();
        const auto t2 = std::chrono::steady_clock::now();
        state.SetIterationTime(Seconds(t1, t2));
        ratios.push_back(Seconds(t0, t1) / Seconds(t1, t2));
    }
    state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(arcs.size()));
    RecordMedian("ConvertArcToBezier arcs vs sine and cosine of five angles", ratios);
}

BENCHMARK(BM_CurvePairs)
    ->Arg(kCrossing)
    ->Arg(kDisjoint)
    ->Arg(kTouching)
    ->Arg(kCoincident)
    ->UseManualTime();
BENCHMARK(BM_ConvertArcToBezier)->UseManualTime();

}  // namespace

TSBENCH_MAIN()
