#ifndef MP4_CONFIG_RECORDS_H_
#define MP4_CONFIG_RECORDS_H_

#include <cstddef>
#include <cstdint>
#include <vector>

#include "mpeg4/Mp4NalUnits.h"

namespace android {

// AVCDecoderConfigurationRecord (ISO/IEC 14496-15 5.3.3.1) with 4-byte NAL
// lengths, with the chroma format and bit depths that profiles other than
// Baseline, Main and Extended carry. Empty without an SPS and a PPS.
std::vector<uint8_t> Mp4BuildAvcC(const std::vector<NalSpan>& sps, const std::vector<NalSpan>& pps);
// HEVCDecoderConfigurationRecord (ISO/IEC 14496-15 8.3.3.1) with 4-byte NAL
// lengths. Empty without a VPS, an SPS and a PPS.
std::vector<uint8_t> Mp4BuildHvcC(const std::vector<NalSpan>& vps, const std::vector<NalSpan>& sps,
                                  const std::vector<NalSpan>& pps);

// The NAL length size a configuration record declares; 0 when the record is
// not well formed.
size_t Mp4AvcCLengthSize(const uint8_t* record, size_t size);
size_t Mp4HvcCLengthSize(const uint8_t* record, size_t size);

// Sample rate and channel count of an AudioSpecificConfig
// (ISO/IEC 14496-3 1.6.2.1); false when it cannot be read.
bool Mp4ParseAsc(const uint8_t* asc, size_t size, uint32_t* sampleRate, uint32_t* channels);
// A two-byte AudioSpecificConfig for AAC-LC; empty for a rate without an
// index or an unusual channel count.
std::vector<uint8_t> Mp4MakeAacLcConfig(uint32_t sampleRate, uint32_t channels);

}  // namespace android

#endif
