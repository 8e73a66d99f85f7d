#include <media/stagefright/DataSource.h>

#include <new>

#include <log/log.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

status_t DataSource::getSize(off64_t* size) {
    *size = 0;
    return INVALID_OPERATION;
}

MediaBuffer* DataSource::readBuffer(off64_t offset, size_t size, status_t* err) {
    MediaBuffer* buffer = new (std::nothrow) MediaBuffer(size);
    if (buffer == nullptr || (size > 0 && buffer->data() == nullptr)) {
        if (buffer != nullptr) buffer->release();
        *err = NO_MEMORY;
        return nullptr;
    }
    buffer->add_ref();
    const ssize_t n = size > 0 ? readAt(offset, buffer->data(), size) : 0;
    if (n != static_cast<ssize_t>(size)) {
        buffer->release();
        *err = n < 0 ? static_cast<status_t>(n) : ERROR_IO;
        return nullptr;
    }
    return buffer;
}

bool DataSource::readExactly(off64_t offset, void* data, size_t size) {
    if (offset < 0) return false;
    return readAt(offset, data, size) == static_cast<ssize_t>(size);
}

bool DataSource::getUInt16(off64_t offset, uint16_t* x) {
    uint8_t b[2];
    if (!readExactly(offset, b, 2)) return false;
    *x = static_cast<uint16_t>((b[0] << 8) | b[1]);
    return true;
}

bool DataSource::getUInt24(off64_t offset, uint32_t* x) {
    uint8_t b[3];
    if (!readExactly(offset, b, 3)) return false;
    *x = (uint32_t(b[0]) << 16) | (uint32_t(b[1]) << 8) | b[2];
    return true;
}

bool DataSource::getUInt32(off64_t offset, uint32_t* x) {
    uint8_t b[4];
    if (!readExactly(offset, b, 4)) return false;
    *x = (uint32_t(b[0]) << 24) | (uint32_t(b[1]) << 16) | (uint32_t(b[2]) << 8) | b[3];
    return true;
}

bool DataSource::getUInt64(off64_t offset, uint64_t* x) {
    uint32_t hi, lo;
    if (!getUInt32(offset, &hi) || !getUInt32(offset + 4, &lo)) return false;
    *x = (uint64_t(hi) << 32) | lo;
    return true;
}

}  // namespace android
