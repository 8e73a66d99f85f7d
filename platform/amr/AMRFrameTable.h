#ifndef AMR_FRAME_TABLE_H_
#define AMR_FRAME_TABLE_H_

#include <cstddef>

namespace android {

// Frame sizes of the AMR and AMR-WB storage format (RFC 4867, section 5.3).
// Each stored frame is a header byte (bit 7 and bits 1-0 padding, bits 6-3
// the frame type, bit 2 the quality flag) followed by the speech bits of
// that frame type, padded to whole bytes.
struct AMRFrameTable {
    // Speech bytes after the header byte, or -1 for a frame type that cannot
    // appear in a stored stream (reserved types and, for AMR, the SID frames
    // of other codecs).
    static int payloadBytes(bool wideband, unsigned frameType);
    static unsigned frameType(unsigned char headerByte) { return (headerByte >> 3) & 0x0F; }
};

}  // namespace android

#endif
