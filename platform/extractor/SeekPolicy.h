#ifndef PLATFORM_EXTRACTOR_SEEK_POLICY_H_
#define PLATFORM_EXTRACTOR_SEEK_POLICY_H_

#include <cstdint>

#include <media/MediaTrack.h>

namespace android {

typedef MediaTrack::ReadOptions::SeekMode SeekMode;

// Index of the unit to start at when seeking to timeUs, for a track made of
// equal units of `unitTicks` ticks of a `rate` Hz clock, every unit being a
// sync point. The result may equal or pass `count` (end of track).
uint64_t SeekUnitIndex(int64_t timeUs, uint64_t rate, uint64_t unitTicks, SeekMode mode);

// For a target between the starts of two neighbouring sync units (before <=
// target < after), whether the later one serves the seek mode better.
bool SeekPrefersLater(int64_t target, int64_t before, int64_t after, SeekMode mode);

// Microseconds of `ticks` at `rate` Hz, without overflow for any 64-bit count.
int64_t TicksToUs(uint64_t ticks, uint64_t rate);

}  // namespace android

#endif
