#ifndef PLATFORM_OGG_OGG_EXTRACTOR_H_
#define PLATFORM_OGG_OGG_EXTRACTOR_H_

#include <memory>

#include <media/stagefright/DataSource.h>

#include "extractor/SingleTrackExtractor.h"

#include "ogg/OggChain.h"
#include "ogg/VorbisHeaders.h"

namespace android {

// Ogg files whose first logical stream is Vorbis; that stream is the track,
// with the links chained after it that decode alike.
class OggExtractor : public SingleTrackExtractor {
public:
    // Null when the file cannot be used.
    static sp<OggExtractor> Create(const sp<DataSource>& source);

    const char* name() override { return "OggExtractor"; }

private:
    OggExtractor(const sp<DataSource>& source, const std::shared_ptr<const VorbisHeaders>& headers,
                 const std::shared_ptr<const OggChain>& chain);
    sp<IMediaSource> createTrack() override;

    const sp<DataSource> mSource;
    const std::shared_ptr<const VorbisHeaders> mHeaders;
    const std::shared_ptr<const OggChain> mChain;
};

}  // namespace android

#endif
