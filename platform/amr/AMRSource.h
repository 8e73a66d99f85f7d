#ifndef PLATFORM_AMR_AMR_SOURCE_H_
#define PLATFORM_AMR_AMR_SOURCE_H_

#include <media/stagefright/DataSource.h>

#include "amr/AMRFrameIndex.h"
#include "extractor/TrackSource.h"

namespace android {

// One storage frame (header byte included) per sample, 20 ms apart.
class AMRSource : public TrackSource {
public:
    AMRSource(const sp<DataSource>& source, const sp<AMRFrameIndex>& index, const sp<MetaData>& format);

protected:
    status_t seekTo(int64_t timeUs, SeekMode mode) override;
    status_t readNext(MediaBufferBase** buffer) override;

private:
    const sp<DataSource> mSource;
    const sp<AMRFrameIndex> mIndex;
    uint64_t mNextFrame;
    off64_t mNextOffset;
};

}  // namespace android

#endif
