// Demo of the geometry kernel: a circle through three points, intersections,
// a distance and a merge.
#include <cmath>
#include <cstdio>

#include <tessarine/tessarine.h>

#include "demo.h"

void DemoGeometry() {
    std::puts("Geometry kernel:");
    BZ_Point centre;
    double radius = 0, start = 0, sweep = 0, length = 0;
    int16_t outcome = 0;
    BZ_3ptarcinfo(1, 0, 0, 1, -1, 0, &centre, &radius, &start, &sweep, &length, &outcome);
    std::printf("  arc through (1,0) (0,1) (-1,0): outcome %d, centre (%.3f, %.3f), radius %.3f,"
                " sweep %.4f\n",
                outcome, centre.x, centre.y, radius, sweep);

    BZ_Arc arc{{1, 0}, {0, 1}, {0, 0}, 0, 3.141592653589793, {-1, 0}};
    BZ_Line line{{-2, 0.5}, {2, 0.5}};
    BZ_Point points[2];
    double lineT[2], arcT[2];
    int16_t count = 0, code = 0;
    BZ_BoundLineArcInt(&line, &arc, points, lineT, arcT, &count, &code);
    std::printf("  line y = 0.5 meets the upper half circle: code %d, %d points", code, count);
    for (int i = 0; i < count; ++i) std::printf(" (%.4f, %.4f)", points[i].x, points[i].y);
    std::puts("");

    BZ_Point foot;
    double t = 0, distance = 0;
    MindistPt2arc(0, 3, 0, 0, 1, 0, 3.141592653589793, 1, 0, -1, 0, &foot, &t, &distance);
    std::printf("  point (0, 3) to the arc: distance %.3f at parameter %.3f, foot (%.3f, %.3f)\n",
                distance, t, foot.x, foot.y);

    const double q = 0.7853981633974483;
    BZ_Arc first{{1, 0}, {std::cos(q / 2), std::sin(q / 2)}, {0, 0}, 0, q,
                 {std::cos(q), std::sin(q)}};
    BZ_Arc second{first.end, {std::cos(1.5 * q), std::sin(1.5 * q)}, {0, 0}, q, q,
                  {std::cos(2 * q), std::sin(2 * q)}};
    BZ_Arc merged;
    int16_t asLine = 0;
    const int32_t status = Mergearcarc(&first, &second, 1e-6, &asLine, &merged, &outcome);
    std::printf("  two 45-degree arcs merged: status %d, outcome %d, sweep %.4f\n",
                TS_STATUS(status), outcome, merged.sweep);
}
