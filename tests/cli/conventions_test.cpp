// The usual conventions: help, version, exit codes, results on standard
// output and messages on standard error.
#include "cli_test_support.h"

namespace clitest {
namespace {

TEST(Conventions, HelpForTheToolAndEachCommand) {
    RunResult r = Cli({"--help"});
    EXPECT_EQ(r.code, 0);
    EXPECT_NE(r.out.find("Usage"), std::string::npos);
    for (const char *command : {"info", "import", "export", "convert", "levels", "cut"}) {
        EXPECT_NE(r.out.find(command), std::string::npos) << command;
        const RunResult sub = Cli({command, "--help"});
        EXPECT_EQ(sub.code, 0) << command;
        EXPECT_NE(sub.out.find(std::string("tessarine ") + command), std::string::npos) << sub.out;
        EXPECT_TRUE(sub.err.empty());
    }
}

TEST(Conventions, Version) {
    const RunResult r = Cli({"--version"});
    EXPECT_EQ(r.code, 0);
    EXPECT_EQ(r.out.rfind("tessarine ", 0), 0u) << r.out;
}

TEST(Conventions, UsageErrorsExitTwo) {
    for (const std::vector<std::string> &args :
         {std::vector<std::string>{}, {"frobnicate"}, {"info"}, {"import", "a.png"},
          {"export", "a", "b.png", "--sub", "-1"}, {"cut", "a.svg", "b.plt", "--tolerance", "abc"},
          {"cut", "a.svg", "b.plt", "--tolerance", "0.001"}, {"levels", "a", "--method", "median"},
          {"info", "a", "--colour"}}) {
        const RunResult r = Cli(args);
        EXPECT_EQ(r.code, 2) << (args.empty() ? "" : args[0]);
        EXPECT_TRUE(r.out.empty());
        EXPECT_EQ(std::count(r.err.begin(), r.err.end(), '\n'), 1) << r.err;
    }
}

}  // namespace
}  // namespace clitest
