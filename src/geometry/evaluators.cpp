// Evaluators of lines, arcs and cubics at a parameter, and the curve forms.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kErrArgument;
using tessarine::kErrDegenerate;
using tessarine::kOk;

namespace tessarine::geometry {

BZ_Point PointOnCircle(double centreX, double centreY, double radius, double angle) {
    double s = 0.0;
    double c = 0.0;
    GetSinCos(angle, &s, &c);
    return BZ_Point{c * radius + centreX, s * radius + centreY};
}

double ArcRadius(const BZ_Arc &arc) {
    return BZ_Distptpt(arc.centre.x, arc.centre.y, arc.start.x, arc.start.y);
}

}  // namespace tessarine::geometry

namespace {

bool ModeInRange(int16_t mode) { return mode >= 0 && mode <= 2; }

BZ_Point Horner(const BZ_CurveCoef &k, double t) {
    return BZ_Point{((k.a.x * t + k.b.x) * t + k.c.x) * t + k.d.x,
                    ((k.a.y * t + k.b.y) * t + k.c.y) * t + k.d.y};
}

BZ_Point FirstDerivative(const BZ_CurveCoef &k, double t) {
    return BZ_Point{3.0 * k.a.x * t * t + 2.0 * k.b.x * t + k.c.x,
                    3.0 * k.a.y * t * t + 2.0 * k.b.y * t + k.c.y};
}

BZ_Point SecondDerivative(const BZ_CurveCoef &k, double t) {
    return BZ_Point{2.0 * (3.0 * k.a.x * t + k.b.x), 2.0 * (3.0 * k.a.y * t + k.b.y)};
}

struct Chord {
    const BZ_Point *from;
    const BZ_Point *to;
};

}  // namespace

