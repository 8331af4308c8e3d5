#include "output_file.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

#include "failure.h"

namespace tessarine::cli {

std::string FolderOf(const std::string &path) {
    const size_t slash = path.find_last_of('/');
    if (slash == std::string::npos) return ".";
    if (slash == 0) return "/";
    return path.substr(0, slash);
}

void RequireWritableFolder(const std::string &path) {
    if (path.empty()) throw Failure("(empty name)", "no output file named");
    if (path.back() == '/') throw Failure(path, "names a folder, not a file");
    const std::string folder = FolderOf(path);
    struct stat st {};
    if (stat(folder.c_str(), &st) != 0)
        throw Failure(path, "cannot write: folder " + folder + ": " + std::strerror(errno));
    if (!S_ISDIR(st.st_mode)) throw Failure(path, "cannot write: " + folder + " is not a folder");
    if (access(folder.c_str(), W_OK | X_OK) != 0)
        throw Failure(path, "cannot write in folder " + folder + ": " + std::strerror(errno));
    if (stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode))
        throw Failure(path, "is a folder");
}

PendingOutput::PendingOutput(std::string path) : path_(std::move(path)) {
    RequireWritableFolder(path_);
    const std::string folder = FolderOf(path_);
    std::string name = path_.substr(path_.find_last_of('/') == std::string::npos
                                        ? 0
                                        : path_.find_last_of('/') + 1);
    std::string pattern = folder + "/." + name + ".part-XXXXXX";
    std::vector<char> buffer(pattern.begin(), pattern.end());
    buffer.push_back('\0');
    const int fd = mkstemp(buffer.data());
    if (fd < 0) throw Failure(path_, std::string("cannot create the file: ") + std::strerror(errno));
    close(fd);
    temp_ = buffer.data();
}

PendingOutput::~PendingOutput() {
    if (!committed_ && !temp_.empty()) std::remove(temp_.c_str());
}

void PendingOutput::Commit() {
    MoveIntoPlace(temp_, path_);
    committed_ = true;
}

void MoveIntoPlace(const std::string &from, const std::string &finalPath) {
    // A new file gets the permissions a plain create would have given it.
    const mode_t mask = umask(0);
    umask(mask);
    chmod(from.c_str(), 0666 & ~mask);
    if (std::rename(from.c_str(), finalPath.c_str()) != 0)
        throw Failure(finalPath, std::string("cannot put the file in place: ") + std::strerror(errno));
}

ScratchFolderFor::ScratchFolderFor(const std::string &path) {
    if (const char *value = std::getenv("TMPDIR")) {
        saved_ = value;
        hadValue_ = true;
    }
    setenv("TMPDIR", FolderOf(path).c_str(), 1);
}

ScratchFolderFor::~ScratchFolderFor() {
    if (hadValue_)
        setenv("TMPDIR", saved_.c_str(), 1);
    else
        unsetenv("TMPDIR");
}

}  // namespace tessarine::cli
