/* Geometry kernel: planar records, evaluators, boxes, intersection, distance, merging and stroking. */
#ifndef TESSARINE_GEOMETRY_H
#define TESSARINE_GEOMETRY_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"
#include "core.h"

TESSARINE_BEGIN_C

/* ---- Planar records ---------------------------------------------------------
   Angles are radians, counter-clockwise positive. Lengths are in the caller's
   units. An arc's radius is not stored: it is the distance from centre to
   start, and a writer of a BZ_Arc keeps all six fields consistent. */

typedef struct BZ_Point {
    double x;
    double y;
} BZ_Point;

typedef struct BZ_Line {
    BZ_Point start;
    BZ_Point end;
} BZ_Line;

typedef struct BZ_Arc {
    BZ_Point start;
    BZ_Point mid;
    BZ_Point centre;
    double startAngle;
    double sweep; /* signed: positive is counter-clockwise */
    BZ_Point end;
} BZ_Arc;

typedef struct BZ_Curve {
    BZ_Point p0;
    BZ_Point p1;
    BZ_Point p2;
    BZ_Point p3;
} BZ_Curve;

/* point(t) = ((a t + b) t + c) t + d */
typedef struct BZ_CurveCoef {
    BZ_Point a;
    BZ_Point b;
    BZ_Point c;
    BZ_Point d;
} BZ_CurveCoef;

typedef struct XQ2DBox {
    BZ_Point min;
    BZ_Point max;
} XQ2DBox;

typedef struct BZ_SortEntry {
    double key;
    int16_t tag;
} BZ_SortEntry;

/* ---- Vectors and angles ---------------------------------------------------- */

TESSARINE_API double BZ_Crossp(double x1, double y1, double x2, double y2);
TESSARINE_API double BZ_Dotp(double x1, double y1, double x2, double y2);
TESSARINE_API double BZ_Magsvec(double x, double y);
TESSARINE_API double BZ_Magvec(double x, double y);
TESSARINE_API double BZ_Distptpt(double x0, double y0, double x1, double y1);
/* BZ_Distptpts is declared with DistanceSQ in core.h. */
TESSARINE_API int32_t BZ_GetVector(double x0, double y0, double x1, double y1, BZ_Point *out);
TESSARINE_API int32_t BZ_Normvec(BZ_Point *vector);
TESSARINE_API int32_t BZ_GetNormVector(double x0, double y0, double x1, double y1, BZ_Point *out);
TESSARINE_API int32_t BZ_Rotatevec(double angle, BZ_Point *vector);
TESSARINE_API int32_t BZ_vecequal(int16_t allowOpposite, double x1, double y1, double x2, double y2,
                                  int16_t *status);
TESSARINE_API int32_t rotateDir(double x1, double y1, double x2, double y2, double tolerance);
TESSARINE_API void BZ_Polar2Cart(double angle, double radius, double *x, double *y);
TESSARINE_API double BZ_sqrt(double x);
TESSARINE_API double BZ_acos(double x);
TESSARINE_API double BZ_atan2z(double y, double x, double fallback);
TESSARINE_API double BZminanglev1v2(double x1, double y1, double x2, double y2);

/* ---- Directions ------------------------------------------------------------- */

TESSARINE_API double BZccwdir(double a);
TESSARINE_API double BZcwdir(double a);
TESSARINE_API double BZsym(double a);
TESSARINE_API double BZeven(double a);
TESSARINE_API double BZodd(double a);
TESSARINE_API double BZcomp(double a);
TESSARINE_API double BZonerevol(double a);
TESSARINE_API double BZmindir(double a);

/* ---- Evaluators and curve forms ---------------------------------------------
   mode 0: point; 1: direction; 2: normal or second derivative. */

TESSARINE_API int32_t BZ_LineEval(double x0, double y0, double x1, double y1, double t,
                                  int16_t mode, BZ_Point *out);
TESSARINE_API int32_t BZ_ArcEval(double centreX, double centreY, double radius, double startAngle,
                                 double sweep, double t, int16_t mode, double *x, double *y);
TESSARINE_API int32_t BZ_CurveEval(double x0, double y0, double x1, double y1, double x2, double y2,
                                   double x3, double y3, const BZ_CurveCoef *coef, double t,
                                   int16_t mode, double *x, double *y);
TESSARINE_API int32_t BZ_beziereval(const BZ_CurveCoef *coef, double t, int16_t mode, double *x,
                                    double *y);
TESSARINE_API int32_t Bezier_Coef(double x0, double y0, double x1, double y1, double x2, double y2,
                                  double x3, double y3, BZ_CurveCoef *out);
TESSARINE_API int32_t GetBZpts(double x0, double y0, double x1, double y1, double x2, double y2,
                               double x3, double y3, BZ_Curve *out);

/* ---- Frames ------------------------------------------------------------------
   A 2D frame matrix is four doubles m0..m3; a 3D one nine, row after row. */

TESSARINE_API int32_t VC_xformMatrix(double angle, double *matrix);
TESSARINE_API int32_t BZ_2Doldtnw(double originX, double originY, const double *matrix,
                                  double scale, double x, double y, BZ_Point *out);
