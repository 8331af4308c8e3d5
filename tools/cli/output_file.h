// Outputs are written under a temporary name in the folder of the final one
// and renamed when complete, so that a failed job leaves no partial file.
#pragma once

#include <string>

namespace tessarine::cli {

// The folder part of a path ("." for a bare name).
std::string FolderOf(const std::string &path);

// Throws a Failure naming `path` when its folder is missing or not writable.
void RequireWritableFolder(const std::string &path);

class PendingOutput {
  public:
    // Makes an empty temporary file beside `path`.
    explicit PendingOutput(std::string path);
    ~PendingOutput();
    PendingOutput(const PendingOutput &) = delete;
    PendingOutput &operator=(const PendingOutput &) = delete;

    const std::string &TempPath() const { return temp_; }
    const std::string &FinalPath() const { return path_; }
    // Renames the finished temporary file to the final name.
    void Commit();

  private:
    std::string path_;
    std::string temp_;
    bool committed_ = false;
};

// Renames a finished file into place; throws a Failure naming `finalPath`.
void MoveIntoPlace(const std::string &from, const std::string &finalPath);

// While alive, the library's scratch files are made in the folder of `path`,
// so that a new tile file can be renamed into place without a copy.
class ScratchFolderFor {
  public:
    explicit ScratchFolderFor(const std::string &path);
    ~ScratchFolderFor();
    ScratchFolderFor(const ScratchFolderFor &) = delete;
    ScratchFolderFor &operator=(const ScratchFolderFor &) = delete;

  private:
    std::string saved_;
    bool hadValue_ = false;
};

}  // namespace tessarine::cli
