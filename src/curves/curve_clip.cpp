// A cubic cut by an axis-aligned rectangle: every crossing of an edge is a
// cut, and each piece between cuts is kept when its middle point is inside.
#include <tessarine/curves.h>

#include <cmath>

#include "core/status.h"
#include "curves/split.h"

using namespace tessarine;

namespace {

// Four edges of at most three crossings each.
constexpr int kMostCuts = 12;
// What one edge can report: the curve family's largest answer.
constexpr int kMostEdgeEntries = 14;

struct Cut {
    double t;
    BZ_Point point;
};

struct Rect {
    double xmin, ymin, xmax, ymax;
    bool Holds(BZ_Point p) const {
        return xmin <= p.x && p.x <= xmax && ymin <= p.y && p.y <= ymax;
    }
};

// A piece is judged by its point at parameter 0.5.
bool MiddleInside(const BZ_Curve &c, const Rect &r) {
    BZ_Curve left;
    BZ_Curve right;
    tessarine::curves::SplitCurveAt(c, 0.5, &left, &right);
    return r.Holds(left.p3);
}

int32_t GatherCuts(const BZ_Curve &c, const Rect &r, Cut *cuts, int *n) {
    const double edges[4][4] = {{r.xmin, r.ymin, r.xmin, r.ymax},
                                {r.xmin, r.ymax, r.xmax, r.ymax},
                                {r.xmax, r.ymax, r.xmax, r.ymin},
                                {r.xmax, r.ymin, r.xmin, r.ymin}};
    for (const auto &e : edges) {
        uint16_t count = 0;
        int16_t kind = 0;
        BZ_Point points[kMostEdgeEntries];
        double curveT[kMostEdgeEntries];
        double lineT[kMostEdgeEntries];
        const int32_t status =
            CL_CvLnIntersection(c.p0.x, c.p0.y, c.p1.x, c.p1.y, c.p2.x, c.p2.y, c.p3.x, c.p3.y,
                                e[0], e[1], e[2], e[3], 1e-6, &count, points, curveT, lineT, &kind);
        // A dot comes with a failing status from the curve family; it only
        // means this edge gives no cut.
        if (kind == 2) continue;
        if (Failed(status)) return status;
        if (count > kMostEdgeEntries || *n + count > kMostCuts) return kErrTooComplex;
        for (int i = 0; i < count; ++i) cuts[(*n)++] = Cut{curveT[i], points[i]};
    }
    return kOk;
}

void SortCuts(Cut *cuts, int n) {
    for (int i = 0; i < n; ++i) {
        double lowest = 4e8;
        int at = i;
        for (int j = i; j < n; ++j) {
            if (cuts[j].t < lowest) {
                lowest = cuts[j].t;
                at = j;
            }
        }
        const Cut held = cuts[i];
        cuts[i] = cuts[at];
        cuts[at] = held;
    }
}

void RemoveCut(Cut *cuts, int *n, int i) {
    for (int j = i; j + 1 < *n; ++j) cuts[j] = cuts[j + 1];
    --*n;
}

// Cuts at the ends of the curve and twins of one crossing go.
void CleanCuts(Cut *cuts, int *n) {
    int i = 0;
    while (i < *n - 1) {
        if (std::fabs(cuts[i].t) < 0.0001) {
            RemoveCut(cuts, n, i);
        } else if (std::fabs(cuts[i].t - 1) < 0.0001) {
            *n = i;
            break;
        } else if (std::fabs(cuts[i].t - cuts[i + 1].t) < 0.0001 &&
                   DistanceSQ(cuts[i].point.x, cuts[i].point.y, cuts[i + 1].point.x,
                              cuts[i + 1].point.y) < 1e-13) {
            RemoveCut(cuts, n, i);
        } else {
            ++i;
        }
    }
    if (*n > 0 && std::fabs(cuts[0].t) < 0.0001) RemoveCut(cuts, n, 0);
    if (*n > 0 && std::fabs(cuts[*n - 1].t - 1) < 0.0001) --*n;
}

}  // namespace

extern "C" TESSARINE_API int32_t ClipBezierCV(double xmin, double ymin, double xmax, double ymax,
                                              double x0, double y0, double x1, double y1,
                                              double x2, double y2, double x3, double y3,
                                              int16_t *count, BZ_Curve *out) {
    *count = 0;
    const Rect rect{xmin, ymin, xmax, ymax};
    const BZ_Curve curve{{x0, y0}, {x1, y1}, {x2, y2}, {x3, y3}};
    Cut cuts[kMostCuts];
    int n = 0;
    const int32_t status = GatherCuts(curve, rect, cuts, &n);
    if (Failed(status)) return status;
    SortCuts(cuts, n);
    CleanCuts(cuts, &n);
    if (n == 0) {
        if (MiddleInside(curve, rect)) {
            out[0] = curve;
            *count = 1;
        }
        return kOk;
    }
    BZ_Curve rest = curve;
    for (int i = 0; i < n; ++i) {
        BZ_Curve left;
        BZ_Curve right;
        tessarine::curves::SplitCurveAt(rest, cuts[i].t, &left, &right);
        if (MiddleInside(left, rect)) out[(*count)++] = left;
        rest = right;
        for (int j = i + 1; j < n; ++j) cuts[j].t = (cuts[j].t - cuts[i].t) / (1 - cuts[i].t);
    }
    if (MiddleInside(rest, rect)) out[(*count)++] = rest;
    return kOk;
}
