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

// Forward copy in 32-bit words, then the last bytes, one word at a time: when
// the destination lies above the source in the same block the copy smears,
// as callers of this layer have always seen.
void ForwardCopy(const unsigned char *source, unsigned char *destination, size_t count) {
    size_t i = 0;
    for (; i + 4 <= count; i += 4) {
        uint32_t word;
        std::memcpy(&word, source + i, 4);
        std::memcpy(destination + i, &word, 4);
    }
    for (; i < count; ++i) destination[i] = source[i];
}

void CopyBytes(const void *source, void *destination, size_t count) {
    const auto *s = static_cast<const unsigned char *>(source);
    auto *d = static_cast<unsigned char *>(destination);
    const uintptr_t from = reinterpret_cast<uintptr_t>(s);
    const uintptr_t to = reinterpret_cast<uintptr_t>(d);
    const bool overlaps = to < from + count && from < to + count;
    if (overlaps)
        ForwardCopy(s, d, count);
    else
        std::memcpy(d, s, count);
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
    if (from != nullptr && to != nullptr) ForwardCopy(static_cast<unsigned char *>(from),
                                                      static_cast<unsigned char *>(to), keep);
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
    if (count > 0) CopyBytes(source, destination, static_cast<size_t>(count));
}

}  // extern "C"
