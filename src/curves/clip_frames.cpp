// Oriented frames of sub-curves, the frame test and the quartering of a piece.
#include <cmath>

#include "curves/clip.h"

namespace tessarine::curves {

namespace {

double Across(const ClipFrame &f, BZ_Point p) {
    return (p.x - f.origin.x) * f.dir.y - (p.y - f.origin.y) * f.dir.x;
}

double Along(const ClipFrame &f, BZ_Point p) {
    return (p.x - f.origin.x) * f.dir.x + (p.y - f.origin.y) * f.dir.y;
}

int Classify(double v, double low, double high) {
    if (v < low - 1e-10) return -1;
    if (v > high + 1e-10) return 1;
    return 0;
}

// Same class for all four control points.
bool AllIn(const int c[4]) {
    return c[0] == c[1] && c[0] == c[2] && c[0] == c[3];
}

}  // namespace

ClipFrame BuildClipFrame(const BZ_Curve &c) {
    ClipFrame f;
    f.origin = c.p0;
    const BZ_Point w3{c.p3.x - c.p0.x, c.p3.y - c.p0.y};
    const double s = w3.x * w3.x + w3.y * w3.y;
    const double length = std::sqrt(s);
    // A closed piece has no chord to lean on.
    f.dir =
        s >= 1e-16 && length >= 1e-8 ? BZ_Point{w3.x / length, w3.y / length} : BZ_Point{1.0, 0.0};
    const double d1 = Across(f, c.p1), d2 = Across(f, c.p2);
    const double smaller = d1 < d2 ? d1 : d2;
    const double larger = d1 > d2 ? d1 : d2;
    if (!(d1 < 0) && !(d2 < 0)) {
        f.dmin = 0.0;
        f.dmax = 0.75 * larger;
    } else if (!(d1 > 0) && !(d2 > 0)) {
        f.dmin = 0.75 * smaller;
        f.dmax = 0.0;
    } else {
        f.dmin = 0.444444444 * smaller;
        f.dmax = 0.444444444 * larger;
    }
    // The along band looks at these points only, and is narrower than the
    // true one on purpose.
    const double s1 = Along(f, c.p1);
    f.smin = s1 < 0 ? s1 : 0.0;
    const double s2 = Along(f, c.p2), s3 = Along(f, c.p3);
    f.smax = s2 > s3 ? s2 : s3;
    return f;
}

bool FrameTouchesCurve(const ClipFrame &f, const BZ_Curve &c) {
    const BZ_Point p[4] = {c.p0, c.p1, c.p2, c.p3};
    int across[4], along[4];
    for (int i = 0; i < 4; ++i) across[i] = Classify(Across(f, p[i]), f.dmin, f.dmax);
    if (across[0] != 0 && AllIn(across)) return false;
    for (int i = 0; i < 4; ++i) along[i] = Classify(Along(f, p[i]), f.smin, f.smax);
    if (along[0] == 0 || !AllIn(along)) return true;
    return false;
}

void SplitIntoQuarters(const ClipPiece &piece, ClipPiece quarters[4]) {
    const BZ_Curve &P = piece.curve;
    BZ_Curve q;
    q.p0 = P.p0;
    q.p1 = BZ_Point{0.25 * P.p1.x + 0.75 * P.p0.x, 0.25 * P.p1.y + 0.75 * P.p0.y};
    q.p2 = BZ_Point{0.375 * P.p1.x + 0.0625 * P.p2.x + 0.5625 * P.p0.x,
                    0.375 * P.p1.y + 0.0625 * P.p2.y + 0.5625 * P.p0.y};
    q.p3 = BZ_Point{0.140625 * P.p2.x + 0.015625 * P.p3.x + 0.421875 * (P.p0.x + P.p1.x),
                    0.140625 * P.p2.y + 0.015625 * P.p3.y + 0.421875 * (P.p0.y + P.p1.y)};
    quarters[0].curve = q;
    // Each next quarter is extrapolated from the one before; the last end is
    // not reset to P3.
    for (int i = 1; i < 4; ++i) {
        BZ_Curve r;
        r.p0 = q.p3;
        r.p1 = BZ_Point{2 * q.p3.x - q.p2.x, 2 * q.p3.y - q.p2.y};
        r.p2 = BZ_Point{2 * r.p1.x - 2 * q.p2.x + q.p1.x, 2 * r.p1.y - 2 * q.p2.y + q.p1.y};
        r.p3 = BZ_Point{3 * (r.p2.x - r.p1.x) + r.p0.x + 3 * q.p1.x + q.p3.x - 3 * q.p2.x - q.p0.x,
                        3 * (r.p2.y - r.p1.y) + r.p0.y + 3 * q.p1.y + q.p3.y - 3 * q.p2.y - q.p0.y};
        quarters[i].curve = r;
        q = r;
    }
    const double step = (piece.t1 - piece.t0) * 0.25;
    quarters[0].t0 = piece.t0;
    quarters[0].t1 = piece.t0 + step;
    quarters[1].t0 = quarters[0].t1;
    quarters[1].t1 = piece.t0 + 2 * step;
    quarters[2].t0 = quarters[1].t1;
    quarters[2].t1 = piece.t0 + 3 * step;
    quarters[3].t0 = quarters[2].t1;
    quarters[3].t1 = piece.t1;
}

}  // namespace tessarine::curves
