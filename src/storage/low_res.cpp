// The levels' entry point and what both methods share: bands, the source
// read band by band, the output saved band by band, and the progress object.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <cstdint>

#include "core/status.h"
#include "storage/low_res.h"

namespace ts = tessarine::storage;
using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrMemory;
using tessarine::kOk;

namespace tessarine::storage {

LevelBand::~LevelBand() {
    if (bytes_ != nullptr) MEM_FreePtr(bytes_);
}

int32_t LevelBand::Allocate(int64_t stride, int64_t giveUpRows) {
    if (stride > INT32_MAX) return kErrMemory;  // no transfer takes such a stride
    const int64_t rowBytes = stride > 0 ? stride : 1;
    for (int64_t rows = 1024; rows > giveUpRows; rows /= 2) {
        const int64_t bytes = rows * rowBytes;
        if (bytes > UINT32_MAX) continue;  // more than one block can hold counts as a failure
        bytes_ = static_cast<uint8_t *>(MEM_AllocPtr(MEM_FLAG_ZERO, static_cast<uint32_t>(bytes)));
        if (bytes_ != nullptr) {
            rows_ = rows;
            return kOk;
        }
    }
    return kErrMemory;
}

LevelBlock::~LevelBlock() {
    if (bytes_ != nullptr) MEM_FreePtr(bytes_);
}

bool LevelBlock::Allocate(int64_t bytes) {
    if (bytes < 1 || bytes > UINT32_MAX) return false;
    bytes_ = static_cast<uint8_t *>(MEM_AllocPtr(MEM_FLAG_ZERO, static_cast<uint32_t>(bytes)));
    return bytes_ != nullptr;
}

int32_t SourceBands::Reach(int64_t y) {
    while (y >= bottom_) {
        top_ = bottom_;
        bottom_ = top_ + rows_ < height_ ? top_ + rows_ : height_;
        const HVT_Box box{0, static_cast<int32_t>(top_), width_, static_cast<int32_t>(bottom_)};
        const int32_t status =
            HVT_ReadBlock(sub_, info_, &box, static_cast<int32_t>(stride_), buffer_);
        if (Failed(status)) return status;
    }
    return kOk;
}

bool LevelWriter::Stop(int64_t y) const {
    const double value = static_cast<double>(y) * (progress_->end - progress_->start) /
                             static_cast<double>(progressHeight_) +
                         progress_->start;
    return progress_->ops->report(progress_, value) != 0;
}

int32_t LevelWriter::Save(int64_t top, int64_t bottom) const {
    const HVT_Box box{0, static_cast<int32_t>(top), width_, static_cast<int32_t>(bottom)};
    return HVT_SaveBlockWithBitShift(sub_, info_, &box, static_cast<int32_t>(stride_), band_);
}

int32_t LoadLevelTables(HVT_FileInfo *info, uint8_t source, uint8_t destination) {
    int32_t status = HVT_GetSubbmpTileHdrs(source, info);
    if (!Failed(status)) status = HVT_GetSubbmpTileHdrs(destination, info);
    return status;
}

}  // namespace tessarine::storage

extern "C" {

TESSARINE_API int32_t HVT_UpdateLowRes(HVT_FileInfo *info, uint8_t source, uint8_t destination,
                                       HVT_Progress *progress) {
    if (info == nullptr || info->header == nullptr) return kErrArgument;
    if (progress != nullptr && (progress->ops == nullptr || progress->ops->report == nullptr))
        return kErrArgument;
    const HVT_FileHeader &h = *info->header;
    if (h.bitsPerPixel == 1 || h.imageType == 3)
        return ts::HVT_UpdateLowResSample(info, source, destination, progress);
    return ts::HVT_UpdateLowResAverage(info, source, destination, progress);
}

}  // extern "C"
