#ifndef PLATFORM_CODEC_CODEC_CONFIG_H_
#define PLATFORM_CODEC_CODEC_CONFIG_H_

#include <cstdint>
#include <vector>

#include <media/stagefright/MetaData.h>

namespace android {

enum class AudioCodec { kNone, kAac, kAmrNb, kAmrWb, kVorbis, kMp3, kFlac };

// What a decoder needs from a track's format: the codec, the configuration
// bytes it is opened with, and the rate and channels where the stream itself
// does not say (AMR).
struct AudioCodecConfig {
    AudioCodec codec = AudioCodec::kNone;
    std::vector<uint8_t> extradata;
    int32_t sampleRate = 0;
    int32_t channels = 0;
};

AudioCodec AudioCodecForMime(const char* mime);
// False (with a log line) when the format lacks or mangles what the codec needs.
bool ReadAudioCodecConfig(const MetaData& format, AudioCodecConfig* config);

enum class VideoCodec { kNone, kAvc, kHevc };

// A video decoder is opened with the parameter sets of the track's avcC or
// hvcC record (ISO/IEC 14496-15), behind start codes as the samples are.
struct VideoCodecConfig {
    VideoCodec codec = VideoCodec::kNone;
    std::vector<uint8_t> extradata;
};

VideoCodec VideoCodecForMime(const char* mime);
bool ReadVideoCodecConfig(const MetaData& format, VideoCodecConfig* config);

}  // namespace android

#endif
