#ifndef PLATFORM_WAV_WAV_FORMAT_H_
#define PLATFORM_WAV_WAV_FORMAT_H_

#include <cstddef>
#include <cstdint>

#include <utils/Errors.h>

namespace android {

struct WAVInfo;

// The format tags this reader takes (after WAVE_FORMAT_EXTENSIBLE is
// resolved to its sub-format).
constexpr uint16_t kWAVFormatPcm = 1;
constexpr uint16_t kWAVFormatFloat = 3;
constexpr uint16_t kWAVFormatALaw = 6;
constexpr uint16_t kWAVFormatMuLaw = 7;

// Reads a fmt chunk body into `info` (encoding, channels, rate, bits, frame
// size). ERROR_MALFORMED for one that is inconsistent, ERROR_UNSUPPORTED
// (with the refusal reason set) for an encoding or layout not read here.
status_t ParseWAVFormat(const uint8_t* data, size_t size, WAVInfo* info);

}  // namespace android

#endif
