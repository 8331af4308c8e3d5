/* Curve toolkit: conversions and the iterative methods on cubics. */
#ifndef TESSARINE_CURVES_H
#define TESSARINE_CURVES_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"
#include "core.h"
#include "geometry.h"

TESSARINE_BEGIN_C

/* ---- Arc and curve conversion ------------------------------------------------ */

/* Writes a run of (incoming handle, node, outgoing handle) triples; out needs
   room for 18 points. count is the number of points written. */
TESSARINE_API void ConvertArcToBezier(double radius, double centreX, double centreY,
                                      double startAngle, double sweep, BZ_Point *out,
                                      int16_t *count);
/* Interpolating cubic spline through n points, as 3n-2 shared-end control
   points. On success *outX and *outY are new blocks (room for 3n doubles each)
   that the caller frees with MEM_FreeHdl; they are also left with the caller
   when the solve fails (-4). */
TESSARINE_API int32_t ArcToBezier(const double *x, const double *y, int16_t n,
                                  double startTangentX, double startTangentY,
                                  double endTangentX, double endTangentY, double **outX,
                                  double **outY, int16_t *count);
/* Widens the box so that both points lie in it. */
TESSARINE_API void LineExtent(double x0, double y0, double x1, double y1, double *xmin,
                              double *ymin, double *xmax, double *ymax);
/* Overwrites the box with that of the arc; a width above -1e-8 widens the
   radius by half of it. */
TESSARINE_API void CalcArcExtent(double width, double *xmin, double *ymin, double *xmax,
                                 double *ymax, double centreX, double centreY, double radius,
                                 double startAngle, double sweep);
TESSARINE_API void SubDivideLine(double x0, double y0, double x1, double y1, double t, double *x,
                                 double *y);
/* Halves (P0, L1, L2, M) and (M, R1, R2, P3); mind the order of the pointers. */
TESSARINE_API void SubDivideBezier(double x0, double y0, double x1, double y1, double x2,
                                   double y2, double x3, double y3, double t, double *l1x,
                                   double *l1y, double *r2x, double *r2y, double *l2x,
                                   double *l2y, double *mx, double *my, double *r1x,
                                   double *r1y);
TESSARINE_API void ReverseCoord(BZ_Point *points, int16_t n);
/* order 0: the point at t; 1: the tangent there. */
TESSARINE_API int32_t CubicBezEval(const BZ_Point *points, double t, int16_t order,
                                   BZ_Point *out);

/* ---- Curve selection ------------------------------------------------------------
   1 for a hit, 0 for a miss (a truth value, not a status). */
TESSARINE_API int32_t SarnSelectCurveTo(double x0, double y0, double x1, double y1, double x2,
                                        double y2, double x3, double y3, double *dist, double *t,
                                        double *x, double *y, double px, double py, double limit,
                                        double eps);
TESSARINE_API int32_t SelectCurveTo_port(double x0, double y0, double x1, double y1, double x2,
                                         double y2, double x3, double y3, double *dist,
                                         double *t, double *x, double *y, double px, double py,
                                         double limit, double eps, double reject);

/* ---- Segment and curve intersection ------------------------------------------------
   Results go to the caller's arrays tA, tB, pts with their number in count;
   kind: 0 nothing, 1 points, 2 a piece is a dot (status -1), 3 the same
   curve, 4 an overlapping stretch (two entries, its ends). A segment pair
   writes at most 2 entries, a curve pair at most 14. */
TESSARINE_API int32_t NewLineSegSegIntersect(double x0, double y0, double x1, double y1,
                                             double x2, double y2, double x3, double y3,
                                             double a0, double a1, double b0, double b1,
                                             int16_t allowOverlap, double *tA, double *tB,
                                             BZ_Point *pts, uint16_t *count, double tol,
                                             int16_t *kind);
/* Curves are eight doubles each: x0, y0, x1, y1, x2, y2, x3, y3. A pair
   whose pieces never separate (a tolerance at or below the rounding of the
   coordinates, values that are not numbers) ends with -56. */
TESSARINE_API int32_t NewCurveCurveIntersect(const double *curveA, const double *curveB,
                                             double *tA, double *tB, BZ_Point *pts,
                                             uint16_t *count, double tol, int16_t *kind);
/* tA is the parameter on the line, 0 at (x0, y0). */
TESSARINE_API int32_t NewLineCurveIntersect(double x0, double y0, double x1, double y1,
                                            const double *curve, double *tA, double *tB,
                                            BZ_Point *pts, uint16_t *count, double tol,
                                            int16_t *kind);
/* Both curves serve as working storage and come back changed. */
TESSARINE_API int32_t TOV_Bezier_Clip(double *curveA, double *curveB, double *tA, double *tB,
                                      BZ_Point *pts, uint16_t *count, double tol,
                                      int16_t *kind);
TESSARINE_API void TOV_FindBezierPoint(double x0, double y0, double x1, double y1, double x2,
                                       double y2, double x3, double y3, double t, double *x,
                                       double *y);
TESSARINE_API void TOV_BoundingBox(double v0, double v1, double v2, double v3, double *min,
                                   double *max);
/* Adds the grouped terms of the integral of y dx; over a closed path the area
   is s1/2 + 3 s2/10 + s3/5 + 3 s4/20 + s5/20. */
TESSARINE_API void TOV_GetBezierArea(double x0, double y0, double x1, double y1, double x2,
                                     double y2, double x3, double y3, double *s1, double *s2,
                                     double *s3, double *s4, double *s5);
/* Adds to the accumulator of s1. */
TESSARINE_API void TOV_GetLineSegArea(double x0, double y0, double x1, double y1, double *s);

/* ---- curve fitting and clipping ---- */

/* One element of a fitted chain, 44 bytes apart. A line holds start (a, b),
   end (c, d) and e 0 (or left as it was when a merge appended the line); an
   arc holds centre (a, b), signed radius c (negative when it turns
   counter-clockwise), start angle d in 0 to a full turn, and signed sweep e. */
#pragma pack(push, 4)
typedef struct ArcFitEntry {
    double a;
    double b;
    double c;
    double d;
    double e;
    uint8_t isArc;
} ArcFitEntry;
#pragma pack(pop)

/* Replaces one cubic by lines and arcs within tol. entries needs room for 101
   elements. Returns 1 on success and 0 on failure (a truth value, not a
   status): too many elements, too deep a halving, or no memory. */
TESSARINE_API int32_t BezierToArc(double tol, double x0, double y0, double x1, double y1,
                                  double x2, double y2, double x3, double y3,
                                  ArcFitEntry *entries, int16_t *count);

/* Cuts a cubic by a rectangle and keeps the pieces inside; out needs room for
   13 curves. */
TESSARINE_API int32_t ClipBezierCV(double xmin, double ymin, double xmax, double ymax,
                                   double x0, double y0, double x1, double y1, double x2,
                                   double y2, double x3, double y3, int16_t *count,
                                   BZ_Curve *out);
/* The tight box of a cubic, from the extremes of the curve itself. */
TESSARINE_API void CalcCurvePathExtent(double x0, double y0, double x1, double y1, double x2,
                                       double y2, double x3, double y3, double *xmin,
                                       double *ymin, double *xmax, double *ymax);
/* The extent of one coordinate of a cubic. */
TESSARINE_API void TOV_CalcComponentExt(double c0, double c1, double c2, double c3, double *min,
                                        double *max);

TESSARINE_END_C

#endif
