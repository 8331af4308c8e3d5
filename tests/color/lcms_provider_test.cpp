#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <tessarine/profile.hpp>

#include "test_profiles.h"

namespace {
using cxtest::kCmykProfile;
using tessarine::testing::AllocationFailureHit;
using tessarine::testing::FileCall;
using tessarine::testing::FileFailureHit;

class LcmsProvider : public cxtest::ProfileSandbox {};

int BytesOf(int16_t format) {
    return format == CX_FORMAT_RGB ? 3 : format == CX_FORMAT_CMYK ? 4 : 1;
}

struct MatchResult {
    long status;
    std::vector<uint8_t> out;
};

MatchResult Match(const std::string &from, int16_t inFormat, const std::string &to,
                  int16_t outFormat, std::vector<uint8_t> colours, int intent = 0,
                  unsigned long flags = 0, const char *proof = nullptr,
                  const char *abstractPath = nullptr) {
    const int32_t count = static_cast<int32_t>(colours.size()) / BytesOf(inFormat);
    std::vector<uint8_t> out(static_cast<size_t>(count * BytesOf(outFormat)), 0xEE);
    CX_ColorBuffer in{inFormat, count, colours.data()};
    CX_ColorBuffer outBuffer{outFormat, count, out.data()};
    AFilePath a(from.c_str()), b(to.c_str()), c(proof), d(abstractPath);
    const long status = R27_XQMatchColors(&a, &b, proof ? &c : nullptr, abstractPath ? &d : nullptr,
                                          &in, &outBuffer, intent, flags, 0);
    return {status, out};
}

void ExpectNear(const std::vector<uint8_t> &got, const std::vector<int> &want, int tolerance) {
    ASSERT_EQ(got.size(), want.size());
    for (size_t i = 0; i < got.size(); ++i)
        EXPECT_NEAR(got[i], want[i], tolerance) << "channel " << i;
}

std::string Description(const std::string &path, const char *fallback = "fallback") {
    AFilePath profile(path.c_str());
    AString fb(fallback);
    const AString text = getProfileInfo(profile, fb);
    return static_cast<char const *>(text);
}

std::vector<int> Fitness(const std::string &path) {
    AFilePath profile(path.c_str());
    std::vector<int> result;
    for (int kind = 1; kind <= 5; ++kind)
        result.push_back(ValidateProfileType(profile, static_cast<EICCProfileType>(kind)));
    return result;
}

// ---- Description -----------------------------------------------------------------------

TEST_F(LcmsProvider, DescriptionComesFromTheDescriptionTag) {
    EXPECT_EQ(Description(srgb), "Tessarine test sRGB");
    EXPECT_EQ(Description(gray), "Tessarine test gray");
    EXPECT_EQ(Description(lab), "Tessarine test Lab");
    // The system's CMYK profile, as LittleCMS reads its tag.
    cmsHPROFILE cmyk = cmsOpenProfileFromFile(kCmykProfile, "r");
    ASSERT_NE(cmyk, nullptr) << "install libgs-common (make deps)";
    char want[256] = {};
    cmsGetProfileInfoASCII(cmyk, cmsInfoDescription, "en", "US", want, sizeof want);
    cmsCloseProfile(cmyk);
    ASSERT_NE(want[0], '\0');
    EXPECT_EQ(Description(kCmykProfile), want);
}

TEST_F(LcmsProvider, LongDescriptionIsCutTo255) {
    const std::string longText(400, 'd');
    const std::string path = Make("long.icc", cmsCreate_sRGBProfile(), longText.c_str());
    EXPECT_EQ(Description(path), longText.substr(0, 255));
}

TEST_F(LcmsProvider, EmptyDescriptionGivesTheFallback) {
    const std::string path = Make("empty.icc", cmsCreate_sRGBProfile(), "");
    EXPECT_EQ(Description(path), "fallback");
}

TEST_F(LcmsProvider, MissingOrCorruptProfileGivesTheFallback) {
    EXPECT_EQ(Description(missing), "fallback");
    EXPECT_EQ(Description(corrupt), "fallback");
    EXPECT_EQ(Description(truncated), "fallback");
    EXPECT_EQ(Description(Dir()), "fallback") << "a folder";
    EXPECT_EQ(Description(""), "fallback");
}

TEST_F(LcmsProvider, DescriptionSurvivesEveryAllocationFailure) {
    AFilePath profile(srgb.c_str());
    AString fallback("fallback");
    tstest::ForEachAllocationFailure([&](int64_t) {
        const AString text = getProfileInfo(profile, fallback);
        const std::string got = static_cast<char const *>(text);
        if (AllocationFailureHit()) {
            // Either the description could not be read, or its copy not made.
            EXPECT_TRUE(got == "fallback" || got.empty() || got == "Tessarine test sRGB") << got;
        } else {
            EXPECT_EQ(got, "Tessarine test sRGB");
        }
    });
}

TEST_F(LcmsProvider, DescriptionSurvivesEveryFileFailure) {
    for (FileCall kind : {FileCall::Read, FileCall::Seek, FileCall::Write}) {
        tstest::ForEachFileFailure(kind, [&](int64_t) {
            const std::string got = Description(srgb);
            EXPECT_EQ(got, FileFailureHit(kind) ? "fallback" : "Tessarine test sRGB");
        });
    }
}

// ---- Fitness ---------------------------------------------------------------------------

TEST_F(LcmsProvider, FitnessFollowsClassAndColourSpace) {
    EXPECT_EQ(Fitness(srgb), (std::vector<int>{1, 0, 0, 1, 0}));
    EXPECT_EQ(Fitness(gray), (std::vector<int>{0, 0, 1, 0, 0}));
    EXPECT_EQ(Fitness(kCmykProfile), (std::vector<int>{0, 1, 0, 0, 1}));
    EXPECT_EQ(Fitness(lab), (std::vector<int>{0, 0, 0, 0, 0})) << "an abstract Lab profile";
    EXPECT_EQ(Fitness(scannerRgb), (std::vector<int>{1, 0, 0, 0, 0}))
        << "input devices are sources only";
}

TEST_F(LcmsProvider, UnreadableProfileIsFitForNothing) {
    EXPECT_EQ(Fitness(missing), (std::vector<int>(5, 0)));
    EXPECT_EQ(Fitness(corrupt), (std::vector<int>(5, 0)));
    EXPECT_EQ(Fitness(truncated), (std::vector<int>(5, 0)));
    AFilePath profile(srgb.c_str());
    EXPECT_EQ(ValidateProfileType(profile, static_cast<EICCProfileType>(0)), 0);
}

TEST_F(LcmsProvider, FitnessCodesOutsideTheFiveAreZero) {
    const TS_ProfileProvider *p = TS_DefaultProfileProvider();
    void *state = p->GetProfileClass(srgb.c_str(), 0);
    ASSERT_NE(state, nullptr);
    EXPECT_EQ(p->ValidateProfileUsingColorSpace(state, 0x10001), 1);
    EXPECT_EQ(p->ValidateProfileUsingColorSpace(state, 0x30001), 0);
    EXPECT_EQ(p->ValidateProfileUsingColorSpace(state, 0x10003), 0);
    EXPECT_EQ(p->ValidateProfileUsingColorSpace(state, 0), 0);
    p->ReleaseProfileClass(state);
    EXPECT_EQ(p->ValidateProfileUsingColorSpace(nullptr, 0x10001), 0);
    p->ReleaseProfileClass(nullptr);
}

TEST_F(LcmsProvider, FitnessSurvivesEveryAllocationAndFileFailure) {
    AFilePath profile(kCmykProfile);
    const EICCProfileType kind = eICCProfileCMYKOutput;
    tstest::ForEachAllocationFailure([&](int64_t) {
        const int fit = ValidateProfileType(profile, kind);
        if (!AllocationFailureHit()) {
            EXPECT_EQ(fit, 1);
        }
        EXPECT_TRUE(fit == 0 || fit == 1);
    });
    for (FileCall call : {FileCall::Read, FileCall::Seek}) {
        tstest::ForEachFileFailure(call, [&](int64_t) {
            const int fit = ValidateProfileType(profile, kind);
            EXPECT_EQ(fit, FileFailureHit(call) ? 0 : 1);
        });
    }
}

// ---- Matching --------------------------------------------------------------------------

TEST_F(LcmsProvider, SRgbToSRgbIsTheIdentityWithinOne) {
    std::vector<uint8_t> colours;
    for (int r = 0; r < 256; r += 5)
        for (int g = 0; g < 256; g += 5)
            for (int b = 0; b < 256; b += 5)
                colours.insert(colours.end(), {uint8_t(r), uint8_t(g), uint8_t(b)});
    for (int intent = 0; intent <= 3; ++intent) {
        const MatchResult m = Match(srgb, 1, srgb, 1, colours, intent);
        ASSERT_EQ(m.status, XQ_OK);
        int worst = 0;
        for (size_t i = 0; i < colours.size(); ++i)
            worst = std::max(worst, std::abs(m.out[i] - colours[i]));
        EXPECT_LE(worst, 1) << "intent " << intent;
    }
}

TEST_F(LcmsProvider, WhiteAndBlackBetweenRgbAndCmyk) {
    MatchResult m = Match(srgb, 1, kCmykProfile, 2, {255, 255, 255, 0, 0, 0});
    ASSERT_EQ(m.status, XQ_OK);
    ExpectNear({m.out.begin(), m.out.begin() + 4}, {0, 0, 0, 0}, 1);
    EXPECT_GE(m.out[7], 200) << "black is carried by black ink";
    EXPECT_GE(m.out[4] + m.out[5] + m.out[6] + m.out[7], 600) << "rich black";
    // Back: paper is white, full ink is black (with black point compensation).
    m = Match(kCmykProfile, 2, srgb, 1, {0, 0, 0, 0, 255, 255, 255, 255}, 1, 1);
    ASSERT_EQ(m.status, XQ_OK);
    ExpectNear(m.out, {255, 255, 255, 0, 0, 0}, 1);
    // Without it, the darkest ink is only as dark as the paper allows.
    m = Match(kCmykProfile, 2, srgb, 1, {255, 255, 255, 255}, 1, 0);
    EXPECT_GT(m.out[0], 10);
}

TEST_F(LcmsProvider, WhiteAndBlackWithGray) {
    MatchResult m = Match(gray, 11, srgb, 1, {0, 255});
    ASSERT_EQ(m.status, XQ_OK);
    ExpectNear(m.out, {0, 0, 0, 255, 255, 255}, 1);
    m = Match(srgb, 1, gray, 11, {0, 0, 0, 255, 255, 255});
    ASSERT_EQ(m.status, XQ_OK);
    ExpectNear(m.out, {0, 255}, 1);
    m = Match(kCmykProfile, 2, gray, 11, {0, 0, 0, 0, 255, 255, 255, 255}, 0, 1);
    ASSERT_EQ(m.status, XQ_OK);
    ExpectNear(m.out, {255, 0}, 1);
    m = Match(gray, 11, kCmykProfile, 2, {255}, 0);
    ASSERT_EQ(m.status, XQ_OK);
    ExpectNear(m.out, {0, 0, 0, 0}, 1);
}

TEST_F(LcmsProvider, ProofingProfileIsUsedOnlyWithItsFlag) {
    const std::vector<uint8_t> colours = {0, 0, 255, 128, 128, 128};
    MatchResult plain = Match(srgb, 1, srgb, 1, colours, 0, 0, kCmykProfile);
    ASSERT_EQ(plain.status, XQ_OK);
    ExpectNear(plain.out, {0, 0, 255, 128, 128, 128}, 1);
    MatchResult proof = Match(srgb, 1, srgb, 1, colours, 0, 2, kCmykProfile);
    ASSERT_EQ(proof.status, XQ_OK);
    // Printing cannot reach the screen's blue; a middle gray it can.
    EXPECT_GT(std::abs(proof.out[0] - 0) + std::abs(proof.out[2] - 255), 60);
    ExpectNear({proof.out.begin() + 3, proof.out.end()}, {128, 128, 128}, 4);
}

TEST_F(LcmsProvider, GamutWarningPaintsTheAlarmColour) {
    const MatchResult m =
        Match(srgb, 1, srgb, 1, {0, 0, 255, 128, 128, 128}, 0, 2 | 4, kCmykProfile);
    ASSERT_EQ(m.status, XQ_OK);
    ExpectNear({m.out.begin(), m.out.begin() + 3}, {0x7F, 0x7F, 0x7F}, 0);
    // Without proofing the warning has nothing to check against.
    const MatchResult none = Match(srgb, 1, srgb, 1, {0, 0, 255}, 0, 4, kCmykProfile);
    ExpectNear(none.out, {0, 0, 255}, 1);
}

TEST_F(LcmsProvider, AbsoluteProofShowsThePaper) {
    const MatchResult relative = Match(srgb, 1, srgb, 1, {255, 255, 255}, 1, 2, kCmykProfile);
    const MatchResult absolute = Match(srgb, 1, srgb, 1, {255, 255, 255}, 1, 2 | 16, kCmykProfile);
    ASSERT_EQ(relative.status, XQ_OK);
    ASSERT_EQ(absolute.status, XQ_OK);
    ExpectNear(relative.out, {255, 255, 255}, 1);
    EXPECT_NE(absolute.out, relative.out);
}

TEST_F(LcmsProvider, AbstractProfileActsInTheConnectionSpace) {
    const std::vector<uint8_t> colours = {0, 0, 255, 128, 128, 128, 30, 200, 90};
    const MatchResult identity = Match(srgb, 1, srgb, 1, colours, 0, 0, nullptr, lab.c_str());
    ASSERT_EQ(identity.status, XQ_OK);
    ExpectNear(identity.out, {0, 0, 255, 128, 128, 128, 30, 200, 90}, 1);
    const MatchResult bright =
        Match(srgb, 1, srgb, 1, {128, 128, 128}, 0, 0, nullptr, brighter.c_str());
    ASSERT_EQ(bright.status, XQ_OK);
    EXPECT_GT(bright.out[1], 160);
}

TEST_F(LcmsProvider, BlackPreservingIntentsKeepPureBlack) {
    for (int intent : {4, 5}) {
        const MatchResult m = Match(kCmykProfile, 2, kCmykProfile, 2, {0, 0, 0, 128}, intent);
        ASSERT_EQ(m.status, XQ_OK);
        ExpectNear(m.out, {0, 0, 0, 128}, 1);
    }
    const MatchResult perceptual = Match(kCmykProfile, 2, kCmykProfile, 2, {0, 0, 0, 128}, 0);
    EXPECT_GT(perceptual.out[0], 20) << "a plain round trip rebuilds black from colour inks";
}

TEST_F(LcmsProvider, FailuresAreResultsAndLeaveTheOutputAlone) {
    const std::vector<uint8_t> rgb = {1, 2, 3};
    const std::vector<uint8_t> untouched = {0xEE, 0xEE, 0xEE};
    MatchResult m = Match(missing, 1, srgb, 1, rgb);
    EXPECT_EQ(m.status, XQ_ERR_PROFILE);
    EXPECT_EQ(m.out, untouched);
    EXPECT_EQ(Match(srgb, 1, corrupt, 1, rgb).status, XQ_ERR_PROFILE);
    EXPECT_EQ(Match(srgb, 1, truncated, 1, rgb).status, XQ_ERR_PROFILE);
    EXPECT_EQ(Match(srgb, 1, srgb, 1, rgb, 0, 2, missing.c_str()).status, XQ_ERR_PROFILE);
    EXPECT_EQ(Match(srgb, 1, srgb, 1, rgb, 0, 0, nullptr, corrupt.c_str()).status, XQ_ERR_PROFILE);
    // A proofing path without its flag is not even read.
    EXPECT_EQ(Match(srgb, 1, srgb, 1, rgb, 0, 0, missing.c_str()).status, XQ_OK);
    // Profiles that do not fit the formats or each other.
    m = Match(srgb, 2, srgb, 1, {1, 2, 3, 4});
    EXPECT_EQ(m.status, XQ_ERR_TRANSFORM);
    EXPECT_EQ(m.out, untouched);
    EXPECT_EQ(Match(lab, 1, srgb, 1, rgb).status, XQ_ERR_TRANSFORM);
    EXPECT_EQ(Match(srgb, 1, kCmykProfile, 1, rgb).status, XQ_ERR_TRANSFORM);
    EXPECT_EQ(Match(srgb, 1, srgb, 1, rgb, 0, 0, nullptr, kCmykProfile).status, XQ_ERR_TRANSFORM);
    // Intents outside 0 to 5.
    EXPECT_EQ(Match(srgb, 1, srgb, 1, rgb, 6).status, XQ_ERR_ARGUMENT);
    EXPECT_EQ(Match(srgb, 1, srgb, 1, rgb, -1).status, XQ_ERR_ARGUMENT);
}

TEST_F(LcmsProvider, BadDescriptorsAndPathsAreArgumentErrors) {
    uint8_t pixels[12] = {};
    CX_ColorBuffer rgb{CX_FORMAT_RGB, 2, pixels};
    CX_ColorBuffer other{CX_FORMAT_RGB, 2, pixels + 6};
    AFilePath s(srgb.c_str());
    EXPECT_EQ(R27_XQMatchColors(&s, &s, nullptr, nullptr, nullptr, &other, 0, 0, 0),
              XQ_ERR_ARGUMENT);
    EXPECT_EQ(R27_XQMatchColors(&s, &s, nullptr, nullptr, &rgb, nullptr, 0, 0, 0), XQ_ERR_ARGUMENT);
    EXPECT_EQ(R27_XQMatchColors(nullptr, &s, nullptr, nullptr, &rgb, &other, 0, 0, 0),
              XQ_ERR_ARGUMENT);
    EXPECT_EQ(R27_XQMatchColors(&s, nullptr, nullptr, nullptr, &rgb, &other, 0, 0, 0),
              XQ_ERR_ARGUMENT);
    CX_ColorBuffer bad{3, 2, pixels};
    EXPECT_EQ(R27_XQMatchColors(&s, &s, nullptr, nullptr, &bad, &other, 0, 0, 0), XQ_ERR_ARGUMENT);
    CX_ColorBuffer fewer{CX_FORMAT_RGB, 1, pixels + 6};
    EXPECT_EQ(R27_XQMatchColors(&s, &s, nullptr, nullptr, &rgb, &fewer, 0, 0, 0), XQ_ERR_ARGUMENT);
    CX_ColorBuffer negative{CX_FORMAT_RGB, -1, pixels};
    EXPECT_EQ(R27_XQMatchColors(&s, &s, nullptr, nullptr, &negative, &negative, 0, 0, 0),
              XQ_ERR_ARGUMENT);
    CX_ColorBuffer noPixels{CX_FORMAT_RGB, 2, nullptr};
    EXPECT_EQ(R27_XQMatchColors(&s, &s, nullptr, nullptr, &noPixels, &other, 0, 0, 0),
              XQ_ERR_ARGUMENT);
    CX_ColorBuffer none{CX_FORMAT_RGB, 0, nullptr};
    EXPECT_EQ(R27_XQMatchColors(&s, &s, nullptr, nullptr, &none, &none, 0, 0, 0), XQ_OK);
    AFilePath m(missing.c_str());
    EXPECT_EQ(R27_XQMatchColors(&m, &s, nullptr, nullptr, &none, &none, 0, 0, 0), XQ_ERR_PROFILE)
        << "profiles are checked even with no colours";
}

struct Progress {
    std::vector<int> percents;
    bool stopAtFirst = false;
};

bool OnProgress(int percent, void *data) {
    auto *progress = static_cast<Progress *>(data);
    progress->percents.push_back(percent);
    return !progress->stopAtFirst;
}

TEST_F(LcmsProvider, ProgressAfterEachRunAndCancel) {
    std::vector<uint8_t> in(200000 * 3, 100), out(200000 * 3, 0);
    CX_ColorBuffer inBuffer{CX_FORMAT_RGB, 200000, in.data()};
    CX_ColorBuffer outBuffer{CX_FORMAT_RGB, 200000, out.data()};
    const TS_ProfileProvider *p = TS_DefaultProfileProvider();
    Progress progress;
    EXPECT_EQ(p->XQMatchColors(srgb.c_str(), srgb.c_str(), nullptr, nullptr, &inBuffer, &outBuffer,
                               0, 0, 0, OnProgress, &progress),
              XQ_OK);
    EXPECT_EQ(progress.percents, (std::vector<int>{32, 65, 98, 100}));
    Progress stop;
    stop.stopAtFirst = true;
    EXPECT_EQ(p->XQMatchColors(srgb.c_str(), srgb.c_str(), nullptr, nullptr, &inBuffer, &outBuffer,
                               0, 0, 0, OnProgress, &stop),
              XQ_ERR_CANCELLED);
    EXPECT_EQ(stop.percents.size(), 1u);
}

TEST_F(LcmsProvider, MatchingSurvivesEveryAllocationFailure) {
    std::vector<uint8_t> colours = {255, 255, 255, 0, 0, 0, 200, 30, 60};
    const MatchResult reference = Match(srgb, 1, gray, 11, colours);
    ASSERT_EQ(reference.status, XQ_OK);
    AFilePath from(srgb.c_str()), to(gray.c_str());
    CX_ColorBuffer in{CX_FORMAT_RGB, 3, colours.data()};
    const int64_t allocations = tstest::ForEachAllocationFailure([&](int64_t) {
        std::vector<uint8_t> out(3, 0xEE);
        CX_ColorBuffer outBuffer{CX_FORMAT_GRAY, 3, out.data()};
        const long status =
            R27_XQMatchColors(&from, &to, nullptr, nullptr, &in, &outBuffer, 0, 0, 0);
        if (status == XQ_OK) {
            EXPECT_EQ(out, reference.out);
        } else {
            EXPECT_TRUE(AllocationFailureHit());
            EXPECT_EQ(status, XQ_ERR_MEMORY);
            EXPECT_EQ(out, std::vector<uint8_t>(3, 0xEE)) << "output untouched";
        }
    });
    RecordProperty("allocations", static_cast<int>(allocations));
}

TEST_F(LcmsProvider, MatchingSurvivesEveryFileFailure) {
    const std::vector<uint8_t> colours = {255, 255, 255, 0, 0, 0};
    for (FileCall kind : {FileCall::Read, FileCall::Seek, FileCall::Write}) {
        tstest::ForEachFileFailure(kind, [&](int64_t) {
            const MatchResult m = Match(srgb, 1, kCmykProfile, 2, colours);
            if (FileFailureHit(kind)) {
                EXPECT_EQ(m.status, XQ_ERR_PROFILE);
                EXPECT_EQ(m.out, std::vector<uint8_t>(8, 0xEE));
            } else {
                EXPECT_EQ(m.status, XQ_OK);
            }
        });
    }
}

// ---- Gamut projection ---------------------------------------------------------------------

TEST_F(LcmsProvider, ProjectionBringsColoursIntoTheDeviceGamut) {
    std::vector<uint8_t> in = {0, 0, 255, 128, 128, 128, 255, 255, 255};
    std::vector<uint8_t> out(9, 0xEE), marks(3, 0xEE);
    CX_ColorBuffer inBuffer{CX_FORMAT_RGB, 3, in.data()};
    CX_ColorBuffer outBuffer{CX_FORMAT_RGB, 3, out.data()};
    CX_ColorBuffer markBuffer{CX_FORMAT_GRAY, 3, marks.data()};
    AFilePath s(srgb.c_str()), device(kCmykProfile);
    ASSERT_EQ(
        R27_XQProjectOntoGamut(&s, &device, nullptr, &inBuffer, &outBuffer, &markBuffer, 1, 0),
        XQ_OK);
    EXPECT_GT(std::abs(out[0] - 0) + std::abs(out[2] - 255), 60) << "blue moved inside";
    ExpectNear({out.begin() + 3, out.end()}, {128, 128, 128, 255, 255, 255}, 4);
    EXPECT_EQ(marks, (std::vector<uint8_t>{1, 0, 0}));
    // A tolerance larger than any difference marks nothing.
    ASSERT_EQ(
        R27_XQProjectOntoGamut(&s, &device, &s, &inBuffer, &outBuffer, &markBuffer, 1, 1000000),
        XQ_OK);
    EXPECT_EQ(marks, (std::vector<uint8_t>{0, 0, 0}));
    // In place, and into another space.
    std::vector<uint8_t> shared = in;
    CX_ColorBuffer sharedBuffer{CX_FORMAT_RGB, 3, shared.data()};
    ASSERT_EQ(R27_XQProjectOntoGamut(&s, &device, nullptr, &sharedBuffer, &sharedBuffer,
                                     &markBuffer, 1, 0),
              XQ_OK);
    EXPECT_EQ(marks, (std::vector<uint8_t>{1, 0, 0}));
    EXPECT_EQ(shared, out);
    std::vector<uint8_t> grayOut(3);
    CX_ColorBuffer grayBuffer{CX_FORMAT_GRAY, 3, grayOut.data()};
    AFilePath g(gray.c_str());
    ASSERT_EQ(R27_XQProjectOntoGamut(&s, &device, &g, &inBuffer, &grayBuffer, nullptr, 0, 0),
              XQ_OK);
    EXPECT_NEAR(grayOut[2], 255, 1);
}

TEST_F(LcmsProvider, ProjectionFailures) {
    uint8_t pixels[3] = {1, 2, 3}, out[3] = {0xEE, 0xEE, 0xEE}, mark[2] = {0xEE, 0xEE};
    CX_ColorBuffer in{CX_FORMAT_RGB, 1, pixels};
    CX_ColorBuffer outBuffer{CX_FORMAT_RGB, 1, out};
    CX_ColorBuffer wrongMark{CX_FORMAT_RGB, 1, mark};
    CX_ColorBuffer longMark{CX_FORMAT_GRAY, 2, mark};
    AFilePath s(srgb.c_str()), device(kCmykProfile), m(missing.c_str()), c(corrupt.c_str());
    EXPECT_EQ(R27_XQProjectOntoGamut(&s, &device, nullptr, &in, &outBuffer, &wrongMark, 0, 0),
              XQ_ERR_ARGUMENT);
    EXPECT_EQ(R27_XQProjectOntoGamut(&s, &device, nullptr, &in, &outBuffer, &longMark, 0, 0),
              XQ_ERR_ARGUMENT);
    EXPECT_EQ(R27_XQProjectOntoGamut(&s, nullptr, nullptr, &in, &outBuffer, nullptr, 0, 0),
              XQ_ERR_ARGUMENT);
    EXPECT_EQ(R27_XQProjectOntoGamut(nullptr, &device, nullptr, &in, &outBuffer, nullptr, 0, 0),
              XQ_ERR_ARGUMENT);
    EXPECT_EQ(R27_XQProjectOntoGamut(&s, &device, nullptr, &in, &outBuffer, nullptr, 9, 0),
              XQ_ERR_ARGUMENT);
    EXPECT_EQ(R27_XQProjectOntoGamut(&s, &m, nullptr, &in, &outBuffer, nullptr, 0, 0),
              XQ_ERR_PROFILE);
    EXPECT_EQ(R27_XQProjectOntoGamut(&c, &device, nullptr, &in, &outBuffer, nullptr, 0, 0),
              XQ_ERR_PROFILE);
    EXPECT_EQ(R27_XQProjectOntoGamut(&s, &device, &device, &in, &outBuffer, nullptr, 0, 0),
              XQ_ERR_TRANSFORM);
    EXPECT_EQ(out[0], 0xEE);
    EXPECT_EQ(mark[0], 0xEE);
}

TEST_F(LcmsProvider, ProjectionSurvivesEveryAllocationFailure) {
    std::vector<uint8_t> in = {0, 0, 255, 128, 128, 128};
    AFilePath s(srgb.c_str()), device(gray.c_str());
    std::vector<uint8_t> reference(6), referenceMarks(2);
    CX_ColorBuffer inBuffer{CX_FORMAT_RGB, 2, in.data()};
    CX_ColorBuffer refBuffer{CX_FORMAT_RGB, 2, reference.data()};
    CX_ColorBuffer refMarks{CX_FORMAT_GRAY, 2, referenceMarks.data()};
    ASSERT_EQ(R27_XQProjectOntoGamut(&s, &device, nullptr, &inBuffer, &refBuffer, &refMarks, 0, 0),
              XQ_OK);
    EXPECT_EQ(referenceMarks, (std::vector<uint8_t>{1, 0})) << "gray has no blue";
    tstest::ForEachAllocationFailure([&](int64_t) {
        std::vector<uint8_t> out(6, 0xEE), marks(2, 0xEE);
        CX_ColorBuffer outBuffer{CX_FORMAT_RGB, 2, out.data()};
        CX_ColorBuffer markBuffer{CX_FORMAT_GRAY, 2, marks.data()};
        const long status =
            R27_XQProjectOntoGamut(&s, &device, nullptr, &inBuffer, &outBuffer, &markBuffer, 0, 0);
        if (status == XQ_OK) {
            EXPECT_EQ(out, reference);
            EXPECT_EQ(marks, referenceMarks);
        } else {
            EXPECT_EQ(status, XQ_ERR_MEMORY);
            EXPECT_EQ(out, std::vector<uint8_t>(6, 0xEE));
            EXPECT_EQ(marks, std::vector<uint8_t>(2, 0xEE));
        }
    });
}

}  // namespace
