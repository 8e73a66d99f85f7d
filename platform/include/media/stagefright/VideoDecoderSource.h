#ifndef VIDEO_DECODER_SOURCE_H_
#define VIDEO_DECODER_SOURCE_H_

#include <cstdint>
#include <deque>
#include <memory>
#include <set>

#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MetaData.h>

namespace android {

class VideoDecoder;
struct VideoPicture;

// Decoded pictures, pulled through a track source of compressed video, in
// the shape of AudioDecoderSource: each read() gives the next picture in
// presentation order, one buffer of 8-bit YUV 4:2:0 stamped with kKeyTime.
//
// Decodes H.264 (to High 4:4:4) and HEVC (Main, Main 10) from MP4-style
// tracks (avcC / hvcC). Deeper samples are rounded to 8 bits and 4:2:2 or
// 4:4:4 chroma averaged down, so every picture has one layout. The output
// format (after start) is video/raw with kKeyColorFormat (planar 4:2:0, Y
// then Cb then Cr), kKeyWidth/kKeyHeight (the coded picture, even),
// kKeyStride and kKeySliceHeight (the same; chroma rows are half as long),
// kKeyCropRect (the visible part, inclusive), the colour keys kKeyColorRange,
// kKeyColorPrimaries, kKeyTransferFunction and kKeyColorMatrix as the stream
// says them (else as the track does), and the track's kKeyRotation and
// kKeyDuration. When a later picture's layout differs, read() answers
// INFO_FORMAT_CHANGED once and the new format holds from the next read().
//
// A seek decodes from the sync sample at or before the time and hands out
// the first picture presented at or after it. A compressed sample that gives
// no picture (the codec rejects it, or drops what it cannot conceal) is
// logged, and the picture before it is held in its place; one the track
// refuses (ERROR_MALFORMED, a broken NAL unit) is logged and skipped.
class VideoDecoderSource : public MediaSource {
public:
    struct Limits {
        int64_t maxPixels = int64_t(8192) * 4352;  // per picture
        int threads = 0;                           // 0: as many as the decoder likes
    };

    static bool CanDecode(const char* mime);
    // Null when the track's format cannot be decoded (the log says why).
    static sp<VideoDecoderSource> Create(const sp<IMediaSource>& track, const Limits& limits);
    static sp<VideoDecoderSource> Create(const sp<IMediaSource>& track) { return Create(track, Limits()); }

    // Starts the track and decodes up to the first picture, so that the
    // format holds the real layout.
    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    sp<MetaData> getFormat() override;
    status_t read(MediaBufferBase** buffer, const ReadOptions* options = nullptr) override;

protected:
    ~VideoDecoderSource() override;

private:
    struct Entry;

    VideoDecoderSource(const sp<IMediaSource>& track, const sp<MetaData>& trackFormat, const Limits& limits);
    // Decodes until a picture may be handed out (or the stream ends).
    status_t fill(const ReadOptions* options);
    void queue(Entry entry);
    // Holds the last picture for samples presented before timeUs that gave none.
    void holdBefore(int64_t timeUs);
    bool headReady() const;
    void seekTo(int64_t timeUs);

    const sp<IMediaSource> mTrack;
    const sp<MetaData> mTrackFormat;
    const Limits mLimits;
    sp<MetaData> mFormat;
    std::unique_ptr<VideoDecoder> mDecoder;
    bool mStarted;
    bool mInputEnded;
    int64_t mStartUs;         // pictures before this are not handed out
    int64_t mNewestUs;        // latest picture the decoder gave
    int64_t mLastOutUs;       // the picture read() gave last
    int mRefusedInARow;       // samples the track could not give
    std::deque<Entry> mQueue; // by presentation time
    std::set<int64_t> mAwaited;           // times of samples fed, no picture yet
    std::shared_ptr<VideoPicture> mLast;  // held in place of a missing picture
};

}  // namespace android

#endif
