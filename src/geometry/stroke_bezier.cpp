// A cubic walked into a polyline: flat pieces stand for their chords, and
// the rest is halved, left half first, on a bounded stack in local storage.
#include <cstdint>

#include "core/status.h"
#include "geometry/stroke.h"

using namespace tessarine;
using namespace tessarine::geometry;

namespace {

// 256 points are tested before eight more go on: room for 66 curves.
constexpr int kStackCurves = 66;
constexpr int kStackLimitPoints = 256;

enum class Walk { Done, GaveUp, SplitOutOfRange };

struct WalkResult {
    int32_t status;
    Walk how;
};

// Walks the curve and hands every output point to `append(point, param,
// inTheLoop)`, which returns a status.
template <typename Append>
WalkResult WalkCurve(const VC_StrokeSpec &spec, const BZ_Curve &curve, bool trackParams,
                     Append &&append) {
    double tol = spec.tolerance;
    if (spec.method == 0) tol *= 0.9;
    if (VC_CurveIsFlat(spec.method, curve, tol)) {
        int32_t s = append(curve.p0, 0.0, false);
        if (!Failed(s)) s = append(curve.p3, 1.0, false);
        return {s, Walk::Done};
    }
    if (spec.split == 1) return {kOk, Walk::GaveUp};
    if (spec.split == 2) {
        BZ_Curve left;
        BZ_Curve right;
        SplitCurveInHalf(curve, &left, &right);
        if (!VC_CurveIsFlat(spec.method, left, tol) || !VC_CurveIsFlat(spec.method, right, tol))
            return {kOk, Walk::GaveUp};
        int32_t s = append(curve.p0, 0.0, false);
        if (!Failed(s)) s = append(left.p3, 0.5, false);
        if (!Failed(s)) s = append(curve.p3, 1.0, false);
        return {s, Walk::Done};
    }
    if (spec.split != 0) return {kOk, Walk::SplitOutOfRange};

    BZ_Curve stack[kStackCurves];
    double ranges[2 * kStackCurves];
    int depth = 0;
    stack[0] = curve;
    ranges[0] = 0;
    ranges[1] = 1;
    depth = 1;
    BZ_Curve last = curve;
    double lastEnd = 1;
    while (depth > 0) {
        --depth;
        last = stack[depth];
        const double tA = ranges[2 * depth];
        const double tB = ranges[2 * depth + 1];
        lastEnd = tB;
        if (VC_CurveIsFlat(spec.method, last, tol)) {
            const int32_t s = append(last.p0, tA, true);
            if (Failed(s)) return {s, Walk::Done};
            continue;
        }
        if (4 * depth >= kStackLimitPoints) return {kErrStackOverflow, Walk::Done};
        BZ_Curve left;
        BZ_Curve right;
        SplitCurveInHalf(last, &left, &right);
        const double tM = trackParams ? (tA + tB) / 2 : 0;
        stack[depth] = right;
        ranges[2 * depth] = trackParams ? tM : 0;
        ranges[2 * depth + 1] = trackParams ? tB : 1;
        ++depth;
        stack[depth] = left;
        ranges[2 * depth] = trackParams ? tA : 0;
        ranges[2 * depth + 1] = trackParams ? tM : 1;
        ++depth;
    }
    return {append(last.p3, lastEnd, false), Walk::Done};
}

BZ_Curve CurveOf(double x0, double y0, double x1, double y1, double x2, double y2, double x3,
                 double y3) {
    return BZ_Curve{{x0, y0}, {x1, y1}, {x2, y2}, {x3, y3}};
}

// The growing arrays of the plain form; freed unless handed over.
class GrowingOutput {
  public:
    GrowingOutput(bool withParams) {
        points_ = static_cast<BZ_Point *>(MEM_AllocPtr(MEM_FLAG_ZERO, kStep * sizeof(BZ_Point)));
        if (withParams && points_ != nullptr) {
            params_ = static_cast<double *>(MEM_AllocPtr(MEM_FLAG_ZERO, kStep * sizeof(double)));
            if (params_ == nullptr) Release();
        }
        capacity_ = kStep;
        wantParams_ = withParams;
    }
    ~GrowingOutput() { Release(); }
    GrowingOutput(const GrowingOutput &) = delete;
    GrowingOutput &operator=(const GrowingOutput &) = delete;

