#ifndef MP4_CONFIG_RECORDS_H_
#define MP4_CONFIG_RECORDS_H_

#include <cstddef>
#include <cstdint>
#include <vector>

#include "mpeg4/Mp4NalUnits.h"

namespace android {

// AVCDecoderConfigurationRecord (ISO/IEC 14496-15 5.3.3.1) with 4-byte NAL
// lengths. Empty when there is no usable SPS or PPS.
std::vector<uint8_t> Mp4BuildAvcC(const std::vector<NalSpan>& sps, const std::vector<NalSpan>& pps);
// HEVCDecoderConfigurationRecord (ISO/IEC 14496-15 8.3.3.1) with 4-byte NAL
// lengths; profile, tier, level, chroma format and bit depths from the SPS.
// Empty without a usable VPS, SPS and PPS.
std::vector<uint8_t> Mp4BuildHvcC(const std::vector<NalSpan>& vps, const std::vector<NalSpan>& sps,
                                  const std::vector<NalSpan>& pps);

// The NAL length size a configuration record declares; 0 when the record is
// not well formed.
size_t Mp4AvcCLengthSize(const uint8_t* record, size_t size);
size_t Mp4HvcCLengthSize(const uint8_t* record, size_t size);

// The AudioSpecificConfig inside an ES descriptor, with or without the
// esds box's version and flags in front (ISO/IEC 14496-1 7.2.6).
bool Mp4AscFromEsds(const uint8_t* data, size_t size, std::vector<uint8_t>* asc);

// Sample rate and channel count of an AudioSpecificConfig
// (ISO/IEC 14496-3 1.6.2.1); false when it cannot be read.
bool Mp4ParseAsc(const uint8_t* asc, size_t size, uint32_t* sampleRate, uint32_t* channels);

}  // namespace android

#endif
