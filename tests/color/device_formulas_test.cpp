#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include <tessarine/color.h>

#include "color/device_tables.h"
#include "color/gamma_tables.h"
#include "color/swop_cmyk_paths.h"
#include "vector_paths.h"

namespace {
using namespace tessarine::color;

// ---- Independent transcriptions of the models, written out term by term ------

// The grid as published: per plane, rows by r node, groups by g node.
const char *const kGridText[4][5] = {
    {"165 255 255 255 249 / 196 216 255 247 237 / 214 232 232 227 198 / 193 201 201 196 181 / 178 "
     "176 163 140 114",
     "114 198 244 249 242 / 135 163 237 234 227 / 193 209 209 211 191 / 183 191 191 191 168 / 173 "
     "168 155 135 107",
     "81 89 176 209 216 / 79 84 160 193 204 / 102 114 137 165 165 / 147 155 160 158 132 / 153 147 "
     "135 114 86",
     "38 38 68 150 176 / 45 45 51 135 163 / 53 56 61 99 130 / 76 79 79 84 89 / 112 109 99 79 51",
     "0 0 0 86 124 / 0 0 0 73 117 / 0 0 0 33 89 / 0 0 0 0 45 / 0 0 2 5 0"},
    {"135 252 249 242 229 / 84 84 216 214 209 / 71 61 63 109 142 / 0 0 0 0 28 / 0 0 0 0 0",
     "188 249 255 242 227 / 107 130 216 214 206 / 76 63 63 119 142 / 0 0 0 0 35 / 0 0 0 0 0",
     "244 252 249 232 216 / 201 211 227 211 198 / 68 76 102 140 142 / 0 0 0 10 56 / 0 0 0 0 0",
     "244 252 247 219 198 / 229 237 234 204 186 / 158 158 158 158 140 / 38 38 38 56 68 / 0 0 0 0 0",
     "242 242 239 211 183 / 229 227 227 201 173 / 181 176 173 168 135 / 84 84 89 94 73 / 7 2 0 0 "
     "0"},
    {"130 84 0 0 0 / 227 135 20 0 0 / 255 244 137 0 0 / 255 244 188 94 0 / 242 227 176 109 51",
     "163 71 0 0 0 / 216 127 17 0 0 / 255 242 124 0 0 / 255 244 188 91 0 / 242 227 176 107 45",
     "255 124 0 0 0 / 255 168 7 0 0 / 255 221 102 0 0 / 255 244 186 81 0 / 242 227 173 102 38",
     "255 196 0 0 0 / 255 209 5 0 0 / 255 227 102 0 0 / 255 237 168 56 0 / 247 232 176 94 20",
     "255 201 35 0 0 / 255 209 58 0 0 / 252 219 112 0 0 / 252 232 160 43 0 / 249 237 186 107 0"},
    {"255 107 0 0 0 / 173 176 2 0 0 / 28 28 38 0 2 / 0 0 0 0 0 / 0 0 0 0 0",
     "211 122 0 0 0 / 183 165 5 0 0 / 43 43 53 2 2 / 0 0 0 0 0 / 0 0 0 0 0",
     "91 86 2 0 0 / 104 102 7 2 0 / 94 89 61 2 2 / 0 0 0 2 0 / 0 0 0 0 0",
     "7 5 5 2 2 / 10 10 7 5 2 / 22 22 22 2 2 / 10 12 17 5 0 / 0 0 0 0 0",
     "0 0 0 2 2 / 0 0 0 2 2 / 0 0 0 2 2 / 0 0 0 0 0 / 0 0 0 0 0"},
};

const char *const kWeightText =
    "128, 128, 128, 127, 126, 126, 125, 124, 123, 121, 120, 119, 117, 115, 114, 112, 110, 108, "
    "105, 103, 101, 98, 95, 93, 90, 87, 84, 81, 78, 74, 71, 68, 64, 60, 57, 54, 50, 47, 44, 41, "
    "38, 35, 33, 30, 27, 25, 23, 20, 18, 16, 14, 13, 11, 9, 8, 7, 5, 4, 3, 2, 2, 1, 0, 0, 0";

std::vector<int> Numbers(const std::string &text) {
    std::vector<int> values;
    std::string cleaned;
    for (char ch : text) cleaned += (ch == '/' || ch == ',') ? ' ' : ch;
    std::istringstream in(cleaned);
    int v;
    while (in >> v) values.push_back(v);
    return values;
}

int GridText(int plane, int r, int g, int b) {
    static const std::vector<std::vector<int>> rows = [] {
        std::vector<std::vector<int>> parsed;
        for (const auto &plane : kGridText)
            for (const char *row : plane) parsed.push_back(Numbers(row));
        return parsed;
    }();
    return rows[static_cast<size_t>(plane * 5 + r)][static_cast<size_t>(g * 5 + b)];
}

void ReferenceCmyk(int r, int g, int b, int out[4]) {
    const int W[2][3] = {
        {CX_RgbWeight[r & 63], CX_RgbWeight[g & 63], CX_RgbWeight[b & 63]},
        {CX_RgbWeight[64 - (r & 63)], CX_RgbWeight[64 - (g & 63)], CX_RgbWeight[64 - (b & 63)]}};
    for (int plane = 0; plane < 4; ++plane) {
        int32_t sum = 0;
        for (int dr = 0; dr < 2; ++dr)
            for (int dg = 0; dg < 2; ++dg)
                for (int db = 0; db < 2; ++db)
                    sum += GridText(plane, (r >> 6) + dr, (g >> 6) + dg, (b >> 6) + db) * W[dr][0] *
                           W[dg][1] * W[db][2];
        out[plane] = sum >> 21;
    }
}

double G(double t) {
    return t <= 0.2069 ? (t - 0.137931) * 0.1284191601386927 : t * t * t;
}

void ToLinear(double f, double a, double b, double Y, double rgb[3]) {
    double X = 95.04 * G(f + a * 0.002);
    double Z = 108.89 * G(f - b * 0.005);
    if (X < 0) X = 0;
    if (Z < 0) Z = 0;
    rgb[0] = X * 0.03241 - Y * 0.015374 - Z * 0.004986;
    rgb[1] = Y * 0.01876 + Z * 0.000416 - X * 0.009692;
    rgb[2] = X * 0.000556 - Y * 0.00204 + Z * 0.01057;
}

int CmykGamma(double value) {
    const double t = static_cast<int>(value * 255.9) * 0.00392156862745098;
    const double v = t <= 0.05 ? 2.708 * t : std::pow(t, 0.45454545454545453) * 1.1625 - 0.1625;
    return static_cast<uint8_t>(v * 255.1);
}

int LabGamma(double value) {
    const double t = static_cast<int>(value * 255.9) * 0.00390625;
    const double v = t <= 0.00304 ? 12.92 * t : std::pow(t, 0.416667) * 1.055 - 0.055;
    return static_cast<uint8_t>(v * 255.1);
}

const int kPrimaries[3][16] = {
    {100, 62, 48, 18, 94, 55, 47, 17, 45, 25, 18, 3, 42, 21, 17, 3},
    {0, -31, 83, 39, -14, -79, 75, 9, 0, -17, 43, 15, -7, -41, 39, 3},
    {0, -48, -3, -52, 100, 36, 49, -5, 0, -25, -1, -25, 52, 19, 24, -1},
};

// Linear RGB before desaturation, and the Lab it came from.
void ReferenceCmykLinear(const uint8_t cmyk[4], double rgb[3]) {
    const double c = cmyk[0] * 0.00392156862745098, m = cmyk[1] * 0.00392156862745098,
                 y = cmyk[2] * 0.00392156862745098, k = cmyk[3] * 0.00392156862745098;
    double w[8];
    for (int i = 0; i < 8; ++i)
        w[i] = ((i & 1) ? c : 1 - c) * ((i & 2) ? m : 1 - m) * ((i & 4) ? y : 1 - y) * (1 - k);
    double lab[3];
    for (int row = 0; row < 3; ++row) {
        double s0 = 0, s1 = 0;
        for (int i = 0; i < 8; ++i) {
            s0 += kPrimaries[row][i] * w[i];
            s1 += kPrimaries[row][8 + i] * w[i];
        }
        lab[row] = (1 - 2 * k) * s0 + 4 * k * s1;
    }
    const double L = lab[0];
    const double f = L * 0.008621 + 0.137931;
    const double Y = L > 8 ? 100 * (f * f * f) : 100 * L * 0.0011070519207350825;
    ToLinear(f, lab[1], lab[2], Y, rgb);
}

void ReferenceSRgbFromCmyk(const uint8_t cmyk[4], int out[3]) {
    double v[3];
    ReferenceCmykLinear(cmyk, v);
    const double low = std::fmin(v[0], std::fmin(v[1], v[2]));
    if (low < 0) {
        const double t = -low / (1 - low);
        for (double &x : v) x = x * (1 - t) + t;
    }
    for (int i = 0; i < 3; ++i) out[i] = CmykGamma(v[i] <= 0 ? 0 : v[i] > 1 ? 1 : v[i]);
}

void ReferenceSRgbFromLab(int L, int a, int b, bool cubic, int out[3]) {
    const double f = L * 0.003381 + 0.137931;
    const double Y = cubic ? 100 * ((0.003381 * L + 0.137931) * (0.003381 * L + 0.137931) *
                                    (0.003381 * L + 0.137931))
                           : 100 * 0.0004341380081314049 * L;
    double v[3];
    ToLinear(f, a, b, Y, v);
    for (int i = 0; i < 3; ++i) out[i] = LabGamma(v[i] > 1 ? 1 : v[i] < 0 ? 0 : v[i]);
}

void ReferenceSRgbFromLab(int L, int a, int b, int out[3]) {
    ReferenceSRgbFromLab(L, a, b, L > 20, out);
}

std::vector<int> Cmyk(int r, int g, int b) {
    uint8_t rgb[3] = {static_cast<uint8_t>(r), static_cast<uint8_t>(g), static_cast<uint8_t>(b)};
    uint8_t cmyk[4] = {};
    CX_SRgb2SWOPCmyk(rgb, cmyk);
    return {cmyk[0], cmyk[1], cmyk[2], cmyk[3]};
}

std::vector<int> RgbFromCmyk(int c, int m, int y, int k) {
    const uint8_t cmyk[4] = {static_cast<uint8_t>(c), static_cast<uint8_t>(m),
                             static_cast<uint8_t>(y), static_cast<uint8_t>(k)};
    uint8_t rgb[3] = {};
    CX_SWOPCmyk2SRgb(cmyk, rgb);
    return {rgb[0], rgb[1], rgb[2]};
}

std::vector<int> RgbFromLab(int L, int a, int b) {
    const uint8_t lab[3] = {static_cast<uint8_t>(L), static_cast<uint8_t>(static_cast<int8_t>(a)),
                            static_cast<uint8_t>(static_cast<int8_t>(b))};
    uint8_t rgb[3] = {};
    CX_Lab2SRgb(lab, rgb);
    return {rgb[0], rgb[1], rgb[2]};
}

// ---- Tables ------------------------------------------------------------------------

TEST(DeviceTables, GridIsTheOneWrittenDown) {
    for (int plane = 0; plane < 4; ++plane)
        for (int r = 0; r < 5; ++r) {
            ASSERT_EQ(Numbers(kGridText[plane][r]).size(), 25u);
            for (int g = 0; g < 5; ++g)
                for (int b = 0; b < 5; ++b)
                    EXPECT_EQ(CX_RgbGrid[plane][r][g][b], GridText(plane, r, g, b))
                        << plane << " " << r << " " << g << " " << b;
        }
}

TEST(DeviceTables, WeightsAreTheSCurveAndPairTo128) {
    const std::vector<int> w = Numbers(kWeightText);
    ASSERT_EQ(w.size(), 65u);
    for (int i = 0; i <= 64; ++i) {
        EXPECT_EQ(CX_RgbWeight[i], w[static_cast<size_t>(i)]) << i;
        EXPECT_EQ(CX_RgbWeight[i] + CX_RgbWeight[64 - i], 128) << i;
    }
    EXPECT_EQ(CX_RgbWeight[63], 0);
}

TEST(DeviceTables, PrimariesAreTheOnesWrittenDown) {
    for (int row = 0; row < 3; ++row)
        for (int i = 0; i < 16; ++i) EXPECT_EQ(CX_SwopPrimaries[row][i], kPrimaries[row][i]);
}

TEST(DeviceTables, GammaTablesHoldTheirCurves) {
    const GammaTable &cmyk = CX_CmykGammaTable();
    const GammaTable &lab = CX_LabGammaTable();
    for (int i = 0; i < 256; ++i) {
        const double t = i * 0.00392156862745098;
        const double v = t <= 0.05 ? 2.708 * t : std::pow(t, 0.45454545454545453) * 1.1625 - 0.1625;
        EXPECT_EQ(cmyk.entry[i], static_cast<uint8_t>(v * 255.1)) << i;
        const double u = i * 0.00390625;
        const double w = u <= 0.00304 ? 12.92 * u : std::pow(u, 0.416667) * 1.055 - 0.055;
        EXPECT_EQ(lab.entry[i], static_cast<uint8_t>(w * 255.1)) << i;
    }
    EXPECT_EQ(cmyk.entry[255], 255);
    EXPECT_EQ(lab.entry[255], 254) << "the Lab curve stops short of 255";
    EXPECT_EQ(&CX_CmykGammaTable(), &cmyk) << "built once";
}

TEST(DeviceTables, ConcurrentFirstUseGivesTheSameResults) {
    std::vector<std::vector<int>> results(4);
    std::vector<std::thread> threads;
    for (auto &result : results)
        threads.emplace_back([&result] {
            for (int v = 0; v < 256; v += 5) {
                for (int x : RgbFromCmyk(v, 255 - v, v / 2, v / 3)) result.push_back(x);
                for (int x : RgbFromLab(v, v - 128, 127 - v)) result.push_back(x);
            }
        });
    for (auto &t : threads) t.join();
    for (const auto &result : results) EXPECT_EQ(result, results[0]);
}

// ---- sRGB to SWOP CMYK -------------------------------------------------------------

TEST(SRgbToSwopCmyk, BlackIsTheFirstGridCorner) {
    EXPECT_EQ(Cmyk(0, 0, 0), (std::vector<int>{165, 135, 130, 255}));
}

TEST(SRgbToSwopCmyk, WhiteIsTheLastGridCorner) {
    EXPECT_EQ(Cmyk(255, 255, 255), (std::vector<int>{0, 0, 0, 0}));
}

TEST(SRgbToSwopCmyk, EveryGridNodeGivesItsTableEntry) {
    const int node[5] = {0, 64, 128, 192, 255};
    for (int r = 0; r < 5; ++r)
        for (int g = 0; g < 5; ++g)
            for (int b = 0; b < 5; ++b) {
                const std::vector<int> want = {GridText(0, r, g, b), GridText(1, r, g, b),
                                               GridText(2, r, g, b), GridText(3, r, g, b)};
                EXPECT_EQ(Cmyk(node[r], node[g], node[b]), want) << r << g << b;
            }
}

TEST(SRgbToSwopCmyk, InputKeepsOnlyItsFractions) {
    uint8_t rgb[3] = {200, 63, 255};
    uint8_t cmyk[4];
    CX_SRgb2SWOPCmyk(rgb, cmyk);
    EXPECT_EQ(rgb[0], 8);
    EXPECT_EQ(rgb[1], 63);
    EXPECT_EQ(rgb[2], 63);
    for (int v = 0; v < 256; ++v) {
        uint8_t in[3] = {static_cast<uint8_t>(v), static_cast<uint8_t>(255 - v), 64};
        CX_SRgb2SWOPCmyk(in, cmyk);
        EXPECT_EQ(in[0], v & 63);
        EXPECT_EQ(in[1], (255 - v) & 63);
        EXPECT_EQ(in[2], 0);
    }
}

TEST(SRgbToSwopCmyk, EveryColourMatchesTheTrilinearModel) {
    int want[4];
    for (int r = 0; r < 256; r += 3)
        for (int g = 0; g < 256; g += 5)
            for (int b = 0; b < 256; b += 7) {
                ReferenceCmyk(r, g, b, want);
                ASSERT_EQ(Cmyk(r, g, b), (std::vector<int>{want[0], want[1], want[2], want[3]}))
                    << r << " " << g << " " << b;
            }
}

// ---- SWOP CMYK to sRGB -------------------------------------------------------------

TEST(SwopCmykToSRgb, CornersOfTheInkCube) {
    // The sixteen corners against the model; paper white and full black by hand.
    for (int i = 0; i < 16; ++i) {
        const uint8_t cmyk[4] = {
            static_cast<uint8_t>(i & 1 ? 255 : 0), static_cast<uint8_t>(i & 2 ? 255 : 0),
            static_cast<uint8_t>(i & 4 ? 255 : 0), static_cast<uint8_t>(i & 8 ? 255 : 0)};
        int want[3];
        ReferenceSRgbFromCmyk(cmyk, want);
        EXPECT_EQ(RgbFromCmyk(cmyk[0], cmyk[1], cmyk[2], cmyk[3]),
                  (std::vector<int>{want[0], want[1], want[2]}))
            << i;
    }
    EXPECT_EQ(RgbFromCmyk(0, 0, 0, 0), (std::vector<int>{255, 255, 255}));
    EXPECT_EQ(RgbFromCmyk(0, 0, 0, 255), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(RgbFromCmyk(255, 255, 255, 255), (std::vector<int>{0, 0, 0}));
}

TEST(SwopCmykToSRgb, GridOfInksMatchesTheModel) {
    int want[3];
    for (int c = 0; c < 256; c += 17)
        for (int m = 0; m < 256; m += 17)
            for (int y = 0; y < 256; y += 17)
                for (int k = 0; k < 256; k += 51) {
                    const uint8_t cmyk[4] = {static_cast<uint8_t>(c), static_cast<uint8_t>(m),
                                             static_cast<uint8_t>(y), static_cast<uint8_t>(k)};
                    ReferenceSRgbFromCmyk(cmyk, want);
                    ASSERT_EQ(RgbFromCmyk(c, m, y, k),
                              (std::vector<int>{want[0], want[1], want[2]}))
                        << c << " " << m << " " << y << " " << k;
                }
}

TEST(SwopCmykToSRgb, OutOfGamutColourIsDesaturatedNotClipped) {
    // Full cyan lies outside sRGB: red goes negative in linear light.
    const uint8_t cyan[4] = {255, 0, 0, 0};
    double linear[3];
    ReferenceCmykLinear(cyan, linear);
    ASSERT_LT(linear[0], 0);
    const double t = -linear[0] / (1 - linear[0]);
    const std::vector<int> got = RgbFromCmyk(255, 0, 0, 0);
    EXPECT_EQ(got[0], 0);
    // The other two are raised by the same t (and clipped ones would differ).
    EXPECT_EQ(got[1], CmykGamma(std::fmin(1.0, linear[1] * (1 - t) + t)));
    EXPECT_EQ(got[2], CmykGamma(std::fmin(1.0, linear[2] * (1 - t) + t)));
    EXPECT_NE(got[1], CmykGamma(std::fmin(1.0, std::fmax(0.0, linear[1]))));
}

// The vector path regroups the work (tabulated factors, rows side by side,
// zero terms left out) but must give the formula's bytes for every input.
using CmykFunction = void (*)(const uint8_t *, uint8_t *);

// Compares `function` with the formula over every c, m, y in `values` for each
// k in `blacks`; stops at the first difference.
void ExpectFormulaBytes(CmykFunction function, const std::vector<int> &values,
                        const std::vector<int> &blacks) {
    int want[3];
    uint8_t got[3];
    for (int k : blacks)
        for (int c : values)
            for (int m : values)
                for (int y : values) {
                    const uint8_t cmyk[4] = {static_cast<uint8_t>(c), static_cast<uint8_t>(m),
                                             static_cast<uint8_t>(y), static_cast<uint8_t>(k)};
                    ReferenceSRgbFromCmyk(cmyk, want);
                    function(cmyk, got);
                    if (got[0] != want[0] || got[1] != want[1] || got[2] != want[2]) {
                        ADD_FAILURE() << "c " << c << " m " << m << " y " << y << " k " << k
                                      << ": " << int{got[0]} << " " << int{got[1]} << " "
                                      << int{got[2]} << ", formula " << want[0] << " " << want[1]
                                      << " " << want[2];
                        return;
                    }
                }
}

std::vector<int> Range(int first, int last, int step) {
    std::vector<int> values;
    for (int v = first; v <= last; v += step) values.push_back(v);
    return values;
}

TEST(SwopCmykToSRgb, EveryInkAtSeveralBlacksGivesTheFormulaBytes) {
    // All 2^24 inks without black (no half-black terms) and with black.
    ExpectFormulaBytes(CX_SWOPCmyk2SRgb, Range(0, 255, 1), {0, 131});
}

TEST(SwopCmykToSRgb, EveryBlackGivesTheFormulaBytes) {
    // Every k over inks that include 0 and 255 (the shortened sums) and values
    // between them.
    ExpectFormulaBytes(CX_SWOPCmyk2SRgb, Range(0, 255, 15), Range(0, 255, 1));
    ExpectFormulaBytes(CX_SWOPCmyk2SRgb, {0, 1, 2, 3, 126, 127, 128, 129, 252, 253, 254, 255},
                       Range(0, 255, 1));
}

TEST(SwopCmykToSRgb, BothPathsGiveTheFormulaBytes) {
    // The exported function takes one of them; check each on its own.
    ExpectFormulaBytes(SwopCmykToSRgbScalar, Range(0, 255, 15), Range(0, 255, 3));
    if (tessarine::ProcessorVectorPath() < tessarine::VectorPath::kWide)
        GTEST_SKIP() << "no AVX2 on this processor";
    ExpectFormulaBytes([](const uint8_t *cmyk, uint8_t *rgb) {
        SwopCmykToSRgbAvx2(cmyk, rgb, CX_CmykGammaTable());
    }, Range(0, 255, 5), {0, 1, 64, 127, 128, 200, 254, 255});
}

TEST(SwopCmykToSRgb, EveryVectorPathGivesTheFormulaBytes) {
    // The exported function under each cap, the plain one included.
    tstest::ForEachVectorPath([] {
        ExpectFormulaBytes(CX_SWOPCmyk2SRgb, Range(0, 255, 17), {0, 1, 128, 254, 255});
    });
}

// ---- Lab to sRGB -------------------------------------------------------------------

TEST(LabToSRgb, WhiteStopsAt254) {
    EXPECT_EQ(RgbFromLab(255, 0, 0), (std::vector<int>{254, 254, 254}));
}

TEST(LabToSRgb, BlackAndMiddleGray) {
    EXPECT_EQ(RgbFromLab(0, 0, 0), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(RgbFromLab(128, 0, 0), (std::vector<int>{118, 118, 118}));
}

TEST(LabToSRgb, EveryLightnessMatchesTheModel) {
    int want[3];
    for (int L = 0; L < 256; ++L) {
        ReferenceSRgbFromLab(L, 0, 0, want);
        EXPECT_EQ(RgbFromLab(L, 0, 0), (std::vector<int>{want[0], want[1], want[2]})) << L;
        for (int a = -128; a < 128; a += 15)
            for (int b = -128; b < 128; b += 17) {
                ReferenceSRgbFromLab(L, a, b, want);
                ASSERT_EQ(RgbFromLab(L, a, b), (std::vector<int>{want[0], want[1], want[2]}))
                    << L << " " << a << " " << b;
            }
    }
}

TEST(LabToSRgb, Lightness20IsStraightAnd21Cubic) {
    int straight[3], cubic[3];
    int differing20 = 0, differing21 = 0;
    for (int L : {20, 21})
        for (int a = -128; a < 128; ++a)
            for (int b = -128; b < 128; ++b) {
                ReferenceSRgbFromLab(L, a, b, false, straight);
                ReferenceSRgbFromLab(L, a, b, true, cubic);
                const int *want = L == 20 ? straight : cubic;
                ASSERT_EQ(RgbFromLab(L, a, b), (std::vector<int>{want[0], want[1], want[2]}))
                    << L << " " << a << " " << b;
                if (straight[0] != cubic[0] || straight[1] != cubic[1] || straight[2] != cubic[2])
                    ++(L == 20 ? differing20 : differing21);
            }
    // The branches meet almost continuously; still some colours tell them
    // apart, so the comparisons above do see which branch was taken.
    EXPECT_GT(differing20, 0);
    EXPECT_GT(differing21, 0);
    RecordProperty("colours telling the branches apart at 20", differing20);
    RecordProperty("colours telling the branches apart at 21", differing21);
}

TEST(LabToSRgb, OutOfRangeIsClippedWithoutDesaturation) {
    // Strong green: red below 0 and green above 1 are clipped independently.
    const std::vector<int> got = RgbFromLab(200, -128, 127);
    int want[3];
    ReferenceSRgbFromLab(200, -128, 127, want);
    EXPECT_EQ(got, (std::vector<int>{want[0], want[1], want[2]}));
    EXPECT_EQ(got[0], 0);
}

}  // namespace
