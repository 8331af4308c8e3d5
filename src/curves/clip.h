// Records and internal steps of the Bezier clipping method. Nothing here is
// exported.
#pragma once

#include <tessarine/curves.h>

#include <cstdint>

namespace tessarine::curves {

// A sub-curve with its parameter range on the whole curve.
struct ClipPiece {
    BZ_Curve curve;
    double t0, t1;
};

// The oriented box of a sub-curve: a band across its chord and one along it.
struct ClipFrame {
    BZ_Point origin;
    BZ_Point dir;
    double dmin, dmax;
    double smin, smax;
};

// One met point (isRange 0, both ends the same) or stretch on the two curves.
struct OverlapRec {
    ListNode link;
    double a0, a1;
    double b0, b1;
    double x0, y0;
    double x1, y1;
    int16_t isRange;
};

// The caller's result arrays.
struct ClipResult {
    double *tA;
    double *tB;
    BZ_Point *pts;
    uint16_t *count;
};

inline BZ_Curve CurveOf(const double *v) {
    return BZ_Curve{{v[0], v[1]}, {v[2], v[3]}, {v[4], v[5]}, {v[6], v[7]}};
}

ClipFrame BuildClipFrame(const BZ_Curve &c);
// False when the frame and the curve's control points are certainly apart.
bool FrameTouchesCurve(const ClipFrame &frame, const BZ_Curve &c);
void SplitIntoQuarters(const ClipPiece &piece, ClipPiece quarters[4]);

// The piece of c over (t0, t1); -4 when the range is too short to split.
int32_t ExtractSubCurve(const BZ_Curve &c, double t0, double t1, BZ_Curve *out);
// 1 when the two sub-curves lie on each other within tol; *sameWay is 1 when
// they run the same way, 0 when opposite.
int32_t CurvesCoincide(const BZ_Curve &a, double a0, double a1, const BZ_Curve &b, double b0,
                       double b1, double tol, int32_t *sameWay);
// The whole curves: on coincidence two entries and 1; *count is cleared first.
int32_t WholeCurvesCoincide(const BZ_Curve &a, const BZ_Curve &b, double tol,
                            const ClipResult &out);
// A stretch where an end of one curve lies on the other: kind 4 with two
// entries, or 0 with nothing written.
int16_t FindPartialOverlap(const BZ_Curve &a, const BZ_Curve &b, double tol, const ClipResult &out);

// A zero-filled record; null when the heap refuses.
OverlapRec *NewOverlapRec();
// Merges N into the list kept in ascending a0, or links it in. N may be freed.
void InsertOverlapRec(ListNode **head, OverlapRec *n, double gap);
// Re-inserts every record, in order, with a wider gap.
void RemergeOverlapRecs(ListNode **head, double gap);
// Writes the entries of the list; -1 when it will not shrink to seven records.
int32_t OverlapRecsToResult(ListNode **head, const ClipResult &out);

}  // namespace tessarine::curves
