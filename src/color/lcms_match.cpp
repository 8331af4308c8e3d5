#include "color/lcms_provider.h"
#include "color/lcms_session.h"

namespace tessarine::color {
namespace {

constexpr unsigned long kBlackPointCompensation = 1;
constexpr unsigned long kProof = 2;
constexpr unsigned long kGamutWarning = 4;
constexpr unsigned long kProofAbsolute = 16;

// Every channel of a colour the proofing device cannot reproduce.
void SetAlarmColour(cmsContext context) {
    cmsUInt16Number codes[cmsMAXCHANNELS];
    for (cmsUInt16Number &code : codes) code = 0x7F7F;
    cmsSetAlarmCodesTHR(context, codes);
}

}  // namespace

long LcmsMatchColors(char const *source, char const *destination, char const *proofing,
                     char const *abstractProfile, void *input, void *output, int intent,
                     unsigned long flags, long, XQProgressFn progress, void *progressData) {
    const auto *in = static_cast<const CX_ColorBuffer *>(input);
    const auto *out = static_cast<const CX_ColorBuffer *>(output);
    PixelLayout inLayout;
    PixelLayout outLayout;
    const int lcmsIntent = LcmsIntent(intent);
    if (!UsableBuffer(in, &inLayout) || !UsableBuffer(out, &outLayout) || in->count != out->count ||
        lcmsIntent < 0 || source == nullptr || destination == nullptr)
        return XQ_ERR_ARGUMENT;
    const bool proof = (flags & kProof) != 0 && proofing != nullptr;

    LcmsSession session;
    if (!session.Valid()) return XQ_ERR_MEMORY;
    ProfileHandle sourceProfile(session.OpenProfile(source));
    ProfileHandle destinationProfile(session.OpenProfile(destination));
    ProfileHandle abstractHandle;
    ProfileHandle proofHandle;
    if (abstractProfile != nullptr) abstractHandle.Reset(session.OpenProfile(abstractProfile));
    if (proof) proofHandle.Reset(session.OpenProfile(proofing));
    if (!sourceProfile || !destinationProfile || (abstractProfile != nullptr && !abstractHandle) ||
        (proof && !proofHandle))
        return session.Failure(XQ_ERR_PROFILE);

    // The chain: source, [abstract], [proofing as output, proofing as input],
    // destination. The proof step is colorimetric, as a proof must be.
    cmsHPROFILE chain[5];
    cmsBool bpc[5];
    cmsUInt32Number intents[5];
    cmsFloat64Number adaptation[5];
    cmsUInt32Number n = 0;
    const cmsBool compensate = (flags & kBlackPointCompensation) != 0;
    auto add = [&](cmsHPROFILE profile, cmsUInt32Number linkIntent, cmsBool linkBpc) {
        chain[n] = profile;
        intents[n] = linkIntent;
        bpc[n] = linkBpc;
        adaptation[n] = 1.0;
        ++n;
    };
    add(sourceProfile.Get(), lcmsIntent, compensate);
    if (abstractHandle) add(abstractHandle.Get(), lcmsIntent, compensate);
    cmsUInt32Number gamutPosition = 0;
    cmsUInt32Number transformFlags = 0;
    if (proof) {
        gamutPosition = n;
        add(proofHandle.Get(), lcmsIntent, compensate);
        add(proofHandle.Get(), INTENT_RELATIVE_COLORIMETRIC, FALSE);
        add(destinationProfile.Get(),
            (flags & kProofAbsolute) ? INTENT_ABSOLUTE_COLORIMETRIC : INTENT_RELATIVE_COLORIMETRIC,
            FALSE);
        if (flags & kGamutWarning) {
            transformFlags |= cmsFLAGS_GAMUTCHECK;
            SetAlarmColour(session.Context());
        }
    } else {
        add(destinationProfile.Get(), lcmsIntent, compensate);
    }
    TransformHandle transform(cmsCreateExtendedTransform(
        session.Context(), n, chain, bpc, intents, adaptation,
        (transformFlags & cmsFLAGS_GAMUTCHECK) ? proofHandle.Get() : nullptr, gamutPosition,
        inLayout.lcmsFormat, outLayout.lcmsFormat, transformFlags));
    if (!transform) return session.Failure(XQ_ERR_TRANSFORM);

    const auto *from = static_cast<const unsigned char *>(in->pixels);
    auto *to = static_cast<unsigned char *>(out->pixels);
    for (int32_t done = 0; done < in->count;) {
        const int32_t run = in->count - done < kColoursPerRun ? in->count - done : kColoursPerRun;
        cmsDoTransform(transform.Get(), from + static_cast<size_t>(done) * inLayout.bytesPerColour,
                       to + static_cast<size_t>(done) * outLayout.bytesPerColour,
                       static_cast<cmsUInt32Number>(run));
        done += run;
        if (ProgressSaysStop(progress, progressData, done, in->count)) return XQ_ERR_CANCELLED;
    }
    return XQ_OK;
}

}  // namespace tessarine::color
