#include <cxxabi.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <map>
#include <string>
#include <type_traits>

#include <tessarine/profile.hpp>

namespace {

// The return types, which a decorated name does not carry.
static_assert(std::is_same_v<decltype(&RenderingIntentR27ToColorDev), int (*)(int const &)>);
static_assert(
    std::is_same_v<decltype(&getICCProfileFlags), unsigned long (*)(int, int, int, int, int)>);
static_assert(std::is_same_v<decltype(&getProfileInfo), AString (*)(AFilePath &, AString &)>);
static_assert(std::is_same_v<decltype(&ValidateProfileType),
                             int (*)(AFilePath const &, EICCProfileType const &)>);
static_assert(
    std::is_same_v<decltype(&ProfileExists), int (*)(AFilePath const &, AString const &)>);
static_assert(std::is_same_v<decltype(&R27_XQMatchColors),
                             long (*)(AFilePath *, AFilePath *, AFilePath *, AFilePath *, void *,
                                      void *, int, unsigned long, long)>);
static_assert(std::is_same_v<decltype(&R27_XQProjectOntoGamut),
                             long (*)(AFilePath *, AFilePath *, AFilePath *, void *, void *, void *,
                                      int, long)>);

std::string Demangle(const std::string &name) {
    int status = 0;
    char *text = abi::__cxa_demangle(name.c_str(), nullptr, nullptr, &status);
    if (status != 0 || text == nullptr) return "";
    std::string result = text;
    std::free(text);
    return result;
}

TEST(ExportedNames, DecoratedNamesDemangleToTheServiceSignatures) {
    const std::map<std::string, bool> want = {
        {"RenderingIntentR27ToColorDev(int const&)", false},
        {"getICCProfileFlags(int, int, int, int, int)", false},
        {"getProfileInfo(AFilePath&, AString&)", false},
        {"ValidateProfileType(AFilePath const&, EICCProfileType const&)", false},
        {"ProfileExists(AFilePath const&, AString const&)", false},
        {"R27_XQMatchColors(AFilePath*, AFilePath*, AFilePath*, AFilePath*, void*, void*, int, "
         "unsigned long, long)",
         false},
        {"R27_XQProjectOntoGamut(AFilePath*, AFilePath*, AFilePath*, void*, void*, void*, int, "
         "long)",
         false},
        {"AString::AString(char const*)", false},
        {"AString::AString(AString const&)", false},
        {"AString::~AString()", false},
        {"AString::operator char const*() const", false},
        {"AFilePath::AFilePath()", false},
        {"AFilePath::AFilePath(char const*)", false},
        {"AFilePath::AFilePath(AFilePath const&)", false},
        {"AFilePath::~AFilePath()", false},
        {"AFilePath::operator char const*()", false},
        {"AFilePath::operator AString const&() const", false},
        {"AFilePath::operator+=(AString const&)", false},
        {"AFilePath::exists() const", false},
    };
    std::map<std::string, bool> seen = want;
    std::string here = __FILE__;
    here.erase(here.rfind('/'));
    std::ifstream list(here + "/../exports/color.txt");
    ASSERT_TRUE(list.good());
    std::string line;
    int decorated = 0;
    while (std::getline(list, line)) {
        if (line.rfind("_Z", 0) != 0) continue;
        ++decorated;
        const std::string signature = Demangle(line);
        ASSERT_TRUE(want.count(signature)) << line << " demangles to \"" << signature << "\"";
        seen[signature] = true;
    }
    for (const auto &[signature, found] : seen) EXPECT_TRUE(found) << "not listed: " << signature;
    // Constructors and destructors come as complete and base object pairs:
    // 7 services, 7 names of AString, 12 of AFilePath.
    EXPECT_EQ(decorated, 26);
}

}  // namespace
