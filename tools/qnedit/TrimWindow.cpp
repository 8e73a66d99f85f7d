#include "TrimWindow.h"

#include <algorithm>

#include <media/MediaTrack.h>
#include <media/stagefright/MediaDefs.h>

#include "Input.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

TrimWindow::Step TrimWindow::step(int64_t timeUs, const sp<MetaData>& meta) {
    int64_t decodingUs = timeUs;
    int32_t sync = 0;
    if (meta != nullptr) {
        meta->findInt64(kKeyDecodingTime, &decodingUs);
        meta->findInt32(kKeyIsSyncFrame, &sync);
    }
    if (!mStarted) {
        // Reading may have begun at an earlier sync sample than this track
        // needs (another track asked for more); what precedes its own is
        // not needed.
        if (mFirstSyncUs != LLONG_MIN && !(sync && timeUs >= mFirstSyncUs)) return Step::kSkip;
        mStarted = true;
    }
    mMaxLagUs = std::max(mMaxLagUs, decodingUs - timeUs);
    if (mEndUs >= 0 && timeUs >= mEndUs) {
        mReachedEnd = true;
        // Negative composition offsets let a sample be shown before it is
        // decoded; allow for the largest lag seen.
        if (decodingUs - mMaxLagUs >= mEndUs) {
            mHeld.clear();
            return Step::kClose;
        }
    }
    return Step::kRead;
}

std::vector<TrimWindow::Sample> TrimWindow::take(const Sample& sample) {
    std::vector<Sample> out;
    if (mEndUs >= 0 && sample.timeUs >= mEndUs) {
        mHeld.push_back(sample);
        // Bounded: past this many, the oldest is written (kept, hidden).
        if (mHeld.size() > kMaxHeld) {
            out.push_back(mHeld.front());
            mHeld.pop_front();
        }
        return out;
    }
    out.assign(mHeld.begin(), mHeld.end());
    mHeld.clear();
    out.push_back(sample);
    mDeliveredUs = std::max(mDeliveredUs, sample.timeUs);
    return out;
}

int64_t trimPrerollUs(const sp<AMessage>& format, const std::string& outFormat) {
    if (outFormat != "mp4" && outFormat != "m4a") return 0;
    int32_t rate = 0;
    if (Input::mimeOf(format) != MEDIA_MIMETYPE_AUDIO_AAC || !format->findInt32("sample-rate", &rate) || rate <= 0) {
        return 0;
    }
    return (1024 * 1000000LL + rate - 1) / rate;
}

namespace {

// The presentation time of the sync sample at or before `timeUs` of one
// track, or LLONG_MIN when there is none.
int64_t syncBefore(QNMediaExtractorWrapper& w, size_t track, int64_t timeUs) {
    int64_t t = LLONG_MIN;
    if (w.selectTrack(track) != OK) return t;
    if (w.seekTo(timeUs, MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC) != OK || w.getSampleTime(&t) != OK) {
        t = LLONG_MIN;
    }
    w.unselectTrack(track);
    return t;
}

}  // namespace

int64_t trimOrigin(QNMediaExtractorWrapper& w, const std::vector<size_t>& tracks, int64_t startUs, bool fromSync) {
    int64_t origin = startUs;
    if (!fromSync) return origin;
    for (size_t track : tracks) {
        const int64_t t = syncBefore(w, track, startUs);
        if (t != LLONG_MIN) origin = std::min(origin, t);
    }
    return origin;
}

bool seekTrimStart(QNMediaExtractorWrapper& w, const std::vector<TrimTrack>& tracks, int64_t originUs, int64_t endUs) {
    int64_t readFromUs = originUs;
    for (const TrimTrack& t : tracks) {
        // Tracks with a pre-roll take every sample from where reading starts;
        // the others skip to their own sync sample.
        const int64_t firstSync = t.prerollUs > 0 ? LLONG_MIN : syncBefore(w, t.source, originUs);
        *t.window = TrimWindow(firstSync, endUs);
        readFromUs = std::min(readFromUs, originUs - t.prerollUs);
    }
    for (const TrimTrack& t : tracks) w.selectTrack(t.source);
    // A freshly selected track reads from its first sample, which is how a
    // sample presented before time 0 (an AAC encoder's priming frame) is
    // reached: a seek cannot go before 0.
    return w.seekTo(readFromUs > 0 ? readFromUs : -1, MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC) == OK;
}

void setTrimDuration(const sp<AMessage>& format, int64_t originUs, int64_t endUs) {
    if (endUs >= 0) {
        format->setInt64("durationUs", endUs - originUs);
    } else {
        format->removeEntry("durationUs");
    }
}

}  // namespace qnedit
