// Heap texts behind AString and AFilePath.
#pragma once

#include <cstddef>

namespace tessarine::platform {

// A heap copy of the pieces joined, or null when they are all empty or the
// memory cannot be had.
char *JoinText(char const *first, char const *second = "", char const *third = "");
void FreeText(char *text);

}  // namespace tessarine::platform
