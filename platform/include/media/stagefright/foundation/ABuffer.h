#ifndef A_BUFFER_H_
#define A_BUFFER_H_

#include <cstddef>
#include <cstdint>

#include <media/stagefright/foundation/ABase.h>
#include <utils/RefBase.h>

namespace android {

struct AMessage;

// Bytes with a capacity and a current range (offset, size). An ABuffer made
// over caller memory does not own it.
struct ABuffer : public RefBase {
    explicit ABuffer(size_t capacity);
    ABuffer(void* data, size_t capacity);

    uint8_t* base() { return static_cast<uint8_t*>(mData); }
    uint8_t* data() { return static_cast<uint8_t*>(mData) + mRangeOffset; }
    size_t capacity() const { return mCapacity; }
    size_t size() const { return mRangeLength; }
    size_t offset() const { return mRangeOffset; }

    // Aborts on a range outside the capacity: a caller's broken contract.
    void setRange(size_t offset, size_t size);

    void setInt32Data(int32_t data) { mInt32Data = data; }
    int32_t int32Data() const { return mInt32Data; }

    sp<AMessage> meta();

    // Copies; null when the memory cannot be had.
    static sp<ABuffer> CreateAsCopy(const void* data, size_t capacity);

protected:
    virtual ~ABuffer();

private:
    sp<AMessage> mMeta;
    void* mData;
    size_t mCapacity;
    size_t mRangeOffset;
    size_t mRangeLength;
    int32_t mInt32Data;
    bool mOwnsData;

    DISALLOW_EVIL_CONSTRUCTORS(ABuffer);
};

}  // namespace android

#endif
