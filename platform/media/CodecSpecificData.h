#ifndef CODEC_SPECIFIC_DATA_H_
#define CODEC_SPECIFIC_DATA_H_

#include <cstddef>
#include <cstdint>
#include <vector>

namespace android {

// Conversions between the codec configuration records that containers store
// and the codec-specific data that decoders take. Parsers never read outside
// the bytes given and answer false on a malformed record.
using Bytes = std::vector<uint8_t>;

// Whether the bytes begin with a start code (00 00 01 or 00 00 00 01).
bool isAnnexB(const uint8_t* data, size_t size);

// AVC decoder configuration record (ISO/IEC 14496-15 5.3.3.1) to Annex-B:
// the sequence parameter sets into *sps, the picture parameter sets into
// *pps, each unit behind 00 00 00 01.
bool avccToAnnexB(const uint8_t* data, size_t size, Bytes* sps, Bytes* pps);
// The reverse, from the units of two Annex-B streams (either may hold both
// kinds); needs at least one sequence and one picture parameter set.
bool annexBToAvcc(const uint8_t* csd0, size_t size0, const uint8_t* csd1, size_t size1, Bytes* avcc);

// HEVC decoder configuration record (ISO/IEC 14496-15 8.3.3.1) to Annex-B,
// every array in order.
bool hvccToAnnexB(const uint8_t* data, size_t size, Bytes* out);
// The reverse; the profile, level, chroma format and bit depths come from the
// sequence parameter set, which must be present.
bool annexBToHvcc(const uint8_t* data, size_t size, Bytes* hvcc);

// The DecoderSpecificInfo inside an ES_Descriptor (ISO/IEC 14496-1 7.2.6.5).
// The blob starts at the descriptor's tag 0x03; a leading 4-byte version and
// flags field of the esds box is tolerated. *dsi points into the blob.
bool esdsDecoderSpecificInfo(const uint8_t* data, size_t size, const uint8_t** dsi, size_t* dsiSize);
// The DecoderConfigDescriptor (7.2.6.6) of the same blob: object type,
// bitrates, and the DecoderSpecificInfo (null when the descriptor has none).
struct EsdsConfig {
    uint8_t objectTypeIndication = 0;
    uint32_t maxBitrate = 0;
    uint32_t avgBitrate = 0;
    const uint8_t* dsi = nullptr;
    size_t dsiSize = 0;
};
bool esdsDecoderConfig(const uint8_t* data, size_t size, EsdsConfig* config);
// A minimal ES_Descriptor around the DecoderSpecificInfo.
Bytes makeEsds(uint8_t objectTypeIndication, uint8_t streamType, uint32_t maxBitrate, uint32_t avgBitrate,
               const uint8_t* dsi, size_t dsiSize);

}  // namespace android

#endif
