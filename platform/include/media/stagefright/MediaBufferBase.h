#ifndef MEDIA_BUFFER_BASE_H_
#define MEDIA_BUFFER_BASE_H_

#include <cstddef>

#include <media/stagefright/MetaDataBase.h>

namespace android {

class MediaBufferBase;

// Told when a buffer it handed out comes back (its count drops to zero).
class MediaBufferObserver {
public:
    MediaBufferObserver() {}
    virtual ~MediaBufferObserver() {}
    virtual void signalBufferReturned(MediaBufferBase* buffer) = 0;

private:
    MediaBufferObserver(const MediaBufferObserver&) = delete;
    MediaBufferObserver& operator=(const MediaBufferObserver&) = delete;
};

class MediaBufferBase {
public:
    // Drops one reference: with an observer the buffer goes back to it at
    // zero, without one it is deleted.
    virtual void release() = 0;
    virtual void add_ref() = 0;

    virtual void* data() const = 0;
    virtual size_t size() const = 0;
    virtual size_t range_offset() const = 0;
    virtual size_t range_length() const = 0;
    virtual void set_range(size_t offset, size_t length) = 0;

    virtual MetaDataBase& meta_data() = 0;
    virtual void reset() = 0;

    virtual void setObserver(MediaBufferObserver* group) = 0;
    virtual int refcount() const = 0;

    virtual MediaBufferBase* clone() = 0;

protected:
    MediaBufferBase() {}
    virtual ~MediaBufferBase() {}
};

}  // namespace android

#endif
