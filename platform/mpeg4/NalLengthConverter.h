#ifndef NAL_LENGTH_CONVERTER_H_
#define NAL_LENGTH_CONVERTER_H_

#include <cstddef>
#include <cstdint>

namespace android {
namespace mpeg4 {

// AVC and HEVC samples in MP4 prefix each NAL unit with its length in
// `lengthSize` (1 to 4) big-endian bytes (ISO/IEC 14496-15); decoders here
// take Annex-B, where each unit starts with 00 00 00 01.

// Size once every prefix is a 4-byte start code; false when a length runs
// past the end of the sample.
bool AnnexBSize(const uint8_t* data, size_t size, size_t lengthSize, size_t* outSize);

// Writes the Annex-B form to `out`, which may be `data` itself when
// `lengthSize` is 4. Only for samples AnnexBSize accepted.
void ToAnnexB(const uint8_t* data, size_t size, size_t lengthSize, uint8_t* out);

}  // namespace mpeg4
}  // namespace android

#endif
