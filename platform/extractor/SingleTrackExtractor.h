#ifndef PLATFORM_EXTRACTOR_SINGLE_TRACK_EXTRACTOR_H_
#define PLATFORM_EXTRACTOR_SINGLE_TRACK_EXTRACTOR_H_

#include <media/stagefright/MediaExtractor.h>

namespace android {

// The frame of the audio containers that hold one track. Metadata goes out
// as copies, so that callers that rewrite it do not change the extractor's.
class SingleTrackExtractor : public MediaExtractor {
public:
    size_t countTracks() override { return 1; }
    sp<IMediaSource> getTrack(size_t index) override;
    sp<MetaData> getTrackMetaData(size_t index, uint32_t flags) override;
    sp<MetaData> getMetaData() override;

protected:
    explicit SingleTrackExtractor(const char* containerMime);
    ~SingleTrackExtractor() override = default;

    virtual sp<IMediaSource> createTrack() = 0;
    // The track's format as things stand (it may follow the output flag).
    virtual const sp<MetaData>& trackMeta() const { return mTrackMeta; }

    const sp<MetaData> mFileMeta;
    const sp<MetaData> mTrackMeta;
};

}  // namespace android

#endif
