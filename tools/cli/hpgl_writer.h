// Cutter commands in HPGL: IN, SP, PA, PU, PD and AA, in plotter units of
// 0.025 mm (40 to the millimetre) with y up. The pen position is followed as
// the plotter follows it, so that an arc starts where the pen really is.
#pragma once

#include <cstdint>
#include <ostream>

#include "svg_document.h"

namespace tessarine::cli {

inline constexpr double kUnitsPerMm = 40.0;
// Largest distance from a drawn point to where it was meant to be, in mm,
// once coordinates are rounded to units: one point, and an arc's centre and start.
inline constexpr double kPointRounding = 0.0177;
inline constexpr double kArcRounding = 0.0375;

class HpglWriter {
  public:
    explicit HpglWriter(std::ostream &out) : out_(out) {}
    void Begin();
    void End();
    void MoveTo(Point mm);
    // A line to the point, unless the pen is there already.
    void LineTo(Point mm);
    // An arc about the centre from where the pen is, turning by the sweep
    // (radians, counter-clockwise positive).
    void ArcAround(Point centreMm, double sweep);
    // The pen in millimetres.
    Point Pen() const { return {penX_ / kUnitsPerMm, penY_ / kUnitsPerMm}; }

    int64_t Moves() const { return moves_; }
    int64_t Lines() const { return lines_; }
    int64_t Arcs() const { return arcs_; }

  private:
    std::ostream &out_;
    double penX_ = 0, penY_ = 0; // units, as the plotter computes them
    int64_t moves_ = 0, lines_ = 0, arcs_ = 0;
};

}  // namespace tessarine::cli
