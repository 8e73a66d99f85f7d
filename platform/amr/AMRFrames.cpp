#include "amr/AMRFrames.h"

#include <cstring>

#include "amr/AMRFrameTable.h"

namespace android {

size_t AMRFrameSize(bool isWide, uint8_t header) {
    const int payload = AMRFrameTable::payloadBytes(isWide, AMRFrameTable::frameType(header));
    return payload < 0 ? 0 : static_cast<size_t>(payload) + 1;
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
