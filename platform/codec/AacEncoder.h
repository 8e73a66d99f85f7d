#ifndef PLATFORM_CODEC_AAC_ENCODER_H_
#define PLATFORM_CODEC_AAC_ENCODER_H_

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include <utils/Errors.h>

namespace android {

// An AAC-LC encoder fed whole frames of interleaved 16-bit PCM. The library
// behind it stays inside its implementation file.
class AacEncoder {
public:
    // Null (with a log line) for a rate or channel count AAC cannot carry.
    static std::unique_ptr<AacEncoder> Create(int32_t sampleRate, int32_t channels, int32_t bitRate);
    virtual ~AacEncoder() = default;

    // PCM frames per access unit (1024).
    virtual size_t frameSize() const = 0;
    // Frames of priming the first access units decode to before the input.
    virtual int32_t delay() const = 0;
    // The AudioSpecificConfig (ISO/IEC 14496-3, 1.6.2.1).
    virtual const std::vector<uint8_t>& config() const = 0;
    // Encodes up to frameSize() frames (fewer only for the last call before
    // finish()); whole access units are appended to *units.
    virtual status_t encode(const int16_t* pcm, size_t frames, std::vector<std::vector<uint8_t>>* units) = 0;
    // Ends the stream: the units still held are appended.
    virtual status_t finish(std::vector<std::vector<uint8_t>>* units) = 0;
};

}  // namespace android

#endif
