// Whether a line or a cubic meets a box grown by a tolerance. Cheap tests
// first: the end points, then the segment's own box; a cubic is halved only
// where its box meets the tested one.
#include <tessarine/curves.h>

#include <initializer_list>

#include "core/status.h"
#include "geometry/kernel.h"
#include "curves/split.h"
#include "geometry/stroke.h"

using namespace tessarine;
using namespace tessarine::geometry;

namespace {

// 256 points are tested before eight more go on.
constexpr int kStackCurves = 66;
constexpr int kStackLimitPoints = 256;
// The stack bounds the depth but not the breadth: a curve of values near
// the smallest doubles can keep a full tree of pieces beside the box without
// any of them reaching the bound. So many halvings end the same way.
constexpr int64_t kMostHalvings = int64_t{1} << 20;

}  // namespace

extern "C" {

TESSARINE_API int32_t BZ_LineBBoxInt(const BZ_Point *p0, const BZ_Point *p1, const BZ_Point *min,
                                     const BZ_Point *max, double tolerance) {
    if (BZ_IsPtInBBox(p0, min, max, tolerance) || BZ_IsPtInBBox(p1, min, max, tolerance)) return 1;
    const double x0 = p0->x, y0 = p0->y, x1 = p1->x, y1 = p1->y;
    const double xmin = min->x, ymin = min->y, xmax = max->x, ymax = max->y;
    BZ_Point lmin;
    BZ_Point lmax;
    FindLineMinmaxBox(x0, y0, x1, y1, &lmin, &lmax);
    // A vertical or a horizontal line compares only its own axis.
    if (x0 == x1) {
        if (ymax + tolerance < lmin.y) return 0;
        return ymin - tolerance <= lmax.y ? 1 : 0;
    }
    const double slope = (y1 - y0) / (x1 - x0);
    for (const double x : {xmin, xmax}) {
        if (lmin.x <= x && x < lmax.x) {
            const double y = y0 + (x - x0) * slope;
            if (ymin - tolerance <= y && y < ymax + tolerance) return 1;
        }
    }
    if (y0 == y1) {
        if (xmax + tolerance < lmin.x) return 0;
        return xmin - tolerance <= lmax.x ? 1 : 0;
    }
    const double inverse = (x1 - x0) / (y1 - y0);
    if (lmin.y <= ymin && ymin < lmax.y) {
        const double x = x0 + (ymin - y0) * inverse;
        if (xmin - tolerance <= x && x < xmax + tolerance) return 1;
    }
    if (ymax < lmin.y || ymax > lmax.y) return 0;
    const double x = x0 + (ymax - y0) * inverse;
    return xmin - tolerance <= x && x <= xmax + tolerance ? 1 : 0;
}

TESSARINE_API int32_t BZ_CurveBBoxInt(double x0, double y0, double x1, double y1, double x2,
                                      double y2, double x3, double y3, const BZ_Point *min,
                                      const BZ_Point *max, double tolerance, int32_t *result) {
    const BZ_Curve curve{{x0, y0}, {x1, y1}, {x2, y2}, {x3, y3}};
    if (BZ_IsPtInBBox(&curve.p0, min, max, tolerance) ||
        BZ_IsPtInBBox(&curve.p3, min, max, tolerance)) {
        *result = 1;
        return kOk;
    }
    if (VC_FlatByPolygon(curve, tolerance)) {
        *result = BZ_LineBBoxInt(&curve.p0, &curve.p3, min, max, tolerance);
        return kOk;
    }
    BZ_Curve stack[kStackCurves];
    int64_t halvings = 0;
    int depth = 0;
    stack[depth++] = curve;
    while (depth > 0) {
        const BZ_Curve c = stack[--depth];
        double bx0 = 0, by0 = 0, bx1 = 0, by1 = 0;
        CalcCurvePathExtent(c.p0.x, c.p0.y, c.p1.x, c.p1.y, c.p2.x, c.p2.y, c.p3.x, c.p3.y, &bx0,
                            &by0, &bx1, &by1);
        if (!BZ_BBoxBoxInt(bx0, by0, bx1, by1, min->x, min->y, max->x, max->y, tolerance)) continue;
        if (VC_FlatByPolygon(c, tolerance)) {
            if (BZ_LineBBoxInt(&c.p0, &c.p3, min, max, tolerance)) {
                *result = 1;
                return kOk;
            }
            continue;
        }
        if (4 * depth >= kStackLimitPoints || ++halvings > kMostHalvings) {
            *result = 0;
            return kErrStackOverflow;
        }
        BZ_Curve left;
        BZ_Curve right;
        curves::SplitCurveAt(c, 0.5, &left, &right);
        if (BZ_IsPtInBBox(&left.p3, min, max, tolerance)) {
            *result = 1;
            return kOk;
        }
        stack[depth++] = right;
        stack[depth++] = left;
    }
    *result = 0;
    return kOk;
}

}  // extern "C"
