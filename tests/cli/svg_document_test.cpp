// The SVG document: shapes, units, view box and transforms, and every bad
// input named with its file.
#include <cmath>

#include "cli_test_support.h"
#include "failure.h"
#include "svg_document.h"

namespace clitest {
namespace {

using tessarine::cli::Drawing;
using tessarine::cli::Failure;
using tessarine::cli::ParseSvg;
using tessarine::cli::Segment;

std::string Page(const std::string &body, const std::string &size = "width='100mm' height='50mm' viewBox='0 0 100 50'") {
    return "<svg xmlns='http://www.w3.org/2000/svg' " + size + ">" + body + "</svg>";
}

std::string FailureOf(const std::string &text) {
    try {
        ParseSvg(text, "art.svg");
    } catch (const Failure &e) {
        return e.what();
    }
    return "(no failure)";
}

TEST(SvgDocument, YUpInMillimetres) {
    const Drawing d = ParseSvg(Page("<line x1='10' y1='5' x2='20' y2='15'/>"), "a.svg");
    ASSERT_EQ(d.outlines.size(), 1u);
    const Segment &s = d.outlines[0].segments[0];
    EXPECT_NEAR(s.p[0].x, 10, 1e-12);
    EXPECT_NEAR(s.p[0].y, 45, 1e-12);
    EXPECT_NEAR(s.p[1].x, 20, 1e-12);
    EXPECT_NEAR(s.p[1].y, 35, 1e-12);
    EXPECT_DOUBLE_EQ(d.heightMm, 50);
}

TEST(SvgDocument, PixelsWithoutAViewBox) {
    const Drawing d = ParseSvg(Page("<line x1='0' y1='0' x2='96' y2='0'/>", "width='96' height='96'"), "a.svg");
    EXPECT_NEAR(d.outlines[0].segments[0].p[1].x, 25.4, 1e-12);
    EXPECT_NEAR(d.outlines[0].segments[0].p[1].y, 25.4, 1e-12);
}

TEST(SvgDocument, NestedGroupTransforms) {
    const Drawing d = ParseSvg(
        Page("<g transform='translate(10 5)'><g transform='rotate(90) scale(2)'><line x1='0' y1='0' x2='1' y2='0'/></g></g>"),
        "a.svg");
    const Segment &s = d.outlines[0].segments[0];
    EXPECT_NEAR(s.p[1].x, 10, 1e-12);
    EXPECT_NEAR(s.p[1].y, 50 - 7, 1e-12);
}

TEST(SvgDocument, Shapes) {
    const Drawing d = ParseSvg(Page("<rect x='1' y='1' width='10' height='5'/><rect x='1' y='1' width='10' height='5' rx='2'/>"
                                    "<circle cx='5' cy='5' r='2'/><ellipse cx='5' cy='5' rx='2' ry='1'/>"
                                    "<polyline points='0 0 1 1 2 0'/><polygon points='0 0 1 1 2 0'/>"
                                    "<path d='M0 0 Q 5 5 10 0 A 5 5 0 0 1 0 0 z M 1 1 L 2 2'/>"
                                    "<defs><circle r='5'/></defs><text>no</text><circle r='3' display='none'/>"),
                               "a.svg");
    ASSERT_EQ(d.outlines.size(), 8u);
    EXPECT_EQ(d.outlines[0].segments.size(), 4u);
    EXPECT_TRUE(d.outlines[0].closed);
    EXPECT_EQ(d.outlines[1].segments.size(), 8u);
    EXPECT_EQ(d.outlines[2].segments[0].kind, Segment::EllipseArc);
    EXPECT_EQ(d.outlines[4].segments.size(), 2u);
    EXPECT_FALSE(d.outlines[4].closed);
    EXPECT_EQ(d.outlines[5].segments.size(), 3u);
    EXPECT_EQ(d.outlines[6].segments[0].kind, Segment::Cubic);
    EXPECT_EQ(d.outlines[6].segments[1].kind, Segment::EllipseArc);
    EXPECT_TRUE(d.outlines[6].closed);
}

TEST(SvgDocument, ZeroRadiusArcIsALineAndAnArcToItselfNothing) {
    const Drawing d = ParseSvg(Page("<path d='M0 0 A0 5 0 0 1 10 0 A5 5 0 0 1 10 0'/>"), "a.svg");
    ASSERT_EQ(d.outlines[0].segments.size(), 1u);
    EXPECT_EQ(d.outlines[0].segments[0].kind, Segment::Line);
}

TEST(SvgDocument, BadInputsNameTheFile) {
    EXPECT_NE(FailureOf("<svg><path d='M0 0'></svg>").find("art.svg: XML error at line 1"), std::string::npos);
    EXPECT_NE(FailureOf("").find("art.svg: XML error"), std::string::npos);
    EXPECT_NE(FailureOf("<html/>").find("not an SVG"), std::string::npos);
    EXPECT_NE(FailureOf(Page("<path d='M0 0 L 5'/>")).find("art.svg: line 1: bad path data at character 9"),
              std::string::npos);
    EXPECT_NE(FailureOf(Page("<path d='M0 0 L 1e999 0'/>")).find("out of range"), std::string::npos);
    EXPECT_NE(FailureOf(Page("<line x1='1e300' x2='0'/>")).find("out of range"), std::string::npos);
    EXPECT_NE(FailureOf(Page("<g transform='scale(1e200)'><line x1='1e200' x2='0'/></g>")).find("out of range"),
              std::string::npos);
    EXPECT_NE(FailureOf(Page("<g transform='skew(3)'/>")).find("bad transform"), std::string::npos);
    EXPECT_NE(FailureOf(Page("<g transform='rotate(3'/>")).find("bad transform"), std::string::npos);
    EXPECT_NE(FailureOf(Page("<rect width='-1' height='3'/>")).find("negative"), std::string::npos);
    EXPECT_NE(FailureOf(Page("<rect width='3'/>")).find("has no height"), std::string::npos);
    EXPECT_NE(FailureOf(Page("<circle r='50%'/>")).find("percentages"), std::string::npos);
    EXPECT_NE(FailureOf(Page("<polygon points='1 2 3'/>")).find("odd count"), std::string::npos);
    EXPECT_NE(FailureOf(Page("<circle r='abc'/>")).find("bad length"), std::string::npos);
    EXPECT_NE(FailureOf(Page("", "viewBox='0 0 -1 5'")).find("bad viewBox"), std::string::npos);
    std::string deep;
    for (int i = 0; i < 300; ++i) deep += "<g>";
    for (int i = 0; i < 300; ++i) deep += "</g>";
    EXPECT_NE(FailureOf(Page(deep)).find("art.svg"), std::string::npos);
}

TEST(SvgDocument, EntitiesAreNotExpandedWithoutBound) {
    std::string bomb = "<?xml version='1.0'?><!DOCTYPE svg [<!ENTITY a 'aaaaaaaaaa'>";
    std::string previous = "a";
    for (int i = 0; i < 9; ++i) {
        const std::string name = "e" + std::to_string(i);
        bomb += "<!ENTITY " + name + " '";
        for (int k = 0; k < 10; ++k) bomb += "&" + previous + ";";
        bomb += "'>";
        previous = name;
    }
    bomb += "]><svg><path d='&" + previous + ";'/></svg>";
    // Either refused or read without the entity: never expanded a billion times.
    const std::string result = FailureOf(bomb);
    EXPECT_TRUE(result == "(no failure)" || result.find("art.svg") == 0) << result;
}

class CutFiles : public CliSandbox {};

TEST_F(CutFiles, BadSvgLeavesNoOutput) {
    const std::string svg = Made("bad.svg");
    WriteFile(svg, Page("<path d='M0 0 C 1 2'/>"));
    RunResult r = Cli({"cut", svg, Path("out.plt")});
    EXPECT_EQ(r.code, 1);
    EXPECT_NE(r.err.find("bad.svg: line 1: bad path data"), std::string::npos) << r.err;
    EXPECT_EQ(std::count(r.err.begin(), r.err.end(), '\n'), 1);
    EXPECT_FALSE(FileExists(Path("out.plt")));
    r = Cli({"cut", Path("missing.svg"), Path("out.plt")});
    EXPECT_EQ(r.code, 1);
    EXPECT_NE(r.err.find("missing.svg"), std::string::npos);
    WriteFile(svg, Page("<circle r='5'/>"));
    r = Cli({"cut", svg, Path("no/folder/out.plt")});
    EXPECT_EQ(r.code, 1);
    EXPECT_NE(r.err.find("out.plt"), std::string::npos);
}

}  // namespace
}  // namespace clitest
