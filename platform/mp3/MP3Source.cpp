#define LOG_TAG "MP3Source"
#include "mp3/MP3Source.h"

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

MP3Source::MP3Source(const sp<DataSource>& source, const MP3Layout& layout, const sp<MetaData>& format)
    : TrackSource(format), mSource(source), mLayout(layout), mOffset(layout.firstFrame), mFrame(0) {}

status_t MP3Source::onStart() {
    mOffset = mLayout.firstFrame;
    mFrame = 0;
    return OK;
}

status_t MP3Source::nextHeader(MP3FrameHeader* header) {
    if (mOffset + 4 > mLayout.end) return ERROR_END_OF_STREAM;
    uint8_t h[4];
    if (mSource->readAt(mOffset, h, 4) != 4) return ERROR_IO;
    if (ParseMP3FrameHeader(h, header) && SameMP3Stream(*header, mLayout.header)) return OK;
    const off64_t next = FindMP3Frame(mSource, mOffset + 1, mLayout.end, mLayout.end, header);
    ALOGW("no frame at %lld: %s", (long long)mOffset, next < 0 ? "none after it" : "skipped to the next");
    if (next < 0) return ERROR_MALFORMED;
    mOffset = next;
    return OK;
}

// Frames differ in length: the walk goes from the first to the one wanted.
status_t MP3Source::seekTo(int64_t timeUs, SeekMode mode) {
    const uint64_t target = SeekUnitIndex(timeUs, mLayout.header.sampleRate, mLayout.header.samples, mode);
    mOffset = mLayout.firstFrame;
    mFrame = 0;
    MP3FrameHeader header;
    while (mFrame < target) {
        const status_t err = nextHeader(&header);
        if (err == ERROR_END_OF_STREAM) return OK;
        if (err != OK) return err;
        mOffset += header.frameBytes;
        ++mFrame;
    }
    return OK;
}

status_t MP3Source::readNext(MediaBufferBase** out) {
    MP3FrameHeader header;
    const status_t err = nextHeader(&header);
    if (err != OK) return err;
    if (mOffset + header.frameBytes > mLayout.end) {
        ALOGW("the last frame is cut short at %lld", (long long)mLayout.end);
        mOffset = mLayout.end;
        return ERROR_MALFORMED;
    }
    MediaBuffer* buffer = NewSampleBuffer(header.frameBytes, TicksToUs(mFrame * header.samples, header.sampleRate));
    if (buffer == nullptr) return NO_MEMORY;
    if (mSource->readAt(mOffset, buffer->data(), header.frameBytes) != ssize_t(header.frameBytes)) {
        buffer->release();
        return ERROR_IO;
    }
    // Samples of this frame before the padding at the end begins.
    if (mLayout.trailingSamples > 0 && mLayout.frames > 0) {
        const uint64_t endSample = mLayout.frames * header.samples - mLayout.trailingSamples;
        const uint64_t first = mFrame * header.samples;
        if (endSample < first + header.samples) {
            buffer->meta_data().setInt32(kKeyValidSamples, int32_t(endSample > first ? endSample - first : 0));
        }
    }
    mOffset += header.frameBytes;
    ++mFrame;
    *out = buffer;
    return OK;
}

}  // namespace android
