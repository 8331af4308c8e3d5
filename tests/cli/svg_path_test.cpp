// The SVG path-data grammar: every command, relative and absolute forms,
// shorthands, implicit repeats, number forms, and the errors.
#include <cmath>

#include "cli_test_support.h"
#include "svg_path.h"

namespace clitest {
namespace {

using tessarine::cli::ParseNumberList;
using tessarine::cli::ParsePathData;
using tessarine::cli::PathCommand;
using tessarine::cli::PathError;

std::vector<PathCommand> Parse(const std::string &d) {
    std::vector<PathCommand> out;
    PathError error;
    EXPECT_TRUE(ParsePathData(d, out, error)) << d << ": " << error.what << " at " << error.offset;
    return out;
}

PathError Error(const std::string &d) {
    std::vector<PathCommand> out;
    PathError error;
    EXPECT_FALSE(ParsePathData(d, out, error)) << d;
    return error;
}

void ExpectCommand(const PathCommand &c, PathCommand::Kind kind, std::vector<double> values) {
    EXPECT_EQ(c.kind, kind);
    for (size_t i = 0; i < values.size(); ++i) EXPECT_DOUBLE_EQ(c.v[i], values[i]) << "value " << i;
}

TEST(SvgPath, AbsoluteCommands) {
    const auto c = Parse("M10 20 L30 40 H50 V60 C1 2 3 4 5 6 Q7 8 9 10 A5 6 30 1 0 70 80 Z");
    ASSERT_EQ(c.size(), 8u);
    ExpectCommand(c[0], PathCommand::Move, {10, 20});
    ExpectCommand(c[1], PathCommand::Line, {30, 40});
    ExpectCommand(c[2], PathCommand::Line, {50, 40});
    ExpectCommand(c[3], PathCommand::Line, {50, 60});
    ExpectCommand(c[4], PathCommand::Cubic, {1, 2, 3, 4, 5, 6});
    ExpectCommand(c[5], PathCommand::Quad, {7, 8, 9, 10});
    ExpectCommand(c[6], PathCommand::Arc, {5, 6, 30, 1, 0, 70, 80});
    ExpectCommand(c[7], PathCommand::Close, {10, 20});
}

TEST(SvgPath, RelativeCommands) {
    const auto c = Parse("m10 20 l5 5 h10 v-10 c1 1 2 2 3 3 q1 1 2 2 a5 5 0 0 1 10 0 z m1 1 l1 0");
    ASSERT_EQ(c.size(), 10u);
    ExpectCommand(c[1], PathCommand::Line, {15, 25});
    ExpectCommand(c[2], PathCommand::Line, {25, 25});
    ExpectCommand(c[3], PathCommand::Line, {25, 15});
    ExpectCommand(c[4], PathCommand::Cubic, {26, 16, 27, 17, 28, 18});
    ExpectCommand(c[5], PathCommand::Quad, {29, 19, 30, 20});
    ExpectCommand(c[6], PathCommand::Arc, {5, 5, 0, 0, 1, 40, 20});
    ExpectCommand(c[7], PathCommand::Close, {10, 20});
    // After a close, a relative move starts from the subpath's start.
    ExpectCommand(c[8], PathCommand::Move, {11, 21});
    ExpectCommand(c[9], PathCommand::Line, {12, 21});
}

TEST(SvgPath, ShorthandCurvesReflectTheLastControlPoint) {
    auto c = Parse("M0 0 C10 0 20 10 20 20 S30 40 40 40");
    ASSERT_EQ(c.size(), 3u);
    ExpectCommand(c[2], PathCommand::Cubic, {20, 30, 30, 40, 40, 40});
    c = Parse("M0 0 Q10 0 20 20 T40 40 t10 0");
    ExpectCommand(c[2], PathCommand::Quad, {30, 40, 40, 40});
    ExpectCommand(c[3], PathCommand::Quad, {50, 40, 50, 40});
    // Without a curve of their kind before them, the control point is the current point.
    c = Parse("M5 5 S10 10 20 20 T 30 30");
    ExpectCommand(c[1], PathCommand::Cubic, {5, 5, 10, 10, 20, 20});
    ExpectCommand(c[2], PathCommand::Quad, {20, 20, 30, 30});
    c = Parse("M0 0 Q10 0 20 20 S30 30 40 40");
    ExpectCommand(c[2], PathCommand::Cubic, {20, 20, 30, 30, 40, 40});
}

TEST(SvgPath, ImplicitRepeatsAndMoveThenLines) {
    const auto c = Parse("M0 0 10 0 10 10 l 1 1 2 2 H 1 2 3");
    ASSERT_EQ(c.size(), 8u);
    ExpectCommand(c[1], PathCommand::Line, {10, 0});
    ExpectCommand(c[2], PathCommand::Line, {10, 10});
    ExpectCommand(c[4], PathCommand::Line, {13, 13});
    ExpectCommand(c[7], PathCommand::Line, {3, 13});
    const auto m = Parse("m1 1 2 2");
    ExpectCommand(m[1], PathCommand::Line, {3, 3});
}

TEST(SvgPath, NumberForms) {
    const auto c = Parse("M-1.5.5L1e2-3E-1l.5-.5M+3,+4 1e+1,1.e1");
    ASSERT_EQ(c.size(), 5u);
    ExpectCommand(c[0], PathCommand::Move, {-1.5, 0.5});
    ExpectCommand(c[1], PathCommand::Line, {100, -0.3});
    ExpectCommand(c[2], PathCommand::Line, {100.5, -0.8});
    ExpectCommand(c[3], PathCommand::Move, {3, 4});
    ExpectCommand(c[4], PathCommand::Line, {10, 10});
}

TEST(SvgPath, ArcFlagsNeedNoSeparator) {
    const auto c = Parse("M0 0a25 25 -30 0110 10A1,1,0,1,0,5,5");
    ASSERT_EQ(c.size(), 3u);
    ExpectCommand(c[1], PathCommand::Arc, {25, 25, -30, 0, 1, 10, 10});
    ExpectCommand(c[2], PathCommand::Arc, {1, 1, 0, 1, 0, 5, 5});
}

TEST(SvgPath, WhiteSpaceAndCommas) {
    EXPECT_EQ(Parse(" \n\tM 1 , 2\r\nL3,4 ").size(), 2u);
    EXPECT_TRUE(Parse("").empty());
    EXPECT_TRUE(Parse("   ").empty());
}

TEST(SvgPath, Errors) {
    EXPECT_EQ(Error("L10 10").offset, 0u);
    EXPECT_NE(Error("10 10").what.find("moveto"), std::string::npos);
    EXPECT_EQ(Error("M10").offset, 3u);
    EXPECT_EQ(Error("M10 10 X 5").offset, 7u);
    EXPECT_NE(Error("M0 0 A1 1 0 2 0 5 5").what.find("flag"), std::string::npos);
    EXPECT_NE(Error("M0 0 Z 5 5").what.find("command"), std::string::npos);
    EXPECT_NE(Error("M1e999 0").what.find("range"), std::string::npos);
    EXPECT_NE(Error("M0 0 L1e308 0 l1e308 0").what.find("range"), std::string::npos);
    EXPECT_EQ(Error("M0 0 L1,,2").offset, 8u);
    EXPECT_EQ(Error("M0 0 L.").offset, 6u);
    EXPECT_EQ(Error("M0 0 L1 2,").offset, 9u);
}

TEST(SvgPath, KeepsTheCommandsBeforeAnError) {
    std::vector<PathCommand> out;
    PathError error;
    EXPECT_FALSE(ParsePathData("M0 0 L1 1 L2", out, error));
    EXPECT_EQ(out.size(), 2u);
}

TEST(SvgPath, TinyNumbersReadAsZero) {
    const auto c = Parse("M1e-400 0");
    ExpectCommand(c[0], PathCommand::Move, {0, 0});
}

TEST(SvgPath, NumberLists) {
    std::vector<double> v;
    PathError error;
    EXPECT_TRUE(ParseNumberList("1,2 3-4 .5e1", v, error));
    EXPECT_EQ(v, (std::vector<double>{1, 2, 3, -4, 5}));
    v.clear();
    EXPECT_FALSE(ParseNumberList("1 2 x", v, error));
    EXPECT_EQ(error.offset, 4u);
}

}  // namespace
}  // namespace clitest
