#include "extractor/SeekPolicy.h"

namespace android {

bool SeekPrefersLater(int64_t target, int64_t before, int64_t after, SeekMode mode) {
    switch (mode) {
        case MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC:
            return false;
        case MediaTrack::ReadOptions::SEEK_NEXT_SYNC:
            return target > before;
        default:  // closest sync and closest: every unit here is a sync unit
            return after - target < target - before;
    }
}

uint64_t SeekUnitIndex(int64_t timeUs, uint64_t rate, uint64_t unitTicks, SeekMode mode) {
    if (timeUs <= 0 || rate == 0 || unitTicks == 0) return 0;
    // Work in ticks * 1e6 so that the rounding is exact.
    const unsigned __int128 scaled = static_cast<unsigned __int128>(timeUs) * rate;
    const unsigned __int128 unitScaled = static_cast<unsigned __int128>(unitTicks) * 1000000u;
    const unsigned __int128 index = scaled / unitScaled;
    const unsigned __int128 rest = scaled % unitScaled;
    if (index >= UINT64_MAX) return UINT64_MAX;
    bool later = false;
    if (rest != 0) {
        if (mode == MediaTrack::ReadOptions::SEEK_NEXT_SYNC) later = true;
        else if (mode != MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC) later = rest * 2 > unitScaled;
    }
    return static_cast<uint64_t>(index) + (later ? 1 : 0);
}

int64_t TicksToUs(uint64_t ticks, uint64_t rate) {
    if (rate == 0) return 0;
    const unsigned __int128 us = static_cast<unsigned __int128>(ticks) * 1000000u / rate;
    return us > static_cast<unsigned __int128>(INT64_MAX) ? INT64_MAX : static_cast<int64_t>(us);
}

}  // namespace android
