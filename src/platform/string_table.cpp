// Built-in status texts, and the optional satellite library that replaces
// them: the module's own file name with everything from its first "." replaced
// by "LOC.so", loaded once when the library is loaded.
#include <dlfcn.h>

#include <cstring>

#include "platform/messages.h"

namespace tessarine::platform {
namespace {

constexpr const char *kBuiltIn[kLastStringId - kFirstStringId + 1] = {
    "Error detected; operation aborted.",         // 16384
    "Functionality not yet supported.",           // 16385
    "Not enough memory.",                         // 16386
    "Open paths will not be processed.",          // 16387
    "Option does not exist",                      // 16388
    "No object found.",                           // 16389
    "Input number is too large.",                 // 16390
    "System database failed.",                    // 16391
    "Offset distance too large.",                 // 16392
    "The gap is too big.",                        // 16393
    "Try a simpler case.",                        // 16394
    "Only one color will be processed.",          // 16395
    "Input must be between 0% and 100%.",         // 16396
    "Logic error detected, operation aborted.",   // 16397
    "No object selected.",                        // 16398
    "Device not supported.",                      // 16399
    "Substrate not supported.",                   // 16400
    "Ink not supported.",                         // 16401
    "Only black and white image allowed.",        // 16402
    "No image selected.",                         // 16403
    "Not enough memory to RIP.",                  // 16404
    "Not enough disk space.",                     // 16405
    "Failed to access bitmap.",                   // 16406
    "Object too small to print.",                 // 16407
    "Resource not found.",                        // 16408
    "Failed in doing rasterization.",             // 16409
    "Failed to communicate with Jobyard.",        // 16410
    "Stack overflow.",                            // 16411
    "Unexpected NULL pointer.",                   // 16412
    "Degenerated input.",                         // 16413
    "Wrong input.",                               // 16414
    "Not enough memory to bitmap.",               // 16415
};

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
    if (id < kFirstStringId || id > kLastStringId) return nullptr;
    if (g_satellite != nullptr) {
        if (const char *text = g_satellite(id)) return text;
    }
    return kBuiltIn[id - kFirstStringId];
}

}  // namespace tessarine::platform
