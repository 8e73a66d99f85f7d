#ifndef MPEG4_BOX_H_
#define MPEG4_BOX_H_

#include <cstdint>

#include <media/stagefright/DataSource.h>
#include <media/stagefright/foundation/ByteReader.h>
#include <utils/Errors.h>

namespace android {
namespace mpeg4 {

constexpr uint32_t FourCC(char a, char b, char c, char d) {
    return (uint32_t(uint8_t(a)) << 24) | (uint32_t(uint8_t(b)) << 16) | (uint32_t(uint8_t(c)) << 8) |
           uint32_t(uint8_t(d));
}

struct BoxHeader {
    uint32_t type = 0;
    uint64_t size = 0;        // the whole box, header included
    uint32_t headerSize = 0;  // 8, 16 with a 64-bit size, +16 for 'uuid'
    uint8_t userType[16] = {};

    uint64_t payloadSize() const { return size - headerSize; }
};

// Walks the child boxes inside one container's payload. A child that does not
// fit in what is left of its parent ends the walk as malformed; fewer than 8
// trailing bytes (some writers end user data with a 32-bit zero) end it
// cleanly.
class BoxIterator {
public:
    explicit BoxIterator(const ByteReader& parent) : mParent(parent) {}

    bool next();
    bool malformed() const { return mMalformed; }
    const BoxHeader& header() const { return mHeader; }
    const ByteReader& payload() const { return mPayload; }

private:
    ByteReader mParent;
    ByteReader mPayload{nullptr, 0};
    BoxHeader mHeader;
    bool mMalformed = false;
};

// Finds the first child of `type`; false when there is none or the container
// is malformed before it.
bool FindChild(const ByteReader& parent, uint32_t type, ByteReader* payload);

// Version and flags of a full box (ISO/IEC 14496-12, 4.2).
bool ReadFullBoxHeader(ByteReader* r, uint8_t* version, uint32_t* flags);

// A box header at `offset` of the file. A size of 0 runs to the end of the
// file. The box may reach past the end (a truncated file): callers decide.
status_t ReadTopLevelBoxHeader(const sp<DataSource>& source, off64_t offset, off64_t fileSize,
                               BoxHeader* header);

}  // namespace mpeg4
}  // namespace android

#endif
