/* Curve toolkit: conversions and the iterative methods on cubics. */
#ifndef TESSARINE_CURVES_H
#define TESSARINE_CURVES_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"
#include "core.h"

TESSARINE_BEGIN_C

TESSARINE_END_C

#endif
