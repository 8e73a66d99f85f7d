#ifndef FLAC_WRITER_H_
#define FLAC_WRITER_H_

#include <memory>

#include <media/stagefright/MediaWriter.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/String8.h>

namespace android {

// Native FLAC from compressed frames or from PCM (encoded here), with the
// device's items in APPLICATION metadata blocks before the frames: "umsg"
// (user message text), "rmod" (recording meta text), "bksz" (bookmark size,
// big-endian int64), "wafm" (waveform values).
class FLACWriter : public MediaWriter {
public:
    explicit FLACWriter(int fd);

    status_t addSource(const sp<MediaSource>& source) override;
    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    status_t pause() override;
    bool reachedEOS() override;
    void setWaveform(const uint8_t* data, int count) override;

    // Device extensions.
    status_t setUserMessage(const uint8_t* message);
    status_t setAudioRecodingMeta(int kind, const String8& text);
    status_t setRecodingParams(const sp<AMessage>& params);

protected:
    ~FLACWriter() override;

private:
    struct Impl;
    std::unique_ptr<Impl> mImpl;
};

}  // namespace android

#endif