    bool ok() const { return points_ != nullptr && (!wantParams_ || params_ != nullptr); }
    int32_t size() const { return size_; }

    int32_t Append(BZ_Point p, double t, bool mayGrow) {
        if (mayGrow && capacity_ - size_ <= 2) {
            const int64_t grown = static_cast<int64_t>(capacity_) + kStep;
            if (grown > static_cast<int64_t>(UINT32_MAX / sizeof(BZ_Point))) return kErrMemory;
            // A failed resize has freed the old block already.
            points_ = static_cast<BZ_Point *>(
                MEM_ReallocPtr(points_, static_cast<uint32_t>(grown * sizeof(BZ_Point))));
            if (points_ == nullptr) return kErrMemory;
            if (params_ != nullptr) {
                params_ = static_cast<double *>(
                    MEM_ReallocPtr(params_, static_cast<uint32_t>(grown * sizeof(double))));
                if (params_ == nullptr) return kErrMemory;
            }
            capacity_ = static_cast<int32_t>(grown);
        }
        points_[size_] = p;
        if (params_ != nullptr) params_[size_] = t;
        ++size_;
        return kOk;
    }

    void HandOver(int32_t *count, BZ_Point **points, double **params) {
        *points = points_;
        if (params != nullptr) *params = params_;
        *count = size_;
        points_ = nullptr;
        params_ = nullptr;
    }

  private:
    static constexpr int32_t kStep = 25;
    void Release() {
        if (points_ != nullptr) MEM_FreeHdl(points_);
        if (params_ != nullptr) MEM_FreeHdl(params_);
        points_ = nullptr;
        params_ = nullptr;
    }
    BZ_Point *points_ = nullptr;
    double *params_ = nullptr;
    int32_t capacity_ = 0;
    int32_t size_ = 0;
    bool wantParams_ = false;
};

}  // namespace

extern "C" {

TESSARINE_API int32_t VC_StrokeBezierCurve(VC_StrokeSpec spec, double x0, double y0, double x1,
                                           double y1, double x2, double y2, double x3, double y3,
                                           int32_t *count, BZ_Point **points, double **params) {
    *count = 0;
    GrowingOutput output(params != nullptr);
    if (!output.ok()) return kErrMemory;
    const BZ_Curve curve = CurveOf(x0, y0, x1, y1, x2, y2, x3, y3);
    WalkResult r = WalkCurve(spec, curve, true, [&](BZ_Point p, double t, bool inLoop) {
        return output.Append(p, t, inLoop);
    });
    if (r.how == Walk::SplitOutOfRange) r.status = output.Append(curve.p3, 1.0, false);
    if (Failed(r.status) || r.how == Walk::GaveUp) return r.status;
    output.HandOver(count, points, params);
    return kOk;
}

TESSARINE_API int32_t VC_SkBezierCurve(VC_StrokeSpec spec, double x0, double y0, double x1,
                                       double y1, double x2, double y2, double x3, double y3,
                                       int32_t *count, int16_t *onHeap, int32_t *capacity,
                                       BZ_Point *fixedPoints, double *fixedParams,
                                       BZ_Point **heapPoints, double **heapParams) {
    *count = 0;
    *onHeap = 0;
    const SampleBuffers out{count, onHeap, capacity, fixedPoints, fixedParams, heapPoints, heapParams};
    const bool track = fixedParams != nullptr && heapParams != nullptr && *heapParams != nullptr;
    const WalkResult r =
        WalkCurve(spec, CurveOf(x0, y0, x1, y1, x2, y2, x3, y3), track,
                  [&](BZ_Point p, double t, bool) { return VC_AppendSample(out, p, t); });
    if (r.how == Walk::SplitOutOfRange) return kErrSelector;
    return r.status;
}

}  // extern "C"
