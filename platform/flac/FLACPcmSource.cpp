#define LOG_TAG "FLACPcmSource"
#include "flac/FLACPcmSource.h"

#include <new>

#include <media/stagefright/MediaErrors.h>

namespace android {

FLACPcmSource::FLACPcmSource(const sp<DataSource>& source, const FlacStreamInfo& info, const sp<MetaData>& format)
    : TrackSource(format), mSource(source), mInfo(info), mAtEnd(false) {}

status_t FLACPcmSource::onStart() {
    mDecoder.reset(new (std::nothrow) FLACDecoder(mSource, mInfo));
    if (mDecoder == nullptr) return NO_MEMORY;
    const status_t err = mDecoder->init();
    if (err != OK) mDecoder.reset();
    mAtEnd = false;
    return err;
}

void FLACPcmSource::onStop() { mDecoder.reset(); }

status_t FLACPcmSource::seekTo(int64_t timeUs, SeekMode mode) {
    // Every PCM sample is a sync point.
    const uint64_t sample = SeekUnitIndex(timeUs, mInfo.sampleRate, 1, mode);
    mAtEnd = mInfo.totalSamples != 0 && sample >= mInfo.totalSamples;
    return mAtEnd ? OK : mDecoder->seek(sample);
}

status_t FLACPcmSource::readNext(MediaBufferBase** out) {
    if (mAtEnd) return ERROR_END_OF_STREAM;
    MediaBuffer* buffer = nullptr;
    const status_t err = mDecoder->decodeNext(&buffer);
    *out = buffer;
    return err;
}

}  // namespace android
