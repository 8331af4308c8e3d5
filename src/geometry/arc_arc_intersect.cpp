// Arc with arc: the circles, arcs of one circle compared by their angles, and
// the bounded form.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;
using tessarine::geometry::ArcRadius;
using tessarine::geometry::BZ_ArcParamOfAngle;
using tessarine::geometry::BZ_SameCircleArcInt;

namespace {

bool InUnit(double v) { return v >= 0 && v <= 1; }

double AngleSeenFrom(const BZ_Point &centre, const BZ_Point &p) {
    return std::atan2(p.y - centre.y, p.x - centre.x);
}

}  // namespace

namespace tessarine::geometry {

int32_t BZ_SameCircleArcInt(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *points, double *t1,
                            double *t2, int16_t *count, int16_t *code) {
    const double s1 = arc1->startAngle;
    const double e1 = arc1->startAngle + arc1->sweep;
    const double s2 = arc2->startAngle;
    const double e2 = arc2->startAngle + arc2->sweep;
    double ps2 = 0.0, pe2 = 0.0, qs1 = 0.0, qe1 = 0.0;
    BZ_ArcParamOfAngle(arc1->startAngle, arc1->sweep, s2, &ps2);
    BZ_ArcParamOfAngle(arc1->startAngle, arc1->sweep, e2, &pe2);
    BZ_ArcParamOfAngle(arc2->startAngle, arc2->sweep, s1, &qs1);
    BZ_ArcParamOfAngle(arc2->startAngle, arc2->sweep, e1, &qe1);
    const bool onS2 = InUnit(ps2), onE2 = InUnit(pe2), onS1 = InUnit(qs1), onE1 = InUnit(qe1);
    *count = 0;
    if (!onS2 && !onE2 && !onS1 && !onE1) {
        *code = 8;
        return kOk;
    }
    if (onS2 && onE2 && onS1 && onE1) {
        // They cover each other; snap the parameters on arc 2 to its nearer end.
        points[0] = arc1->start;
        t1[0] = 0.0;
        t2[0] = qs1 > 0.5 ? 1.0 : 0.0;
        points[1] = arc1->end;
        t1[1] = 1.0;
        t2[1] = qe1 > 0.5 ? 1.0 : 0.0;
        *count = 2;
        *code = 3;
        return kOk;
    }
    *code = 4;
    auto add = [&](const BZ_Point &p, double a, double b) {
        points[*count] = p;
        t1[*count] = a;
        t2[*count] = b;
        ++*count;
    };
    if (onS1) add(arc1->start, 0.0, qs1);
    if (onE1) add(arc1->end, 1.0, qe1);
    if (*count < 2 && onS2) add(arc2->start, ps2, 0.0);
    if (*count < 2 && onE2) add(arc2->end, pe2, 1.0);
    return kOk;
}

}  // namespace tessarine::geometry

extern "C" {

TESSARINE_API int32_t BZ_ArcArcInt(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *points,
                                   double *t1, double *t2, int16_t *count, int16_t *code) {
    *count = 0;
    *code = 0;
    const double r1 = ArcRadius(*arc1);
    const double r2 = ArcRadius(*arc2);
    const BZ_Point c1 = arc1->centre;
    const BZ_Point c2 = arc2->centre;
    const double dd = BZ_Distptpt(c1.x, c1.y, c2.x, c2.y);
    const double d2 = BZ_Distptpts(c1.x, c1.y, c2.x, c2.y);
    if (dd > r1 + r2 || dd < std::fabs(r1 - r2) || r1 < 1e-8 || r2 < 1e-8) return kOk;
    if (dd >= 1e-8) {
        // Tangent circles too give two (equal) points.
        const BZ_Point e{c2.x - c1.x, c2.y - c1.y};
        const BZ_Point n{-e.y / dd, e.x / dd};
        const double k = 0.5 - ((r2 * r2 - r1 * r1) / d2) * 0.5;
        const double h = BZ_sqrt(r1 * r1 - k * k * d2);
        const BZ_Point p0{c1.x + k * e.x + h * n.x, c1.y + k * e.y + h * n.y};
        const BZ_Point p1{p0.x - 2.0 * h * n.x, p0.y - 2.0 * h * n.y};
        points[0] = p0;
        points[1] = p1;
        for (int i = 0; i < 2; ++i) {
            BZ_ArcParamOfAngle(arc1->startAngle, arc1->sweep, AngleSeenFrom(c1, points[i]),
                               &t1[i]);
            BZ_ArcParamOfAngle(arc2->startAngle, arc2->sweep, AngleSeenFrom(c2, points[i]),
                               &t2[i]);
        }
        *count = 2;
        *code = 1;
        return kOk;
    }
    if (std::fabs(r1 - r2) < 1e-8)
        return BZ_SameCircleArcInt(arc1, arc2, points, t1, t2, count, code);
    return kOk;
}

TESSARINE_API int32_t BZ_BoundArcArcInt(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *points,
                                        double *t1, double *t2, int16_t *count, int16_t *code) {
    *code = 0;
    *count = 0;
    const BZ_Arc a = *arc1;
    const BZ_Arc b = *arc2;
    BZ_Point p[2];
    double u1[2];
    double u2[2];
    int16_t n = 0;
    int16_t plain = 0;
    const int32_t status = BZ_ArcArcInt(&a, &b, p, u1, u2, &n, &plain);
    if (plain == 0 || plain == 8) return status;
    for (int i = 0; i < n; ++i) {
        if (!InUnit(u1[i]) || !InUnit(u2[i])) continue;
        points[*count] = p[i];
        t1[*count] = u1[i];
        t2[*count] = u2[i];
        ++*count;
        *code = plain;
    }
    return status;
}

}  // extern "C"
