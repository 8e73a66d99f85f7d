#ifndef FLAC_CRC_H_
#define FLAC_CRC_H_

#include <cstddef>
#include <cstdint>

namespace android {

// The checksums of the FLAC frame: CRC-8 (x^8 + x^2 + x + 1) over the frame
// header and CRC-16 (x^16 + x^15 + x^2 + 1) over the whole frame, both MSB
// first with initial value 0 and no final XOR.

// Carry-less multiplication where the processor has it, otherwise the table
// below.
uint16_t FLACCrc16(const uint8_t* data, size_t size);
// Continues a CRC-16 over more bytes: FLACCrc16(A B) = FLACCrc16Continue(FLACCrc16(A), B).
uint16_t FLACCrc16Continue(uint16_t crc, const uint8_t* data, size_t size);
// The same by table, sixteen bytes per step and two independent runs on long
// inputs: the fallback, on every processor.
uint16_t FLACCrc16Table(uint16_t crc, const uint8_t* data, size_t size);
// One byte of the CRC-16.
uint16_t FLACCrc16Update(uint16_t crc, uint8_t byte);
uint8_t FLACCrc8(const uint8_t* data, size_t size);

// Bit at a time, straight from the polynomials: what the fast ones are checked against.
uint16_t FLACCrc16Reference(const uint8_t* data, size_t size);
uint8_t FLACCrc8Reference(const uint8_t* data, size_t size);

}  // namespace android

#endif
