// Row functions on bitmaps of any layout, with runs anywhere: the library
// must refuse what lies outside the pixels, never reach past them.
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
constexpr LayoutChoice kLayouts[] = {{1, 1, 1, 0},  {2, 1, 1, 0},  {2, 4, 1, 0},   {2, 8, 2, 0},
                                     {3, 1, 1, 2},  {3, 4, 1, 11}, {3, 8, 2, 200}, {4, 24, 1, 0},
                                     {4, 32, 2, 0}, {3, 4, 2, 3}};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Reader in{data, size};
    const LayoutChoice &l = kLayouts[in.U8() % (sizeof kLayouts / sizeof kLayouts[0])];
    const int32_t w = 1 + in.U8() % 40, h = 1 + in.U8() % 12;
    const uint8_t storage = (in.U8() & 1) ? 2 : 1;
    std::vector<uint8_t> table(static_cast<size_t>(l.colors) * 4 + 4);
    for (auto &t : table) t = in.U8();
    BI_Bitmap *b = nullptr;
    if (TS_FAILED(BI_CreateBlankBmp(l.type, l.d, w, h, 300, 300, l.model, l.colors, table.data(), &b,
                                    storage, 0, 0, 0)))
        return 0;
    if (b->pixelHandle) std::memset(MEM_Lock(b->pixelHandle), 0, MEM_HdlSize(b->pixelHandle)), MEM_Unlock(b->pixelHandle);
    if (in.U8() & 1) MakeColorTableIndex(b);
    if (storage == 2 && (in.U8() & 1)) {
        const HVT_Box box{in.I16() % 50, in.I16() % 20, in.I16() % 60, in.I16() % 20};
        HVT_TileFileRowIOBegin(static_cast<uint8_t>(1 + in.U8() % 3), b, (in.U8() & 1) ? &box : nullptr,
                               in.U8() % 5, 0, in.I16() * 64);
    }
    for (int op = 0; op < 16 && in.n > 0; ++op) {
        const uint8_t f = in.U8() % 19;
        const int32_t y = in.I16() % 20, x = in.I16() % 50, count = in.I16() % 60;
        const size_t room = static_cast<size_t>(count > 0 ? count : 0) * 4 + 16;
        std::vector<uint8_t> a(room, in.U8()), c(room), e(room), k(room);
        switch (f) {
            case 0: BI_GetRGBRow(b, y, x, count, a.data(), c.data(), e.data()); break;
            case 1: BI_GetRGBRowInterlace(b, y, x, count, a.data()); break;
            case 2: BI_GetBGRRowInterlace(b, y, x, count, a.data()); break;
            case 3: BI_GetCMYKRow(b, y, x, count, a.data(), c.data(), e.data(), k.data()); break;
            case 4: BI_GetIndexRow(b, y, x, count, a.data()); break;
            case 5: BI_GetGRow(b, y, x, count, a.data()); break;
            case 6: BI_GetBWRow(b, y, x, count, a.data()); break;
            case 7: BI_GetBWPackedRow(b, y, x, count, a.data()); break;
            case 8: BI_GetPaddedIndexRow(b, y, x, count, a.data()); break;
            case 9: BI_GetPaddedGRow(b, y, x, count, a.data()); break;
            case 10: BI_SetRGBRow(y, x, count, a.data(), c.data(), e.data(), b); break;
            case 11: BI_SetRGBRowInterlace(y, x, count, a.data(), b); break;
            case 12: BI_SetBGRRowInterlace(y, x, count, a.data(), b); break;
            case 13: BI_SetCMYKRow(y, x, count, a.data(), c.data(), e.data(), k.data(), b); break;
            case 14: BI_SetIndexRow(y, x, count, a.data(), b); break;
            case 15: BI_SetGRow(y, x, count, a.data(), b); break;
            case 16: BI_SetBWRow(y, x, count, a.data(), b); break;
            case 17: BI_SetBWPackedRow(y, x, count, a.data(), b); break;
            default: {
                uint8_t map[256];
                BI_GetMapTable(b, b, map);
                break;
            }
        }
    }
    HVT_TileFileRowColIOEnd(b);
    BI_DeleteBitmap(&b);
    return 0;
}
