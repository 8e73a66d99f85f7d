#include "mpeg4/NalLengthConverter.h"

#include <cstring>

namespace android {
namespace mpeg4 {

namespace {
size_t ReadLength(const uint8_t* p, size_t lengthSize) {
    size_t n = 0;
    for (size_t i = 0; i < lengthSize; ++i) n = (n << 8) | p[i];
    return n;
}
}  // namespace

bool AnnexBSize(const uint8_t* data, size_t size, size_t lengthSize, size_t* outSize) {
    if (lengthSize < 1 || lengthSize > 4) return false;
    size_t pos = 0, out = 0;
    while (pos < size) {
        if (size - pos < lengthSize) return false;
        const size_t n = ReadLength(data + pos, lengthSize);
        pos += lengthSize;
        if (n > size - pos) return false;
        pos += n;
        out += 4 + n;
    }
    *outSize = out;
    return true;
}

void ToAnnexB(const uint8_t* data, size_t size, size_t lengthSize, uint8_t* out) {
    static const uint8_t kStartCode[4] = {0, 0, 0, 1};
    size_t pos = 0;
    while (pos < size) {
        const size_t n = ReadLength(data + pos, lengthSize);
        pos += lengthSize;
        memcpy(out, kStartCode, 4);
        if (out + 4 != data + pos) memmove(out + 4, data + pos, n);
        out += 4 + n;
        pos += n;
    }
}

}  // namespace mpeg4
}  // namespace android
