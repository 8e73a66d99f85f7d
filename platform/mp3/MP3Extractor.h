#ifndef PLATFORM_MP3_MP3_EXTRACTOR_H_
#define PLATFORM_MP3_MP3_EXTRACTOR_H_

#include <media/stagefright/DataSource.h>

#include "extractor/SingleTrackExtractor.h"
#include "mp3/MP3FrameHeader.h"

namespace android {

// Where an MP3 stream's audio frames lie in its file.
struct MP3Layout {
    off64_t firstFrame = 0;  // the first audio frame (after tags and an info frame)
    off64_t end = 0;         // where the audio ends (before the tags at the end)
    MP3FrameHeader header;   // of the first frame
    uint64_t frames = 0;     // audio frames as the info frame states them; 0 when unknown
    // Decoded samples past the end of the audio: the encoder's padding less
    // the decoder's delay. The last frames say how many of theirs count.
    uint32_t trailingSamples = 0;
};

// MPEG-1/2/2.5 layer III streams, with ID3v2 tags in front and ID3v1/APE
// tags at the end skipped. One frame per sample; every frame is a sync
// sample. Duration from the encoder's Xing/Info or VBRI frame, else from the
// bitrate; LAME's delay is published as kKeyEncoderDelay (with the
// decoder's own 529 samples) and its padding as kKeyEncoderPadding.
class MP3Extractor : public SingleTrackExtractor {
public:
    static sp<MP3Extractor> Create(const sp<DataSource>& source);
    const char* name() override { return "MP3Extractor"; }

protected:
    sp<IMediaSource> createTrack() override;

private:
    MP3Extractor(const sp<DataSource>& source, const MP3Layout& layout);
    const sp<DataSource> mSource;
    MP3Layout mLayout;
};

}  // namespace android

#endif
