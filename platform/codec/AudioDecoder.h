#ifndef PLATFORM_CODEC_AUDIO_DECODER_H_
#define PLATFORM_CODEC_AUDIO_DECODER_H_

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include <media/stagefright/MetaData.h>
#include <utils/Errors.h>

namespace android {

// One compressed audio stream's decoder, fed one sample at a time. The
// library behind it stays inside its implementation file.
class AudioDecoder {
public:
    // Null when the format names no codec here or its configuration is bad.
    static std::unique_ptr<AudioDecoder> Create(const MetaData& format);
    virtual ~AudioDecoder() = default;

    // Appends what the sample decodes to (interleaved 16-bit, possibly
    // nothing) to *pcm. ERROR_MALFORMED for a sample the codec rejects; the
    // decoder stays usable.
    virtual status_t decode(const uint8_t* data, size_t size, std::vector<int16_t>* pcm) = 0;
    // Forgets the stream's history, before a seek.
    virtual void flush() = 0;
    // Known after the first decoded audio (0 before).
    virtual int32_t sampleRate() const = 0;
    virtual int32_t channelCount() const = 0;
};

}  // namespace android

#endif
