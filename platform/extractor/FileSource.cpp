#define LOG_TAG "FileSource"
#include <media/stagefright/FileSource.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

FileSource::FileSource(const char* filename)
    : mFd(open(filename, O_RDONLY | O_CLOEXEC)), mOffset(0), mLength(-1), mName(filename) {
    if (mFd < 0) {
        ALOGE("Failed to open file '%s' (%s)", filename, strerror(errno));
        return;
    }
    struct stat st;
    if (fstat(mFd, &st) != 0 || S_ISDIR(st.st_mode)) {
        close(mFd);
        mFd = -1;
        return;
    }
    mLength = st.st_size;
}

FileSource::FileSource(int fd, int64_t offset, int64_t length)
    : mFd(-1), mOffset(offset), mLength(length) {
    mName = String8::format("FileSource(fd(%d), %lld, %lld)", fd, (long long)offset, (long long)length);
    struct stat st;
    if (fd < 0 || offset < 0 || fstat(fd, &st) != 0 || S_ISDIR(st.st_mode)) {
        ALOGE("cannot read from descriptor %d", fd);
        return;
    }
    const int mode = fcntl(fd, F_GETFL);
    if (mode < 0 || (mode & O_ACCMODE) == O_WRONLY) {
        ALOGE("descriptor %d is not open for reading", fd);
        return;
    }
    // The window ends at the end of the file, whatever length was asked for.
    const int64_t available = st.st_size > offset ? st.st_size - offset : 0;
    if (S_ISREG(st.st_mode) && (length < 0 || length > available)) mLength = available;
    mFd = fcntl(fd, F_DUPFD_CLOEXEC, 0);
    if (mFd < 0) ALOGE("cannot duplicate descriptor %d (%s)", fd, strerror(errno));
}

FileSource::~FileSource() {
    if (mFd >= 0) close(mFd);
}

status_t FileSource::initCheck() const { return mFd >= 0 ? OK : NO_INIT; }

ssize_t FileSource::readAt(off64_t offset, void* data, size_t size) {
    if (mFd < 0) return NO_INIT;
    if (offset < 0) return ERROR_OUT_OF_RANGE;
    if (mLength >= 0) {
        if (offset >= mLength) return 0;
        if (static_cast<int64_t>(size) > mLength - offset) size = static_cast<size_t>(mLength - offset);
    }
    size_t done = 0;
    while (done < size) {
        const ssize_t n = pread(mFd, static_cast<uint8_t*>(data) + done, size - done, mOffset + offset + done);
        if (n < 0) {
            if (errno == EINTR) continue;
            ALOGE("pread failed (%s)", strerror(errno));
            return ERROR_IO;
        }
        if (n == 0) break;
        done += static_cast<size_t>(n);
    }
    return static_cast<ssize_t>(done);
}

status_t FileSource::getSize(off64_t* size) {
    if (mFd < 0) return NO_INIT;
    *size = mLength;
    return OK;
}

BufferDataSource::BufferDataSource(const void* data, size_t size)
    : mBytes(static_cast<const char*>(data), size) {}

ssize_t BufferDataSource::readAt(off64_t offset, void* data, size_t size) {
    if (offset < 0) return ERROR_OUT_OF_RANGE;
    if (static_cast<uint64_t>(offset) >= mBytes.size()) return 0;
    const size_t n = std::min(size, mBytes.size() - static_cast<size_t>(offset));
    memcpy(data, mBytes.data() + offset, n);
    return static_cast<ssize_t>(n);
}

status_t BufferDataSource::getSize(off64_t* size) {
    *size = static_cast<off64_t>(mBytes.size());
    return OK;
}

}  // namespace android
