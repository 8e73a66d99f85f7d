#ifndef FLAC_STREAM_HEADER_H_
#define FLAC_STREAM_HEADER_H_

#include <cstddef>
#include <cstdint>
#include <vector>

namespace android {

// The STREAMINFO metadata block body (34 bytes).
struct FlacStreamInfo {
    static constexpr size_t kBodyBytes = 34;

    uint32_t minBlockSize = 0, maxBlockSize = 0;
    uint32_t minFrameSize = 0, maxFrameSize = 0;  // 0: unknown
    uint32_t sampleRate = 0;
    uint32_t channels = 0;
    uint32_t bitsPerSample = 0;
    uint64_t totalSamples = 0;  // 0: unknown
    uint8_t md5[16] = {};       // all zero: unknown

    static bool parse(const uint8_t* body, size_t size, FlacStreamInfo* out);
    void serialize(uint8_t body[kBodyBytes]) const;
};

// Metadata block types that a writer handles.
enum FlacBlockType : uint8_t {
    kFlacStreamInfo = 0,
    kFlacPadding = 1,
    kFlacApplication = 2,
    kFlacSeekTable = 3,
    kFlacVorbisComment = 4,
    kFlacCueSheet = 5,
    kFlacPicture = 6,
};

// A stream header ("fLaC" and its metadata blocks) as it arrives with a
// track: from the track format or from a codec-config buffer.
struct FlacStreamHeader {
    struct Block {
        uint8_t type;
        std::vector<uint8_t> body;
    };

    FlacStreamInfo info;
    // The blocks after STREAMINFO that still hold for a rewritten stream:
    // VORBIS_COMMENT and PICTURE. Seek tables and cue sheets point into the
    // source, padding and application data are the writer's own.
    std::vector<Block> kept;

    // Accepts "fLaC" followed by blocks, a STREAMINFO block with its 4-byte
    // header, or a bare STREAMINFO body. Blocks are read until the one
    // flagged last or the end of the data (some producers leave the flag
    // clear on their final block); a block running past the end is an error.
    static bool parse(const uint8_t* data, size_t size, FlacStreamHeader* out);

    // Largest block body the 24-bit length field can describe.
    static constexpr size_t kMaxBlockBody = 0xFFFFFF;
    // Appends a block header and body; false when the body is too large.
    static bool appendBlock(std::vector<uint8_t>* out, uint8_t type, bool last, const void* body, size_t size);
    static bool appendApplicationBlock(std::vector<uint8_t>* out, const char* id, bool last, const void* data,
                                       size_t size);
    static void appendPaddingBlock(std::vector<uint8_t>* out, bool last, size_t bodyBytes);
};

}  // namespace android

#endif
