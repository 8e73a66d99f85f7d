#ifndef PLATFORM_AMR_AMR_FRAMES_H_
#define PLATFORM_AMR_AMR_FRAMES_H_

#include <cstddef>
#include <cstdint>

namespace android {

// Storage-format frames (RFC 4867 section 5.3): a header byte with the frame
// type in bits 6..3, then the speech bits padded to whole bytes.
constexpr size_t kAMRMaxFrameSize = 61;       // AMR-WB 23.85 kbit/s
constexpr int64_t kAMRFrameDurationUs = 20000;

// Bytes of the frame that starts with `header`, the header included; 0 for a
// frame type that the codec does not define.
size_t AMRFrameSize(bool isWide, uint8_t header);

// Length of the file magic ("#!AMR\n" or "#!AMR-WB\n") at the start of
// `data`, and which one it is; 0 when neither is there.
size_t AMRMagicLength(const uint8_t* data, size_t size, bool* isWide);

}  // namespace android

#endif
