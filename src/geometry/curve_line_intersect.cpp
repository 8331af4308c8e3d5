// Where a line meets a curve: the curve family's intersection, with the
// degenerate cases answered first.
#include <tessarine/curves.h>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kOk;

namespace {

// The most entries a curve pair can report.
constexpr int kMostCurveEntries = 14;

bool CurveIsOnePoint(double x0, double y0, double x1, double y1, double x2, double y2, double x3,
                     double y3) {
    return DistanceSQ(x0, y0, x1, y1) < 1e-13 && DistanceSQ(x0, y0, x2, y2) < 1e-13 &&
           DistanceSQ(x0, y0, x3, y3) < 1e-13;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t CL_CvLnIntersection(double x0, double y0, double x1, double y1, double x2,
                                          double y2, double x3, double y3, double lx0, double ly0,
                                          double lx1, double ly1, double tolerance,
                                          uint16_t *count, BZ_Point *points, double *curveT,
                                          double *lineT, int16_t *kind) {
    if (CurveIsOnePoint(x0, y0, x1, y1, x2, y2, x3, y3) || DistanceSQ(lx0, ly0, lx1, ly1) < 1e-13) {
        *count = 0;
        *kind = 2;
        return kOk;
    }
    const double curve[8] = {x0, y0, x1, y1, x2, y2, x3, y3};
    BZ_Point local[kMostCurveEntries];
    const int32_t status = NewLineCurveIntersect(lx0, ly0, lx1, ly1, curve, lineT, curveT, local,
                                                 count, tolerance, kind);
    if (!tessarine::Failed(status)) {
        for (int i = 0; i < *count && i < kMostCurveEntries; ++i) points[i] = local[i];
    }
    return status;
}

}  // extern "C"
