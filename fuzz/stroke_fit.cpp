// Feeds arbitrary doubles (not numbers, infinities, huge and tiny values,
// degenerate curves) to stroking, Bezier to arc, the curve clip and the box
// tests: each must end with a status and stay in its memory. The heap refuses
// blocks above 256 KiB here, so that a request for millions of points turns
// into the memory failure it would be on a small machine.
#include <cstddef>
#include <cstdint>

#include <tessarine/curves.h>

#include "double_reader.h"
#include "platform/test_hooks.h"

namespace {

struct HeapArrays {
    BZ_Point *points = nullptr;
    double *params = nullptr;
    ~HeapArrays() { Free(); }
    void Free() {
        if (points != nullptr) MEM_FreeHdl(points);
        if (params != nullptr) MEM_FreeHdl(params);
        points = nullptr;
        params = nullptr;
    }
};

VC_StrokeSpec Spec(DoubleReader &in) {
    VC_StrokeSpec s{};
    const uint8_t b = in.Byte();
    s.method = static_cast<int16_t>(b & 1);
    s.split = static_cast<int16_t>((b >> 1) % 4);
    s.tolerance = in.Next();
    return s;
}

void Stroking(DoubleReader &in) {
    BZ_Point fixedPoints[256];
    double fixedParams[256];
    HeapArrays heap;
    int32_t count = 0;
    int16_t onHeap = 0;
    int32_t capacity = 0;
    const double x0 = in.Next(), y0 = in.Next(), x1 = in.Next(), y1 = in.Next();
    VC_StrokeLnUniform(in.Next(), x0, y0, x1, y1, &count, &onHeap, &capacity, fixedPoints,
                       fixedParams, &heap.points, &heap.params);

    BZ_Arc arc;
    arc.start = BZ_Point{in.Next(), in.Next()};
    arc.mid = BZ_Point{in.Next(), in.Next()};
    arc.centre = BZ_Point{in.Next(), in.Next()};
    arc.startAngle = in.Next();
    arc.sweep = in.Next();
    arc.end = BZ_Point{in.Next(), in.Next()};
    // Arrays made while onHeap is 0 replace the handles: hand them back first.
    if (onHeap == 0) heap.Free();
    VC_SkArc(Spec(in), arc, &count, &onHeap, &capacity, fixedPoints, fixedParams, &heap.points,
             &heap.params);

    int16_t n16 = 0;
    BZ_Point *rendered = nullptr;
    if (VC_renderArc(in.Next(), 0, 0, arc.centre.x, arc.centre.y, in.Next(), arc.startAngle,
                     arc.sweep, &n16, &rendered) == 10 &&
        rendered != nullptr)
        MEM_FreeHdl(rendered);

    double v[8];
    for (double &d : v) d = in.Next();
    const VC_StrokeSpec spec = Spec(in);
    BZ_Point *points = nullptr;
    double *params = nullptr;
    if (VC_StrokeBezierCurve(spec, v[0], v[1], v[2], v[3], v[4], v[5], v[6], v[7], &count, &points,
                             &params) == 10 &&
        count > 0) {
        MEM_FreeHdl(points);
        MEM_FreeHdl(params);
    }
    heap.Free();
    VC_SkBezierCurve(spec, v[0], v[1], v[2], v[3], v[4], v[5], v[6], v[7], &count, &onHeap,
                     &capacity, fixedPoints, fixedParams, &heap.points, &heap.params);
}

void FitClipAndBoxes(DoubleReader &in) {
    double v[8];
    for (double &d : v) d = in.Next();
    ArcFitEntry entries[101];
    int16_t count = 0;
    BezierToArc(in.Next(), v[0], v[1], v[2], v[3], v[4], v[5], v[6], v[7], entries, &count);

    const double xmin = in.Next(), ymin = in.Next(), xmax = in.Next(), ymax = in.Next();
    BZ_Curve pieces[13];
    ClipBezierCV(xmin, ymin, xmax, ymax, v[0], v[1], v[2], v[3], v[4], v[5], v[6], v[7], &count,
                 pieces);
    const BZ_Point lo{xmin, ymin}, hi{xmax, ymax};
    int32_t result = 0;
    BZ_CurveBBoxInt(v[0], v[1], v[2], v[3], v[4], v[5], v[6], v[7], &lo, &hi, in.Next(), &result);
    const BZ_Curve curve{{v[0], v[1]}, {v[2], v[3]}, {v[4], v[5]}, {v[6], v[7]}};
    BZ_CVboxintersected(xmin, ymin, xmax, ymax, &curve);
    BZ_LNboxintersected(xmin, ymin, xmax, ymax, v[0], v[1], v[6], v[7]);
    BZ_ARCboxintersected(xmin, ymin, xmax, ymax, v[0], v[1], v[2], v[3], v[4]);
    BZ_LineBBoxInt(&curve.p0, &curve.p3, &lo, &hi, in.Next());

    double roots[3];
    int16_t n = 0, flag = 0;
    CL_Solv3orderEq(v[0], v[1], v[2], v[3], v[4], roots, &n, &flag);
    FindRootDegree2(v[5], v[6], v[7], &roots[0], &roots[1]);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    tessarine::testing::LimitAllocationSize(256 * 1024);
    DoubleReader in{data, size};
    if (in.Byte() & 1) {
        Stroking(in);
    } else {
        FitClipAndBoxes(in);
    }
    return 0;
}
