#ifndef WAVE_CHUNKS_H_
#define WAVE_CHUNKS_H_

#include <cstddef>
#include <cstdint>
#include <vector>

#include "writer/PcmLayout.h"

namespace android {

// RIFF/WAVE pieces for the WAVE writer. All sizes are little-endian; a chunk
// of odd size is followed by a pad byte that its size does not count.
struct WaveChunks {
    // "RIFF" <size> "WAVE", "fmt ", "fact" (float data only) and the "data"
    // chunk header; the sizes are placeholders fixed by the writer at stop.
    struct Header {
        std::vector<uint8_t> bytes;
        size_t factFramesOffset = 0;  // 0: no fact chunk
        size_t dataSizeOffset = 0;
    };

    // WAVE_FORMAT_EXTENSIBLE whenever there are more than 2 channels or more
    // than 16 bits per sample, and for float; plain PCM otherwise.
    static bool needsExtensible(const PcmLayout& layout);
    static Header buildHeader(const PcmLayout& layout);

    // The largest data chunk, a whole number of frames, that keeps the RIFF
    // size within 32 bits with `trailerBytes` of chunks after the data (and
    // its pad byte).
    static uint64_t maxDataBytes(size_t headerBytes, uint64_t trailerBytes, size_t frameBytes);

    // Appends a chunk (and its pad byte).
    static void appendChunk(std::vector<uint8_t>* out, const char* fourcc, const void* data, size_t size);
};

}  // namespace android

#endif
