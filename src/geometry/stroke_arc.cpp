// An arc walked in even angle steps: the two-tier form and the plain form.
#include <cmath>
#include <cstdint>

#include "core/status.h"
#include "geometry/stroke.h"

using namespace tessarine;
using namespace tessarine::geometry;

namespace {

// Past this many points a heap array no longer fits a 32-bit size.
constexpr double kMostHeapSamples = static_cast<double>(UINT32_MAX / sizeof(BZ_Point) - 1);

double AngleStep(const VC_StrokeSpec &spec, double R, double sweep) {
    if (spec.method == 0) return 2 * std::fabs(BZ_acos(1 - spec.tolerance / R));
    const double c = spec.tolerance;
    if (2 * R < c) return sweep;
    return 2 * std::fabs(BZ_acos(std::sqrt((c / 2 + R) * (R - c / 2)) / R));
}

template <typename T>
bool HasRoom(const T *block, int64_t entries) {
    return SampleRoom(block, sizeof(T)) >= entries;
}

// Heap arrays with room for `entries`; onHeap becomes 1. capacity is not
// this operation's to keep.
int32_t PrepareHeap(const SampleBuffers &out, int64_t needed, int64_t entries, bool withParams) {
    double **params = withParams ? out.heapParams : nullptr;
    if (*out.onHeap != 1) {
        const int32_t status = NewSampleArrays(entries, out.heapPoints, params);
        if (Failed(status)) return status;
        *out.onHeap = 1;
        return kOk;
    }
    // Arrays that do not really hold what is about to be written are grown
    // like arrays below their capacity.
    if (*out.capacity >= needed && HasRoom(*out.heapPoints, entries) &&
        (!withParams || HasRoom(*out.heapParams, entries)))
        return kOk;
    return GrowSampleArrays(out.heapPoints, params, entries);
}

}  // namespace

extern "C" {

TESSARINE_API int32_t VC_SkArc(VC_StrokeSpec spec, BZ_Arc arc, int32_t *count, int16_t *onHeap,
                               int32_t *capacity, BZ_Point *fixedPoints, double *fixedParams,
                               BZ_Point **heapPoints, double **heapParams) {
    const double R = BZ_Distptpt(arc.mid.x, arc.mid.y, arc.centre.x, arc.centre.y);
    double step = AngleStep(spec, R, arc.sweep);
    if (arc.sweep <= 0) step = -step;
    const double quotient = arc.sweep / step;
    if (std::isnan(quotient)) return kErrArgument;
    if (quotient >= kMostHeapSamples) return kErrMemory;
    // The quotient is -1 at the least (a chord longer than the diameter on a
    // clockwise arc), which leaves no computed point.
    const int32_t computed = quotient <= -1 ? 0 : static_cast<int32_t>(quotient) + 1;
    const double dt = step / arc.sweep;

    const SampleBuffers out{count, onHeap, capacity, fixedPoints, fixedParams, heapPoints, heapParams};
    BZ_Point *points = fixedPoints;
    double *params = fixedParams;
    if (computed <= 255) {
        *onHeap = 0;
    } else {
        const bool withParams = fixedParams != nullptr && heapParams != nullptr;
        const int32_t status = PrepareHeap(out, computed, static_cast<int64_t>(computed) + 1, withParams);
        if (Failed(status)) return status;
        points = *heapPoints;
        params = withParams ? *heapParams : nullptr;
    }
    for (int32_t i = 0; i < computed; ++i) {
        const double t = i * dt;
        double x = 0;
        double y = 0;
        const int32_t status =
            BZ_ArcEval(arc.centre.x, arc.centre.y, R, arc.startAngle, arc.sweep, t, 0, &x, &y);
        if (Failed(status)) return status;
        points[i] = BZ_Point{x, y};
        if (params != nullptr) params[i] = t;
    }
    int32_t total = computed;
    if (total == 0 || DistanceSQ(points[total - 1].x, points[total - 1].y, arc.end.x, arc.end.y) > 1e-8) {
        points[total] = arc.end;
        if (params != nullptr) params[total] = 1;
        ++total;
    }
    *count = total;
    return kOk;
}

TESSARINE_API int32_t VC_renderArc(double tolerance, double /*unusedX*/, double /*unusedY*/,
                                   double centreX, double centreY, double radius,
                                   double startAngle, double sweep, int16_t *count,
                                   BZ_Point **points) {
    const double step = std::fabs(2 * std::fabs(BZ_acos(1 - tolerance / radius)));
    const double quotient = sweep / step;
    // The count is a 16-bit value; a quotient that is no number, or too large
    // to be one, is refused.
    if (!(std::fabs(quotient) < 2147483647.0)) return kErrArgument;
    const auto n = static_cast<int16_t>(static_cast<int32_t>(quotient) + 1);
    if (n <= 0) {
        *count = n;
        *points = nullptr;
        return kOk;
    }
    auto *array = static_cast<BZ_Point *>(
        MEM_AllocPtr(MEM_FLAG_ZERO, static_cast<uint32_t>(n) * sizeof(BZ_Point)));
    if (array == nullptr) return kErrMemory;
    for (int32_t i = 0; i < n; ++i) {
        const double t = static_cast<double>(i + 1) / n;
        const int32_t status =
            BZ_ArcEval(centreX, centreY, radius, startAngle, sweep, t, 0, &array[i].x, &array[i].y);
        if (Failed(status)) {
            MEM_FreeHdl(array);
            return status;
        }
    }
    *count = n;
    *points = array;
    return kOk;
}

}  // extern "C"
