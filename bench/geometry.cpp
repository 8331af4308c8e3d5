// Throughput of the geometry kernel's intersection and distance operations,
// in operations per second, over a fixed set of random segments. The
// baseline is a plain point distance over the same data.
#include <cmath>
#include <random>
#include <vector>

#include <tessarine/geometry.h>

#include "bench_ratio.h"

namespace {

constexpr int kInputs = 1024;

struct Inputs {
    std::vector<BZ_Line> lines;
    std::vector<BZ_Arc> arcs;
};

BZ_Arc MakeArc(double cx, double cy, double r, double start, double sweep) {
    auto on = [&](double a) { return BZ_Point{cx + r * std::cos(a), cy + r * std::sin(a)}; };
    return BZ_Arc{on(start), on(start + 0.5 * sweep), {cx, cy}, start, sweep, on(start + sweep)};
}

const Inputs &Data() {
    static const Inputs data = [] {
        Inputs d;
        std::mt19937_64 rng(42);
        std::uniform_real_distribution<double> pos(-10, 10), rad(0.5, 8), ang(0, 6.283185307179586),
            sweep(-3, 3);
        for (int i = 0; i < kInputs; ++i) {
            d.lines.push_back(BZ_Line{{pos(rng), pos(rng)}, {pos(rng), pos(rng)}});
            d.arcs.push_back(MakeArc(pos(rng), pos(rng), rad(rng), ang(rng), sweep(rng)));
        }
        return d;
    }();
    return data;
}

template <typename F>
void Run(benchmark::State &state, F op) {
    const Inputs &d = Data();
    int i = 0;
    for (auto _ : state) {
        op(d, i, (i + 1) & (kInputs - 1));
        i = (i + 1) & (kInputs - 1);
    }
    state.SetItemsProcessed(state.iterations());
}

void BM_Baseline_PointDistance(benchmark::State &state) {
    Run(state, [](const Inputs &d, int i, int j) {
        benchmark::DoNotOptimize(BZ_Distptpt(d.lines[i].start.x, d.lines[i].start.y,
                                             d.arcs[j].centre.x, d.arcs[j].centre.y));
    });
}

void BM_LinelineInt(benchmark::State &state) {
    Run(state, [](const Inputs &d, int i, int j) {
        const BZ_Line &a = d.lines[i], &b = d.lines[j];
        int16_t code;
        double t1, t2;
        BZ_Point p;
        benchmark::DoNotOptimize(BZ_LinelineInt(a.start.x, a.start.y, a.end.x, a.end.y, b.start.x,
                                                b.start.y, b.end.x, b.end.y, &code, &t1, &t2, &p));
        benchmark::DoNotOptimize(p);
    });
}

template <int32_t (*Op)(const BZ_Line *, const BZ_Arc *, BZ_Point *, double *, double *, int16_t *,
                        int16_t *)>
void BM_LineArc(benchmark::State &state) {
    Run(state, [](const Inputs &d, int i, int j) {
        BZ_Point p[2];
        double t1[2], t2[2];
        int16_t count, code;
        benchmark::DoNotOptimize(Op(&d.lines[i], &d.arcs[j], p, t1, t2, &count, &code));
        benchmark::DoNotOptimize(p);
    });
}

template <int32_t (*Op)(const BZ_Arc *, const BZ_Arc *, BZ_Point *, double *, double *, int16_t *,
                        int16_t *)>
void BM_ArcArc(benchmark::State &state) {
    Run(state, [](const Inputs &d, int i, int j) {
        BZ_Point p[2];
        double t1[2], t2[2];
        int16_t count, code;
        benchmark::DoNotOptimize(Op(&d.arcs[i], &d.arcs[j], p, t1, t2, &count, &code));
        benchmark::DoNotOptimize(p);
    });
}

void BM_ThreePointArc(benchmark::State &state) {
    Run(state, [](const Inputs &d, int i, int) {
        const BZ_Arc &a = d.arcs[i];
        BZ_Point c;
        double r, s, w, l;
        int16_t outcome;
        benchmark::DoNotOptimize(BZ_3ptarcinfo(a.start.x, a.start.y, a.mid.x, a.mid.y, a.end.x,
                                               a.end.y, &c, &r, &s, &w, &l, &outcome));
        benchmark::DoNotOptimize(c);
    });
}

void BM_Mindistpt2ln(benchmark::State &state) {
    Run(state, [](const Inputs &d, int i, int j) {
        const BZ_Line &l = d.lines[i];
        const BZ_Point &p = d.arcs[j].centre;
        double dist, t;
        BZ_Point f;
        benchmark::DoNotOptimize(
            BZ_Mindistpt2Bln(l.start.x, l.start.y, l.end.x, l.end.y, p.x, p.y, &dist, &t, &f));
        benchmark::DoNotOptimize(dist);
    });
}

void BM_MindistPt2arc(benchmark::State &state) {
    Run(state, [](const Inputs &d, int i, int j) {
        const BZ_Arc &a = d.arcs[j];
        const BZ_Point &p = d.lines[i].start;
        const double r = BZ_Distptpt(a.centre.x, a.centre.y, a.start.x, a.start.y);
        BZ_Point f;
        double t, dist;
        benchmark::DoNotOptimize(MindistPt2arc(p.x, p.y, a.centre.x, a.centre.y, r, a.startAngle,
                                               a.sweep, a.start.x, a.start.y, a.end.x, a.end.y,
                                               &f, &t, &dist));
        benchmark::DoNotOptimize(dist);
    });
}

void BM_MindistLineArc(benchmark::State &state) {
    Run(state, [](const Inputs &d, int i, int j) {
        BZ_Point p1, p2;
        double t1, t2, dist;
        benchmark::DoNotOptimize(
            BZ_MindistLineArc(&d.lines[i], &d.arcs[j], &p1, &t1, &p2, &t2, &dist));
        benchmark::DoNotOptimize(dist);
    });
}

void BM_MindistArcArc(benchmark::State &state) {
    Run(state, [](const Inputs &d, int i, int j) {
        BZ_Point p1, p2;
        double t1[2], t2[2], dist;
        benchmark::DoNotOptimize(
            BZ_MindistArcArc(&d.arcs[i], &d.arcs[j], &p1, t1, &p2, t2, &dist));
        benchmark::DoNotOptimize(dist);
    });
}

BENCHMARK(BM_Baseline_PointDistance);
BENCHMARK(BM_LinelineInt);
BENCHMARK(BM_LineArc<BZ_LineArcInt>)->Name("BM_LineArcInt");
BENCHMARK(BM_LineArc<BZ_BoundLineArcInt>)->Name("BM_BoundLineArcInt");
BENCHMARK(BM_ArcArc<BZ_ArcArcInt>)->Name("BM_ArcArcInt");
BENCHMARK(BM_ArcArc<BZ_BoundArcArcInt>)->Name("BM_BoundArcArcInt");
BENCHMARK(BM_ThreePointArc);
BENCHMARK(BM_Mindistpt2ln);
BENCHMARK(BM_MindistPt2arc);
BENCHMARK(BM_MindistLineArc);
BENCHMARK(BM_MindistArcArc);

const bool kRatios = [] {
    for (const char *name : {"BM_LinelineInt", "BM_LineArcInt", "BM_BoundLineArcInt",
                             "BM_ArcArcInt", "BM_BoundArcArcInt", "BM_ThreePointArc",
                             "BM_Mindistpt2ln", "BM_MindistPt2arc", "BM_MindistLineArc",
                             "BM_MindistArcArc"})
        tsbench::AddRatio(name, "BM_Baseline_PointDistance");
    return true;
}();

}  // namespace

TSBENCH_MAIN()
