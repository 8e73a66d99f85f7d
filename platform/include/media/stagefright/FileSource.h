#ifndef FILE_SOURCE_H_
#define FILE_SOURCE_H_

#include <string>

#include <media/stagefright/DataSource.h>

namespace android {

// A window (offset, length) of a caller's descriptor, read with pread. The
// descriptor is duplicated, so the caller may close its own.
class FileSource : public DataSource {
public:
    explicit FileSource(const char* filename);
    FileSource(int fd, int64_t offset, int64_t length);

    status_t initCheck() const override;
    ssize_t readAt(off64_t offset, void* data, size_t size) override;
    status_t getSize(off64_t* size) override;
    uint32_t flags() override { return kIsLocalFileSource; }
    String8 toString() override { return mName; }

protected:
    ~FileSource() override;

private:
    int mFd;
    int64_t mOffset;
    int64_t mLength;
    String8 mName;
};

// Bytes in memory, for tests and for data already read.
class BufferDataSource : public DataSource {
public:
    BufferDataSource(const void* data, size_t size);

    status_t initCheck() const override { return OK; }
    ssize_t readAt(off64_t offset, void* data, size_t size) override;
    status_t getSize(off64_t* size) override;

private:
    std::string mBytes;
};

}  // namespace android

#endif
