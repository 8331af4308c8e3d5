// Reads with one pixel of margin on each side; at an image edge the
// outermost pixel of the run is repeated.
#pragma once

#include <cstdint>

#include <tessarine/bitmap.h>

#include "core/status.h"

namespace tessarine::bitmap {

// `read(x, count, out)` reads one run; count + 2 bytes land in out.
template <class Read>
int32_t PaddedRead(const BI_Bitmap *b, int32_t x, int32_t count, uint8_t *out, Read &&read) {
    // The margins must stay within what a run can name.
    if (count < 0 || count > INT32_MAX - 2 || x == INT32_MIN) return kErrGeneral;
    const bool atLeft = x == 0;
    const bool atRight = int64_t{x} + count == b->width;
    int32_t status;
    if (!atLeft && !atRight) return read(x - 1, count + 2, out);
    if (!atLeft) {
        status = read(x - 1, count + 1, out);
        if (!Failed(status)) out[count + 1] = out[count];
        return status;
    }
    status = read(0, atRight ? count : count + 1, out + 1);
    if (!Failed(status)) {
        out[0] = out[1];
        if (atRight) out[count + 1] = out[count];
    }
    return status;
}

}  // namespace tessarine::bitmap
