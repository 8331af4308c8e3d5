// Tile bitmap files as the tool sees them: an existing file opened as a
// bitmap record of the library (the file stays the user's), and a new file
// written under a scratch name beside its final one.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include <tessarine/tessarine.h>

#include "layouts.h"

namespace tessarine::cli {

struct SubbmpFacts {
    int32_t offset;
    HVT_SubbmpHdr header;
    std::vector<HVT_TileHdr> tiles;
};

struct TileFileFacts {
    HVT_FileHeader header;
    std::vector<uint8_t> colors; // colorCount entries of 3 or 4 bytes
    std::vector<SubbmpFacts> subs;
    int64_t fileBytes = 0;
};

class TileImage {
  public:
    enum class Access { Read, ReadWrite };
    // Opens and checks the file; throws a Failure naming it when it is
    // missing, unreadable or not a sound tile bitmap file.
    TileImage(const std::string &path, Access access);
    ~TileImage();
    TileImage(const TileImage &) = delete;
    TileImage &operator=(const TileImage &) = delete;

    BI_Bitmap *Bitmap() { return bitmap_; }
    const TileFileFacts &Facts() const { return facts_; }
    const std::string &Path() const { return path_; }
    // Reads the header and the sub-bitmaps again (after levels were added).
    void Reload();
    // Throws a UsageFailure unless the sub-bitmap exists.
    const SubbmpFacts &Sub(int sub) const;

  private:
    void Load();
    void Release();
    std::string path_;
    int descriptor_ = -1;
    BI_Bitmap *bitmap_ = nullptr;
    TileFileFacts facts_;
};

class NewTileImage {
  public:
    // A blank tile file of the layout under a scratch name in the folder of
    // `finalPath`. `colors` is the colour table for an indexed layout.
    NewTileImage(const std::string &finalPath, const Layout &layout, int32_t width, int32_t height,
                 double xResolution, double yResolution, const std::vector<uint8_t> &colors);
    ~NewTileImage();
    NewTileImage(const NewTileImage &) = delete;
    NewTileImage &operator=(const NewTileImage &) = delete;

    BI_Bitmap *Bitmap() { return bitmap_; }
    const std::string &FinalPath() const { return path_; }
    // Closes the file and renames it to the final name.
    void Commit();

  private:
    std::string path_;
    BI_Bitmap *bitmap_ = nullptr;
};

// A row session over a whole sub-bitmap, ended on every exit. A writing
// session reports at End a band that could not be saved.
class RowSession {
  public:
    RowSession(BI_Bitmap *bitmap, uint8_t flags, uint8_t sub, const std::string &file);
    ~RowSession();
    RowSession(const RowSession &) = delete;
    RowSession &operator=(const RowSession &) = delete;
    void End();

  private:
    BI_Bitmap *bitmap_;
    uint8_t flags_;
    std::string file_;
    bool open_ = false;
};

// Band budget of the tool's row sessions: small bands keep memory bounded
// while each band still meets every tile of its rows once.
inline constexpr int32_t kSessionBudget = 8 << 20;

}  // namespace tessarine::cli
