#ifndef QNEDIT_TRIM_WINDOW_H_
#define QNEDIT_TRIM_WINDOW_H_

#include <climits>
#include <cstdint>
#include <deque>
#include <string>
#include <vector>

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>

#include "QNMediaExtractorWrapper.h"

namespace qnedit {

// Which samples of one track a trim keeps, seen in decoding order.
//
// Start: a track is read from a sync sample at or before the start (audio
// that needs it from one frame earlier); samples stored before that sync
// sample are skipped. What is presented before the start is kept for
// decoding and hidden by the output's edit list.
//
// End: with reordered frames a sample presented before the end can be stored
// after one presented at or past it (B-frames after the P-frame they refer
// to). Every sample presented before the end is kept, and so are the samples
// stored between them, hidden by the edit list; those stored after the last
// one presented before the end are dropped. A sample decoded and presented at
// or past the end closes the track: decoding times only grow and no sample
// is presented before it is decoded.
class TrimWindow {
public:
    struct Sample {
        android::sp<android::ABuffer> buffer;
        int64_t timeUs;
        uint32_t flags;
    };
    enum class Step {
        kSkip,   // not needed: advance without reading
        kClose,  // nothing more of this track is needed
        kRead,   // read it and hand it to take()
    };

    TrimWindow() = default;
    // `firstSyncUs`: presentation time of the sync sample the track starts
    // from (LLONG_MIN to take every sample delivered); `endUs` < 0: no end.
    TrimWindow(int64_t firstSyncUs, int64_t endUs) : mFirstSyncUs(firstSyncUs), mEndUs(endUs) {}

    Step step(int64_t timeUs, const android::sp<android::MetaData>& meta);
    // The samples to write now, in order; a sample past the end is held
    // until a later one shows it is needed, or dropped with the track.
    std::vector<Sample> take(const Sample& sample);

    // The latest presentation time of a sample given out to be written and
    // presented before the end (LLONG_MIN when none was).
    int64_t deliveredUntilUs() const { return mDeliveredUs; }
    // True once a sample at or past the end was seen.
    bool reachedEnd() const { return mReachedEnd; }

private:
    static constexpr size_t kMaxHeld = 64;

    int64_t mFirstSyncUs = LLONG_MIN;
    int64_t mEndUs = -1;
    bool mStarted = false;
    bool mReachedEnd = false;
    int64_t mMaxLagUs = 0;  // how far a decoding time ran past its presentation
    int64_t mDeliveredUs = LLONG_MIN;
    std::deque<Sample> mHeld;
};

// The audio a decoder needs before the first sample it shows (one AAC frame,
// whose overlap the next frame completes); 0 for other tracks and outputs.
int64_t trimPrerollUs(const android::sp<android::AMessage>& format, const std::string& outFormat);

// Where the presentation of a trim starts: `startUs`, or with `fromSync` the
// earliest sync sample at or before it among `tracks`.
int64_t trimOrigin(android::qnmediaeditor::QNMediaExtractorWrapper& w, const std::vector<size_t>& tracks,
                   int64_t startUs, bool fromSync);

struct TrimTrack {
    size_t source;
    int64_t prerollUs;
    TrimWindow* window;
};
// Selects the tracks and positions the reading so that each track delivers
// from the first sample needed to show `originUs`, and sets up their windows.
// False when no track has anything there.
bool seekTrimStart(android::qnmediaeditor::QNMediaExtractorWrapper& w, const std::vector<TrimTrack>& tracks,
                   int64_t originUs, int64_t endUs);

// The writer stops a track's presentation at its duration: the end of the
// trim on the output's time line, or no bound without one.
void setTrimDuration(const android::sp<android::AMessage>& format, int64_t originUs, int64_t endUs);

}  // namespace qnedit

#endif
