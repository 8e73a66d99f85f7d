#define LOG_TAG "WAVSource"
#include "wav/WAVSource.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

namespace {
constexpr uint32_t kSampleBytes = 4096;
}

uint32_t WAVSource::FramesPerSample(uint32_t frameSize) {
    return frameSize >= kSampleBytes ? 1 : kSampleBytes / frameSize;
}

WAVSource::WAVSource(const sp<DataSource>& source, const WAVInfo& info, const sp<MetaData>& format)
    : TrackSource(format),
      mSource(source),
      mDataOffset(info.dataOffset),
      mFrameCount(info.frameCount),
      mFrameSize(info.frameSize),
      mSampleRate(info.sampleRate),
      mFramesPerSample(FramesPerSample(info.frameSize)),
      mNextFrame(0) {}

status_t WAVSource::seekTo(int64_t timeUs, SeekMode mode) {
    // Every frame is a sync point.
    mNextFrame = std::min(SeekUnitIndex(timeUs, mSampleRate, 1, mode), mFrameCount);
    return OK;
}

status_t WAVSource::readNext(MediaBufferBase** out) {
    if (mNextFrame >= mFrameCount) return ERROR_END_OF_STREAM;
    const uint64_t frames = std::min<uint64_t>(mFramesPerSample, mFrameCount - mNextFrame);
    const size_t bytes = static_cast<size_t>(frames * mFrameSize);
    MediaBuffer* buffer = NewSampleBuffer(bytes, TicksToUs(mNextFrame, mSampleRate));
    if (buffer == nullptr) return NO_MEMORY;
    *out = buffer;
    const ssize_t got = mSource->readAt(mDataOffset + static_cast<off64_t>(mNextFrame * mFrameSize),
                                        buffer->data(), bytes);
    if (got < 0) {
        ALOGW("read failed (%zd)", got);
        return ERROR_IO;
    }
    // The file may have shrunk since it was opened: hand out whole frames only.
    const size_t whole = static_cast<size_t>(got) / mFrameSize * mFrameSize;
    if (whole == 0) return ERROR_END_OF_STREAM;
    buffer->set_range(0, whole);
    mNextFrame += whole / mFrameSize;
    return OK;
}

}  // namespace android
