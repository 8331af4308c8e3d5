// Colour: the device formulas and the profile services on the system's profiles.
#include <cstdio>

#include <tessarine/tessarine.h>
#include <tessarine/profile.hpp>

#include "demo.h"

namespace {

constexpr const char *kFolder = "/usr/share/color/icc/ghostscript";

void PrintBytes(const char *label, const uint8_t *bytes, int count) {
    std::printf("%s", label);
    for (int i = 0; i < count; ++i) std::printf(" %3d", bytes[i]);
}

}  // namespace

void DemoColor() {
    std::puts("Colour formulas:");
    const uint8_t colours[][3] = {{0, 0, 0}, {255, 255, 255}, {200, 30, 60}, {0, 128, 255}};
    for (const auto &colour : colours) {
        uint8_t rgb[3] = {colour[0], colour[1], colour[2]};
        uint8_t cmyk[4];
        uint8_t back[3];
        CX_SRgb2SWOPCmyk(rgb, cmyk);
        CX_SWOPCmyk2SRgb(cmyk, back);
        PrintBytes("  sRGB", colour, 3);
        PrintBytes(" -> SWOP CMYK", cmyk, 4);
        PrintBytes(" -> sRGB", back, 3);
        PrintBytes("  (input left as", rgb, 3);
        std::puts(")");
    }
    const uint8_t labs[][3] = {{0, 0, 0}, {128, 0, 0}, {255, 0, 0}, {150, 60, 0xC4}};
    for (const auto &lab : labs) {
        uint8_t rgb[3];
        CX_Lab2SRgb(lab, rgb);
        std::printf("  Lab %3d %4d %4d -> sRGB", lab[0], static_cast<int8_t>(lab[1]),
                    static_cast<int8_t>(lab[2]));
        PrintBytes("", rgb, 3);
        std::puts("");
    }

    std::puts("Profile services:");
    std::printf("  getICCProfileFlags(1,1,1,0,1) = %lu, RenderingIntentR27ToColorDev(6) = %d\n",
                getICCProfileFlags(1, 1, 1, 0, 1), RenderingIntentR27ToColorDev(6));
    AFilePath folder(kFolder);
    AString fallback("(no description)");
    const char *names[] = {"default_rgb.icc", "default_gray.icc", "default_cmyk.icc",
                           "missing.icc"};
    for (const char *name : names) {
        AFilePath profile(folder);
        profile += AString(name);
        const AString description = getProfileInfo(profile, fallback);
        std::printf("  %-17s exists %d, \"%s\", fit for kinds 1-5:", name,
                    ProfileExists(folder, AString(name)), static_cast<char const *>(description));
        for (int kind = 1; kind <= 5; ++kind)
            std::printf(" %d", ValidateProfileType(profile, static_cast<EICCProfileType>(kind)));
        std::puts("");
    }

    AFilePath rgbProfile(folder), cmykProfile(folder);
    rgbProfile += AString("default_rgb.icc");
    cmykProfile += AString("default_cmyk.icc");
    uint8_t rgb[] = {255, 255, 255, 0, 0, 0, 255, 0, 0, 0, 0, 255};
    uint8_t cmyk[16];
    uint8_t back[12];
    CX_ColorBuffer rgbBuffer = {CX_FORMAT_RGB, 4, rgb};
    CX_ColorBuffer cmykBuffer = {CX_FORMAT_CMYK, 4, cmyk};
    CX_ColorBuffer backBuffer = {CX_FORMAT_RGB, 4, back};
    long result = R27_XQMatchColors(&rgbProfile, &cmykProfile, nullptr, nullptr, &rgbBuffer,
                                    &cmykBuffer, 0, getICCProfileFlags(1, 0, 0, 0, 0), 0);
    std::printf("  match RGB -> CMYK (result %ld):\n", result);
    result = R27_XQMatchColors(&cmykProfile, &rgbProfile, nullptr, nullptr, &cmykBuffer,
                               &backBuffer, 1, getICCProfileFlags(1, 0, 0, 0, 0), 0);
    for (int i = 0; i < 4; ++i) {
        PrintBytes("   ", rgb + i * 3, 3);
        PrintBytes(" ->", cmyk + i * 4, 4);
        PrintBytes(" -> back", back + i * 3, 3);
        std::puts("");
    }
    std::printf("  (back: result %ld)\n", result);
    uint8_t projected[12];
    uint8_t outside[4];
    CX_ColorBuffer projectedBuffer = {CX_FORMAT_RGB, 4, projected};
    CX_ColorBuffer outsideBuffer = {CX_FORMAT_GRAY, 4, outside};
    result = R27_XQProjectOntoGamut(&rgbProfile, &cmykProfile, nullptr, &rgbBuffer,
                                    &projectedBuffer, &outsideBuffer, 1, 0);
    std::printf("  onto the CMYK gamut (result %ld):\n", result);
    for (int i = 0; i < 4; ++i) {
        PrintBytes("   ", rgb + i * 3, 3);
        PrintBytes(" ->", projected + i * 3, 3);
        std::printf("%s\n", outside[i] ? "  (was outside)" : "");
    }
    AFilePath missing("/nonexistent/profile.icc");
    result = R27_XQMatchColors(&missing, &rgbProfile, nullptr, nullptr, &rgbBuffer, &backBuffer, 0,
                               0, 0);
    std::printf("  a missing profile gives result %ld\n", result);
}
