#ifndef ANDROID_IMEDIA_SOURCE_H_
#define ANDROID_IMEDIA_SOURCE_H_

#include <media/MediaTrack.h>
#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MetaData.h>
#include <utils/Errors.h>
#include <utils/RefBase.h>

namespace android {

// A stream of media buffers: a track of an extractor, a queue, an adapter.
class IMediaSource : public virtual RefBase {
public:
    typedef MediaTrack::ReadOptions ReadOptions;

    virtual status_t start(MetaData* params = nullptr) = 0;
    virtual status_t stop() = 0;
    virtual sp<MetaData> getFormat() = 0;
    // On OK *buffer holds a buffer the caller gives back with release(); on
    // any other status *buffer is null.
    virtual status_t read(MediaBufferBase** buffer, const MediaTrack::ReadOptions* options = nullptr) = 0;

protected:
    ~IMediaSource() override = default;
};

}  // namespace android

#endif
