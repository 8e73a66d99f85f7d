#define LOG_TAG "WAVSource"
#include "wav/WAVSource.h"

#include <algorithm>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "wav/G711.h"

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
      mOutputFrameSize(info.outputFrameSize()),
      mG711(info.isG711() ? info.encoding : 0),
      mSampleRate(info.sampleRate),
      mFramesPerSample(FramesPerSample(info.outputFrameSize())),
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
    const size_t outBytes = static_cast<size_t>(frames * mOutputFrameSize);
    MediaBuffer* buffer = NewSampleBuffer(outBytes, TicksToUs(mNextFrame, mSampleRate));
    if (buffer == nullptr) return NO_MEMORY;
    *out = buffer;
    // Codes to expand go to the end of the buffer, and the samples fill it
    // from the start.
    uint8_t* const data = static_cast<uint8_t*>(buffer->data());
    uint8_t* const stored = data + (outBytes - bytes);
    const ssize_t got = mSource->readAt(mDataOffset + static_cast<off64_t>(mNextFrame * mFrameSize), stored, bytes);
    if (got < 0) {
        ALOGW("read failed (%zd)", got);
        return ERROR_IO;
    }
    // The file may have shrunk since it was opened: hand out whole frames only.
    const size_t wholeFrames = static_cast<size_t>(got) / mFrameSize;
    if (wholeFrames == 0) return ERROR_END_OF_STREAM;
    if (mG711 != 0) {
        ExpandG711(mG711 == kWAVFormatALaw, stored, reinterpret_cast<int16_t*>(data), wholeFrames * mFrameSize);
    }
    buffer->set_range(0, wholeFrames * mOutputFrameSize);
    mNextFrame += wholeFrames;
    return OK;
}

}  // namespace android
