#define LOG_TAG "Mp4NalUnits"
#include "mpeg4/Mp4NalUnits.h"

namespace android {

bool Mp4StartsWithStartCode(const uint8_t* data, size_t size) {
    if (size >= 3 && data[0] == 0 && data[1] == 0 && data[2] == 1) return true;
    return size >= 4 && data[0] == 0 && data[1] == 0 && data[2] == 0 && data[3] == 1;
}

bool Mp4SplitAnnexB(const uint8_t* data, size_t size, std::vector<NalSpan>* nals) {
    nals->clear();
    if (!Mp4StartsWithStartCode(data, size)) return false;
    size_t i = data[2] == 1 ? 3 : 4;
    size_t start = i;
    auto emit = [&](size_t end) {
        while (end > start && data[end - 1] == 0) --end;  // trailing_zero_8bits
        if (end > start) nals->push_back({data + start, end - start});
    };
    while (i + 2 < size) {
        if (data[i + 2] > 1) {
            i += 3;  // no start code can begin at i, i+1 or i+2
        } else if (data[i] == 0 && data[i + 1] == 0 && data[i + 2] == 1) {
            emit(i);
            i += 3;
            start = i;
        } else {
            ++i;
        }
    }
    emit(size);
    return true;
}

bool Mp4IsLengthPrefixed(const uint8_t* data, size_t size, size_t lengthSize) {
    if (size == 0 || lengthSize == 0 || lengthSize > 4) return false;
    size_t pos = 0;
    while (pos < size) {
        if (size - pos < lengthSize) return false;
        uint32_t length = 0;
        for (size_t k = 0; k < lengthSize; ++k) length = (length << 8) | data[pos + k];
        pos += lengthSize;
        // A NAL unit has at least its header, whose forbidden bit is 0.
        if (length == 0 || length > size - pos || (data[pos] & 0x80) != 0) return false;
        pos += length;
    }
    return true;
}

bool Mp4AppendLengthPrefixed(const std::vector<NalSpan>& nals, size_t lengthSize, std::vector<uint8_t>* out) {
    for (const NalSpan& nal : nals) {
        if (lengthSize < 4 && nal.size >= (size_t(1) << (8 * lengthSize))) return false;
        if (nal.size > UINT32_MAX) return false;
        for (size_t k = lengthSize; k > 0; --k) out->push_back(static_cast<uint8_t>(nal.size >> (8 * (k - 1))));
        out->insert(out->end(), nal.data, nal.data + nal.size);
    }
    return true;
}

RbspBitReader::RbspBitReader(const uint8_t* nal, size_t size, size_t skipBytes) {
    int zeros = 0;
    for (size_t i = skipBytes; i < size; ++i) {
        if (zeros >= 2 && nal[i] == 3) {
            zeros = 0;
            continue;
        }
        zeros = nal[i] == 0 ? zeros + 1 : 0;
        mRbsp.push_back(nal[i]);
    }
}

bool RbspBitReader::bits(int count, uint32_t* value) {
    if (count < 0 || count > 32 || mBitPos + size_t(count) > mRbsp.size() * 8) return false;
    uint32_t v = 0;
    for (int k = 0; k < count; ++k, ++mBitPos) {
        v = (v << 1) | ((mRbsp[mBitPos / 8] >> (7 - mBitPos % 8)) & 1);
    }
    *value = v;
    return true;
}

bool RbspBitReader::skipBits(int count) {
    if (count < 0 || mBitPos + size_t(count) > mRbsp.size() * 8) return false;
    mBitPos += size_t(count);
    return true;
}

bool RbspBitReader::ue(uint32_t* value) {
    int leadingZeros = 0;
    uint32_t bit = 0;
    while (true) {
        if (!bits(1, &bit)) return false;
        if (bit) break;
        if (++leadingZeros > 31) return false;
    }
    uint32_t suffix = 0;
    if (!bits(leadingZeros, &suffix)) return false;
    *value = static_cast<uint32_t>((uint64_t(1) << leadingZeros) - 1 + suffix);
    return true;
}

}  // namespace android
