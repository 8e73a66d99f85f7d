#ifndef AAC_ENCODER_SOURCE_H_
#define AAC_ENCODER_SOURCE_H_

#include <deque>
#include <memory>
#include <vector>

#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MetaData.h>

namespace android {

class AacEncoder;

// AAC-LC, pulled through a source of 16-bit interleaved PCM (mono or stereo,
// at a rate AAC can signal): each read() returns one access unit. The pull
// shape matches AudioDecoderSource, so a decoder, a mixer and this encoder
// chain as sources and a writer takes the result as any track.
//
// The format (after start) is audio/mp4a-latm with kKeySampleRate,
// kKeyChannelCount, kKeyBitRate, kKeyESDS holding the AudioSpecificConfig,
// kKeyEncoderDelay (the priming frames) and the PCM source's duration.
// Access unit times count from 0 and include the priming: unit k starts at
// k * 1024 frames, and the source's frame 0 is presented at the delay. A
// writer that presents from the delay on (an edit list, or times shifted by
// it) gives audio that lines up with the PCM; AudioDecoderSource drops the
// delay when it reads this format.
class AacEncoderSource : public MediaSource {
public:
    // Null when the PCM format cannot be encoded (the log says why).
    // bitRate 0: 64 kbit/s per channel.
    static sp<AacEncoderSource> Create(const sp<IMediaSource>& pcm, int32_t bitRate = 0);

    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    sp<MetaData> getFormat() override;
    // No seeking: an encoder's output depends on everything before.
    status_t read(MediaBufferBase** buffer, const ReadOptions* options = nullptr) override;

protected:
    ~AacEncoderSource() override;

private:
    AacEncoderSource(const sp<IMediaSource>& pcm, std::unique_ptr<AacEncoder> encoder, const sp<MetaData>& format);
    // Encodes PCM until at least one access unit is ready or the end.
    status_t fill();

    const sp<IMediaSource> mPcm;
    std::unique_ptr<AacEncoder> mEncoder;
    const sp<MetaData> mFormat;
    const int32_t mRate;
    const int32_t mChannels;
    bool mStarted = false;
    bool mInputDone = false;
    std::vector<int16_t> mHeld;  // PCM short of a whole frame
    std::deque<std::vector<uint8_t>> mUnits;
    int64_t mUnitsOut = 0;
};

}  // namespace android

#endif
