#define LOG_TAG "TrackSource"
#include "extractor/TrackSource.h"

#include <new>

#include <log/log.h>

namespace android {

TrackSource::TrackSource(const sp<MetaData>& format) : mFormat(format), mStarted(false) {}

status_t TrackSource::start(MetaData* /*params*/) {
    if (mStarted) return OK;
    const status_t err = onStart();
    if (err == OK) mStarted = true;
    return err;
}

status_t TrackSource::stop() {
    if (mStarted) onStop();
    mStarted = false;
    return OK;
}

sp<MetaData> TrackSource::getFormat() { return new MetaData(*mFormat); }

status_t TrackSource::read(MediaBufferBase** buffer, const ReadOptions* options) {
    if (buffer == nullptr) return BAD_VALUE;
    *buffer = nullptr;
    if (!mStarted) return INVALID_OPERATION;
    int64_t seekTimeUs;
    SeekMode mode;
    if (options != nullptr && options->getSeekTo(&seekTimeUs, &mode)) {
        const status_t err = seekTo(seekTimeUs < 0 ? 0 : seekTimeUs, mode);
        if (err != OK) return err;
    }
    const status_t err = readNext(buffer);
    if (err != OK && *buffer != nullptr) {
        (*buffer)->release();
        *buffer = nullptr;
    }
    return err;
}

MediaBuffer* TrackSource::NewSampleBuffer(size_t size, int64_t timeUs) {
    MediaBuffer* buffer = new (std::nothrow) MediaBuffer(size);
    if (buffer == nullptr) return nullptr;
    if (size > 0 && buffer->data() == nullptr) {
        ALOGE("cannot allocate a sample of %zu bytes", size);
        buffer->release();
        return nullptr;
    }
    buffer->add_ref();
    buffer->meta_data().setInt64(kKeyTime, timeUs);
    buffer->meta_data().setInt32(kKeyIsSyncFrame, 1);
    return buffer;
}

}  // namespace android
