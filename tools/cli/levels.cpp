// tessarine levels: reduced copies of the image as further sub-bitmaps, each
// half the size of the one before, made by the library from the last one.
// A stop (Ctrl-C) reaches the library through its progress object; the level
// that was being made is then taken off again, so the file stays as it was
// after the last finished level.
#include <cerrno>
#include <cstring>
#include <ostream>
#include <unistd.h>

#include "commands.h"
#include "failure.h"
#include "tile_image.h"

namespace tessarine::cli {
namespace {

ProgressObserver observer = nullptr;

struct ProgressState {
    HVT_Progress progress; // first: the library hands this back
    std::ostream *err;
    bool bar;
    int level, levels;
    int shown = -1;
};

int32_t Report(HVT_Progress *self, double value) {
    auto *state = reinterpret_cast<ProgressState *>(self);
    if (observer != nullptr) observer(value);
    if (state->bar) {
        const int percent = int(value * 100.0 + 0.5);
        if (percent != state->shown) {
            state->shown = percent;
            const int filled = percent * 30 / 100;
            *state->err << "\r[" << std::string(size_t(std::max(0, filled)), '#')
                        << std::string(size_t(std::max(0, 30 - filled)), '.') << "] " << percent << "% level "
                        << state->level << "/" << state->levels << std::flush;
        }
    }
    return StopRequested() ? 1 : 0;
}

constexpr HVT_ProgressOps kOps{Report};

// What a level changes in the file, kept to take an unfinished level off.
struct FileState {
    uint8_t header[80];
    off_t size;
};

FileState Save(int fd, const std::string &file) {
    FileState s{};
    if (pread(fd, s.header, sizeof s.header, 0) != ssize_t(sizeof s.header))
        throw Failure(file, std::string("cannot read: ") + std::strerror(errno));
    s.size = lseek(fd, 0, SEEK_END);
    return s;
}

void Restore(int fd, const FileState &s) {
    const char dot = '.';
    // The header goes back first, so that the file never names a level it lacks.
    if (pwrite(fd, s.header, sizeof s.header, 0) == ssize_t(sizeof s.header) &&
        pwrite(fd, &dot, 1, s.size - 1) == 1) {
        if (ftruncate(fd, s.size) != 0) { /* a longer file is still a valid one */ }
    }
}

}  // namespace

void SetProgressObserver(ProgressObserver o) { observer = o; }

void RunLevels(const LevelsOptions &options, std::ostream &out, std::ostream &err) {
    TileImage image(options.file, TileImage::Access::ReadWrite);
    BI_Bitmap *b = image.Bitmap();
    const bool samples = b->bitsPerPixel == 1 || b->imageType == 3;
    if ((options.method == "average" && samples) || (options.method == "sample" && !samples))
        throw Failure(options.file, std::string("levels of ") + LayoutOf(*b) + " are made by " +
                                        (samples ? "point sampling" : "box averaging") + ", not by " +
                                        options.method);
    const int existing = int(image.Facts().subs.size());
    const SubbmpFacts &last = image.Facts().subs.back();
    // Each level halves the one before; point sampling needs two rows and columns.
    std::vector<std::pair<int32_t, int32_t>> sizes;
    int32_t w = last.header.width, h = last.header.height;
    const int room = HVT_MAX_SUBBMPS - 1 - existing;
    const int wanted = options.count > 0 ? options.count : room;
    while (int(sizes.size()) < std::min(wanted, room) && w / 2 >= 2 && h / 2 >= 2) {
        if (options.count == 0 && std::max(w, h) <= 256) break;
        w /= 2;
        h /= 2;
        sizes.emplace_back(w, h);
    }
    if (options.count > 0 && int(sizes.size()) < options.count)
        throw Failure(options.file, "room for " + std::to_string(sizes.size()) + " more levels, not " +
                                        std::to_string(options.count) + " (the file holds " +
                                        std::to_string(existing) + " sub-bitmaps of at most 9, each at least 2 x 2)");

    const int fd = b->tileFile;
    ProgressState state{{&kOps, 0.0, 1.0}, &err, options.progressBar, 0, int(sizes.size())};
    double total = 0, done = 0;
    for (const auto &s : sizes) total += double(s.first) * s.second * 4;
    int made = 0;
    for (const auto &[width, height] : sizes) {
        const FileState before = Save(fd, options.file);
        HVT_FileInfo info;
        HVT_InitFileInfo(&info);
        int32_t status = HVT_TileFileBegin(b, &info, 0);
        uint8_t sub = 0;
        if (!TS_FAILED(status)) status = HVT_AddSubbmp(fd, info.header, uint32_t(width), uint32_t(height), nullptr, &sub);
        HVT_TileFileEnd(&info, 0);
        if (!TS_FAILED(status)) {
            HVT_InitFileInfo(&info);
            status = HVT_TileFileBegin(b, &info, 0);
            if (!TS_FAILED(status)) {
                const double work = double(width) * height * 4;
                state.level = made + 1;
                state.progress.start = done / total;
                state.progress.end = (done + work) / total;
                status = HVT_UpdateLowRes(&info, uint8_t(sub - 1), sub, &state.progress);
                done += work;
            }
            HVT_TileFileEnd(&info, 0);
        }
        if (TS_FAILED(status)) {
            Restore(fd, before);
            if (state.bar) err << "\n";
            if (TS_STATUS(status) == -18)
                throw Failure(options.file, "stopped after " + std::to_string(made) +
                                                " levels; the file is left valid");
            FailStatus(options.file, "make level " + std::to_string(made + 1), status);
        }
        ++made;
    }
    if (state.bar && made > 0) err << "\r[" << std::string(30, '#') << "] 100%" << std::string(12, ' ') << "\n";
    image.Reload();
    out << options.file << ": " << made << " levels added, now " << image.Facts().subs.size()
        << " sub-bitmaps:";
    for (const SubbmpFacts &s : image.Facts().subs) out << " " << s.header.width << "x" << s.header.height;
    out << "\n";
}

}  // namespace tessarine::cli
