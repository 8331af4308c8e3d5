#include <atomic>

#include "platform/heap.h"

namespace tessarine::platform {
namespace {

int32_t DefaultNewMemoryHandler(uint32_t) { return 0; }

std::atomic<TS_NewMemoryHandlerFn> g_handler{DefaultNewMemoryHandler};

}  // namespace

int32_t NewMemoryHandler(uint32_t size) { return g_handler.load()(size); }

}  // namespace tessarine::platform

extern "C" TESSARINE_API TS_NewMemoryHandlerFn TS_SetNewMemoryHandler(
    TS_NewMemoryHandlerFn handler) {
    using namespace tessarine::platform;
    return g_handler.exchange(handler ? handler : DefaultNewMemoryHandler);
}
