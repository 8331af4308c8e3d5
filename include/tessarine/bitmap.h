/* Bitmap engine: the bitmap record and everything that reads or writes pixels. */
#ifndef TESSARINE_BITMAP_H
#define TESSARINE_BITMAP_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"
#include "core.h"

TESSARINE_BEGIN_C

TESSARINE_END_C

#endif
