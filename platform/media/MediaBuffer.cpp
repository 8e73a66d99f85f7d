#include <media/stagefright/MediaBuffer.h>

#include <cstdlib>

#include <media/stagefright/foundation/ABuffer.h>
#include <media/stagefright/foundation/ADebug.h>

namespace android {

MediaBuffer::MediaBuffer(size_t size)
    : mObserver(nullptr), mRefCount(0), mData(size ? malloc(size) : nullptr),
      mSize(mData ? size : 0), mRangeOffset(0), mRangeLength(mSize), mOwnsData(true),
      mMetaData(new MetaData) {}

MediaBuffer::MediaBuffer(void* data, size_t size)
    : mObserver(nullptr), mRefCount(0), mData(data), mSize(size), mRangeOffset(0),
      mRangeLength(size), mOwnsData(false), mMetaData(new MetaData) {}

MediaBuffer::MediaBuffer(const sp<ABuffer>& buffer)
    : mObserver(nullptr), mRefCount(0), mData(buffer->data()), mSize(buffer->size()),
      mRangeOffset(0), mRangeLength(mSize), mBuffer(buffer), mOwnsData(false),
      mMetaData(new MetaData) {}

MediaBuffer::~MediaBuffer() {
    if (mOwnsData) free(mData);
}

void MediaBuffer::add_ref() { mRefCount.fetch_add(1); }

void MediaBuffer::release() {
    const int previous = mRefCount.fetch_sub(1);
    if (previous > 1) return;
    mRefCount.store(0);
    if (mObserver != nullptr) {
        mObserver->signalBufferReturned(this);
    } else {
        delete this;
    }
}

void MediaBuffer::set_range(size_t offset, size_t length) {
    CHECK_LE(offset, mSize);
    CHECK_LE(length, mSize - offset);
    mRangeOffset = offset;
    mRangeLength = length;
}

void MediaBuffer::reset() {
    mMetaData->clear();
    set_range(0, mSize);
}

MediaBufferBase* MediaBuffer::clone() {
    MediaBuffer* buffer = new MediaBuffer(mData, mSize);
    buffer->set_range(mRangeOffset, mRangeLength);
    buffer->meta_data() = *mMetaData;
    return buffer;
}

}  // namespace android
