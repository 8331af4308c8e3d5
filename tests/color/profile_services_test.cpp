#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include <tessarine/profile.hpp>

#include "test_support.h"

namespace {

// A provider that records what reaches it.
struct Record {
    int descriptionCalls = 0;
    std::string descriptionPath;
    int descriptionOptions = -1;
    unsigned long descriptionSize = 0;
    int describe = 1;       // result of GetAsciiDescription
    const char *text = "";  // what it writes
    bool fillAll = false;   // write 256 bytes without a terminator

    int classCalls = 0;
    int classOptions = -1;
    std::string classPath;
    int releases = 0;
    std::vector<int> codes;
    int fitness = 7;

    std::vector<std::string> paths;
    std::vector<bool> nullPaths;
    void *input = nullptr, *output = nullptr, *outside = nullptr;
    int intent = 0;
    unsigned long flags = 0;
    long last = 0;
    bool progressNull = false, dataNull = false;
} g_record;

int Describe(char const *path, int options, char *buffer, unsigned long size) {
    ++g_record.descriptionCalls;
    g_record.descriptionPath = path;
    g_record.descriptionOptions = options;
    g_record.descriptionSize = size;
    if (g_record.fillAll)
        std::memset(buffer, 'x', size);
    else
        std::strcpy(buffer, g_record.text);
    return g_record.describe;
}

int g_state;
void *OpenClass(char const *path, int options) {
    ++g_record.classCalls;
    g_record.classPath = path;
    g_record.classOptions = options;
    return &g_state;
}
int Validate(void *state, int code) {
    EXPECT_EQ(state, &g_state);
    g_record.codes.push_back(code);
    return g_record.fitness;
}
void Release(void *state) {
    EXPECT_EQ(state, &g_state);
    ++g_record.releases;
}

void NotePath(char const *path) {
    g_record.nullPaths.push_back(path == nullptr);
    g_record.paths.push_back(path != nullptr ? path : "");
}

long Match(char const *a, char const *b, char const *c, char const *d, void *in, void *out,
           int intent, unsigned long flags, long last, XQProgressFn progress, void *data) {
    for (char const *p : {a, b, c, d}) NotePath(p);
    g_record.input = in;
    g_record.output = out;
    g_record.intent = intent;
    g_record.flags = flags;
    g_record.last = last;
    g_record.progressNull = progress == nullptr;
    g_record.dataNull = data == nullptr;
    return -12345678L;
}

long Project(char const *a, char const *b, char const *c, void *in, void *out, void *outside,
             int intent, long last, XQProgressFn progress, void *data) {
    for (char const *p : {a, b, c}) NotePath(p);
    g_record.input = in;
    g_record.output = out;
    g_record.outside = outside;
    g_record.intent = intent;
    g_record.last = last;
    g_record.progressNull = progress == nullptr;
    g_record.dataNull = data == nullptr;
    return 87654321L;
}

const TS_ProfileProvider kRecorder = {Describe, OpenClass, Validate, Release, Match, Project};

class ProfileServices : public tstest::Sandbox {
  protected:
    void SetUp() override {
        tstest::Sandbox::SetUp();
        g_record = Record{};
        previous_ = TS_SetProfileProvider(&kRecorder);
    }
    void TearDown() override {
        TS_SetProfileProvider(previous_);
        tstest::Sandbox::TearDown();
    }
    const TS_ProfileProvider *previous_ = nullptr;
};

// ---- Flags and intents ------------------------------------------------------------

TEST(ProfileFlags, DependOnEachOtherInAChain) {
    EXPECT_EQ(getICCProfileFlags(1, 0, 1, 1, 1), 1ul);
    EXPECT_EQ(getICCProfileFlags(0, 1, 0, 1, 0), 2ul) << "d counts only with c";
    EXPECT_EQ(getICCProfileFlags(1, 1, 1, 1, 1), 31ul);
    EXPECT_EQ(getICCProfileFlags(0, 0, 0, 0, 0), 0ul);
    EXPECT_EQ(getICCProfileFlags(-3, 7, 0, 0, 9), 19ul) << "any non-zero value switches";
    for (int i = 0; i < 32; ++i) {
        const int a = i & 1, b = (i >> 1) & 1, c = (i >> 2) & 1, d = (i >> 3) & 1, e = (i >> 4) & 1;
        const unsigned long want = (a ? 1 : 0) | (b ? 2 : 0) | (b && c ? 4 : 0) |
                                   (b && c && d ? 8 : 0) | (b && e ? 16 : 0);
        EXPECT_EQ(getICCProfileFlags(a, b, c, d, e), want) << i;
        if (!b) {
            EXPECT_LE(getICCProfileFlags(a, b, c, d, e), 1ul);
        }
    }
}

TEST(RenderingIntent, OneToOneUpToFive) {
    for (int intent = 0; intent <= 5; ++intent)
        EXPECT_EQ(RenderingIntentR27ToColorDev(intent), intent);
    EXPECT_EQ(RenderingIntentR27ToColorDev(6), -1);
    EXPECT_EQ(RenderingIntentR27ToColorDev(-1), -1);
    EXPECT_EQ(RenderingIntentR27ToColorDev(1000), -1);
}

// ---- ProfileExists -------------------------------------------------------------------

class ProfileExistsTest : public tstest::Sandbox {};

TEST_F(ProfileExistsTest, MissingFolderGivesZeroWithoutLookingAtTheName) {
    AFilePath folder(Path("no-such-folder").c_str());
    AString name("x.icc");
    tessarine::testing::ResetInjection();
    EXPECT_EQ(ProfileExists(folder, name), 0);
    // Only the copy of the folder was made: the name was never appended.
    EXPECT_EQ(tessarine::testing::AllocationCount(), 1);
}

TEST_F(ProfileExistsTest, FileInAFolder) {
    FILE *file = std::fopen(Path("p.icc").c_str(), "wb");
    std::fclose(file);
    AFilePath folder(Dir().c_str());
    EXPECT_NE(ProfileExists(folder, AString("p.icc")), 0);
    EXPECT_EQ(ProfileExists(folder, AString("q.icc")), 0);
    AFilePath slashed((Dir() + "/").c_str());
    EXPECT_NE(ProfileExists(slashed, AString("p.icc")), 0);
    EXPECT_STREQ(static_cast<char const *>(AFilePath(folder)), Dir().c_str()) << "folder unchanged";
    const AString name("p.icc");
    tstest::ForEachAllocationFailure([&](int64_t) {
        const int found = ProfileExists(folder, name);
        // Any failed copy leaves an empty path, which exists nowhere.
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(found, 0);
        } else {
            EXPECT_NE(found, 0);
        }
    });
    std::remove(Path("p.icc").c_str());
}

