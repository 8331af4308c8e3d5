// Block file life cycle: create, open, close and delete, and the header's
// byte layout.
#include <cstring>

#include <tessarine/core.h>
#include <tessarine/storage.h>

#include "core/status.h"
#include "storage/block_file.h"
#include "storage/raw_file.h"

namespace tessarine::storage {

void EncodeFileHdr(const FM_BlockFileHdr &h, uint8_t out[FM_BLOCKFILE_HDR_BYTES]) {
    std::memcpy(out, h.magic, 4);
    const uint32_t words[] = {h.payloadSize, h.stride,   h.nextIndex, h.firstBlock,
                              h.lastBlock,   h.freeHead, h.endBlock,  h.endOffset};
    for (size_t i = 0; i < 8; ++i) PutU32(out + 4 + 4 * i, words[i]);
}

void DecodeFileHdr(const uint8_t in[FM_BLOCKFILE_HDR_BYTES], FM_BlockFileHdr *h) {
    std::memcpy(h->magic, in, 4);
    uint32_t *words[] = {&h->payloadSize, &h->stride,   &h->nextIndex, &h->firstBlock,
                         &h->lastBlock,   &h->freeHead, &h->endBlock,  &h->endOffset};
    for (size_t i = 0; i < 8; ++i) *words[i] = GetU32(in + 4 + 4 * i);
}

void EncodeTagHdr(const FM_TagHdr &h, uint8_t out[FM_TAG_HDR_BYTES]) {
    out[0] = h.kind;
    std::memcpy(out + 1, h.extra, 3);
    PutU32(out + 4, h.length);
}

void DecodeTagHdr(const uint8_t in[FM_TAG_HDR_BYTES], FM_TagHdr *h) {
    h->kind = in[0];
    std::memcpy(h->extra, in + 1, 3);
    h->length = GetU32(in + 4);
}

}  // namespace tessarine::storage

namespace {

using namespace tessarine;
using namespace tessarine::storage;

constexpr uint8_t kMagic[4] = {FM_BLOCKFILE_MAGIC0, FM_BLOCKFILE_MAGIC1, FM_BLOCKFILE_MAGIC2,
                               FM_BLOCKFILE_MAGIC3};
// Block 1 must start within a signed 32-bit offset; slots beyond what such an
// offset reaches are refused when they are taken or moved.
constexpr uint32_t kMaxStride = INT32_MAX;

bool PathFits(const char *path) {
    return path != nullptr && std::strlen(path) < FM_BLOCKFILE_PATH_BYTES;
}

uint32_t NodeBytes(uint32_t stride) {
    return static_cast<uint32_t>(offsetof(FM_MemBlock, image)) + stride;
}

// A header whose sizes would make a node smaller than what is moved into it,
// or a walk that never advances, is refused like a wrong magic.
bool SizesUsable(const FM_BlockFileHdr &h) {
    return h.stride >= FM_BLOCK_HDR_BYTES && h.stride <= kMaxStride && h.payloadSize > 0 &&
           h.payloadSize <= h.stride - FM_BLOCK_HDR_BYTES;
}

FM_BlockFile *AllocRecord() {
    // Cleared, so that a header that fails to load is written back as read.
    auto *file = static_cast<FM_BlockFile *>(MEM_AllocPtr(MEM_FLAG_ZERO, sizeof(FM_BlockFile)));
    if (file != nullptr) {
        file->cacheHead = nullptr;
        file->descriptor = -1;
    }
    return file;
}

void FreeRecord(FM_BlockFile *file) {
    FreeEntireList(AsListHead(&file->cacheHead));
    MEM_FreeHdl(file);
}

int32_t WriteHeader(FM_BlockFile *file) {
    uint8_t bytes[FM_BLOCKFILE_HDR_BYTES];
    EncodeFileHdr(file->header, bytes);
    return FM_SeekAndWrite(file->descriptor, 0, 0, bytes, sizeof bytes);
}

}  // namespace

