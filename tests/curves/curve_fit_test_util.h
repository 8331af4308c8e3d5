// Extras for the fitting, clipping and extent tests: random cubics and a
// distance to a curve that polishes every local minimum of its scan (a curve
// that folds back near a point has more than one).
#pragma once

#include <cmath>
#include <random>
#include <vector>

#include "curves_test_util.h"

namespace gtest_curves {

// A quarter circle of radius 1 as one cubic has its handles this long.
inline constexpr double kKappa = 0.5522847498307936;

inline double NearestOnCurve(const Cubic &c, BZ_Point p, int samples = 400) {
    std::vector<double> d(samples + 1);
    for (int i = 0; i <= samples; ++i) d[i] = Dist(PointAt(c, static_cast<double>(i) / samples), p);
    double best = 1e300;
    for (int i = 0; i <= samples; ++i) {
        best = std::fmin(best, d[i]);
        if ((i > 0 && d[i] > d[i - 1]) || (i < samples && d[i] > d[i + 1])) continue;
        double lo = std::fmax(0.0, (i - 1.0) / samples), hi = std::fmin(1.0, (i + 1.0) / samples);
        for (int k = 0; k < 50; ++k) {
            const double m1 = lo + (hi - lo) * 0.381966, m2 = hi - (hi - lo) * 0.381966;
            if (Dist(PointAt(c, m1), p) < Dist(PointAt(c, m2), p)) hi = m2;
            else lo = m1;
        }
        best = std::fmin(best, Dist(PointAt(c, (lo + hi) / 2), p));
    }
    return best;
}

class Random {
  public:
    explicit Random(uint64_t seed) : engine_(seed) {}
    double Uniform(double lo, double hi) {
        return std::uniform_real_distribution<double>(lo, hi)(engine_);
    }
    Cubic Curve(double extent) {
        Cubic c;
        for (double &x : c.v) x = Uniform(-extent, extent);
        return c;
    }

  private:
    std::mt19937_64 engine_;
};

}  // namespace gtest_curves
