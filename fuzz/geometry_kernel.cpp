// Feeds arbitrary doubles (including infinities, NaNs and huge values) to the
// intersection, distance and merge operations: they must end and stay in
// their memory.
#include <cstddef>
#include <cstdint>
#include <cstring>

#include <tessarine/geometry.h>

#include "double_reader.h"

namespace {

struct Reader : DoubleReader {
    BZ_Point Point() { return BZ_Point{Next(), Next()}; }
    BZ_Arc Arc() {
        BZ_Arc a;
        a.start = Point();
        a.mid = Point();
        a.centre = Point();
        a.startAngle = Next();
        a.sweep = Next();
        a.end = Point();
        return a;
    }
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Reader in{{data, size}};
    const BZ_Line line{in.Point(), in.Point()};
    BZ_Arc a = in.Arc();
    BZ_Arc b = in.Arc();
    const double tol = in.Next();
    BZ_Point p[2];
    double t1[2], t2[2], d = 0;
    int16_t count = 0, code = 0, outcome = 0, asLine = 0;
    BZ_LineArcInt(&line, &a, p, t1, t2, &count, &code);
    BZ_BoundLineArcInt(&line, &a, p, t1, t2, &count, &code);
    BZ_ArcArcInt(&a, &b, p, t1, t2, &count, &code);
    BZ_BoundArcArcInt(&a, &b, p, t1, t2, &count, &code);
    BZ_MindistLineArc(&line, &a, &p[0], t1, &p[1], t2, &d);
    BZ_MindistArcArc(&a, &b, &p[0], t1, &p[1], t2, &d);
    BZ_Point centre;
    double r, s, w, l;
    BZ_3ptarcinfo(a.start.x, a.start.y, a.mid.x, a.mid.y, a.end.x, a.end.y, &centre, &r, &s, &w,
                  &l, &outcome);
    BZ_Arc out;
    Mergearcarc(&a, &b, tol, &asLine, &out, &outcome);
    Mergelnarc(&line, &a, 1, tol, &asLine, &out, &outcome);
    Mergelnarc(&a, &line, 0, tol, &asLine, &out, &outcome);
    BZ_Line merged;
    Mergelnln(&line, &line, tol, &merged, &outcome);
    BZ_Point mid;
    Chkcv2arc(a.start.x, a.start.y, a.mid.x, a.mid.y, a.centre.x, a.centre.y, a.end.x, a.end.y,
              tol, 0, &centre, &mid, &r, &s, &w, &outcome);
    return 0;
}
