#include <media/stagefright/foundation/ABuffer.h>

#include <cstdlib>
#include <cstring>
#include <new>

#include <media/stagefright/foundation/ADebug.h>
#include <media/stagefright/foundation/AMessage.h>

namespace android {

ABuffer::ABuffer(size_t capacity)
    : mData(capacity ? malloc(capacity) : nullptr),
      mCapacity(mData ? capacity : 0),
      mRangeOffset(0),
      mRangeLength(mCapacity),
      mInt32Data(0),
      mOwnsData(true) {}

ABuffer::ABuffer(void* data, size_t capacity)
    : mData(data),
      mCapacity(capacity),
      mRangeOffset(0),
      mRangeLength(capacity),
      mInt32Data(0),
      mOwnsData(false) {}

ABuffer::~ABuffer() {
    if (mOwnsData) free(mData);
}

void ABuffer::setRange(size_t offset, size_t size) {
    CHECK_LE(offset, mCapacity);
    CHECK_LE(size, mCapacity - offset);
    mRangeOffset = offset;
    mRangeLength = size;
}

sp<AMessage> ABuffer::meta() {
    if (mMeta == nullptr) mMeta = new AMessage;
    return mMeta;
}

sp<ABuffer> ABuffer::CreateAsCopy(const void* data, size_t capacity) {
    sp<ABuffer> res = new (std::nothrow) ABuffer(capacity);
    if (res == nullptr || (capacity > 0 && res->base() == nullptr)) return nullptr;
    if (capacity > 0) memcpy(res->data(), data, capacity);
    return res;
}

}  // namespace android