extern "C" {

TESSARINE_API int32_t BZ_LineEval(double x0, double y0, double x1, double y1, double t,
                                  int16_t mode, BZ_Point *out) {
    if (mode == 2) {
        out->x = 0.0;
        out->y = 0.0;
        return kOk;
    }
    if (mode == 0) {
        out->x = x0 + (x1 - x0) * t;
        out->y = y0 + (y1 - y0) * t;
        return kOk;
    }
    if (mode != 1) return kErrArgument;
    if (EqualPoints(x0, y0, x1, y1)) {
        out->x = 0.0;
        out->y = 0.0;
        return kErrDegenerate;
    }
    // The status of the normalisation is dropped on purpose: a segment that
    // passes EqualPoints but is too short to normalise gives 10 and zero.
    BZ_Point v{x1 - x0, y1 - y0};
    BZ_Normvec(&v);
    *out = v;
    return kOk;
}

TESSARINE_API int32_t BZ_ArcEval(double centreX, double centreY, double radius, double startAngle,
                                 double sweep, double t, int16_t mode, double *x, double *y) {
    if (t < -0.0001 || t - 1 > 0.0001 || !ModeInRange(mode)) return kErrArgument;
    if (std::fabs(t) < 0.0001) {
        t = 0.0;
    } else if (std::fabs(t - 1) < 0.0001) {
        t = 1.0;
    }
    const double angle = sweep * t + startAngle;
    const BZ_Point p = tessarine::geometry::PointOnCircle(centreX, centreY, radius, angle);
    if (mode == 0) {
        *x = p.x;
        *y = p.y;
        return kOk;
    }
    BZ_Point n{centreX - p.x, centreY - p.y};
    const int32_t status = BZ_Normvec(&n);
    if (status == kErrDegenerate) return status;
    if (mode == 2) {
        *x = n.x;
        *y = n.y;
    } else if (sweep > 0) {
        *x = n.y;
        *y = -n.x;
    } else {
        *x = -n.y;
        *y = n.x;
    }
    return status;
}

TESSARINE_API int32_t BZ_CurveEval(double x0, double y0, double x1, double y1, double x2, double y2,
                                   double x3, double y3, const BZ_CurveCoef *coef, double t,
                                   int16_t mode, double *x, double *y) {
    if (!ModeInRange(mode)) return kErrArgument;
    BZ_CurveCoef k;
    if (coef == nullptr) {
        const double control[8] = {x0, y0, x1, y1, x2, y2, x3, y3};
        double c[8];
        Bezier(control, c);
        k = BZ_CurveCoef{{c[0], c[1]}, {c[2], c[3]}, {c[4], c[5]}, {c[6], c[7]}};
    } else {
        k = *coef;
    }
    if (mode == 0) {
        const BZ_Point p = Horner(k, t);
        *x = p.x;
        *y = p.y;
        return kOk;
    }
    if (mode == 2) {
        const BZ_Point d2 = SecondDerivative(k, t);
        *x = d2.x;
        *y = d2.y;
        return kOk;
    }
    BZ_Point d = FirstDerivative(k, t);
    // A cubic's speed falls to zero at coincident handles, hence the looser
    // threshold on the square than the one of BZ_Normvec.
    if (d.x * d.x + d.y * d.y > 1e-8) {
        const int32_t status = BZ_Normvec(&d);
        *x = d.x;
        *y = d.y;
        return status;
    }
    // Otherwise a chord that points forward along the curve.
    const BZ_Point p = Horner(k, t);
    const BZ_Point p0{x0, y0}, p1{x1, y1}, p2{x2, y2}, p3{x3, y3};
    Chord chords[3];
    int n = 0;
    if (t < 0.0001) {
        chords[n++] = {&p, &p1};
        chords[n++] = {&p, &p2};
        chords[n++] = {&p, &p3};
    } else if (t >= 0.0001 && t < 0.5) {
        chords[n++] = {&p, &p2};
        chords[n++] = {&p, &p3};
    } else if (t >= 0.5 && t <= 0.9999) {
        chords[n++] = {&p1, &p};
        chords[n++] = {&p0, &p};
    } else {
        chords[n++] = {&p2, &p};
        chords[n++] = {&p1, &p};
        chords[n++] = {&p0, &p};
    }
    BZ_Point v{0.0, 0.0};
    int32_t status = kErrDegenerate;
    for (int i = 0; i < n; ++i) {
        status = BZ_GetNormVector(chords[i].from->x, chords[i].from->y, chords[i].to->x,
                                  chords[i].to->y, &v);
        if (status != kErrDegenerate) break;
    }
    *x = v.x;
    *y = v.y;
    return status;
}

TESSARINE_API int32_t BZ_beziereval(const BZ_CurveCoef *coef, double t, int16_t mode, double *x,
                                    double *y) {
    BZ_Point p;
    switch (mode) {
        case 0:
            p = Horner(*coef, t);
            break;
        case 1:
            p = FirstDerivative(*coef, t);
            break;
        case 2:
            p = SecondDerivative(*coef, t);
            break;
        default:
            return kErrArgument;
    }
    *x = p.x;
    *y = p.y;
    return kOk;
}

TESSARINE_API int32_t Bezier_Coef(double x0, double y0, double x1, double y1, double x2, double y2,
                                  double x3, double y3, BZ_CurveCoef *out) {
    out->a.x = 3.0 * (x1 - x2) - x0 + x3;
    out->a.y = 3.0 * (y1 - y2) - y0 + y3;
    out->b.x = 3.0 * (x0 - 2.0 * x1 + x2);
    out->b.y = 3.0 * (y0 - 2.0 * y1 + y2);
    out->c.x = 3.0 * (x1 - x0);
    out->c.y = 3.0 * (y1 - y0);
    out->d.x = x0;
    out->d.y = y0;
    return kOk;
}

TESSARINE_API int32_t GetBZpts(double x0, double y0, double x1, double y1, double x2, double y2,
                               double x3, double y3, BZ_Curve *out) {
    out->p0 = BZ_Point{x0, y0};
    out->p1 = BZ_Point{x1, y1};
    out->p2 = BZ_Point{x2, y2};
    out->p3 = BZ_Point{x3, y3};
    return kOk;
}

}  // extern "C"
