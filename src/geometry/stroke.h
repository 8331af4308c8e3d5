// Internal pieces of stroking: the flatness tests, the two-tier sample
// output, and the split of a cubic that the walks share.
#pragma once

#include <tessarine/geometry.h>

#include <cstdint>

namespace tessarine::geometry {

// Flatness by the control polygon's distance from the chord (method 0).
int32_t VC_FlatByPolygon(const BZ_Curve &curve, double tolerance);
// Flatness by the chords to the middle point (any other method).
int32_t VC_FlatByChord(const BZ_Curve &curve, double tolerance);
// 1 for flat, 0 for not flat, by the method's test.
int32_t VC_CurveIsFlat(int16_t method, const BZ_Curve &curve, double tolerance);

// Halves at t = 0.5; the middle point is left.p3 and right.p0.
void SplitCurveInHalf(const BZ_Curve &curve, BZ_Curve *left, BZ_Curve *right);

// The caller's two-tier output: fixed arrays of 256 first, heap arrays that
// live across calls beyond that.
struct SampleBuffers {
    int32_t *count;
    int16_t *onHeap;
    int32_t *capacity;
    BZ_Point *fixedPoints;
    double *fixedParams;
    BZ_Point **heapPoints;
    double **heapParams;
};

inline constexpr int32_t kFixedSamples = 256;

// Appends one point (and its parameter where parameters are kept), moving
// the output to the heap at the 257th point. 10 or -5.
int32_t VC_AppendSample(const SampleBuffers &out, BZ_Point point, double param);

// Makes fresh zero-filled heap arrays of `entries` (points, and parameters
// when `params` is not null); stores them only when both are had. 10 or -5.
int32_t NewSampleArrays(int64_t entries, BZ_Point **points, double **params);
// Resizes the caller's heap arrays to `entries`, keeping their contents; a
// null handle gets a fresh array. A failed resize leaves that array as it
// was (the points may then already be larger). 10 or -5.
int32_t GrowSampleArrays(BZ_Point **points, double **params, int64_t entries);

// Entries a heap array really has room for (0 for none).
int64_t SampleRoom(const void *block, int64_t entrySize);

}  // namespace tessarine::geometry
