/* Tiled storage: the raw file layer, block files and tags, tile bitmap files,
   transfers, sessions and low-resolution levels. */
#ifndef TESSARINE_STORAGE_H
#define TESSARINE_STORAGE_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"
#include "bitmap.h"

TESSARINE_BEGIN_C

/* ---- Raw file layer ------------------------------------------------------- */

/* errno of the last failed seek, tell, read or write; kept for inspection. */
TESSARINE_API extern int32_t FM_LastErrno;

TESSARINE_API int32_t FM_Create(const char *path, int8_t mode, int32_t *fd);
TESSARINE_API int32_t FM_Open(const char *path, int8_t mode, int32_t *fd);
TESSARINE_API int32_t FM_Delete(const char *path);
TESSARINE_API int32_t FM_Seek(int32_t fd, int32_t origin, int32_t offset);
TESSARINE_API int32_t FM_Tell(int32_t fd, int32_t *position);
TESSARINE_API int32_t FM_Close(int32_t fd);
TESSARINE_API int32_t FM_Read(int32_t fd, void *buffer, uint32_t count);
TESSARINE_API int32_t FM_Write(int32_t fd, const void *buffer, uint32_t count);
TESSARINE_API int32_t FM_SeekAndRead(int32_t fd, int32_t offset, int32_t origin, void *buffer,
                                     uint32_t count);
TESSARINE_API int32_t FM_SeekAndWrite(int32_t fd, int32_t offset, int32_t origin,
                                      const void *buffer, uint32_t count);

/* ---- Tile bitmap file -------------------------------------------------------- */

#define HVT_MAX_SUBBMPS 10
#define HVT_TILE_WIDTH 8192
#define HVT_TILE_HEIGHT 1024

/* The 80-byte file header, as kept in memory. On disk it is written and read
   field by field, little-endian. */
#pragma pack(push, 4)
typedef struct HVT_FileHeader {
    uint8_t stamp[6];            /* 7, 20, 19, 'D', 0, 1 */
    uint8_t userByte1;
    uint8_t userByte2;
    uint8_t userByte3;
    uint8_t bitsPerPixel;
    uint8_t reserved1[2];
    double xResolution;          /* at byte 12 */
    double yResolution;
    uint8_t colorModel;
    uint8_t reserved2[3];
    int32_t colorCount;
    uint8_t imageType;
    uint8_t subbmpCount;
    uint8_t reserved3[2];
    int32_t subbmpOffset[HVT_MAX_SUBBMPS]; /* entry subbmpCount: the closing '.' */
} HVT_FileHeader;
#pragma pack(pop)

typedef struct HVT_SubbmpHdr {
    int32_t width;
    int32_t height;
    int32_t tilesAcross;
    int32_t tilesDown;
} HVT_SubbmpHdr;

typedef struct HVT_TileHdr {
    int32_t offset; /* file offset of the tile's first byte */
    int32_t left;
    int32_t top;
    int32_t right;
    int32_t bottom;
} HVT_TileHdr;

typedef struct HVT_SubbmpSlot {
    int32_t width;
    int32_t height;
    int32_t tilesAcross;
    int32_t tilesDown;
    HVT_TileHdr *tileHdrs; /* loaded on first use */
} HVT_SubbmpSlot;

/* The open state of one tile file. */
typedef struct HVT_FileInfo {
    int32_t descriptor;
    HVT_FileHeader *header;
    HVT_SubbmpSlot subbmps[HVT_MAX_SUBBMPS];
    uint8_t subIndex;
    uint8_t *colorTable;
    uint8_t *tileBuffer; /* one whole tile at the largest */
    MEM_Handle readHandle;
    MEM_Handle writeHandle;
    uint8_t *readBuffer;
    uint8_t *writeBuffer;
    HVT_Box readBox;
    HVT_Box writeBox;
    HVT_Box pendingBox;
    HVT_Box regionBox;
    uint8_t sessionMode;
    uint8_t sessionFlags;
    int32_t readRowBytes;
    int32_t writeRowBytes;
    int32_t bandRowBytes;
    int32_t bandRows;
} HVT_FileInfo;

TESSARINE_API int32_t HVT_CreateBlankTileBmpFile(uint8_t imageType, uint8_t bitsPerPixel,
                                                 uint32_t width, uint32_t height,
                                                 double xResolution, double yResolution,
                                                 uint8_t colorModel, int32_t colorCount,
                                                 const uint8_t *colors, char *path, int32_t *fd,
                                                 uint8_t userByte1, uint8_t userByte2,
                                                 uint8_t userByte3);
TESSARINE_API int32_t HVT_AddSubbmp(int32_t fd, HVT_FileHeader *header, uint32_t width,
                                    uint32_t height, HVT_SubbmpHdr *subbmpHdr, uint8_t *subIndex);
TESSARINE_API void HVT_InitFileInfo(HVT_FileInfo *info);
TESSARINE_API int32_t HVT_TileFileBegin(const BI_Bitmap *bitmap, HVT_FileInfo *info,
                                        int32_t openFile);
TESSARINE_API void HVT_TileFileEnd(HVT_FileInfo *info, int32_t closeFile);
TESSARINE_API int32_t HVT_GetSubbmpTileHdrs(uint8_t sub, HVT_FileInfo *info);
TESSARINE_API int32_t HVT_SaveTile(uint8_t sub, HVT_FileInfo *info, int32_t tile, int32_t firstRow,
                                   int32_t rowCount, const void *buffer);
TESSARINE_API int32_t HVT_ReadTile(uint8_t sub, HVT_FileInfo *info, int32_t tile, int32_t firstRow,
                                   int32_t rowCount, void *buffer);
TESSARINE_API int32_t HVT_PixelInWhichTile(int32_t tilesAcross, int32_t x, int32_t y);

/* ---- Tile block transfer ----------------------------------------------------- */

TESSARINE_API int32_t HVT_SaveBlock(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box,
                                    int32_t stride, const void *buffer);
TESSARINE_API int32_t HVT_ReadBlock(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box,
                                    int32_t stride, void *buffer);
TESSARINE_API int32_t HVT_SaveBlockWithBitShift(uint8_t sub, HVT_FileInfo *info,
                                                const HVT_Box *box, int32_t stride,
                                                const void *buffer);
TESSARINE_API int32_t HVT_ReadBlockWithBitShift(uint8_t sub, HVT_FileInfo *info,
                                                const HVT_Box *box, int32_t stride, void *buffer);

/* ---- Row and column transfer sessions ------------------------------------------ */

/* flags: 1 reading, 2 writing. mode: 0 one row at a time, 1 small windows,
   2 (and 3) bands. box null: the whole sub-bitmap. budget 0: the default. */
TESSARINE_API int32_t HVT_TileFileRowIOBegin(uint8_t flags, BI_Bitmap *bitmap, const HVT_Box *box,
                                             uint8_t mode, uint8_t sub, int32_t budget);
TESSARINE_API int32_t HVT_RotatedTileFileColIOBegin(uint8_t flags, BI_Bitmap *bitmap,
                                                    const HVT_Box *box, uint8_t mode, uint8_t sub,
                                                    int32_t budget);
TESSARINE_API void HVT_TileFileRowColIOEnd(BI_Bitmap *bitmap);

TESSARINE_END_C

#endif
