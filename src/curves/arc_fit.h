// Internal pieces of the Bezier-to-arc fit: the plane arithmetic in the exact
// forms the fit uses, the angle and sweep rules, and the merging append.
#pragma once

#include <tessarine/curves.h>

#include <cmath>
#include <cstdint>

namespace tessarine::curves {

inline constexpr double kFitFullTurn = 6.283185307179586;

struct Vec {
    double x;
    double y;
};

inline Vec Sub(Vec a, Vec b) { return Vec{a.x - b.x, a.y - b.y}; }
inline double Dot(Vec a, Vec b) { return a.x * b.x + a.y * b.y; }
inline double Cross(Vec a, Vec b) { return a.x * b.y - a.y * b.x; }
inline double SquaredLength(Vec v) { return v.x * v.x + v.y * v.y; }
inline double Length(Vec v) { return std::sqrt(v.x * v.x + v.y * v.y); }
inline Vec Unit(Vec v) {
    const double n = std::sqrt(v.x * v.x + v.y * v.y);
    return Vec{v.x / n, v.y / n};
}
// Unit when the squared length is above the floor; the raw vector otherwise.
inline Vec UnitAbove(Vec v, double floor) { return SquaredLength(v) > floor ? Unit(v) : v; }
inline Vec UnitAtOrAbove(Vec v, double floor) { return SquaredLength(v) >= floor ? Unit(v) : v; }
// A radius: the length, or the squared length itself when that is tiny.
inline double FitRadius(Vec v) {
    const double s = SquaredLength(v);
    return s <= 1e-16 ? s : std::sqrt(s);
}

// Direction of v from 0 up to a full turn, with acos guarded near +-1.
double FitAngle(Vec v);
// Signed sweep from a0 to a3 that passes the inner angle am.
double FitSweep(double a0, double a3, double am);

// Run state of one fit: the caller's array, its count, and the two tolerances.
struct ArcFitRun {
    ArcFitEntry *entries;
    int16_t *count;
    double tol;
    double curTol;
};

// Appends a line from p0 to p3 (e = 0), offered to the last entry first.
void AppendFitLine(ArcFitRun &run, Vec p0, Vec p3);
// Appends an arc, offered to the last entry first.
void AppendFitArc(ArcFitRun &run, Vec centre, double radius, double startAngle, double sweep);

}  // namespace tessarine::curves
