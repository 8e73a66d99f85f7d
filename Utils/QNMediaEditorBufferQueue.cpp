#define LOG_TAG "QNMediaEditorBufferQueue"
#include "QNMediaEditorBufferQueue.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/ADebug.h>
#include <media/stagefright/foundation/AMessage.h>

// Assertion messages carry the service's source path and fixed line numbers so
// that crash reports read the same whatever the build tree looks like.
#define QUEUE_CHECK(line, condition) \
    CHECK_AT("frameworks/av/services/mediaeditorservice/Utils/QNMediaEditorBufferQueue", line, condition)

namespace android {
namespace qnmediaeditor {

namespace {

// Copies an optional blob of the unit's meta into the media buffer's metadata.
void copyBlob(const sp<AMessage>& meta, const char* name, MetaDataBase& to, uint32_t key) {
    sp<ABuffer> blob;
    if (meta->findBuffer(name, &blob) && blob != nullptr) {
        to.setData(key, 0, blob->data(), blob->size());
    }
}

}  // namespace

QNMediaEditorBufferQueue::QNMediaEditorBufferQueue(const sp<MetaData>& format)
    : mEnabled(true), mFormat(format), mLastQueuedTimeUs(0), mEOSResult(OK) {}

QNMediaEditorBufferQueue::~QNMediaEditorBufferQueue() {
    std::lock_guard<std::mutex> lock(mLock);
    mBuffers.clear();
    mFormat.clear();
}

status_t QNMediaEditorBufferQueue::start(MetaData*) { return OK; }

status_t QNMediaEditorBufferQueue::stop() { return OK; }

sp<MetaData> QNMediaEditorBufferQueue::getFormat() {
    std::lock_guard<std::mutex> lock(mLock);
    return mFormat;
}

void QNMediaEditorBufferQueue::setFormat(const sp<MetaData>& format) {
    // Taking the lock costs nothing here and keeps a late call race-free.
    std::lock_guard<std::mutex> lock(mLock);
    if (mFormat == nullptr && format != nullptr) mFormat = format;
}

bool QNMediaEditorBufferQueue::waitForUnit(std::unique_lock<std::mutex>& lock) {
    while (mEOSResult == OK && mBuffers.empty()) mCondition.wait(lock);
    return !mBuffers.empty();
}

void QNMediaEditorBufferQueue::wakeNextIfAny() {
    if (!mBuffers.empty()) mCondition.notify_one();
}

status_t QNMediaEditorBufferQueue::read(MediaBufferBase** out, const MediaTrack::ReadOptions*) {
    *out = nullptr;
    std::unique_lock<std::mutex> lock(mLock);
    if (!waitForUnit(lock)) return mEOSResult;

    sp<ABuffer> buffer = mBuffers.front();
    mBuffers.erase(mBuffers.begin());
    wakeNextIfAny();

    int64_t timeUs;
    QUEUE_CHECK(118, buffer->meta()->findInt64("timeUs", &timeUs));

    MediaBuffer* mediaBuffer = new MediaBuffer(buffer);
    MetaDataBase& meta = mediaBuffer->meta_data();
    meta.setInt64(kKeyTime, timeUs);
    int32_t isSync;
    if (buffer->meta()->findInt32("isSync", &isSync)) meta.setInt32(kKeyIsSyncFrame, isSync);
    copyBlob(buffer->meta(), "sei", meta, kKeySEI);
    copyBlob(buffer->meta(), "mpegUserData", meta, kKeyMpegUserData);

    *out = mediaBuffer;
    return OK;
}

void QNMediaEditorBufferQueue::queueAccessUnit(const sp<ABuffer>& buffer) {
    std::lock_guard<std::mutex> lock(mLock);
    mBuffers.push_back(buffer);
    mCondition.notify_one();
    int64_t lastQueuedTimeUs;
    QUEUE_CHECK(152, buffer->meta()->findInt64("timeUs", &lastQueuedTimeUs));
    mLastQueuedTimeUs = lastQueuedTimeUs;
}

void QNMediaEditorBufferQueue::signalEOS(status_t result) {
    QUEUE_CHECK(169, result != OK);
    std::lock_guard<std::mutex> lock(mLock);
    mEOSResult = result;
    // Every blocked consumer must see the end, not just one of them.
    mCondition.notify_all();
}

void QNMediaEditorBufferQueue::clear() {
    std::lock_guard<std::mutex> lock(mLock);
    mBuffers.clear();
    mEOSResult = OK;
}

void QNMediaEditorBufferQueue::enable(bool enable) {
    std::lock_guard<std::mutex> lock(mLock);
    mEnabled = enable;
}

bool QNMediaEditorBufferQueue::hasBufferAvailable(status_t* finalResult) {
    std::lock_guard<std::mutex> lock(mLock);
    *finalResult = OK;
    if (!mEnabled) return false;
    if (!mBuffers.empty()) return true;
    *finalResult = mEOSResult;
    return false;
}

bool QNMediaEditorBufferQueue::isEmpty() {
    std::lock_guard<std::mutex> lock(mLock);
    return !mEnabled || mBuffers.empty();
}

int32_t QNMediaEditorBufferQueue::getAvailableBufferCount(status_t* finalResult) {
    std::lock_guard<std::mutex> lock(mLock);
    *finalResult = OK;
    if (!mEnabled) return 0;
    if (mBuffers.empty()) {
        *finalResult = mEOSResult;
        return 0;
    }
    int32_t count = 0;
    for (auto it = mBuffers.begin(); it != mBuffers.end(); ++it) ++count;
    return count;
}

status_t QNMediaEditorBufferQueue::nextBufferTime(int64_t* timeUs) {
    *timeUs = 0;
    std::lock_guard<std::mutex> lock(mLock);
    if (mBuffers.empty()) return mEOSResult != OK ? status_t(mEOSResult) : status_t(WOULD_BLOCK);
    const sp<ABuffer>& buffer = mBuffers.front();
    QUEUE_CHECK(225, buffer->meta()->findInt64("timeUs", timeUs));
    return OK;
}

uint32_t QNMediaEditorBufferQueue::nextBufferSize() {
    std::lock_guard<std::mutex> lock(mLock);
    return mBuffers.empty() ? 0 : static_cast<uint32_t>(mBuffers.front()->size());
}

bool QNMediaEditorBufferQueue::isFinished(int64_t) const { return mEOSResult != OK; }

status_t QNMediaEditorBufferQueue::dequeueAccessUnit(sp<ABuffer>* accessUnit) {
    accessUnit->clear();
    std::unique_lock<std::mutex> lock(mLock);
    if (!waitForUnit(lock)) return mEOSResult;
    *accessUnit = mBuffers.front();
    mBuffers.erase(mBuffers.begin());
    wakeNextIfAny();
    return OK;
}

status_t QNMediaEditorBufferQueue::dequeueAccessUnit(sp<ABuffer>* accessUnit, uint32_t size,
                                                     int64_t timeOffsetUs) {
    accessUnit->clear();
    std::unique_lock<std::mutex> lock(mLock);
    if (!waitForUnit(lock)) return mEOSResult;

    const sp<ABuffer>& iBuff = mBuffers.front();
    int64_t timeUs;
    QUEUE_CHECK(261, iBuff->meta()->findInt64("timeUs", &timeUs));

    // Callers size their pieces from nextBufferSize(); a larger request takes
    // what is left rather than reading past the unit.
    const size_t take = std::min<size_t>(size, iBuff->size());
    sp<ABuffer> piece = ABuffer::CreateAsCopy(iBuff->data(), take);
    if (piece == nullptr) {
        wakeNextIfAny();
        return NO_MEMORY;
    }
    piece->setRange(0, take);
    piece->meta()->clear();
    piece->meta()->setInt64("timeUs", timeUs);

    // The remainder stays at the front, even when empty, until a whole take.
    // Wraps instead of overflowing on absurd offsets.
    iBuff->meta()->setInt64("timeUs", static_cast<int64_t>(static_cast<uint64_t>(timeUs) +
                                                           static_cast<uint64_t>(timeOffsetUs)));
    iBuff->setRange(iBuff->offset() + take, iBuff->size() - take);
    wakeNextIfAny();

    *accessUnit = piece;
    return OK;
}

}  // namespace qnmediaeditor
}  // namespace android
