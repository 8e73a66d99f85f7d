#ifndef MP4_SAMPLE_ENTRIES_H_
#define MP4_SAMPLE_ENTRIES_H_

#include <cstdint>
#include <vector>

namespace android {

class Mp4BoxWriter;

// The sample entries of the codecs this writer stores, each with its
// configuration box.
void Mp4WriteVisualEntry(Mp4BoxWriter& w, const char type[4], const char configType[4],
                         const std::vector<uint8_t>& config, uint16_t width, uint16_t height);

struct Mp4AacEntry {
    std::vector<uint8_t> asc;  // AudioSpecificConfig
    uint32_t sampleRate;
    uint16_t channels;
    uint32_t maxBitrate;
    uint32_t avgBitrate;
};
// 'mp4a' with an 'esds' (ISO/IEC 14496-14 5.6).
void Mp4WriteAacEntry(Mp4BoxWriter& w, const Mp4AacEntry& entry);

// 'samr' or 'sawb' with its 'damr' (3GPP TS 26.244 6.5): `modeSet` has bit n
// set when frame type n occurs.
void Mp4WriteAmrEntry(Mp4BoxWriter& w, bool wideband, uint16_t modeSet);

}  // namespace android

#endif
