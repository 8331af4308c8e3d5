// Two straight segments: a crossing point, a dot on a segment, or the
// stretch along which collinear segments overlap. Parameters come back in the
// caller's ranges, so that a chord of a sub-curve answers on the whole curve.
#include <cmath>
#include <initializer_list>
#include <utility>

#include "core/status.h"
#include "curves/toolkit.h"

using tessarine::kOk;

namespace {

// Sine of a tenth of a degree.
constexpr double kCollinearSine = 0.0017453;
constexpr double kParamSlack = 0.0001;

double Clamp01(double v) {
    if (v < 0) return 0.0;
    if (v > 1) return 1.0;
    return v;
}

double MapInto(double t, double start, double end) {
    return (end - start) * t + start;
}

struct Entries {
    double *tA;
    double *tB;
    BZ_Point *pts;
    uint16_t *count;
};

void Put(const Entries &out, int i, double a, double b, BZ_Point p) {
    out.tA[i] = a;
    out.tB[i] = b;
    out.pts[i] = p;
}

// A crossing just beyond an end counts when it lies close to that end. The
// measure is the difference of the squares, p^2 - q^2: a crossing beyond an
// end in y always passes.
bool PullOntoEnd(BZ_Point *point, double endX, double endY, double tol) {
    const double p = point->x - endX;
    const double q = point->y - endY;
    if (p * p - q * q > tol * tol) return false;
    *point = BZ_Point{endX, endY};
    return true;
}

void Overlap(double x0, double y0, double x1, double y1, double x2, double y2, double x3, double y3,
             double a0, double a1, double b0, double b1, const Entries &out, int16_t *kind) {
    *kind = 4;
    const double dx = x1 - x0, dy = y1 - y0, ex = x3 - x2, ey = y3 - y2;
    const double wx = std::fmin(std::fabs(dx), std::fabs(ex));
    const double wy = std::fmin(std::fabs(dy), std::fabs(ey));
    const bool inY = wx < wy;
    auto coord = [inY](BZ_Point p) { return inY ? p.y : p.x; };

    const BZ_Point p0{x0, y0}, p1{x1, y1}, p2{x2, y2}, p3{x3, y3};
    if (coord(p1) <= coord(p0)) {
        out.pts[0] = p1;
        out.pts[1] = p0;
    } else {
        out.pts[0] = p0;
        out.pts[1] = p1;
    }
    *out.count = 2;
    const double cmin = std::fmin(coord(p2), coord(p3));
    const double cmax = std::fmax(coord(p2), coord(p3));
    for (const BZ_Point &q : {p2, p3}) {
        const double c = coord(q);
        if (c == cmin && c >= coord(out.pts[0])) {
            out.pts[0] = q;
        } else if (c == cmax && c <= coord(out.pts[1])) {
            out.pts[1] = q;
        }
    }

    if (inY) {
        if (std::fabs(dy) >= 1e-8) {
            for (int i = 0; i < 2; ++i)
                out.tA[i] = MapInto(Clamp01((out.pts[i].y - y0) / dy), a0, a1);
        } else {
            out.tA[0] = a0;
            out.tA[1] = a1;
        }
    } else {
        // No guard in x: a zero width gives what the division gives.
        for (int i = 0; i < 2; ++i) out.tA[i] = MapInto(Clamp01((out.pts[i].x - x0) / dx), a0, a1);
    }
    const double component = inY ? ey : ex;
    const double origin = inY ? y2 : x2;
    if (std::fabs(component) >= 1e-8) {
        for (int i = 0; i < 2; ++i)
            out.tB[i] = MapInto(Clamp01((coord(out.pts[i]) - origin) / component), b0, b1);
    } else {
        out.tB[0] = b0;
        out.tB[1] = b1;
    }
    // A stretch is reported with tA rising; a falling tB tells that the
    // pieces run opposite ways.
    if (out.tA[1] < out.tA[0]) {
        std::swap(out.tA[0], out.tA[1]);
        std::swap(out.tB[0], out.tB[1]);
        std::swap(out.pts[0], out.pts[1]);
    }
}

}  // namespace