TESSARINE_API int32_t BZ_2Dnwtold(double originX, double originY, const double *matrix,
                                  double scale, double x, double y, BZ_Point *out);
TESSARINE_API int32_t BZ_3Doldtnw(double originX, double originY, double originZ,
                                  const double *matrix, double scale, double x, double y, double z,
                                  double *out);
TESSARINE_API int32_t BZ_3Dnwtold(double originX, double originY, double originZ,
                                  const double *matrix, double scale, double x, double y, double z,
                                  double *out);

/* ---- Others --------------------------------------------------------------- */

TESSARINE_API void Sort_a(BZ_SortEntry *entries, int16_t count);
TESSARINE_API int32_t BZ_PtOnWhichSideofLine(double tolerance, double x0, double y0, double x1,
                                             double y1, double px, double py);
TESSARINE_API int32_t BZ_BBoxBoxInt(double xmin1, double ymin1, double xmax1, double ymax1,
                                    double xmin2, double ymin2, double xmax2, double ymax2,
                                    double tolerance);

/* ---- Line and arc intersection -----------------------------------------------
   Codes: 0 none, 1 points, 3 same arc, 4 partial overlap, 6 parallel,
   7 coincident lines, 8 apart on one circle. Arrays hold up to two entries. */

TESSARINE_API int32_t BZ_3ptarcinfo(double x0, double y0, double x1, double y1, double x2,
                                    double y2, BZ_Point *centre, double *radius,
                                    double *startAngle, double *sweep, double *length,
                                    int16_t *outcome);
TESSARINE_API int32_t BZ_LinelineInt(double x0, double y0, double x1, double y1, double x2,
                                     double y2, double x3, double y3, int16_t *code, double *t1,
                                     double *t2, BZ_Point *point);
TESSARINE_API int32_t BZ_LineArcInt(const BZ_Line *line, const BZ_Arc *arc, BZ_Point *points,
                                    double *lineT, double *arcT, int16_t *count, int16_t *code);
TESSARINE_API int32_t BZ_ArcArcInt(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *points,
                                   double *t1, double *t2, int16_t *count, int16_t *code);
TESSARINE_API int32_t BZ_BoundLineArcInt(const BZ_Line *line, const BZ_Arc *arc, BZ_Point *points,
                                         double *lineT, double *arcT, int16_t *count,
                                         int16_t *code);
TESSARINE_API int32_t BZ_BoundArcArcInt(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *points,
                                        double *t1, double *t2, int16_t *count, int16_t *code);
/* area: 3 beyond the start, 4 on the span, 5 beyond the end. */
TESSARINE_API int32_t BZ_PtOnWhichAreaofArc(double startAngle, double midAngle, double endAngle,
                                            double angle, int16_t *area);

/* ---- Minimum distance --------------------------------------------------------- */

TESSARINE_API int32_t BZ_Mindistpt2ln(double px, double py, double ax, double ay, double bx,
                                      double by, double *distance, double *t, BZ_Point *foot);
TESSARINE_API int32_t BZ_Mindistsq2ln(double ax, double ay, double bx, double by, double px,
                                      double py, double *distanceSq, double *t, BZ_Point *foot);
TESSARINE_API int32_t BZ_Mindistpt2Bln(double ax, double ay, double bx, double by, double px,
                                       double py, double *distance, double *t, BZ_Point *foot);
TESSARINE_API int32_t BZ_Mindistsqpt2line(double px, double py, double ax, double ay, double bx,
                                          double by, BZ_Point *foot, double *t,
                                          double *distanceSq);
TESSARINE_API int32_t MindistPt2arc(double px, double py, double centreX, double centreY,
                                    double radius, double startAngle, double sweep, double startX,
                                    double startY, double endX, double endY, BZ_Point *foot,
                                    double *t, double *distance);
TESSARINE_API int32_t BZ_MindistLineArc(const BZ_Line *line, const BZ_Arc *arc, BZ_Point *onLine,
                                        double *lineT, BZ_Point *onArc, double *arcT,
                                        double *distance);
/* t1 and t2 must each have room for two doubles. */
TESSARINE_API int32_t BZ_MindistArcArc(const BZ_Arc *arc1, const BZ_Arc *arc2, BZ_Point *on1,
                                       double *t1, BZ_Point *on2, double *t2, double *distance);

/* ---- Segment merging -----------------------------------------------------------
   outcome: -1 no merge, 10 merged. asLine may be null: then no line is tried.
   A merged line is written as a BZ_Line at the head of the out record, which
   must be large enough for a BZ_Arc. */

TESSARINE_API int32_t Mergelnln(const BZ_Line *line1, const BZ_Line *line2, double tolerance,
                                BZ_Line *out, int16_t *outcome);
/* order 0: first is the arc, second the line; otherwise line first. */
TESSARINE_API int32_t Mergelnarc(const void *first, const void *second, int16_t order,
                                 double tolerance, int16_t *asLine, void *out, int16_t *outcome);
