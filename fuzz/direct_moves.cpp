// Direct copy, direct mask and mask compositing between small bitmaps of any
// layouts and storages, with rectangles and mask points anywhere: the library
// must answer with a status and never reach past the pixels it owns.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include <tessarine/tessarine.h>

#include "fuzz_input.h"

namespace {

using Reader = ByteReader;

struct LayoutChoice {
    uint8_t type, d, model;
    int32_t colors;
};
constexpr LayoutChoice kLayouts[] = {{1, 1, 1, 0}, {2, 4, 1, 0},  {2, 8, 2, 0},  {3, 1, 1, 2},
                                     {3, 4, 1, 11}, {3, 8, 2, 200}, {4, 24, 1, 0}, {4, 32, 2, 0}};

BI_Bitmap *Make(Reader &in) {
    const LayoutChoice &l = kLayouts[in.U8() % (sizeof kLayouts / sizeof kLayouts[0])];
    const int32_t w = 1 + in.U8() % 48, h = 1 + in.U8() % 12;
    const uint8_t storage = (in.U8() & 1) ? 2 : 1;
    std::vector<uint8_t> table(static_cast<size_t>(l.colors) * 4 + 4);
    for (size_t i = 0; i < table.size(); ++i) table[i] = static_cast<uint8_t>(i * 37);
    BI_Bitmap *b = nullptr;
    if (TS_FAILED(BI_CreateBlankBmp(l.type, l.d, w, h, 300, 300, l.model, l.colors, table.data(), &b,
                                    storage, 0, 0, 0)))
        return nullptr;
    if (b->pixelHandle) BI_FillByte(b, in.U8());
    return b;
}

RECT Rect(Reader &in) {
    const int32_t l = in.I16() % 64, t = in.I16() % 16;
    return {l, t, l + in.I16() % 64, t + in.I16() % 16};
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Reader in{data, size};
    BI_Bitmap *a = Make(in), *b = Make(in);
    std::vector<uint8_t> mask(64 * 64);
    uint8_t pattern[64];
    for (auto &p : pattern) p = in.U8();
    for (size_t i = 0; i < mask.size(); ++i) mask[i] = static_cast<uint8_t>(pattern[i % 64] ^ (i / 64 * 29));
    for (int op = 0; op < 6 && in.n > 0 && a && b; ++op) {
        const RECT sr = Rect(in), dr = Rect(in);
        // The mask point stays inside the mask: the mask is the caller's.
        const int32_t mx = in.U8() % 64, my = in.U8() % 16;
        switch (in.U8() % 4) {
            case 0: BI_DirectCopyBmp(&sr, a, &dr, b, 0, 0); break;
            case 1: BI_DirectCopyBmp(&sr, b, &dr, a, 0, 0); break;
            case 2: {
                const RECT fit{sr.left, sr.top, sr.left + ((dr.right - dr.left) & 31), sr.top + ((dr.bottom - dr.top) & 15)};
                BI_DirectMaskBmp(&fit, a, 64, mx, my, mask.data(), &dr, b);
                break;
            }
            default: {
                const RECT fit{sr.left, sr.top, sr.left + (sr.right - sr.left) % 32, sr.top + (sr.bottom - sr.top) % 16};
                const std::vector<uint8_t> before = mask;
                BI_MaskBmp(&fit, a, 64, mx, my, mask.data(), &dr, b);
                if (mask != before) __builtin_trap();
            }
        }
    }
    if (a) BI_DeleteBitmap(&a);
    if (b) BI_DeleteBitmap(&b);
    return 0;
}
