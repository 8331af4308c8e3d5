// The subcommands of the tool. Each throws a Failure (exit 1) or a
// UsageFailure (exit 2); results go to `out`, progress to `err`.
#pragma once

#include <iosfwd>
#include <string>

namespace tessarine::cli {

struct InfoOptions {
    std::string file;
    bool json = false;
};
void RunInfo(const InfoOptions &options, std::ostream &out);

struct ImportOptions {
    std::string input;
    std::string output;
    std::string layout; // empty: chosen from the image
};
void RunImport(const ImportOptions &options, std::ostream &out);

struct ExportOptions {
    std::string input;
    std::string output;
    int sub = 0;
    std::string profile;    // CMYK profile of the image; empty: the device formulas
    std::string rgbProfile; // RGB profile of the output
    bool tiffCmyk = false;
};
void RunExport(const ExportOptions &options, std::ostream &out);

struct ConvertOptions {
    std::string input;
    std::string output;
    std::string layout;
};
void RunConvert(const ConvertOptions &options, std::ostream &out);

struct LevelsOptions {
    std::string file;
    int count = 0; // 0: down to about 256 pixels
    std::string method = "auto";
    bool quiet = false;
    bool progressBar = false; // decided by the caller: standard error is a terminal
};
void RunLevels(const LevelsOptions &options, std::ostream &out, std::ostream &err);
// Told every progress value of levels before the stop is looked at (tests).
using ProgressObserver = void (*)(double value);
void SetProgressObserver(ProgressObserver observer);

struct CutOptions {
    std::string input;
    std::string output;
    double tolerance = 0.1; // millimetres
    bool arcs = false;
};
void RunCut(const CutOptions &options, std::ostream &out);

// The tool: parses the arguments and runs a subcommand. Returns the exit code.
int RunTool(int argc, const char *const *argv, std::ostream &out, std::ostream &err);

// Set by SIGINT; a long job polls it and stops cleanly.
bool StopRequested();
void RequestStop();
void ClearStop();

}  // namespace tessarine::cli
