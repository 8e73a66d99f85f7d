#ifndef PLATFORM_CODEC_LIBAV_CODEC_STATE_H_
#define PLATFORM_CODEC_LIBAV_CODEC_STATE_H_

#include <cstdint>
#include <vector>

extern "C" {
#include <libavcodec/avcodec.h>
}

namespace android {

// What every codec of the library needs beside the codec itself: its context,
// one packet and one frame, freed together.
struct LibavCodecState {
    LibavCodecState() = default;
    LibavCodecState(const LibavCodecState&) = delete;
    LibavCodecState& operator=(const LibavCodecState&) = delete;
    ~LibavCodecState();

    // False (and logged) when the library cannot provide them.
    bool allocate(const AVCodec* codec);
    // Codec-specific data copied into the context, padded as the library reads it.
    bool setExtradata(const std::vector<uint8_t>& data);

    AVCodecContext* context = nullptr;
    AVPacket* packet = nullptr;
    AVFrame* frame = nullptr;
};

}  // namespace android

#endif
