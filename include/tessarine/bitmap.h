/* Bitmap engine: the bitmap record and everything that reads or writes pixels. */
#ifndef TESSARINE_BITMAP_H
#define TESSARINE_BITMAP_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"
#include "core.h"

TESSARINE_BEGIN_C

struct HVT_FileInfo;

/* storage flags */
#define BI_STORAGE_MEMORY 1u
#define BI_STORAGE_TILEFILE 2u

/* The record behind a bitmap handle. The fields are public: the engine and
   the application read and write them directly. */
typedef struct BI_Bitmap {
    uint8_t refCount;          /* owners; 1 after creation */
    int32_t width;             /* pixels per row */
    int32_t height;            /* rows */
    uint8_t userByte1;         /* three opaque bytes of the caller's */
    uint8_t userByte2;
    uint8_t userByte3;
    uint8_t bitsPerPixel;      /* 1, 4, 8, 24 or 32 */
    uint32_t bytesPerRow;      /* memory stride, padded to 4 bytes */
    double xResolution;
    double yResolution;
    uint8_t colorModel;        /* 1 RGB, 2 CMYK, 0 not set */
    uint8_t imageType;         /* 1 b/w, 2 gray, 3 indexed, 4 true colour */
    uint8_t storage;           /* bit 0 memory, bit 1 tile file */
    char tilePath[513];        /* empty when there is no tile file */
    int32_t tileFile;          /* open descriptor of the tile file, or -1 */
    char companionPath[512];   /* a further file deleted with the bitmap */
    struct HVT_FileInfo *ioSession;
    MEM_Handle pixelHandle;    /* height * bytesPerRow bytes, top row first */
    int32_t colorCount;
    MEM_Handle colorTable;     /* colorCount entries of 3 (RGB) or 4 (CMYK) bytes */
    void *colorIndex;          /* sorted lookup array, null until built */
    AFilePath *profilePath;    /* owned by the bitmap; null when none */
} BI_Bitmap;

TESSARINE_API int32_t BI_NewBitmap(BI_Bitmap **out);
TESSARINE_API void BI_UseBitmap(BI_Bitmap *bitmap);
TESSARINE_API int32_t BI_IsValidBmp(const BI_Bitmap *bitmap);
TESSARINE_API void BI_DeleteBitmap(BI_Bitmap **bitmap);
TESSARINE_API int32_t BI_CreateBlankBmp(uint8_t imageType, uint8_t bitsPerPixel, int32_t width,
                                        int32_t height, double xResolution, double yResolution,
                                        uint8_t colorModel, int32_t colorCount,
                                        const uint8_t *colors, BI_Bitmap **out, uint8_t storage,
                                        uint8_t userByte1, uint8_t userByte2, uint8_t userByte3);
TESSARINE_API int32_t BI_GetBlankBmp(const BI_Bitmap *source, const RECT *rect, BI_Bitmap **out,
                                     uint8_t storage);

/* ---- Colour tables, map tables and row access ------------------------------ */

TESSARINE_API int32_t BI_SetRGBColorTable(BI_Bitmap *bitmap, int32_t count, const uint8_t *entries);
TESSARINE_API int32_t BI_GetRGBColorTable(const BI_Bitmap *bitmap, int32_t *count, uint8_t *entries);
TESSARINE_API int32_t BI_GetCMYKColorTable(const BI_Bitmap *bitmap, int32_t *count,
                                           uint8_t *entries);
TESSARINE_API uint8_t BI_RGBMapToColorIndex(uint8_t r, uint8_t g, uint8_t b, int32_t count,
                                            const uint8_t *entries);
TESSARINE_API int32_t BI_GetMapTable(const BI_Bitmap *source, const BI_Bitmap *destination,
                                     uint8_t *map);
TESSARINE_API int32_t MakeColorTableIndex(BI_Bitmap *bitmap);
/* Gray density (0 white, 255 black) of an RGB colour. */
TESSARINE_API uint8_t RGB2GrayScale(uint8_t r, uint8_t g, uint8_t b);

/* Rows as colour planes or triples. A row pointer addresses the byte that
   holds pixel x; x gives the pixel's place in that byte. */
TESSARINE_API int32_t BI_UnpackRGBRow(uint8_t imageType, uint8_t bitsPerPixel, MEM_Handle table,
                                      const uint8_t *row, int32_t x, int32_t count, uint8_t *r,
                                      uint8_t *g, uint8_t *b);
TESSARINE_API int32_t BI_UnpackRGBRowInterlace(uint8_t imageType, uint8_t bitsPerPixel,
                                               MEM_Handle table, const uint8_t *row, int32_t x,
                                               int32_t count, uint8_t *rgb);
