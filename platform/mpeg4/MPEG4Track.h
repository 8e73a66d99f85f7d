#ifndef MPEG4_TRACK_H_
#define MPEG4_TRACK_H_

#include <cstdint>

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ByteReader.h>
#include <utils/Errors.h>

#include <vector>

#include "mpeg4/MPEG4EditList.h"
#include "mpeg4/MPEG4SampleTable.h"

namespace android {
namespace mpeg4 {

// Ticks of `timescale` in microseconds, rounded to nearest and kept in a range
// where sums of a few such times cannot overflow.
int64_t SignedTicksToUs(int64_t ticks, uint32_t timescale);

// One track of the movie, read-only once finished; its sources share it.
struct Track {
    sp<MetaData> meta = new MetaData;
    SampleTable table;
    uint32_t trackId = 0;
    uint32_t timescale = 0;
    uint32_t nalLengthSize = 0;  // AVC/HEVC length prefix; 0 for other codecs
    bool isAudio = false;
    // What the movie box says, kept until the samples are all known.
    std::vector<Edit> edits;
    uint64_t mediaDuration = 0;  // media timescale; 0 when unknown
    bool fragmented = false;     // samples came in movie fragments too
    uint32_t avgBitrate = 0;
    // The samples in play order (see LayOutEdits).
    std::vector<Segment> segments;

    int64_t presentationUs(const SampleInfo& s, const Segment& seg) const {
        return SignedTicksToUs(s.dts + s.ctsOffset - seg.mediaStartTicks, timescale) + seg.startUs;
    }
    int64_t decodingUs(const SampleInfo& s, const Segment& seg) const {
        return SignedTicksToUs(s.dts - seg.mediaStartTicks, timescale) + seg.startUs;
    }
};

// Reads a 'trak' payload: its headers, sample description, the sample tables
// of the movie box and its edit list. ERROR_UNSUPPORTED for a track that is
// neither audio nor video or whose codec is not handed out; ERROR_MALFORMED
// when its headers or sample tables cannot be trusted.
status_t ParseTrack(const ByteReader& trak, Track* track);

// Once fragments have added their samples: lays out the edits and sets the
// metadata that depends on the samples, the counts of samples and sync samples
// played and, in a file cut short at `fileSize`, where the track's data stops.
// ERROR_UNSUPPORTED for edits that are not played at rate 1.
status_t FinishTrack(uint32_t movieTimescale, uint64_t fileSize, Track* track);

}  // namespace mpeg4
}  // namespace android

#endif
