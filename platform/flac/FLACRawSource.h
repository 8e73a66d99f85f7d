#ifndef PLATFORM_FLAC_FLAC_RAW_SOURCE_H_
#define PLATFORM_FLAC_FLAC_RAW_SOURCE_H_

#include "extractor/TrackSource.h"
#include "flac/FLACFrameScanner.h"

namespace android {

// The compressed frames as stored, one whole frame per sample.
class FLACRawSource : public TrackSource {
public:
    FLACRawSource(const sp<DataSource>& source, const FLACMetadata& meta, const sp<MetaData>& format);

protected:
    status_t seekTo(int64_t timeUs, SeekMode mode) override;
    status_t readNext(MediaBufferBase** buffer) override;

private:
    int64_t timeOf(const FLACFrame& frame) const;

    FLACFrameScanner mScanner;
    const uint32_t mSampleRate;
    off64_t mNext;
};

}  // namespace android

#endif
