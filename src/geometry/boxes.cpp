// Boxes of segments, the point tests against a box and the outcode.
#include <tessarine/curves.h>

#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;

extern "C" {

TESSARINE_API void AssigXQ2DBox(double x0, double y0, double x1, double y1, BZ_Point *first,
                                BZ_Point *second) {
    *first = BZ_Point{x0, y0};
    *second = BZ_Point{x1, y1};
}

TESSARINE_API int32_t FindLineMinmaxBox(double x0, double y0, double x1, double y1, BZ_Point *min,
                                        BZ_Point *max) {
    *min = BZ_Point{x0 < x1 ? x0 : x1, y0 < y1 ? y0 : y1};
    *max = BZ_Point{x0 < x1 ? x1 : x0, y0 < y1 ? y1 : y0};
    return kOk;
}

TESSARINE_API int32_t BZ_FindCurveMinmaxBox(double x0, double y0, double x1, double y1,
                                            double x2, double y2, double x3, double y3,
                                            BZ_Point *min, BZ_Point *max) {
    TOV_CalcComponentExt(x0, x1, x2, x3, &min->x, &max->x);
    TOV_CalcComponentExt(y0, y1, y2, y3, &min->y, &max->y);
    return kOk;
}

TESSARINE_API int32_t BZ_FindArcMinmaxBox(BZ_Arc arc, BZ_Point *min, BZ_Point *max) {
    const double radius = tessarine::geometry::ArcRadius(arc);
    double start = arc.startAngle;
    double sweep = arc.sweep;
    if (sweep < 0) {
        start = start + sweep;
        sweep = -sweep;
    }
    CalcArcExtent(0, &min->x, &min->y, &max->x, &max->y, arc.centre.x, arc.centre.y, radius, start,
                  sweep);
    return kOk;
}

TESSARINE_API int32_t BZ_IsPtInBBox(const BZ_Point *point, const BZ_Point *min,
                                    const BZ_Point *max, double tolerance) {
    return min->x - tolerance <= point->x && point->x <= max->x + tolerance &&
                   min->y - tolerance <= point->y && point->y <= max->y + tolerance
               ? 1
               : 0;
}

TESSARINE_API double BZ_Mindistsqpt2BBox(double px, double py, double xmin, double ymin,
                                         double xmax, double ymax) {
    double dx = 0;
    if (px < xmin) dx = xmin - px;
    else if (px > xmax) dx = px - xmax;
    double dy = 0;
    if (py < ymin) dy = ymin - py;
    else if (py > ymax) dy = py - ymax;
    return dx * dx + dy * dy;
}

TESSARINE_API double BZ_Maxdistsqpt2BBox(double px, double py, double xmin, double ymin,
                                         double xmax, double ymax) {
    auto term = [](double p, double lo, double hi) {
        if (p < lo) return hi - p;
        if (p > hi) return p - lo;
        return hi - p > p - lo ? hi - p : p - lo;
    };
    const double dx = term(px, xmin, xmax);
    const double dy = term(py, ymin, ymax);
    return dx * dx + dy * dy;
}

TESSARINE_API int16_t GetOutCode(double xmin, double ymin, double xmax, double ymax, double px,
                                 double py) {
    int16_t code = 0;
    if (py > ymax) code |= 8;
    else if (py < ymin) code |= 4;
    if (px > xmax) code |= 2;
    else if (px < xmin) code |= 1;
    return code;
}

}  // extern "C"
