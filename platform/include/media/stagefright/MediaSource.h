#ifndef MEDIA_SOURCE_H_
#define MEDIA_SOURCE_H_

#include <media/IMediaSource.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

// A source in this process, with the device's optional operations; those a
// source does not override answer ERROR_UNSUPPORTED (amplitude: 0).
class MediaSource : public IMediaSource {
public:
    MediaSource() = default;

    status_t start(MetaData* params = nullptr) override = 0;
    status_t stop() override = 0;
    sp<MetaData> getFormat() override = 0;
    status_t read(MediaBufferBase** buffer, const MediaTrack::ReadOptions* options = nullptr) override = 0;

    virtual status_t pause() { return ERROR_UNSUPPORTED; }
    virtual status_t setStopTimeUs(int64_t /*stopTimeUs*/) { return ERROR_UNSUPPORTED; }
    virtual status_t doEISFlushData() { return ERROR_UNSUPPORTED; }
    virtual status_t setPerformanceMode(int /*mode*/) { return ERROR_UNSUPPORTED; }
    virtual int32_t getCurrentMaxAmplitude() { return 0; }

protected:
    ~MediaSource() override = default;
};

}  // namespace android

#endif
