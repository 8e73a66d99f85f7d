#ifndef MPEG4_ESDS_H_
#define MPEG4_ESDS_H_

#include <cstddef>
#include <cstdint>

#include <media/stagefright/foundation/ByteReader.h>

namespace android {
namespace mpeg4 {

// What the elementary stream descriptor of an 'esds' box says
// (ISO/IEC 14496-1, 7.2.6.5 and 7.2.6.6).
struct EsdsInfo {
    uint8_t objectType = 0;
    uint32_t maxBitrate = 0;
    uint32_t avgBitrate = 0;
    const uint8_t* specificInfo = nullptr;  // DecoderSpecificInfo, inside the parsed bytes
    size_t specificInfoSize = 0;
};

// `descriptor` starts at the ES_Descriptor tag (the 'esds' payload after its
// version and flags).
bool ParseEsds(ByteReader descriptor, EsdsInfo* info);

// Sample rate and channel configuration of an AudioSpecificConfig
// (ISO/IEC 14496-3, 1.6.2.1); channels is 0 when the config leaves it to a
// program config element.
bool ParseAudioSpecificConfig(const uint8_t* data, size_t size, int32_t* objectType, int32_t* sampleRate,
                              int32_t* channels);

}  // namespace mpeg4
}  // namespace android

#endif
