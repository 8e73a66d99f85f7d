#define LOG_TAG "Mp4NalUnits"
#include "mpeg4/Mp4NalUnits.h"

#include <media/stagefright/foundation/avc_utils.h>

#include "media/CodecSpecificData.h"

namespace android {

bool Mp4SplitAnnexB(const uint8_t* data, size_t size, std::vector<NalSpan>* nals) {
    nals->clear();
    if (!isAnnexB(data, size)) return false;
    const uint8_t* unit = nullptr;
    size_t unitSize = 0;
    while (nextAnnexBUnit(&data, &size, &unit, &unitSize)) nals->push_back({unit, unitSize});
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

bool Mp4FitsLength(size_t size, size_t lengthSize) {
    return size <= UINT32_MAX && (lengthSize >= 4 || size < (size_t(1) << (8 * lengthSize)));
}

bool Mp4AppendLengthPrefixed(const std::vector<NalSpan>& nals, size_t lengthSize, std::vector<uint8_t>* out) {
    for (const NalSpan& nal : nals) {
        if (!Mp4FitsLength(nal.size, lengthSize)) return false;
        for (size_t k = lengthSize; k > 0; --k) out->push_back(static_cast<uint8_t>(nal.size >> (8 * (k - 1))));
        out->insert(out->end(), nal.data, nal.data + nal.size);
    }
    return true;
}

}  // namespace android
