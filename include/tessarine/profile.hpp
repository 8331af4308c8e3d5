// Profile services: description, fitness and existence of ICC profiles, and
// colour matching through them. C++ only: these functions take and return
// class types and are exported under their C++ (decorated) names.
//
// The profile work itself is done by a provider. The library's default
// provider reads real ICC profiles with LittleCMS 2; an application may
// install its own with TS_SetProfileProvider.
#ifndef TESSARINE_PROFILE_HPP
#define TESSARINE_PROFILE_HPP

#ifndef __cplusplus
#error "profile.hpp is a C++ header"
#endif

#include "color.h"
#include "export.h"
#include "platform.h"

// ---- Text and path values ----------------------------------------------------
//
// Small value classes. Their text lives on the library's heap; a copy that
// cannot get its memory is empty (its text is ""), so that nothing here fails
// with an exception. They are not assignable: make a new one instead.

class AString {
  public:
    // A copy of `text`; a null text gives an empty string.
    TESSARINE_API AString(char const *text);
    TESSARINE_API AString(AString const &other);
    TESSARINE_API ~AString();
    AString &operator=(AString const &) = delete;

    // Never null; "" for an empty string.
    TESSARINE_API operator char const *() const;

  private:
    friend class AFilePath;
    char *text_;  // null when empty
};

class AFilePath {
  public:
    // An empty path (it exists nowhere).
    TESSARINE_API AFilePath();
    // A path from narrow text; a null text gives an empty path.
    TESSARINE_API explicit AFilePath(char const *path);
    TESSARINE_API AFilePath(AFilePath const &other);
    TESSARINE_API ~AFilePath();
    AFilePath &operator=(AFilePath const &) = delete;

    // The path as narrow text, never null.
    TESSARINE_API operator char const *();
    TESSARINE_API operator AString const &() const;
    // Appends a file name to a folder, with a '/' between them unless the
    // folder is empty or already ends with one. Should the longer text not
    // get its memory, the path becomes empty.
    TESSARINE_API AFilePath &operator+=(AString const &name);
    // Non-zero when something exists at the path in the file system.
    TESSARINE_API int exists() const;

  private:
    AString path_;
};

// ---- Profile kinds -------------------------------------------------------------
//
// What a profile is wanted for. Each kind is checked as a fitness code of the
// form (use << 16) | format, where the format is that of the colour buffer
// descriptor (1 RGB, 2 CMYK, 11 gray) and the use is
//   1  source: colours in this device space come in and are converted to the
//      connection space (classes input, display, output or colour space, with
//      a device-to-connection transform);
//   2  destination: colours are converted into this device space (classes
//      display, output or colour space, with a connection-to-device
//      transform; an input-device profile is never a destination).
// The default provider answers 1 when the profile's device class, colour space
// and transforms fit the code, and 0 when they do not, when the profile cannot
// be read, or for any other code.
enum EICCProfileType : int {
    eICCProfileRGBSource = 1,   // code 0x10001
    eICCProfileCMYKSource = 2,  // code 0x10002
    eICCProfileGraySource = 3,  // code 0x1000B
    eICCProfileRGBOutput = 4,   // code 0x20001
    eICCProfileCMYKOutput = 5,  // code 0x20002
};

// ---- The profile services ------------------------------------------------------

// The device's intent for a rendering intent 0 to 5 (the same value); -1 for
// any other.
TESSARINE_API int RenderingIntentR27ToColorDev(int const &intent);

// The flag word of colour matching from five switches: bit 0 from a; bit 1
// from b; bit 2 from b and c; bit 3 from b, c and d; bit 4 from b and e.
TESSARINE_API unsigned long getICCProfileFlags(int a, int b, int c, int d, int e);

// The profile's description (at most 255 characters), or a copy of
// `fallback` when it has none or cannot be read.
TESSARINE_API AString getProfileInfo(AFilePath &profile, AString &fallback);

// What the provider reports for the kind's fitness code; 0 for a kind outside
// 1 to 5 (the profile is opened all the same).
TESSARINE_API int ValidateProfileType(AFilePath const &profile, EICCProfileType const &kind);

// Non-zero when the folder exists and the file exists in it.
TESSARINE_API int ProfileExists(AFilePath const &folder, AString const &fileName);

// Colour matching through the provider's XQMatchColors: the four paths go as
// text (null stays null), `input` and `output` are CX_ColorBuffer
// descriptors, and the rest is passed on unchanged. Returns its result.
TESSARINE_API long R27_XQMatchColors(AFilePath *source, AFilePath *destination, AFilePath *proofing,
                                     AFilePath *abstractProfile, void *input, void *output,
                                     int intent, unsigned long flags, long reserved);