TESSARINE_API int32_t BI_UnpackBGRRowInterlace(uint8_t imageType, uint8_t bitsPerPixel,
                                               MEM_Handle table, const uint8_t *row, int32_t x,
                                               int32_t count, uint8_t *bgr);
TESSARINE_API int32_t BI_GetRGBRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                   uint8_t *r, uint8_t *g, uint8_t *b);
TESSARINE_API int32_t BI_GetRGBRowInterlace(BI_Bitmap *bitmap, int32_t y, int32_t x,
                                            int32_t count, uint8_t *rgb);
TESSARINE_API int32_t BI_GetBGRRowInterlace(BI_Bitmap *bitmap, int32_t y, int32_t x,
                                            int32_t count, uint8_t *bgr);
TESSARINE_API int32_t BI_SetRGBRow(int32_t y, int32_t x, int32_t count, const uint8_t *r,
                                   const uint8_t *g, const uint8_t *b, BI_Bitmap *bitmap);
TESSARINE_API int32_t BI_SetRGBRowInterlace(int32_t y, int32_t x, int32_t count,
                                            const uint8_t *rgb, BI_Bitmap *bitmap);
TESSARINE_API int32_t BI_SetBGRRowInterlace(int32_t y, int32_t x, int32_t count,
                                            const uint8_t *bgr, BI_Bitmap *bitmap);
TESSARINE_API int32_t BI_UnpackCMYKRow(uint8_t imageType, uint8_t bitsPerPixel, MEM_Handle table,
                                       const uint8_t *row, int32_t x, int32_t count, uint8_t *c,
                                       uint8_t *m, uint8_t *y, uint8_t *k);
TESSARINE_API int32_t BI_GetCMYKRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                    uint8_t *c, uint8_t *m, uint8_t *yellow, uint8_t *k);
TESSARINE_API int32_t BI_SetCMYKRow(int32_t y, int32_t x, int32_t count, const uint8_t *c,
                                    const uint8_t *m, const uint8_t *yellow, const uint8_t *k,
                                    BI_Bitmap *bitmap);

/* Rows as one byte per pixel: indexes, densities, black-and-white flags. */
TESSARINE_API int32_t BI_UnpackIndexRow(uint8_t bitsPerPixel, const uint8_t *row, int32_t x,
                                        int32_t count, uint8_t *out);
TESSARINE_API int32_t BI_PackIndexRow(uint8_t bitsPerPixel, const uint8_t *values, int32_t x,
                                      int32_t count, uint8_t *row);
TESSARINE_API int32_t BI_GetIndexRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                     uint8_t *out);
/* Values at or above the bitmap's colorCount are set to 0 in `values` first. */
TESSARINE_API int32_t BI_SetIndexRow(int32_t y, int32_t x, int32_t count, uint8_t *values,
                                     BI_Bitmap *bitmap);
TESSARINE_API int32_t BI_GetPaddedIndexRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                           uint8_t *out);
TESSARINE_API int32_t BI_UnpackGRow(uint8_t imageType, uint8_t colorModel, uint8_t bitsPerPixel,
                                    MEM_Handle table, const uint8_t *row, int32_t x, int32_t count,
                                    uint8_t *out);
TESSARINE_API int32_t BI_PackGRow(uint8_t bitsPerPixel, const uint8_t *values, int8_t x,
                                  int32_t count, uint8_t *row);
TESSARINE_API int32_t BI_GetGRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                 uint8_t *out);
TESSARINE_API int32_t BI_SetGRow(int32_t y, int32_t x, int32_t count, const uint8_t *values,
                                 BI_Bitmap *bitmap);
TESSARINE_API int32_t BI_GetPaddedGRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                       uint8_t *out);
TESSARINE_API int32_t BI_UnpackBWRow(const uint8_t *row, int32_t x, int32_t count, uint8_t *out);
TESSARINE_API int32_t BI_PackBWRow(const uint8_t *flags, int32_t x, int32_t count, uint8_t *row);
TESSARINE_API int32_t BI_GetBWRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                  uint8_t *out);
TESSARINE_API int32_t BI_SetBWRow(int32_t y, int32_t x, int32_t count, const uint8_t *flags,
                                  BI_Bitmap *bitmap);
TESSARINE_API int32_t BI_GetBWPackedRow(BI_Bitmap *bitmap, int32_t y, int32_t x, int32_t count,
                                        uint8_t *out);
TESSARINE_API int32_t BI_SetBWPackedRow(int32_t y, int32_t x, int32_t count, const uint8_t *packed,
                                        BI_Bitmap *bitmap);

