/* Tessarine: graphics services for sign-making and large-format printing.
   This header declares every exported C function and public record; it
   compiles as C99 and as C++. The profile services are in profile.hpp. */
#ifndef TESSARINE_H
#define TESSARINE_H

#include "export.h"
#include "platform.h"
#include "core.h"
#include "bitmap.h"
#include "storage.h"
#include "geometry.h"
#include "curves.h"
#include "color.h"

#endif
