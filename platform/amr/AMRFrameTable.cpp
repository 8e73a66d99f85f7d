#include "amr/AMRFrameTable.h"

namespace android {

namespace {
// Types 0-7 are the eight speech modes (4.75 to 12.2 kbit/s), 8 is SID,
// 15 NO_DATA; 9-14 are not stored.
constexpr int kNarrowband[16] = {12, 13, 15, 17, 19, 20, 26, 31, 5, -1, -1, -1, -1, -1, -1, 0};
// Types 0-8 are the nine speech modes (6.60 to 23.85 kbit/s), 9 is SID,
// 14 SPEECH_LOST and 15 NO_DATA; 10-13 are reserved.
constexpr int kWideband[16] = {17, 23, 32, 36, 40, 46, 50, 58, 60, 5, -1, -1, -1, -1, 0, 0};
}  // namespace

int AMRFrameTable::payloadBytes(bool wideband, unsigned frameType) {
    if (frameType > 15) return -1;
    return wideband ? kWideband[frameType] : kNarrowband[frameType];
}

}  // namespace android
