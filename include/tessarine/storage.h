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
    /* Library-private: nonzero while tileBuffer has still to be given the
       bytes the session's last band read leaves in it. */
    uint8_t tileBufferOwed;
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

/* ---- Tile block transfer -----------------------------------------------------
   A box's rows go between the caller's buffer, stride bytes apart (0 for a
   box of one row), and the sub-bitmap's tiles. The plain forms move whole
   bytes. Below 8 bits per pixel the two bit-shift forms expect the box's
   first pixel at different places of a buffer row:
   - HVT_ReadBlockWithBitShift delivers it at the top bit of the row's first
     byte, and finishes that byte from the tile data;
   - HVT_SaveBlockWithBitShift takes it where it sits in a byte of a full
     image row: at bit (left * bitsPerPixel) mod 8, counted from the top. */

TESSARINE_API int32_t HVT_SaveBlock(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box,
                                    int32_t stride, const void *buffer);
TESSARINE_API int32_t HVT_ReadBlock(uint8_t sub, HVT_FileInfo *info, const HVT_Box *box,
                                    int32_t stride, void *buffer);
TESSARINE_API int32_t HVT_SaveBlockWithBitShift(uint8_t sub, HVT_FileInfo *info,
                                                const HVT_Box *box, int32_t stride,
                                                const void *buffer);
TESSARINE_API int32_t HVT_ReadBlockWithBitShift(uint8_t sub, HVT_FileInfo *info,
                                                const HVT_Box *box, int32_t stride, void *buffer);
/* ---- Block file and tag layer ----------------------------------------------
   A file of fixed-size slots: slot 0 holds the 36-byte header, slot i >= 1
   holds block i (a 12-byte block header, then payloadSize data bytes). All
   on-disk words are 32-bit little-endian; the records below give the field
   order and are read and written field by field. */

/* First four bytes of every block file. */
#define FM_BLOCKFILE_MAGIC0 0x54u
#define FM_BLOCKFILE_MAGIC1 0x5Eu
#define FM_BLOCKFILE_MAGIC2 0xD8u
#define FM_BLOCKFILE_MAGIC3 0x07u
#define FM_BLOCKFILE_HDR_BYTES 36u
#define FM_BLOCK_HDR_BYTES 12u
#define FM_TAG_HDR_BYTES 8u
/* Size of the path field of FM_BlockFile; a path must be shorter. */
#define FM_BLOCKFILE_PATH_BYTES 512

/* File header, at byte 0 (36 bytes). */
typedef struct FM_BlockFileHdr {
    uint8_t magic[4];
    uint32_t payloadSize; /* data bytes in a block */
    uint32_t stride;      /* payloadSize + 12: file distance between blocks */
    uint32_t nextIndex;   /* index the next block taken from the end gets */
    uint32_t firstBlock;  /* 0 = empty chain */
    uint32_t lastBlock;
    uint32_t freeHead;    /* first block of the free list, 0 = none */
    uint32_t endBlock;    /* append position of the tags; 0 = take a new block */
    uint32_t endOffset;
} FM_BlockFileHdr;

/* Block header, at the start of every block (12 bytes). */
typedef struct FM_BlockHdr {
    uint32_t next;     /* next in the chain; on the free list, the next free block */
    uint32_t prev;
    uint32_t firstTag; /* offset of the first tag starting here; payloadSize if none */
} FM_BlockHdr;

/* Tag header, in the tag stream (8 bytes). kind 0 is free space. */
typedef struct FM_TagHdr {
    uint8_t kind;
    uint8_t extra[3]; /* the caller's; carried along */
    uint32_t length;  /* the whole tag, these 8 bytes included */
} FM_TagHdr;

/* A position in the chain; block 0 is past the end. */
typedef struct FM_BlockAddr {
    uint32_t block;
    uint32_t offset;
} FM_BlockAddr;

/* Told when an insert moves a tag to another block; a negative status stops
   the move. */
typedef int32_t (*FM_TagCallback)(FM_BlockAddr *oldAddress, FM_BlockAddr *newAddress);

/* A cache node: a node of a circular list (its head is laid out as ListNode),
   then the block image of `stride` bytes. nodeBytes is
   offsetof(FM_MemBlock, image) + stride. */
typedef struct FM_MemBlock {
    uintptr_t dirty;           /* non-zero: written back on eviction and close */
    struct FM_MemBlock *next;  /* towards older */
    struct FM_MemBlock *prev;  /* towards newer; the head's prev is the oldest */
    uint32_t index;            /* block held here */
    uint8_t image[];           /* FM_BlockHdr then the data, as in the file */
} FM_MemBlock;