/* ---- Pixel movers ----------------------------------------------------------
   Row primitives take the byte that holds a run's first pixel and that
   pixel's phase: 0 to 7 at one bit (0 is the high bit), 0 or 1 at four bits.
   They may read one byte past the run and, where documented, write bits
   before or after it: buffers handed in must allow for that. A point is x
   then y. Areas are a base, a stride in bytes and a rectangle. */

TESSARINE_API void BI_CopyRow1BPPBits(int32_t count, uint8_t sourcePhase, const uint8_t *source,
                                      uint8_t destinationPhase, uint8_t *destination);
TESSARINE_API void BI_CopyRow4BPPBits(int32_t count, uint8_t sourcePhase, const uint8_t *source,
                                      uint8_t destinationPhase, uint8_t *destination);
TESSARINE_API void BI_MaskRow1BPPBits(int32_t count, uint8_t sourcePhase, const uint8_t *source,
                                      uint8_t maskPhase, const uint8_t *mask,
                                      uint8_t destinationPhase, uint8_t *destination);
TESSARINE_API void BI_MaskRow4BPPBits(int32_t count, uint8_t sourcePhase, const uint8_t *source,
                                      uint8_t maskPhase, const uint8_t *mask,
                                      uint8_t destinationPhase, uint8_t *destination);
TESSARINE_API int32_t BI_MemDirectCopyBits(uint8_t bitsPerPixel, int32_t sourceStride,
                                           const RECT *sourceRect, const uint8_t *sourceBase,
                                           int32_t destinationStride, int32_t x, int32_t y,
                                           uint8_t *destinationBase);
/* map has 256 entries; rowBuffer, when not null, holds the rectangle's width
   in bytes. */
TESSARINE_API int32_t BI_MemMapTableCopyBits(const uint8_t *map, uint8_t sourceBitsPerPixel,
                                             int32_t sourceStride, const RECT *sourceRect,
                                             const uint8_t *sourceBase,
                                             uint8_t destinationBitsPerPixel,
                                             int32_t destinationStride, int32_t x, int32_t y,
                                             uint8_t *destinationBase, uint8_t *rowBuffer);
TESSARINE_API int32_t BI_MemDirectMaskBits(uint8_t bitsPerPixel, int32_t sourceStride,
                                           const RECT *sourceRect, const uint8_t *sourceBase,
                                           int32_t maskStride, int32_t maskX, int32_t maskY,
                                           const uint8_t *maskBase, int32_t destinationStride,
                                           int32_t x, int32_t y, uint8_t *destinationBase);
/* The DIB is one block: the header, its palette, then the pixels. */
TESSARINE_API int32_t BI_MemBitsToDIB(const BI_Bitmap *bitmap, int32_t sourceStride,
                                      const RECT *sourceRect, const uint8_t *sourceBase, int32_t x,
                                      int32_t y, BITMAPINFOHEADER *dib);
TESSARINE_API int32_t BI_DIBToMemBits(const RECT *sourceRect, const BITMAPINFOHEADER *dib,
                                      const BI_Bitmap *bitmap, int32_t destinationStride,
                                      int32_t x, int32_t y, uint8_t *destinationBase);
TESSARINE_API void BI_FillByte(BI_Bitmap *bitmap, uint8_t value);
TESSARINE_API void BI_ReverseByte(BI_Bitmap *bitmap);

/* Same-layout moves between bitmaps in memory or in tile files. The mask is a
   1-bit area in memory: a stride, a point (x, y) and a base. */
TESSARINE_API int32_t BI_DirectCopyBmp(const RECT *sourceRect, BI_Bitmap *source,
                                       const RECT *destinationRect, BI_Bitmap *destination,
                                       uint8_t sourceSub, uint8_t destinationSub);
TESSARINE_API int32_t BI_DirectMaskBmp(const RECT *sourceRect, BI_Bitmap *source,
                                       int32_t maskStride, int32_t maskX, int32_t maskY,
                                       const uint8_t *maskBase, const RECT *destinationRect,
                                       BI_Bitmap *destination);
/* Any pair of layouts. The first mask byte of each row is briefly changed and
   put back: the mask must be writable and not shared during the call. */
TESSARINE_API int32_t BI_MaskBmp(const RECT *sourceRect, BI_Bitmap *source, int32_t maskStride,
                                 int32_t maskX, int32_t maskY, uint8_t *maskBase,
                                 const RECT *destinationRect, BI_Bitmap *destination);

/* Columns: count pixels down column x, from the top or from the bottom. The
   unpacking reads pixel i at first + i * stride (from the bottom, output 0 is
   the lowest pixel); x gives the pixel's place in its byte. */
