// Hints to the system about how a block of memory will be used. Advice only:
// nothing observable depends on it, and a refused hint is ignored.
#pragma once

#include <cstddef>

namespace tessarine::platform {

// A large block that is filled whole and streamed through, such as a
// session's band buffer: the whole 2 MiB pages inside it may be backed by
// large pages, which saves a page fault and a TLB entry for every 4 KiB.
void AdviseLargePages(void *block, size_t bytes);

}  // namespace tessarine::platform
