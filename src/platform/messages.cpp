#include <atomic>
#include <cstdio>

#include <tessarine/platform.h>

#include "platform/messages.h"

namespace tessarine::platform {
namespace {

int32_t DefaultSink(const char *text, uint32_t, int32_t) {
    std::fprintf(stderr, "%s\n", text ? text : "");
    return 1;  // OK
}

std::atomic<TS_MessageSinkFn> g_sink{DefaultSink};

}  // namespace

int32_t AfxMessageBox(uint32_t id, uint32_t style, uint32_t /*helpContext*/) {
    const char *text = LoadString(static_cast<int32_t>(id));
    return g_sink.load()(text ? text : "", style, static_cast<int32_t>(id));
}

int32_t MessageBoxA(void * /*owner*/, const char *text, const char * /*caption*/,
                    uint32_t style) {
    return g_sink.load()(text ? text : "", style, -1);
}

}  // namespace tessarine::platform

extern "C" TESSARINE_API TS_MessageSinkFn TS_SetMessageSink(TS_MessageSinkFn sink) {
    using namespace tessarine::platform;
    return g_sink.exchange(sink ? sink : DefaultSink);
}
