// Direction arithmetic: the kernel's whole vocabulary for angles. The small
// differences at the edges (0, pi, a full turn) are deliberate.
#include <cmath>

#include "geometry/kernel.h"

using tessarine::geometry::kFullTurn;
using tessarine::geometry::kPi;

namespace {

constexpr double kFarTurns = 1e6 * kFullTurn;

}  // namespace

extern "C" {

TESSARINE_API double BZccwdir(double a) { return a < 0 ? a + kFullTurn : a; }

TESSARINE_API double BZcwdir(double a) { return a > 0 ? a - kFullTurn : a; }

TESSARINE_API double BZsym(double a) { return a < 0 ? a + kPi : a - kPi; }

TESSARINE_API double BZeven(double a) { return a < 0 ? -kPi - a : kPi - a; }

TESSARINE_API double BZodd(double a) { return -a; }

TESSARINE_API double BZcomp(double a) { return a < 0 ? a + kFullTurn : a - kFullTurn; }

TESSARINE_API double BZonerevol(double a) {
    // A value the loops below cannot bring home in reasonable time (not
    // finite, or a million turns and more away) comes back unchanged.
    if (!std::isfinite(a) || std::fabs(a) >= kFarTurns) return a;
    while (a + 1e-13 >= kFullTurn) a -= kFullTurn;
    while (a - 1e-13 <= -kFullTurn) a += kFullTurn;
    return a;
}

TESSARINE_API double BZmindir(double a) {
    if (std::fabs(a) > kPi) return a < 0 ? a + kFullTurn : a - kFullTurn;
    return a;
}

}  // extern "C"
