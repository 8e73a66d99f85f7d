#ifndef MP4_NAL_UNITS_H_
#define MP4_NAL_UNITS_H_

#include <cstddef>
#include <cstdint>
#include <vector>

namespace android {

// One NAL unit inside a caller's buffer (no start code, no length).
struct NalSpan {
    const uint8_t* data;
    size_t size;
};

// The NAL units of an Annex-B byte stream (ISO/IEC 14496-10 Annex B). False
// when the data does not open with a start code.
bool Mp4SplitAnnexB(const uint8_t* data, size_t size, std::vector<NalSpan>* nals);

// Whether the bytes are exactly a run of NAL units each preceded by a
// big-endian length of `lengthSize` bytes (1, 2 or 4).
bool Mp4IsLengthPrefixed(const uint8_t* data, size_t size, size_t lengthSize);

// Whether a unit of `size` bytes can be stored behind a `lengthSize`-byte length.
bool Mp4FitsLength(size_t size, size_t lengthSize);

// Appends the units, each behind a `lengthSize`-byte length. False when a
// unit is too long for that length size.
bool Mp4AppendLengthPrefixed(const std::vector<NalSpan>& nals, size_t lengthSize, std::vector<uint8_t>* out);

}  // namespace android

#endif
