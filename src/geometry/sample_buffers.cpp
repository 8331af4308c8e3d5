// The two-tier sample output: the caller's fixed arrays of 256 first, then
// heap arrays that the caller keeps between calls and frees itself.
#include <cstdint>
#include <cstring>

#include "core/status.h"
#include "geometry/stroke.h"
#include "platform/heap.h"

namespace tessarine::geometry {
namespace {

// The heap speaks in 32-bit sizes.
void *NewZeroedArray(int64_t entries, int64_t entrySize) {
    if (entries < 0 || entries > static_cast<int64_t>(UINT32_MAX) / entrySize) return nullptr;
    return MEM_AllocPtr(MEM_FLAG_ZERO, static_cast<uint32_t>(entries * entrySize));
}

constexpr int32_t kHeapStart = 356;
constexpr int32_t kHeapGrowth = 100;

}  // namespace

int64_t SampleRoom(const void *block, int64_t entrySize) {
    if (block == nullptr) return 0;
    return static_cast<int64_t>(MEM_HdlSize(const_cast<void *>(block))) / entrySize;
}

int32_t NewSampleArrays(int64_t entries, BZ_Point **points, double **params) {
    auto *newPoints = static_cast<BZ_Point *>(NewZeroedArray(entries, sizeof(BZ_Point)));
    if (newPoints == nullptr) return kErrMemory;
    if (params != nullptr) {
        auto *newParams = static_cast<double *>(NewZeroedArray(entries, sizeof(double)));
        if (newParams == nullptr) {
            MEM_FreeHdl(newPoints);
            return kErrMemory;
        }
        *params = newParams;
    }
    *points = newPoints;
    return kOk;
}

namespace {

// Resizes one array in place where the heap can; a failed resize leaves the
// block as it was.
template <typename T>
bool Resize(T **block, int64_t entries) {
    if (entries < 0 || entries > static_cast<int64_t>(UINT32_MAX) / static_cast<int64_t>(sizeof(T)))
        return false;
    const auto bytes = static_cast<size_t>(entries) * sizeof(T);
    void *resized = *block == nullptr
                        ? MEM_AllocPtr(MEM_FLAG_ZERO, static_cast<uint32_t>(bytes))
                        : platform::GlobalReAlloc(*block, bytes, platform::GMEM_MOVEABLE);
    if (resized == nullptr) return false;
    *block = static_cast<T *>(resized);
    return true;
}

}  // namespace

int32_t GrowSampleArrays(BZ_Point **points, double **params, int64_t entries) {
    if (!Resize(points, entries)) return kErrMemory;
    if (params != nullptr && !Resize(params, entries)) return kErrMemory;
    return kOk;
}

int32_t VC_AppendSample(const SampleBuffers &out, BZ_Point point, double param) {
    const int32_t n = *out.count;
    if (*out.onHeap == 0 && n < kFixedSamples) {
        out.fixedPoints[n] = point;
        if (out.fixedParams != nullptr) out.fixedParams[n] = param;
        *out.count = n + 1;
        return kOk;
    }
    const bool withParams = out.fixedParams != nullptr && out.heapParams != nullptr;
    if (*out.onHeap == 0) {
        // The 257th point: whatever the handles held is replaced.
        BZ_Point *points = nullptr;
        double *params = nullptr;
        const int32_t status = NewSampleArrays(kHeapStart, &points, withParams ? &params : nullptr);
        if (Failed(status)) return status;
        std::memcpy(points, out.fixedPoints, kFixedSamples * sizeof(BZ_Point));
        if (withParams) std::memcpy(params, out.fixedParams, kFixedSamples * sizeof(double));
        *out.heapPoints = points;
        if (withParams) *out.heapParams = params;
        *out.capacity = kHeapStart;
        *out.onHeap = 1;
    } else if (n >= *out.capacity) {
        const int64_t grown = static_cast<int64_t>(*out.capacity) + kHeapGrowth;
        const int32_t status =
            GrowSampleArrays(out.heapPoints, withParams ? out.heapParams : nullptr, grown);
        if (Failed(status)) return status;
        *out.capacity = static_cast<int32_t>(grown);
    }
    (*out.heapPoints)[n] = point;
    if (withParams && *out.heapParams != nullptr) (*out.heapParams)[n] = param;
    *out.count = n + 1;
    return kOk;
}

}  // namespace tessarine::geometry
