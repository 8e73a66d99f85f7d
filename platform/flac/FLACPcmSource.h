#ifndef PLATFORM_FLAC_FLAC_PCM_SOURCE_H_
#define PLATFORM_FLAC_FLAC_PCM_SOURCE_H_

#include <memory>

#include "extractor/TrackSource.h"
#include "flac/FLACDecoder.h"

namespace android {

// Decoded PCM, one sample per FLAC frame.
class FLACPcmSource : public TrackSource {
public:
    FLACPcmSource(const sp<DataSource>& source, const FlacStreamInfo& info, const sp<MetaData>& format);

protected:
    status_t onStart() override;
    void onStop() override;
    status_t seekTo(int64_t timeUs, SeekMode mode) override;
    status_t readNext(MediaBufferBase** buffer) override;

private:
    const sp<DataSource> mSource;
    const FlacStreamInfo mInfo;
    std::unique_ptr<FLACDecoder> mDecoder;
    bool mAtEnd;
};

}  // namespace android

#endif
