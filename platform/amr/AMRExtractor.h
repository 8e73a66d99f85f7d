#ifndef PLATFORM_AMR_AMR_EXTRACTOR_H_
#define PLATFORM_AMR_AMR_EXTRACTOR_H_

#include <media/stagefright/DataSource.h>

#include "extractor/SingleTrackExtractor.h"

#include "amr/AMRFrameIndex.h"

namespace android {

// Single-channel AMR-NB and AMR-WB storage files (RFC 4867 section 5).
class AMRExtractor : public SingleTrackExtractor {
public:
    // Null when the file is not one or cannot be read.
    static sp<AMRExtractor> Create(const sp<DataSource>& source);

    const char* name() override { return "AMRExtractor"; }

private:
    AMRExtractor(const sp<DataSource>& source, const sp<AMRFrameIndex>& index);
    sp<IMediaSource> createTrack() override;

    const sp<DataSource> mSource;
    const sp<AMRFrameIndex> mIndex;
};

}  // namespace android

#endif
