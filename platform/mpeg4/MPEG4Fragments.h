#ifndef MPEG4_FRAGMENTS_H_
#define MPEG4_FRAGMENTS_H_

#include <cstdint>
#include <memory>
#include <vector>

#include <media/stagefright/foundation/ByteReader.h>
#include <utils/Errors.h>

#include "mpeg4/MPEG4Track.h"

namespace android {
namespace mpeg4 {

// A track's defaults for its fragments ('trex', ISO/IEC 14496-12, 8.8.3).
struct TrackExtends {
    uint32_t trackId = 0;
    uint32_t duration = 0;
    uint32_t size = 0;
    uint32_t flags = 0;
};

// Reads the 'trex' boxes of an 'mvex' payload; false when one is short.
bool ReadMovieExtends(const ByteReader& mvex, std::vector<TrackExtends>* defaults);

// Adds the samples of movie fragments ('moof', 8.8.4) to the tracks of the
// movie, fragment by fragment in file order.
class FragmentReader {
public:
    FragmentReader(std::vector<TrackExtends> defaults, uint64_t fileSize)
        : mDefaults(std::move(defaults)), mFileSize(fileSize) {}

    // `moof` is the box's payload and `moofOffset` where the box starts.
    // OK when its samples were added; ERROR_END_OF_STREAM when its media
    // data runs past the end of the file (the samples that are there were
    // added, and no later fragment can follow); ERROR_MALFORMED when the
    // fragment cannot be trusted.
    status_t addFragment(const ByteReader& moof, uint64_t moofOffset,
                         const std::vector<std::shared_ptr<Track>>& tracks);

private:
    struct TrackFragment;
    status_t addTrackFragment(const ByteReader& traf, uint64_t moofOffset, bool first, uint64_t* dataEnd,
                              const std::vector<std::shared_ptr<Track>>& tracks);
    status_t addRun(ByteReader trun, const TrackFragment& tf, uint64_t* dataAt, int64_t* dts, Track* track);

    const std::vector<TrackExtends> mDefaults;
    const uint64_t mFileSize;
    std::vector<FragmentSample> mRun;  // reused from run to run
};

}  // namespace mpeg4
}  // namespace android

#endif
