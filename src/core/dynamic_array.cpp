// A growing array of equal elements in one moveable block, kept locked for the
// array's life. Element 0 is never handed out; callers hold indices, since the
// block may move whenever the array grows.
#include <algorithm>
#include <cstdint>

#include <tessarine/core.h>

#include "core/pool_blocks.h"
#include "core/status.h"

using tessarine::kErrGeneral;
using tessarine::kErrMemory;
using tessarine::kOk;

namespace {

// The old contents are lost on failure, as a failed reallocation frees them.
int32_t DropBlock(MGR_DARY *array) {
    if (array->handle != nullptr) {
        MEM_Unlock(array->handle);
        MEM_FreeHdl(array->handle);
    }
    array->handle = nullptr;
    array->base = nullptr;
    return kErrMemory;
}

int32_t Resize(MGR_DARY *array, int64_t newCapacity) {
    const int64_t capacity = std::max<int64_t>(array->capacity, newCapacity);
    const int64_t bytes = tessarine::detail::BlockBytes(capacity, array->elementSize);
    if (capacity > INT32_MAX) return DropBlock(array);
    array->capacity = static_cast<int32_t>(capacity);
    if (bytes < 0) return DropBlock(array);
    MEM_Unlock(array->handle);
    array->base = nullptr;
    array->handle = MEM_ReallocHdl(array->handle, static_cast<uint32_t>(bytes));
    if (array->handle == nullptr) return kErrMemory;
    array->base = MEM_Lock(array->handle);
    return array->base != nullptr ? kOk : kErrGeneral;
}

}  // namespace

extern "C" {

TESSARINE_API void MGR_DARYInit(MGR_DARY *array) {
    array->handle = nullptr;
    array->base = nullptr;
}

TESSARINE_API int32_t MGR_DARYStart(MGR_DARY *array, int32_t elementSize, int32_t capacity) {
    const int64_t bytes = tessarine::detail::BlockBytes(capacity, elementSize);
    if (bytes < 0) return kErrMemory;
    MEM_Handle handle = MEM_AllocHdl(MEM_FLAG_ZERO, static_cast<uint32_t>(bytes));
    if (handle == nullptr) return kErrMemory;
    void *base = MEM_Lock(handle);
    if (base == nullptr) {
        MEM_FreeHdl(handle);
        return kErrGeneral;
    }
    array->handle = handle;
    array->base = base;
    array->capacity = capacity;
    array->growBy = capacity;
    array->elementSize = elementSize;
    array->used = 1;
    return kOk;
}

// The growth comes two elements before the block is full.
TESSARINE_API int32_t MGR_DARYAlloc(MGR_DARY *array, void **element) {
    if (array->used >= static_cast<int64_t>(array->capacity) - 2) {
        const int32_t status = Resize(array, static_cast<int64_t>(array->capacity) + array->growBy);
        if (status < 0) return status;
    }
    // After a failed resize there is no block to hand out from.
    if (array->base == nullptr) return kErrGeneral;
    *element = static_cast<uint8_t *>(array->base) +
               static_cast<int64_t>(array->elementSize) * array->used;
    ++array->used;
    return kOk;
}

// Never shrinks; added elements are not cleared.
TESSARINE_API int32_t MGR_DARYResize(MGR_DARY *array, int32_t newCapacity) {
    return Resize(array, newCapacity);
}

TESSARINE_API void MGR_DARYEnd(MGR_DARY *array) {
    if (array->handle != nullptr) {
        MEM_Unlock(array->handle);
        MEM_FreeHdl(array->handle);
    }
    array->handle = nullptr;
    array->base = nullptr;
}

}  // extern "C"
