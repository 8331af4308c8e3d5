// Every valid layout through every Get and Set row function that accepts it,
// on every storage route, at every x phase and run length that crosses byte
// edges, against a per-pixel model.
#include <gtest/gtest.h>

#include <optional>
#include <random>
#include <vector>

#include <tessarine/tessarine.h>

#include "row_model.h"
#include "test_support.h"

namespace {

using namespace rowtest;

enum class GetFn { RGB, RGBI, BGRI, CMYK, Index, Gray, BW, BWPacked, PadIndex, PadGray };
enum class SetFn { RGB, RGBI, BGRI, CMYK, Index, Gray, BW, BWPacked };

const char *Name(GetFn f) {
    const char *names[] = {"GetRGBRow", "GetRGBRowInterlace", "GetBGRRowInterlace", "GetCMYKRow",
                           "GetIndexRow", "GetGRow", "GetBWRow", "GetBWPackedRow",
                           "GetPaddedIndexRow", "GetPaddedGRow"};
    return names[static_cast<int>(f)];
}
const char *Name(SetFn f) {
    const char *names[] = {"SetRGBRow", "SetRGBRowInterlace", "SetBGRRowInterlace", "SetCMYKRow",
                           "SetIndexRow", "SetGRow", "SetBWRow", "SetBWPackedRow"};
    return names[static_cast<int>(f)];
}

bool Small(const Layout &l) { return l.d <= 8; }

// --- what the getters give, pixel by pixel -----------------------------------

struct Model {
    const Layout &l;
    const std::vector<uint8_t> &table;
    const Image &img;

    std::array<uint8_t, 3> Rgb(int y, int64_t x0, int64_t i) const {
        const int64_t x = x0 + i;
        if (l.type == 4) {  // 3 bytes a pixel from the run's first byte, whatever the depth
            const uint8_t *p = img.rows[y].data() + (x0 * l.d) / 8 + 3 * i;
            return {p[0], p[1], p[2]};
        }
        const uint32_t v = img.Pixel(y, x);
        if (l.type == 1 || l.d == 1) {
            if (l.type != 3) return v ? std::array<uint8_t, 3>{0, 0, 0} : std::array<uint8_t, 3>{255, 255, 255};
        }
        if (l.type == 2) {
            if (l.d == 4) {
                const auto c = static_cast<uint8_t>(v == 0 ? 255 : static_cast<uint8_t>(~(v << 4)));
                return {c, c, c};
            }
            const auto c = static_cast<uint8_t>(255 - v);
            return {c, c, c};
        }
        return {TableByte(table, 3 * v), TableByte(table, 3 * v + 1), TableByte(table, 3 * v + 2)};
    }
    uint8_t GrayAt(int y, int64_t x) const {
        if (l.type == 4) {
            const uint8_t *p = img.rows[y].data() + x * (l.d / 8);
            if (l.model == 1) return Gray(p[0], p[1], p[2]);
            return static_cast<uint8_t>(p[3] + ((255 - p[3]) * (6 * p[0] + 3 * p[1] + p[2])) / 2550);
        }
        const uint32_t v = img.Pixel(y, x);
        if (l.type == 1 || (l.type == 2 && l.d == 1)) return v ? 255 : 0;
        if (l.type == 2) return static_cast<uint8_t>(l.d == 4 ? v * 17 : v);
        return Gray(TableByte(table, 3 * v), TableByte(table, 3 * v + 1), TableByte(table, 3 * v + 2));
    }

