// The pick question for a cubic: is the point on the curve, within a
// distance, and where? A coarse and a fine scan of the squared distance give
// Newton's method its start.
#include <cmath>

#include "curves/toolkit.h"

namespace {

struct Sextic {
    double c6, c5, c4, c3, c2, c1, c0;
    double F(double t) const {
        return (((((c6 * t + c5) * t + c4) * t + c3) * t + c2) * t + c1) * t + c0;
    }
    // g = f' and g' = f''.
    double G(double t) const {
        return ((((6 * c6 * t + 5 * c5) * t + 4 * c4) * t + 3 * c3) * t + 2 * c2) * t + c1;
    }
    double GPrime(double t) const {
        return (((30 * c6 * t + 20 * c5) * t + 12 * c4) * t + 6 * c3) * t + 2 * c2;
    }
};

double Dot(BZ_Point u, BZ_Point v) {
    return u.x * v.x + u.y * v.y;
}

}  // namespace

namespace tessarine::curves {

int LowestSample(const double S[9]) {
    int m = 0;
    for (int i = 1; i <= 7; ++i)
        if (S[i] < S[m]) m = i;
    return m;
}

int32_t NearestOnCubic(const BZ_CurveCoef &k, double px, double py, double *dist, double *t,
                       double *x, double *y, double limit, double eps) {
    *dist = 0.0;
    *y = 0.0;
    *x = 0.0;
    const BZ_Point P{px, py};
    const BZ_Point e{k.d.x - px, k.d.y - py};
    const Sextic f{Dot(k.a, k.a),
                   2 * Dot(k.a, k.b),
                   Dot(k.b, k.b) + 2 * Dot(k.a, k.c),
                   2 * (Dot(k.b, k.c) + Dot(k.a, e)),
                   Dot(k.c, k.c) + 2 * Dot(k.b, e),
                   2 * Dot(k.c, e),
                   Dot(k.d, k.d) + Dot(P, P) - 2 * Dot(k.d, P)};

    double S[9];
    S[0] = f.c0;
    for (int i = 1; i <= 7; ++i) S[i] = f.F(i * 0.125);
    int m = LowestSample(S);
    S[8] = f.F(1.0);

    // A bracket of a quarter with its two end samples.
    double low;
    if (S[8] < S[m]) {
        low = 0.75;
        S[0] = S[6];
    } else if (m == 0) {
        low = 0.0;
        S[8] = S[2];
    } else {
        low = m * 0.125 - 0.125;
        const double first = S[m - 1], last = S[m + 1];
        S[0] = first;
        S[8] = last;
    }
    for (int i = 1; i <= 7; ++i) S[i] = f.F(low + i * 0.03125);
    m = LowestSample(S);
    double tm = m == 0 ? low : low + m * 0.03125;
    if (S[8] < S[m]) {
        m = 8;
        tm = low + 0.25;
    }

    // The start moves a quarter step towards the lower neighbour.
    double t0;
    if (m == 0) {
        t0 = 0.015625;
    } else if (m == 8 || S[m - 1] < S[m + 1]) {
        t0 = tm - 0.015625;
    } else {
        t0 = tm + 0.015625;
    }

    double gp = f.GPrime(t0);
    if (FEQ(gp, 0.0, 1e-8)) return 0;
    double tc = t0 - f.G(t0) / gp;
    if (!(tc >= tm - 0.047 && tc <= tm + 0.047)) return 0;
    bool converged = false;
    for (int step = 2; step <= 20; ++step) {
        gp = f.GPrime(tc);
        if (FEQ(gp, 0.0, 1e-8)) return 0;
        const double next = tc - f.G(tc) / gp;
        if (next < -0.05 || next > 1.05) return 0;
        const bool close = FEQ(tc - next, 0.0, eps);
        tc = next;
        if (close) {
            converged = true;
            break;
        }
    }
    if (!converged) return 0;
    if (tc < -eps || tc > 1 + eps) return 0;
    *x = ((k.a.x * tc + k.b.x) * tc + k.c.x) * tc + k.d.x;
    *y = ((k.a.y * tc + k.b.y) * tc + k.c.y) * tc + k.d.y;
    const double d = Distance(*x, *y, px, py);
    if (d > limit) return 0;
    *dist = d;
    *t = tc;
    return 1;
}

}  // namespace tessarine::curves

extern "C" {

TESSARINE_API int32_t SarnSelectCurveTo(double x0, double y0, double x1, double y1, double x2,
                                        double y2, double x3, double y3, double *dist, double *t,
                                        double *x, double *y, double px, double py, double limit,
                                        double eps) {
    BZ_CurveCoef k;
    k.a = BZ_Point{3 * (x1 - x2) - x0 + x3, 3 * (y1 - y2) - y0 + y3};
    k.b = BZ_Point{3 * (x0 - 2 * x1 + x2), 3 * (y0 - 2 * y1 + y2)};
    k.c = BZ_Point{3 * (x1 - x0), 3 * (y1 - y0)};
    k.d = BZ_Point{x0, y0};
    return tessarine::curves::NearestOnCubic(k, px, py, dist, t, x, y, limit, eps);
}

TESSARINE_API int32_t SelectCurveTo_port(double x0, double y0, double x1, double y1, double x2,
                                         double y2, double x3, double y3, double *dist, double *t,
                                         double *x, double *y, double px, double py, double limit,
                                         double eps, double reject) {
    // A first-order estimate of the distance to the cubic's implicit locus:
    // the implicit equation at the pick point over its gradient.
    const BZ_Point d1{x1 - x0, y1 - y0}, d2{x2 - x1, y2 - y1}, d3{x3 - x2, y3 - y2};
    const BZ_Point A{d3.x - 2 * d2.x + d1.x, d3.y - 2 * d2.y + d1.y};
    const BZ_Point B{3 * (d2.x - d1.x), 3 * (d2.y - d1.y)};
    const BZ_Point C{3 * d1.x, 3 * d1.y};
    const BZ_Point Q{x0 - px, y0 - py};
    auto cross = [](BZ_Point u, BZ_Point v) { return u.x * v.y - u.y * v.x; };
    const double k0 = cross(Q, C), k1 = cross(Q, B), k2 = cross(Q, A);
    const double s = (B.y * C.x - B.x * C.y) + k2;
    const double e = A.y * C.x - A.x * C.y;
    const double w = A.y * B.x - A.x * B.y;
    const double p = w * s - e * e;
    const double q = w * k1 - e * k2;
    const double r = e * k1 - s * k2;
    const double n = (w * k0 - k2 * k2) + r;
    const double gx = n * A.y + (r * A.y + (p * C.y - q * B.y)) - q * B.y;
    const double gy = n * A.x + (r * A.x + (p * C.x - q * B.x)) - q * B.x;
    const double g2 = gx * gx + gy * gy;
    // For a straight cubic the determinant form vanishes, and only the full
    // search can answer.
    if (g2 > 1e-16) {
        const double estimate = std::fabs(r * k2 + (p * k0 - q * k1)) / std::sqrt(g2);
        if (estimate > reject) return 0;
        const double atStart = Distance(x0, y0, px, py);
        if (atStart < limit) {
            *t = 0.0;
            *dist = atStart;
            *x = x0;
            *y = y0;
            return 1;
        }
        const double atEnd = Distance(x3, y3, px, py);
        if (atEnd < limit) {
            *t = 1.0;
            *dist = atEnd;
            *x = x3;
            *y = y3;
            return 1;
        }
    }
    return SarnSelectCurveTo(x0, y0, x1, y1, x2, y2, x3, y3, dist, t, x, y, px, py, limit, eps);
}

}  // extern "C"
