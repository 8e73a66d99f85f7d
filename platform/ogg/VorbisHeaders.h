#ifndef PLATFORM_OGG_VORBIS_HEADERS_H_
#define PLATFORM_OGG_VORBIS_HEADERS_H_

#include <cstdint>
#include <vector>

#include <ogg/ogg.h>
#include <vorbis/codec.h>

#include <media/stagefright/DataSource.h>

namespace android {

// The three header packets of a Vorbis stream (identification, comment,
// setup) and the codec set-up libvorbis builds from them, which gives the
// block size of each audio packet. Read-only once complete.
class VorbisHeaders {
public:
    VorbisHeaders();
    ~VorbisHeaders();

    // Reads the headers from the first logical stream of the Ogg link that
    // starts at `start` (0: the file). ERROR_MALFORMED when it does not
    // start with a Vorbis stream.
    status_t read(const sp<DataSource>& source, off64_t start = 0);
    // Whether packets of a stream with these headers decode as those of
    // `other` would: the same rate, channels, block sizes and set-up.
    bool decodesLike(const VorbisHeaders& other) const;

    int serial() const { return mSerial; }
    // Offset of the first page after the headers: audio starts on a fresh page.
    off64_t audioStart() const { return mAudioStart; }
    uint32_t sampleRate() const { return static_cast<uint32_t>(mInfo.rate); }
    int channels() const { return mInfo.channels; }
    long nominalBitrate() const { return mInfo.bitrate_nominal; }
    const std::vector<uint8_t>& identification() const { return mIdentification; }
    const std::vector<uint8_t>& setup() const { return mSetup; }

    // Samples per channel of the block this audio packet codes; negative for
    // a packet that is not audio.
    long blockSize(ogg_packet* packet) const;

private:
    status_t add(ogg_packet* packet);

    vorbis_info mInfo;
    vorbis_comment mComment;
    int mCount;
    int mSerial;
    off64_t mAudioStart;
    std::vector<uint8_t> mIdentification;
    std::vector<uint8_t> mSetup;

    VorbisHeaders(const VorbisHeaders&) = delete;
    VorbisHeaders& operator=(const VorbisHeaders&) = delete;
};

}  // namespace android

#endif
