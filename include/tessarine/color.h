/* Colour: device colour formulas. */
#ifndef TESSARINE_COLOR_H
#define TESSARINE_COLOR_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"
#include "core.h"

TESSARINE_BEGIN_C

TESSARINE_END_C

#endif
