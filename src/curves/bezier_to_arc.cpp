// One cubic to a chain of lines and arcs: flat pieces become lines, convex
// pieces are tried against the circle through their start, middle and end,
// and everything else is halved, left half first, on a fixed stack.
#include <cstddef>

#include "core/status.h"
#include "curves/arc_fit.h"

namespace tessarine::curves {
namespace {

constexpr int kStackPoints = 100;

// The pending curves: a count of points, then the x and the y values, in one
// zero-filled block of the size the format has always had.
#pragma pack(push, 4)
struct CurveStack {
    int16_t count;
    double x[kStackPoints];
    double y[kStackPoints];
};
#pragma pack(pop)
static_assert(sizeof(CurveStack) == 1604);
static_assert(sizeof(ArcFitEntry) == 44);

struct Cubic {
    Vec p0, p1, p2, p3;
};

// Frees the stack block on every way out.
class StackBlock {
  public:
    StackBlock() : stack_(static_cast<CurveStack *>(MEM_AllocPtr(MEM_FLAG_ZERO, sizeof(CurveStack)))) {}
    ~StackBlock() {
        if (stack_ != nullptr) MEM_FreeHdl(stack_);
    }
    StackBlock(const StackBlock &) = delete;
    StackBlock &operator=(const StackBlock &) = delete;
    CurveStack *get() const { return stack_; }