// ---- ValidateProfileType ---------------------------------------------------------------

TEST_F(ProfileServices, KindZeroStillOpensTheProfileClassAndGivesZero) {
    AFilePath path("/some/profile.icc");
    const EICCProfileType kind = static_cast<EICCProfileType>(0);
    EXPECT_EQ(ValidateProfileType(path, kind), 0);
    EXPECT_EQ(g_record.classCalls, 1);
    EXPECT_EQ(g_record.classPath, "/some/profile.icc");
    EXPECT_EQ(g_record.classOptions, 0);
    EXPECT_TRUE(g_record.codes.empty());
    EXPECT_EQ(g_record.releases, 1);
    EXPECT_EQ(ValidateProfileType(path, static_cast<EICCProfileType>(6)), 0);
    EXPECT_EQ(g_record.classCalls, 2);
    EXPECT_EQ(g_record.releases, 2);
}

TEST_F(ProfileServices, KindsMapToTheirCodes) {
    AFilePath path("/p.icc");
    for (int kind = 1; kind <= 5; ++kind)
        EXPECT_EQ(ValidateProfileType(path, static_cast<EICCProfileType>(kind)), 7);
    EXPECT_EQ(g_record.codes, (std::vector<int>{0x10001, 0x10002, 0x1000B, 0x20001, 0x20002}));
    EXPECT_EQ(g_record.releases, 5);
}

// ---- getProfileInfo ---------------------------------------------------------------------

TEST_F(ProfileServices, DescriptionOrFallback) {
    AFilePath path("/p.icc");
    AString fallback("unknown profile");
    g_record.text = "Monitor 6500K";
    EXPECT_STREQ(getProfileInfo(path, fallback), "Monitor 6500K");
    EXPECT_EQ(g_record.descriptionPath, "/p.icc");
    EXPECT_EQ(g_record.descriptionOptions, 0);
    EXPECT_EQ(g_record.descriptionSize, 256ul);
    g_record.describe = 0;
    EXPECT_STREQ(getProfileInfo(path, fallback), "unknown profile");
}

TEST_F(ProfileServices, FullBufferStillGivesATextOf255) {
    AFilePath path("/p.icc");
    AString fallback("f");
    g_record.fillAll = true;
    const AString text = getProfileInfo(path, fallback);
    EXPECT_EQ(std::strlen(text), 255u);
}

TEST_F(ProfileServices, DescriptionWithoutMemoryIsEmpty) {
    AFilePath path("/p.icc");
    AString fallback("unknown");
    g_record.text = "Monitor";
    tstest::ForEachAllocationFailure([&](int64_t) {
        const AString text = getProfileInfo(path, fallback);
        EXPECT_STREQ(text, tessarine::testing::AllocationFailureHit() ? "" : "Monitor");
    });
}

