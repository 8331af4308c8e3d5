// Profiles for the profile service tests: made by LittleCMS and saved into
// the test's sandbox, plus the CMYK output profile the system provides.
#pragma once

#include <lcms2.h>

#include <cstdio>
#include <string>
#include <vector>

#include "test_support.h"

namespace cxtest {

inline constexpr const char *kCmykProfile = "/usr/share/color/icc/ghostscript/default_cmyk.icc";

inline void Describe(cmsHPROFILE profile, const char *text) {
    cmsMLU *mlu = cmsMLUalloc(nullptr, 1);
    cmsMLUsetASCII(mlu, "en", "US", text);
    cmsWriteTag(profile, cmsSigProfileDescriptionTag, mlu);
    cmsMLUfree(mlu);
}

inline bool Save(cmsHPROFILE profile, const std::string &path, const char *description) {
    if (profile == nullptr) return false;
    if (description != nullptr) Describe(profile, description);
    const bool saved = cmsSaveProfileToFile(profile, path.c_str());
    cmsCloseProfile(profile);
    return saved;
}

inline cmsHPROFILE MakeGray() {
    cmsToneCurve *curve = cmsBuildGamma(nullptr, 2.2);
    cmsHPROFILE profile = cmsCreateGrayProfile(cmsD50_xyY(), curve);
    cmsFreeToneCurve(curve);
    return profile;
}

// A sandbox holding the test profiles, removed again before the sandbox
// checks that nothing is left.
class ProfileSandbox : public tstest::Sandbox {
  protected:
    void SetUp() override {
        tstest::Sandbox::SetUp();
        srgb = Make("srgb.icc", cmsCreate_sRGBProfile(), "Tessarine test sRGB");
        gray = Make("gray.icc", MakeGray(), "Tessarine test gray");
        lab = Make("lab.icc", cmsCreateLab4Profile(nullptr), "Tessarine test Lab");
        cmsHPROFILE scanner = cmsCreate_sRGBProfile();
        cmsSetDeviceClass(scanner, cmsSigInputClass);
        scannerRgb = Make("scanner.icc", scanner, "Tessarine test scanner");
        brighter =
            Make("brighter.icc", cmsCreateBCHSWabstractProfile(17, 30, 1, 0, 0, 0, 0), "Brighter");
        corrupt = Path("corrupt.icc");
        WriteBytes(corrupt, std::string(300, '\x5A'));
        truncated = Path("truncated.icc");
        WriteBytes(truncated, ReadBytes(srgb).substr(0, 200));
        missing = Path("missing.icc");
    }
    void TearDown() override {
        for (const auto &path : made_) std::remove(path.c_str());
        tstest::Sandbox::TearDown();
    }
    std::string Make(const char *name, cmsHPROFILE profile, const char *description) {
        const std::string path = Path(name);
        EXPECT_TRUE(Save(profile, path, description)) << name;
        made_.push_back(path);
        return path;
    }
    void WriteBytes(const std::string &path, const std::string &bytes) {
        FILE *file = std::fopen(path.c_str(), "wb");
        std::fwrite(bytes.data(), 1, bytes.size(), file);
        std::fclose(file);
        made_.push_back(path);
    }
    static std::string ReadBytes(const std::string &path) {
        std::string bytes;
        FILE *file = std::fopen(path.c_str(), "rb");
        if (file == nullptr) return bytes;
        char chunk[4096];
        size_t n;
        while ((n = std::fread(chunk, 1, sizeof chunk, file)) > 0) bytes.append(chunk, n);
        std::fclose(file);
        return bytes;
    }

    std::string srgb, gray, lab, scannerRgb, brighter, corrupt, truncated, missing;

  private:
    std::vector<std::string> made_;
};

}  // namespace cxtest
