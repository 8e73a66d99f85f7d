#ifndef QN_AUDIO_FORMAT_CONVERTER_H
#define QN_AUDIO_FORMAT_CONVERTER_H

#include <cstddef>
#include <cstdint>
#include <vector>

// The device's PCM format converter: interleaved little-endian PCM from one
// (sample format, sample rate, channel count) to another.
//
// Sample formats: 1 unsigned 8-bit, 2 signed 16-bit, 3 signed 24-bit packed in
// three bytes, 4 signed 32-bit integer. Channels: any count to the same count,
// and mono <-> stereo (up-mix duplicates, down-mix takes the mean). Sample rates
// 1 Hz to 768 kHz, converted with a high-quality resampler.
//
// Use: initAFC with the input description, then one setParamAFC per aspect that
// changes (each call applies only the aspect its kind names), then processAFC.

// Kinds of setParamAFC.
enum QNAFCParamKind {
    QNAFC_PARAM_CHANNELS = 0,     // output channel count from `channels`
    QNAFC_PARAM_SAMPLE_RATE = 1,  // output sample rate from `sampleRate`
    QNAFC_PARAM_FORMAT = 2,       // output sample format from `format`
};

// Resampler quality, the third argument of initAFC.
enum QNAFCQuality {
    QNAFC_QUALITY_HIGH = 0,
    QNAFC_QUALITY_VERY_HIGH = 1,
    QNAFC_QUALITY_QUICK = 2,
};

// The parameter block of setParamAFC: 116 bytes, native endian.
struct QNAFCParam {
    int32_t reserved0[10];  // unused, zero
    int32_t kind;           // QNAFCParamKind
    int32_t format;         // output sample format
    int32_t sampleRate;     // output sample rate in Hz
    int32_t channels;       // output channel count
    int32_t reserved1[15];  // unused, zero
};
static_assert(sizeof(QNAFCParam) == 116, "parameter block layout");

class QNAudioFormatConverter {
public:
    // Results: 0 or a positive count on success, else one of these.
    enum {
        kBadValue = -22,
        kInvalidOperation = -38,
        kNoMemory = -12,
    };

    QNAudioFormatConverter();

    // 1, the revision of the parameter block.
    virtual int getVersionAFC() const;
    // Input description: sample format, sample rate (Hz), resampler quality, channel count.
    // Resets the output description to the input's and drops any held audio.
    virtual int initAFC(int format, int sampleRate, int quality, int channels);
    virtual int setParamAFC(const QNAFCParam* param);
    // Converts the whole frames of `size` input bytes (a trailing partial frame is
    // ignored) and answers the number of bytes written to `out`, which must hold
    // maxOutputBytes(size). A resampler holds some audio back; what does not fit
    // in this call comes out in later ones. `in` null or `size` 0 flushes the
    // held audio at the end of a stream: call until it answers 0.
    virtual int processAFC(unsigned char* in, unsigned char* out, int size);
    virtual int deinitAFC();
    virtual ~QNAudioFormatConverter();

    // Grows `buffer` (null for a new one) with realloc to maxOutputBytes(size)
    // times `margin` (values below 1 count as 1); the caller frees it with free().
    // Null when not initialised, for a negative size, or without memory; `buffer`
    // then stays valid.
    unsigned char* allocateBuffAFC(unsigned char* buffer, int size, float margin);

    // The most bytes processAFC writes for `size` input bytes, or -1 when not initialised.
    int64_t maxOutputBytes(int size) const;

    int inputFrameBytes() const;
    int outputFrameBytes() const;

private:
    struct Description {
        int format = 0;
        int sampleRate = 0;
        int channels = 0;
    };

    bool prepareResampler();
    void releaseResampler();
    int64_t maxOutputFrames(int64_t inFrames) const;
    // Moves up to `maxFrames` held frames to `out` in the output format.
    int64_t emitPending(unsigned char* out, int64_t maxFrames);

    bool mInitialised;
    int mQuality;
    Description mIn;
    Description mOut;
    void* mResampler;  // created on first use after the rates are known
    bool mResamplerReady;
    bool mFlushed;  // the resampler has seen the end of a stream
    std::vector<int32_t> mWork;      // input after decoding and channel mapping
    std::vector<int32_t> mPending;   // converted frames not yet handed out
    size_t mPendingStart;            // frames of mPending already handed out

    QNAudioFormatConverter(const QNAudioFormatConverter&) = delete;
    QNAudioFormatConverter& operator=(const QNAudioFormatConverter&) = delete;
};

#endif
