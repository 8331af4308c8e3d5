#include "test_support.h"

#include <dirent.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>

#include <tessarine/platform.h>

namespace tstest {
namespace fs = std::filesystem;
using tessarine::testing::FileCall;

int OpenDescriptorCount() {
    int count = 0;
    DIR *dir = opendir("/proc/self/fd");
    if (dir == nullptr) return -1;
    while (dirent *entry = readdir(dir)) {
        if (entry->d_name[0] != '.') ++count;
    }
    closedir(dir);
    return count - 1;  // the directory stream itself
}

std::vector<std::string> DirectoryEntries(const std::string &path) {
    std::vector<std::string> names;
    std::error_code ec;
    for (const auto &entry : fs::directory_iterator(path, ec)) names.push_back(entry.path().filename());
    return names;
}

std::string MakeFreshDirectory(const char *tag) {
    static const std::string root = [] {
        std::string base = (fs::temp_directory_path() / "tessarine-tests-XXXXXX").string();
        if (mkdtemp(base.data()) == nullptr) std::abort();
        return base;
    }();
    static int serial = 0;
    std::string dir = root + "/" + tag + "-" + std::to_string(++serial);
    fs::create_directories(dir);
    return dir;
}

void RemoveTree(const std::string &path) {
    std::error_code ec;
    fs::remove_all(path, ec);
}

void Sandbox::SetUp() {
    tessarine::testing::ResetInjection();
    dir_ = MakeFreshDirectory("sandbox");
    if (const char *old = std::getenv("TMPDIR")) {
        hadTmpdir_ = true;
        savedTmpdir_ = old;
    }
    setenv("TMPDIR", dir_.c_str(), 1);
    liveAtStart_ = tessarine::testing::LiveBlocks();
    fdsAtStart_ = OpenDescriptorCount();
}

void Sandbox::TearDown() {
    tessarine::testing::ResetInjection();
    std::vector<std::string> left;
    for (const auto &name : DirectoryEntries(dir_)) {
        bool allowed = false;
        for (const auto &a : allowed_) allowed = allowed || a == name;
        if (!allowed) left.push_back(name);
    }
    EXPECT_TRUE(left.empty()) << "files left behind in TMPDIR, first: "
                              << (left.empty() ? "" : left.front());
    EXPECT_EQ(tessarine::testing::LiveBlocks(), liveAtStart_) << "heap blocks leaked";
    EXPECT_EQ(OpenDescriptorCount(), fdsAtStart_) << "descriptors left open";
    RemoveTree(dir_);
    if (hadTmpdir_)
        setenv("TMPDIR", savedTmpdir_.c_str(), 1);
    else
        unsetenv("TMPDIR");
}

int64_t ForEachAllocationFailure(const std::function<void(int64_t)> &attempt) {
    for (int64_t n = 1; n < 1000000; ++n) {
        const int64_t live = tessarine::testing::LiveBlocks();
        tessarine::testing::FailAllocationAt(n);
        attempt(n);
        const bool hit = tessarine::testing::AllocationFailureHit();
        const int64_t count = tessarine::testing::AllocationCount();
        tessarine::testing::ResetInjection();
        if (!hit) return count;
        EXPECT_EQ(tessarine::testing::LiveBlocks(), live) << "leak after allocation failure " << n;
        if (::testing::Test::HasFailure()) return -1;
    }
    ADD_FAILURE() << "allocation failure loop did not end";
    return -1;
}

int64_t ForEachFileFailure(FileCall kind, const std::function<void(int64_t)> &attempt) {
    for (int64_t n = 1; n < 1000000; ++n) {
        tessarine::testing::FailFileCallAt(kind, n);
        attempt(n);
        const bool hit = tessarine::testing::FileFailureHit(kind);
        const int64_t count = tessarine::testing::FileCallCount(kind);
        tessarine::testing::ResetInjection();
        if (!hit) return count;
        if (::testing::Test::HasFailure()) return -1;
    }
    ADD_FAILURE() << "file failure loop did not end";
    return -1;
}

namespace {
std::vector<CapturedMessage> g_messages;
TS_MessageSinkFn g_previous = nullptr;

int32_t CaptureSink(const char *text, uint32_t style, int32_t id) {
    g_messages.push_back({text ? text : "", style, id});
    return 1;
}
}  // namespace

MessageCapture::MessageCapture() {
    g_messages.clear();
    g_previous = TS_SetMessageSink(CaptureSink);
}
MessageCapture::~MessageCapture() { TS_SetMessageSink(g_previous); }
const std::vector<CapturedMessage> &MessageCapture::Messages() const { return g_messages; }
void MessageCapture::Clear() { g_messages.clear(); }

}  // namespace tstest
