#ifndef PLATFORM_FLAC_FLAC_CRC_H_
#define PLATFORM_FLAC_FLAC_CRC_H_

#include <cstddef>
#include <cstdint>

namespace android {

// The frame checksum of the FLAC format: CRC-16 (x^16 + x^15 + x^2 + 1) over
// the whole frame, MSB first with initial value 0, table driven.
uint16_t FLACCrc16(const uint8_t* data, size_t size);
// One step of the CRC-16, for checksums built while scanning.
uint16_t FLACCrc16Update(uint16_t crc, uint8_t byte);

}  // namespace android

#endif
