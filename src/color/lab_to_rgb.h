// Steps shared by the two formulas that go through Lab: from the Lab cube
// root f to X and Z, and from XYZ (Y from 0 to 100) to linear RGB.
#pragma once

namespace tessarine::color {

inline double Cube(double t) {
    return t * t * t;
}

// Inverse of the Lab companding around the white point's cube root.
inline double LabInverse(double t) {
    return t <= 0.2069 ? (t - 0.137931) * 0.1284191601386927 : Cube(t);
}

struct LinearRgb {
    double r, g, b;
};

inline LinearRgb XyzFromLabToLinearRgb(double f, double a, double b, double Y) {
    const double fx = f + a * 0.002;
    const double fz = f - b * 0.005;
    double X = 95.04 * LabInverse(fx);
    double Z = 108.89 * LabInverse(fz);
    if (X < 0) X = 0;
    if (Z < 0) Z = 0;
    return {X * 0.03241 - Y * 0.015374 - Z * 0.004986, Y * 0.01876 + Z * 0.000416 - X * 0.009692,
            X * 0.000556 - Y * 0.00204 + Z * 0.01057};
}

inline double Clamp01(double v) {
    if (v <= 0) return 0;
    if (v > 1) return 1;
    return v;
}

}  // namespace tessarine::color
