// Merging of two adjacent segments into one line or one arc, within a
// distance tolerance.
#include <cmath>
#include <initializer_list>
#include <cstring>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrDegenerate;
using tessarine::kOk;
using tessarine::geometry::ArcRadius;

namespace {

constexpr int16_t kNoMerge = -1;
constexpr int16_t kMerged = 10;
// Joint angle from which two lines count as straight: 175 degrees.
constexpr double kStraightJoint = 3.054326191;
// Largest direction error of a merged segment: 5 degrees.
constexpr double kDirectionError = 0.087266462;
// Largest sweep of a merged arc: 162 degrees.
constexpr double kLargestSweep = 2.827433388;
// Sine of the turn at the joint above which three points make a circle.
constexpr double kLeastTurn = 0.001;
constexpr double kGap = 1e-13;

bool Apart(const BZ_Point &a, const BZ_Point &b) { return BZ_Distptpts(a.x, a.y, b.x, b.y) >= kGap; }

double AngleBetween(const BZ_Point &u, const BZ_Point &v) {
    return std::fabs(BZminanglev1v2(u.x, u.y, v.x, v.y));
}

double DistanceToCarrier(const BZ_Point &p, const BZ_Point &a, const BZ_Point &e) {
    double d = 0.0;
    BZ_Mindistpt2ln(p.x, p.y, a.x, a.y, e.x, e.y, &d, nullptr, nullptr);
    return d;
}

bool OnCircle(const BZ_Point &centre, double radius, const BZ_Point &p, double tolerance) {
    return std::fabs(radius - BZ_Distptpt(centre.x, centre.y, p.x, p.y)) <= tolerance;
}

int32_t ArcTangent(const BZ_Arc &arc, double radius, double t, BZ_Point *out) {
    return BZ_ArcEval(arc.centre.x, arc.centre.y, radius, arc.startAngle, arc.sweep, t, 1, &out->x,
                      &out->y);
}

void WriteLine(void *out, const BZ_Point &a, const BZ_Point &e) {
    const BZ_Line line{a, e};
    std::memcpy(out, &line, sizeof line);
}

void WriteArc(void *out, const BZ_Arc &arc) { std::memcpy(out, &arc, sizeof arc); }

// The circle through A, J and E, when it passes the tests that every merge
// to an arc shares: a real turn at J, and a sweep below the limit.
struct Circle {
    BZ_Point centre;
    double radius;
    double startAngle;
    double sweep;
};

bool CircleThrough(const BZ_Point &a, const BZ_Point &j, const BZ_Point &e, const BZ_Point &w1,
                   const BZ_Point &w2, Circle *circle) {
    if (!(std::fabs(BZ_Crossp(w1.x, w1.y, w2.x, w2.y)) > kLeastTurn &&
          BZ_Dotp(w1.x, w1.y, w2.x, w2.y) < 0))
        return false;
    int16_t outcome = 0;
    BZ_3ptarcinfo(a.x, a.y, j.x, j.y, e.x, e.y, &circle->centre, &circle->radius,
                  &circle->startAngle, &circle->sweep, nullptr, &outcome);
    if (outcome != kOk) return false;
    return std::fabs(circle->sweep) < kLargestSweep;
}

// Tangents of the new circle at its ends against the directions wanted
// there. A failed evaluator counts as a failed test.
int32_t EndsAgree(const Circle &k, const BZ_Point &atStart, const BZ_Point &atEnd, bool *agree) {
    *agree = false;
    BZ_Point t;
    int32_t s = BZ_ArcEval(k.centre.x, k.centre.y, k.radius, k.startAngle, k.sweep, 0.0, 1, &t.x,
                           &t.y);
    if (Failed(s)) return s;
    if (!(AngleBetween(atStart, t) <= kDirectionError)) return kOk;
    s = BZ_ArcEval(k.centre.x, k.centre.y, k.radius, k.startAngle, k.sweep, 1.0, 1, &t.x, &t.y);
    if (Failed(s)) return s;
    *agree = AngleBetween(atEnd, t) <= kDirectionError;
    return kOk;
}

// Writes the merged arc; start first, as the mid comes from an evaluator.
int32_t WriteMergedArc(void *out, const BZ_Point &a, const BZ_Point &e, const Circle &k) {
    BZ_Arc arc;
    arc.start = a;
    std::memcpy(out, &arc.start, sizeof arc.start);
    const int32_t s = BZ_ArcEval(k.centre.x, k.centre.y, k.radius, k.startAngle, k.sweep, 0.5, 0,
                                 &arc.mid.x, &arc.mid.y);
    if (Failed(s)) return s;
    arc.centre = k.centre;
    arc.startAngle = k.startAngle;
    arc.sweep = k.sweep;
    arc.end = e;
    WriteArc(out, arc);
    return kOk;
}

// The arc attempt's last step: when the circle's end directions agree with
// the operands', the merged arc is written and the outcome set.
int32_t MergeArcIfEndsAgree(const Circle &k, const BZ_Point &atStart, const BZ_Point &atEnd,
                            const BZ_Point &a, const BZ_Point &e, void *out, int16_t *outcome,
                            bool *merged) {
    *merged = false;
    int32_t status = EndsAgree(k, atStart, atEnd, merged);
    if (Failed(status) || !*merged) return status;
    status = WriteMergedArc(out, a, e, k);
    if (Failed(status)) {
        *merged = false;
        return status;
    }
    *outcome = kMerged;
    return kOk;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t Mergelnln(const BZ_Line *line1, const BZ_Line *line2, double tolerance,
                                BZ_Line *out, int16_t *outcome) {
    *outcome = kNoMerge;
    if (Apart(line1->end, line2->start)) return kErrArgument;
    const BZ_Point a = line1->start;
    const BZ_Point j = line1->end;
    const BZ_Point e = line2->end;
    BZ_Point w1;
    BZ_Point w2;
    const int32_t s1 = BZ_GetNormVector(j.x, j.y, a.x, a.y, &w1);
    const int32_t s2 = BZ_GetNormVector(j.x, j.y, e.x, e.y, &w2);
    // A line of no length vanishes into the other without a test.
    if (s1 != kErrDegenerate && s2 != kErrDegenerate) {
        if (AngleBetween(w1, w2) < kStraightJoint) return kOk;
        if (DistanceToCarrier(j, a, e) > tolerance) return kOk;
    }
    out->start = a;
    out->end = e;
    *outcome = kMerged;
    return kOk;
}

TESSARINE_API int32_t Mergelnarc(const void *first, const void *second, int16_t order,
                                 double tolerance, int16_t *asLine, void *out, int16_t *outcome) {
    *outcome = kNoMerge;
    if (asLine != nullptr) *asLine = 0;
    const bool arcFirst = order == 0;
    BZ_Arc arc;
    BZ_Line line;
    std::memcpy(&arc, arcFirst ? first : second, sizeof arc);
    std::memcpy(&line, arcFirst ? second : first, sizeof line);
    const BZ_Point firstEnd = arcFirst ? arc.end : line.end;
    const BZ_Point secondStart = arcFirst ? line.start : arc.start;
    if (Apart(firstEnd, secondStart)) return kErrArgument;
    const BZ_Point a = arcFirst ? arc.start : line.start;
    const BZ_Point j = secondStart;
    const BZ_Point e = arcFirst ? line.end : arc.end;

    // The arc's direction is the tangent at its end wherever the arc stands.
    BZ_Point arcDir{0.0, 0.0};
    BZ_Point lineDir;
    const int32_t arcStatus = ArcTangent(arc, ArcRadius(arc), 1.0, &arcDir);
    const int32_t lineStatus =
        BZ_GetNormVector(line.start.x, line.start.y, line.end.x, line.end.y, &lineDir);
    const BZ_Point d1 = arcFirst ? arcDir : lineDir;
    const BZ_Point d2 = arcFirst ? lineDir : arcDir;

    auto arcDegenerate = [&]() -> bool { return arcStatus == kErrDegenerate; };
    auto lineDegenerate = [&]() -> bool { return lineStatus == kErrDegenerate; };
    // Degenerate operands merge without a test, taken in the record order.
    for (int k = 0; k < 2; ++k) {
        const bool testLine = (k == 0) != arcFirst;
        if (testLine && lineDegenerate()) {
            BZ_Arc merged = arc;
            if (arcFirst)
                merged.end = e;
            else
                merged.start = a;
            WriteArc(out, merged);
            *outcome = kMerged;
            return kOk;
        }
        if (!testLine && arcDegenerate()) {
            if (asLine == nullptr) return kErrDegenerate;
            *asLine = 1;
            WriteLine(out, a, e);
            *outcome = kMerged;
            return kOk;
        }
    }
    if (Failed(arcStatus)) return arcStatus;

    const BZ_Point lineMid{(line.start.x + line.end.x) * 0.5, (line.start.y + line.end.y) * 0.5};
    const BZ_Point p1 = arcFirst ? arc.mid : lineMid;
    const BZ_Point p2 = arcFirst ? lineMid : arc.mid;
    BZ_Point w1;
    BZ_Point w2;
    int32_t status = BZ_GetNormVector(j.x, j.y, a.x, a.y, &w1);
    if (Failed(status)) return status;
    status = BZ_GetNormVector(j.x, j.y, e.x, e.y, &w2);
    if (Failed(status)) return status;

    Circle k;
    if (CircleThrough(a, j, e, w1, w2, &k) && OnCircle(k.centre, k.radius, p1, tolerance) &&
        OnCircle(k.centre, k.radius, p2, tolerance)) {
        bool merged = false;
        status = MergeArcIfEndsAgree(k, d1, d2, a, e, out, outcome, &merged);
        if (Failed(status) || merged) return status;
    }
    if (asLine == nullptr) return kOk;
    if (!(DistanceToCarrier(j, a, e) <= tolerance)) return kOk;
    if (!(DistanceToCarrier(arc.mid, a, e) <= tolerance)) return kOk;
    BZ_Point chord;
    if (BZ_GetNormVector(a.x, a.y, e.x, e.y, &chord) == kErrDegenerate) return kOk;
    if (!(AngleBetween(d1, chord) < kDirectionError && AngleBetween(d2, chord) < kDirectionError))
        return kOk;
    WriteLine(out, a, e);
    *asLine = 1;
    *outcome = kMerged;
    return kOk;
}

TESSARINE_API int32_t Mergearcarc(const BZ_Arc *arc1, const BZ_Arc *arc2, double tolerance,
                                  int16_t *asLine, void *out, int16_t *outcome) {
    if (Apart(arc1->end, arc2->start)) return kErrArgument;
    *outcome = kNoMerge;
    if (asLine != nullptr) *asLine = 0;
    const BZ_Point a = arc1->start;
    const BZ_Point j = arc2->start;
    const BZ_Point e = arc2->end;
    const BZ_Point m1 = arc1->mid;
    const BZ_Point m2 = arc2->mid;

    // An arc of no radius vanishes into the other.
    const double r1 = ArcRadius(*arc1);
    if (r1 < 1e-8) {
        BZ_Arc merged = *arc2;
        merged.start = a;
        WriteArc(out, merged);
        *outcome = kMerged;
        return kOk;
    }
    BZ_Point t1s, t1e;
    int32_t status = ArcTangent(*arc1, r1, 0.0, &t1s);
    if (Failed(status)) return status;
    status = ArcTangent(*arc1, r1, 1.0, &t1e);
    if (Failed(status)) return status;
    const double r2 = ArcRadius(*arc2);
    if (r2 < 1e-8) {
        BZ_Arc merged = *arc1;
        merged.end = e;
        WriteArc(out, merged);
        *outcome = kMerged;
        return kOk;
    }
    BZ_Point t2s, t2e;
    status = ArcTangent(*arc2, r2, 0.0, &t2s);
    if (Failed(status)) return status;
    status = ArcTangent(*arc2, r2, 1.0, &t2e);
    if (Failed(status)) return status;

    // A kinked joint is pulled towards the middle of the two arcs' middles,
    // so that a small kink does not bend the circle.
    double w = BZ_Crossp(t1e.x, t1e.y, t2s.x, t2s.y);
    if (w > 0.7) w = 0.7;
    const BZ_Point jp{(1 - w) * j.x + w * (m1.x + m2.x) / 2, (1 - w) * j.y + w * (m1.y + m2.y) / 2};
    BZ_Point w1;
    BZ_Point w2;
    status = BZ_GetNormVector(jp.x, jp.y, a.x, a.y, &w1);
    if (Failed(status)) return status;
    status = BZ_GetNormVector(jp.x, jp.y, e.x, e.y, &w2);
    if (Failed(status)) return status;

    Circle k;
    bool arcOk = CircleThrough(a, jp, e, w1, w2, &k) && OnCircle(k.centre, k.radius, m1, tolerance) &&
                 OnCircle(k.centre, k.radius, m2, tolerance) &&
                 OnCircle(k.centre, k.radius, j, tolerance);
    if (arcOk) {
        // Samples at 1.25 and 1.75 times each start angle, not fractions of
        // the sweep.
        const BZ_Arc *arcs[2] = {arc1, arc2};
        const double radii[2] = {r1, r2};
        for (int i = 0; i < 2 && arcOk; ++i) {
            for (double factor : {1.25, 1.75}) {
                const BZ_Point p = tessarine::geometry::PointOnCircle(
                    arcs[i]->centre.x, arcs[i]->centre.y, radii[i], factor * arcs[i]->startAngle);
                if (!OnCircle(k.centre, k.radius, p, tolerance)) {
                    arcOk = false;
                    break;
                }
            }
        }
    }
    if (arcOk) {
        bool merged = false;
        status = MergeArcIfEndsAgree(k, t1s, t2e, a, e, out, outcome, &merged);
        if (Failed(status) || merged) return status;
    }
    if (asLine == nullptr) return kOk;
    if (!(DistanceToCarrier(m1, a, e) <= tolerance && DistanceToCarrier(j, a, e) <= tolerance &&
          DistanceToCarrier(m2, a, e) <= tolerance))
        return kOk;
    BZ_Point chord;
    BZ_GetVector(a.x, a.y, e.x, e.y, &chord);
    if (!(AngleBetween(t1s, chord) < kDirectionError && AngleBetween(t2e, chord) < kDirectionError))
        return kOk;
    WriteLine(out, a, e);
    *asLine = 1;
    *outcome = kMerged;
    return kOk;
}

}  // extern "C"
