/* Platform words: memory handles, the device-independent bitmap header, the
   hooks an application installs, and the closed-library class names. */
#ifndef TESSARINE_PLATFORM_H
#define TESSARINE_PLATFORM_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"

#ifdef __cplusplus
class AFilePath;
class AString;
#else
typedef struct AFilePath AFilePath;
typedef struct AString AString;
#endif

TESSARINE_BEGIN_C

/* A moveable block is named by an opaque word; a fixed block by its address.
   Both travel as MEM_Handle and are released by the same call. */
typedef void *MEM_Handle;

/* The 40-byte little-endian device-independent bitmap header. */
#pragma pack(push, 4)
typedef struct BITMAPINFOHEADER {
    uint32_t biSize;
    int32_t biWidth;
    int32_t biHeight;
    uint16_t biPlanes;
    uint16_t biBitCount;
    uint32_t biCompression;
    uint32_t biSizeImage;
    int32_t biXPelsPerMeter;
    int32_t biYPelsPerMeter;
    uint32_t biClrUsed;
    uint32_t biClrImportant;
} BITMAPINFOHEADER;
#pragma pack(pop)

/* Integer rectangle, right and bottom exclusive. The tile layer calls it
   HVT_Box. */
typedef struct RECT {
    int32_t left;
    int32_t top;
    int32_t right;
    int32_t bottom;
} RECT;
typedef RECT HVT_Box;

/* The application's out-of-memory hook. It receives the byte count that could
   not be had; its result is not read. The default does nothing and returns 0. */
typedef int32_t (*TS_NewMemoryHandlerFn)(uint32_t size);
TESSARINE_API TS_NewMemoryHandlerFn TS_SetNewMemoryHandler(TS_NewMemoryHandlerFn handler);

/* Stand-in for the framework's message box and MessageBoxA. The sink gets the
   text, the style word, and the string id of the text (-1 for a free text),
   and returns the button pressed. A null sink restores the default, which
   writes the text to standard error and returns 1 (OK). Returns the sink that
   was installed before. */
typedef int32_t (*TS_MessageSinkFn)(const char *text, uint32_t style, int32_t textId);
TESSARINE_API TS_MessageSinkFn TS_SetMessageSink(TS_MessageSinkFn sink);

TESSARINE_END_C

#endif
