#ifndef TESTS_UTILS_TEST_HELPERS_H
#define TESTS_UTILS_TEST_HELPERS_H

#include <cstdint>
#include <vector>

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>

using Bytes = std::vector<uint8_t>;

inline android::sp<android::ABuffer> bufferOf(const Bytes& bytes) {
    return android::ABuffer::CreateAsCopy(bytes.data(), bytes.size());
}

inline Bytes bytesOf(const android::sp<android::ABuffer>& b) {
    if (b == nullptr) return {};
    return Bytes(b->data(), b->data() + b->size());
}

inline Bytes blobOf(const android::MetaDataBase& meta, uint32_t key) {
    uint32_t type;
    const void* data;
    size_t size;
    if (!meta.findData(key, &type, &data, &size)) return {};
    const uint8_t* p = static_cast<const uint8_t*>(data);
    return Bytes(p, p + size);
}

// Writes H.264/H.265 syntax: fixed-width fields and Exp-Golomb codes, then
// the RBSP trailing bits and emulation prevention.
class BitWriter {
public:
    void bits(uint64_t value, int n) {
        for (int i = n - 1; i >= 0; --i) bit(i < 64 ? (value >> i) & 1 : 0);
    }
    void ue(uint32_t v) {
        const uint64_t code = uint64_t(v) + 1;
        int k = 0;
        while ((code >> (k + 1)) != 0) ++k;
        bits(0, k);
        bits(code, k + 1);
    }
    void se(int32_t v) { ue(v > 0 ? 2 * uint32_t(v) - 1 : 2 * uint32_t(-int64_t(v))); }
    // header: the NAL header bytes, kept outside emulation prevention.
    Bytes unit(const Bytes& header) {
        bit(1);
        while (mFill != 0) bit(0);
        Bytes out = header;
        int zeros = 0;
        for (uint8_t b : mBytes) {
            if (zeros >= 2 && b <= 3) {
                out.push_back(3);
                zeros = 0;
            }
            out.push_back(b);
            zeros = b == 0 ? zeros + 1 : 0;
        }
        return out;
    }

private:
    void bit(int b) {
        if (mFill == 0) mBytes.push_back(0);
        if (b) mBytes.back() |= uint8_t(0x80 >> mFill);
        mFill = (mFill + 1) % 8;
    }
    Bytes mBytes;
    int mFill = 0;
};

#endif
