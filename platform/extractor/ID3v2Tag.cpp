#include "extractor/ID3v2Tag.h"

#include <cstring>

namespace android {

namespace {
// Some tools write a tag twice; more than this is not a tagged stream.
constexpr int kMaxTags = 4;
constexpr off64_t kHeaderBytes = 10;
constexpr uint8_t kFooterFlag = 0x10;
}  // namespace

off64_t SkipID3v2Tags(const sp<DataSource>& source, off64_t offset) {
    for (int i = 0; i < kMaxTags; ++i) {
        // ID3v2.4 section 3.1: "ID3", version and revision below 0xFF, flags,
        // then a size of four 7-bit bytes that excludes the header (and the
        // footer, present when flagged).
        uint8_t h[kHeaderBytes];
        if (!source->readExactly(offset, h, sizeof(h)) || memcmp(h, "ID3", 3) != 0 || h[3] == 0xFF ||
            h[4] == 0xFF || ((h[6] | h[7] | h[8] | h[9]) & 0x80) != 0) {
            break;
        }
        const off64_t size = (off64_t(h[6]) << 21) | (off64_t(h[7]) << 14) | (off64_t(h[8]) << 7) | h[9];
        offset += kHeaderBytes + size + ((h[5] & kFooterFlag) ? kHeaderBytes : 0);
    }
    return offset;
}

}  // namespace android
