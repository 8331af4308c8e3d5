// Rectangles of pixels between a caller's buffer and the tiles of a
// sub-bitmap. The plain forms move whole bytes; the bit-shift forms keep exact
// pixel edges below 8 bits per pixel.
#include <tessarine/core.h>
#include <tessarine/storage.h>

#include <algorithm>
#include <cstring>

#include "core/status.h"
#include "storage/bit_copy.h"
#include "storage/raw_file.h"
#include "storage/tile_format.h"
#include "storage/tile_walk.h"
#include "storage/tile_transfer.h"

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

struct Transfer {
    uint8_t sub;
    HVT_FileInfo *info;
    HVT_Box box;
    int64_t stride;
    int32_t d;

    ts::TileWalk Walk() const { return ts::TileWalk(info->subbmps[sub], box, d); }
    // Bytes a row of I moves in the plain forms.
    int64_t PlainBytes(const HVT_Box &I) const {
        return ((int64_t{I.right} * d + 7) >> 3) - ((int64_t{I.left} * d) >> 3);
    }
    // Offset of I's first byte in the caller's buffer.
    int64_t CallerOffset(const HVT_Box &I) const {
        return (int64_t{I.top} - box.top) * stride + ((int64_t{I.left} - box.left) * d) / 8;
    }
};

// A plain read of a tile whose rows lie whole in the caller's buffer, each
// row in a place of its own, goes there straight from the file.
bool ReadsStraight(const Transfer &x, const HVT_TileHdr &t, const HVT_Box &I, const Span &span) {
    const int64_t n = x.PlainBytes(I);
    return I.left == t.left && n == span.rowBytes &&
           (span.rows == 1 || x.stride >= n || x.stride <= -n);
}

// A plain save of whole tile rows goes to the file straight from the caller.
bool SavesStraight(const Transfer &x, const HVT_TileHdr &t, const HVT_Box &I, const Span &span) {
    return I.left == t.left && I.right == t.right && x.PlainBytes(I) == span.rowBytes;
}

// The straight paths leave tileBuffer alone, where the walk of the plain
// forms leaves each tile's rows in it; and a later shifted read takes the
// bits behind a short span from tileBuffer as it lies. So after a walk that
// went straight, the bytes its last tiles would have left there are laid
// down from the caller's rows: a later tile covers the start of the buffer,
// an earlier one only what lies past that.
using StraightTest = bool (*)(const Transfer &, const HVT_TileHdr &, const HVT_Box &, const Span &);

void SettleTileBuffer(const Transfer &x, const uint8_t *callerRows, StraightTest straight,
                      int64_t from = 0) {
    uint8_t *const tileBuffer = x.info->tileBuffer;
    int64_t covered = from;
    (void)x.Walk().Backward([&](const HVT_TileHdr &t, const HVT_Box &I) {
        Span span;
        if (!RowsOf(t, x.d, I, &span)) return kErrFileAccess;
        const int64_t T = span.rowBytes;
        const int64_t extent = T * span.rows;
        if (extent <= covered) return kOk;
        if (straight(x, t, I, span)) {
            const uint8_t *rows = callerRows + x.CallerOffset(I);
            for (int64_t at = covered; at < extent;) {
                const int64_t r = at / T, c = at % T, n = std::min(T - c, extent - at);
                std::memcpy(tileBuffer + at, rows + r * x.stride + c, static_cast<size_t>(n));
                at += n;
            }
        }
        covered = extent;
        return kOk;
    });
}

// The bytes a walk leaves at the start of tileBuffer: its largest tile extent.
int64_t WalkExtent(const Transfer &x) {
    int64_t extent = 0;
    (void)x.Walk().Forward([&](const HVT_TileHdr &t, const HVT_Box &I) {
        extent = std::max(extent, ts::TileRowBytes(t, x.d) * (int64_t{I.bottom} - I.top));
        return kOk;
    });
    return extent;
}

