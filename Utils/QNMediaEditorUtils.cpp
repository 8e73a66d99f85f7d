#define LOG_TAG "QNMediaEditorUtils"
#include "QNMediaEditorUtils.h"

#include <cstring>
#include <new>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/Utils.h>
#include <media/stagefright/foundation/avc_utils.h>

#include "QNMediaEditorDefs.h"

namespace android {
namespace qnmediaeditor {

namespace {

// A growable codec-specific-data buffer with range (0, 0); null without memory.
sp<ABuffer> newCsdBuffer() {
    sp<ABuffer> buffer = new (std::nothrow) ABuffer(1024);
    if (buffer == nullptr || buffer->base() == nullptr) return nullptr;
    buffer->setRange(0, 0);
    return buffer;
}

void markCsd(const sp<ABuffer>& buffer) {
    buffer->meta()->setInt32("csd", 1);
    buffer->meta()->setInt64("timeUs", 0);
}

// count units of a 16-bit length each, appended behind start codes; *ptr and
// *size move past them.
status_t appendLengthPrefixedUnits(QNMediaEditorUtils* utils, size_t count, const uint8_t** ptr, size_t* size,
                                   sp<ABuffer>* out) {
    for (size_t i = 0; i < count; ++i) {
        if (*size < 2) {
            ALOGE("b/23680780");
            return ERROR_NOT_CONNECTED;
        }
        const size_t length = (size_t((*ptr)[0]) << 8) | (*ptr)[1];
        *ptr += 2;
        *size -= 2;
        if (*size < length) return ERROR_NOT_CONNECTED;
        const status_t err = utils->copyNALUToABuffer(out, *ptr, length);
        if (err != OK) return err;
        *ptr += length;
        *size -= length;
    }
    return OK;
}

}  // namespace

QNMediaEditorUtils::QNMediaEditorUtils() {}

QNMediaEditorUtils::~QNMediaEditorUtils() {}

status_t QNMediaEditorUtils::getNextNALUnit(const uint8_t** data, size_t* size, const uint8_t** unitStart,
                                            size_t* unitSize, bool endTerminatesUnit) {
    const uint8_t* const p = *data;
    const size_t n = *size;
    *unitStart = nullptr;
    *unitSize = 0;
    if (n == 0) {
        ALOGE("Next NAL Unit size is zero");
        return ERROR_NOT_CONNECTED;
    }
    size_t zeros = 0;
    while (zeros < n && p[zeros] == 0x00) ++zeros;
    if (zeros == n) {
        ALOGE("Next NAL Unit size and offset is same");
        return ERROR_NOT_CONNECTED;
    }
    if (zeros < 2 || p[zeros] != 0x01) return ERROR_MALFORMED;

    const size_t start = zeros + 1;
    // pos: the 0x01 of the next start code. Its two zeros cannot reach back
    // before start, since the byte before start is this start code's 0x01.
    size_t pos = start + findStartCodePrefix(p + start, n - start) + 2;
    if (pos >= n) {
        if (!endTerminatesUnit) {
            ALOGE("Next NAL Unit size is zero in while");
            return ERROR_NOT_CONNECTED;
        }
        pos = n + 2;
    }
    size_t end = pos - 2;
    while (end > start + 1 && p[end - 1] == 0x00) --end;
    *unitStart = p + start;
    *unitSize = end - start;
    if (pos + 2 < n) {
        *data = p + pos - 2;
        *size = n - pos + 2;
    } else {
        *data = nullptr;
        *size = 0;
    }
    return OK;
}

sp<ABuffer> QNMediaEditorUtils::FindNAL(const uint8_t* data, size_t size, unsigned type) {
    const uint8_t* unit;
    size_t unitSize;
    while (getNextNALUnit(&data, &size, &unit, &unitSize, true) == OK) {
        // An empty unit has no header byte to test.
        if (unitSize > 0 && (unit[0] & 0x1F) == type) {
            sp<ABuffer> buffer = new ABuffer(unitSize);
            if (buffer->base() == nullptr) return nullptr;  // no memory behind it
            memcpy(buffer->data(), unit, unitSize);
            return buffer;
        }
    }
    return nullptr;
}

status_t QNMediaEditorUtils::copyNALUToABuffer(sp<ABuffer>* buffer, const uint8_t* unit, size_t length) {
    if (buffer == nullptr) return ERROR_NOT_CONNECTED;
    const sp<ABuffer> old = *buffer;
    const size_t offset = old != nullptr ? old->offset() : 0;
    const size_t used = old != nullptr ? old->size() : 0;
    const size_t capacity = old != nullptr ? old->capacity() : 0;
    if (length > SIZE_MAX - used - 1028) return NO_MEMORY;
    if (used + 4 + length > capacity - offset) {
        sp<ABuffer> grown = new (std::nothrow) ABuffer(used + length + 1028);
        if (grown == nullptr || grown->base() == nullptr) return NO_MEMORY;
        if (used > 0) memcpy(grown->data(), old->data(), used);
        grown->setRange(0, used);
        *buffer = grown;
    }
    ABuffer* b = buffer->get();
    static const uint8_t kStartCode[4] = {0, 0, 0, 1};
    memcpy(b->data() + used, kStartCode, 4);
    if (length > 0) memcpy(b->data() + used + 4, unit, length);
    b->setRange(b->offset(), used + 4 + length);
    return OK;
}

status_t QNMediaEditorUtils::convertMetaDataToMessageAVCCSD(const sp<MetaData>& meta, sp<AMessage>* format) {
    if (format == nullptr) return ERROR_NOT_CONNECTED;
    sp<AMessage> msg = new AMessage;
    uint32_t type;
    const void* blob;
    size_t size;
    if (meta == nullptr || !meta->findData(kEditorKeyAVCC, &type, &blob, &size)) {
        *format = msg;
        return OK;
    }
    const uint8_t* ptr = static_cast<const uint8_t*>(blob);
    if (size < 7 || ptr[0] != 1) {
        ALOGE("b/23680780");
        return ERROR_NOT_CONNECTED;
    }

    const size_t spsCount = ptr[5] & 0x1F;
    ptr += 6;
    size -= 6;

    sp<ABuffer> sps = newCsdBuffer();
    if (sps == nullptr) return ERROR_NOT_CONNECTED;
    status_t err = appendLengthPrefixedUnits(this, spsCount, &ptr, &size, &sps);
    if (err != OK) return err;
    markCsd(sps);
    msg->setBuffer("csd-0", sps);

    sp<ABuffer> pps = newCsdBuffer();
    if (pps == nullptr) return ERROR_NOT_CONNECTED;
    if (size < 1) {
        ALOGE("b/23680780");
        return ERROR_NOT_CONNECTED;
    }
    const size_t ppsCount = *ptr++;
    size -= 1;
    err = appendLengthPrefixedUnits(this, ppsCount, &ptr, &size, &pps);
    if (err != OK) return err;
    markCsd(pps);
    msg->setBuffer("csd-1", pps);
    *format = msg;
    return OK;
}

bool QNMediaEditorUtils::IsAVCReferenceFrame(const sp<MediaCodecBuffer>& accessUnit) {
    const uint8_t* data = accessUnit != nullptr ? accessUnit->data() : nullptr;
    size_t size = accessUnit != nullptr ? accessUnit->size() : 0;
    if (data == nullptr) {
        ALOGE("IsAVCReferenceFrame: called on NULL data (%p, %zu)", accessUnit.get(), size);
        return false;
    }
    const uint8_t* unit;
    size_t unitSize;
    // Access units without any slice, or not in Annex-B, count as reference.
    while (getNextNALUnit(&data, &size, &unit, &unitSize, true) == OK) {
        if (unitSize == 0) {
            ALOGE("IsAVCReferenceFrame: invalid nalSize: 0 (%p, %zu)", accessUnit.get(), size);
            return false;
        }
        const unsigned type = unit[0] & 0x1F;
        if (type == 5) return true;
        if (type == 1) return (unit[0] & 0x60) != 0;
    }
    return true;
}

int QNMediaEditorUtils::bytesForSize(unsigned size) {
    if (size >= 0x200000) return 4;
    if (size >= 0x4000) return 3;
    if (size > 127) return 2;
    return 1;
}

// Sizes of 2^28 and above keep only their low 28 bits; callers stay below.
void QNMediaEditorUtils::storeSize(uint8_t* out, unsigned& offset, unsigned size) {
    const int n = bytesForSize(size);
    uint8_t* field = out + offset;
    offset += n;
    for (int i = n - 1; i >= 0; --i) {
        field[i] = static_cast<uint8_t>((size & 0x7F) | (i != n - 1 ? 0x80 : 0));
        size >>= 7;
    }
}

status_t QNMediaEditorUtils::ConvertMetaDataToMessage(const sp<MetaData>& meta, sp<AMessage>* format) {
    const status_t err = convertMetaDataToMessage(meta, format);
    if (err != OK) return err;
    if (format == nullptr || *format == nullptr) return OK;
    int32_t bits = 0;
    if ((*format)->findInt32("bit-per-sample", &bits) && bits != 0) (*format)->setInt32("bits-per-sample", bits);
    return OK;
}

}  // namespace qnmediaeditor
}  // namespace android
