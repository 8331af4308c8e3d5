// Helpers for the tile file tests: file bytes, little-endian fields, and a
// tile file made and opened in one step.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include <tessarine/storage.h>

namespace tiletest {

inline std::vector<uint8_t> FileBytes(const std::string &path) {
    std::ifstream in(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

inline int32_t I32(const std::vector<uint8_t> &b, size_t at) {
    return static_cast<int32_t>(uint32_t{b.at(at)} | uint32_t{b.at(at + 1)} << 8 |
                                uint32_t{b.at(at + 2)} << 16 | uint32_t{b.at(at + 3)} << 24);
}

// A scratch tile file with one sub-bitmap, opened into `info` on its own
// descriptor; removed at the end.
class TileFile {
  public:
    TileFile(uint8_t bpp, uint32_t width, uint32_t height, uint8_t imageType = 2,
             uint8_t colorModel = 0, int32_t colorCount = 0, const uint8_t *colors = nullptr) {
        path_[0] = '\0';
        status_ = HVT_CreateBlankTileBmpFile(imageType, bpp, width, height, 300.0, 150.0,
                                             colorModel, colorCount, colors, path_, &fd_, 9, 8, 7);
        HVT_InitFileInfo(&info_);
        if (status_ == TS_OK) status_ = Open();
    }
    // Adds a sub-bitmap through the creator's descriptor and opens the file
    // state again so that it sees it.
    int32_t AddSubbmp(uint32_t width, uint32_t height) {
        HVT_FileHeader header = *info_.header;
        const int32_t s = HVT_AddSubbmp(fd_, &header, width, height, nullptr, nullptr);
        if (s != TS_OK) return s;
        HVT_TileFileEnd(&info_, 1);
        return Open();
    }
    ~TileFile() {
        HVT_TileFileEnd(&info_, 1);
        if (fd_ > 0) FM_Close(fd_);
        if (path_[0]) FM_Delete(path_);
    }
    int32_t Status() const { return status_; }
    HVT_FileInfo *Info() { return &info_; }
    const char *Path() const { return path_; }
    int32_t Fd() const { return fd_; }

  private:
    int32_t Open() {
        BI_Bitmap view{};
        view.tileFile = -1;
        std::snprintf(view.tilePath, sizeof view.tilePath, "%s", path_);
        return HVT_TileFileBegin(&view, &info_, 1);
    }
    char path_[513];
    int32_t fd_ = -1;
    int32_t status_;
    HVT_FileInfo info_;
};

}  // namespace tiletest
