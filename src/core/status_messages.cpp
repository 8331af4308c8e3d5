#include <array>

#include <tessarine/core.h>

#include "core/status.h"
#include "platform/messages.h"

namespace {

constexpr int32_t kGeneralText = 16384;
constexpr int32_t kSilent = -1;
constexpr int32_t kLowestListed = -56;

// Text id for each status from -56 to -2; 0 means "no row of its own".
constexpr std::array<int32_t, 55> MakeTextIds() {
    std::array<int32_t, 55> ids{};
    struct Row { int32_t status, id; };
    constexpr Row rows[] = {
        {-2, 16385},  {-5, 16386},  {-8, 16387},  {-9, 16388},  {-10, 16389}, {-11, 16390},
        {-12, 16391}, {-17, 16392}, {-20, 16393}, {-21, 16394}, {-23, 16415}, {-24, 16395},
        {-25, 16396}, {-26, 16397}, {-28, 16398}, {-31, 16399}, {-32, 16400}, {-33, 16401},
        {-35, 16402}, {-36, 16403}, {-37, 16404}, {-38, 16405}, {-50, 16406}, {-52, 16407},
        {-53, 16408}, {-54, 16409}, {-55, 16410}, {-56, 16411}, {-18, kSilent}, {-34, kSilent},
    };
    for (const Row &row : rows) ids[row.status - kLowestListed] = row.id;
    return ids;
}

constexpr std::array<int32_t, 55> kTextIds = MakeTextIds();

constexpr uint32_t kStyleOk = 0;
constexpr uint32_t kNoHelpContext = 0xFFFFFFFFu;
constexpr uint32_t kStyleTaskModalExclamation = 0x2030;

}  // namespace

extern "C" TESSARINE_API void ShowStatusMsg(int32_t status) {
    const int32_t s = tessarine::StatusOf(status);
    if (s > 0) return;
    int32_t id = kGeneralText;
    const int32_t slot = s - kLowestListed;
    if (slot >= 0 && slot < static_cast<int32_t>(kTextIds.size()) && kTextIds[slot] != 0)
        id = kTextIds[slot];
    if (id == kSilent) return;
    tessarine::platform::AfxMessageBox(static_cast<uint32_t>(id), kStyleOk, kNoHelpContext);
}

extern "C" TESSARINE_API int32_t TO_ShowMessageBox(const char *text) {
    return tessarine::platform::MessageBoxA(nullptr, text, "", kStyleTaskModalExclamation);
}