TESSARINE_API int32_t Mergearcarc(const BZ_Arc *arc1, const BZ_Arc *arc2, double tolerance,
                                  int16_t *asLine, void *out, int16_t *outcome);
TESSARINE_API int32_t Chkcv2arc(double x0, double y0, double x1, double y1, double x2, double y2,
                                double x3, double y3, double tolerance, double leastRadius,
                                BZ_Point *centre, BZ_Point *mid, double *radius, double *startAngle,
                                double *sweep, int16_t *isArc);
TESSARINE_API int32_t BZ_MirrorPt(const BZ_Point *a, const BZ_Point *b, BZ_Point *point);

/* ---- Stroking ----------------------------------------------------------------------
   A stroke is a polyline of points on the segment, each optionally with its
   parameter (0 at the start, 1 at the end).

   method 0: tolerance is the polyline's largest error from the segment;
   otherwise it is the longest chord. split (Bezier only): what to do with a
   curve that is not flat at once: 0 subdivide, 1 give up with no output,
   2 accept one split at 0.5 when both halves are flat, else give up. */
typedef struct VC_StrokeSpec {
    int16_t method;
    double tolerance;
    int16_t split;
    int32_t reserved; /* read by no operation */
} VC_StrokeSpec;

/* Two-tier output (the VC_Sk... family and VC_StrokeLnUniform): count points;
   onHeap 1 when they stand in the heap arrays, 0 in the fixed ones; capacity
   of the heap arrays in points (0: none yet). fixedPoints and fixedParams
   (null: no parameters) are the caller's arrays of 256. heapPoints and
   heapParams (may be null) hold the caller's heap arrays: fixed blocks of the
   library heap that live across calls and that the caller frees with
   MEM_FreeHdl. When the library makes a new one it replaces whatever the
   handle held. */
TESSARINE_API int32_t VC_StrokeLnUniform(double step, double x0, double y0, double x1, double y1,
                                         int32_t *count, int16_t *onHeap, int32_t *capacity,
                                         BZ_Point *fixedPoints, double *fixedParams,
                                         BZ_Point **heapPoints, double **heapParams);
/* Does not maintain capacity: a caller that reuses the heap arrays sets it. */
TESSARINE_API int32_t VC_SkArc(VC_StrokeSpec spec, BZ_Arc arc, int32_t *count, int16_t *onHeap,
                               int32_t *capacity, BZ_Point *fixedPoints, double *fixedParams,
                               BZ_Point **heapPoints, double **heapParams);
/* The points after the start up to the end; *points is a new block the caller
   frees with MEM_FreeHdl (null when the count is 0 or below). */
TESSARINE_API int32_t VC_renderArc(double tolerance, double unusedX, double unusedY,
                                   double centreX, double centreY, double radius,
                                   double startAngle, double sweep, int16_t *count,
                                   BZ_Point **points);
/* *points and *params (params may be null) are new blocks the caller frees
   with MEM_FreeHdl; nothing is handed over on a failure or when the curve is
   given up (count 0). */
TESSARINE_API int32_t VC_StrokeBezierCurve(VC_StrokeSpec spec, double x0, double y0, double x1,
                                           double y1, double x2, double y2, double x3, double y3,
                                           int32_t *count, BZ_Point **points, double **params);
/* Parameters are tracked only when fixedParams is given and *heapParams is
   not null on entry; otherwise every point has 0 and the last 1. */
TESSARINE_API int32_t VC_SkBezierCurve(VC_StrokeSpec spec, double x0, double y0, double x1,
                                       double y1, double x2, double y2, double x3, double y3,
                                       int32_t *count, int16_t *onHeap, int32_t *capacity,
                                       BZ_Point *fixedPoints, double *fixedParams,
                                       BZ_Point **heapPoints, double **heapParams);

/* ---- Polynomial solving and curve-line intersection ------------------------------ */

/* Roots of a x x + b x + c; -7 (nothing written) when there is no real root. */
TESSARINE_API int32_t FindRootDegree2(double a, double b, double c, double *first,
                                      double *second);
/* Roots of a cubic that lie in -T to 1 + T (T = tolerance / 100) come first in
   roots (room for three); count says how many. Always 10; a must not be 0. */
TESSARINE_API int32_t CL_Solv3orderEq(double a, double b, double c, double d, double tolerance,
                                      double *roots, int16_t *count, int16_t *flag);
/* A curve (eight values) against a line; arrays need room for 14 entries.
   curveT gets the parameters on the curve, lineT those on the line. */
TESSARINE_API int32_t CL_CvLnIntersection(double x0, double y0, double x1, double y1, double x2,
                                          double y2, double x3, double y3, double lx0, double ly0,
                                          double lx1, double ly1, double tolerance,
                                          uint16_t *count, BZ_Point *points, double *curveT,
                                          double *lineT, int16_t *kind);
/* The parameter of p on the segment a-b; -1 when p is off it. */
TESSARINE_API int32_t GetparONln(double ax, double ay, double bx, double by, double px, double py,
                                 double tolerance, double *t);

TESSARINE_END_C

#endif
