// Constants and internal operations of the geometry kernel. Nothing here is
// exported.
#pragma once

#include <tessarine/geometry.h>

#include <cstdint>

namespace tessarine::geometry {

inline constexpr double kPi = 3.141592653589793;
inline constexpr double kFullTurn = 6.283185307179586;
// Start value of every search for a least distance: farther than anything.
inline constexpr double kFarAway = 400000000.0;

// The point of a circle at an angle, the way the arc evaluator forms it.
BZ_Point PointOnCircle(double centreX, double centreY, double radius, double angle);
// Arc radius: the distance from centre to start.
double ArcRadius(const BZ_Arc &arc);

// Parameter of an angle on an arc, measured the nearer way out when the
// angle is off the arc. Always 10.
int32_t BZ_ArcParamOfAngle(double startAngle, double sweep, double angle, double *param);
// Two arcs of one circle, compared by their angles. Outs as BZ_ArcArcInt.
int32_t BZ_SameCircleArcInt(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *points, double *t1,
                            double *t2, int16_t *count, int16_t *code);

// 1 when the two angle ranges (start, sweep) overlap, as plain numbers.
int32_t BZ_AnglesOverlap(double start1, double sweep1, double start2, double sweep2);
// Class 1 to 5 of how two arcs' sectors face each other.
int32_t BZ_ArcPairClass(const BZ_Arc *arc1, const BZ_Arc *arc2);
int32_t BZ_ArcPairEndDist(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *on1, double *t1,
                          BZ_Point *on2, double *t2, double *distance);
// t1 and t2 must each have room for two doubles.
int32_t BZ_ArcPairCentreDist(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *on1, double *t1,
                             BZ_Point *on2, double *t2, double *distance);
int32_t BZ_LineArcPerpProbe(const BZ_Line *line, const BZ_Arc *arc, BZ_Point *onLine,
                            double *lineT, BZ_Point *onArc, double *arcT, double *distance);

// The three real roots of a depressed cubic (p, q, discriminant D, shift);
// each lands at the next free place of roots, and count advances only for a
// root in -T to 1 + T.
void CL_ThreeRealRoots(double p, double q, double D, double shift, double T, double *roots,
                       int16_t *count);

}  // namespace tessarine::geometry
