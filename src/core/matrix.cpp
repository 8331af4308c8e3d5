// 2-by-3 transform matrices:  x' = x * a + y * c + e,  y' = x * b + y * d + f.
#include <algorithm>
#include <cmath>

#include <tessarine/core.h>

#include "core/rounding.h"

namespace {

struct IntPoint {
    int32_t x, y;
};

IntPoint ApplyInt(const QM &m, int32_t x, int32_t y) {
    const double fx = x;
    const double fy = y;
    const double tx = fx * m.a + fy * m.c + m.e;
    const double ty = fx * m.b + fy * m.d + m.f;
    const int32_t rx = tessarine::detail::LongRoundRule(tx);
    const int32_t ry = tessarine::detail::LongRoundRule(ty);
    return {rx, ry};
}

}  // namespace

extern "C" {

// No test of the determinant: a singular matrix gives infinities. Each value
// is stored as soon as it is computed, so out must not be m itself.
TESSARINE_API void QM_GetInverseQM(const QM *m, QM *out) {
    const double r = 1 / (m->a * m->d - m->b * m->c);
    out->a = r * m->d;
    out->b = -(r * m->b);
    out->c = -(r * m->c);
    out->d = r * m->a;
    out->e = (m->f * m->c - m->e * m->d) * r;
    out->f = (m->e * m->b - m->f * m->a) * r;
}

TESSARINE_API void QM_ApplyQmXY(const QM *m, double x, double y, double *outX, double *outY) {
    const double tx = x * m->a + y * m->c + m->e;
    const double ty = x * m->b + y * m->d + m->f;
    *outX = tx;
    *outY = ty;
}

TESSARINE_API void QM_ApplyQmPt(const QM *m, double *point) {
    QM_ApplyQmXY(m, point[0], point[1], &point[0], &point[1]);
}

TESSARINE_API void QM_ApplyQmIntXY(const QM *m, int32_t x, int32_t y, int32_t *outX,
                                   int32_t *outY) {
    const IntPoint p = ApplyInt(*m, x, y);
    *outX = p.x;
    *outY = p.y;
}

// The bounding rectangle of the four transformed corners, exclusive edges
// taken as they stand.
TESSARINE_API void QM_ApplyQmRECT(const QM *m, RECT *rect) {
    const IntPoint corners[4] = {
        ApplyInt(*m, rect->left, rect->top), ApplyInt(*m, rect->left, rect->bottom),
        ApplyInt(*m, rect->right, rect->top), ApplyInt(*m, rect->right, rect->bottom)};
    RECT r{corners[0].x, corners[0].y, corners[0].x, corners[0].y};
    for (const IntPoint &p : corners) {
        r.left = std::min(r.left, p.x);
        r.top = std::min(r.top, p.y);
        r.right = std::max(r.right, p.x);
        r.bottom = std::max(r.bottom, p.y);
    }
    *rect = r;
}

// A nearly zero angle gives an exact identity rotation.
TESSARINE_API void GetSinCos(double angle, double *sine, double *cosine) {
    if (std::fabs(angle) <= 1e-8) {
        *sine = 0.0;
        *cosine = 1.0;
        return;
    }
    *sine = std::sin(angle);
    *cosine = std::cos(angle);
}

}  // extern "C"
