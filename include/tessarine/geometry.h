/* Geometry kernel: planar records, evaluators, boxes, intersection, distance, merging and stroking. */
#ifndef TESSARINE_GEOMETRY_H
#define TESSARINE_GEOMETRY_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"
#include "core.h"

TESSARINE_BEGIN_C

TESSARINE_END_C

#endif