// Reads the box; *wentStraight tells whether some tile skipped tileBuffer,
// which is then owed its bytes.
int32_t ReadBlockPlainOwing(const Transfer &x, uint8_t *buffer, bool *wentStraightOut) {
    const int32_t fd = x.info->descriptor;
    uint8_t *const tileBuffer = x.info->tileBuffer;
    bool &wentStraight = *wentStraightOut;
    wentStraight = false;
    const int32_t status = x.Walk().Forward([&](const HVT_TileHdr &t, const HVT_Box &I) {
        Span span;
        if (!RowsOf(t, x.d, I, &span)) return kErrFileAccess;
        const int64_t srcSkip = ((int64_t{I.left} - t.left) * x.d) >> 3;
        const int64_t n = x.PlainBytes(I);
        uint8_t *dst = buffer + x.CallerOffset(I);
        if (ReadsStraight(x, t, I, span)) {
            wentStraight = true;
            return ts::FM_SeekAndReadRows(fd, span.offset, dst, x.stride, static_cast<uint32_t>(n),
                                          static_cast<uint32_t>(span.rows));
        }
        const int32_t s = ReadRows(fd, span, tileBuffer);
        if (Failed(s)) return s;
        const uint8_t *src = tileBuffer + srcSkip;
        for (int32_t r = 0; r < span.rows; ++r, src += span.rowBytes, dst += x.stride)
            std::memcpy(dst, src, static_cast<size_t>(n));
        return kOk;
    });
    return status;
}

int32_t ReadBlockPlain(const Transfer &x, uint8_t *buffer) {
    bool wentStraight;
    const int32_t status = ReadBlockPlainOwing(x, buffer, &wentStraight);
    if (!Failed(status) && wentStraight) SettleTileBuffer(x, buffer, ReadsStraight);
    return status;
}

int32_t SaveBlockPlain(const Transfer &x, const uint8_t *buffer) {
    const int32_t fd = x.info->descriptor;
    uint8_t *const tileBuffer = x.info->tileBuffer;
    bool wentStraight = false;
    const int32_t status = x.Walk().Forward([&](const HVT_TileHdr &t, const HVT_Box &I) {
        Span span;
        if (!RowsOf(t, x.d, I, &span)) return kErrFileAccess;
        const int64_t dstSkip = ((int64_t{I.left} - t.left) * x.d) >> 3;
        const int64_t n = x.PlainBytes(I);
        const uint8_t *src = buffer + x.CallerOffset(I);
        if (SavesStraight(x, t, I, span)) {  // no read, no copy
            wentStraight = true;
            return ts::FM_SeekAndWriteRows(fd, span.offset, src, x.stride, static_cast<uint32_t>(n),
                                           static_cast<uint32_t>(span.rows));
        }
        if (!(I.left == t.left && I.right == t.right)) {  // keep the rest of those tile rows
            const int32_t s = ReadRows(fd, span, tileBuffer);
            if (Failed(s)) return s;
        }
        uint8_t *dst = tileBuffer + dstSkip;
        for (int32_t r = 0; r < span.rows; ++r, dst += span.rowBytes, src += x.stride)
            std::memcpy(dst, src, static_cast<size_t>(n));
        return WriteRows(fd, span, tileBuffer);
    });
    if (!Failed(status) && wentStraight) SettleTileBuffer(x, buffer, SavesStraight);
    return status;
}

// Rows lie T bytes apart from the start of tileBuffer, so the bits that
// finish a first byte past the end of a tile row are the first bits of the
// next row in the buffer, or whatever an earlier transfer left there after
// the last row read; past the end of the buffer there are none.
int32_t ReadBlockShifted(const Transfer &x, uint8_t *buffer) {
    const int32_t fd = x.info->descriptor;
    uint8_t *const tileBuffer = x.info->tileBuffer;
    const int64_t tileBytes = ts::TileBufferBytes(x.d);
    return x.Walk().Forward([&](const HVT_TileHdr &t, const HVT_Box &I) {
        Span span;
        if (!RowsOf(t, x.d, I, &span)) return kErrFileAccess;
        const int32_t status = ReadRows(fd, span, tileBuffer);
        if (Failed(status)) return status;
        int64_t from = (int64_t{I.left} - t.left) * x.d;
        const int64_t to = (int64_t{I.left} - x.box.left) * x.d;
        int64_t bits = (int64_t{I.right} - I.left) * x.d;
        // The first destination byte is always finished from the source.
        bits = std::max<int64_t>(bits, 8 - (to & 7));
        uint8_t *dst = buffer + (int64_t{I.top} - x.box.top) * x.stride;
        for (int32_t r = 0; r < span.rows; ++r, from += int64_t{span.rowBytes} * 8, dst += x.stride)
            ts::CopyBits(tileBuffer, tileBytes, from, dst, to, bits);
        return kOk;
    });
}

int32_t SaveBlockShifted(const Transfer &x, const uint8_t *buffer) {
    const int32_t fd = x.info->descriptor;
    uint8_t *const tileBuffer = x.info->tileBuffer;
    // The buffer holds the box's first pixel where it sits in a byte of a
    // full image row.
    const int64_t p = (int64_t{x.box.left} * x.d) & 7;
    return x.Walk().Forward([&](const HVT_TileHdr &t, const HVT_Box &I) {
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
            ts::CopyBits(src, srcLength, from, dst, to, bits);
        return WriteRows(fd, span, tileBuffer);
    });
}

