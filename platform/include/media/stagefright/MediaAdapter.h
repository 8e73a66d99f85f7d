#ifndef MEDIA_ADAPTER_H_
#define MEDIA_ADAPTER_H_

#include <condition_variable>
#include <deque>
#include <mutex>

#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MetaData.h>

namespace android {

// Hands buffers pushed by one thread to a writer that reads them on another.
// A bounded queue between the two. Both sides are woken in batches, so that a
// long copy costs a few thread switches per queue's worth of buffers instead of
// one or two per sample: a waiting reader is woken once a quarter of the queue
// has gathered (or at stop()), a pusher waiting on a full queue once it has
// drained to half. A producer that pauses keeps up to a quarter of the queue
// unwritten until it pushes more or stops the adapter.
//
// The writer reads with a ReadOptions object. A read without options comes
// from outside the writer (the muxer's forced track stop): it never waits and
// never takes a queued buffer, which belongs to the writer, and answers
// WOULD_BLOCK.
//
// stop() ends the stream: buffers pushed before it are still delivered, then
// reads answer ERROR_END_OF_STREAM; pushes after it are refused.
struct MediaAdapter : public MediaSource, public MediaBufferObserver {
    explicit MediaAdapter(const sp<MetaData>& meta, size_t maxQueued = kDefaultMaxQueued);

    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    sp<MetaData> getFormat() override;
    status_t read(MediaBufferBase** buffer, const ReadOptions* options = nullptr) override;

    void signalBufferReturned(MediaBufferBase* buffer) override;

    // Takes over one reference of the buffer (the caller's add_ref). OK, or
    // INVALID_OPERATION once stopped (the buffer is then given back).
    status_t pushBuffer(MediaBuffer* buffer);

    static constexpr size_t kDefaultMaxQueued = 64;

protected:
    ~MediaAdapter() override;

private:
    void giveBack(MediaBufferBase* buffer);

    std::mutex mLock;
    std::condition_variable mReaderCond;
    std::condition_variable mPusherCond;
    std::deque<MediaBuffer*> mQueue;
    sp<MetaData> mOutputFormat;
    const size_t mMaxQueued;
    const size_t mWakeReaderAt;  // queued buffers that wake a waiting reader
    const size_t mWakePusherAt;  // queued buffers that wake a waiting pusher
    bool mStarted = false;
    bool mStopped = false;
    bool mReaderWaiting = false;
    bool mPusherWaiting = false;
};

}  // namespace android

#endif
