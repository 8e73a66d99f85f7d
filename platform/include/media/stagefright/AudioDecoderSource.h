#ifndef AUDIO_DECODER_SOURCE_H_
#define AUDIO_DECODER_SOURCE_H_

#include <memory>

#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MetaData.h>

namespace android {

class AudioDecoder;

// Decoded audio, pulled through a track source of compressed audio: each
// read() decodes the next compressed sample into one buffer of 16-bit
// interleaved PCM stamped with kKeyTime. This keeps the framework's pull shape
// (start/read/stop/getFormat) rather than a buffer-queue codec: every user of
// decoded audio here reads a whole track in order, and a source composes with
// the converters and writers that already take sources.
//
// Decodes AAC (LC, HE, HEv2; in MP4 or ADTS), AMR-NB, AMR-WB, Vorbis, MP3
// and FLAC. The output format (after start) is audio/raw with kKeySampleRate,
// kKeyChannelCount and kKeyPcmEncoding (16-bit), as the decoder reports them
// (HE-AAC: the doubled rate), and the track's duration.
//
// Priming is dropped so decoded audio lines up with the track's times: the
// samples a track presents before time 0 (an edit list's skipped start shows
// as negative sample times) and the track's kKeyEncoderDelay frames (for
// extractors that report priming that way instead). A
// damaged compressed sample is logged and replaced by silence as long as the
// previous one, so later audio keeps its place.
class AudioDecoderSource : public MediaSource {
public:
    // Whether a track of this MIME type can be decoded here.
    static bool CanDecode(const char* mime);
    // Null when the track's format cannot be decoded (the log says why).
    static sp<AudioDecoderSource> Create(const sp<IMediaSource>& track);

    // Starts the track and decodes up to the first audio, so that the format
    // holds the real rate and channel count.
    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    sp<MetaData> getFormat() override;
    // A seek is to the exact time: the decoder starts afresh a little before
    // it and what precedes it is dropped.
    status_t read(MediaBufferBase** buffer, const ReadOptions* options = nullptr) override;

protected:
    ~AudioDecoderSource() override;

private:
    AudioDecoderSource(const sp<IMediaSource>& track, const sp<MetaData>& trackFormat);
    // Decodes compressed samples until one gives audio; the PCM is kept.
    status_t decodeNext(const ReadOptions* options);

    const sp<IMediaSource> mTrack;
    const sp<MetaData> mTrackFormat;
    sp<MetaData> mFormat;
    std::unique_ptr<AudioDecoder> mDecoder;
    bool mStarted;
    const int64_t mDelayUs;   // the track's stated encoder delay
    int64_t mStartUs;         // audio before this is dropped: 0, or a seek's time
    size_t mLastFrames;       // frames of the last good decode: the length of a concealment
    MediaBufferBase* mPending;  // decoded by start() or a read that found audio
};

}  // namespace android

#endif
