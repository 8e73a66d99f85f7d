#ifndef PLATFORM_EXTRACTOR_TRACK_SOURCE_H_
#define PLATFORM_EXTRACTOR_TRACK_SOURCE_H_

#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MetaData.h>

#include "extractor/SeekPolicy.h"

namespace android {

// The frame shared by the extractors' track sources: start/stop state, the
// format, and read() split into an optional seek and the next sample.
// One thread drives a source at a time.
class TrackSource : public MediaSource {
public:
    explicit TrackSource(const sp<MetaData>& format);

    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    // A copy, so that callers that rewrite it do not change the track.
    sp<MetaData> getFormat() override;
    status_t read(MediaBufferBase** buffer, const ReadOptions* options = nullptr) override;

protected:
    ~TrackSource() override = default;

    virtual status_t onStart() { return OK; }
    virtual void onStop() {}
    // Position the source so that the next sample is the one the mode picks.
    virtual status_t seekTo(int64_t timeUs, SeekMode mode) = 0;
    virtual status_t readNext(MediaBufferBase** buffer) = 0;

    // A buffer of `size` bytes stamped with the time and marked sync (every
    // audio sample here decodes on its own); null when memory runs out.
    static MediaBuffer* NewSampleBuffer(size_t size, int64_t timeUs);

    const sp<MetaData> mFormat;

private:
    bool mStarted;
};

}  // namespace android

#endif
