#define LOG_TAG "FileSource"
#include <media/stagefright/FileSource.h>

#include <algorithm>
#include <iterator>
#include <new>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <log/log.h>
#include <media/stagefright/MediaBuffer.h>
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

bool FileSource::Ahead::take(off64_t offset, size_t size) {
    const off64_t end = offset + static_cast<off64_t>(size);
    auto next = std::upper_bound(given.begin(), given.end(), std::make_pair(offset, INT64_MAX));
    if (next != given.end() && next->first < end) return false;
    if (next != given.begin() && std::prev(next)->second > offset) return false;
    const bool joinsPrevious = next != given.begin() && std::prev(next)->second == offset;
    const bool joinsNext = next != given.end() && next->first == end;
    if (joinsPrevious && joinsNext) {
        std::prev(next)->second = next->second;
        given.erase(next);
    } else if (joinsPrevious) {
        std::prev(next)->second = end;
    } else if (joinsNext) {
        next->first = offset;
    } else {
        given.insert(next, {offset, end});
    }
    return true;
}

MediaBuffer* FileSource::readBuffer(off64_t offset, size_t size, status_t* err) {
    // Ranges that fill much of a read gain nothing from sharing one.
    if (mFd < 0 || offset < 0 || size == 0 || size > kReadAhead / 4) return DataSource::readBuffer(offset, size, err);
    std::lock_guard<std::mutex> lock(mAheadLock);
    Ahead* from = nullptr;
    for (Ahead& a : mAhead) {
        if (a.bytes != nullptr && offset >= a.start &&
            static_cast<uint64_t>(offset - a.start) + size <= a.length && a.take(offset, size)) {
            from = &a;
            break;
        }
    }
    if (from == nullptr) {
        // Replaces the read used least recently.
        from = &mAhead[0];
        for (Ahead& a : mAhead) {
            if (a.lastUse < from->lastUse) from = &a;
        }
        from->bytes.clear();
        from->given.clear();
        size_t want = kReadAhead;
        if (mLength >= 0) want = static_cast<size_t>(std::max<int64_t>(0, std::min<int64_t>(want, mLength - offset)));
        want = std::max(want, size);
        sp<ABuffer> bytes = new (std::nothrow) ABuffer(want);
        if (bytes == nullptr || bytes->base() == nullptr) {
            *err = NO_MEMORY;
            return nullptr;
        }
        const ssize_t n = readAt(offset, bytes->base(), want);
        if (n < static_cast<ssize_t>(size)) {
            *err = n < 0 ? static_cast<status_t>(n) : ERROR_IO;
            return nullptr;
        }
        from->bytes = bytes;
        from->start = offset;
        from->length = static_cast<size_t>(n);
        from->take(offset, size);
    }
    from->lastUse = ++mUses;
    // The buffer takes the range as it is now and keeps the read alive.
    from->bytes->setRange(static_cast<size_t>(offset - from->start), size);
    MediaBuffer* out = new (std::nothrow) MediaBuffer(from->bytes);
    if (out == nullptr) {
        *err = NO_MEMORY;
        return nullptr;
    }
    out->add_ref();
    return out;
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
