// The SVG path-data grammar ("M 10 10 l 5 0 c ... z"): every command, relative
// and absolute, shorthand and implicit repeats, turned into absolute commands.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace tessarine::cli {

struct PathCommand {
    enum Kind : uint8_t { Move, Line, Cubic, Quad, Arc, Close };
    Kind kind;
    // Move, Line: x y. Cubic: x1 y1 x2 y2 x y. Quad: x1 y1 x y.
    // Arc: rx ry x-axis-rotation (degrees) large-arc sweep x y.
    // Close: the point it returns to (the subpath's start).
    double v[7];
};

struct PathError {
    size_t offset = 0; // byte where the data went wrong
    std::string what;
};

// Parses `data`. On an error returns false, fills `error` and leaves in `out`
// the commands before it. Every number in `out` is finite.
bool ParsePathData(std::string_view data, std::vector<PathCommand> &out, PathError &error);

// Parses a list of numbers (the points of polyline and polygon, viewBox):
// separated by white space and commas. False with `error` on anything else.
bool ParseNumberList(std::string_view data, std::vector<double> &out, PathError &error);

}  // namespace tessarine::cli
