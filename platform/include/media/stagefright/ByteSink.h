#ifndef BYTE_SINK_H_
#define BYTE_SINK_H_

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>
#include <sys/types.h>

#include <utils/Errors.h>
#include <utils/RefBase.h>

namespace android {

// Where writers put their bytes: appends at the end, and rewrites earlier
// bytes in place (sizes fixed up when a file is finished).
class ByteSink : public RefBase {
public:
    // Appends; OK or an error status (a negated errno for a failed write).
    virtual status_t write(const void* data, size_t size) = 0;
    // Overwrites bytes that were already written.
    virtual status_t writeAt(int64_t offset, const void* data, size_t size) = 0;
    // Bytes written so far (the append position).
    virtual int64_t position() const = 0;
    // Reads back bytes already written, for writers that move data when they
    // finish; INVALID_OPERATION where the sink cannot be read.
    virtual status_t readAt(int64_t offset, void* data, size_t size) { return INVALID_OPERATION; }

    status_t writeU8(uint8_t v) { return write(&v, 1); }
    status_t writeBE16(uint16_t v);
    status_t writeBE32(uint32_t v);
    status_t writeBE64(uint64_t v);
    status_t writeLE16(uint16_t v);
    status_t writeLE32(uint32_t v);
    status_t writeFourcc(const char* fourcc) { return write(fourcc, 4); }

protected:
    ~ByteSink() override = default;
};

// A caller's descriptor, written from its current offset on; the caller keeps
// ownership of the descriptor.
//
// With a buffer, appends are gathered into writes of that many bytes (appends
// at least that large go straight to the descriptor). A failed write is then
// answered by the call that flushed: an append, writeAt, readAt, flush or sync,
// and every later call answers it again. What is still buffered when the sink
// goes is dropped (the caller may have closed or reused the descriptor).
class FdSink : public ByteSink {
public:
    // What the writers gather appends into: a long copy otherwise makes one
    // system call per sample.
    static constexpr size_t kWriterBuffer = 1 << 20;

    explicit FdSink(int fd, size_t bufferBytes = 0);
    status_t initCheck() const { return mFd >= 0 ? OK : NO_INIT; }
    status_t write(const void* data, size_t size) override;
    status_t writeAt(int64_t offset, const void* data, size_t size) override;
    int64_t position() const override { return mPosition; }
    // Needs a descriptor opened for reading too.
    status_t readAt(int64_t offset, void* data, size_t size) override;
    // Writes out what is buffered.
    status_t flush();
    // Pushes what was written to the device; a negated errno when that
    // fails (descriptors that cannot be synced, like pipes, answer OK).
    status_t sync();

private:
    status_t pwriteAll(int64_t fileOffset, const void* data, size_t size);
    int mFd;
    int64_t mBase;      // file offset of byte 0 of the sink
    int64_t mPosition;  // bytes appended, buffered ones included
    size_t mCapacity;   // 0: every append is written at once
    std::vector<uint8_t> mBuffer;  // the last mBuffer.size() bytes appended
    status_t mError = OK;          // of a failed buffered write
};

// Bytes in memory, for tests and for building boxes before they are sized.
class MemorySink : public ByteSink {
public:
    status_t write(const void* data, size_t size) override;
    status_t writeAt(int64_t offset, const void* data, size_t size) override;
    int64_t position() const override { return static_cast<int64_t>(mBytes.size()); }
    status_t readAt(int64_t offset, void* data, size_t size) override;
    const std::string& bytes() const { return mBytes; }

private:
    std::string mBytes;
};

}  // namespace android

#endif
