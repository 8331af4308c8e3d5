// Dense sampling of cubics for the property tests of the curve toolkit.
#pragma once

#include <cmath>
#include <random>
#include <vector>

#include <tessarine/curves.h>

namespace gtest_curves {

inline constexpr double kPi = 3.141592653589793;
inline constexpr double kTurn = 6.283185307179586;
// A quarter circle of radius 1 as one cubic.
inline constexpr double kKappa = 0.5522847498307936;

struct Cubic {
    double v[8];
    BZ_Point At(double t) const {
        const double u = 1 - t;
        const double a = u * u * u, b = 3 * u * u * t, c = 3 * u * t * t, d = t * t * t;
        return BZ_Point{a * v[0] + b * v[2] + c * v[4] + d * v[6],
                        a * v[1] + b * v[3] + c * v[5] + d * v[7]};
    }
};

inline double Dist(BZ_Point a, BZ_Point b) { return std::hypot(a.x - b.x, a.y - b.y); }

// Distance from p to the curve: a dense scan, then a golden-section polish
// around every local minimum of the scan.
inline double DistanceToCurve(const Cubic &c, BZ_Point p, int samples = 400) {
    std::vector<double> d(samples + 1);
    for (int i = 0; i <= samples; ++i) d[i] = Dist(c.At(static_cast<double>(i) / samples), p);
    double best = 1e300;
    for (int i = 0; i <= samples; ++i) {
        best = std::fmin(best, d[i]);
        if ((i > 0 && d[i] > d[i - 1]) || (i < samples && d[i] > d[i + 1])) continue;
        double lo = std::fmax(0.0, (i - 1.0) / samples), hi = std::fmin(1.0, (i + 1.0) / samples);
        for (int k = 0; k < 50; ++k) {
            const double m1 = lo + (hi - lo) * 0.381966, m2 = hi - (hi - lo) * 0.381966;
            if (Dist(c.At(m1), p) < Dist(c.At(m2), p)) hi = m2; else lo = m1;
        }
        best = std::fmin(best, Dist(c.At((lo + hi) / 2), p));
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
