#define LOG_TAG "AMRSource"
#include "amr/AMRSource.h"

#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "amr/AMRFrames.h"

namespace android {

AMRSource::AMRSource(const sp<DataSource>& source, const sp<AMRFrameIndex>& index, const sp<MetaData>& format)
    : TrackSource(format), mSource(source), mIndex(index), mNextFrame(0), mNextOffset(0) {
    mIndex->offsetOf(mSource, 0, &mNextOffset);
}

status_t AMRSource::seekTo(int64_t timeUs, SeekMode mode) {
    // Every frame is a sync point; count in milliseconds, 20 per frame.
    const uint64_t frame = SeekUnitIndex(timeUs, 1000, kAMRFrameDurationUs / 1000, mode);
    if (frame >= mIndex->frameCount()) {
        mNextFrame = mIndex->frameCount();
        return OK;
    }
    const status_t err = mIndex->offsetOf(mSource, frame, &mNextOffset);
    if (err != OK) return err;
    mNextFrame = frame;
    return OK;
}

status_t AMRSource::readNext(MediaBufferBase** out) {
    if (mNextFrame >= mIndex->frameCount()) return mIndex->endStatus();
    uint8_t frame[kAMRMaxFrameSize];
    const ssize_t n = mSource->readAt(mNextOffset, frame, sizeof(frame));
    if (n < 0) return ERROR_IO;
    const size_t size = n > 0 ? AMRFrameSize(mIndex->isWide(), frame[0]) : 0;
    if (size == 0 || size > static_cast<size_t>(n)) {
        ALOGW("frame %llu is no longer readable", (unsigned long long)mNextFrame);
        return ERROR_MALFORMED;
    }
    MediaBuffer* buffer = NewSampleBuffer(size, static_cast<int64_t>(mNextFrame) * kAMRFrameDurationUs);
    if (buffer == nullptr) return NO_MEMORY;
    memcpy(buffer->data(), frame, size);
    *out = buffer;
    ++mNextFrame;
    mNextOffset += static_cast<off64_t>(size);
    return OK;
}

}  // namespace android
