// An interpolating C2 cubic spline with centripetal knots through a run of
// points, handed back as shared-end Bezier control points. Despite its name,
// ArcToBezier is this smooth-curve maker.
#include <cmath>
#include <initializer_list>

#include "core/status.h"
#include "curves/toolkit.h"
#include "storage/tile_format.h"

using tessarine::kErrArgument;
using tessarine::kErrMemory;
using tessarine::kOk;
using tessarine::curves::kQuarterTurn;
using tessarine::storage::ScopedBlock;

namespace {

// Working arrays of one call, carved from one zero-filled block. The long
// arrays keep room for n + 4 doubles: the two-point end rule reads W[2]
// before anything has written it.
struct SplineWork {
    int L = 0;
    double *u = nullptr, *wx = nullptr, *wy = nullptr, *dx = nullptr, *dy = nullptr;
    double *a = nullptr, *b = nullptr, *c = nullptr, *low = nullptr, *up = nullptr, *f = nullptr;

    // The knot with the ends repeated outside 0 to L.
    double Knot(int i) const { return u[i < 0 ? 0 : (i > L ? L : i)]; }
    // Knot interval, 0 outside 0 to L-1.
    double Delta(int i) const { return i < 0 || i > L - 1 ? 0.0 : u[i + 1] - u[i]; }
};

int32_t DirectionMode(BZ_Point *tangent, const BZ_Point &chord) {
    if (BZ_Normvec(tangent) < 0) return -1;
    if (std::fabs(BZminanglev1v2(tangent->x, tangent->y, chord.x, chord.y)) > kQuarterTurn) {
        tangent->x = -tangent->x;
        tangent->y = -tangent->y;
    }
    return 1;
}

// The tangent scaled to unit length again; a length below 0.0001 counts as 1.
BZ_Point UnitAgain(BZ_Point t) {
    double length = Distance(0.0, 0.0, t.x, t.y);
    if (length < 0.0001) length = 1.0;
    return BZ_Point{t.x / length, t.y / length};
}

// A parabola through the three end points, raised to a cubic; per coordinate.
double EndRuleStart(double alpha, double A, double B, double C) {
    const double beta = 1 - alpha;
    const double q = (B - alpha * alpha * A - beta * beta * C) / (2 * alpha * beta);
    return A / 3 + 2.0 / 3.0 * (beta * q + alpha * A);
}

double EndRuleEnd(double alpha, double A, double B, double C) {
    const double beta = 1 - alpha;
    const double q = (B - alpha * alpha * A - beta * beta * C) / (2 * alpha * beta);
    return C / 3 + 2.0 / 3.0 * (alpha * q + beta * C);
}

void TwoPointEndRule(SplineWork &w) {
    const double x1 = (2 * w.wx[0] + w.wx[3]) / 3, y1 = (2 * w.wy[0] + w.wy[3]) / 3;
    const double x2 = (2 * w.wx[3] + w.wx[0]) / 3, y2 = (2 * w.wy[3] + w.wy[0]) / 3;
    w.wx[1] = x1;
    w.wy[1] = y1;
    w.wx[2] = x2;
    w.wy[2] = y2;
}

void StartEndRule(SplineWork &w) {
    const int L = w.L;
    if (L == 1) return TwoPointEndRule(w);
    const double alpha = (w.u[2] - w.u[1]) / (w.u[2] - w.u[0]);
    const int ci = L >= 3 ? 3 : 4;
    w.wx[1] = EndRuleStart(alpha, w.wx[0], w.wx[2], w.wx[ci]);
    w.wy[1] = EndRuleStart(alpha, w.wy[0], w.wy[2], w.wy[ci]);
}

void EndEndRule(SplineWork &w) {
    const int L = w.L;
    if (L == 1) return TwoPointEndRule(w);
    if (L == 2) {
        const double alpha = (w.u[2] - w.u[1]) / (w.u[2] - w.u[0]);
        w.wx[3] = EndRuleEnd(alpha, w.wx[0], w.wx[2], w.wx[4]);
        w.wy[3] = EndRuleEnd(alpha, w.wy[0], w.wy[2], w.wy[4]);
        return;
    }
    const double alpha = (w.u[L] - w.u[L - 1]) / (w.u[L] - w.u[L - 2]);
    w.wx[L + 1] = EndRuleEnd(alpha, w.wx[L - 1], w.wx[L], w.wx[L + 2]);
    w.wy[L + 1] = EndRuleEnd(alpha, w.wy[L - 1], w.wy[L], w.wy[L + 2]);
}

// Rows a_i D[i] + b_i D[i+1] + c_i D[i+2] = W[i+1], then their factors.
int32_t BuildAndFactor(SplineWork &w) {
    const int L = w.L;
    w.b[0] = 1.0;
    w.b[L] = 1.0;
    for (int i = 1; i <= L - 1; ++i) {
        const double dm2 = w.Delta(i - 2), dm1 = w.Delta(i - 1), d0 = w.Delta(i),
                     dp1 = w.Delta(i + 1);
        const double s = dm1 + d0;
        if (FEQ(s, 0.0, 1e-13)) return kErrArgument;
        const double p = dm2 + s;
        const double m = s + dp1;
        w.a[i] = d0 * d0 / (p * s);
        w.b[i] = (d0 * (dm2 + dm1) / p + dm1 * (d0 + dp1) / m) / s;
        w.c[i] = dm1 * dm1 / (m * s);
    }
    w.up[0] = w.b[0];
    for (int i = 1; i <= L; ++i) {
        if (FEQ(w.up[i - 1], 0.0, 1e-13)) return kErrArgument;
        w.low[i] = w.a[i] / w.up[i - 1];
        w.up[i] = w.b[i] - w.low[i] * w.c[i - 1];
    }
    if (FEQ(w.up[L], 0.0, 1e-13)) return kErrArgument;
    return kOk;
}

void Solve(const SplineWork &w, const double *W, double *D) {
    const int L = w.L;
    D[0] = W[0];
    D[1] = W[1];
    w.f[0] = W[1];
    for (int i = 1; i <= L; ++i) w.f[i] = W[i + 1] - w.low[i] * w.f[i - 1];
    D[L + 1] = w.f[L] / w.up[L];
    for (int i = L - 1; i >= 1; --i) D[i + 1] = (w.f[i] - w.c[i] * D[i + 2]) / w.up[i];
    D[L + 2] = W[L + 2];
}

void ToBezier(const SplineWork &w, const double *D, double *B) {
    const int L = w.L;
    B[0] = D[0];
    B[1] = D[1];
    B[3 * L - 1] = D[L + 1];
    B[3 * L] = D[L + 2];
    for (int i = 1; i <= L - 1; ++i) {
        const double um2 = w.Knot(i - 2), um1 = w.Knot(i - 1), u0 = w.Knot(i), up1 = w.Knot(i + 1),
                     up2 = w.Knot(i + 2);
        B[3 * i - 1] = ((u0 - um2) * D[i + 1] + (up1 - u0) * D[i]) / (up1 - um2);
        B[3 * i + 1] = ((up2 - u0) * D[i + 1] + (u0 - um1) * D[i + 2]) / (up2 - um1);
        B[3 * i] = ((up1 - u0) * B[3 * i - 1] + (u0 - um1) * B[3 * i + 1]) / (up1 - um1);
    }
}

}  // namespace

