#ifndef MEDIA_WRITER_H_
#define MEDIA_WRITER_H_

#include <cstdint>

#include <media/IMediaRecorderClient.h>
#include <media/stagefright/MediaSource.h>
#include <media/stagefright/MetaData.h>
#include <utils/Errors.h>
#include <utils/RefBase.h>

namespace android {

// Writes one file from the sources added to it; it pulls their buffers.
struct MediaWriter : public RefBase {
    MediaWriter() : mMaxFileSizeLimitBytes(0), mMaxFileDurationLimitUs(0) {}

    virtual status_t addSource(const sp<MediaSource>& source) = 0;
    virtual bool reachedEOS() = 0;
    virtual status_t start(MetaData* params = nullptr) = 0;
    // Everything the sources delivered before stop() is in the file, and the
    // file is complete, when stop() returns.
    virtual status_t stop() = 0;
    virtual status_t pause() = 0;
    virtual void setMaxFileSize(int64_t bytes) { mMaxFileSizeLimitBytes = bytes; }
    virtual void setMaxFileDuration(int64_t durationUs) { mMaxFileDurationLimitUs = durationUs; }
    virtual void setListener(const sp<IMediaRecorderClient>& listener) { mListener = listener; }
    virtual status_t setNextFd(int /*fd*/) { return INVALID_OPERATION; }

    // Device extension: the recording's waveform, `count` 16-bit big-endian
    // values (2 * count bytes), copied. Writers that cannot store it ignore it.
    virtual void setWaveform(const uint8_t* data, int count) {}

protected:
    ~MediaWriter() override = default;

    void notify(int msg, int ext1, int ext2) {
        if (mListener != nullptr) mListener->notify(msg, ext1, ext2);
    }

    int64_t mMaxFileSizeLimitBytes;
    int64_t mMaxFileDurationLimitUs;
    sp<IMediaRecorderClient> mListener;
};

}  // namespace android

#endif
