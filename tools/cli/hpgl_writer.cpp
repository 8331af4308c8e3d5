#include "hpgl_writer.h"

#include <cmath>
#include <cstdio>

namespace tessarine::cli {
namespace {

constexpr double kPi = 3.14159265358979323846;

int64_t Unit(double mm) { return std::llround(mm * kUnitsPerMm); }

}  // namespace

void HpglWriter::Begin() { out_ << "IN;\nSP1;\nPA;\n"; }

void HpglWriter::End() { out_ << "PU;\nSP0;\n"; }

void HpglWriter::MoveTo(Point mm) {
    const int64_t x = Unit(mm.x), y = Unit(mm.y);
    out_ << "PU" << x << "," << y << ";\n";
    penX_ = double(x);
    penY_ = double(y);
    ++moves_;
}

void HpglWriter::LineTo(Point mm) {
    const int64_t x = Unit(mm.x), y = Unit(mm.y);
    if (std::llround(penX_) == x && std::llround(penY_) == y) return;
    out_ << "PD" << x << "," << y << ";\n";
    penX_ = double(x);
    penY_ = double(y);
    ++lines_;
}

void HpglWriter::ArcAround(Point centreMm, double sweep) {
    const int64_t cx = Unit(centreMm.x), cy = Unit(centreMm.y);
    char degrees[32];
    std::snprintf(degrees, sizeof degrees, "%.4f", sweep * 180.0 / kPi);
    out_ << "AA" << cx << "," << cy << "," << degrees << ";\n";
    // The plotter turns the pen about the centre by the angle as written.
    const double turn = std::strtod(degrees, nullptr) * kPi / 180.0;
    const double dx = penX_ - double(cx), dy = penY_ - double(cy);
    penX_ = double(cx) + dx * std::cos(turn) - dy * std::sin(turn);
    penY_ = double(cy) + dx * std::sin(turn) + dy * std::cos(turn);
    ++arcs_;
}

}  // namespace tessarine::cli
