#ifndef MPEG4_WRITER_H_
#define MPEG4_WRITER_H_

#include <memory>

#include <media/stagefright/MediaWriter.h>
#include <utils/String8.h>

namespace android {

// ISO base media file writer (mp4): ftyp, streamed mdat, moov at the end.
class MPEG4Writer : public MediaWriter {
public:
    explicit MPEG4Writer(int fd);

    status_t addSource(const sp<MediaSource>& source) override;
    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    status_t pause() override;
    bool reachedEOS() override;
    void setWaveform(const uint8_t* data, int count) override;

    // Device extensions. Location in units of 1e-4 degrees.
    status_t setGeoData(int latitude, int longitude);
    status_t setUuidData(const uint8_t* data, int size);
    status_t setQNVideoFourCC(String8 fourcc);

protected:
    ~MPEG4Writer() override;

    struct Impl;
    std::unique_ptr<Impl> mImpl;
};

}  // namespace android

#endif
