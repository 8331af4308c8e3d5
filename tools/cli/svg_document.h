// The drawing of an SVG file: the outlines of its shapes, in millimetres with
// y up (the cutter's frame), each an open or closed run of segments.
#pragma once

#include <string>
#include <vector>

namespace tessarine::cli {

struct Point {
    double x;
    double y;
};

// An affine map: x' = a x + c y + e, y' = b x + d y + f.
struct Affine {
    double a = 1, b = 0, c = 0, d = 1, e = 0, f = 0;
    Point Apply(Point p) const { return {a * p.x + c * p.y + e, b * p.x + d * p.y + f}; }
    Affine Then(const Affine &outer) const; // outer after this
};

struct Segment {
    enum Kind { Line, Cubic, EllipseArc } kind;
    Point p[4];    // Line: p[0] to p[1]; Cubic: p[0] to p[3]; EllipseArc: p[0] start, p[3] end
    Affine circle; // EllipseArc: maps the unit circle onto the ellipse, in millimetres
    double theta = 0;  // EllipseArc: start angle and signed sweep on the unit circle
    double sweep = 0;
    Point Start() const { return p[0]; }
    Point End() const { return kind == Line ? p[1] : p[3]; }
};

struct Outline {
    std::vector<Segment> segments;
    bool closed = false;
};

struct Drawing {
    std::vector<Outline> outlines;
    double widthMm = 0;
    double heightMm = 0;
};

// Reads the paths of an SVG file: path (every command), line, polyline,
// polygon, rect, circle, ellipse, in nested g with transform. Throws a
// Failure naming the file for XML errors, bad path data and absurd numbers.
Drawing ReadSvg(const std::string &path);

// The same from text in memory (for tests and fuzzing); `name` is used in messages.
Drawing ParseSvg(const std::string &text, const std::string &name);

// A centre-form elliptical arc from the SVG endpoint form: false when the arc
// is a straight line (a zero radius) or nothing (equal end points).
bool ArcCentreForm(Point from, double rx, double ry, double rotationDegrees, bool large, bool sweep,
                   Point to, Affine &unitCircle, double &theta, double &delta, bool &isLine);

}  // namespace tessarine::cli
