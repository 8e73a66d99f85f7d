#ifndef MPEG4_EDIT_LIST_H_
#define MPEG4_EDIT_LIST_H_

#include <cstdint>
#include <vector>

#include <media/stagefright/foundation/ByteReader.h>
#include <utils/Errors.h>

#include "mpeg4/MPEG4SampleTable.h"

namespace android {
namespace mpeg4 {

// One entry of an edit list (ISO/IEC 14496-12, 8.6.6).
struct Edit {
    uint64_t duration = 0;  // movie timescale; 0 on the last edit of a fragmented file: to the end
    int64_t mediaTime = -1;  // media timescale; -1 for an empty edit
    uint32_t rate = 0x10000;  // 16.16 fixed point
};

// Reads an 'elst' payload.
status_t ReadEditList(ByteReader elst, std::vector<Edit>* edits);

// A stretch of the track's samples played at `startUs` of the presentation
// from `mediaStartTicks` of the media. It begins early enough for decoding
// (at the sync sample before, and one sample before for audio, whose decoders
// need the previous frame) and ends with the last sample decoded before the
// edit ends, so its first and last samples may be presented outside it.
struct Segment {
    uint32_t begin = 0;
    uint32_t end = 0;
    int64_t mediaStartTicks = 0;
    int64_t startUs = 0;
};

struct EditLayout {
    std::vector<Segment> segments;  // in play order; none when nothing is played
    int64_t durationUs = -1;        // -1 when the edits do not say
};

// Plays the edits one after another: empty edits delay what follows, media
// edits take their stretch of the samples. Without edits the whole track plays
// from its start. ERROR_UNSUPPORTED for a media edit played at a rate other
// than 1 (a dwell or a change of speed): those are not laid out, and handing
// out the track without them would play it wrong. ERROR_MALFORMED when times overflow or there are more
// segments than a track could sensibly hold.
status_t LayOutEdits(const std::vector<Edit>& edits, uint32_t movieTimescale, uint32_t mediaTimescale,
                     const SampleTable& table, bool isAudio, EditLayout* layout);

}  // namespace mpeg4
}  // namespace android

#endif
