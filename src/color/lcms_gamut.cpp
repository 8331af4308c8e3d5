#include "color/lcms_provider.h"
#include "color/lcms_session.h"
#include "platform/heap.h"

namespace tessarine::color {
namespace {

// Runs are shorter when colours are marked: two Lab buffers of doubles.
constexpr int32_t kMarkRun = 4096;

class LabBuffer {
  public:
    LabBuffer() = default;
    ~LabBuffer() {
        if (lab_ != nullptr) platform::GlobalFree(lab_);
    }
    LabBuffer(LabBuffer const &) = delete;
    LabBuffer &operator=(LabBuffer const &) = delete;
    bool Allocate() {
        lab_ = static_cast<cmsCIELab *>(
            platform::GlobalAlloc(platform::GMEM_FIXED, sizeof(cmsCIELab) * kMarkRun));
        return lab_ != nullptr;
    }
    cmsCIELab *Get() const { return lab_; }

  private:
    cmsCIELab *lab_ = nullptr;
};

// What marking needs beside the projection: both ends seen in Lab.
struct Marker {
    ProfileHandle lab;
    TransformHandle before;
    TransformHandle after;
    LabBuffer beforeLab;
    LabBuffer afterLab;
    double limit = 2.0;

    long Prepare(LcmsSession &session, cmsHPROFILE source, cmsUInt32Number sourceFormat,
                 cmsHPROFILE result, cmsUInt32Number resultFormat) {
        lab.Reset(cmsCreateLab4ProfileTHR(session.Context(), nullptr));
        if (!lab || !beforeLab.Allocate() || !afterLab.Allocate()) return XQ_ERR_MEMORY;
        before.Reset(cmsCreateTransformTHR(session.Context(), source, sourceFormat, lab.Get(),
                                           TYPE_Lab_DBL, INTENT_RELATIVE_COLORIMETRIC, 0));
        after.Reset(cmsCreateTransformTHR(session.Context(), result, resultFormat, lab.Get(),
                                          TYPE_Lab_DBL, INTENT_RELATIVE_COLORIMETRIC, 0));
        if (!before || !after) return session.Failure(XQ_ERR_TRANSFORM);
        return XQ_OK;
    }
};

}  // namespace

long LcmsProjectOntoGamut(char const *source, char const *device, char const *destination,
                          void *input, void *output, void *outside, int intent, long tolerance,
                          XQProgressFn progress, void *progressData) {
    const auto *in = static_cast<const CX_ColorBuffer *>(input);
    const auto *out = static_cast<const CX_ColorBuffer *>(output);
    const auto *marks = static_cast<const CX_ColorBuffer *>(outside);
    PixelLayout inLayout;
    PixelLayout outLayout;
    PixelLayout markLayout;
    const int lcmsIntent = LcmsIntent(intent);
    if (!UsableBuffer(in, &inLayout) || !UsableBuffer(out, &outLayout) || in->count != out->count ||
        lcmsIntent < 0 || source == nullptr || device == nullptr)
        return XQ_ERR_ARGUMENT;
    if (marks != nullptr && (!UsableBuffer(marks, &markLayout) || marks->format != CX_FORMAT_GRAY ||
                             marks->count != in->count))
        return XQ_ERR_ARGUMENT;

    LcmsSession session;
    if (!session.Valid()) return XQ_ERR_MEMORY;
    ProfileHandle sourceProfile(session.OpenProfile(source));
    ProfileHandle deviceProfile(session.OpenProfile(device));
    ProfileHandle destinationProfile(
        session.OpenProfile(destination != nullptr ? destination : source));
    if (!sourceProfile || !deviceProfile || !destinationProfile)
        return session.Failure(XQ_ERR_PROFILE);

    // Into the device with the intent, and out of it as it reproduces the
    // colours.
    cmsHPROFILE chain[4] = {sourceProfile.Get(), deviceProfile.Get(), deviceProfile.Get(),
                            destinationProfile.Get()};
    cmsBool bpc[4] = {FALSE, FALSE, FALSE, FALSE};
    cmsUInt32Number intents[4] = {static_cast<cmsUInt32Number>(lcmsIntent),
                                  static_cast<cmsUInt32Number>(lcmsIntent),
                                  INTENT_RELATIVE_COLORIMETRIC, INTENT_RELATIVE_COLORIMETRIC};
    cmsFloat64Number adaptation[4] = {1.0, 1.0, 1.0, 1.0};
    TransformHandle transform(
        cmsCreateExtendedTransform(session.Context(), 4, chain, bpc, intents, adaptation, nullptr,
                                   0, inLayout.lcmsFormat, outLayout.lcmsFormat, 0));
    if (!transform) return session.Failure(XQ_ERR_TRANSFORM);

    Marker marker;
    if (marks != nullptr) {
        const long prepared = marker.Prepare(session, sourceProfile.Get(), inLayout.lcmsFormat,
                                             destinationProfile.Get(), outLayout.lcmsFormat);
        if (prepared != XQ_OK) return prepared;
        if (tolerance > 0) marker.limit = tolerance / 100.0;
    }

    const auto *from = static_cast<const unsigned char *>(in->pixels);
    auto *to = static_cast<unsigned char *>(out->pixels);
    const int32_t runLength = marks != nullptr ? kMarkRun : kColoursPerRun;
    for (int32_t done = 0; done < in->count;) {
        const int32_t run = in->count - done < runLength ? in->count - done : runLength;
        const unsigned char *runIn = from + static_cast<size_t>(done) * inLayout.bytesPerColour;
        unsigned char *runOut = to + static_cast<size_t>(done) * outLayout.bytesPerColour;
        // The input is seen before the output is written: they may share memory.
        if (marks != nullptr)
            cmsDoTransform(marker.before.Get(), runIn, marker.beforeLab.Get(),
                           static_cast<cmsUInt32Number>(run));
        cmsDoTransform(transform.Get(), runIn, runOut, static_cast<cmsUInt32Number>(run));
        if (marks != nullptr) {
            cmsDoTransform(marker.after.Get(), runOut, marker.afterLab.Get(),
                           static_cast<cmsUInt32Number>(run));
            auto *mark = static_cast<unsigned char *>(marks->pixels) + done;
            for (int32_t i = 0; i < run; ++i)
                mark[i] =
                    cmsDeltaE(&marker.beforeLab.Get()[i], &marker.afterLab.Get()[i]) > marker.limit
                        ? 1
                        : 0;
        }
        done += run;
        if (ProgressSaysStop(progress, progressData, done, in->count)) return XQ_ERR_CANCELLED;
    }
    return XQ_OK;
}

}  // namespace tessarine::color
