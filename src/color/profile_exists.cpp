#include <tessarine/profile.hpp>

TESSARINE_API int ProfileExists(AFilePath const &folder, AString const &fileName) {
    AFilePath path(folder);
    if (!path.exists()) return 0;
    path += fileName;
    return path.exists();
}
