// Feeds arbitrary doubles (not numbers, infinities, huge and tiny values,
// degenerate curves) to the curve intersection, selection and conversion
// entry points: each must end with a status and stay in its memory.
#include <cstddef>
#include <cstdint>
#include <cstring>

#include <tessarine/curves.h>

#include "double_reader.h"

namespace {

using Reader = DoubleReader;

void Curves(Reader &in) {
    double a[8], b[8];
    for (double &v : a) v = in.Next();
    for (double &v : b) v = in.Next();
    const double tol = in.Next();
    double tA[14], tB[14];
    BZ_Point pts[14];
    uint16_t count = 0;
    int16_t kind = 0;
    NewCurveCurveIntersect(a, b, tA, tB, pts, &count, tol, &kind);
    NewLineCurveIntersect(b[0], b[1], b[6], b[7], a, tA, tB, pts, &count, tol, &kind);
    NewLineSegSegIntersect(a[0], a[1], a[6], a[7], b[0], b[1], b[6], b[7], 0, 1, 0, 1, 1, tA, tB,
                           pts, &count, tol, &kind);
    double dist, t, x, y;
    SelectCurveTo_port(a[0], a[1], a[2], a[3], a[4], a[5], a[6], a[7], &dist, &t, &x, &y, b[0],
                       b[1], tol, tol, tol);
    SarnSelectCurveTo(a[0], a[1], a[2], a[3], a[4], a[5], a[6], a[7], &dist, &t, &x, &y, b[0], b[1],
                      b[2], b[3]);
}

void Conversions(Reader &in) {
    const double radius = in.Next(), cx = in.Next(), cy = in.Next(), start = in.Next(),
                 sweep = in.Next();
    BZ_Point nodes[18];
    int16_t count = 0;
    ConvertArcToBezier(radius, cx, cy, start, sweep, nodes, &count);
    double xmin, ymin, xmax, ymax;
    CalcArcExtent(in.Next(), &xmin, &ymin, &xmax, &ymax, cx, cy, radius, start, sweep);

    const int16_t n = static_cast<int16_t>(2 + in.Byte() % 12);
    double x[14], y[14];
    for (int i = 0; i < n; ++i) {
        x[i] = in.Next();
        y[i] = in.Next();
    }
    double *outX = nullptr, *outY = nullptr;
    ArcToBezier(x, y, n, in.Next(), in.Next(), in.Next(), in.Next(), &outX, &outY, &count);
    if (outX != nullptr) MEM_FreeHdl(outX);
    if (outY != nullptr) MEM_FreeHdl(outY);

    BZ_Point four[4] = {{x[0], y[0]}, {x[1], y[1]}, {cx, cy}, {start, sweep}};
    BZ_Point out;
    CubicBezEval(four, in.Next(), static_cast<int16_t>(in.Byte() % 3), &out);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Reader in{data, size};
    if (in.Byte() & 1)
        Curves(in);
    else
        Conversions(in);
    return 0;
}
