// The memory family: a thin layer on the global heap with two kinds of block,
// moveable handles and fixed pointers, released by the same call.
#include <algorithm>
#include <cstring>

#include <tessarine/core.h>

#include "platform/heap.h"

namespace gh = tessarine::platform;

namespace {

uint32_t HandleFlags(uint32_t flags) {
    uint32_t g = gh::GMEM_MOVEABLE;
    if (flags & MEM_FLAG_DISCARDABLE) g |= gh::GMEM_DISCARDABLE;
    if (flags & MEM_FLAG_ZERO) g |= gh::GMEM_ZEROINIT;
    return g;
}

uint32_t PointerFlags(uint32_t flags) {
    return (flags & MEM_FLAG_ZERO) ? gh::GMEM_ZEROINIT : gh::GMEM_FIXED;
}

// Forward copy in 32-bit words, each read whole before it is written, then
// the last 0 to 3 bytes one at a time. When the destination lies above the
// source in the same block the copy smears, as callers of this layer have
// always seen. Words that cannot see each other's writes go through memcpy in
// runs: with the destination `gap` bytes above the source, a run of up to
// gap bytes reads nothing that the same run writes.
void ForwardCopy(const unsigned char *source, unsigned char *destination, size_t count) {
    const uintptr_t from = reinterpret_cast<uintptr_t>(source);
    const uintptr_t to = reinterpret_cast<uintptr_t>(destination);
    if (to >= from + count || from >= to + count) {
        std::memcpy(destination, source, count);
        return;
    }
    const size_t words = count & ~size_t{3};
    if (to <= from || to - from >= words) {
        // Below the source a forward copy never reads what it wrote.
        std::memmove(destination, source, words);
    } else if (const size_t gap = to - from; gap >= 4) {
        const size_t run = gap & ~size_t{3};
        for (size_t i = 0; i < words; i += run)
            std::memcpy(destination + i, source + i, std::min(run, words - i));
    } else {
        for (size_t i = 0; i < words; i += 4) {
            uint32_t word;
            std::memcpy(&word, source + i, 4);
            std::memcpy(destination + i, &word, 4);
        }
    }
    for (size_t i = words; i < count; ++i) destination[i] = source[i];
}

}  // namespace

extern "C" {

TESSARINE_API MEM_Handle MEM_AllocHdl(uint32_t flags, uint32_t size) {
    return gh::GlobalAlloc(HandleFlags(flags), size);
}

TESSARINE_API void *MEM_AllocPtr(uint32_t flags, uint32_t size) {
    void *block = gh::GlobalAlloc(PointerFlags(flags), size);
    if (block == nullptr) gh::NewMemoryHandler(size);
    return block;
}

TESSARINE_API void *MEM_Lock(MEM_Handle handle) { return gh::GlobalLock(handle); }

TESSARINE_API int32_t MEM_Unlock(MEM_Handle handle) { return gh::GlobalUnlock(handle); }

TESSARINE_API uint32_t MEM_HdlSize(MEM_Handle handle) {
    return static_cast<uint32_t>(gh::GlobalSize(handle));
}

TESSARINE_API MEM_Handle MEM_PurgeHdl(MEM_Handle handle) {
    return gh::GlobalReAlloc(handle, 0, gh::GMEM_MOVEABLE);
}

TESSARINE_API MEM_Handle MEM_FreeHdl(MEM_Handle block) { return gh::GlobalFree(block); }

TESSARINE_API MEM_Handle MEM_FreePtr(MEM_Handle block) __attribute__((alias("MEM_FreeHdl")));

TESSARINE_API MEM_Handle MEM_ReallocHdl(MEM_Handle handle, uint32_t size) {
    if (handle == nullptr) return gh::GlobalAlloc(gh::GMEM_MOVEABLE, size);
    if (MEM_Handle resized = gh::GlobalReAlloc(handle, size, gh::GMEM_MOVEABLE)) return resized;
    MEM_Handle fresh = gh::GlobalAlloc(gh::GMEM_MOVEABLE, size);
    if (fresh == nullptr) {
        gh::GlobalFree(handle);
        return nullptr;
    }
    const size_t keep = std::min<size_t>(gh::GlobalSize(handle), size);
    void *from = gh::GlobalLock(handle);
    void *to = gh::GlobalLock(fresh);
    if (from != nullptr && to != nullptr)
        ForwardCopy(static_cast<unsigned char *>(from), static_cast<unsigned char *>(to), keep);
    gh::GlobalUnlock(handle);
    gh::GlobalFree(handle);
    gh::GlobalUnlock(fresh);
    return fresh;
}

TESSARINE_API void *MEM_ReallocPtr(void *pointer, uint32_t size) {
    if (pointer == nullptr) return MEM_AllocPtr(0, size);
    if (void *resized = gh::GlobalReAlloc(pointer, size, gh::GMEM_MOVEABLE)) return resized;
    void *fresh = gh::GlobalAlloc(gh::GMEM_FIXED, size);
    if (fresh == nullptr) {
        gh::NewMemoryHandler(size);
        gh::GlobalFree(pointer);
        return nullptr;
    }
    const size_t keep = std::min<size_t>(gh::GlobalSize(pointer), size);
    ForwardCopy(static_cast<unsigned char *>(pointer), static_cast<unsigned char *>(fresh), keep);
    gh::GlobalFree(pointer);
    return fresh;
}

TESSARINE_API void MEM_Fill(void *destination, int32_t count, int32_t value) {
    if (count > 0) std::memset(destination, value & 0xFF, static_cast<size_t>(count));
}

TESSARINE_API void MEM_Copy(const void *source, void *destination, int32_t count) {
    if (count > 0)
        ForwardCopy(static_cast<const unsigned char *>(source),
                    static_cast<unsigned char *>(destination), static_cast<size_t>(count));
}

}  // extern "C"
