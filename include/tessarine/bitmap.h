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

TESSARINE_END_C

#endif
