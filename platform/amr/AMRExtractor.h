#ifndef PLATFORM_AMR_AMR_EXTRACTOR_H_
#define PLATFORM_AMR_AMR_EXTRACTOR_H_

#include <media/stagefright/DataSource.h>
#include <media/stagefright/MediaExtractor.h>

#include "amr/AMRFrameIndex.h"

namespace android {

// Single-channel AMR-NB and AMR-WB storage files (RFC 4867 section 5).
class AMRExtractor : public MediaExtractor {
public:
    // Null when the file is not one or cannot be read.
    static sp<AMRExtractor> Create(const sp<DataSource>& source);

    size_t countTracks() override { return 1; }
    sp<IMediaSource> getTrack(size_t index) override;
    sp<MetaData> getTrackMetaData(size_t index, uint32_t flags) override;
    sp<MetaData> getMetaData() override;
    const char* name() override { return "AMRExtractor"; }

private:
    AMRExtractor(const sp<DataSource>& source, const sp<AMRFrameIndex>& index);

    const sp<DataSource> mSource;
    const sp<AMRFrameIndex> mIndex;
    sp<MetaData> mTrackMeta;
};

}  // namespace android

#endif
