#ifndef MEDIA_BUFFER_H_
#define MEDIA_BUFFER_H_

#include <atomic>

#include <media/stagefright/MediaBufferBase.h>
#include <media/stagefright/MetaData.h>
#include <utils/RefBase.h>

namespace android {

struct ABuffer;

class MediaBuffer : public MediaBufferBase {
public:
    // Owns a new allocation of `size` bytes (data() is null when it failed).
    explicit MediaBuffer(size_t size);
    // Wraps caller memory without owning it.
    MediaBuffer(void* data, size_t size);
    // Shares the buffer's bytes (its current range) and keeps it alive.
    explicit MediaBuffer(const sp<ABuffer>& buffer);

    void release() override;
    void add_ref() override;

    void* data() const override { return mData; }
    size_t size() const override { return mSize; }
    size_t range_offset() const override { return mRangeOffset; }
    size_t range_length() const override { return mRangeLength; }
    // Aborts on a range outside the buffer: a caller's broken contract.
    void set_range(size_t offset, size_t length) override;

    MetaDataBase& meta_data() override { return *mMetaData; }
    void reset() override;

    void setObserver(MediaBufferObserver* group) override { mObserver = group; }
    int refcount() const override { return mRefCount.load(); }

    // A new buffer sharing these bytes; the original must outlive it.
    MediaBufferBase* clone() override;

protected:
    ~MediaBuffer() override;

private:
    MediaBufferObserver* mObserver;
    std::atomic<int> mRefCount;
    void* mData;
    size_t mSize, mRangeOffset, mRangeLength;
    sp<ABuffer> mBuffer;
    bool mOwnsData;
    sp<MetaData> mMetaData;

    MediaBuffer(const MediaBuffer&) = delete;
    MediaBuffer& operator=(const MediaBuffer&) = delete;
};

}  // namespace android

#endif
