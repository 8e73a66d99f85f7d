#ifndef PLATFORM_MP3_MP3_SOURCE_H_
#define PLATFORM_MP3_MP3_SOURCE_H_

#include "extractor/TrackSource.h"
#include "mp3/MP3Extractor.h"

namespace android {

// One frame per sample, its time counted in frames from the first.
class MP3Source : public TrackSource {
public:
    MP3Source(const sp<DataSource>& source, const MP3Layout& layout, const sp<MetaData>& format);

protected:
    status_t onStart() override;
    status_t seekTo(int64_t timeUs, SeekMode mode) override;
    status_t readNext(MediaBufferBase** buffer) override;

private:
    // The header of the frame at mOffset, after a resync past damage.
    status_t nextHeader(MP3FrameHeader* header);

    const sp<DataSource> mSource;
    const MP3Layout mLayout;
    off64_t mOffset;
    uint64_t mFrame;
};

}  // namespace android

#endif
