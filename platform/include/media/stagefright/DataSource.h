#ifndef DATA_SOURCE_H_
#define DATA_SOURCE_H_

#include <cstddef>
#include <cstdint>
#include <sys/types.h>

#include <utils/Errors.h>
#include <utils/RefBase.h>
#include <utils/String8.h>

namespace android {

class MediaBuffer;

// Random-access bytes that extractors read from.
class DataSource : public RefBase {
public:
    enum Flags {
        kWantsPrefetching = 1,
        kStreamedFromLocalHost = 2,
        kIsCachingDataSource = 4,
        kIsHTTPBasedSource = 8,
        kIsLocalFileSource = 16,
    };

    DataSource() = default;

    virtual status_t initCheck() const = 0;
    // Bytes read (fewer at the end of the data, 0 past it), or a negative error.
    virtual ssize_t readAt(off64_t offset, void* data, size_t size) = 0;
    virtual status_t getSize(off64_t* size);
    virtual uint32_t flags() { return 0; }
    virtual String8 toString() { return String8("<unspecified>"); }

    // Exactly the bytes [offset, offset + size) in a buffer that holds one
    // reference for the caller, who may rewrite them; null with *err set on
    // a read error or a short read. Sources that read ahead hand out
    // consecutive ranges from one read without copying them.
    virtual MediaBuffer* readBuffer(off64_t offset, size_t size, status_t* err);

    // Reads exactly `size` bytes or answers false.
    bool readExactly(off64_t offset, void* data, size_t size);
    bool getUInt16(off64_t offset, uint16_t* x);   // big-endian
    bool getUInt24(off64_t offset, uint32_t* x);   // big-endian
    bool getUInt32(off64_t offset, uint32_t* x);   // big-endian
    bool getUInt64(off64_t offset, uint64_t* x);   // big-endian

protected:
    ~DataSource() override = default;
};

}  // namespace android

#endif