TESSARINE_API int32_t BI_UnpackRGBColTopdown(uint8_t imageType, uint8_t bitsPerPixel,
                                             MEM_Handle table, int32_t stride,
                                             const uint8_t *first, int32_t x, int32_t count,
                                             uint8_t *r, uint8_t *g, uint8_t *b);
TESSARINE_API int32_t BI_UnpackRGBColBottomup(uint8_t imageType, uint8_t bitsPerPixel,
                                              MEM_Handle table, int32_t stride,
                                              const uint8_t *first, int32_t x, int32_t count,
                                              uint8_t *r, uint8_t *g, uint8_t *b);
TESSARINE_API int32_t BI_GetRGBColTopdown(BI_Bitmap *bitmap, int32_t x, int32_t y, int32_t count,
                                          uint8_t *r, uint8_t *g, uint8_t *b);
TESSARINE_API int32_t BI_GetRGBColBottomup(BI_Bitmap *bitmap, int32_t x, int32_t y, int32_t count,
                                           uint8_t *r, uint8_t *g, uint8_t *b);
TESSARINE_API int32_t BI_UnpackGColTopdown(uint8_t imageType, uint8_t colorModel,
                                           uint8_t bitsPerPixel, MEM_Handle table, int32_t stride,
                                           const uint8_t *first, int32_t x, int32_t count,
                                           uint8_t *out);
TESSARINE_API int32_t BI_UnpackGColBottomup(uint8_t imageType, uint8_t colorModel,
                                            uint8_t bitsPerPixel, MEM_Handle table, int32_t stride,
                                            const uint8_t *first, int32_t x, int32_t count,
                                            uint8_t *out);
TESSARINE_API int32_t BI_GetGColTopdown(BI_Bitmap *bitmap, int32_t x, int32_t y, int32_t count,
                                        uint8_t *out);
TESSARINE_API int32_t BI_GetGColBottomup(BI_Bitmap *bitmap, int32_t x, int32_t y, int32_t count,
                                         uint8_t *out);
/* Pixel (x, y) of a 1-bit bitmap in memory, given its first byte and stride:
   operation 0 sets it, 2 flips it, and 1 clears the whole byte that holds it. */
TESSARINE_API int32_t BI_PixelOpBWBmp(int32_t x, int32_t y, int32_t operation, int32_t stride,
                                      uint8_t *first);

/* ---- Whole bitmaps: copy, fill, conversion, DIBs ---------------------------- */

/* The colour match of BI_CopyBmpToRGBTrueColor: the four profile paths in the
   order R27_XQMatchColors takes them (the second is kept with the
   destination), then its rendering intent and flag word, handed on as they
   are. */
typedef struct BI_ColorMatch {
    AFilePath *source;
    AFilePath *destination;
    AFilePath *proofing;
    AFilePath *abstractProfile;
    int32_t intent;
    uint32_t flags;
} BI_ColorMatch;

/* Rectangles are not clipped: they must lie inside their bitmaps. A
   sub-bitmap number matters only for a bitmap in a tile file. */
TESSARINE_API int32_t BI_CopyBmp(const RECT *sourceRect, BI_Bitmap *source,
                                 const RECT *destinationRect, BI_Bitmap *destination,
                                 uint8_t sourceSub, uint8_t destinationSub);
/* The destination must be RGB true colour; match may be null. */
TESSARINE_API int32_t BI_CopyBmpToRGBTrueColor(const RECT *sourceRect, BI_Bitmap *source,
                                               const RECT *destinationRect,
                                               BI_Bitmap *destination, uint8_t sourceSub,
                                               uint8_t destinationSub,
                                               const BI_ColorMatch *match);
TESSARINE_API int32_t BI_FillBmp(BI_Bitmap *bitmap, uint8_t r, uint8_t g, uint8_t b);
TESSARINE_API int32_t BI_ConvertBmpToMem(BI_Bitmap *bitmap);
TESSARINE_API int32_t BI_ConvertBmpToTiledFile(BI_Bitmap *bitmap);
/* One pointer block, freed with MEM_FreePtr: the header, the palette (blue,
   green, red, 0 for each colour), then room for the pixels, not cleared. */
TESSARINE_API int32_t BI_CreateDIB(uint8_t bitsPerPixel, int32_t width, int32_t height,
                                   int32_t count, const uint8_t *colors, BITMAPINFOHEADER **out);
TESSARINE_API int32_t BI_CreateDIBFromBmp(const BI_Bitmap *bitmap, const RECT *rect,
                                          BITMAPINFOHEADER **out);

TESSARINE_END_C

#endif
