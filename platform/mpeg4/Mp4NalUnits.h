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

// Whether the bytes open with a 3- or 4-byte Annex-B start code.
bool Mp4StartsWithStartCode(const uint8_t* data, size_t size);

// Splits an Annex-B byte stream (ISO/IEC 14496-10 Annex B) into its NAL
// units, dropping start codes and trailing zero bytes. False when the data
// does not open with a start code. Empty units are skipped.
bool Mp4SplitAnnexB(const uint8_t* data, size_t size, std::vector<NalSpan>* nals);

// Whether the bytes are exactly a run of NAL units each preceded by a
// big-endian length of `lengthSize` bytes (1, 2 or 4).
bool Mp4IsLengthPrefixed(const uint8_t* data, size_t size, size_t lengthSize);

// Appends the units, each behind a `lengthSize`-byte length. False when a
// unit is too long for that length size.
bool Mp4AppendLengthPrefixed(const std::vector<NalSpan>& nals, size_t lengthSize, std::vector<uint8_t>* out);

// Reads the bits of a NAL unit's payload with the emulation prevention
// bytes (00 00 03) removed. Every read past the end fails.
class RbspBitReader {
public:
    // `skipBytes`: bytes of the unit to skip first (its header).
    RbspBitReader(const uint8_t* nal, size_t size, size_t skipBytes);
    bool bits(int count, uint32_t* value);
    bool skipBits(int count);
    bool ue(uint32_t* value);  // unsigned Exp-Golomb

private:
    std::vector<uint8_t> mRbsp;
    size_t mBitPos = 0;
};

}  // namespace android

#endif
