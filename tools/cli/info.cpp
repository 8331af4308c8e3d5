// tessarine info: what a tile bitmap file holds, as text or JSON.
#include <nlohmann/json.hpp>
#include <ostream>

#include "commands.h"
#include "tile_image.h"

namespace tessarine::cli {
namespace {

int64_t TileBytes(const HVT_TileHdr &t, int bitsPerPixel) {
    return ((int64_t(t.right - t.left) * bitsPerPixel + 7) >> 3) * (t.bottom - t.top);
}

nlohmann::ordered_json AsJson(const TileImage &image) {
    const TileFileFacts &f = image.Facts();
    const HVT_FileHeader &h = f.header;
    nlohmann::ordered_json j;
    j["file"] = image.Path();
    j["bytes"] = f.fileBytes;
    j["layout"] = LayoutOf(*const_cast<TileImage &>(image).Bitmap());
    j["imageType"] = h.imageType;
    j["bitsPerPixel"] = h.bitsPerPixel;
    j["colorModel"] = h.colorModel;
    // The header is packed: its doubles are copied out before use.
    const double xResolution = h.xResolution, yResolution = h.yResolution;
    j["xResolution"] = xResolution;
    j["yResolution"] = yResolution;
    j["userBytes"] = {h.userByte1, h.userByte2, h.userByte3};
    const size_t entry = h.colorModel == 2 ? 4 : 3;
    auto colors = nlohmann::ordered_json::array();
    for (size_t i = 0; i + entry <= f.colors.size(); i += entry)
        colors.push_back(std::vector<int>(f.colors.begin() + i, f.colors.begin() + i + entry));
    j["colorTable"] = colors;
    auto subs = nlohmann::ordered_json::array();
    for (size_t i = 0; i < f.subs.size(); ++i) {
        const SubbmpFacts &s = f.subs[i];
        nlohmann::ordered_json sj;
        sj["index"] = i;
        sj["offset"] = s.offset;
        sj["width"] = s.header.width;
        sj["height"] = s.header.height;
        sj["tilesAcross"] = s.header.tilesAcross;
        sj["tilesDown"] = s.header.tilesDown;
        auto tiles = nlohmann::ordered_json::array();
        for (const HVT_TileHdr &t : s.tiles)
            tiles.push_back({{"left", t.left}, {"top", t.top}, {"right", t.right}, {"bottom", t.bottom},
                             {"offset", t.offset}, {"bytes", TileBytes(t, h.bitsPerPixel)}});
        sj["tiles"] = tiles;
        subs.push_back(sj);
    }
    j["subBitmaps"] = subs;
    const int32_t end = h.subbmpOffset[h.subbmpCount];
    j["end"] = end;
    return j;
}

void AsText(TileImage &image, std::ostream &out) {
    const TileFileFacts &f = image.Facts();
    const HVT_FileHeader &h = f.header;
    out << image.Path() << ": tile bitmap file, " << f.fileBytes << " bytes\n";
    out << "  layout:       " << LayoutOf(*image.Bitmap()) << " (" << ImageTypeName(h.imageType) << ", "
        << int(h.bitsPerPixel) << "-bit, " << ColorModelName(h.colorModel) << ")\n";
    const double xResolution = h.xResolution, yResolution = h.yResolution;
    out << "  resolution:   " << xResolution << " x " << yResolution << "\n";
    out << "  user bytes:   " << int(h.userByte1) << " " << int(h.userByte2) << " " << int(h.userByte3) << "\n";
    const size_t entry = h.colorModel == 2 ? 4 : 3;
    out << "  colour table: " << f.colors.size() / entry << " entries\n";
    for (size_t i = 0; i + entry <= f.colors.size(); i += entry) {
        out << "    " << i / entry << ":";
        for (size_t c = 0; c < entry; ++c) out << " " << int(f.colors[i + c]);
        out << "\n";
    }
    out << "  sub-bitmaps:  " << f.subs.size() << "\n";
    for (size_t i = 0; i < f.subs.size(); ++i) {
        const SubbmpFacts &s = f.subs[i];
        out << "  sub-bitmap " << i << ": " << s.header.width << " x " << s.header.height << ", "
            << s.header.tilesAcross << " x " << s.header.tilesDown << " tiles, header at " << s.offset << "\n";
        for (size_t t = 0; t < s.tiles.size(); ++t) {
            const HVT_TileHdr &tile = s.tiles[t];
            out << "    tile " << t << ": (" << tile.left << ", " << tile.top << ") to (" << tile.right
                << ", " << tile.bottom << "), " << TileBytes(tile, h.bitsPerPixel) << " bytes at "
                << tile.offset << "\n";
        }
    }
    out << "  end mark at:  " << h.subbmpOffset[h.subbmpCount] << "\n";
}

}  // namespace

void RunInfo(const InfoOptions &options, std::ostream &out) {
    TileImage image(options.file, TileImage::Access::Read);
    if (options.json)
        out << AsJson(image).dump(2) << "\n";
    else
        AsText(image, out);
}

}  // namespace tessarine::cli
