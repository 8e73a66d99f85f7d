#include <media/stagefright/foundation/ABitReader.h>

namespace android {

ABitReader::ABitReader(const uint8_t* data, size_t size)
    : mData(data),
      mSize(data != nullptr ? size : 0),
      mNext(0),
      mByteIndex(0),
      mByte(0),
      mBitsInByte(0),
      mOverRead(false) {}

ABitReader::~ABitReader() {}

bool ABitReader::fillReservoir() {
    if (mNext >= mSize) return false;
    mByteIndex = mNext;
    mByte = mData[mNext++];
    mBitsInByte = 8;
    return true;
}

// Reads up to n (<= 32) bits. Missing bits at the end of the data count as 0
// in *out; the answer says whether all n were there.
bool ABitReader::readBits(size_t n, uint32_t* out) {
    uint64_t value = 0;
    size_t missing = 0;
    while (n > 0) {
        if (mBitsInByte == 0 && !fillReservoir()) {
            mOverRead = true;
            missing = n;
            break;
        }
        const size_t take = n < mBitsInByte ? n : mBitsInByte;
        mBitsInByte -= take;
        value = (value << take) | ((mByte >> mBitsInByte) & ((1u << take) - 1));
        n -= take;
    }
    *out = static_cast<uint32_t>(value << missing);
    return missing == 0;
}

bool ABitReader::getBitsGraceful(size_t n, uint32_t* out) {
    if (n > 32) return false;
    uint32_t value;
    if (!readBits(n, &value)) return false;
    *out = value;
    return true;
}

uint32_t ABitReader::getBitsWithFallback(size_t n, uint32_t fallback) {
    uint32_t value;
    return getBitsGraceful(n, &value) ? value : fallback;
}

uint32_t ABitReader::getBits(size_t n) {
    uint32_t value;
    readBits(n > 32 ? 32 : n, &value);
    return value;
}

bool ABitReader::skipBits(size_t n) {
    const size_t first = n < mBitsInByte ? n : mBitsInByte;
    mBitsInByte -= first;
    n -= first;
    while (n > 0) {
        if (!fillReservoir()) {
            mOverRead = true;
            return false;
        }
        const size_t take = n < 8 ? n : 8;
        mBitsInByte -= take;
        n -= take;
    }
    return true;
}

size_t ABitReader::numBitsLeft() const { return mBitsInByte + (mSize - mNext) * 8; }

bool ABitReader::atLeastNumBitsLeft(size_t n) const { return numBitsLeft() >= n; }

const uint8_t* ABitReader::data() const {
    if (mData == nullptr) return nullptr;
    return mData + (mBitsInByte > 0 ? mByteIndex : mNext);
}

NALBitReader::NALBitReader(const uint8_t* data, size_t size) : ABitReader(data, size), mZeros(0) {}

bool NALBitReader::fillReservoir() {
    while (mNext < mSize) {
        const uint8_t b = mData[mNext];
        if (b == 0x03 && mZeros >= 2) {
            ++mNext;
            mZeros = 0;
            continue;
        }
        mZeros = b == 0 ? mZeros + 1 : 0;
        mByteIndex = mNext;
        mByte = b;
        ++mNext;
        mBitsInByte = 8;
        return true;
    }
    return false;
}

size_t NALBitReader::countPayloadBits(size_t limit) const {
    size_t bits = 0;
    size_t zeros = mZeros;
    for (size_t i = mNext; i < mSize && bits < limit; ++i) {
        const uint8_t b = mData[i];
        if (b == 0x03 && zeros >= 2) {
            zeros = 0;
            continue;
        }
        zeros = b == 0 ? zeros + 1 : 0;
        bits += 8;
    }
    return bits;
}

size_t NALBitReader::numBitsLeft() const { return mBitsInByte + countPayloadBits(SIZE_MAX); }

bool NALBitReader::atLeastNumBitsLeft(size_t n) const {
    if (mBitsInByte >= n) return true;
    return mBitsInByte + countPayloadBits(n - mBitsInByte) >= n;
}

}  // namespace android
