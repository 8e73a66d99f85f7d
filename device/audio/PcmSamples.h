#ifndef DEVICE_AUDIO_PCM_SAMPLES_H
#define DEVICE_AUDIO_PCM_SAMPLES_H

#include <cstddef>
#include <cstdint>

// Interleaved little-endian PCM as the audio engines see it. Internally every
// sample is a left-justified signed 32-bit value, so conversions between widths
// are shifts and a round trip through a wider format is exact.
namespace qnaudio {

// Sample-format codes shared by both engines.
enum SampleFormat {
    kFormatU8 = 1,          // unsigned 8-bit, 128 is silence
    kFormatS16 = 2,         // signed 16-bit
    kFormatS24Packed = 3,   // signed 24-bit in 3 bytes
    kFormatS32 = 4,         // signed 32-bit integer
};

// 1 to 4, or 0 for an unknown code.
int bytesPerSample(int format);

void decodeSamples(const uint8_t* in, int format, size_t count, int32_t* out);
// Rounds to the nearest step of the narrower format, saturating at its limits.
void encodeSamples(const int32_t* in, int format, size_t count, uint8_t* out);

// Whether remapChannels handles the pair: equal counts, or mono and stereo either way.
bool canRemap(int inChannels, int outChannels);
// Mono to stereo duplicates; stereo to mono takes the mean.
void remapChannels(const int32_t* in, int inChannels, int32_t* out, int outChannels, size_t frames);

// Saturating conversion of a mixed value in [-1, 1) units.
int32_t saturateToS32(double v);

}  // namespace qnaudio

#endif