    // Expected output bytes, or nothing when the function refuses the layout.
    std::optional<std::vector<uint8_t>> Get(GetFn f, int y, int32_t x, int32_t n) const {
        std::vector<uint8_t> out;
        switch (f) {
            case GetFn::RGB:
            case GetFn::RGBI:
            case GetFn::BGRI:
                for (int64_t i = 0; i < n; ++i) {
                    auto c = Rgb(y, x, i);
                    if (f == GetFn::BGRI && l.type == 3) std::swap(c[0], c[2]);
                    out.insert(out.end(), c.begin(), c.end());
                }
                return out;
            case GetFn::CMYK:
                if (l.type != 3 && l.type != 4) return std::nullopt;
                for (int64_t i = 0; i < n; ++i) {
                    if (l.type == 4) {
                        const uint8_t *p = img.rows[y].data() + int64_t{x} * 4 + 4 * i;
                        out.insert(out.end(), p, p + 4);
                    } else {
                        const uint32_t v = img.Pixel(y, x + i);
                        for (int k = 0; k < 4; ++k) out.push_back(TableByte(table, 4 * v + k));
                    }
                }
                return out;
            case GetFn::Index:
                if (!Small(l)) return std::nullopt;
                for (int64_t i = 0; i < n; ++i) out.push_back(static_cast<uint8_t>(img.Pixel(y, x + i)));
                return out;
            case GetFn::Gray:
                for (int64_t i = 0; i < n; ++i) out.push_back(GrayAt(y, x + i));
                return out;
            case GetFn::BW: {
                // head from the first byte, whole middle bytes, tail from the last:
                // a run inside one byte gets both head and tail of that byte
                const uint8_t *row = img.rows[y].data() + (x >> 3);
                const int s = x & 7, e = (x + n - 1) & 7;
                const int64_t m = ((x + n - 1) >> 3) - (x >> 3);
                for (int i = s; i < 8; ++i) out.push_back((row[0] >> (7 - i)) & 1);
                for (int64_t j = 1; j < m; ++j)
                    for (int i = 0; i < 8; ++i) out.push_back((row[j] >> (7 - i)) & 1);
                for (int i = 0; i <= e; ++i) out.push_back((row[m] >> (7 - i)) & 1);
                return out;
            }
            case GetFn::BWPacked: {
                const uint8_t *row = img.rows[y].data() + (x >> 3);
                out.assign(row, row + (((x + n - 1) >> 3) - (x >> 3) + 1));
                return out;
            }
            case GetFn::PadIndex:
            case GetFn::PadGray: {
                if (f == GetFn::PadIndex && !Small(l)) return std::nullopt;
                auto at = [&](int64_t px) {
                    return f == GetFn::PadIndex ? static_cast<uint8_t>(img.Pixel(y, px)) : GrayAt(y, px);
                };
                out.push_back(at(x == 0 ? 0 : x - 1));
                for (int64_t i = 0; i < n; ++i) out.push_back(at(x + i));
                out.push_back(at(x + n == img.w ? x + n - 1 : x + n));
                return out;
            }
        }
        return std::nullopt;
    }
};

bool Accepts(GetFn f, const Layout &l) {
    switch (f) {
        case GetFn::BW:
        case GetFn::BWPacked: return l.d == 1;
        case GetFn::CMYK: return !(l.type == 4 && l.model == 1);  // would read past 3-byte pixels
        default: return true;
    }
}

int32_t CallGet(GetFn f, BI_Bitmap *b, int y, int32_t x, int32_t n, std::vector<uint8_t> &out) {
    out.assign(static_cast<size_t>(n) * 4 + 16, 0xA5);
    switch (f) {
        case GetFn::RGB: {
            std::vector<uint8_t> r(n), g(n), bl(n);
            const int32_t s = BI_GetRGBRow(b, y, x, n, r.data(), g.data(), bl.data());
            for (int32_t i = 0; i < n; ++i) {
                out[3 * i] = r[i];
                out[3 * i + 1] = g[i];
                out[3 * i + 2] = bl[i];
            }
            return s;
        }
        case GetFn::RGBI: return BI_GetRGBRowInterlace(b, y, x, n, out.data());
        case GetFn::BGRI: return BI_GetBGRRowInterlace(b, y, x, n, out.data());
        case GetFn::CMYK: {
            std::vector<uint8_t> c(n), m(n), yy(n), k(n);
            const int32_t s = BI_GetCMYKRow(b, y, x, n, c.data(), m.data(), yy.data(), k.data());
            for (int32_t i = 0; i < n; ++i) {
                out[4 * i] = c[i];
                out[4 * i + 1] = m[i];
                out[4 * i + 2] = yy[i];
                out[4 * i + 3] = k[i];
            }
            return s;
        }
        case GetFn::Index: return BI_GetIndexRow(b, y, x, n, out.data());
        case GetFn::Gray: return BI_GetGRow(b, y, x, n, out.data());
        case GetFn::BW: return BI_GetBWRow(b, y, x, n, out.data());
        case GetFn::BWPacked: return BI_GetBWPackedRow(b, y, x, n, out.data());
        case GetFn::PadIndex: return BI_GetPaddedIndexRow(b, y, x, n, out.data());
        case GetFn::PadGray: return BI_GetPaddedGRow(b, y, x, n, out.data());
    }
    return -100;
}

// --- what the setters do, byte by byte ----------------------------------------

bool AcceptsSet(SetFn f, const Layout &l) {
    switch (f) {
        // an RGB table and 3-byte pixels only: three bytes into a 4-byte pixel is no colour
        case SetFn::RGB: return !(l.model == 2 && (l.type == 3 || l.type == 4));
        case SetFn::RGBI:
        case SetFn::BGRI: return l.type == 4 && l.model == 1;
        case SetFn::CMYK: return l.type == 4 && l.model == 2;
        case SetFn::Index:
        case SetFn::Gray: return Small(l);
        case SetFn::BW:
        case SetFn::BWPacked: return l.d == 1;
    }
    return false;
}

uint8_t NearestRgb(const std::vector<uint8_t> &t, int count, int r, int g, int b) {
    int best = 0x7FFFFFFF, index = 0;
    for (int i = 0; i < count; ++i) {
        const int dr = t[3 * i] - r, dg = t[3 * i + 1] - g, db = t[3 * i + 2] - b;
        const int dist = dr * dr + dg * dg + db * db;
        if (dist < best) {
            best = dist;
            index = i;
        }
    }
    return static_cast<uint8_t>(index);
}

// Applies the setter to a copy of a packed row, as it changes the bytes.
void Simulate(SetFn f, const Layout &l, const std::vector<uint8_t> &table, std::vector<uint8_t> &row,
              int32_t x, int32_t n, const std::vector<uint8_t> &in, int32_t width) {
    auto setBit = [&](int64_t p, bool v) { Image::SetPixelOf(row.data(), p, 1, v); };
    switch (f) {
        case SetFn::RGB:
            for (int64_t i = 0; i < n; ++i) {
                const int64_t px = x + i;
                const uint8_t r = in[i], g = in[n + i], b = in[2 * n + i];
                const uint8_t gray = Gray(r, g, b);
                if (l.type == 4) {
                    uint8_t *p = row.data() + int64_t{x} * (l.d / 8) + 3 * i;
                    p[0] = r;
                    p[1] = g;
                    p[2] = b;
                } else if (l.type == 1 || l.d == 1) {
                    if (l.type == 3)
                        setBit(px, NearestRgb(table, l.colors, r, g, b) == 1);
                    else
                        setBit(px, gray >= 128);
                } else if (l.type == 2) {
                    Image::SetPixelOf(row.data(), px, l.d, l.d == 4 ? gray >> 4 : gray);
                } else {
                    Image::SetPixelOf(row.data(), px, l.d, NearestRgb(table, l.colors, r, g, b));
                }
            }
            break;
        case SetFn::RGBI:
        case SetFn::BGRI:
            for (int64_t i = 0; i < n; ++i)
                for (int k = 0; k < 3; ++k)
                    row[3 * (x + i) + k] = in[3 * i + (f == SetFn::BGRI ? 2 - k : k)];
            break;
        case SetFn::CMYK:
            for (int64_t i = 0; i < n; ++i)
                for (int k = 0; k < 4; ++k) row[4 * (x + i) + k] = in[k * n + i];
            break;
        case SetFn::Index:
            for (int64_t i = 0; i < n; ++i) {
                const uint8_t v = in[i] >= l.colors ? 0 : in[i];
                Image::SetPixelOf(row.data(), x + i, l.d, l.d == 1 ? v != 0 : v);
            }
            break;
        case SetFn::Gray:
            for (int64_t i = 0; i < n; ++i) {
                const uint8_t v = in[i];
                Image::SetPixelOf(row.data(), x + i, l.d, l.d == 1 ? v > 127 : l.d == 4 ? v / 17 : v);
            }
            break;
        case SetFn::BW: {
            const int64_t first = x & ~7;
            const int s = x & 7, e = (x + n - 1) & 7;
            const int64_t m = ((x + n - 1) >> 3) - (x >> 3);
            size_t k = 0;
            for (int i = s; i < 8; ++i) setBit(first + i, in[k++] != 0);
            for (int64_t j = 1; j < m; ++j)
                for (int i = 0; i < 8; ++i) setBit(first + 8 * j + i, in[k++] != 0);
            for (int i = 0; i <= e; ++i) setBit(first + 8 * m + i, in[k++] != 0);
            break;
        }
        case SetFn::BWPacked: {
            uint8_t *p = row.data() + (x >> 3);
            const int s = x & 7;
            if (s == 0) {
                for (int64_t i = 0; i < (n + 7) / 8; ++i) p[i] = in[i];
                break;
            }
            const int e = (x + n - 1) & 7;
            const int64_t m = ((x + n - 1) >> 3) - (x >> 3) + 1;
            p[0] = static_cast<uint8_t>(in[0] >> s);
            for (int64_t k = 0; k + 1 < m; ++k)
                p[k + 1] = static_cast<uint8_t>((in[k] << (8 - s)) | (in[k + 1] >> s));
            if ((x >> 3) + m < (width + 7) / 8)  // the byte after the run, in the same row
                p[m] = static_cast<uint8_t>(((in[m - 1] << (8 - s)) | (in[m] >> s)) & (0xFF >> e));
            break;
        }
    }
}

std::vector<uint8_t> Inputs(SetFn f, const Layout &l, const std::vector<uint8_t> &table, int32_t n,
                            std::mt19937 &rng) {
    std::vector<uint8_t> in(static_cast<size_t>(n) * 4 + 16);
    for (auto &v : in) v = static_cast<uint8_t>(rng());
    if (f == SetFn::RGB && l.type == 3) {
        for (int32_t i = 0; i < n; ++i) {
            if (rng() % 5 == 0) continue;  // a colour that is not in the table: the nearest
            const int e = static_cast<int>(rng() % l.colors);
            in[i] = table[3 * e];
            in[n + i] = table[3 * e + 1];
            in[2 * n + i] = table[3 * e + 2];
        }
    }
    if (f == SetFn::Index || f == SetFn::BW)
        for (auto &v : in) v = static_cast<uint8_t>(rng() % 3 == 0 ? 0 : v % 20);
    return in;
}

int32_t CallSet(SetFn f, BI_Bitmap *b, int y, int32_t x, int32_t n, std::vector<uint8_t> in) {
    switch (f) {
        case SetFn::RGB: return BI_SetRGBRow(y, x, n, in.data(), in.data() + n, in.data() + 2 * n, b);
        case SetFn::RGBI: return BI_SetRGBRowInterlace(y, x, n, in.data(), b);
        case SetFn::BGRI: return BI_SetBGRRowInterlace(y, x, n, in.data(), b);
        case SetFn::CMYK:
            return BI_SetCMYKRow(y, x, n, in.data(), in.data() + n, in.data() + 2 * n,
                                 in.data() + 3 * n, b);
        case SetFn::Index: return BI_SetIndexRow(y, x, n, in.data(), b);
        case SetFn::Gray: return BI_SetGRow(y, x, n, in.data(), b);
        case SetFn::BW: return BI_SetBWRow(y, x, n, in.data(), b);
        case SetFn::BWPacked: return BI_SetBWPackedRow(y, x, n, in.data(), b);
    }
    return -100;
}

// Which bytes of the simulated row a route brings to the storage. Bytes
// outside the run's pixels differ from the old row only for the functions
// that write past a run; the routes keep them as far as they save.
void Merge(Route route, const Layout &l, std::vector<uint8_t> &model, const std::vector<uint8_t> &sim,
           int32_t x, int32_t n, int32_t width) {
    const int64_t d = l.d;
    const int64_t rowBytes = (int64_t{width} * d + 7) / 8;
    int64_t lo = 0, hi = rowBytes;
    switch (route) {
        case Route::Memory:
        case Route::Mode2:
        case Route::Mode3: break;
        case Route::Alone:
        case Route::AloneOwnFd:
            lo = (x * d) >> 3;
            hi = ((int64_t{x} + n) * d + 7) >> 3;
            break;
        case Route::Mode1: {  // the window, widened to whole bytes
            int64_t left = x, right = int64_t{x} + n;
            if (d < 8) {
                left = x - ((d * x) & 7) / d;
                const int64_t e = (d * right) & 7;
                if (e != 7) right += (7 - e) / d;
                right = std::min<int64_t>(right, width);
            }
            lo = (left * d) >> 3;
            hi = (right * d + 7) >> 3;
            break;
        }
        case Route::Mode0:  // only the run's own pixels reach the file
            if (d < 8) {
                for (int64_t p = x; p < int64_t{x} + n; ++p)
                    Image::SetPixelOf(model.data(), p, static_cast<int>(d), Image::PixelOf(sim.data(), p, static_cast<int>(d)));
                return;
            }
            lo = (x * d) >> 3;
            hi = ((int64_t{x} + n) * d + 7) >> 3;
            break;
    }
    for (int64_t i = lo; i < std::min(hi, rowBytes); ++i) model[i] = sim[i];
}

class RowRoutes : public tstest::Sandbox {};

constexpr int32_t kWidth = 45;

TEST_F(RowRoutes, EveryGetterOnEveryRouteMatchesTheModel) {
    const std::vector<GetFn> getters = {GetFn::RGB,   GetFn::RGBI, GetFn::BGRI,     GetFn::CMYK,
                                        GetFn::Index, GetFn::Gray, GetFn::BW,       GetFn::BWPacked,
                                        GetFn::PadIndex, GetFn::PadGray};
    const auto runs = Runs(kWidth);
    const int32_t height = static_cast<int32_t>(runs.size());
    uint32_t seed = 1;
    for (const Layout &l : Layouts()) {
        const Image img = RandomImage(kWidth, height, l.d, seed++);
        const auto table = RandomTable(l, seed++);
        const Model model{l, table, img};
        for (Route route : Routes()) {
            BI_Bitmap *b = MakeBitmap(l, route, img, table);
            ASSERT_NE(b, nullptr);
            for (GetFn f : getters) {
                if (!Accepts(f, l)) continue;
                SCOPED_TRACE(std::string(l.name) + " " + RouteName(route) + " " + Name(f));
                ASSERT_EQ(BeginRoute(route, b, 1), TS_OK);
                for (int y = 0; y < height; ++y) {
                    const auto [x, n] = runs[y];
                    std::vector<uint8_t> out;
                    const int32_t s = CallGet(f, b, y, x, n, out);
                    const auto want = model.Get(f, y, x, n);
                    if (!want) {
                        EXPECT_EQ(TS_STATUS(s), -2) << "x " << x << " n " << n;
                        continue;
                    }
                    ASSERT_EQ(s, TS_OK) << "x " << x << " n " << n;
                    ASSERT_EQ(std::vector<uint8_t>(out.begin(), out.begin() + want->size()), *want)
                        << "x " << x << " n " << n;
                }
                HVT_TileFileRowColIOEnd(b);
            }
            BI_DeleteBitmap(&b);
        }
    }
}

TEST_F(RowRoutes, EverySetterOnEveryRouteMatchesTheModel) {
    const std::vector<SetFn> setters = {SetFn::RGB,   SetFn::RGBI, SetFn::BGRI, SetFn::CMYK,
                                        SetFn::Index, SetFn::Gray, SetFn::BW,   SetFn::BWPacked};
    const auto runs = Runs(kWidth);
    const int32_t height = static_cast<int32_t>(runs.size());
    uint32_t seed = 100;
    for (const Layout &l : Layouts()) {
        const auto table = RandomTable(l, seed++);
        for (SetFn f : setters) {
            if (!AcceptsSet(f, l)) continue;
            const Image start = RandomImage(kWidth, height, l.d, seed++);
            std::vector<Image> results;
            for (Route route : Routes()) {
                SCOPED_TRACE(std::string(l.name) + " " + RouteName(route) + " " + Name(f));
                BI_Bitmap *b = MakeBitmap(l, route, start, table);
                ASSERT_NE(b, nullptr);
                Image model = start;
                std::mt19937 rng(seed);  // the same inputs on every route
                ASSERT_EQ(BeginRoute(route, b, 3), TS_OK);
                for (int y = 0; y < height; ++y) {
                    const auto [x, n] = runs[y];
                    const auto in = Inputs(f, l, table, n, rng);
                    ASSERT_EQ(CallSet(f, b, y, x, n, in), TS_OK) << "x " << x << " n " << n;
                    auto sim = model.rows[y];
                    Simulate(f, l, table, sim, x, n, in, kWidth);
                    Merge(route, l, model.rows[y], sim, x, n, kWidth);
                }
                HVT_TileFileRowColIOEnd(b);
                model.MaskTail();
                const Image got = ReadImage(b);
                for (int y = 0; y < height; ++y)
                    ASSERT_EQ(std::vector<uint8_t>(got.rows[y].begin(), got.rows[y].begin() + got.RowBytes()),
                              std::vector<uint8_t>(model.rows[y].begin(), model.rows[y].begin() + got.RowBytes()))
                        << "row " << y << " x " << runs[y].first << " n " << runs[y].second;
                results.push_back(got);
                BI_DeleteBitmap(&b);
            }
            // The run's pixels come out the same whatever the route.
            for (size_t r = 1; r < results.size(); ++r)
                for (int y = 0; y < height; ++y)
                    for (int32_t p = runs[y].first; p < runs[y].first + runs[y].second; ++p)
                        if (l.d <= 8) {
                            ASSERT_EQ(results[r].Pixel(y, p), results[0].Pixel(y, p))
                                << l.name << " " << Name(f) << " route " << r << " row " << y;
                        }
        }
    }
}

}  // namespace
