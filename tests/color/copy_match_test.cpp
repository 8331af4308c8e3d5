// Copying into RGB true colour through the default profile provider: the
// pixels are those a direct match of the same colours gives.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <vector>

#include <tessarine/profile.hpp>
#include <tessarine/tessarine.h>

#include "test_profiles.h"

namespace {

using Bytes = std::vector<uint8_t>;

class CopyMatch : public cxtest::ProfileSandbox {};

TEST_F(CopyMatch, TrueColourCmykAndGrayThroughTheDefaultProvider) {
    AFilePath cmyk(cxtest::kCmykProfile), rgb(srgb.c_str()), grayPath(gray.c_str());
    const int32_t w = 17, h = 5;
    BI_Bitmap *s = nullptr, *d = nullptr;
    ASSERT_EQ(BI_CreateBlankBmp(4, 32, w, h, 300, 300, 2, 0, nullptr, &s, 2, 0, 0, 0), TS_OK);
    ASSERT_EQ(BI_CreateBlankBmp(4, 24, w, h, 300, 300, 1, 0, nullptr, &d, 1, 0, 0, 0), TS_OK);
    std::vector<Bytes> rows(h, Bytes(4 * w));
    for (int y = 0; y < h; ++y) {
        for (int i = 0; i < 4 * w; ++i) rows[y][i] = static_cast<uint8_t>(i * 37 + y * 11);
        Bytes c(w), m(w), ye(w), k(w);
        for (int x = 0; x < w; ++x) {
            c[x] = rows[y][4 * x];
            m[x] = rows[y][4 * x + 1];
            ye[x] = rows[y][4 * x + 2];
            k[x] = rows[y][4 * x + 3];
        }
        ASSERT_EQ(BI_SetCMYKRow(y, 0, w, c.data(), m.data(), ye.data(), k.data(), s), TS_OK);
    }
    const BI_ColorMatch match{&cmyk, &rgb, nullptr, nullptr, 0, 0};
    const RECT all{0, 0, w, h};
    ASSERT_EQ(BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, &match), TS_OK);
    for (int y = 0; y < h; ++y) {
        Bytes want(3 * w), got(3 * w);
        CX_ColorBuffer in{CX_FORMAT_CMYK, w, rows[y].data()}, out{CX_FORMAT_RGB, w, want.data()};
        ASSERT_GE(R27_XQMatchColors(&cmyk, &rgb, nullptr, nullptr, &in, &out, 0, 0, 0), 0);
        ASSERT_EQ(BI_GetRGBRowInterlace(d, y, 0, w, got.data()), TS_OK);
        EXPECT_EQ(got, want) << "row " << y;
    }
    ASSERT_NE(d->profilePath, nullptr);
    EXPECT_STREQ(static_cast<const char *>(*d->profilePath), srgb.c_str());
    BI_DeleteBitmap(&s);

    // Gray through a gray profile: the RGB getter's first plane goes in.
    ASSERT_EQ(BI_CreateBlankBmp(2, 8, w, h, 300, 300, 1, 0, nullptr, &s, 1, 0, 0, 0), TS_OK);
    Bytes densities(w);
    for (int x = 0; x < w; ++x) densities[x] = static_cast<uint8_t>(x * 15);
    for (int y = 0; y < h; ++y) ASSERT_EQ(BI_SetGRow(y, 0, w, densities.data(), s), TS_OK);
    const BI_ColorMatch grayMatch{&grayPath, &rgb, nullptr, nullptr, 1, 0};
    ASSERT_EQ(BI_CopyBmpToRGBTrueColor(&all, s, &all, d, 0, 0, &grayMatch), TS_OK);
    Bytes levels(w), want(3 * w), got(3 * w);
    for (int x = 0; x < w; ++x) levels[x] = static_cast<uint8_t>(255 - densities[x]);
    CX_ColorBuffer in{CX_FORMAT_GRAY, w, levels.data()}, out{CX_FORMAT_RGB, w, want.data()};
    ASSERT_GE(R27_XQMatchColors(&grayPath, &rgb, nullptr, nullptr, &in, &out, 1, 0, 0), 0);
    ASSERT_EQ(BI_GetRGBRowInterlace(d, h - 1, 0, w, got.data()), TS_OK);
    EXPECT_EQ(got, want);
    BI_DeleteBitmap(&s);
    BI_DeleteBitmap(&d);
}

}  // namespace