extern "C" {

TESSARINE_API int32_t FM_BlockFileCreate(const char *path, FM_BlockFile **out, uint32_t payloadSize,
                                         uint8_t cacheLimit, FM_TagCallback tagCallback) {
    if (!PathFits(path)) return kErrArgument;
    // A payload of 0 would make every walk stand still.
    if (payloadSize == 0) return kErrArgument;
    // The write position after the header could not be reached.
    if (payloadSize > kMaxStride - FM_BLOCK_HDR_BYTES) return kErrFileAccess;
    FM_BlockFile *file = AllocRecord();
    if (file == nullptr) return kErrMemory;
    const uint32_t stride = payloadSize + FM_BLOCK_HDR_BYTES;
    FM_CopyPath(path, file->path);
    file->cacheLimit = cacheLimit;
    file->tagCallback = tagCallback;
    file->nodeBytes = NodeBytes(stride);
    file->cachedCount = 0;

    int32_t status = FM_Create(path, 2, &file->descriptor);
    if (!Failed(status)) {
        FM_BlockFileHdr &h = file->header;
        h.payloadSize = payloadSize;
        h.stride = stride;
        std::memcpy(h.magic, kMagic, 4);
        h.nextIndex = 1;
        h.firstBlock = h.lastBlock = h.freeHead = h.endBlock = h.endOffset = 0;
        status = WriteHeader(file);
    }
    if (!Failed(status)) status = FM_Seek(file->descriptor, 0, static_cast<int32_t>(stride));
    if (Failed(status)) {
        FM_Close(file->descriptor);
        FM_Delete(path);
        FreeRecord(file);
        return status;
    }
    *out = file;
    return kOk;
}

TESSARINE_API int32_t FM_BlockFileOpen(const char *path, FM_BlockFile **out, uint8_t cacheLimit) {
    if (!PathFits(path)) return kErrArgument;
    FM_BlockFile *file = AllocRecord();
    if (file == nullptr) return kErrMemory;

    int32_t status = FM_Open(path, 2, &file->descriptor);
    if (!Failed(status)) {
        uint8_t bytes[FM_BLOCKFILE_HDR_BYTES] = {};
        status = FM_SeekAndRead(file->descriptor, 0, 0, bytes, sizeof bytes);
        // Whatever arrived is what the record holds, and what a failed open
        // writes back at its close.
        DecodeFileHdr(bytes, &file->header);
    }
    if (!Failed(status)) {
        for (int i = 0; i < 4 && !Failed(status); ++i)
            if (file->header.magic[i] != kMagic[i]) status = kErrFileAccess;
        if (!Failed(status) && !SizesUsable(file->header)) status = kErrFileAccess;
    }
    if (Failed(status)) {
        FM_BlockFile *doomed = file;
        FM_BlockFileClose(&doomed);
        return status;
    }
    FM_CopyPath(path, file->path);
    file->cacheLimit = cacheLimit;
    file->nodeBytes = NodeBytes(file->header.stride);
    file->cachedCount = 0;
    file->tagCallback = nullptr;  // no call sets one after an open
    *out = file;
    return kOk;
}

TESSARINE_API int32_t FM_BlockFileClose(FM_BlockFile **place) {
    if (place == nullptr || *place == nullptr) return kOk;
    FM_BlockFile *file = *place;
    *place = nullptr;
    int32_t status = kOk;
    if (file->descriptor != -1) {
        // A failed write-back leaves the file open and the record allocated.
        if (FM_MemBlock *head = file->cacheHead) {
            FM_MemBlock *node = head;
            do {
                if (node->dirty != 0) {
                    int32_t offset = 0;
                    status = SlotOffset(file, node->index, 0, &offset);
                    if (!Failed(status))
                        status = FM_SeekAndWrite(file->descriptor, offset, 0, node->image,
                                                 file->header.stride);
                    if (Failed(status)) return status;
                }
                node = node->next;
            } while (node != head);
        }
        status = WriteHeader(file);
        if (Failed(status)) return status;
        status = FM_Close(file->descriptor);
    }
    FreeRecord(file);
    return status;
}

TESSARINE_API void FM_BlockFileDelete(FM_BlockFile **place) {
    if (place == nullptr || *place == nullptr) return;
    FM_BlockFile *file = *place;
    *place = nullptr;
    if (file->descriptor != -1) FM_Close(file->descriptor);
    FM_Delete(file->path);
    FreeRecord(file);
}

}  // extern "C"
