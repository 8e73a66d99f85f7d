#ifndef QN_MEDIA_AUDIO_WAVE_FORM_H
#define QN_MEDIA_AUDIO_WAVE_FORM_H

#include <cstdint>

#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/RefBase.h>

namespace android {
namespace qnmediaeditor {

// One 16-bit peak value per 20 ms of PCM, measured across the buffers fed in
// order, or the waveform a track already carries. Driven by one thread.
class QNMediaAudioWaveForm : public RefBase {
public:
    static constexpr status_t kError = -1100;
    static constexpr int32_t kMaxWaveFormCount = 359997;

    QNMediaAudioWaveForm();
    virtual ~QNMediaAudioWaveForm();

    // Always 0; the outcome shows in isValid() and getSamples().
    status_t init(sp<AMessage>& format);
    bool isValid();
    void cancel();
    // Interleaved little-endian PCM; a trailing partial sample frame is ignored.
    status_t addSample(sp<ABuffer>& buffer);
    // Hands out the live buffer, not a copy.
    status_t getSamples(sp<ABuffer>* buffer, int* count);

    int getMaxAmplitude(signed char* data, int size);
    // count is in samples, not frames.
    int getMaxAmplitude16(short* data, int count);
    int getMaxAmplitude24(signed char* data, int count);
    bool checkInterval(short value);
    void addWaveformData(short value);

private:
    // Frames to feed before the current interval closes, or -1 when it never does.
    int64_t framesToClose() const;
    // Counts n frames that do not close the interval.
    void advanceCounter(int64_t n);
    void closeInterval();
    // Both peak functions: count samples of 2 or 3 bytes.
    int measure(const uint8_t* p, int count, int sampleBytes);

    sp<AMessage> mFormat;
    bool mIsValid;
    bool mUseExistWaveForm;
    int64_t mIntervalUs;
    int64_t mLastTimeUs;  // kept for the layout; nothing reads it yet
    int32_t mChannelCount;
    int32_t mBytesPerSample;
    int32_t mSampleRate;
    int32_t mWaveFormCount;
    sp<ABuffer> mWaveForm;
    int32_t mFrameInterval;
    int32_t mFrameCounter;
    int16_t mPeak;
    int16_t mLeftPeak;
    int16_t mRightPeak;
    int32_t mInterview;

    DISALLOW_EVIL_CONSTRUCTORS(QNMediaAudioWaveForm);
};

}  // namespace qnmediaeditor
}  // namespace android

#endif
