// Built-in status texts, and the optional satellite library that replaces
// them: the module's own file name with everything from its first "." replaced
// by "LOC.so", loaded once when the library is loaded.
#include <dlfcn.h>

#include <array>
#include <cstring>

#include "core/status.h"
#include "platform/messages.h"

namespace tessarine::platform {
namespace {

constexpr size_t kTextCount = static_cast<size_t>(kLastTextId - kFirstTextId + 1);

// The status table's texts by id, built in.
constexpr std::array<const char *, kTextCount> kBuiltIn = [] {
    std::array<const char *, kTextCount> texts{};
    for (const StatusText &row : kStatusTable)
        if (row.text != nullptr) texts[row.textId - kFirstTextId] = row.text;
    return texts;
}();

using LocStringFn = const char *(*)(int);
LocStringFn g_satellite = nullptr;

constexpr char kSatelliteSuffix[] = "LOC.so";
constexpr size_t kPathBytes = 4096;

// Runs at load; the load itself cannot fail, so every step just gives up.
__attribute__((constructor)) void LoadSatellite() {
    Dl_info info{};
    if (dladdr(reinterpret_cast<void *>(&LoadSatellite), &info) == 0 || info.dli_fname == nullptr)
        return;
    const size_t length = std::strlen(info.dli_fname);
    if (length == 0 || length >= kPathBytes) return;
    char path[kPathBytes + sizeof kSatelliteSuffix];
    std::memcpy(path, info.dli_fname, length + 1);
    char *name = std::strrchr(path, '/');
    name = name ? name + 1 : path;
    char *dot = std::strchr(name, '.');
    if (dot == nullptr) return;
    std::memcpy(dot, kSatelliteSuffix, sizeof kSatelliteSuffix);
    void *satellite = dlopen(path, RTLD_NOW | RTLD_LOCAL);
    if (satellite == nullptr) return;
    g_satellite = reinterpret_cast<LocStringFn>(dlsym(satellite, "TessarineLocString"));
}

}  // namespace

const char *LoadString(int32_t id) {
    if (id < kFirstTextId || id > kLastTextId) return nullptr;
    if (g_satellite != nullptr) {
        if (const char *text = g_satellite(id)) return text;
    }
    return kBuiltIn[id - kFirstTextId];
}

}  // namespace tessarine::platform
