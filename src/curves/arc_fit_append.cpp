// The fit's append step: each new line or arc is offered to the last entry of
// the chain, and neighbours on one line or one circle become one entry.
#include "curves/arc_fit.h"

namespace tessarine::curves {

double FitAngle(Vec v) {
    const Vec u = UnitAbove(v, 1e-16);
    double c = u.x;
    if (1 < c && c <= 1.000001) c = 1;
    if (-1.000001 <= c && c < -1) c = -1;
    double angle = std::acos(c);
    if (u.y < 0) angle = kFitFullTurn - angle;
    return angle;
}

double FitSweep(double a0, double a3, double am) {
    if ((a0 < am && am < a3) || (a3 < am && am < a0)) return a3 - a0;
    if (a3 <= a0) return a3 - a0 + kFitFullTurn;
    return a3 - a0 - kFitFullTurn;
}

namespace {

// Start, inner point and end of an entry; for the last entry also the
// direction at its end.
struct Shape {
    Vec start;
    Vec inner;
    Vec end;
    Vec endDirection;
};

Vec OnCircle(const ArcFitEntry &arc, double angle) {
    const double r = std::fabs(arc.c);
    return Vec{arc.a + r * std::cos(angle), arc.b + r * std::sin(angle)};
}

Shape Describe(const ArcFitEntry &entry) {
    Shape s;
    if (entry.isArc != 0) {
        s.start = OnCircle(entry, entry.d);
        s.inner = OnCircle(entry, entry.d + entry.e * 0.5);
        s.end = OnCircle(entry, entry.d + entry.e);
        s.endDirection = Vec{-std::sin(entry.d + entry.e), std::cos(entry.d + entry.e)};
    } else {
        s.start = Vec{entry.a, entry.b};
        s.end = Vec{entry.c, entry.d};
        s.inner = Vec{(entry.a + entry.c) * 0.5, (entry.b + entry.d) * 0.5};
        s.endDirection = UnitAbove(Sub(s.inner, s.start), 1e-16);
    }
    return s;
}

void Store(ArcFitRun &run, const ArcFitEntry &e) {
    run.entries[*run.count] = e;
    ++*run.count;
    run.curTol = run.tol;
}

// Two lines: extend the last one when the new one carries on along it.
void OfferLineToLine(ArcFitRun &run, ArcFitEntry &last, const Shape &l, const ArcFitEntry &e,
                     const Shape &n) {
    const Vec v = UnitAtOrAbove(Sub(l.start, n.end), 1e-16);
    if (std::fabs(Cross(Sub(n.start, l.start), v)) <= run.curTol &&
        std::fabs(Cross(v, l.endDirection)) <= 0.08) {
        last.c = e.c;
        last.d = e.d;
        run.curTol *= 0.5;
        return;
    }
    ArcFitEntry &slot = run.entries[*run.count];
    slot.a = e.a;
    slot.b = e.b;
    slot.c = e.c;
    slot.d = e.d;
    slot.isArc = e.isArc;
    ++*run.count;
    run.curTol = run.tol;
}

// At least one arc: both go on one circle through the last start, the new
// start and the new end, when that circle holds both inner points.
void OfferToCircle(ArcFitRun &run, ArcFitEntry &last, const Shape &l, const ArcFitEntry &e,
                   const Shape &n) {
    const Vec v = UnitAbove(Sub(l.start, n.start), 1e-16);
    const Vec w = UnitAbove(Sub(n.end, n.start), 1e-16);
    const double cr = w.y * v.x - w.x * v.y;
    if (Dot(v, w) > 0 || std::fabs(cr) <= 1e-7) {
        Store(run, e);
        return;
    }
    const double D = Dot(Sub(n.end, l.start), w);
    const Vec c{(n.start.x + l.start.x) * 0.5 - D * v.y / (2 * cr),
                (n.start.y + l.start.y) * 0.5 + D * v.x / (2 * cr)};
    double R = FitRadius(Sub(c, l.start));
    const Vec radial = UnitAbove(Sub(l.start, c), 1e-16);
    if (!(std::fabs(Length(Sub(c, l.inner)) - R) <= run.curTol &&
          std::fabs(Length(Sub(c, n.inner)) - R) <= run.curTol &&
          std::fabs(Dot(radial, l.endDirection)) <= 0.08)) {
        Store(run, e);
        return;
    }
    const double a0 = FitAngle(Sub(l.start, c));
    const double a3 = FitAngle(Sub(n.end, c));
    const double am = FitAngle(Sub(n.start, c));
    const double sweep = FitSweep(a0, a3, am);
    if (Cross(Sub(l.start, c), Sub(l.inner, c)) > 0) R = -R;
    last.a = c.x;
    last.b = c.y;
    last.c = R;
    last.d = a0;
    last.e = sweep;
    last.isArc = 1;
    run.curTol *= 0.5;
}

void Append(ArcFitRun &run, const ArcFitEntry &e) {
    if (*run.count == 0) {
        run.entries[0] = e;
        *run.count = 1;
        return;
    }
    ArcFitEntry &last = run.entries[*run.count - 1];
    const Shape l = Describe(last);
    const Shape n = Describe(e);
    if (e.isArc == 0 && std::fabs(e.a - e.c) < 1e-11 && std::fabs(e.b - e.d) < 1e-11) return;
    if (last.isArc == 0 && e.isArc == 0) {
        OfferLineToLine(run, last, l, e, n);
    } else {
        OfferToCircle(run, last, l, e, n);
    }
}

}  // namespace

void AppendFitLine(ArcFitRun &run, Vec p0, Vec p3) {
    ArcFitEntry e{};
    e.a = p0.x;
    e.b = p0.y;
    e.c = p3.x;
    e.d = p3.y;
    e.e = 0;
    e.isArc = 0;
    Append(run, e);
}

void AppendFitArc(ArcFitRun &run, Vec centre, double radius, double startAngle, double sweep) {
    ArcFitEntry e{};
    e.a = centre.x;
    e.b = centre.y;
    e.c = radius;
    e.d = startAngle;
    e.e = sweep;
    e.isArc = 1;
    Append(run, e);
}

}  // namespace tessarine::curves
