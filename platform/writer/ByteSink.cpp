#define LOG_TAG "ByteSink"
#include <media/stagefright/ByteSink.h>

#include <cerrno>
#include <cstring>
#include <unistd.h>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

status_t ByteSink::writeBE16(uint16_t v) {
    const uint8_t b[2] = {uint8_t(v >> 8), uint8_t(v)};
    return write(b, 2);
}
status_t ByteSink::writeBE32(uint32_t v) {
    const uint8_t b[4] = {uint8_t(v >> 24), uint8_t(v >> 16), uint8_t(v >> 8), uint8_t(v)};
    return write(b, 4);
}
status_t ByteSink::writeBE64(uint64_t v) {
    status_t err = writeBE32(uint32_t(v >> 32));
    return err != OK ? err : writeBE32(uint32_t(v));
}
status_t ByteSink::writeLE16(uint16_t v) {
    const uint8_t b[2] = {uint8_t(v), uint8_t(v >> 8)};
    return write(b, 2);
}
status_t ByteSink::writeLE32(uint32_t v) {
    const uint8_t b[4] = {uint8_t(v), uint8_t(v >> 8), uint8_t(v >> 16), uint8_t(v >> 24)};
    return write(b, 4);
}

FdSink::FdSink(int fd, size_t bufferBytes) : mFd(fd), mBase(0), mPosition(0), mCapacity(bufferBytes) {
    if (fd < 0) return;
    const off_t current = lseek(fd, 0, SEEK_CUR);
    mBase = current > 0 ? current : 0;
}

status_t FdSink::pwriteAll(int64_t fileOffset, const void* data, size_t size) {
    if (mFd < 0) return NO_INIT;
    const uint8_t* p = static_cast<const uint8_t*>(data);
    while (size > 0) {
        const ssize_t n = pwrite(mFd, p, size, fileOffset);
        if (n < 0) {
            const int cause = errno;
            if (cause == EINTR) continue;
            ALOGE("write failed: %s", strerror(cause));
            // The cause itself (ENOSPC, EDQUOT, EIO...) is what the caller
            // must be able to tell the user.
            return -cause;
        }
        if (n == 0) return -EIO;
        p += n;
        size -= static_cast<size_t>(n);
        fileOffset += n;
    }
    return OK;
}

status_t FdSink::flush() {
    if (mError != OK || mBuffer.empty()) return mError;
    const int64_t start = mPosition - static_cast<int64_t>(mBuffer.size());
    mError = pwriteAll(mBase + start, mBuffer.data(), mBuffer.size());
    mBuffer.clear();
    return mError;
}

status_t FdSink::write(const void* data, size_t size) {
    if (mCapacity == 0) {
        const status_t err = pwriteAll(mBase + mPosition, data, size);
        if (err == OK) mPosition += static_cast<int64_t>(size);
        return err;
    }
    if (mError != OK) return mError;
    if (mBuffer.size() + size > mCapacity) {
        if (const status_t err = flush()) return err;
    }
    if (size >= mCapacity) {
        // Large appends skip the copy into the buffer.
        mError = pwriteAll(mBase + mPosition, data, size);
        if (mError != OK) return mError;
    } else {
        if (mBuffer.capacity() < mCapacity) mBuffer.reserve(mCapacity);
        const uint8_t* p = static_cast<const uint8_t*>(data);
        mBuffer.insert(mBuffer.end(), p, p + size);
    }
    mPosition += static_cast<int64_t>(size);
    return OK;
}

status_t FdSink::writeAt(int64_t offset, const void* data, size_t size) {
    if (offset < 0 || offset + static_cast<int64_t>(size) > mPosition) return BAD_VALUE;
    if (const status_t err = flush()) return err;
    return pwriteAll(mBase + offset, data, size);
}

status_t FdSink::readAt(int64_t offset, void* data, size_t size) {
    if (mFd < 0) return NO_INIT;
    if (offset < 0 || offset + static_cast<int64_t>(size) > mPosition) return BAD_VALUE;
    if (const status_t err = flush()) return err;
    uint8_t* p = static_cast<uint8_t*>(data);
    while (size > 0) {
        const ssize_t n = pread(mFd, p, size, mBase + offset);
        if (n < 0 && errno == EINTR) continue;
        if (n <= 0) return ERROR_IO;
        p += n;
        size -= static_cast<size_t>(n);
        offset += n;
    }
    return OK;
}

status_t FdSink::sync() {
    if (mFd < 0) return NO_INIT;
    if (const status_t err = flush()) return err;
    // Pipes and character devices cannot be synced; that is not a failure.
    // Anything else (EIO, ENOSPC, EDQUOT on file systems that allocate late)
    // means the data may not be on the device.
    if (fsync(mFd) == 0) return OK;
    const int cause = errno;
    if (cause == EINVAL || cause == EROFS) return OK;
    ALOGE("fsync failed: %s", strerror(cause));
    return -cause;
}

status_t MemorySink::write(const void* data, size_t size) {
    mBytes.append(static_cast<const char*>(data), size);
    return OK;
}

status_t MemorySink::writeAt(int64_t offset, const void* data, size_t size) {
    if (offset < 0 || static_cast<size_t>(offset) + size > mBytes.size()) return BAD_VALUE;
    memcpy(&mBytes[static_cast<size_t>(offset)], data, size);
    return OK;
}

status_t MemorySink::readAt(int64_t offset, void* data, size_t size) {
    if (offset < 0 || static_cast<size_t>(offset) + size > mBytes.size()) return BAD_VALUE;
    memcpy(data, &mBytes[static_cast<size_t>(offset)], size);
    return OK;
}

}  // namespace android
