// Whether a line, a cubic or an arc meets a bare box, without a tolerance.
// The line and the cubic also say where their ends lie.
#include <tessarine/curves.h>

#include "core/status.h"
#include "geometry/kernel.h"

namespace {

constexpr int16_t kNoContact = 0;
constexpr int16_t kCrosses = 4;
constexpr int16_t kStartInside = 5;
constexpr int16_t kEndInside = 6;
constexpr int16_t kBothInside = 7;

int16_t EndsRelation(int16_t c0, int16_t c1) {
    if (c0 == 0 && c1 == 0) return kBothInside;
    if (c0 == 0) return kStartInside;
    if (c1 == 0) return kEndInside;
    return kNoContact;
}

bool BoxesApart(const BZ_Point &min, const BZ_Point &max, double xmin, double ymin, double xmax,
                double ymax) {
    return max.x < xmin || min.x > xmax || max.y < ymin || min.y > ymax;
}

enum Edge { kBottom, kRight, kTop, kLeft };

// The edge on the far side from a point outside: the first set bit in the
// order 8, 4, 1, 2.
Edge FarEdge(int16_t code) {
    if (code & 8) return kBottom;
    if (code & 4) return kTop;
    if (code & 1) return kRight;
    return kLeft;
}

}  // namespace

extern "C" {

TESSARINE_API int16_t BZ_LNboxintersected(double xmin, double ymin, double xmax, double ymax,
                                          double x0, double y0, double x1, double y1) {
    const int16_t c0 = GetOutCode(xmin, ymin, xmax, ymax, x0, y0);
    const int16_t c1 = GetOutCode(xmin, ymin, xmax, ymax, x1, y1);
    const int16_t ends = EndsRelation(c0, c1);
    if (ends != kNoContact) return ends;
    if (c0 & c1) return kNoContact;
    const int16_t either = static_cast<int16_t>(c0 | c1);
    if (either & 8) {
        const double x = (x1 - x0) * (ymax - y0) / (y1 - y0) + x0;
        if (xmin < x && x < xmax) return kCrosses;
    }
    if (either & 4) {
        const double x = (x1 - x0) * (ymin - y0) / (y1 - y0) + x0;
        if (xmin < x && x < xmax) return kCrosses;
    }
    if (either & 1) {
        const double y = (xmin - x0) * (y1 - y0) / (x1 - x0) + y0;
        if (ymin < y && y < ymax) return kCrosses;
    }
    if (either & 2) {
        const double y = (xmax - x0) * (y1 - y0) / (x1 - x0) + y0;
        if (ymin < y && y < ymax) return kCrosses;
    }
    return kNoContact;
}

TESSARINE_API int16_t BZ_CVboxintersected(double xmin, double ymin, double xmax, double ymax,
                                          const BZ_Curve *curve) {
    const BZ_Curve &c = *curve;
    BZ_Point min;
    BZ_Point max;
    BZ_FindCurveMinmaxBox(c.p0.x, c.p0.y, c.p1.x, c.p1.y, c.p2.x, c.p2.y, c.p3.x, c.p3.y, &min,
                          &max);
    if (BoxesApart(min, max, xmin, ymin, xmax, ymax)) return kNoContact;
    const int16_t c0 = GetOutCode(xmin, ymin, xmax, ymax, c.p0.x, c.p0.y);
    const int16_t c3 = GetOutCode(xmin, ymin, xmax, ymax, c.p3.x, c.p3.y);
    const int16_t ends = EndsRelation(c0, c3);
    if (ends != kNoContact) return ends;
    const Edge skipped = FarEdge(c0);
    const double edges[4][4] = {{xmin, ymin, xmax, ymin},
                                {xmax, ymin, xmax, ymax},
                                {xmin, ymax, xmax, ymax},
                                {xmin, ymin, xmin, ymax}};
    const double control[8] = {c.p0.x, c.p0.y, c.p1.x, c.p1.y, c.p2.x, c.p2.y, c.p3.x, c.p3.y};
    for (int e = kBottom; e <= kLeft; ++e) {
        if (e == skipped) continue;
        double tA[14];
        double tB[14];
        BZ_Point pts[14];
        uint16_t count = 0;
        int16_t kind = 0;
        const int32_t status = NewLineCurveIntersect(edges[e][0], edges[e][1], edges[e][2],
                                                     edges[e][3], control, tA, tB, pts, &count,
                                                     0.01, &kind);
        // A test that fails counts as contact.
        if (tessarine::Failed(status) || count >= 1) return kCrosses;
    }
    return kNoContact;
}

TESSARINE_API int32_t BZ_ARCboxintersected(double xmin, double ymin, double xmax, double ymax,
                                           double centreX, double centreY, double radius,
                                           double startAngle, double sweep) {
    using tessarine::geometry::PointOnCircle;
    BZ_Arc arc;
    arc.centre = BZ_Point{centreX, centreY};
    arc.startAngle = startAngle;
    arc.sweep = sweep;
    arc.start = PointOnCircle(centreX, centreY, radius, startAngle);
    arc.end = PointOnCircle(centreX, centreY, radius, startAngle + sweep);
    // The probe's angle is the half sum of angle and sweep, as it has always been.
    arc.mid = PointOnCircle(centreX, centreY, radius, (startAngle + sweep) / 2);
    BZ_Point min;
    BZ_Point max;
    BZ_FindArcMinmaxBox(arc, &min, &max);
    if (BoxesApart(min, max, xmin, ymin, xmax, ymax)) return 0;
    const int16_t cs = GetOutCode(xmin, ymin, xmax, ymax, arc.start.x, arc.start.y);
    if (cs == 0 || GetOutCode(xmin, ymin, xmax, ymax, arc.end.x, arc.end.y) == 0 ||
        GetOutCode(xmin, ymin, xmax, ymax, arc.mid.x, arc.mid.y) == 0)
        return 1;
    const Edge skipped = FarEdge(cs);
    const struct {
        Edge edge;
        BZ_Line line;
    } edges[4] = {{kBottom, {{xmin, ymin}, {xmax, ymin}}},
                  {kLeft, {{xmin, ymin}, {xmin, ymax}}},
                  {kRight, {{xmax, ymax}, {xmax, ymin}}},
                  {kTop, {{xmax, ymax}, {xmin, ymax}}}};
    for (const auto &e : edges) {
        if (e.edge == skipped) continue;
        BZ_Point points[2];
        double lineT[2];
        double arcT[2];
        int16_t count = 0;
        int16_t code = 0;
        BZ_BoundLineArcInt(&e.line, &arc, points, lineT, arcT, &count, &code);
        if (code != 0) return 1;
    }
    return 0;
}

}  // extern "C"
