#ifndef PLATFORM_WAV_WAV_EXTRACTOR_H_
#define PLATFORM_WAV_WAV_EXTRACTOR_H_

#include <media/stagefright/DataSource.h>
#include <media/stagefright/MediaExtractor.h>

#include "wav/WAVHeader.h"

namespace android {

// RIFF/WAVE with one PCM track.
class WAVExtractor : public MediaExtractor {
public:
    // Null when the file cannot be used.
    static sp<WAVExtractor> Create(const sp<DataSource>& source);

    size_t countTracks() override { return 1; }
    sp<IMediaSource> getTrack(size_t index) override;
    sp<MetaData> getTrackMetaData(size_t index, uint32_t flags) override;
    sp<MetaData> getMetaData() override;
    const char* name() override { return "WAVExtractor"; }

private:
    WAVExtractor(const sp<DataSource>& source, const WAVInfo& info);

    const sp<DataSource> mSource;
    const WAVInfo mInfo;
    sp<MetaData> mFileMeta;
    sp<MetaData> mTrackMeta;
};

}  // namespace android

#endif