extern "C" TESSARINE_API int32_t ArcToBezier(const double *x, const double *y, int16_t n,
                                             double startTangentX, double startTangentY,
                                             double endTangentX, double endTangentY, double **outX,
                                             double **outY, int16_t *count) {
    // Without two points there is no first chord to read.
    if (n < 2) return kErrArgument;
    BZ_Point first{x[1] - x[0], y[1] - y[0]};
    if (BZ_Normvec(&first) < 0) return 0;
    BZ_Point startTangent{startTangentX, startTangentY};
    const int32_t startMode = DirectionMode(&startTangent, first);
    BZ_Point last{x[n - 1] - x[n - 2], y[n - 1] - y[n - 2]};
    if (BZ_Normvec(&last) < 0) return 0;
    BZ_Point endTangent{endTangentX, endTangentY};
    const int32_t endMode = DirectionMode(&endTangent, last);

    // Both blocks go to the caller at once, whatever follows.
    const uint32_t outBytes = static_cast<uint32_t>(3 * n) * sizeof(double);
    double *bx = static_cast<double *>(MEM_AllocPtr(MEM_FLAG_ZERO, outBytes));
    double *by = static_cast<double *>(MEM_AllocPtr(MEM_FLAG_ZERO, outBytes));
    *outX = bx;
    *outY = by;
    if (bx == nullptr || by == nullptr) return kErrMemory;

    const int L = n - 1;
    const uint32_t longLen = static_cast<uint32_t>(n) + 4;
    const uint32_t bandLen = static_cast<uint32_t>(L) + 1;
    ScopedBlock block(MEM_AllocPtr(MEM_FLAG_ZERO, (5 * longLen + 6 * bandLen) * sizeof(double)));
    if (block.Get() == nullptr) return kErrMemory;
    double *p = static_cast<double *>(block.Get());
    SplineWork w;
    w.L = L;
    for (double **a : {&w.u, &w.wx, &w.wy, &w.dx, &w.dy}) {
        *a = p;
        p += longLen;
    }
    for (double **a : {&w.a, &w.b, &w.c, &w.low, &w.up, &w.f}) {
        *a = p;
        p += bandLen;
    }

    // Knot intervals go with the square root of the chord lengths.
    w.u[0] = 0.0;
    w.u[1] = 1.0;
    for (int i = 0; i <= n - 3; ++i) {
        const double ci = Distance(x[i], y[i], x[i + 1], y[i + 1]);
        const double cn = Distance(x[i + 1], y[i + 1], x[i + 2], y[i + 2]);
        double r = std::sqrt(ci / cn);
        if (r < 0.0001) r = 1.0;
        w.u[i + 2] = ((r + 1) * w.u[i + 1] - w.u[i]) / r;
    }

    w.wx[0] = x[0];
    w.wy[0] = y[0];
    w.wx[L + 2] = x[n - 1];
    w.wy[L + 2] = y[n - 1];
    for (int i = 1; i <= L - 1; ++i) {
        w.wx[i + 1] = x[i];
        w.wy[i + 1] = y[i];
    }

    if (startMode == 1) {
        const BZ_Point t = UnitAgain(startTangent);
        const double reach = Distance(w.wx[0], w.wy[0], w.wx[2], w.wy[2]);
        w.wx[1] = w.wx[0] + t.x * 0.3 * reach;
        w.wy[1] = w.wy[0] + t.y * 0.3 * reach;
    } else {
        StartEndRule(w);
    }
    if (endMode == 1) {
        const BZ_Point t = UnitAgain(endTangent);
        const double reach = Distance(w.wx[L], w.wy[L], w.wx[L + 2], w.wy[L + 2]);
        w.wx[L + 1] = w.wx[L + 2] - t.x * 0.3 * reach;
        w.wy[L + 1] = w.wy[L + 2] - t.y * 0.3 * reach;
    } else {
        EndEndRule(w);
    }

    const int32_t status = BuildAndFactor(w);
    if (status != kOk) return status;
    Solve(w, w.wx, w.dx);
    Solve(w, w.wy, w.dy);
    ToBezier(w, w.dx, bx);
    ToBezier(w, w.dy, by);
    *count = static_cast<int16_t>(3 * n - 2);
    return kOk;
}