  private:
    CurveStack *stack_;
};

// False when the stack would hold more than it has room for.
bool Push(CurveStack &s, const Cubic &c) {
    if (s.count + 4 > kStackPoints) return false;
    const Vec pts[4] = {c.p0, c.p1, c.p2, c.p3};
    for (const Vec &p : pts) {
        s.x[s.count] = p.x;
        s.y[s.count] = p.y;
        ++s.count;
    }
    return true;
}

Cubic Pop(CurveStack &s) {
    s.count = static_cast<int16_t>(s.count - 4);
    const int i = s.count;
    return Cubic{{s.x[i], s.y[i]}, {s.x[i + 1], s.y[i + 1]}, {s.x[i + 2], s.y[i + 2]},
                 {s.x[i + 3], s.y[i + 3]}};
}

Vec Mean(Vec a, Vec b) { return Vec{(a.x + b.x) * 0.5, (a.y + b.y) * 0.5}; }

struct Halves {
    Vec l1, q, r2, l2, r1, m;
    Cubic left() const { return Cubic{p0, l1, l2, m}; }
    Cubic right() const { return Cubic{m, r1, r2, p3}; }
    Vec p0, p3;
};

Halves Halve(const Cubic &c) {
    Halves h;
    h.p0 = c.p0;
    h.p3 = c.p3;
    h.l1 = Mean(c.p0, c.p1);
    h.q = Mean(c.p1, c.p2);
    h.r2 = Mean(c.p2, c.p3);
    h.l2 = Mean(h.l1, h.q);
    h.r1 = Mean(h.q, h.r2);
    h.m = Mean(h.l2, h.r1);
    return h;
}

// Right half first, so that the left half is worked first.
bool PushHalves(CurveStack &s, const Halves &h) { return Push(s, h.right()) && Push(s, h.left()); }

double HandleHeight(const Cubic &c) {
    const Vec chord = Sub(c.p3, c.p0);
    if (SquaredLength(chord) <= 1e-16) return 0;
    const Vec u = Unit(chord);
    const double h1 = std::fabs(Cross(Sub(c.p1, c.p0), u));
    const double h2 = std::fabs(Cross(Sub(c.p2, c.p3), u));
    return h1 > h2 ? h1 : h2;
}

bool HandlesAlongChord(const Cubic &c) {
    Vec u1;
    Vec u2;
    if (SquaredLength(Sub(c.p1, c.p0)) >= 1e-16) {
        u1 = Unit(Sub(c.p1, c.p0));
    } else {
        u1 = UnitAbove(Sub(c.p2, c.p0), 1e-16);
    }
    if (SquaredLength(Sub(c.p3, c.p2)) >= 1e-16) {
        u2 = Unit(Sub(c.p3, c.p2));
    } else {
        // The first handle's vector is the one replaced here; so it stays.
        u1 = Sub(c.p3, c.p1);
        u2 = Sub(c.p3, c.p2);
    }
    const Vec chord = Sub(c.p3, c.p0);
    const double limit = Length(chord) * 0.08;
    return std::fabs(chord.y * u1.x - chord.x * u1.y) <= limit &&
           std::fabs(chord.y * u2.x - chord.x * u2.y) <= limit;
}

bool IsConvexPolygon(const Cubic &c) {
    const Vec e[4] = {Sub(c.p1, c.p0), Sub(c.p2, c.p1), Sub(c.p3, c.p2), Sub(c.p0, c.p3)};
    bool negative = false;
    bool positive = false;
    for (int i = 0; i < 4; ++i) {
        const double k = Cross(e[i], e[(i + 1) % 4]);
        if (k < 0) negative = true;
        if (k > 0) positive = true;
    }
    return !(negative && positive);
}

Vec QuarterPoint(Vec a, Vec b, Vec c, Vec d) {
    return Vec{(a.x + 3 * b.x + 3 * c.x + d.x) / 8, (a.y + 3 * b.y + 3 * c.y + d.y) / 8};
}

// False only when a halving overflows the stack.
bool FitArcToCurve(ArcFitRun &run, CurveStack &stack, const Cubic &c) {
    const Halves h = Halve(c);
    if (SquaredLength(Sub(c.p0, c.p3)) < 1e-16 || SquaredLength(Sub(c.p0, h.m)) < 1e-16 ||
        SquaredLength(Sub(c.p3, h.m)) < 1e-16)
        return true;
    const Vec w = Unit(Sub(c.p0, h.m));
    const Vec z = Unit(Sub(c.p3, h.m));
    const double cr = z.y * w.x - z.x * w.y;
    if (std::fabs(cr) <= 1e-7) {
        AppendFitLine(run, c.p0, c.p3);
        return true;
    }
    const double D = Dot(Sub(c.p3, c.p0), z);
    const Vec centre{(h.m.x + c.p0.x) * 0.5 - D * w.y / (2 * cr),
                     (h.m.y + c.p0.y) * 0.5 + D * w.x / (2 * cr)};
    double R = FitRadius(Sub(centre, c.p0));
    const Vec q1 = QuarterPoint(c.p0, h.l1, h.l2, h.m);
    const Vec q3 = QuarterPoint(h.m, h.r1, h.r2, c.p3);
    if (std::fabs(Length(Sub(centre, q1)) - R) > run.tol ||
        std::fabs(Length(Sub(centre, q3)) - R) > run.tol)
        return PushHalves(stack, h);
    const Vec us = UnitAbove(Sub(h.l1, c.p0), 1e-16);
    const Vec ue = UnitAbove(Sub(c.p3, h.r2), 1e-16);
    if (std::fabs(Dot(Sub(c.p0, centre), us)) > 0.08 * R ||
        std::fabs(Dot(Sub(c.p3, centre), ue)) > 0.08 * R)
        return PushHalves(stack, h);
    const double a0 = FitAngle(Sub(c.p0, centre));
    const double a3 = FitAngle(Sub(c.p3, centre));
    const double am = FitAngle(Sub(h.m, centre));
    const double sweep = FitSweep(a0, a3, am);
    if (Cross(Sub(c.p0, centre), Sub(c.p3, centre)) > 0) R = -R;
    if (std::fabs(sweep) > 1.2217304763960306) return PushHalves(stack, h);
    AppendFitArc(run, centre, R, a0, sweep);
    return true;
}

}  // namespace
}  // namespace tessarine::curves

using namespace tessarine::curves;

extern "C" TESSARINE_API int32_t BezierToArc(double tol, double x0, double y0, double x1,
                                             double y1, double x2, double y2, double x3,
                                             double y3, ArcFitEntry *entries, int16_t *count) {
    StackBlock block;
    CurveStack *stack = block.get();
    if (stack == nullptr) return 0;
    *count = 0;
    ArcFitRun run{entries, count, tol, tol};
    Push(*stack, Cubic{{x0, y0}, {x1, y1}, {x2, y2}, {x3, y3}});
    while (stack->count >= 4) {
        const Cubic c = Pop(*stack);
        if (*count > 100) return 0;
        const double h = HandleHeight(c);
        if (h <= 0.001 && h <= tol * 1.333333 && HandlesAlongChord(c)) {
            AppendFitLine(run, c.p0, c.p3);
            continue;
        }
        const double m = std::fabs(c.p0.x - c.p3.x) + std::fabs(c.p0.y - c.p3.y);
        if (IsConvexPolygon(c) && m >= 1e-7) {
            if (!FitArcToCurve(run, *stack, c)) return 0;
            continue;
        }
        if (!PushHalves(*stack, Halve(c))) return 0;
    }
    return 1;
}
