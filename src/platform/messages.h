// Stand-ins for the framework's message box and the string table behind it.
#pragma once

#include <cstdint>

namespace tessarine::platform {

// The text for a string id: the satellite's if it has one, else the built-in
// one (the status table's); null for an id outside the table.
const char *LoadString(int32_t id);

// Framework message box: shows string `id`; returns the button pressed.
int32_t AfxMessageBox(uint32_t id, uint32_t style, uint32_t helpContext);
// Platform message box with a free text.
int32_t MessageBoxA(void *owner, const char *text, const char *caption, uint32_t style);

}  // namespace tessarine::platform
