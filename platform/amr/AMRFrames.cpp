#include "amr/AMRFrames.h"

#include <cstring>

namespace android {

namespace {
// Indexed by frame type. AMR-NB (3GPP TS 26.101): types 0-7 speech, 8 SID,
// 9-14 not stored, 15 no data. AMR-WB (TS 26.201): 0-8 speech, 9 SID,
// 10-13 reserved, 14 speech lost, 15 no data.
const uint8_t kNarrowSizes[16] = {13, 14, 16, 18, 20, 21, 27, 32, 6, 0, 0, 0, 0, 0, 0, 1};
const uint8_t kWideSizes[16] = {18, 24, 33, 37, 41, 47, 51, 59, 61, 6, 0, 0, 0, 0, 1, 1};
}  // namespace

size_t AMRFrameSize(bool isWide, uint8_t header) {
    const unsigned type = (header >> 3) & 0x0F;
    return isWide ? kWideSizes[type] : kNarrowSizes[type];
}

size_t AMRMagicLength(const uint8_t* data, size_t size, bool* isWide) {
    if (size >= 9 && memcmp(data, "#!AMR-WB\n", 9) == 0) {
        *isWide = true;
        return 9;
    }
    if (size >= 6 && memcmp(data, "#!AMR\n", 6) == 0) {
        *isWide = false;
        return 6;
    }
    return 0;
}

}  // namespace android
