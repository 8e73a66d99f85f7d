#ifndef PLATFORM_WAV_WAV_EXTRACTOR_H_
#define PLATFORM_WAV_WAV_EXTRACTOR_H_

#include <media/stagefright/DataSource.h>

#include "extractor/SingleTrackExtractor.h"

#include "wav/WAVHeader.h"

namespace android {

// RIFF/WAVE (and RF64/BW64) with one PCM track; A-law and mu-law are
// expanded to 16-bit PCM.
class WAVExtractor : public SingleTrackExtractor {
public:
    // Null when the file cannot be used.
    static sp<WAVExtractor> Create(const sp<DataSource>& source);

    const char* name() override { return "WAVExtractor"; }

private:
    WAVExtractor(const sp<DataSource>& source, const WAVInfo& info);
    sp<IMediaSource> createTrack() override;

    const sp<DataSource> mSource;
    const WAVInfo mInfo;
};

}  // namespace android

#endif
