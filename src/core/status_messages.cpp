#include <array>

#include <tessarine/core.h>

#include "core/status.h"
#include "platform/messages.h"

namespace {

using tessarine::kHighestListedStatus;
using tessarine::kLowestListedStatus;

constexpr size_t kListedSpan = static_cast<size_t>(kHighestListedStatus - kLowestListedStatus + 1);
// In the dense table below: a status in the span with no row of its own.
constexpr int32_t kUnlisted = -1;

// The text id of each status from the lowest listed to the highest, so that
// a lookup is one index.
constexpr std::array<int32_t, kListedSpan> kTextIds = [] {
    std::array<int32_t, kListedSpan> ids{};
    ids.fill(kUnlisted);
    for (const tessarine::StatusText &row : tessarine::kStatusTable)
        if (tessarine::status_table::IsListed(row)) ids[row.status - kLowestListedStatus] = row.textId;
    return ids;
}();

constexpr uint32_t kStyleOk = 0;
constexpr uint32_t kNoHelpContext = 0xFFFFFFFFu;
constexpr uint32_t kStyleTaskModalExclamation = 0x2030;

}  // namespace

extern "C" TESSARINE_API void ShowStatusMsg(int32_t status) {
    const int32_t s = tessarine::StatusOf(status);
    if (s > 0) return;
    int32_t id = tessarine::kGeneralTextId;
    const int32_t slot = s - kLowestListedStatus;
    if (slot >= 0 && slot < static_cast<int32_t>(kTextIds.size()) && kTextIds[slot] != kUnlisted)
        id = kTextIds[slot];
    if (id == tessarine::kNoText) return;
    tessarine::platform::AfxMessageBox(static_cast<uint32_t>(id), kStyleOk, kNoHelpContext);
}

extern "C" TESSARINE_API int32_t TO_ShowMessageBox(const char *text) {
    return tessarine::platform::MessageBoxA(nullptr, text, "", kStyleTaskModalExclamation);
}
