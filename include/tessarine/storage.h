/* Tiled storage: the raw file layer, block files and tags, tile bitmap files,
   transfers, sessions and low-resolution levels. */
#ifndef TESSARINE_STORAGE_H
#define TESSARINE_STORAGE_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"

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

TESSARINE_END_C

#endif
