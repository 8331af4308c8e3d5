// Status texts through the message sink, the free-text message box, and the
// entry points that do nothing.
#include <cstdint>
#include <map>
#include <string>

#include <gtest/gtest.h>

#include <tessarine/core.h>

#include "test_support.h"

namespace {

const std::map<int32_t, std::string> kTexts = {
    {16384, "Error detected; operation aborted."},
    {16385, "Functionality not yet supported."},
    {16386, "Not enough memory."},
    {16387, "Open paths will not be processed."},
    {16388, "Option does not exist"},
    {16389, "No object found."},
    {16390, "Input number is too large."},
    {16391, "System database failed."},
    {16392, "Offset distance too large."},
    {16393, "The gap is too big."},
    {16394, "Try a simpler case."},
    {16395, "Only one color will be processed."},
    {16396, "Input must be between 0% and 100%."},
    {16397, "Logic error detected, operation aborted."},
    {16398, "No object selected."},
    {16399, "Device not supported."},
    {16400, "Substrate not supported."},
    {16401, "Ink not supported."},
    {16402, "Only black and white image allowed."},
    {16403, "No image selected."},
    {16404, "Not enough memory to RIP."},
    {16405, "Not enough disk space."},
    {16406, "Failed to access bitmap."},
    {16407, "Object too small to print."},
    {16408, "Resource not found."},
    {16409, "Failed in doing rasterization."},
    {16410, "Failed to communicate with Jobyard."},
    {16411, "Stack overflow."},
    {16415, "Not enough memory to bitmap."},
};

// Status to text id; statuses missing here below 1 show the general text.
const std::map<int32_t, int32_t> kOwnRows = {
    {-2, 16385},  {-5, 16386},  {-8, 16387},  {-9, 16388},  {-10, 16389}, {-11, 16390},
    {-12, 16391}, {-17, 16392}, {-20, 16393}, {-21, 16394}, {-23, 16415}, {-24, 16395},
    {-25, 16396}, {-26, 16397}, {-28, 16398}, {-31, 16399}, {-32, 16400}, {-33, 16401},
    {-35, 16402}, {-36, 16403}, {-37, 16404}, {-38, 16405}, {-50, 16406}, {-52, 16407},
    {-53, 16408}, {-54, 16409}, {-55, 16410}, {-56, 16411},
};

// The id shown for a status, or 0 for nothing.
int32_t ExpectedId(int32_t status) {
    if (status > 0 || status == -18 || status == -34) return 0;
    auto row = kOwnRows.find(status);
    return row != kOwnRows.end() ? row->second : 16384;
}

void ExpectShows(tstest::MessageCapture &capture, int32_t argument, int32_t id) {
    capture.Clear();
    ShowStatusMsg(argument);
    if (id == 0) {
        EXPECT_TRUE(capture.Messages().empty()) << "status " << argument;
        return;
    }
    ASSERT_EQ(capture.Messages().size(), 1u) << "status " << argument;
    const tstest::CapturedMessage &m = capture.Messages()[0];
    EXPECT_EQ(m.id, id) << "status " << argument;
    EXPECT_EQ(m.text, kTexts.at(id)) << "status " << argument;
    EXPECT_EQ(m.style, 0u) << "status " << argument;
}

TEST(ShowStatusMsg, EveryStatusFromMinus60To12) {
    tstest::MessageCapture capture;
    for (int32_t status = -60; status <= 12; ++status)
        ExpectShows(capture, status, ExpectedId(status));
}

TEST(ShowStatusMsg, PositiveStatusesShowNothing) {
    tstest::MessageCapture capture;
    for (int32_t status : {1, 10, 11, 100, 32767}) ExpectShows(capture, status, 0);
}

TEST(ShowStatusMsg, ZeroShowsGeneralText) {
    tstest::MessageCapture capture;
    ExpectShows(capture, 0, 16384);
}

TEST(ShowStatusMsg, UnlistedCodesShowGeneralText) {
    tstest::MessageCapture capture;
    for (int32_t status : {-1, -3, -57, -4, -6, -14, -29, -40, -32768})
        ExpectShows(capture, status, 16384);
}

TEST(ShowStatusMsg, SilentCodes) {
    tstest::MessageCapture capture;
    ExpectShows(capture, -18, 0);
    ExpectShows(capture, -34, 0);
}

TEST(ShowStatusMsg, MinusTwentyThreeShowsText16415) {
    tstest::MessageCapture capture;
    ExpectShows(capture, -23, 16415);
}

TEST(ShowStatusMsg, OnlyTheLowSixteenBitsCount) {
    tstest::MessageCapture capture;
    ExpectShows(capture, static_cast<int32_t>(0xFFFFFFFBu), 16386);
    ExpectShows(capture, 0xFFFB, 16386);
    ExpectShows(capture, 0x1234FFFB, 16386);
    ExpectShows(capture, 0x0001000A, 0);      // 10 with garbage above
    ExpectShows(capture, 0x00010000, 16384);  // status 0
    ExpectShows(capture, static_cast<int32_t>(0xFFFF0005u), 0);
    ExpectShows(capture, 0xFFEE, 0);  // -18
    EXPECT_TRUE(TS_FAILED(0xFFFB));
    EXPECT_TRUE(TS_FAILED(static_cast<int32_t>(0xFFFFFFFBu)));
    EXPECT_EQ(TS_STATUS(0xFFFB), TS_STATUS(static_cast<int32_t>(0xFFFFFFFBu)));
    EXPECT_FALSE(TS_FAILED(0x7FFF000A));
}

TEST(ShowStatusMsg, WithoutSatelliteTextsAreBuiltIn) {
    // The test program has no satellite beside it: every text is the
    // library's own.
    tstest::MessageCapture capture;
    for (const auto &[status, id] : kOwnRows) ExpectShows(capture, status, id);
}

int32_t g_sinkResult = 0;
std::string g_sinkText;
uint32_t g_sinkStyle = 0;
int32_t g_sinkId = 0;

int32_t AnsweringSink(const char *text, uint32_t style, int32_t id) {
    g_sinkText = text;
    g_sinkStyle = style;
    g_sinkId = id;
    return g_sinkResult;
}

TEST(TO_ShowMessageBox, ShowsFreeTextTaskModalWithExclamation) {
    tstest::MessageCapture capture;
    EXPECT_EQ(TO_ShowMessageBox("Disk is full"), 1);
    ASSERT_EQ(capture.Messages().size(), 1u);
    EXPECT_EQ(capture.Messages()[0].text, "Disk is full");
    EXPECT_EQ(capture.Messages()[0].id, -1);
    EXPECT_EQ(capture.Messages()[0].style, 0x2030u);
}

TEST(TO_ShowMessageBox, ReturnsWhatTheBoxReturns) {
    TS_MessageSinkFn previous = TS_SetMessageSink(AnsweringSink);
    g_sinkResult = 7;
    EXPECT_EQ(TO_ShowMessageBox(""), 7);
    EXPECT_EQ(g_sinkText, "");
    EXPECT_EQ(g_sinkStyle, 0x2030u);
    EXPECT_EQ(g_sinkId, -1);
    g_sinkResult = 2;
    EXPECT_EQ(TO_ShowMessageBox("x"), 2);
    TS_SetMessageSink(previous);
}

TEST(NoOps, ReturnNothingOrOneAndShowNothing) {
    tstest::MessageCapture capture;
    TO_AnimateWaitCursor();
    TOPrintf("%s %d", "ignored", 3);
    TO_SetProgressBarLeftLabel("left");
    TO_SetProgressBarRightLabel("right");
    TO_SetProgressBarStatus(1, 2, 3);
    func_exit_routine();
    MEM_MoveHHiHdl(nullptr);
    EXPECT_EQ(TO_CmdPeriodStop(), 1);
    EXPECT_EQ(TO_CutStatusIdle(1.5, "x"), 1);
    EXPECT_EQ(TO_InitProgressBar(0, 100, "label"), 1);
    EXPECT_EQ(TO_ReleaseProgressBar(nullptr), 1);
    EXPECT_EQ(TO_SetProgressBarValue(42), 1);
    EXPECT_TRUE(capture.Messages().empty());
}

TEST(NoOps, EachFamilyIsOneFunction) {
    using Void = void (*)(...);
    using One = int32_t (*)(...);
    Void volatile voids[] = {TOPrintf,
                             TO_SetProgressBarLeftLabel,
                             TO_SetProgressBarRightLabel,
                             TO_SetProgressBarStatus,
                             func_exit_routine,
                             MEM_MoveHHiHdl};
    One volatile ones[] = {TO_CutStatusIdle, TO_InitProgressBar, TO_ReleaseProgressBar,
                           TO_SetProgressBarValue};
    Void volatile firstVoid = TO_AnimateWaitCursor;
    One volatile firstOne = TO_CmdPeriodStop;
    for (Void f : voids) EXPECT_EQ(f, firstVoid);
    for (One f : ones) EXPECT_EQ(f, firstOne);
}

}  // namespace
