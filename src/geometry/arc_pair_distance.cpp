// Arc to arc: an angular class of the pair picks the method, the line of
// centres or the four ends.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;
using tessarine::geometry::ArcRadius;
using tessarine::geometry::kFarAway;
using tessarine::geometry::kFullTurn;
using tessarine::geometry::kPi;

namespace {

bool StrictlyBetween(double v, double a, double b) { return (a < v && v < b) || (b < v && v < a); }

}  // namespace

namespace tessarine::geometry {

int32_t BZ_AnglesOverlap(double start1, double sweep1, double start2, double sweep2) {
    // Plain numbers: no wrapping, so ranges a full turn apart do not overlap.
    const double end1 = start1 + sweep1;
    const double end2 = start2 + sweep2;
    return StrictlyBetween(start1, start2, end2) || StrictlyBetween(start2, start1, end1) ||
                   StrictlyBetween(end1, start2, end2) || StrictlyBetween(end2, start1, end1)
               ? 1
               : 0;
}

int32_t BZ_ArcPairClass(const BZ_Arc *arc1, const BZ_Arc *arc2) {
    const BZ_Point c1 = arc1->centre;
    const BZ_Point c2 = arc2->centre;
    if (BZ_Distptpts(c1.x, c1.y, c2.x, c2.y) < 1e-13)
        return BZ_AnglesOverlap(arc1->startAngle, arc1->sweep, arc2->startAngle, arc2->sweep) ? 5
                                                                                             : 3;
    double opposite = arc1->startAngle + kPi;
    if (opposite > kFullTurn) opposite -= kFullTurn;
    // Arc 1's opposite sector does not reach arc 2.
    if (!BZ_AnglesOverlap(opposite, arc1->sweep, arc2->startAngle, arc2->sweep)) return 2;
    const BZ_Point *ends1[2] = {&arc1->start, &arc1->end};
    const BZ_Point *ends2[2] = {&arc2->start, &arc2->end};
    bool meet = false;
    for (int i = 0; i < 2 && !meet; ++i) {
        for (int j = 0; j < 2 && !meet; ++j) {
            int16_t code = 0;
            double u = 0.0, v = 0.0;
            BZ_LinelineInt(c1.x, c1.y, ends1[i]->x, ends1[i]->y, c2.x, c2.y, ends2[j]->x,
                           ends2[j]->y, &code, &u, &v, nullptr);
            meet = code == 1 && u > 0 && v > 0;
        }
    }
    if (!meet) return 3;
    return BZ_Distptpt(c1.x, c1.y, c2.x, c2.y) < ArcRadius(*arc1) + ArcRadius(*arc2) ? 4 : 1;
}

int32_t BZ_ArcPairEndDist(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *on1, double *t1,
                          BZ_Point *on2, double *t2, double *distance) {
    double best = kFarAway;
    const double r1 = ArcRadius(*arc1);
    const double r2 = ArcRadius(*arc2);
    // An end of one arc against the other arc; on a tie the earlier stands.
    auto endAgainst = [&best](const BZ_Point &end, double endT, const BZ_Arc &other, double r,
                              BZ_Point *onEnd, double *tEnd, BZ_Point *onOther, double *tOther,
                              double *dist) {
        BZ_Point foot;
        double t = 0.0;
        double d = 0.0;
        const int32_t status = MindistPt2arc(
            end.x, end.y, other.centre.x, other.centre.y, r, other.startAngle, other.sweep,
            other.start.x, other.start.y, other.end.x, other.end.y, &foot, &t, &d);
        if (Failed(status)) return status;
        if (d < best) {
            best = d;
            *onEnd = end;
            *tEnd = endT;
            *onOther = foot;
            *tOther = t;
            *dist = d;
        }
        return status;
    };
    int32_t status = endAgainst(arc1->start, 0.0, *arc2, r2, on1, t1, on2, t2, distance);
    if (Failed(status)) return status;
    status = endAgainst(arc1->end, 1.0, *arc2, r2, on1, t1, on2, t2, distance);
    if (Failed(status)) return status;
    status = endAgainst(arc2->start, 0.0, *arc1, r1, on2, t2, on1, t1, distance);
    if (Failed(status)) return status;
    status = endAgainst(arc2->end, 1.0, *arc1, r1, on2, t2, on1, t1, distance);
    if (Failed(status)) return status;
    return kOk;
}

int32_t BZ_ArcPairCentreDist(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *on1, double *t1,
                             BZ_Point *on2, double *t2, double *distance) {
    const BZ_Line centres{arc1->centre, arc2->centre};
    BZ_Point p[2];
    double lt[2];
    double at[2];
    int16_t count = 0;
    int16_t code = 0;
    BZ_LineArcInt(&centres, arc1, p, lt, at, &count, &code);
    if (code == 0) return BZ_ArcPairEndDist(arc1, arc2, on1, t1, on2, t2, distance);
    *on1 = p[0];
    *t1 = at[0];
    const double arc1T = at[0];
    // The caller's two parameter addresses serve as the arrays of this run,
    // so that arc 1's address ends up with the line parameter; kept as it is.
    BZ_Point q[2];
    BZ_LineArcInt(&centres, arc2, q, t1, t2, &count, &code);
    if (code == 0) return BZ_ArcPairEndDist(arc1, arc2, on1, t1, on2, t2, distance);
    *on2 = q[0];
    *t2 = arc1T;
    *distance = BZ_Distptpt(on1->x, on1->y, on2->x, on2->y);
    return kOk;
}

}  // namespace tessarine::geometry

extern "C" TESSARINE_API int32_t BZ_MindistArcArc(const BZ_Arc *arc1, const BZ_Arc *arc2,
                                                  BZ_Point *on1, double *t1, BZ_Point *on2,
                                                  double *t2, double *distance) {
    using namespace tessarine::geometry;
    switch (BZ_ArcPairClass(arc1, arc2)) {
        case 1:
            return BZ_ArcPairCentreDist(arc1, arc2, on1, t1, on2, t2, distance);
        case 2:
        case 3:
        case 4:
            return BZ_ArcPairEndDist(arc1, arc2, on1, t1, on2, t2, distance);
        default:
            // One centre and overlapping ranges: no answer, neither success
            // nor failure.
            return 0;
    }
}
