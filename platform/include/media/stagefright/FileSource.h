#ifndef FILE_SOURCE_H_
#define FILE_SOURCE_H_

#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include <media/stagefright/DataSource.h>
#include <media/stagefright/foundation/ABuffer.h>

namespace android {

// A window (offset, length) of a caller's descriptor, read with pread. The
// descriptor is duplicated, so the caller may close its own.
//
// readBuffer() reads kReadAhead bytes at a time and hands out ranges of such
// a read as buffers sharing its memory, so that the samples of a long copy
// cost neither a read call nor a copy each. A few reads are kept, so that
// tracks stored apart each keep theirs. A byte of a read is handed out at
// most once (asking again reads it anew), so each caller may rewrite its
// bytes. Safe to call from several threads.
class FileSource : public DataSource {
public:
    static constexpr size_t kReadAhead = 1 << 20;

    explicit FileSource(const char* filename);
    FileSource(int fd, int64_t offset, int64_t length);

    status_t initCheck() const override;
    ssize_t readAt(off64_t offset, void* data, size_t size) override;
    MediaBuffer* readBuffer(off64_t offset, size_t size, status_t* err) override;
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

    struct Ahead {
        sp<ABuffer> bytes;
        off64_t start = 0;
        size_t length = 0;
        // Ranges handed out, sorted, neighbours merged.
        std::vector<std::pair<off64_t, off64_t>> given;
        uint64_t lastUse = 0;
        // Marks [offset, offset + size) handed out; false when some of it was.
        bool take(off64_t offset, size_t size);
    };
    static constexpr size_t kAheadReads = 4;
    std::mutex mAheadLock;
    Ahead mAhead[kAheadReads];
    uint64_t mUses = 0;
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
