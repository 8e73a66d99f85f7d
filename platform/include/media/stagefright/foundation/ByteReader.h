#ifndef BYTE_READER_H_
#define BYTE_READER_H_

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace android {

// The one bounds-checked reader for bytes in memory that came from a file.
// Every read checks what remains first; a read that does not fit fails,
// reads nothing and leaves the reader where it was. Sizes taken from the
// data must go through has()/skip() before they are used or allocated from.
class ByteReader {
public:
    ByteReader(const uint8_t* data, size_t size) : mData(data), mSize(data ? size : 0), mPos(0) {}

    size_t remaining() const { return mSize - mPos; }
    size_t position() const { return mPos; }
    size_t size() const { return mSize; }
    const uint8_t* current() const { return mData + mPos; }
    bool has(uint64_t n) const { return n <= remaining(); }
    bool atEnd() const { return mPos == mSize; }

    bool skip(uint64_t n) {
        if (!has(n)) return false;
        mPos += static_cast<size_t>(n);
        return true;
    }
    bool seek(size_t pos) {
        if (pos > mSize) return false;
        mPos = pos;
        return true;
    }
    bool read(void* out, size_t n) {
        if (!has(n)) return false;
        memcpy(out, mData + mPos, n);
        mPos += n;
        return true;
    }
    // A reader over the next n bytes; this one moves past them.
    bool sub(uint64_t n, ByteReader* out) {
        if (!has(n)) return false;
        *out = ByteReader(mData + mPos, static_cast<size_t>(n));
        mPos += static_cast<size_t>(n);
        return true;
    }

    bool u8(uint8_t* v) { return readUnsigned(1, true, v); }
    bool be16(uint16_t* v) { return readUnsigned(2, true, v); }
    bool be24(uint32_t* v) { return readUnsigned(3, true, v); }
    bool be32(uint32_t* v) { return readUnsigned(4, true, v); }
    bool be64(uint64_t* v) { return readUnsigned(8, true, v); }
    bool le16(uint16_t* v) { return readUnsigned(2, false, v); }
    bool le32(uint32_t* v) { return readUnsigned(4, false, v); }
    bool le64(uint64_t* v) { return readUnsigned(8, false, v); }

private:
    template <typename T>
    bool readUnsigned(size_t n, bool bigEndian, T* v) {
        if (!has(n)) return false;
        uint64_t x = 0;
        for (size_t i = 0; i < n; ++i) {
            const uint64_t b = mData[mPos + (bigEndian ? i : n - 1 - i)];
            x = (x << 8) | b;
        }
        *v = static_cast<T>(x);
        mPos += n;
        return true;
    }

    const uint8_t* mData;
    size_t mSize;
    size_t mPos;
};

}  // namespace android

#endif
