#ifndef MP4_TRACK_TIMING_H_
#define MP4_TRACK_TIMING_H_

#include <cstdint>
#include <vector>

#include <utils/Errors.h>

namespace android {

class Mp4BoxWriter;

// Microseconds <-> ticks of a time scale, rounded to nearest, without
// overflow for any 64-bit time.
int64_t Mp4UsToTicks(int64_t us, uint32_t timescale);
int64_t Mp4TicksToUs(int64_t ticks, uint32_t timescale);

// What narrows a track's presentation besides its samples' times.
struct Mp4TrackBounds {
    // Where the presentation stops at the latest (< 0: none); applied when
    // the last sample stored is presented before it.
    int64_t endUs = -1;
    bool startsOnSample = false;  // video: start on the first frame presented from 0 on
};

// The timing of one track as stored: decoding deltas (stts), composition
// offsets (ctts) and the edit that presents it.
//
// Presentation rule: sample times are presentation times on the movie's
// time line, which starts at time 0. A track is shown from
// max(0, its earliest presentation time): when that is later than 0 an empty
// edit covers the gap; samples presented before 0 (pre-roll kept from an
// earlier sync sample) are decoded but hidden, because the media edit starts
// at the media time of presentation time 0. Composition offsets are stored
// unsigned (ctts version 0): when a decoding time would follow its
// presentation time, the whole decoding time line is moved earlier and the
// edit's media time takes the shift back out, so presentation times stay
// exact.
//
// Bounds can narrow that: an end on the movie time line, past which samples
// kept only as references (a P-frame stored before the B-frames shown before
// the end) are decoded but hidden; and for video a start on a frame: a frame
// that would be shown from before time 0 is hidden and an empty edit covers
// the time until the next one, so exactly the frames presented from 0 on are
// shown.
//
// Decoding times are kept when they increase strictly and never pass the
// presentation time; otherwise (generated times running ahead of B-frames,
// repeated or unordered times) they are rebuilt from the sorted presentation
// times, the order in which such a stream must be decoded.
struct Mp4TrackTiming {
    struct Run {
        uint32_t count;
        uint32_t value;
    };

    uint32_t timescale = 0;
    std::vector<Run> stts;
    std::vector<Run> ctts;        // empty when every offset is 0
    uint64_t mediaDuration = 0;   // ticks, the sum of stts
    bool rebuiltDecodingTimes = false;

    // The edit: presentation starts at startUs on the movie time line and
    // shows `shownTicks` of media from `mediaTime`.
    bool needsEdit = false;
    int64_t startUs = 0;
    int64_t mediaTime = 0;
    uint64_t shownTicks = 0;

    // `candidates`: time scales in order of preference; the first in which
    // every time is exact to the microsecond and every table value fits is
    // taken (else the first that fits, times rounded to its ticks).
    // `lastDurationUs` is the duration of the last sample when there is no
    // earlier delta to repeat.
    status_t compute(const std::vector<int64_t>& dtsUs, const std::vector<int64_t>& ptsUs,
                     const std::vector<uint32_t>& candidates, int64_t lastDurationUs,
                     const Mp4TrackBounds& bounds = Mp4TrackBounds());

    void writeDecodingTimes(Mp4BoxWriter& w) const;     // stts
    void writeCompositionOffsets(Mp4BoxWriter& w) const;  // ctts, when needed
    // edts/elst in the movie time scale; nothing when no edit is needed.
    void writeEdits(Mp4BoxWriter& w, uint32_t movieTimescale) const;
    // The track's duration on the movie time line (tkhd).
    uint64_t presentedDuration(uint32_t movieTimescale) const;

private:
    bool tryTimescale(const std::vector<int64_t>& dtsUs, const std::vector<int64_t>& ptsUs,
                      uint32_t ts, int64_t lastDurationUs, const Mp4TrackBounds& bounds, bool requireExact);
};

}  // namespace android

#endif
