// A circular arc as a run of Bezier node triples, one quarter turn a piece.
// The handle length is scaled linearly for short pieces; that is not the
// exact handle of a short arc, and callers rely on it as it is.
#include <cmath>

#include "curves/toolkit.h"

using tessarine::curves::kFullTurn;
using tessarine::curves::kQuarterTurn;

namespace {

constexpr double kHandleFactor = 0.552276388;
constexpr double kPerQuarter = 0.6366197723675814;
// Beyond this many turns the subtraction of whole turns would take too long
// to be an answer; such a sweep is treated like a non-finite one.
constexpr double kMostTurns = 1048576.0;

// Incoming handle, node and outgoing handle of the node at `angle`.
void WriteTriple(BZ_Point *out, double radius, double cx, double cy, double h, double angle) {
    double sine = 0.0;
    double cosine = 0.0;
    GetSinCos(angle, &sine, &cosine);
    BZ_Point triple[3] = {{cx + radius, cy - h}, {cx + radius, cy}, {cx + radius, cy + h}};
    for (int i = 0; i < 3; ++i) {
        RotatePoint(&triple[i].x, &triple[i].y, cx, cy, sine, cosine);
        out[i] = triple[i];
    }
}

}  // namespace

extern "C" TESSARINE_API void ConvertArcToBezier(double radius, double centreX, double centreY,
                                                 double startAngle, double sweep, BZ_Point *out,
                                                 int16_t *count) {
    if (!std::isfinite(radius) || !std::isfinite(startAngle) || !std::isfinite(sweep) ||
        sweep > kFullTurn * kMostTurns) {
        *count = 0;
        return;
    }
    // Only turns above one full circle go; a negative sweep stays as it is.
    while (sweep - kFullTurn > 1e-8) sweep -= kFullTurn;
    // A negative radius with a sweep that passes the first length test would
    // add quarters for ever: radius x rest only grows. Like an endless sweep,
    // it writes nothing.
    if (radius < 0 && radius * (sweep - kQuarterTurn) > 1e-8) {
        *count = 0;
        return;
    }
    double h = sweep <= kQuarterTurn ? sweep * kPerQuarter * radius : radius;
    h = h * kHandleFactor;

    int k = 0;
    double angle = startAngle;
    double remaining = sweep;
    for (;;) {
        WriteTriple(out + k, radius, centreX, centreY, h, angle);
        k += 3;
        const double rest = remaining - kQuarterTurn;
        // A test on arc length: a leftover shorter than 1e-8 adds no piece.
        // Never past the caller's 18 elements.
        if (radius * rest <= 1e-8 || k >= 15) break;
        angle += kQuarterTurn;
        remaining = rest;
        if (rest < kQuarterTurn) h = rest * kPerQuarter * radius * kHandleFactor;
    }
    WriteTriple(out + k, radius, centreX, centreY, h, angle + remaining);
    *count = static_cast<int16_t>(k + 3);
}
