// Whether two curves, or pieces of them, lie on each other. Plain
// subdivision never ends on such a pair, so the clipping method asks here.
#include <cmath>
#include <utility>

#include "core/status.h"
#include "curves/clip.h"

namespace tessarine::curves {

namespace {

BZ_Curve RightHalf(const BZ_Curve &c, double t) {
    BZ_Point l1, l2, m, r1, r2;
    SubDivideBezier(c.p0.x, c.p0.y, c.p1.x, c.p1.y, c.p2.x, c.p2.y, c.p3.x, c.p3.y, t, &l1.x, &l1.y,
                    &r2.x, &r2.y, &l2.x, &l2.y, &m.x, &m.y, &r1.x, &r1.y);
    return BZ_Curve{m, r1, r2, c.p3};
}

BZ_Curve LeftHalf(const BZ_Curve &c, double t) {
    BZ_Point l1, l2, m, r1, r2;
    SubDivideBezier(c.p0.x, c.p0.y, c.p1.x, c.p1.y, c.p2.x, c.p2.y, c.p3.x, c.p3.y, t, &l1.x, &l1.y,
                    &r2.x, &r2.y, &l2.x, &l2.y, &m.x, &m.y, &r1.x, &r1.y);
    return BZ_Curve{c.p0, l1, l2, m};
}

double Dist(BZ_Point a, BZ_Point b) {
    return Distance(a.x, a.y, b.x, b.y);
}

// The parameter at which the point lies on the curve, when it does.
bool LiesOn(const BZ_Curve &c, BZ_Point p, double tol, double *t) {
    double dist = 0.0, x = 0.0, y = 0.0;
    return SelectCurveTo_port(c.p0.x, c.p0.y, c.p1.x, c.p1.y, c.p2.x, c.p2.y, c.p3.x, c.p3.y, &dist,
                              t, &x, &y, p.x, p.y, tol, tol, tol) == 1;
}

bool Near(BZ_Point a, BZ_Point b) {
    return std::fabs(a.x - b.x) < 1e-5 && std::fabs(a.y - b.y) < 1e-5;
}

}  // namespace

int32_t ExtractSubCurve(const BZ_Curve &c, double t0, double t1, BZ_Curve *out) {
    if (t1 - t0 <= 1e-8 || 1 - t0 <= 1e-8) return kErrArgument;
    *out = LeftHalf(RightHalf(c, t0), (t1 - t0) / (1 - t0));
    return kOk;
}

int32_t CurvesCoincide(const BZ_Curve &a, double a0, double a1, const BZ_Curve &b, double b0,
                       double b1, double tol, int32_t *sameWay) {
    if (a1 - a0 <= 1e-8 || 1 - a0 <= 1e-8 || b1 - b0 <= 1e-8 || 1 - b0 <= 1e-8) return 0;
    BZ_Curve ca, cb;
    if (Failed(ExtractSubCurve(a, a0, a1, &ca)) || Failed(ExtractSubCurve(b, b0, b1, &cb)))
        return 0;
    double e0 = Dist(ca.p0, cb.p0);
    double e3 = Dist(ca.p3, cb.p3);
    double i1, i2;
    if (e0 <= tol && e3 <= tol) {
        *sameWay = 1;
        i1 = Dist(ca.p1, cb.p1);
        i2 = Dist(ca.p2, cb.p2);
    } else {
        e0 = Dist(ca.p0, cb.p3);
        e3 = Dist(ca.p3, cb.p0);
        if (e0 > tol || e3 > tol) return 0;
        *sameWay = 0;
        i1 = Dist(ca.p1, cb.p2);
        i2 = Dist(ca.p2, cb.p1);
    }
    if (i1 <= tol && i2 <= tol) return 1;
    // Inner control points may lie apart by up to nine times what the end
    // points left over of the tolerance.
    return (tol - e0 - e3) * 9 < i1 + i2 ? 0 : 1;
}

int32_t WholeCurvesCoincide(const BZ_Curve &a, const BZ_Curve &b, double tol,
                            const ClipResult &out) {
    *out.count = 0;
    int32_t sameWay = 0;
    if (!CurvesCoincide(a, 0.0, 1.0, b, 0.0, 1.0, tol, &sameWay)) return 0;
    *out.count = 2;
    out.tA[0] = 0.0;
    out.tA[1] = 1.0;
    out.tB[0] = sameWay ? 0.0 : 1.0;
    out.tB[1] = sameWay ? 1.0 : 0.0;
    out.pts[0] = a.p0;
    out.pts[1] = a.p3;
    return 1;
}

int16_t FindPartialOverlap(const BZ_Curve &a, const BZ_Curve &b, double tol,
                           const ClipResult &out) {
    double tA[2] = {0, 0}, tB[2] = {0, 0};
    BZ_Point pts[2] = {};
    int k = 0;
    double t = 0.0;
    if (LiesOn(b, a.p0, tol, &t)) {
        tA[k] = 0.0, tB[k] = t, pts[k] = a.p0;
        ++k;
    }
    if (LiesOn(b, a.p3, tol, &t)) {
        tA[k] = 1.0, tB[k] = t, pts[k] = a.p3;
        ++k;
    }
    if (k < 2 && !Near(b.p0, a.p0) && !Near(b.p0, a.p3) && LiesOn(a, b.p0, tol, &t)) {
        tA[k] = t, tB[k] = 0.0, pts[k] = b.p0;
        ++k;
    }
    if (k < 2 && !Near(b.p3, a.p0) && !Near(b.p3, a.p3) && LiesOn(a, b.p3, tol, &t)) {
        tA[k] = t, tB[k] = 1.0, pts[k] = b.p3;
        ++k;
    }
    if (k < 2) return 0;
    if (tA[0] > tA[1]) {
        std::swap(tA[0], tA[1]);
        std::swap(tB[0], tB[1]);
        std::swap(pts[0], pts[1]);
    }
    const double bLow = tB[0] < tB[1] ? tB[0] : tB[1];
    const double bHigh = tB[0] < tB[1] ? tB[1] : tB[0];
    int32_t sameWay = 0;
    if (!CurvesCoincide(a, tA[0], tA[1], b, bLow, bHigh, tol, &sameWay)) return 0;
    *out.count = 2;
    for (int i = 0; i < 2; ++i) {
        out.tA[i] = tA[i];
        out.pts[i] = pts[i];
    }
    out.tB[0] = sameWay ? bLow : bHigh;
    out.tB[1] = sameWay ? bHigh : bLow;
    return 4;
}

}  // namespace tessarine::curves
