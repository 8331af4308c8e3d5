// Point to line: against the infinite carrier, against the segment with a
// margin, and against the segment without one.
#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;

namespace {

struct Foot {
    BZ_Point point;
    double t;
};

// Foot of the perpendicular on the carrier; a degenerate line gives its end b.
Foot CarrierFoot(double px, double py, double ax, double ay, double bx, double by) {
    const double dx = bx - ax;
    const double dy = by - ay;
    const double s = dx * dx + dy * dy;
    if (s >= 1e-13) {
        const double t = ((px - ax) * dx + (py - ay) * dy) / s;
        return Foot{{ax + dx * t, ay + dy * t}, t};
    }
    return Foot{{bx, by}, 1.0};
}

}  // namespace

extern "C" {

TESSARINE_API int32_t BZ_Mindistpt2ln(double px, double py, double ax, double ay, double bx,
                                      double by, double *distance, double *t, BZ_Point *foot) {
    const Foot f = CarrierFoot(px, py, ax, ay, bx, by);
    if (distance != nullptr) *distance = BZ_Distptpt(px, py, f.point.x, f.point.y);
    if (t != nullptr) *t = f.t;
    if (foot != nullptr) *foot = f.point;
    return kOk;
}

TESSARINE_API int32_t BZ_Mindistsq2ln(double ax, double ay, double bx, double by, double px,
                                      double py, double *distanceSq, double *t, BZ_Point *foot) {
    const Foot f = CarrierFoot(px, py, ax, ay, bx, by);
    if (distanceSq != nullptr) *distanceSq = BZ_Distptpts(px, py, f.point.x, f.point.y);
    if (t != nullptr) *t = f.t;
    if (foot != nullptr) *foot = f.point;
    return kOk;
}

TESSARINE_API int32_t BZ_Mindistpt2Bln(double ax, double ay, double bx, double by, double px,
                                       double py, double *distance, double *t, BZ_Point *foot) {
    BZ_Mindistpt2ln(px, py, ax, ay, bx, by, distance, t, foot);
    // A parameter a little outside 0 to 1 comes back as it is.
    if (*t <= -0.0001) {
        *distance = BZ_Distptpt(px, py, ax, ay);
        *t = 0.0;
        *foot = BZ_Point{ax, ay};
    } else if (*t - 1 >= 0.0001) {
        *distance = BZ_Distptpt(px, py, bx, by);
        *t = 1.0;
        *foot = BZ_Point{bx, by};
    }
    return kOk;
}

TESSARINE_API int32_t BZ_Mindistsqpt2line(double px, double py, double ax, double ay, double bx,
                                          double by, BZ_Point *foot, double *t,
                                          double *distanceSq) {
    BZ_Point f;
    double u = 0.0;
    BZ_Mindistsq2ln(ax, ay, bx, by, px, py, nullptr, &u, &f);
    if (u < 0) {
        u = 0.0;
        f = BZ_Point{ax, ay};
    } else if (u > 1) {
        u = 1.0;
        f = BZ_Point{bx, by};
    }
    if (foot != nullptr) *foot = f;
    if (t != nullptr) *t = u;
    if (distanceSq != nullptr) *distanceSq = BZ_Distptpts(px, py, f.x, f.y);
    return kOk;
}

}  // extern "C"
