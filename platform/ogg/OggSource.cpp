#define LOG_TAG "OggSource"
#include "ogg/OggSource.h"

#include <cstring>
#include <new>

#include <media/stagefright/MediaErrors.h>

namespace android {

OggSource::OggSource(const sp<DataSource>& source, const std::shared_ptr<const VorbisHeaders>& headers,
                     const std::shared_ptr<const OggChain>& chain, const sp<MetaData>& format)
    : TrackSource(format), mSource(source), mHeaders(headers), mChain(chain) {}

status_t OggSource::onStart() {
    mStream.reset(new (std::nothrow) OggVorbisStream(mSource, mHeaders, mChain));
    return mStream != nullptr ? OK : NO_MEMORY;
}

void OggSource::onStop() { mStream.reset(); }

status_t OggSource::seekTo(int64_t timeUs, SeekMode mode) { return mStream->seek(timeUs, mode); }

status_t OggSource::readNext(MediaBufferBase** out) {
    const VorbisPacket* packet;
    const status_t err = mStream->peek(&packet);
    if (err != OK) return err;
    MediaBuffer* buffer = NewSampleBuffer(packet->data.size(), TicksToUs(packet->start, mHeaders->sampleRate()));
    if (buffer == nullptr) return NO_MEMORY;
    memcpy(buffer->data(), packet->data.data(), packet->data.size());
    buffer->meta_data().setInt32(kKeyValidSamples, packet->valid);
    mStream->pop();
    *out = buffer;
    return OK;
}

}  // namespace android
