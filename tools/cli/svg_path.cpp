#include "svg_path.h"

#include <charconv>
#include <cmath>
#include <cstdlib>
#include <string>

namespace tessarine::cli {
namespace {

bool IsSpace(char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r' || c == '\f'; }
bool IsDigit(char c) { return c >= '0' && c <= '9'; }

class Scanner {
  public:
    explicit Scanner(std::string_view s) : s_(s) {}
    size_t Pos() const { return i_; }
    bool AtEnd() const { return i_ >= s_.size(); }
    char Peek() const { return AtEnd() ? '\0' : s_[i_]; }
    void Next() { ++i_; }
    void SkipSpace() {
        while (!AtEnd() && IsSpace(s_[i_])) ++i_;
    }
    // White space, at most one comma, white space. True when a comma was passed.
    bool SkipSeparator() {
        SkipSpace();
        if (Peek() != ',') return false;
        ++i_;
        SkipSpace();
        return true;
    }
    bool StartsNumber() const {
        const char c = Peek();
        return IsDigit(c) || c == '.' || c == '-' || c == '+';
    }

    // A number of the grammar: sign, digits with an optional fraction, exponent.
    bool Number(double &value, std::string &why) {
        const size_t start = i_;
        size_t j = i_;
        if (j < s_.size() && (s_[j] == '+' || s_[j] == '-')) ++j;
        size_t digits = 0;
        while (j < s_.size() && IsDigit(s_[j])) ++j, ++digits;
        if (j < s_.size() && s_[j] == '.') {
            ++j;
            while (j < s_.size() && IsDigit(s_[j])) ++j, ++digits;
        }
        if (digits == 0) {
            why = "a number was expected";
            return false;
        }
        if (j < s_.size() && (s_[j] == 'e' || s_[j] == 'E')) {
            size_t k = j + 1;
            if (k < s_.size() && (s_[k] == '+' || s_[k] == '-')) ++k;
            if (k < s_.size() && IsDigit(s_[k])) {
                while (k < s_.size() && IsDigit(s_[k])) ++k;
                j = k;
            }
        }
        const char *first = s_.data() + start + (s_[start] == '+' ? 1 : 0);
        const auto result = std::from_chars(first, s_.data() + j, value);
        if (result.ec == std::errc::result_out_of_range) {
            // Underflow is harmless and reads as zero; overflow is not.
            const std::string text(first, s_.data() + j);
            value = std::strtod(text.c_str(), nullptr);
            if (!std::isfinite(value)) {
                why = "number out of range";
                return false;
            }
        } else if (result.ec != std::errc() || result.ptr != s_.data() + j || !std::isfinite(value)) {
            why = "bad number";
            return false;
        }
        i_ = j;
        return true;
    }

    bool Flag(double &value, std::string &why) {
        const char c = Peek();
        if (c != '0' && c != '1') {
            why = "an arc flag (0 or 1) was expected";
            return false;
        }
        value = c == '1' ? 1.0 : 0.0;
        ++i_;
        return true;
    }

  private:
    std::string_view s_;
    size_t i_ = 0;
};

int ArgumentCount(char upper) {
    switch (upper) {
        case 'M': case 'L': case 'T': return 2;
        case 'H': case 'V': return 1;
        case 'C': return 6;
        case 'S': case 'Q': return 4;
        case 'A': return 7;
        case 'Z': return 0;
        default: return -1;
    }
}

}  // namespace

bool ParsePathData(std::string_view data, std::vector<PathCommand> &out, PathError &error) {
    Scanner in(data);
    char command = '\0';
    double cx = 0, cy = 0;         // current point
    double sx = 0, sy = 0;         // start of the subpath
    double lastCx = 0, lastCy = 0; // last control point of a cubic or quad
    char lastKind = '\0';          // 'C' or 'Q' when the last segment was one
    auto fail = [&](size_t at, const std::string &why) {
        error.offset = at;
        error.what = why;
        return false;
    };

    in.SkipSpace();
    while (!in.AtEnd()) {
        const size_t at = in.Pos();
        char c = in.Peek();
        if (ArgumentCount(char(c & ~0x20)) >= 0 && (c & ~0x20) != 'E' && !(IsDigit(c))) {
            command = c;
            in.Next();
            in.SkipSpace();
        } else if (command == '\0') {
            return fail(at, "path data must begin with a moveto (M or m)");
        } else if (command == 'Z' || command == 'z') {
            return fail(at, "a command was expected");
        } else if (!in.StartsNumber()) {
            return fail(at, std::string("unexpected character '") + c + "'");
        }
        if (out.empty() && command != 'M' && command != 'm')
            return fail(at, "path data must begin with a moveto (M or m)");
        const char upper = char(command & ~0x20);
        const bool relative = command != upper;
        const int count = ArgumentCount(upper);
        double a[7] = {};
        std::string why;
        for (int k = 0; k < count; ++k) {
            if (k > 0) in.SkipSeparator();
            const size_t argAt = in.Pos();
            const bool ok = upper == 'A' && (k == 3 || k == 4) ? in.Flag(a[k], why) : in.Number(a[k], why);
            if (!ok) return fail(argAt, why);
        }
        const size_t commaAt = in.Pos();
        if (in.SkipSeparator() && (in.AtEnd() || !in.StartsNumber()))
            return fail(commaAt, "a number was expected after ','");

        PathCommand p{};
        const double ox = relative ? cx : 0, oy = relative ? cy : 0;
        switch (upper) {
            case 'M':
                p = {PathCommand::Move, {a[0] + ox, a[1] + oy}};
                sx = p.v[0];
                sy = p.v[1];
                command = relative ? 'l' : 'L'; // further pairs are lines
                break;
            case 'L': p = {PathCommand::Line, {a[0] + ox, a[1] + oy}}; break;
            case 'H': p = {PathCommand::Line, {a[0] + ox, cy}}; break;
            case 'V': p = {PathCommand::Line, {cx, a[0] + oy}}; break;
            case 'C':
                p = {PathCommand::Cubic, {a[0] + ox, a[1] + oy, a[2] + ox, a[3] + oy, a[4] + ox, a[5] + oy}};
                break;
            case 'S': {
                const double rx = lastKind == 'C' ? 2 * cx - lastCx : cx;
                const double ry = lastKind == 'C' ? 2 * cy - lastCy : cy;
                p = {PathCommand::Cubic, {rx, ry, a[0] + ox, a[1] + oy, a[2] + ox, a[3] + oy}};
                break;
            }
            case 'Q': p = {PathCommand::Quad, {a[0] + ox, a[1] + oy, a[2] + ox, a[3] + oy}}; break;
            case 'T': {
                const double rx = lastKind == 'Q' ? 2 * cx - lastCx : cx;
                const double ry = lastKind == 'Q' ? 2 * cy - lastCy : cy;
                p = {PathCommand::Quad, {rx, ry, a[0] + ox, a[1] + oy}};
                break;
            }
            case 'A':
                p = {PathCommand::Arc, {a[0], a[1], a[2], a[3], a[4], a[5] + ox, a[6] + oy}};
                break;
            case 'Z': p = {PathCommand::Close, {sx, sy}}; break;
            default: return fail(at, "unknown command");
        }
        for (double v : p.v)
            if (!std::isfinite(v)) return fail(at, "number out of range");
        out.push_back(p);
        lastKind = '\0';
        switch (p.kind) {
            case PathCommand::Move:
            case PathCommand::Line:
            case PathCommand::Close: cx = p.v[0]; cy = p.v[1]; break;
            case PathCommand::Cubic:
                lastCx = p.v[2];
                lastCy = p.v[3];
                lastKind = 'C';
                cx = p.v[4];
                cy = p.v[5];
                break;
            case PathCommand::Quad:
                lastCx = p.v[0];
                lastCy = p.v[1];
                lastKind = 'Q';
                cx = p.v[2];
                cy = p.v[3];
                break;
            case PathCommand::Arc: cx = p.v[5]; cy = p.v[6]; break;
        }
    }
    return true;
}

bool ParseNumberList(std::string_view data, std::vector<double> &out, PathError &error) {
    Scanner in(data);
    in.SkipSpace();
    while (!in.AtEnd()) {
        const size_t at = in.Pos();
        double v = 0;
        std::string why;
        if (!in.StartsNumber() || !in.Number(v, why)) {
            error.offset = at;
            error.what = why.empty() ? "a number was expected" : why;
            return false;
        }
        out.push_back(v);
        in.SkipSeparator();
    }
    return true;
}

}  // namespace tessarine::cli
