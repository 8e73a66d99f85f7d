#ifndef PLATFORM_WAV_WAV_SOURCE_H_
#define PLATFORM_WAV_WAV_SOURCE_H_

#include <media/stagefright/DataSource.h>

#include "extractor/TrackSource.h"
#include "wav/WAVHeader.h"

namespace android {

// Reads the data chunk in samples of whole frames (about 4 KiB each as
// handed out).
class WAVSource : public TrackSource {
public:
    WAVSource(const sp<DataSource>& source, const WAVInfo& info, const sp<MetaData>& format);

    // Frames delivered per sample for a stream of this frame size.
    static uint32_t FramesPerSample(uint32_t frameSize);

protected:
    status_t seekTo(int64_t timeUs, SeekMode mode) override;
    status_t readNext(MediaBufferBase** buffer) override;

private:
    const sp<DataSource> mSource;
    const off64_t mDataOffset;
    const uint64_t mFrameCount;
    const uint32_t mFrameSize;  // as stored
    const uint32_t mOutputFrameSize;
    const int mG711;  // 0, or the format tag of the codes to expand
    const uint32_t mSampleRate;
    const uint32_t mFramesPerSample;
    uint64_t mNextFrame;
};

}  // namespace android

#endif
