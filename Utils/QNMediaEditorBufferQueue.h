#ifndef QN_MEDIA_EDITOR_BUFFER_QUEUE_H
#define QN_MEDIA_EDITOR_BUFFER_QUEUE_H

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <mutex>

#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <utils/List.h>

namespace android {
namespace qnmediaeditor {

// A blocking FIFO of access units (ABuffers whose meta carries "timeUs"),
// readable as a MediaSource. Producers queue units and end the stream with
// signalEOS(); consumers read() or dequeue units, whole or in pieces.
// Unbounded; no seeking.
class QNMediaEditorBufferQueue : public MediaSource {
public:
    explicit QNMediaEditorBufferQueue(const sp<MetaData>& format);

    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    sp<MetaData> getFormat() override;
    // Blocks until a unit is queued or the stream has ended. The options are
    // ignored: the queue cannot seek.
    status_t read(MediaBufferBase** buffer, const MediaTrack::ReadOptions* options = nullptr) override;

    // Keeps the first non-null format; call before sharing the queue.
    void setFormat(const sp<MetaData>& format);

    void queueAccessUnit(const sp<ABuffer>& buffer);
    // `result` must not be OK; consumers get it once the queue runs dry.
    void signalEOS(status_t result);
    // Drops every unit and reopens the stream.
    void clear();
    // A disabled queue looks empty to the three queries below only.
    void enable(bool enable);

    bool hasBufferAvailable(status_t* finalResult);
    bool isEmpty();
    int32_t getAvailableBufferCount(status_t* finalResult);
    // Never waits: WOULD_BLOCK on an empty open queue.
    status_t nextBufferTime(int64_t* timeUs);
    uint32_t nextBufferSize();
    bool isFinished(int64_t durationUs) const;

    status_t dequeueAccessUnit(sp<ABuffer>* accessUnit);
    // Copies the first `size` bytes of the front unit, which stays queued
    // with its time advanced by `timeOffsetUs`. A size beyond the unit is
    // clamped to what the unit holds.
    status_t dequeueAccessUnit(sp<ABuffer>* accessUnit, uint32_t size, int64_t timeOffsetUs);

protected:
    ~QNMediaEditorBufferQueue() override;

private:
    // With the lock held: waits while the stream is open and empty. False
    // when the stream ended with nothing left.
    bool waitForUnit(std::unique_lock<std::mutex>& lock);
    // A consumer that leaves units behind passes the wake-up on, so that no
    // other consumer stays blocked while something is queued.
    void wakeNextIfAny();

    std::mutex mLock;
    // Waits have no timeout, so the clock of the wait does not matter.
    std::condition_variable mCondition;
    bool mEnabled;
    sp<MetaData> mFormat;
    int64_t mLastQueuedTimeUs;
    List<sp<ABuffer>> mBuffers;
    // Atomic because isFinished() reads it without the lock.
    std::atomic<status_t> mEOSResult;

    QNMediaEditorBufferQueue(const QNMediaEditorBufferQueue&) = delete;
    QNMediaEditorBufferQueue& operator=(const QNMediaEditorBufferQueue&) = delete;
};

}  // namespace qnmediaeditor
}  // namespace android

#endif
