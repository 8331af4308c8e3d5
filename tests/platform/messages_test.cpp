#include <gtest/gtest.h>

#include <tessarine/core.h>

#include "core/status.h"
#include "platform/heap.h"
#include "platform/messages.h"
#include "test_support.h"

namespace {
using namespace tessarine::platform;

TEST(StringTable, HoldsTheBuiltInTextsByIdAndNothingOutside) {
    EXPECT_STREQ(LoadString(16384), "Error detected; operation aborted.");
    EXPECT_STREQ(LoadString(16411), "Stack overflow.");
    EXPECT_STREQ(LoadString(16412), "Unexpected NULL pointer.");
    EXPECT_STREQ(LoadString(16413), "Degenerated input.");
    EXPECT_STREQ(LoadString(16414), "Wrong input.");
    EXPECT_STREQ(LoadString(16415), "Not enough memory to bitmap.");
    EXPECT_EQ(LoadString(16383), nullptr);
    EXPECT_EQ(LoadString(16416), nullptr);
}

TEST(StringTable, EveryTextOfTheStatusTableUnderItsId) {
    int32_t texts = 0;
    for (const tessarine::StatusText &row : tessarine::kStatusTable) {
        if (row.text == nullptr) continue;
        EXPECT_STREQ(LoadString(row.textId), row.text) << row.textId;
        ++texts;
    }
    EXPECT_EQ(texts, tessarine::kLastTextId - tessarine::kFirstTextId + 1);
    EXPECT_EQ(LoadString(tessarine::kFirstTextId - 1), nullptr);
    EXPECT_EQ(LoadString(tessarine::kLastTextId + 1), nullptr);
}

TEST(MessageSink, FrameworkBoxPassesIdStyleAndText) {
    tstest::MessageCapture capture;
    EXPECT_EQ(AfxMessageBox(16386, 0, 0xFFFFFFFFu), 1);
    ASSERT_EQ(capture.Messages().size(), 1u);
    EXPECT_EQ(capture.Messages()[0].text, "Not enough memory.");
    EXPECT_EQ(capture.Messages()[0].id, 16386);
    EXPECT_EQ(capture.Messages()[0].style, 0u);
}

TEST(MessageSink, FreeTextHasIdMinusOne) {
    tstest::MessageCapture capture;
    MessageBoxA(nullptr, "free", "", 0x2030);
    ASSERT_EQ(capture.Messages().size(), 1u);
    EXPECT_EQ(capture.Messages()[0].text, "free");
    EXPECT_EQ(capture.Messages()[0].id, -1);
    EXPECT_EQ(capture.Messages()[0].style, 0x2030u);
}

TEST(MessageSink, DefaultSinkWritesToStandardErrorAndAnswersOk) {
    TS_MessageSinkFn previous = TS_SetMessageSink(nullptr);
    ::testing::internal::CaptureStderr();
    const int32_t answer = TO_ShowMessageBox("to standard error");
    const std::string written = ::testing::internal::GetCapturedStderr();
    TS_SetMessageSink(previous);
    EXPECT_EQ(answer, 1);
    EXPECT_EQ(written, "to standard error\n");
}

std::vector<uint32_t> g_sizes;
int32_t RecordSize(uint32_t size) {
    g_sizes.push_back(size);
    return 77;
}

TEST(NewMemoryHandlerHook, DefaultDoesNothingAndInstalledOneIsCalled) {
    EXPECT_EQ(NewMemoryHandler(5), 0);
    TS_NewMemoryHandlerFn previous = TS_SetNewMemoryHandler(RecordSize);
    g_sizes.clear();
    EXPECT_EQ(NewMemoryHandler(123), 77);
    EXPECT_EQ(g_sizes, std::vector<uint32_t>{123});
    EXPECT_EQ(TS_SetNewMemoryHandler(previous), RecordSize);
    EXPECT_EQ(NewMemoryHandler(5), 0);
}

}  // namespace
