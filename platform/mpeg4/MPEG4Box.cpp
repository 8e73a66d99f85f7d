#define LOG_TAG "MPEG4Box"
#include "mpeg4/MPEG4Box.h"

#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {
namespace mpeg4 {

namespace {

// Parses a header at the start of `r`; `available` is how many bytes the box
// may span (size 0 takes all of them). Leaves `r` after the header.
bool ParseHeader(ByteReader* r, uint64_t available, BoxHeader* h) {
    uint32_t size32;
    if (!r->be32(&size32) || !r->be32(&h->type)) return false;
    h->headerSize = 8;
    if (size32 == 1) {
        if (!r->be64(&h->size)) return false;
        h->headerSize = 16;
    } else if (size32 == 0) {
        h->size = available;
    } else {
        h->size = size32;
    }
    if (h->type == FourCC('u', 'u', 'i', 'd')) {
        if (!r->read(h->userType, sizeof(h->userType))) return false;
        h->headerSize += 16;
    }
    return h->size >= h->headerSize;
}

}  // namespace

bool BoxIterator::next() {
    if (mMalformed || mParent.remaining() < 8) return false;
    ByteReader r = mParent;
    if (!ParseHeader(&r, mParent.remaining(), &mHeader) || mHeader.size > mParent.remaining()) {
        ALOGW("box '%c%c%c%c' does not fit in its parent", char(mHeader.type >> 24),
              char(mHeader.type >> 16), char(mHeader.type >> 8), char(mHeader.type));
        mMalformed = true;
        return false;
    }
    mParent.skip(mHeader.headerSize);
    mParent.sub(mHeader.payloadSize(), &mPayload);
    return true;
}

bool FindChild(const ByteReader& parent, uint32_t type, ByteReader* payload) {
    BoxIterator it(parent);
    while (it.next()) {
        if (it.header().type == type) {
            *payload = it.payload();
            return true;
        }
    }
    return false;
}

bool ReadFullBoxHeader(ByteReader* r, uint8_t* version, uint32_t* flags) {
    uint32_t word;
    if (!r->be32(&word)) return false;
    *version = uint8_t(word >> 24);
    *flags = word & 0xFFFFFF;
    return true;
}

status_t ReadTopLevelBoxHeader(const sp<DataSource>& source, off64_t offset, off64_t fileSize,
                               BoxHeader* header) {
    if (offset < 0 || offset >= fileSize) return ERROR_END_OF_STREAM;
    uint8_t bytes[32];
    const ssize_t n = source->readAt(offset, bytes, sizeof(bytes));
    if (n < 0) return static_cast<status_t>(n);
    ByteReader r(bytes, static_cast<size_t>(n));
    if (!ParseHeader(&r, static_cast<uint64_t>(fileSize - offset), header)) return ERROR_MALFORMED;
    return OK;
}

}  // namespace mpeg4
}  // namespace android
