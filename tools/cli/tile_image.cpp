#include "tile_image.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "failure.h"
#include "output_file.h"

namespace tessarine::cli {
namespace {

constexpr uint8_t kStamp[6] = {7, 20, 19, 'D', 0, 1};

// Releases a record that was filled for one opening.
struct FileInfoGuard {
    HVT_FileInfo info;
    bool begun = false;
    FileInfoGuard() { HVT_InitFileInfo(&info); }
    ~FileInfoGuard() {
        if (begun) HVT_TileFileEnd(&info, 0);
    }
};

int64_t TileBytes(const HVT_TileHdr &tile, int bitsPerPixel) {
    return ((int64_t(tile.right - tile.left) * bitsPerPixel + 7) >> 3) * (tile.bottom - tile.top);
}

// Everything the library takes on trust, checked before a pixel is moved.
void CheckFacts(const std::string &path, const TileFileFacts &f) {
    const HVT_FileHeader &h = f.header;
    auto corrupt = [&](const std::string &what) { throw Failure(path, "corrupt tile file: " + what); };
    if (std::memcmp(h.stamp, kStamp, 6) != 0) throw Failure(path, "not a tile bitmap file");
    const int d = h.bitsPerPixel;
    if (d != 1 && d != 4 && d != 8 && d != 24 && d != 32) corrupt("bits per pixel " + std::to_string(d));
    if (h.subbmpCount < 1 || h.subbmpCount >= HVT_MAX_SUBBMPS)
        corrupt("sub-bitmap count " + std::to_string(h.subbmpCount));
    if (h.colorCount < 0 || h.colorCount > 256) corrupt("colour count " + std::to_string(h.colorCount));
    const int entry = h.colorModel == 2 ? 4 : 3;
    if (h.subbmpOffset[0] != 80 + h.colorCount * entry) corrupt("colour table size");
    for (size_t i = 0; i < f.subs.size(); ++i) {
        const SubbmpFacts &sub = f.subs[i];
        const HVT_SubbmpHdr &s = sub.header;
        const std::string which = "sub-bitmap " + std::to_string(i) + ": ";
        if (s.width < 1 || s.height < 1) corrupt(which + "size");
        if (s.tilesAcross != 1 + ((s.width - 1) >> 13) || s.tilesDown != 1 + ((s.height - 1) >> 10))
            corrupt(which + "tile count");
        int64_t running = int64_t(sub.offset) + 16 + int64_t(sub.tiles.size()) * 20;
        for (int32_t row = 0; row < s.tilesDown; ++row) {
            for (int32_t col = 0; col < s.tilesAcross; ++col) {
                const HVT_TileHdr &t = sub.tiles[size_t(row) * s.tilesAcross + col];
                const int32_t left = col * HVT_TILE_WIDTH, top = row * HVT_TILE_HEIGHT;
                const int32_t right = std::min(s.width, left + HVT_TILE_WIDTH);
                const int32_t bottom = std::min(s.height, top + HVT_TILE_HEIGHT);
                if (t.left != left || t.top != top || t.right != right || t.bottom != bottom)
                    corrupt(which + "tile box");
                if (t.offset != running) corrupt(which + "tile offset");
                running += TileBytes(t, d);
            }
        }
        if (running != h.subbmpOffset[i + 1]) corrupt(which + "end offset");
    }
    if (int64_t(h.subbmpOffset[h.subbmpCount]) + 1 > f.fileBytes)
        throw Failure(path, "truncated tile file (" + std::to_string(f.fileBytes) + " bytes, " +
                                std::to_string(int64_t(h.subbmpOffset[h.subbmpCount]) + 1) +
                                " expected)");
}

}  // namespace

TileImage::TileImage(const std::string &path, Access access) : path_(path) {
    if (path.size() >= sizeof(bitmap_->tilePath)) throw Failure(path, "path too long");
    descriptor_ = open(path.c_str(), (access == Access::Read ? O_RDONLY : O_RDWR) | O_CLOEXEC);
    if (descriptor_ < 0) throw Failure(path, std::strerror(errno));
    struct stat st {};
    if (fstat(descriptor_, &st) != 0 || !S_ISREG(st.st_mode)) {
        close(descriptor_);
        throw Failure(path, "not a regular file");
    }
    if (st.st_size < 80) {
        close(descriptor_);
        throw Failure(path, st.st_size == 0 ? "empty file" : "not a tile bitmap file (too short)");
    }
    if (TS_FAILED(BI_NewBitmap(&bitmap_))) {
        close(descriptor_);
        throw Failure(path, "not enough memory");
    }
    std::strcpy(bitmap_->tilePath, path.c_str());
    bitmap_->tileFile = descriptor_;
    bitmap_->storage = BI_STORAGE_TILEFILE;
    try {
        Load();
    } catch (...) {
        Release();
        throw;
    }
}

TileImage::~TileImage() { Release(); }

void TileImage::Release() {
    if (bitmap_ != nullptr) {
        // The file is the user's: the record forgets it before it goes.
        bitmap_->tilePath[0] = '\0';
        bitmap_->tileFile = -1;
        BI_DeleteBitmap(&bitmap_);
    }
    if (descriptor_ >= 0) close(descriptor_);
    descriptor_ = -1;
}

void TileImage::Reload() { Load(); }

const SubbmpFacts &TileImage::Sub(int sub) const {
    if (sub < 0 || size_t(sub) >= facts_.subs.size())
        throw UsageFailure(path_ + ": no sub-bitmap " + std::to_string(sub) + " (the file has " +
                           std::to_string(facts_.subs.size()) + ")");
    return facts_.subs[size_t(sub)];
}

void TileImage::Load() {
    struct stat st {};
    fstat(descriptor_, &st);
    FileInfoGuard guard;
    int32_t s = HVT_TileFileBegin(bitmap_, &guard.info, 0);
    if (TS_FAILED(s)) {
        if (TS_STATUS(s) == -50)
            throw Failure(path_, "corrupt or truncated tile file (its header or colour table cannot be read)");
        if (TS_STATUS(s) == -2) throw Failure(path_, "corrupt tile file: unknown colour model");
        if (TS_STATUS(s) == -5) throw Failure(path_, "corrupt tile file: sizes beyond memory");
        FailStatus(path_, "open the tile file", s);
    }
    guard.begun = true;
    TileFileFacts facts;
    facts.fileBytes = st.st_size;
    facts.header = *guard.info.header;
    const HVT_FileHeader &h = facts.header;
    if (std::memcmp(h.stamp, kStamp, 6) != 0) throw Failure(path_, "not a tile bitmap file");
    const int entry = h.colorModel == 2 ? 4 : 3;
    if (h.colorCount > 0 && h.colorCount <= 256 && guard.info.colorTable != nullptr)
        facts.colors.assign(guard.info.colorTable, guard.info.colorTable + size_t(h.colorCount) * entry);
    const int count = h.subbmpCount < HVT_MAX_SUBBMPS ? h.subbmpCount : 0;
    for (int i = 0; i < count; ++i) {
        SubbmpFacts sub{};
        sub.offset = h.subbmpOffset[i];
        const HVT_SubbmpSlot &slot = guard.info.subbmps[i];
        sub.header = {slot.width, slot.height, slot.tilesAcross, slot.tilesDown};
        if (slot.width < 1 || slot.height < 1 || slot.tilesAcross != 1 + ((slot.width - 1) >> 13) ||
            slot.tilesDown != 1 + ((slot.height - 1) >> 10))
            throw Failure(path_, "corrupt tile file: sub-bitmap " + std::to_string(i) + " header");
        if (int64_t(sub.offset) + 16 + int64_t(slot.tilesAcross) * slot.tilesDown * 20 > facts.fileBytes)
            throw Failure(path_, "truncated tile file (tile table of sub-bitmap " + std::to_string(i) + ")");
        s = HVT_GetSubbmpTileHdrs(uint8_t(i), &guard.info);
        if (TS_FAILED(s)) FailStatus(path_, "read the tile table", s);
        const HVT_TileHdr *tiles = guard.info.subbmps[i].tileHdrs;
        sub.tiles.assign(tiles, tiles + size_t(slot.tilesAcross) * slot.tilesDown);
        facts.subs.push_back(std::move(sub));
    }
    CheckFacts(path_, facts);

    BI_Bitmap &b = *bitmap_;
    b.imageType = h.imageType;
    b.bitsPerPixel = h.bitsPerPixel;
    b.colorModel = h.colorModel;
    b.width = facts.subs[0].header.width;
    b.height = facts.subs[0].header.height;
    b.xResolution = h.xResolution;
    b.yResolution = h.yResolution;
    b.userByte1 = h.userByte1;
    b.userByte2 = h.userByte2;
    b.userByte3 = h.userByte3;
    b.bytesPerRow = uint32_t(((int64_t(b.bitsPerPixel) * b.width + 31) >> 3) & ~int64_t(3));
    if (b.colorTable != nullptr) b.colorTable = MEM_FreeHdl(b.colorTable);
    b.colorCount = 0;
    if (!facts.colors.empty()) {
        b.colorTable = MEM_AllocHdl(0, uint32_t(facts.colors.size()));
        if (b.colorTable == nullptr) throw Failure(path_, "not enough memory");
        std::memcpy(MEM_Lock(b.colorTable), facts.colors.data(), facts.colors.size());
        MEM_Unlock(b.colorTable);
        b.colorCount = h.colorCount;
    }
    if (!BI_IsValidBmp(&b))
        throw Failure(path_, std::string("corrupt tile file: no valid layout (") +
                                 ImageTypeName(b.imageType) + ", " + std::to_string(b.bitsPerPixel) +
                                 "-bit, " + std::to_string(b.colorCount) + " colours)");
    facts_ = std::move(facts);
}

NewTileImage::NewTileImage(const std::string &finalPath, const Layout &layout, int32_t width,
                           int32_t height, double xResolution, double yResolution,
                           const std::vector<uint8_t> &colors)
    : path_(finalPath) {
    RequireWritableFolder(finalPath);
    const int entry = layout.colorModel == 2 ? 4 : 3;
    const int32_t count = layout.imageType == 3 ? int32_t(colors.size() / entry) : 0;
    int32_t s;
    {
        ScratchFolderFor here(finalPath);
        s = BI_CreateBlankBmp(layout.imageType, layout.bitsPerPixel, width, height, xResolution,
                              yResolution, layout.colorModel, count,
                              count > 0 ? colors.data() : nullptr, &bitmap_, BI_STORAGE_TILEFILE, 1,
                              0, 0);
    }
    if (TS_FAILED(s)) {
        bitmap_ = nullptr;
        if (TS_STATUS(s) == -1)
            // The folder was found writable: what is left is memory or descriptors.
            throw Failure(finalPath, "cannot make the tile file in " + FolderOf(finalPath) +
                                         " (not enough memory, or too many open files)");
        FailStatus(finalPath, "create the tile file", s);
    }
}

NewTileImage::~NewTileImage() {
    if (bitmap_ != nullptr) BI_DeleteBitmap(&bitmap_); // removes the scratch file too
}

void NewTileImage::Commit() {
    if (bitmap_->tileFile != -1) {
        const int fd = bitmap_->tileFile;
        bitmap_->tileFile = -1;
        if (TS_FAILED(FM_Close(fd)))
            throw Failure(path_, std::string("cannot finish the file: ") + std::strerror(errno));
    }
    MoveIntoPlace(bitmap_->tilePath, path_);
    bitmap_->tilePath[0] = '\0';
    BI_DeleteBitmap(&bitmap_);
}

RowSession::RowSession(BI_Bitmap *bitmap, uint8_t flags, uint8_t sub, const std::string &file)
    : bitmap_(bitmap), flags_(flags), file_(file) {
    const int32_t s = HVT_TileFileRowIOBegin(flags, bitmap, nullptr, 2, sub, kSessionBudget);
    Check(s, file, flags & 2 ? "write the tile file" : "read the tile file");
    open_ = true;
}

RowSession::~RowSession() {
    if (open_) HVT_TileFileRowColIOEnd(bitmap_);
}

void RowSession::End() {
    if (!open_) return;
    open_ = false;
    // The last band is saved by End, which has no result: a failed write
    // shows in the errno the file layer keeps.
    constexpr int32_t kUntouched = INT32_MIN;
    FM_LastErrno = kUntouched;
    HVT_TileFileRowColIOEnd(bitmap_);
    const int32_t error = FM_LastErrno;
    FM_LastErrno = 0;
    if ((flags_ & 2) && error != kUntouched)
        throw Failure(file_, std::string("cannot write: ") +
                                 (error != 0 ? std::strerror(error) : "the disk is full"));
}

}  // namespace tessarine::cli
