#define LOG_TAG "SingleSourceWriter"
#include "writer/SingleSourceWriter.h"

#include <cerrno>

#include <fcntl.h>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

SingleSourceWriter::SingleSourceWriter(int fd, const char* name, Format* format)
    : mFd(fd), mName(name), mFormat(format) {}

SingleSourceWriter::~SingleSourceWriter() {
    // The owner normally stopped already; never leave a thread behind.
    if (mThread.joinable()) {
        if (mSource != nullptr) mSource->stop();
        mThread.join();
    }
}

bool SingleSourceWriter::started() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mStarted;
}

status_t SingleSourceWriter::addSource(const sp<MediaSource>& source) {
    if (source == nullptr) {
        ALOGE("%s: null source", mName);
        return BAD_VALUE;
    }
    std::lock_guard<std::mutex> lock(mLock);
    if (mStarted) {
        ALOGE("%s: addSource after start", mName);
        return INVALID_OPERATION;
    }
    if (mSource != nullptr) {
        ALOGE("%s: takes a single track", mName);
        return INVALID_OPERATION;
    }
    const sp<MetaData> format = source->getFormat();
    if (format == nullptr) {
        ALOGE("%s: source without a format", mName);
        return BAD_VALUE;
    }
    const status_t err = mFormat->checkSource(format);
    if (err != OK) return err;
    mSource = source;
    return OK;
}

void SingleSourceWriter::recordError(status_t err) {
    std::lock_guard<std::mutex> lock(mErrorLock);
    if (mError == OK) mError = err;
}

status_t SingleSourceWriter::start() {
    std::lock_guard<std::mutex> lock(mLock);
    if (mStarted) {
        ALOGE("%s: already started", mName);
        return INVALID_OPERATION;
    }
    if (mSource == nullptr) {
        ALOGE("%s: start without a source", mName);
        return INVALID_OPERATION;
    }
    mStarted = true;

    // Some formats write nothing until their first buffer; find an unusable
    // descriptor now rather than after the stream has been consumed.
    const int flags = mFd < 0 ? -1 : fcntl(mFd, F_GETFL);
    status_t err = OK;
    if (flags < 0) {
        ALOGE("%s: bad file descriptor %d", mName, mFd);
        err = BAD_VALUE;
    } else if ((flags & O_ACCMODE) == O_RDONLY) {
        ALOGE("%s: file descriptor %d is not writable", mName, mFd);
        err = -EBADF;  // what the first write would have met
    }
    if (err == OK) {
        err = mSource->start();
        if (err != OK) ALOGE("%s: source start failed (%d)", mName, err);
    }
    if (err == OK) {
        mSink = new FdSink(mFd, mFormat->writeBuffer());
        err = mFormat->writeHeader(*mSink, mSource->getFormat());
        if (err != OK) ALOGE("%s: writing the header failed (%d)", mName, err);
    }
    if (err != OK) {
        // No reader will run: end the source so that a producer pushing into
        // it is refused instead of waiting forever on a full queue.
        mSource->stop();
        recordError(err);
        mReachedEOS = true;
        return err;
    }
    mHeaderWritten = true;
    mThread = std::thread(&SingleSourceWriter::readLoop, this);
    return OK;
}

void SingleSourceWriter::readLoop() {
    // The adapter waits only for readers that pass options.
    MediaTrack::ReadOptions options;
    size_t samples = 0, skipped = 0;
    for (;;) {
        MediaBufferBase* buffer = nullptr;
        const status_t err = mSource->read(&buffer, &options);
        if (err != OK || buffer == nullptr) {
            if (err != OK && err != ERROR_END_OF_STREAM) {
                ALOGE("%s: source read failed (%d)", mName, err);
                recordError(err);
            }
            break;
        }
        bool failed;
        {
            std::lock_guard<std::mutex> lock(mErrorLock);
            failed = mError != OK;
        }
        if (buffer->range_length() == 0) {
            ++skipped;
        } else if (!failed) {
            const status_t writeErr = mFormat->writeSample(*mSink, *buffer);
            if (writeErr != OK) {
                ALOGE("%s: writing a sample failed (%d); dropping the rest", mName, writeErr);
                recordError(writeErr);
            }
            ++samples;
        }
        buffer->release();
    }
    if (skipped > 0) ALOGD("%s: skipped %zu empty buffers", mName, skipped);
    ALOGV("%s: reader done after %zu samples", mName, samples);
    mReachedEOS = true;
}

status_t SingleSourceWriter::stop() {
    std::lock_guard<std::mutex> lock(mLock);
    if (!mStarted) return OK;
    if (mStopped) return mStopStatus;
    mStopped = true;
    if (mThread.joinable()) {
        mSource->stop();
        mThread.join();
    }
    status_t err;
    {
        std::lock_guard<std::mutex> errLock(mErrorLock);
        err = mError;
    }
    if (mHeaderWritten) {
        // Finish even after an error: what was written stays a valid file.
        const status_t finishErr = mFormat->finish(*mSink);
        if (finishErr != OK) ALOGE("%s: finishing the file failed (%d)", mName, finishErr);
        if (err == OK) err = finishErr;
        if (err == OK) err = mSink->sync();
    }
    mStopStatus = err;
    return err;
}

status_t SingleSourceWriter::pause() {
    ALOGE("%s: pause is not supported", mName);
    return ERROR_UNSUPPORTED;
}

}  // namespace android
