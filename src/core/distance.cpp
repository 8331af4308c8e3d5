// Distances between two points given as x, y pairs.
#include <cmath>

#include <tessarine/core.h>

extern "C" {

TESSARINE_API double DistanceSQ(double x1, double y1, double x2, double y2) {
    const double dx = x2 - x1;
    const double dy = y2 - y1;
    return dx * dx + dy * dy;
}

TESSARINE_API double BZ_Distptpts(double x1, double y1, double x2, double y2)
    __attribute__((alias("DistanceSQ")));

// Points closer than 1e-8 are at distance 0, exactly.
TESSARINE_API double Distance(double x1, double y1, double x2, double y2) {
    const double s = DistanceSQ(x1, y1, x2, y2);
    if (s <= 1.0000000000000001e-16) return 0.0;
    return std::sqrt(s);
}

}  // extern "C"
