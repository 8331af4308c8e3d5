// Rectangles of pixels between a caller's buffer and the tiles of a
// sub-bitmap. The plain forms move whole bytes; the bit-shift forms keep exact
// pixel edges below 8 bits per pixel.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <algorithm>
#include <cstring>

#include "core/status.h"
#include "storage/raw_file.h"
#include "storage/tile_format.h"

namespace ts = tessarine::storage;
using tessarine::Failed;
using tessarine::kErrArgument;
using tessarine::kErrFileAccess;
using tessarine::kOk;

namespace {

struct Span {
    int32_t offset;  // file offset of the first row
    int32_t rowBytes;
    int32_t rows;
};

// Where the rows [I.top, I.bottom) of a tile lie in the file, or false when a
// hostile table puts them outside a 32-bit file.
bool RowsOf(const HVT_TileHdr &t, int32_t d, const HVT_Box &I, Span *span) {
    const int64_t rowBytes = ts::TileRowBytes(t, d);
    const int64_t at = t.offset + rowBytes * (int64_t{I.top} - t.top);
    if (at > INT32_MAX) return false;
    *span = {static_cast<int32_t>(at), static_cast<int32_t>(rowBytes), I.bottom - I.top};
    return true;
}

int32_t ReadRows(int32_t fd, const Span &s, uint8_t *to) {
    return FM_SeekAndRead(fd, s.offset, 0, to, static_cast<uint32_t>(s.rowBytes) * s.rows);
}

int32_t WriteRows(int32_t fd, const Span &s, const uint8_t *from) {
    return FM_SeekAndWrite(fd, s.offset, 0, from, static_cast<uint32_t>(s.rowBytes) * s.rows);
}

// Walks the tiles that the box meets, band by band from the top, left to
// right in a band, and calls visit(tile, intersection) for each. The walk
// stays inside the table: the parts of a box past the last tile column or
// row, or left of or above the image, find nothing.
template <class Visit>
int32_t ForEachTile(uint8_t sub, HVT_FileInfo *info, const HVT_Box &box, Visit &&visit) {
    const int32_t status = HVT_GetSubbmpTileHdrs(sub, info);
    if (Failed(status)) return status;
    const HVT_SubbmpSlot &slot = info->subbmps[sub];
    const int64_t across = slot.tilesAcross;
    const int64_t down = slot.tilesDown;
    if (across <= 0 || down <= 0) return kOk;
    const int32_t d = info->header->bitsPerPixel;
    const int64_t colLo = std::max<int64_t>(box.left / ts::kTileWidth, 0);
    const int64_t colHi = std::min<int64_t>((int64_t{box.right} - 1) / ts::kTileWidth, across - 1);
    if (colLo > colHi) return kOk;
    for (int64_t row = std::max<int64_t>(box.top / ts::kTileHeight, 0); row < down; ++row) {
        const HVT_TileHdr *band = slot.tileHdrs + row * across;
        if (!(band[colLo].top < box.bottom)) break;
        for (int64_t col = colLo; col <= colHi; ++col) {
            const HVT_TileHdr &t = band[col];
            const HVT_Box I{std::max(t.left, box.left), std::max(t.top, box.top),
                            std::min(t.right, box.right), std::min(t.bottom, box.bottom)};
            if (!(I.left < I.right && I.top < I.bottom)) continue;
            if (!ts::UsableTile(t, d)) return kErrFileAccess;
            const int32_t s = visit(t, I);
            if (Failed(s)) return s;
        }
    }
    return kOk;
}

inline uint8_t ByteAt(const uint8_t *s, int64_t length, int64_t i) {
    return i >= 0 && i < length ? s[i] : 0;
}

// Eight source bits from bit `pos` on, high bit first; bits outside the
// source's `length` bytes read as 0.
inline uint8_t Fetch8(const uint8_t *s, int64_t length, int64_t pos) {
    const int64_t i = pos >> 3;
    const unsigned window = unsigned{ByteAt(s, length, i)} << 8 | ByteAt(s, length, i + 1);
    return static_cast<uint8_t>(window >> (8 - (pos & 7)));
}

// Copies `bits` bits (at least 1) from bit `from` of the source to bit `to` of
// the destination, high bits first. Destination bits before the start in the
// first byte and after the end in the last byte keep their values.
void CopyBits(const uint8_t *src, int64_t srcLength, int64_t from, uint8_t *dst, int64_t to,
              int64_t bits) {
    const int64_t first = to >> 3;
    const int64_t end = to + bits;
    const int64_t last = (end - 1) >> 3;
    const int phase = static_cast<int>(to & 7);
    const int endPhase = static_cast<int>(end & 7);
    const auto keepFirst = static_cast<uint8_t>(0xFF << (8 - phase));
    const auto keepLast = static_cast<uint8_t>(endPhase ? ~(0xFF << (8 - endPhase)) : 0);
    const int64_t pos = from - phase;  // the source bit that lands on the top of dst[first]
    if (first == last) {
        const auto keep = static_cast<uint8_t>(keepFirst | keepLast);
        dst[first] = static_cast<uint8_t>((dst[first] & keep) | (Fetch8(src, srcLength, pos) & ~keep));
        return;
    }
    dst[first] = static_cast<uint8_t>((dst[first] & keepFirst) |
                                      (Fetch8(src, srcLength, pos) & ~keepFirst));
    // Whole bytes between the edges; their source bits all lie in the span.
    const int64_t middle = last - first - 1;
    const int64_t at = pos + 8;
    uint8_t *out = dst + first + 1;
    const uint8_t *in = src + (at >> 3);
    const int shift = static_cast<int>(at & 7);
    if (shift == 0) {
        std::memcpy(out, in, static_cast<size_t>(middle));
    } else {
        for (int64_t j = 0; j < middle; ++j)
            out[j] = static_cast<uint8_t>((in[j] << shift) | (in[j + 1] >> (8 - shift)));
    }
    const uint8_t tail = Fetch8(src, srcLength, pos + (last - first) * 8);
    dst[last] = static_cast<uint8_t>((dst[last] & keepLast) | (tail & ~keepLast));
}

struct Transfer {
    uint8_t sub;
    HVT_FileInfo *info;
    HVT_Box box;
    int64_t stride;
    int32_t d;
};

int32_t ReadBlockPlain(const Transfer &x, uint8_t *buffer) {
    const int32_t fd = x.info->descriptor;
    uint8_t *const tileBuffer = x.info->tileBuffer;
    return ForEachTile(x.sub, x.info, x.box, [&](const HVT_TileHdr &t, const HVT_Box &I) {
        Span span;
        if (!RowsOf(t, x.d, I, &span)) return kErrFileAccess;
        const int64_t srcSkip = ((int64_t{I.left} - t.left) * x.d) >> 3;
        const int64_t n = ((int64_t{I.right} * x.d + 7) >> 3) - ((int64_t{I.left} * x.d) >> 3);
        uint8_t *dst = buffer + (int64_t{I.top} - x.box.top) * x.stride +
                       ((int64_t{I.left} - x.box.left) * x.d) / 8;
        if (srcSkip == 0 && n == span.rowBytes)  // whole tile rows: straight into place
            return ts::FM_SeekAndReadRows(fd, span.offset, dst, x.stride,
                                          static_cast<uint32_t>(n), static_cast<uint32_t>(span.rows));
        const int32_t status = ReadRows(fd, span, tileBuffer);
        if (Failed(status)) return status;
        const uint8_t *src = tileBuffer + srcSkip;
        for (int32_t r = 0; r < span.rows; ++r, src += span.rowBytes, dst += x.stride)
            std::memcpy(dst, src, static_cast<size_t>(n));
        return kOk;
    });
}

int32_t SaveBlockPlain(const Transfer &x, const uint8_t *buffer) {
    const int32_t fd = x.info->descriptor;
    uint8_t *const tileBuffer = x.info->tileBuffer;
    return ForEachTile(x.sub, x.info, x.box, [&](const HVT_TileHdr &t, const HVT_Box &I) {
        Span span;
        if (!RowsOf(t, x.d, I, &span)) return kErrFileAccess;
        const int64_t dstSkip = ((int64_t{I.left} - t.left) * x.d) >> 3;
        const int64_t n = ((int64_t{I.right} * x.d + 7) >> 3) - ((int64_t{I.left} * x.d) >> 3);
        const uint8_t *src = buffer + (int64_t{I.top} - x.box.top) * x.stride +
                             ((int64_t{I.left} - x.box.left) * x.d) / 8;
        const bool wholeWidth = I.left == t.left && I.right == t.right;
        if (wholeWidth && dstSkip == 0 && n == span.rowBytes)  // no read, no copy
            return ts::FM_SeekAndWriteRows(fd, span.offset, src, x.stride,
                                           static_cast<uint32_t>(n), static_cast<uint32_t>(span.rows));
        if (!wholeWidth) {  // keep the rest of those tile rows
            const int32_t status = ReadRows(fd, span, tileBuffer);
            if (Failed(status)) return status;
        }
        uint8_t *dst = tileBuffer + dstSkip;
        for (int32_t r = 0; r < span.rows; ++r, dst += span.rowBytes, src += x.stride)
            std::memcpy(dst, src, static_cast<size_t>(n));
        return WriteRows(fd, span, tileBuffer);
    });
}

int32_t ReadBlockShifted(const Transfer &x, uint8_t *buffer) {
    const int32_t fd = x.info->descriptor;
    uint8_t *const tileBuffer = x.info->tileBuffer;
    return ForEachTile(x.sub, x.info, x.box, [&](const HVT_TileHdr &t, const HVT_Box &I) {
        Span span;
        if (!RowsOf(t, x.d, I, &span)) return kErrFileAccess;
        const int32_t status = ReadRows(fd, span, tileBuffer);
        if (Failed(status)) return status;
        const int64_t from = (int64_t{I.left} - t.left) * x.d;
        const int64_t to = (int64_t{I.left} - x.box.left) * x.d;
        int64_t bits = (int64_t{I.right} - I.left) * x.d;
        // The first destination byte is always finished from the source.
        bits = std::max<int64_t>(bits, 8 - (to & 7));
        const uint8_t *src = tileBuffer;
        uint8_t *dst = buffer + (int64_t{I.top} - x.box.top) * x.stride;
        for (int32_t r = 0; r < span.rows; ++r, src += span.rowBytes, dst += x.stride)
            CopyBits(src, span.rowBytes, from, dst, to, bits);
        return kOk;
    });
}

int32_t SaveBlockShifted(const Transfer &x, const uint8_t *buffer) {
    const int32_t fd = x.info->descriptor;
    uint8_t *const tileBuffer = x.info->tileBuffer;
    // The buffer holds the box's first pixel where it sits in a byte of a
    // full image row.
    const int64_t p = (int64_t{x.box.left} * x.d) & 7;
    return ForEachTile(x.sub, x.info, x.box, [&](const HVT_TileHdr &t, const HVT_Box &I) {
        Span span;
        if (!RowsOf(t, x.d, I, &span)) return kErrFileAccess;
        if (!(I.left == t.left && I.right == t.right)) {
            const int32_t status = ReadRows(fd, span, tileBuffer);
            if (Failed(status)) return status;
        }
        const int64_t from = (int64_t{I.left} - x.box.left) * x.d + p;
        const int64_t to = (int64_t{I.left} - t.left) * x.d;
        const int64_t bits = (int64_t{I.right} - I.left) * x.d;
        const int64_t srcLength = (from + bits + 7) >> 3;
        const uint8_t *src = buffer + (int64_t{I.top} - x.box.top) * x.stride;
        uint8_t *dst = tileBuffer;
        for (int32_t r = 0; r < span.rows; ++r, dst += span.rowBytes, src += x.stride)
            CopyBits(src, srcLength, from, dst, to, bits);
        return WriteRows(fd, span, tileBuffer);
    });
}

// The common checks; false when the record cannot serve the sub-bitmap.
bool Prepare(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box, int32_t stride, Transfer *x) {
    if (sub >= ts::kMaxSubbmps || info->header == nullptr) return false;
    *x = {sub, info, *box, stride, info->header->bitsPerPixel};
    return true;
}

}  // namespace