extern "C" TESSARINE_API int32_t NewLineSegSegIntersect(double x0, double y0, double x1, double y1,
                                                        double x2, double y2, double x3, double y3,
                                                        double a0, double a1, double b0, double b1,
                                                        int16_t allowOverlap, double *tA,
                                                        double *tB, BZ_Point *pts, uint16_t *count,
                                                        double tol, int16_t *kind) {
    const Entries out{tA, tB, pts, count};
    *kind = 0;
    *count = 0;
    if (!BZ_BBoxBoxInt(std::fmin(x0, x1), std::fmin(y0, y1), std::fmax(x0, x1), std::fmax(y0, y1),
                       std::fmin(x2, x3), std::fmin(y2, y3), std::fmax(x2, x3), std::fmax(y2, y3),
                       tol))
        return kOk;

    const double dx = x1 - x0, dy = y1 - y0;
    const double L1 = std::fabs(dx) + std::fabs(dy);
    const double L2 = std::fabs(x2 - x3) + std::fabs(y2 - y3);

    // Dots answer in raw parameters, not mapped into the ranges.
    if (L1 <= tol && L2 > tol) {
        double d = 0.0, t = 0.0;
        BZ_Point foot;
        BZ_Mindistpt2ln(x0, y0, x2, y2, x3, y3, &d, &t, &foot);
        if (d <= tol && t >= 0 && t <= 1) {
            *kind = 1;
            Put(out, 0, 0.0, t, BZ_Point{x0, y0});
            *count = 1;
        }
        return kOk;
    }
    if (L1 <= tol && L2 <= tol) {
        if (DistanceSQ(x0, y0, x2, y2) <= tol * tol) {
            *kind = 1;
            Put(out, 0, 0.0, 0.0, BZ_Point{x0, y0});
            *count = 1;
        }
        return kOk;
    }
    if (L2 <= tol && L1 > tol) {
        double d = 0.0, t = 0.0;
        BZ_Point foot;
        BZ_Mindistpt2ln(x2, y2, x0, y0, x1, y1, &d, &t, &foot);
        if (d <= tol && t >= 0 && t <= 1) {
            *kind = 1;
            Put(out, 0, t, 0.0, BZ_Point{x2, y2});
            *count = 1;
        }
        return kOk;
    }

    const double thr = L1 * tol * 6;
    const double c2 = (y2 - y0) * dx - (x2 - x0) * dy;
    const double c3 = (y3 - y0) * dx - (x3 - x0) * dy;
    BZ_Point u{dx, dy};
    int32_t status = BZ_Normvec(&u);
    if (tessarine::Failed(status)) return status;
    BZ_Point v{x3 - x2, y3 - y2};
    status = BZ_Normvec(&v);
    if (tessarine::Failed(status)) return status;
    const double s = std::fabs(BZ_Crossp(u.x, u.y, v.x, v.y));

    if (s <= kCollinearSine && std::fabs(c2) <= thr && std::fabs(c3) <= thr) {
        if (allowOverlap != 0) Overlap(x0, y0, x1, y1, x2, y2, x3, y3, a0, a1, b0, b1, out, kind);
        return kOk;
    }
    if ((c2 >= thr && c3 >= thr) || (c2 <= -thr && c3 <= -thr)) return kOk;
    const double ex = x3 - x2, ey = y3 - y2;
    const double thr2 = 2 * L2 * tol;
    const double c0 = (y0 - y2) * ex - (x0 - x2) * ey;
    const double c1 = (y1 - y2) * ex - (x1 - x2) * ey;
    // Strict on the negative side, unlike the test above.
    if ((c0 >= thr2 && c1 >= thr2) || (c0 < -thr2 && c1 < -thr2)) return kOk;
    double sA = c0 / (c0 - c1);
    double sB = c2 / (c2 - c3);
    if (sA < -kParamSlack || sA > 1 + kParamSlack || sB < -kParamSlack || sB > 1 + kParamSlack)
        return kOk;

    *kind = 1;
    BZ_Point point{x0 + dx * sA, y0 + dy * sA};
    bool near = true;
    if (sA < 0) {
        near = PullOntoEnd(&point, x0, y0, tol);
        sA = 0.0;
    } else if (sA > 1) {
        near = PullOntoEnd(&point, x1, y1, tol);
        sA = 1.0;
    }
    if (near && sB < 0) {
        near = PullOntoEnd(&point, x2, y2, tol);
        sB = 0.0;
    } else if (near && sB > 1) {
        near = PullOntoEnd(&point, x3, y3, tol);
        sB = 1.0;
    }
    if (!near) {
        *kind = 0;
        return kOk;
    }
    Put(out, *count, MapInto(sA, a0, a1), MapInto(sB, b0, b1), point);
    *count = static_cast<uint16_t>(*count + 1);
    return kOk;
}
