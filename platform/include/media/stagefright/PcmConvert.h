#ifndef PCM_CONVERT_H_
#define PCM_CONVERT_H_

#include <cstddef>
#include <cstdint>
#include <vector>

namespace android {

// Sample layouts of decoders and PCM files (24-bit: packed little-endian).
enum class PcmSampleType { kU8, kS16, kS24, kS32, kFloat, kDouble };

// Appends `frames` frames of `channels` channels to *out as interleaved
// 16-bit. `planes` holds one pointer per channel when planar, else one.
// Float is scaled by 32768, rounded to nearest and clipped, as the reference
// decodes it.
void AppendPcm16(PcmSampleType type, bool planar, const uint8_t* const* planes, size_t frames,
                 size_t channels, std::vector<int16_t>* out);

}  // namespace android

#endif