extern "C" {

TESSARINE_API int32_t HVT_ReadBlock(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box,
                                    int32_t stride, void *buffer) {
    Transfer x;
    if (!Prepare(sub, info, box, stride, &x)) return kErrArgument;
    return ReadBlockPlain(x, static_cast<uint8_t *>(buffer));
}

TESSARINE_API int32_t HVT_SaveBlock(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box,
                                    int32_t stride, const void *buffer) {
    Transfer x;
    if (!Prepare(sub, info, box, stride, &x)) return kErrArgument;
    return SaveBlockPlain(x, static_cast<const uint8_t *>(buffer));
}

TESSARINE_API int32_t HVT_ReadBlockWithBitShift(uint8_t sub, HVT_FileInfo *info,
                                                const HVT_Box *box, int32_t stride, void *buffer) {
    Transfer x;
    if (!Prepare(sub, info, box, stride, &x)) return kErrArgument;
    if (x.d >= 8 || (int64_t{box->left} * x.d) % 8 == 0)
        return HVT_ReadBlock(sub, info, box, stride, buffer);
    return ReadBlockShifted(x, static_cast<uint8_t *>(buffer));
}

TESSARINE_API int32_t HVT_SaveBlockWithBitShift(uint8_t sub, HVT_FileInfo *info,
                                                const HVT_Box *box, int32_t stride,
                                                const void *buffer) {
    Transfer x;
    if (!Prepare(sub, info, box, stride, &x)) return kErrArgument;
    const bool leftAligned = (int64_t{box->left} * x.d) % 8 == 0;
    const bool rightAligned = (int64_t{box->right} * x.d) % 8 == 0;
    if (x.d >= 8 || (leftAligned && (rightAligned || box->right == info->subbmps[sub].width)))
        return HVT_SaveBlock(sub, info, box, stride, buffer);
    return SaveBlockShifted(x, static_cast<const uint8_t *>(buffer));
}

}  // extern "C"
