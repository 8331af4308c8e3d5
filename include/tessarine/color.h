/* Colour: device colour formulas and the colour buffer descriptor that the
   profile services (profile.hpp) take. */
#ifndef TESSARINE_COLOR_H
#define TESSARINE_COLOR_H

#include <stddef.h>
#include <stdint.h>

#include "core.h"
#include "export.h"
#include "platform.h"

TESSARINE_BEGIN_C

/* ---- Device colour formulas ------------------------------------------------
   Fixed models with built-in tables; no profile, no status. Every value is
   one byte. CMYK is ink: 255 is full ink. */

/* sRGB to SWOP CMYK. rgb[3] is overwritten with the low six bits of each
   component (the interpolation fractions); cmyk[4] receives c, m, y, k. */
TESSARINE_API void CX_SRgb2SWOPCmyk(uint8_t *rgb, uint8_t *cmyk);

/* SWOP CMYK to sRGB. cmyk[4] in, rgb[3] out. */
TESSARINE_API void CX_SWOPCmyk2SRgb(const uint8_t *cmyk, uint8_t *rgb);

/* Lab to sRGB. lab[0] is L, 0 to 255; lab[1] and lab[2] are a and b as
   signed bytes. rgb[3] out. */
TESSARINE_API void CX_Lab2SRgb(const uint8_t *lab, uint8_t *rgb);

/* ---- Colour buffer descriptor ----------------------------------------------
   One side of a colour match: `count` colours at `pixels`, interleaved as
   `format` says. */
#define CX_FORMAT_RGB 1   /* r, g, b: 3 bytes a colour */
#define CX_FORMAT_CMYK 2  /* c, m, y, k: 4 bytes a colour, 255 full ink */
#define CX_FORMAT_GRAY 11 /* 1 byte a colour, 0 black, 255 white */

typedef struct CX_ColorBuffer {
    int16_t format;
    int32_t count;
    void *pixels;
} CX_ColorBuffer;

TESSARINE_END_C

#endif
