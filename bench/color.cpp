// Device formulas against a LittleCMS transform between sRGB and the system's
// CMYK output profile, over the same 16 million pixels (every sRGB colour).
#include <lcms2.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <vector>

#include <tessarine/color.h>

#include "bench_ratio.h"

namespace {

constexpr size_t kPixels = size_t{1} << 24;
constexpr const char *kCmykProfile = "/usr/share/color/icc/ghostscript/default_cmyk.icc";

struct Pixels {
    std::vector<uint8_t> rgb, cmyk, rgbOut, cmykOut;
    cmsHTRANSFORM toCmyk = nullptr, toRgb = nullptr;

    Pixels() : rgb(kPixels * 3), cmyk(kPixels * 4), rgbOut(kPixels * 3), cmykOut(kPixels * 4) {
        for (size_t i = 0; i < kPixels; ++i) {
            rgb[i * 3] = static_cast<uint8_t>(i >> 16);
            rgb[i * 3 + 1] = static_cast<uint8_t>(i >> 8);
            rgb[i * 3 + 2] = static_cast<uint8_t>(i);
        }
        cmsHPROFILE srgb = cmsCreate_sRGBProfile();
        cmsHPROFILE press = cmsOpenProfileFromFile(kCmykProfile, "r");
        if (srgb == nullptr || press == nullptr) {
            std::fprintf(stderr, "cannot open %s\n", kCmykProfile);
            std::exit(1);
        }
        toCmyk = cmsCreateTransform(srgb, TYPE_RGB_8, press, TYPE_CMYK_8, INTENT_PERCEPTUAL, 0);
        toRgb = cmsCreateTransform(press, TYPE_CMYK_8, srgb, TYPE_RGB_8, INTENT_PERCEPTUAL, 0);
        cmsCloseProfile(srgb);
        cmsCloseProfile(press);
        // The CMYK side of both routes: the press's own separation of every colour.
        cmsDoTransform(toCmyk, rgb.data(), cmyk.data(), static_cast<cmsUInt32Number>(kPixels));
    }
};

Pixels &Data() {
    static Pixels pixels;
    return pixels;
}

void BM_FormulaSRgbToCmyk(benchmark::State &state) {
    Pixels &p = Data();
    for (auto _ : state) {
        const uint8_t *in = p.rgb.data();
        uint8_t *out = p.cmykOut.data();
        for (size_t i = 0; i < kPixels; ++i) {
            uint8_t colour[3] = {in[0], in[1], in[2]};  // the formula keeps only fractions
            CX_SRgb2SWOPCmyk(colour, out);
            in += 3;
            out += 4;
        }
        benchmark::DoNotOptimize(p.cmykOut.data());
    }
    state.SetItemsProcessed(static_cast<int64_t>(state.iterations() * kPixels));
}

void BM_LcmsSRgbToCmyk(benchmark::State &state) {
    Pixels &p = Data();
    for (auto _ : state) {
        cmsDoTransform(p.toCmyk, p.rgb.data(), p.cmykOut.data(),
                       static_cast<cmsUInt32Number>(kPixels));
        benchmark::DoNotOptimize(p.cmykOut.data());
    }
    state.SetItemsProcessed(static_cast<int64_t>(state.iterations() * kPixels));
}

void BM_FormulaCmykToSRgb(benchmark::State &state) {
    Pixels &p = Data();
    for (auto _ : state) {
        const uint8_t *in = p.cmyk.data();
        uint8_t *out = p.rgbOut.data();
        for (size_t i = 0; i < kPixels; ++i) {
            CX_SWOPCmyk2SRgb(in, out);
            in += 4;
            out += 3;
        }
        benchmark::DoNotOptimize(p.rgbOut.data());
    }
    state.SetItemsProcessed(static_cast<int64_t>(state.iterations() * kPixels));
}

void BM_LcmsCmykToSRgb(benchmark::State &state) {
    Pixels &p = Data();
    for (auto _ : state) {
        cmsDoTransform(p.toRgb, p.cmyk.data(), p.rgbOut.data(),
                       static_cast<cmsUInt32Number>(kPixels));
        benchmark::DoNotOptimize(p.rgbOut.data());
    }
    state.SetItemsProcessed(static_cast<int64_t>(state.iterations() * kPixels));
}

BENCHMARK(BM_FormulaSRgbToCmyk)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_LcmsSRgbToCmyk)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FormulaCmykToSRgb)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_LcmsCmykToSRgb)->Unit(benchmark::kMillisecond);

const bool kRatios = [] {
    tsbench::AddRatio("BM_FormulaSRgbToCmyk", "BM_LcmsSRgbToCmyk", 3.0);
    tsbench::AddRatio("BM_FormulaCmykToSRgb", "BM_LcmsCmykToSRgb", 3.0);
    return true;
}();

}  // namespace

TSBENCH_MAIN()