// ---- The matching services pass everything on ---------------------------------------------

TEST_F(ProfileServices, MatchColorsPassesPathsAsTextAndTheRestUnchanged) {
    AFilePath a("/a.icc"), b("/b.icc"), d("/d.icc");
    int in, out;
    EXPECT_EQ(R27_XQMatchColors(&a, &b, nullptr, &d, &in, &out, 3, 0xDEADBEEFul, -77), -12345678L);
    EXPECT_EQ(g_record.paths, (std::vector<std::string>{"/a.icc", "/b.icc", "", "/d.icc"}));
    EXPECT_EQ(g_record.nullPaths, (std::vector<bool>{false, false, true, false}));
    EXPECT_EQ(g_record.input, &in);
    EXPECT_EQ(g_record.output, &out);
    EXPECT_EQ(g_record.intent, 3);
    EXPECT_EQ(g_record.flags, 0xDEADBEEFul);
    EXPECT_EQ(g_record.last, -77);
    EXPECT_TRUE(g_record.progressNull);
    EXPECT_TRUE(g_record.dataNull);
}

TEST_F(ProfileServices, ProjectOntoGamutPassesPathsAsTextAndTheRestUnchanged) {
    AFilePath b("/b.icc"), c("/c.icc");
    int in, out, outside;
    EXPECT_EQ(R27_XQProjectOntoGamut(nullptr, &b, &c, &in, &out, &outside, 9, 123456), 87654321L);
    EXPECT_EQ(g_record.paths, (std::vector<std::string>{"", "/b.icc", "/c.icc"}));
    EXPECT_EQ(g_record.nullPaths, (std::vector<bool>{true, false, false}));
    EXPECT_EQ(g_record.input, &in);
    EXPECT_EQ(g_record.output, &out);
    EXPECT_EQ(g_record.outside, &outside);
    EXPECT_EQ(g_record.intent, 9);
    EXPECT_EQ(g_record.last, 123456);
    EXPECT_TRUE(g_record.progressNull);
    EXPECT_TRUE(g_record.dataNull);
}

TEST(ProfileProvider, InstallingNullRestoresTheDefault) {
    const TS_ProfileProvider *standard = TS_DefaultProfileProvider();
    ASSERT_NE(standard, nullptr);
    EXPECT_EQ(TS_SetProfileProvider(&kRecorder), standard);
    EXPECT_EQ(TS_SetProfileProvider(nullptr), &kRecorder);
    EXPECT_EQ(TS_SetProfileProvider(nullptr), standard);
}

// ---- AString and AFilePath ---------------------------------------------------------------

class TextClasses : public tstest::Sandbox {};

TEST_F(TextClasses, StringsCopyTheirText) {
    char source[] = "abc";
    AString s(source);
    source[0] = 'z';
    EXPECT_STREQ(s, "abc");
    AString copy(s);
    EXPECT_STREQ(copy, "abc");
    EXPECT_NE(static_cast<char const *>(copy), static_cast<char const *>(s));
    EXPECT_STREQ(AString(nullptr), "");
    EXPECT_STREQ(AString(""), "");
}

TEST_F(TextClasses, PathsAppendNamesWithOneSeparator) {
    AFilePath folder("/usr/share");
    AFilePath copy(folder);
    copy += AString("color");
    EXPECT_STREQ(static_cast<char const *>(copy), "/usr/share/color");
    EXPECT_STREQ(static_cast<char const *>(folder), "/usr/share");
    AFilePath slashed("/usr/");
    slashed += AString("share");
    EXPECT_STREQ(static_cast<char const *>(slashed), "/usr/share");
    AFilePath empty;
    empty += AString("name");
    EXPECT_STREQ(static_cast<char const *>(empty), "name");
    const AString &asString = static_cast<AString const &>(folder);
    EXPECT_STREQ(asString, "/usr/share");
}

TEST_F(TextClasses, ExistsLooksAtTheFileSystem) {
    EXPECT_NE(AFilePath(Dir().c_str()).exists(), 0);
    EXPECT_EQ(AFilePath(Path("none").c_str()).exists(), 0);
    EXPECT_EQ(AFilePath().exists(), 0);
    EXPECT_EQ(AFilePath(nullptr).exists(), 0);
}

TEST_F(TextClasses, FailedAllocationsLeaveEmptyValuesAndNoLeak) {
    tstest::ForEachAllocationFailure([](int64_t n) {
        AString s("text");
        AFilePath p("/folder");
        p += AString("file");
        if (n == 1) {
            EXPECT_STREQ(s, "");
        } else if (n == 2) {
            EXPECT_EQ(p.exists(), 0);
        } else if (n == 4) {
            EXPECT_STREQ(static_cast<char const *>(p), "") << "append failed: path empty";
        }
    });
}

}  // namespace
