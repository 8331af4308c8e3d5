// The block transfers' service to sessions. A session's band read goes
// straight from the file into readBuffer; the bytes the text's walk would
// leave in tileBuffer are laid down only when something could see them: the
// next transfer on the record, a change to readBuffer, or a band read that
// does not cover them.
#pragma once

#include <cstdint>

#include <tessarine/storage.h>

namespace tessarine::storage {

// HVT_ReadBlock of the band into readBuffer at the band stride; readBox
// becomes the band.
int32_t ReadSessionBand(HVT_FileInfo *session, const HVT_Box &band);
// Gives tileBuffer what the last band read owes it, if anything.
void PayTileBuffer(HVT_FileInfo *session);

}  // namespace tessarine::storage