bool Serves(uint8_t sub, const HVT_FileInfo *info) {
    return sub < ts::kMaxSubbmps && info->header != nullptr;
}

Transfer SessionBand(HVT_FileInfo *s) {
    return {s->subIndex, s, s->readBox, s->bandRowBytes, s->header->bitsPerPixel};
}

// The tile table, then the transfer's record; false with the status when
// the table cannot be had.
bool Prepare(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box, int32_t stride, Transfer *x,
             int32_t *status) {
    *status = HVT_GetSubbmpTileHdrs(sub, info);
    if (Failed(*status)) return false;
    *x = {sub, info, *box, stride, info->header->bitsPerPixel};
    return true;
}

}  // namespace

namespace tessarine::storage {

void PayTileBuffer(HVT_FileInfo *s) {
    if (!s->tileBufferOwed) return;
    s->tileBufferOwed = 0;
    SettleTileBuffer(SessionBand(s), s->readBuffer, ReadsStraight);
}

int32_t ReadSessionBand(HVT_FileInfo *s, const HVT_Box &band) {
    if (!Serves(s->subIndex, s)) return kErrArgument;
    Transfer x;
    int32_t status;
    if (!Prepare(s->subIndex, s, &band, s->bandRowBytes, &x, &status)) return status;
    // What the new band leaves covers the start of tileBuffer; the old band
    // is still owed what lies past that, before readBuffer takes the new one.
    if (s->tileBufferOwed) {
        s->tileBufferOwed = 0;
        SettleTileBuffer(SessionBand(s), s->readBuffer, ReadsStraight, WalkExtent(x));
    }
    s->readBox = band;
    bool wentStraight;
    status = ReadBlockPlainOwing(x, s->readBuffer, &wentStraight);
    s->tileBufferOwed = !Failed(status) && wentStraight ? 1 : 0;
    return status;
}

}  // namespace tessarine::storage

extern "C" {

TESSARINE_API int32_t HVT_ReadBlock(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box,
                                    int32_t stride, void *buffer) {
    if (!Serves(sub, info)) return kErrArgument;
    ts::PayTileBuffer(info);
    Transfer x;
    int32_t status;
    if (!Prepare(sub, info, box, stride, &x, &status)) return status;
    return ReadBlockPlain(x, static_cast<uint8_t *>(buffer));
}

TESSARINE_API int32_t HVT_SaveBlock(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box,
                                    int32_t stride, const void *buffer) {
    if (!Serves(sub, info)) return kErrArgument;
    ts::PayTileBuffer(info);
    Transfer x;
    int32_t status;
    if (!Prepare(sub, info, box, stride, &x, &status)) return status;
    return SaveBlockPlain(x, static_cast<const uint8_t *>(buffer));
}

TESSARINE_API int32_t HVT_ReadBlockWithBitShift(uint8_t sub, HVT_FileInfo *info,
                                                const HVT_Box *box, int32_t stride, void *buffer) {
    if (!Serves(sub, info)) return kErrArgument;
    ts::PayTileBuffer(info);
    const int32_t d = info->header->bitsPerPixel;
    if (d >= 8 || (int64_t{box->left} * d) % 8 == 0)
        return HVT_ReadBlock(sub, info, box, stride, buffer);
    Transfer x;
    int32_t status;
    if (!Prepare(sub, info, box, stride, &x, &status)) return status;
    return ReadBlockShifted(x, static_cast<uint8_t *>(buffer));
}

TESSARINE_API int32_t HVT_SaveBlockWithBitShift(uint8_t sub, HVT_FileInfo *info,
                                                const HVT_Box *box, int32_t stride,
                                                const void *buffer) {
    if (!Serves(sub, info)) return kErrArgument;
    ts::PayTileBuffer(info);
    const int32_t d = info->header->bitsPerPixel;
    const bool leftAligned = (int64_t{box->left} * d) % 8 == 0;
    const bool rightAligned = (int64_t{box->right} * d) % 8 == 0;
    if (d >= 8 || (leftAligned && (rightAligned || box->right == info->subbmps[sub].width)))
        return HVT_SaveBlock(sub, info, box, stride, buffer);
    Transfer x;
    int32_t status;
    if (!Prepare(sub, info, box, stride, &x, &status)) return status;
    return SaveBlockShifted(x, static_cast<const uint8_t *>(buffer));
}

}  // extern "C"
