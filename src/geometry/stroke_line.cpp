// A line walked in even steps.
#include <cmath>
#include <cstdint>

#include "core/status.h"
#include "geometry/stroke.h"

using namespace tessarine;
using namespace tessarine::geometry;

namespace {

// Past this many points the heap arrays (with their 256 spare entries) no
// longer fit a 32-bit size.
constexpr double kMostHeapSamples = static_cast<double>(UINT32_MAX / sizeof(BZ_Point) - 256);

template <typename T>
bool HasRoom(const T *block, int64_t entries) {
    return SampleRoom(block, sizeof(T)) >= entries;
}

// Brings the heap arrays to room for `count` points. Writes capacity.
int32_t PrepareHeap(const SampleBuffers &out, int32_t count, bool withParams) {
    double **params = withParams ? out.heapParams : nullptr;
    const int64_t wanted = static_cast<int64_t>(count) + 256;
    if (*out.capacity == 0) {
        const int32_t status = NewSampleArrays(wanted, out.heapPoints, params);
        if (Failed(status)) return status;
        *out.capacity = static_cast<int32_t>(wanted);
        return kOk;
    }
    // A capacity that the arrays do not really have is treated as too small.
    if (*out.capacity >= count && HasRoom(*out.heapPoints, count) &&
        (!withParams || HasRoom(*out.heapParams, count)))
        return kOk;
    const int32_t status = GrowSampleArrays(out.heapPoints, params, wanted);
    if (Failed(status)) return status;
    *out.capacity = static_cast<int32_t>(wanted);
    return kOk;
}

}  // namespace

extern "C" TESSARINE_API int32_t VC_StrokeLnUniform(double step, double x0, double y0, double x1,
                                                    double y1, int32_t *count, int16_t *onHeap,
                                                    int32_t *capacity, BZ_Point *fixedPoints,
                                                    double *fixedParams, BZ_Point **heapPoints,
                                                    double **heapParams) {
    if (step < 0.0001) return kErrArgument;
    const double dx = x1 - x0;
    const double dy = y1 - y0;
    const double d = std::sqrt(dx * dx + dy * dy);
    if (d * d < step * step) {
        fixedPoints[0] = BZ_Point{x0, y0};
        if (fixedParams != nullptr) fixedParams[0] = 0;
        *count = 1;
        *onHeap = 0;
        return kOk;
    }
    const double quotient = d / step;
    if (std::isnan(quotient)) return kErrArgument;
    if (quotient >= kMostHeapSamples) return kErrMemory;
    const int32_t N = static_cast<int32_t>(quotient) + 1;
    const int32_t total = N + 1;
    BZ_Point *points = fixedPoints;
    double *params = fixedParams;
    const SampleBuffers out{count, onHeap, capacity, fixedPoints, fixedParams, heapPoints, heapParams};
    const bool onTheHeap = N >= kFixedSamples;
    if (onTheHeap) {
        const bool withParams = fixedParams != nullptr && heapParams != nullptr;
        const int32_t status = PrepareHeap(out, total, withParams);
        if (Failed(status)) return status;
        points = *heapPoints;
        params = heapParams != nullptr && HasRoom(*heapParams, total) ? *heapParams : nullptr;
    }
    for (int32_t i = 0; i <= N; ++i) {
        points[i] = BZ_Point{x0 + (dx * i) / N, y0 + (dy * i) / N};
        if (params != nullptr) params[i] = static_cast<double>(i) / N;
    }
    *count = total;
    *onHeap = onTheHeap ? 1 : 0;
    return kOk;
}
