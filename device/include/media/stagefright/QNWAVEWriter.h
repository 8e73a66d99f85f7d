#ifndef QN_WAVE_WRITER_H_
#define QN_WAVE_WRITER_H_

#include <memory>

#include <media/stagefright/MediaWriter.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/String8.h>

namespace android {

// RIFF/WAVE from PCM, with the device's items in chunks of their own after
// "data": "wafm" (waveform values), "umsg" (user message text), "rmod"
// (recording meta text), "bksz" (bookmark size, little-endian int64).
class QNWAVEWriter : public MediaWriter {
public:
    explicit QNWAVEWriter(int fd);

    status_t addSource(const sp<MediaSource>& source) override;
    status_t start(MetaData* params = nullptr) override;
    status_t stop() override;
    status_t pause() override;
    bool reachedEOS() override;
    void setWaveform(const uint8_t* data, int count) override;

    status_t setUserMessage(const uint8_t* message);
    status_t setAudioRecodingMeta(int kind, const String8& text);
    status_t setRecodingParams(const sp<AMessage>& params);

protected:
    ~QNWAVEWriter() override;

private:
    struct Impl;
    std::unique_ptr<Impl> mImpl;
};

}  // namespace android

#endif
