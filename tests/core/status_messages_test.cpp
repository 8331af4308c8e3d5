// Status texts through the message sink, the free-text message box, and the
// entry points that do nothing.
#include <cstdint>
#include <iterator>
#include <string>

#include <gtest/gtest.h>

#include <tessarine/core.h>

#include "core/status.h"
#include "test_support.h"

namespace {

using tessarine::kStatusTable;
using tessarine::StatusText;

// The row of a status in the library's table, or null.
const StatusText *RowOf(int32_t status) {
    for (const StatusText &row : kStatusTable)
        if (tessarine::status_table::IsListed(row) && row.status == status) return &row;
    return nullptr;
}

// The text the table gives an id.
std::string TextOf(int32_t id) {
    for (const StatusText &row : kStatusTable)
        if (row.textId == id && row.text != nullptr) return row.text;
    ADD_FAILURE() << "no text " << id;
    return {};
}

// The id shown for a status, or 0 for nothing: a status above 0 is silent,
// a listed one shows its row's text (or nothing), the rest the general text.
int32_t ExpectedId(int32_t status) {
    if (status > 0) return 0;
    if (const StatusText *row = RowOf(status)) return row->textId;
    return 16384;
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
    EXPECT_EQ(m.text, TextOf(id)) << "status " << argument;
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
    EXPECT_EQ(capture.Messages()[0].text, "Error detected; operation aborted.");
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
    EXPECT_EQ(capture.Messages()[0].text, "Not enough memory to bitmap.");
}

TEST(StatusTable, CodesAndTextsAsPublished) {
    // The table's edges and the rows that break the order of the ids.
    EXPECT_EQ(tessarine::kFirstTextId, 16384);
    EXPECT_EQ(tessarine::kLastTextId, 16415);
    EXPECT_EQ(tessarine::kGeneralTextId, 16384);
    EXPECT_EQ(tessarine::kLowestListedStatus, -56);
    EXPECT_EQ(tessarine::kHighestListedStatus, -2);
    EXPECT_EQ(std::size(kStatusTable), 34u);
    ASSERT_NE(RowOf(-2), nullptr);
    EXPECT_EQ(RowOf(-2)->textId, 16385);
    EXPECT_STREQ(RowOf(-5)->text, "Not enough memory.");
    EXPECT_EQ(RowOf(-23)->textId, 16415);
    EXPECT_EQ(RowOf(-24)->textId, 16395);
    EXPECT_STREQ(RowOf(-50)->text, "Failed to access bitmap.");
    EXPECT_STREQ(RowOf(-56)->text, "Stack overflow.");
    EXPECT_EQ(RowOf(-18)->textId, tessarine::kNoText);
    EXPECT_EQ(RowOf(-34)->textId, tessarine::kNoText);
    for (int32_t unlisted : {-1, -3, -4, -6, -14, -29, -40}) EXPECT_EQ(RowOf(unlisted), nullptr);
    EXPECT_EQ(TextOf(16412), "Unexpected NULL pointer.");
    EXPECT_EQ(TextOf(16413), "Degenerated input.");
    EXPECT_EQ(TextOf(16414), "Wrong input.");
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
    for (const StatusText &row : kStatusTable)
        if (tessarine::status_table::IsListed(row)) ExpectShows(capture, row.status, row.textId);
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
