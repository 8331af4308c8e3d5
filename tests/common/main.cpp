// Test main: the whole run works under its own scratch root, so that no test
// can litter the machine's temporary directory.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>

#include "test_support.h"

int main(int argc, char **argv) {
    ::testing::InitGoogleTest(&argc, argv);
    const std::string root = tstest::MakeFreshDirectory("run");
    setenv("TMPDIR", root.c_str(), 1);
    const int result = RUN_ALL_TESTS();
    std::filesystem::path top = std::filesystem::path(root).parent_path();
    tstest::RemoveTree(top.string());
    return result;
}
