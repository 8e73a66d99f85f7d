#ifndef PLATFORM_FLAC_FLAC_EXTRACTOR_H_
#define PLATFORM_FLAC_FLAC_EXTRACTOR_H_

#include <media/stagefright/DataSource.h>

#include "extractor/SingleTrackExtractor.h"

#include "flac/FLACMetadata.h"

namespace android {

// Native FLAC streams. The track delivers decoded PCM, or with the output
// format flag kFlacRawOutput the frames as stored.
class FLACExtractor : public SingleTrackExtractor {
public:
    static constexpr uint32_t kFlacRawOutput = 5;

    // Null when the stream cannot be used.
    static sp<FLACExtractor> Create(const sp<DataSource>& source);

    const char* name() override { return "FLACExtractor"; }

private:
    FLACExtractor(const sp<DataSource>& source, const FLACMetadata& meta);
    bool rawOutput() const { return outputFormatFlag() == kFlacRawOutput; }
    sp<IMediaSource> createTrack() override;
    const sp<MetaData>& trackMeta() const override { return rawOutput() ? mRawMeta : mTrackMeta; }

    const sp<DataSource> mSource;
    const FLACMetadata mMeta;
    const sp<MetaData> mRawMeta;
};

}  // namespace android

#endif
