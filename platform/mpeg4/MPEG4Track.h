#ifndef MPEG4_TRACK_H_
#define MPEG4_TRACK_H_

#include <cstdint>

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ByteReader.h>
#include <utils/Errors.h>

#include "mpeg4/MPEG4SampleTable.h"

namespace android {
namespace mpeg4 {

// Ticks of `timescale` in microseconds, rounded to nearest and kept in a range
// where sums of a few such times cannot overflow.
int64_t SignedTicksToUs(int64_t ticks, uint32_t timescale);

// One track of the movie, read-only once parsed; its sources share it.
struct Track {
    sp<MetaData> meta = new MetaData;
    SampleTable table;
    uint32_t timescale = 0;
    // The edit list's start in the media (an encoder delay, the first
    // composition offset), and how late presentation starts (empty edits).
    int64_t mediaStartTicks = 0;
    int64_t emptyEditUs = 0;
    uint32_t nalLengthSize = 0;  // AVC/HEVC length prefix; 0 for other codecs
    bool isAudio = false;

    int64_t presentationUs(const SampleInfo& s) const {
        return SignedTicksToUs(s.dts + s.ctsOffset - mediaStartTicks, timescale) + emptyEditUs;
    }
    int64_t decodingUs(const SampleInfo& s) const {
        return SignedTicksToUs(s.dts - mediaStartTicks, timescale) + emptyEditUs;
    }
};

// Reads a 'trak' payload. ERROR_UNSUPPORTED for a track that is neither
// audio nor video or whose codec is not handed out; ERROR_MALFORMED when its
// headers or sample tables cannot be trusted.
status_t ParseTrack(const ByteReader& trak, uint32_t movieTimescale, Track* track);

}  // namespace mpeg4
}  // namespace android

#endif
