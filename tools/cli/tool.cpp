// The command line: subcommands, their options, exit codes (0 done, 1 failed,
// 2 usage) and the one-line failure message.
#include <CLI/CLI.hpp>
#include <atomic>
#include <new>
#include <ostream>
#include <unistd.h>

#include "commands.h"
#include "failure.h"
#include "layouts.h"

#ifndef TESSARINE_VERSION
#define TESSARINE_VERSION "unknown"
#endif

namespace tessarine::cli {
namespace {

std::atomic<bool> stopRequested{false};

}  // namespace

bool StopRequested() { return stopRequested.load(std::memory_order_relaxed); }
void RequestStop() { stopRequested.store(true, std::memory_order_relaxed); }
void ClearStop() { stopRequested.store(false, std::memory_order_relaxed); }

int RunTool(int argc, const char *const *argv, std::ostream &out, std::ostream &err) {
    CLI::App app{"Print-shop jobs on tile bitmap files, images and cut paths.", "tessarine"};
    app.set_version_flag("--version", "tessarine " TESSARINE_VERSION);
    app.require_subcommand(1);
    app.footer("Exit codes: 0 done, 1 failed, 2 usage. Run 'tessarine COMMAND --help' for a command.");

    InfoOptions info;
    CLI::App *infoCmd = app.add_subcommand("info", "Show a tile bitmap file's header, colour table, sub-bitmaps and tiles.");
    infoCmd->add_option("FILE", info.file, "Tile bitmap file")->required();
    infoCmd->add_flag("--json", info.json, "Print JSON instead of text");

    ImportOptions import;
    CLI::App *importCmd = app.add_subcommand("import", "Make a tile bitmap file from a PNG or TIFF image, streamed row by row.");
    importCmd->add_option("IN", import.input, "PNG or TIFF image")->required();
    importCmd->add_option("OUT", import.output, "Tile bitmap file to write")->required();
    importCmd->add_option("--layout", import.layout, "Pixel layout: " + LayoutNames() + " (default: from the image)");

    ExportOptions exportOpts;
    CLI::App *exportCmd = app.add_subcommand("export", "Write a sub-bitmap of a tile bitmap file as a PNG or TIFF image.");
    exportCmd->add_option("IN", exportOpts.input, "Tile bitmap file")->required();
    exportCmd->add_option("OUT", exportOpts.output, "Image to write: .png, .tif or .tiff")->required();
    exportCmd->add_option("--sub", exportOpts.sub, "Sub-bitmap (0 is the full image)")->check(CLI::NonNegativeNumber);
    exportCmd->add_option("--profile", exportOpts.profile, "ICC profile of a CMYK image: convert to RGB through profiles");
    exportCmd->add_option("--rgb-profile", exportOpts.rgbProfile, "ICC profile of the RGB output (default: sRGB)");
    exportCmd->add_flag("--tiff-cmyk", exportOpts.tiffCmyk, "Keep CMYK in a CMYK TIFF");

    ConvertOptions convert;
    CLI::App *convertCmd = app.add_subcommand("convert", "Copy a tile bitmap file into another layout.");
    convertCmd->add_option("IN", convert.input, "Tile bitmap file")->required();
    convertCmd->add_option("OUT", convert.output, "Tile bitmap file to write")->required();
    convertCmd->add_option("--layout", convert.layout, "Pixel layout: " + LayoutNames())->required();

    LevelsOptions levels;
    CLI::App *levelsCmd = app.add_subcommand("levels", "Add reduced levels to a tile bitmap file as sub-bitmaps.");
    levelsCmd->add_option("FILE", levels.file, "Tile bitmap file (changed in place)")->required();
    levelsCmd->add_option("--count", levels.count, "Levels to add, each half the size of the one before (default: down to 256 pixels)")
        ->check(CLI::Range(1, 8));
    levelsCmd->add_option("--method", levels.method, "sample or average (default: average where the layout allows)")
        ->check(CLI::IsMember({"sample", "average", "auto"}));
    levelsCmd->add_flag("-q,--quiet", levels.quiet, "No progress bar");

    CutOptions cut;
    CLI::App *cutCmd = app.add_subcommand("cut", "Turn the paths of an SVG file into cutter commands (HPGL).");
    cutCmd->add_option("IN", cut.input, "SVG file")->required();
    cutCmd->add_option("OUT", cut.output, "HPGL file to write")->required();
    cutCmd->add_option("--tolerance", cut.tolerance, "Largest distance from the path, in mm (at least 0.05)")
        ->check(CLI::Range(0.05, 100.0));
    cutCmd->add_flag("--arcs", cut.arcs, "Cut curves as arcs (AA) and lines, not lines only");

    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError &e) {
        if (e.get_exit_code() == 0) return app.exit(e, out, err);
        err << "tessarine: " << e.what() << " (see --help)\n";
        return 2;
    }

    try {
        if (infoCmd->parsed()) RunInfo(info, out);
        if (importCmd->parsed()) RunImport(import, out);
        if (exportCmd->parsed()) RunExport(exportOpts, out);
        if (convertCmd->parsed()) RunConvert(convert, out);
        if (levelsCmd->parsed()) {
            levels.progressBar = !levels.quiet && &err == &std::cerr && isatty(STDERR_FILENO);
            RunLevels(levels, out, err);
        }
        if (cutCmd->parsed()) RunCut(cut, out);
    } catch (const UsageFailure &e) {
        err << "tessarine: " << e.what() << "\n";
        return 2;
    } catch (const Failure &e) {
        err << "tessarine: " << e.what() << "\n";
        return 1;
    } catch (const std::bad_alloc &) {
        err << "tessarine: not enough memory\n";
        return 1;
    }
    out.flush();
    return 0;
}

}  // namespace tessarine::cli
