// Angular classification of a point of a circle against an arc, and the
// parameter an angle has on an arc.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;
using tessarine::geometry::kFullTurn;
using tessarine::geometry::kPi;

namespace {

double NonNegativeTurn(double a) { return BZonerevol(a < 0 ? a + kFullTurn : a); }

// Tested angle minus a mark, the shorter way round.
double ShortDifference(double angle, double mark) {
    double d = angle - mark;
    if (std::fabs(d) > kPi) d = d < 0 ? d + kFullTurn : d - kFullTurn;
    return BZonerevol(d);
}

}  // namespace

extern "C" TESSARINE_API int32_t BZ_PtOnWhichAreaofArc(double startAngle, double midAngle,
                                                       double endAngle, double angle,
                                                       int16_t *area) {
    // Marks: the start (tag 1), the point opposite the middle (tag 2), which
    // splits the rest of the circle between the two ends, and the end (tag 3).
    const double s = NonNegativeTurn(startAngle);
    const double e = NonNegativeTurn(endAngle);
    const double a = NonNegativeTurn(angle);
    double opposite = BZonerevol(midAngle + kPi);
    if (opposite < 0) opposite += kFullTurn;
    BZ_SortEntry marks[3] = {
        {ShortDifference(a, e), 3},
        {ShortDifference(a, opposite), 2},
        {ShortDifference(a, s), 1},
    };
    Sort_a(marks, 3);
    if (marks[2].key <= 0 || marks[1].key <= 0)
        *area = static_cast<int16_t>(marks[1].tag + marks[2].tag);
    else
        *area = static_cast<int16_t>(marks[0].tag + marks[1].tag);
    return kOk;
}

namespace tessarine::geometry {

int32_t BZ_ArcParamOfAngle(double startAngle, double sweep, double angle, double *param) {
    if (FEQ(sweep, 0.0, 1e-8)) {
        *param = 0.0;
        return kOk;
    }
    const double a = BZonerevol(BZccwdir(angle));
    const double s = BZonerevol(BZccwdir(startAngle));
    const double m = BZonerevol(BZccwdir(startAngle + 0.5 * sweep));
    const double e = BZonerevol(BZccwdir(startAngle + sweep));
    int16_t area = 0;
    BZ_PtOnWhichAreaofArc(s, m, e, a, &area);
    if (area == 3) {
        *param = sweep > 0 ? -(BZccwdir(s - a)) / sweep : -(BZcwdir(s - a)) / sweep;
    } else {
        *param = sweep > 0 ? (BZccwdir(a - s)) / sweep : (BZcwdir(a - s)) / sweep;
    }
    return kOk;
}

}  // namespace tessarine::geometry
