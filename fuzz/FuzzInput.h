#ifndef FUZZ_INPUT_H
#define FUZZ_INPUT_H

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <sys/mman.h>
#include <unistd.h>

#include <log/log.h>

// Takes values off the front of the fuzzer's bytes; runs dry with zeros.
class FuzzInput {
public:
    FuzzInput(const uint8_t* data, size_t size) : mData(data), mSize(size) {}
    uint8_t u8() { return mPos < mSize ? mData[mPos++] : 0; }
    // Little-endian; one statement per byte keeps the order of the reads fixed.
    uint32_t u32() {
        uint32_t v = u8();
        v |= uint32_t(u8()) << 8;
        v |= uint32_t(u8()) << 16;
        v |= uint32_t(u8()) << 24;
        return v;
    }
    // The next n bytes (fewer at the end).
    const uint8_t* take(size_t n, size_t* got) {
        *got = n < mSize - mPos ? n : mSize - mPos;
        const uint8_t* p = mData + mPos;
        mPos += *got;
        return p;
    }
    const uint8_t* rest(size_t* got) { return take(mSize - mPos, got); }

private:
    const uint8_t* mData;
    size_t mSize;
    size_t mPos = 0;
};

// A descriptor holding the bytes, for APIs that take files.
inline int fuzzFd(const uint8_t* data, size_t size) {
    const int fd = memfd_create("fuzz", MFD_CLOEXEC);
    if (fd < 0) return -1;
    size_t done = 0;
    while (done < size) {
        const ssize_t n = write(fd, data + done, size - done);
        if (n <= 0) break;
        done += static_cast<size_t>(n);
    }
    return fd;
}

// Log lines cost time and say nothing here.
inline void quietLogs() {
    static bool done = false;
    if (!done) {
        android::setLogSink([](int, const char*, const char*) {});
        done = true;
    }
}

#endif
