#ifndef FLAC_FRAME_HEADER_H_
#define FLAC_FRAME_HEADER_H_

#include <cstddef>
#include <cstdint>

namespace android {

// The header at the start of a FLAC frame (FLAC format, "FRAME_HEADER").
struct FlacFrameHeader {
    bool variableBlockSize = false;  // blocking-strategy bit: number counts samples
    uint32_t blockSize = 0;          // samples per channel
    uint32_t sampleRate = 0;         // 0: given by STREAMINFO
    uint32_t channels = 0;
    uint32_t bitsPerSample = 0;      // 0: given by STREAMINFO
    uint64_t number = 0;             // frame number, or first sample number
    size_t headerBytes = 0;          // up to and including the CRC-8

    // Checks the sync code, the reserved values, the coded number and the
    // CRC-8; false for anything that is not a well-formed header.
    static bool parse(const uint8_t* data, size_t size, FlacFrameHeader* out);
};

// CRC-8 of the FLAC frame header: polynomial x^8 + x^2 + x + 1, initial 0.
uint8_t flacCrc8(const uint8_t* data, size_t size);

}  // namespace android

#endif
