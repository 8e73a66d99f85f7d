#define LOG_TAG "MediaAdapter"
#include <media/stagefright/MediaAdapter.h>

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

MediaAdapter::MediaAdapter(const sp<MetaData>& meta, size_t maxQueued)
    : mOutputFormat(meta),
      mMaxQueued(maxQueued ? maxQueued : 1),
      mWakeReaderAt(std::max<size_t>(1, mMaxQueued / 4)),
      mWakePusherAt(mMaxQueued / 2) {}

MediaAdapter::~MediaAdapter() {
    for (MediaBuffer* buffer : mQueue) giveBack(buffer);
    mQueue.clear();
}

void MediaAdapter::giveBack(MediaBufferBase* buffer) {
    // The buffer's observer is this adapter while it is queued; unhook it so
    // that the last release deletes it.
    buffer->setObserver(nullptr);
    buffer->release();
}

status_t MediaAdapter::start(MetaData*) {
    std::lock_guard<std::mutex> lock(mLock);
    mStarted = true;
    return OK;
}

status_t MediaAdapter::stop() {
    std::lock_guard<std::mutex> lock(mLock);
    mStopped = true;
    mReaderCond.notify_all();
    mPusherCond.notify_all();
    return OK;
}

sp<MetaData> MediaAdapter::getFormat() {
    std::lock_guard<std::mutex> lock(mLock);
    return mOutputFormat;
}

status_t MediaAdapter::read(MediaBufferBase** buffer, const ReadOptions* options) {
    *buffer = nullptr;
    std::unique_lock<std::mutex> lock(mLock);
    if (options == nullptr) return mStopped && mQueue.empty() ? status_t(ERROR_END_OF_STREAM) : status_t(WOULD_BLOCK);
    while (mQueue.empty() && !mStopped) {
        mReaderWaiting = true;
        mReaderCond.wait(lock, [this] { return !mReaderWaiting || mStopped; });
    }
    mReaderWaiting = false;
    if (mQueue.empty()) return ERROR_END_OF_STREAM;
    MediaBuffer* front = mQueue.front();
    mQueue.pop_front();
    if (mPusherWaiting && mQueue.size() <= mWakePusherAt) {
        mPusherWaiting = false;
        mPusherCond.notify_all();
    }
    lock.unlock();
    // The reader owns it now; release() without an observer frees it.
    front->setObserver(nullptr);
    *buffer = front;
    return OK;
}

void MediaAdapter::signalBufferReturned(MediaBufferBase* buffer) { giveBack(buffer); }

status_t MediaAdapter::pushBuffer(MediaBuffer* buffer) {
    if (buffer == nullptr) return BAD_VALUE;
    std::unique_lock<std::mutex> lock(mLock);
    while (!mStopped && mQueue.size() >= mMaxQueued) {
        mPusherWaiting = true;
        mPusherCond.wait(lock, [this] { return !mPusherWaiting || mStopped; });
    }
    if (mStopped) {
        lock.unlock();
        ALOGW("buffer pushed after stop, dropped");
        giveBack(buffer);
        return INVALID_OPERATION;
    }
    mQueue.push_back(buffer);
    if (mReaderWaiting && mQueue.size() >= mWakeReaderAt) {
        mReaderWaiting = false;
        mReaderCond.notify_all();
    }
    return OK;
}

}  // namespace android
