#ifndef MEDIA_CODEC_BUFFER_H_
#define MEDIA_CODEC_BUFFER_H_

#include <cstddef>
#include <cstdint>

#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/AMessage.h>
#include <utils/Errors.h>
#include <utils/RefBase.h>

namespace android {

// A codec's input or output buffer: bytes with a capacity and a range, and
// the format they are in.
class MediaCodecBuffer : public RefBase {
public:
    MediaCodecBuffer(const sp<AMessage>& format, const sp<ABuffer>& buffer);

    uint8_t* base() { return mBuffer->base(); }
    uint8_t* data() { return mBuffer->data(); }
    size_t capacity() const { return mBuffer->capacity(); }
    size_t size() const { return mBuffer->size(); }
    size_t offset() const { return mBuffer->offset(); }
    // BAD_VALUE for a range outside the capacity.
    status_t setRange(size_t offset, size_t size);

    sp<AMessage> meta() { return mMeta; }
    sp<AMessage> format() { return mFormat; }
    void setFormat(const sp<AMessage>& format) { mFormat = format; }

protected:
    ~MediaCodecBuffer() override = default;

private:
    sp<AMessage> mMeta;
    sp<AMessage> mFormat;
    const sp<ABuffer> mBuffer;
};

}  // namespace android

#endif
