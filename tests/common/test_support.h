// Shared test fixtures: a fresh TMPDIR per test with a check that nothing is
// left in it, leak and descriptor accounting, failure injection loops, and a
// capturing message sink.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "platform/test_hooks.h"

namespace tstest {

// Number of open descriptors of this process.
int OpenDescriptorCount();
// Names of the entries in a directory.
std::vector<std::string> DirectoryEntries(const std::string &path);
// Makes a fresh directory under the run's scratch root.
std::string MakeFreshDirectory(const char *tag);
void RemoveTree(const std::string &path);

// Gives each test a fresh TMPDIR, and fails the test if a file is left in it,
// a heap block is leaked, or a descriptor is left open.
class Sandbox : public ::testing::Test {
  protected:
    void SetUp() override;
    void TearDown() override;
    std::string Path(const std::string &name) const { return dir_ + "/" + name; }
    const std::string &Dir() const { return dir_; }
    // Files the test itself made and will remove may be left out of the check.
    void AllowLeftover(const std::string &name) { allowed_.push_back(name); }

  private:
    std::string dir_;
    std::string savedTmpdir_;
    bool hadTmpdir_ = false;
    int64_t liveAtStart_ = 0;
    int fdsAtStart_ = 0;
    std::vector<std::string> allowed_;
};

// Runs `attempt` with the Nth allocation failing, for N = 1, 2, ... until a
// run completes without reaching the injected failure. `attempt` gets N and
// must check what a failure at that point must give. Between runs the heap
// must be back where it was (no leak). Returns the number of allocations of
// the successful run.
int64_t ForEachAllocationFailure(const std::function<void(int64_t)> &attempt);

// The same for reads, writes or seeks.
int64_t ForEachFileFailure(tessarine::testing::FileCall kind,
                           const std::function<void(int64_t)> &attempt);

struct CapturedMessage {
    std::string text;
    uint32_t style;
    int32_t id;
};

// Installs a capturing message sink for its lifetime.
class MessageCapture {
  public:
    MessageCapture();
    ~MessageCapture();
    const std::vector<CapturedMessage> &Messages() const;
    void Clear();
};

}  // namespace tstest
