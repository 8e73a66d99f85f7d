#ifndef PLATFORM_OGG_OGG_EXTRACTOR_H_
#define PLATFORM_OGG_OGG_EXTRACTOR_H_

#include <memory>

#include <media/stagefright/DataSource.h>
#include <media/stagefright/MediaExtractor.h>

#include "ogg/VorbisHeaders.h"

namespace android {

// Ogg files whose first logical stream is Vorbis; that stream is the track.
class OggExtractor : public MediaExtractor {
public:
    // Null when the file cannot be used.
    static sp<OggExtractor> Create(const sp<DataSource>& source);

    size_t countTracks() override { return 1; }
    sp<IMediaSource> getTrack(size_t index) override;
    sp<MetaData> getTrackMetaData(size_t index, uint32_t flags) override;
    sp<MetaData> getMetaData() override;
    const char* name() override { return "OggExtractor"; }

private:
    OggExtractor(const sp<DataSource>& source, const std::shared_ptr<const VorbisHeaders>& headers);

    const sp<DataSource> mSource;
    const std::shared_ptr<const VorbisHeaders> mHeaders;
    sp<MetaData> mTrackMeta;
};

}  // namespace android

#endif