/* An open block file. */
typedef struct FM_BlockFile {
    char path[FM_BLOCKFILE_PATH_BYTES];
    int32_t descriptor; /* -1 = none */
    uint32_t nodeBytes;
    uint8_t cacheLimit;
    uint32_t cachedCount;
    FM_MemBlock *cacheHead; /* most recently used */
    FM_TagCallback tagCallback;
    FM_BlockFileHdr header; /* written back at close */
} FM_BlockFile;

TESSARINE_API int32_t FM_BlockFileCreate(const char *path, FM_BlockFile **file,
                                         uint32_t payloadSize, uint8_t cacheLimit,
                                         FM_TagCallback tagCallback);
TESSARINE_API int32_t FM_BlockFileOpen(const char *path, FM_BlockFile **file, uint8_t cacheLimit);
TESSARINE_API int32_t FM_BlockFileClose(FM_BlockFile **file);
TESSARINE_API void FM_BlockFileDelete(FM_BlockFile **file);
TESSARINE_API int32_t FM_NewBlock(FM_BlockFile *file, FM_MemBlock **node);
TESSARINE_API int32_t FM_FreeBlock(FM_BlockFile *file, uint32_t index);
TESSARINE_API int32_t FM_InsertBlockAfter(FM_BlockFile *file, uint32_t after, FM_MemBlock *node);
TESSARINE_API int32_t FM_GetFileBlockHdrByIndex(FM_BlockFile *file, uint32_t index,
                                                FM_BlockHdr *header);
TESSARINE_API int32_t FM_GetMemBlockByIndex(FM_BlockFile *file, uint32_t index,
                                            FM_MemBlock **node);
TESSARINE_API int32_t FM_GetNextAddr(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                     uint32_t distance, FM_BlockAddr *result);
TESSARINE_API int32_t FM_BlockRead(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                   int32_t count, void *buffer, FM_BlockAddr *last);
TESSARINE_API int32_t FM_BlockWrite(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                    int32_t count, const void *buffer, FM_BlockAddr *last);

TESSARINE_API int32_t FM_TagReadHdr(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                    FM_TagHdr *header, FM_BlockAddr *data, FM_BlockAddr *next);
TESSARINE_API int32_t FM_TagAppendHdrAtEnd(FM_BlockFile *file, const FM_TagHdr *header,
                                           FM_BlockAddr *tag, FM_BlockAddr *data);
TESSARINE_API int32_t FM_TagInsertHdrAt(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                        FM_TagHdr *header, FM_BlockAddr *tag,
                                        FM_BlockAddr *data, FM_BlockAddr *next);
TESSARINE_API int32_t FM_TagDelete(FM_BlockFile *file, const FM_BlockAddr *tag,
                                   FM_BlockAddr *next);
TESSARINE_API int32_t FM_TagRewriteHdr(FM_BlockFile *file, uint32_t block, uint32_t offset,
                                       FM_TagHdr *header, FM_BlockAddr *tag,
                                       FM_BlockAddr *data, FM_BlockAddr *next);
TESSARINE_API int32_t FM_DupTagBlockFile(const char *sourcePath, const char *destinationPath);

/* ---- Row and column transfer sessions ------------------------------------------ */

/* flags: 1 reading, 2 writing. mode: 0 one row at a time, 1 small windows,
   2 (and 3) bands. box null: the whole sub-bitmap. budget 0: the default. */
TESSARINE_API int32_t HVT_TileFileRowIOBegin(uint8_t flags, BI_Bitmap *bitmap, const HVT_Box *box,
                                             uint8_t mode, uint8_t sub, int32_t budget);
TESSARINE_API int32_t HVT_RotatedTileFileColIOBegin(uint8_t flags, BI_Bitmap *bitmap,
                                                    const HVT_Box *box, uint8_t mode, uint8_t sub,
                                                    int32_t budget);
TESSARINE_API void HVT_TileFileRowColIOEnd(BI_Bitmap *bitmap);

/* ---- Low-resolution levels ---------------------------------------------------- */

/* A progress object of the caller's. report is the first operation of its
   table and is called with the object itself; a non-zero answer asks the job
   to stop. start and end are the values at the beginning and the end of the
   job; a job puts them back as it found them. */
struct HVT_Progress;
typedef struct HVT_ProgressOps {
    int32_t (*report)(struct HVT_Progress *self, double value);
} HVT_ProgressOps;
typedef struct HVT_Progress {
    const HVT_ProgressOps *ops;
    double start;
    double end;
} HVT_Progress;

/* Fills sub-bitmap `destination` of an open tile file from `source`: point
   sampling for 1-bit and indexed files, box averaging for the others. */
TESSARINE_API int32_t HVT_UpdateLowRes(HVT_FileInfo *info, uint8_t source, uint8_t destination,
                                       HVT_Progress *progress);

TESSARINE_END_C

#endif
