#include <media/MediaCodecBuffer.h>

namespace android {

MediaCodecBuffer::MediaCodecBuffer(const sp<AMessage>& format, const sp<ABuffer>& buffer)
    : mMeta(new AMessage), mFormat(format), mBuffer(buffer) {}

status_t MediaCodecBuffer::setRange(size_t offset, size_t size) {
    if (offset > mBuffer->capacity() || size > mBuffer->capacity() - offset) return BAD_VALUE;
    mBuffer->setRange(offset, size);
    return OK;
}

}  // namespace android
