#include <sys/stat.h>

#include <cstring>

#include <tessarine/profile.hpp>

#include "platform/text_copy.h"

using tessarine::platform::FreeText;
using tessarine::platform::JoinText;

AFilePath::AFilePath() : path_(nullptr) {}

AFilePath::AFilePath(char const *path) : path_(path) {}

AFilePath::AFilePath(AFilePath const &other) : path_(other.path_) {}

AFilePath::~AFilePath() = default;

AFilePath::operator char const *() {
    return path_;
}

AFilePath::operator AString const &() const {
    return path_;
}

AFilePath &AFilePath::operator+=(AString const &name) {
    char const *folder = path_;
    const size_t length = std::strlen(folder);
    const bool separate = length != 0 && folder[length - 1] != '/';
    char *joined = JoinText(folder, separate ? "/" : "", name);
    FreeText(path_.text_);
    path_.text_ = joined;
    return *this;
}

int AFilePath::exists() const {
    char const *text = path_;
    struct stat info;
    return text[0] != '\0' && stat(text, &info) == 0 ? 1 : 0;
}
