#ifndef FUZZ_DECODER_TARGET_H
#define FUZZ_DECODER_TARGET_H

// Any bytes as a media file through the extractors, then each track's
// samples through the audio or video decoding source: read from the start,
// then after a seek to the middle. The reading is bounded (samples fed,
// buffers taken, picture size), not the library.
#include <strings.h>
#include <unistd.h>

#include <media/stagefright/AudioDecoderSource.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/MediaSource.h>
#include <media/stagefright/VideoDecoderSource.h>

#include "FuzzInput.h"

namespace fuzztargets {

// A track that ends after a number of samples: a sample table may claim
// billions of samples over the same few bytes.
class BoundedTrack : public android::MediaSource {
public:
    BoundedTrack(const android::sp<android::IMediaSource>& track, int limit) : mTrack(track), mLeft(limit) {}
    android::status_t start(android::MetaData* params) override { return mTrack->start(params); }
    android::status_t stop() override { return mTrack->stop(); }
    android::sp<android::MetaData> getFormat() override { return mTrack->getFormat(); }
    android::status_t read(android::MediaBufferBase** buffer, const ReadOptions* options) override {
        *buffer = nullptr;
        if (mLeft <= 0) return android::ERROR_END_OF_STREAM;
        --mLeft;
        return mTrack->read(buffer, options);
    }

private:
    const android::sp<android::IMediaSource> mTrack;
    int mLeft;
};

inline void drainDecoded(const android::sp<android::MediaSource>& decoder, int64_t durationUs) {
    using namespace android;
    if (decoder->start() != OK) return;
    decoder->getFormat();
    MediaBufferBase* buffer = nullptr;
    MediaSource::ReadOptions seek;
    for (int pass = 0; pass < 2; ++pass) {
        for (int n = 0; n < 24; ++n) {
            const status_t err = decoder->read(&buffer, pass == 1 && n == 0 ? &seek : nullptr);
            if (err == INFO_FORMAT_CHANGED) continue;
            if (err != OK) break;
            buffer->release();
        }
        seek.setSeekTo(durationUs / 2, MediaSource::ReadOptions::SEEK_CLOSEST);
    }
    decoder->stop();
}

inline void fuzzDecoder(const uint8_t* data, size_t size) {
    using namespace android;
    const int fd = fuzzFd(data, size);
    if (fd < 0) return;
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(fd, 0, int64_t(size)));
    for (size_t i = 0; extractor != nullptr && i < extractor->countTracks() && i < 4; ++i) {
        const sp<MetaData> meta = extractor->getTrackMetaData(i);
        const char* mime = nullptr;
        if (meta == nullptr || !meta->findCString(kKeyMIMEType, &mime)) continue;
        int64_t durationUs = 0;
        meta->findInt64(kKeyDuration, &durationUs);
        const sp<IMediaSource> track = new BoundedTrack(extractor->getTrack(i), 400);
        if (AudioDecoderSource::CanDecode(mime)) {
            const sp<AudioDecoderSource> decoder = AudioDecoderSource::Create(track);
            if (decoder != nullptr) drainDecoded(decoder, durationUs);
        } else if (VideoDecoderSource::CanDecode(mime)) {
            // Small pictures and one thread keep each input quick.
            VideoDecoderSource::Limits limits;
            limits.maxPixels = 640 * 480;
            limits.threads = 1;
            const sp<VideoDecoderSource> decoder = VideoDecoderSource::Create(track, limits);
            if (decoder != nullptr) drainDecoded(decoder, durationUs);
        }
    }
    extractor.clear();
    close(fd);
}

}  // namespace fuzztargets

#endif
