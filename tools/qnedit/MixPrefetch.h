#ifndef QNEDIT_MIX_PREFETCH_H
#define QNEDIT_MIX_PREFETCH_H

#include <condition_variable>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <thread>

#include "MixPcm.h"

namespace qnedit {

// Reads (and decodes) a PcmReader's chunks on a thread of its own, a few
// chunks ahead of the mixer, so reading, mixing, encoding and writing
// overlap. The queue is bounded, so memory does not grow with the length.
// With `loop`, the audio starts again from the beginning at its end, for as
// long as chunks are taken.
class PrefetchedPcm {
public:
    using Opener = std::function<std::unique_ptr<PcmReader>()>;
    PrefetchedPcm(const Opener& open, bool loop);
    ~PrefetchedPcm();
    PrefetchedPcm(const PrefetchedPcm&) = delete;
    PrefetchedPcm& operator=(const PrefetchedPcm&) = delete;

    const PcmLayout& layout() const { return mLayout; }
    const android::sp<android::AMessage>& format() const { return mFormat; }
    bool decoded() const { return mDecoded; }
    int64_t durationUs() const { return mDurationUs; }
    // The next chunk; false at the end. An error of the reading thread is
    // raised here.
    bool next(PcmChunk* chunk);
    // Stops reading; what the first pass through the audio showed of damage.
    const ReadCoverage& finish();

private:
    void run();

    const Opener mOpen;
    const bool mLoop;
    std::unique_ptr<PcmReader> mReader;
    PcmLayout mLayout;
    android::sp<android::AMessage> mFormat;
    bool mDecoded = false;
    int64_t mDurationUs = -1;

    std::mutex mLock;
    std::condition_variable mChanged;
    std::deque<PcmChunk> mQueue;
    size_t mQueuedBytes = 0;
    bool mDone = false, mStop = false;
    bool mFailed = false;
    int mErrorCode = 0;
    std::string mError;
    ReadCoverage mCoverage;  // of the first pass, once it ended
    bool mHaveCoverage = false;
    std::thread mThread;
};

}  // namespace qnedit

#endif
