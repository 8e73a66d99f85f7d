#ifndef PLATFORM_FLAC_FLAC_EXTRACTOR_H_
#define PLATFORM_FLAC_FLAC_EXTRACTOR_H_

#include <media/stagefright/DataSource.h>
#include <media/stagefright/MediaExtractor.h>

#include "flac/FLACMetadata.h"

namespace android {

// Native FLAC streams. The track delivers decoded PCM, or with the output
// format flag kFlacRawOutput the frames as stored.
class FLACExtractor : public MediaExtractor {
public:
    static constexpr uint32_t kFlacRawOutput = 5;

    // Null when the stream cannot be used.
    static sp<FLACExtractor> Create(const sp<DataSource>& source);

    size_t countTracks() override { return 1; }
    sp<IMediaSource> getTrack(size_t index) override;
    sp<MetaData> getTrackMetaData(size_t index, uint32_t flags) override;
    sp<MetaData> getMetaData() override;
    const char* name() override { return "FLACExtractor"; }

private:
    FLACExtractor(const sp<DataSource>& source, const FLACMetadata& meta);
    bool rawOutput() const { return outputFormatFlag() == kFlacRawOutput; }

    const sp<DataSource> mSource;
    const FLACMetadata mMeta;
    sp<MetaData> mFileMeta;
    sp<MetaData> mPcmMeta;
    sp<MetaData> mRawMeta;
};

}  // namespace android

#endif
