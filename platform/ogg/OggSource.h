#ifndef PLATFORM_OGG_OGG_SOURCE_H_
#define PLATFORM_OGG_OGG_SOURCE_H_

#include <memory>

#include "extractor/TrackSource.h"
#include "ogg/OggVorbisStream.h"

namespace android {

// Vorbis audio packets, one per sample, with the count of samples each
// decodes to under kKeyValidSamples.
class OggSource : public TrackSource {
public:
    OggSource(const sp<DataSource>& source, const std::shared_ptr<const VorbisHeaders>& headers,
              const std::shared_ptr<const OggChain>& chain, const sp<MetaData>& format);

protected:
    status_t onStart() override;
    void onStop() override;
    status_t seekTo(int64_t timeUs, SeekMode mode) override;
    status_t readNext(MediaBufferBase** buffer) override;

private:
    const sp<DataSource> mSource;
    const std::shared_ptr<const VorbisHeaders> mHeaders;
    const std::shared_ptr<const OggChain> mChain;
    std::unique_ptr<OggVorbisStream> mStream;
};

}  // namespace android

#endif
