#ifndef PLATFORM_WAV_WAV_HEADER_H_
#define PLATFORM_WAV_WAV_HEADER_H_

#include <cstdint>

#include <media/stagefright/DataSource.h>

#include "extractor/DeviceItems.h"

namespace android {

// What the RIFF/WAVE chunks say about the one PCM stream of the file.
struct WAVInfo {
    bool isFloat = false;
    uint16_t channels = 0;
    uint32_t sampleRate = 0;
    uint16_t bitsPerSample = 0;
    uint32_t channelMask = 0;   // from WAVE_FORMAT_EXTENSIBLE, else 0
    uint32_t frameSize = 0;     // bytes of one sample of every channel
    off64_t dataOffset = 0;
    uint64_t frameCount = 0;    // whole frames in the data chunk that the file holds
    DeviceItems items;
};

// Walks the chunks of a RIFF/WAVE file. ERROR_MALFORMED for a file that is
// not one, ERROR_UNSUPPORTED for a sample format other than integer PCM of
// 8/16/24/32 bits or 32-bit float.
status_t ParseWAVHeader(const sp<DataSource>& source, WAVInfo* info);

// The kKeyPcmEncoding code of the stream's samples.
int32_t WAVPcmEncoding(const WAVInfo& info);

}  // namespace android

#endif
