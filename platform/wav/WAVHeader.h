#ifndef PLATFORM_WAV_WAV_HEADER_H_
#define PLATFORM_WAV_WAV_HEADER_H_

#include <cstdint>

#include <media/stagefright/DataSource.h>

#include "extractor/DeviceItems.h"
#include "wav/WAVFormat.h"

namespace android {

// What the RIFF/WAVE (or RF64/BW64) chunks say about the one audio stream
// of the file.
struct WAVInfo {
    uint16_t encoding = 0;      // kWAVFormat*
    uint16_t channels = 0;
    uint32_t sampleRate = 0;
    uint16_t bitsPerSample = 0; // of the samples handed out
    uint32_t channelMask = 0;   // from WAVE_FORMAT_EXTENSIBLE, else 0
    uint32_t frameSize = 0;     // bytes of one sample of every channel, as stored
    off64_t dataOffset = 0;
    uint64_t frameCount = 0;    // whole frames in the data chunk that the file holds
    DeviceItems items;

    bool isG711() const { return encoding == kWAVFormatALaw || encoding == kWAVFormatMuLaw; }
    // Bytes of one frame as handed out (G.711 codes expand to 16 bits).
    uint32_t outputFrameSize() const { return isG711() ? frameSize * 2 : frameSize; }
};

// Walks the chunks of a RIFF/WAVE file, or of an RF64/BW64 one whose large
// sizes are in its ds64 chunk. ERROR_MALFORMED for a file that is not one,
// ERROR_UNSUPPORTED for a sample format other than integer PCM of 8/16/24/32
// bits, 32-bit float, or 8-bit A-law or mu-law.
status_t ParseWAVHeader(const sp<DataSource>& source, WAVInfo* info);

// The kKeyPcmEncoding code of the stream's samples.
int32_t WAVPcmEncoding(const WAVInfo& info);

}  // namespace android

#endif
