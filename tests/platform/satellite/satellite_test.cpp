// Loads copies of the shared library from fresh folders, with and without a
// satellite beside them, and reads the texts its message box shows.
#include <dlfcn.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include <tessarine/platform.h>

namespace fs = std::filesystem;

namespace {

std::vector<std::string> g_texts;

int32_t Capture(const char *text, uint32_t, int32_t) {
    g_texts.emplace_back(text);
    return 1;
}

struct LoadedCopy {
    std::string dir;
    void *handle = nullptr;

    LoadedCopy(const std::string &libraryName, bool withSatellite,
               const char *folder = "tessarine-satellite-XXXXXX") {
        std::string pattern = (fs::temp_directory_path() / folder).string();
        dir = mkdtemp(pattern.data());
        fs::copy_file(TESSARINE_LIBRARY, dir + "/" + libraryName);
        if (withSatellite) fs::copy_file(TESSARINE_SATELLITE, dir + "/libtessarineLOC.so");
        handle = dlopen((dir + "/" + libraryName).c_str(), RTLD_NOW | RTLD_LOCAL);
    }
    ~LoadedCopy() {
        if (handle) dlclose(handle);
        fs::remove_all(dir);
    }
    std::vector<std::string> Show(int32_t status) {
        auto setSink = reinterpret_cast<TS_MessageSinkFn (*)(TS_MessageSinkFn)>(
            dlsym(handle, "TS_SetMessageSink"));
        auto show = reinterpret_cast<void (*)(int32_t)>(dlsym(handle, "ShowStatusMsg"));
        EXPECT_NE(setSink, nullptr);
        EXPECT_NE(show, nullptr);
        g_texts.clear();
        setSink(Capture);
        show(status);
        setSink(nullptr);
        return g_texts;
    }
};

TEST(Satellite, TextsComeFromTheSatelliteWhenItIsThere) {
    LoadedCopy copy("libtessarine.so", true);
    ASSERT_NE(copy.handle, nullptr) << dlerror();
    EXPECT_EQ(copy.Show(-5), std::vector<std::string>{"Speicher reicht nicht."});
    EXPECT_EQ(copy.Show(-1), std::vector<std::string>{"Fehler erkannt; Vorgang abgebrochen."});
    // An id the satellite does not translate falls back to the built-in text.
    EXPECT_EQ(copy.Show(-50), std::vector<std::string>{"Failed to access bitmap."});
}

TEST(Satellite, VersionedLibraryNameFindsTheSameSatellite) {
    LoadedCopy copy("libtessarine.so.1", true);
    ASSERT_NE(copy.handle, nullptr) << dlerror();
    EXPECT_EQ(copy.Show(-5), std::vector<std::string>{"Speicher reicht nicht."});
}

TEST(Satellite, OnlyTheFileNameHasItsExtensionReplaced) {
    LoadedCopy copy("libtessarine.so", true, "tessarine.satellite-XXXXXX");
    ASSERT_NE(copy.handle, nullptr) << dlerror();
    EXPECT_EQ(copy.Show(-5), std::vector<std::string>{"Speicher reicht nicht."});
}

TEST(Satellite, FileNameWithoutADotLoadsWithBuiltInTexts) {
    // Nothing to replace: no satellite is looked for, even with one beside it.
    LoadedCopy copy("libtessarine", true, "tessarine.satellite-XXXXXX");
    ASSERT_NE(copy.handle, nullptr) << dlerror();
    EXPECT_EQ(copy.Show(-5), std::vector<std::string>{"Not enough memory."});
}

TEST(Satellite, LoadingWithoutASatelliteSucceedsWithBuiltInTexts) {
    LoadedCopy copy("libtessarine.so", false);
    ASSERT_NE(copy.handle, nullptr) << dlerror();
    EXPECT_EQ(copy.Show(-5), std::vector<std::string>{"Not enough memory."});
    EXPECT_EQ(copy.Show(0), std::vector<std::string>{"Error detected; operation aborted."});
}

}  // namespace