// Gamut projection through the provider's XQProjectOntoGamut, likewise.
TESSARINE_API long R27_XQProjectOntoGamut(AFilePath *source, AFilePath *device,
                                          AFilePath *destination, void *input, void *output,
                                          void *outside, int intent, long tolerance);

// ---- The provider ----------------------------------------------------------------
//
// Results of XQMatchColors and XQProjectOntoGamut in the default provider.
enum XQResult : long {
    XQ_OK = 0,
    XQ_ERR_ARGUMENT = -1,   // a null or inconsistent descriptor, a bad format,
                            // intent or count, or a null source/destination path
    XQ_ERR_PROFILE = -2,    // a profile is missing or cannot be read
    XQ_ERR_TRANSFORM = -3,  // the profiles do not fit the formats or each other
    XQ_ERR_MEMORY = -4,     // the library's heap ran out (the colour engine's own
                            // memory failures show as -2 or -3)
    XQ_ERR_CANCELLED = -5,  // the progress callback asked to stop
};

// Progress: percent done (0 to 100) and the caller's data; return false to
// stop. May be null.
typedef bool (*XQProgressFn)(int percent, void *data);

// The operations the services stand on. An installed table must stay valid
// while it is installed; every entry must be set.
//
// XQMatchColors, default provider:
//   paths     1 source and 2 destination profile (required);
//             3 proofing profile, used when flag bit 1 is set and ignored
//               otherwise: colours are rendered to the proofing device with
//               the intent, and what it reproduces goes to the destination
//               colorimetrically (a soft proof);
//             4 abstract profile (connection space to connection space, for
//               example an adjustment), applied right after the source when
//               not null.
//   buffers   CX_ColorBuffer descriptors. Formats 1 RGB (3 bytes), 2 CMYK
//             (4 bytes, 255 full ink), 11 gray (1 byte, 0 black, 255 white);
//             each must match its profile's colour space. The counts must be
//             equal; count 0 converts nothing once the profiles are checked.
//   intent    0 perceptual, 1 relative colorimetric, 2 saturation, 3 absolute
//             colorimetric, 4 perceptual keeping black ink only in black,
//             5 perceptual keeping the black plane (4 and 5 act as 0 unless
//             both ends are CMYK); anything else is XQ_ERR_ARGUMENT.
//   flags     bit 0 black point compensation; bit 1 proof through path 3;
//             bit 2 (with bit 1) gamut warning: colours the proofing device
//             cannot reproduce come out as the alarm colour, every channel
//             at 0x7F; bit 4 (with bit 1) the proof step is absolute
//             colorimetric, so the proofing device's paper shows; other bits
//             have no effect.
//   reserved  not read.
//   Nothing is written to the output on a failure found before the colours
//   are converted. The colours are converted in runs of 65536, with a
//   progress call after each.
//
// XQProjectOntoGamut, default provider:
//   paths     1 the colours' profile, 2 the device profile whose gamut they are
//             brought into, 3 the profile of the output (null: the same as 1).
//   buffers   input and output as above; the third, when not null, is a
//             format 11 descriptor of the same count that receives 1 for each
//             colour that was outside the gamut and 0 for one inside.
//   intent    as above, for rendering into the device.
//   tolerance colour difference (CIE 1976, in hundredths) above which a colour
//             counts as outside; 0 or less means 200.
//   The way back out of the device is relative colorimetric, without black
//   point compensation. Input and output may share their memory.
struct TS_ProfileProvider {
    // Puts the description into `buffer` (at most size - 1 characters and a
    // terminator); non-zero on success.
    int (*GetAsciiDescription)(char const *path, int options, char *buffer, unsigned long size);
    // Opens the profile for fitness questions; the result (null allowed) is
    // handed to the next two entries.
    void *(*GetProfileClass)(char const *path, int options);
    int (*ValidateProfileUsingColorSpace)(void *profileClass, int code);
    void (*ReleaseProfileClass)(void *profileClass);
    long (*XQMatchColors)(char const *source, char const *destination, char const *proofing,
                          char const *abstractProfile, void *input, void *output, int intent,
                          unsigned long flags, long reserved, XQProgressFn progress,
                          void *progressData);
    long (*XQProjectOntoGamut)(char const *source, char const *device, char const *destination,
                               void *input, void *output, void *outside, int intent, long tolerance,
                               XQProgressFn progress, void *progressData);
};

extern "C" {
// Installs a provider; null restores the default. Returns the one installed
// before, so that a provider can hand work on to it.
TESSARINE_API const TS_ProfileProvider *TS_SetProfileProvider(const TS_ProfileProvider *provider);
// The LittleCMS provider, for applications that wrap it.
TESSARINE_API const TS_ProfileProvider *TS_DefaultProfileProvider(void);
}

#endif
