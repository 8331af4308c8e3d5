// Running the tool in-process, and writing and reading PNG and TIFF files
// with libpng and libtiff directly, so that the tests do not lean on the
// tool's own readers and writers.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "test_support.h"

namespace clitest {

struct RunResult {
    int code = -1;
    std::string out;
    std::string err;
};

RunResult Cli(const std::vector<std::string> &args);

// Raw image: rows of packed samples as the file holds them.
struct Image {
    int width = 0, height = 0;
    int colorType = 0; // PNG colour type (0 gray, 2 RGB, 3 palette) or, for TIFF, samples
    int depth = 8;
    int photometric = 0; // TIFF only
    std::vector<uint8_t> palette;
    std::vector<std::vector<uint8_t>> rows;
};

void WritePng(const std::string &path, const Image &image);
Image ReadPng(const std::string &path);
void WriteTiff(const std::string &path, const Image &image, bool tiled = false);
Image ReadTiff(const std::string &path);

// Deterministic test content.
Image MakeRgb(int w, int h);
Image MakeGray(int w, int h, int depth);
Image MakePalette(int w, int h, int colours);

bool FileExists(const std::string &path);
std::string ReadFile(const std::string &path);
void WriteFile(const std::string &path, const std::string &bytes);

// A sandbox whose folder also receives the tool's outputs; the test removes
// what it asked for, so anything else left is a partial output.
class CliSandbox : public tstest::Sandbox {
  protected:
    std::string Made(const std::string &name) {
        made_.push_back(Path(name));
        return Path(name);
    }
    void TearDown() override;

  private:
    std::vector<std::string> made_;
};

}  // namespace clitest
