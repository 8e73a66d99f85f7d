#ifndef A_BIT_READER_H_
#define A_BIT_READER_H_

#include <cstddef>
#include <cstdint>

#include <media/stagefright/foundation/ABase.h>

namespace android {

// Reads bits most significant first from bytes in memory. No read ever goes
// past the data:
// - getBits(n) with fewer than n bits left yields the bits that remain
//   followed by 0 bits for the missing part, and leaves the reader at the end
//   (overRead() then answers true). It never aborts.
// - getBitsGraceful() and getBitsWithFallback() report the shortage instead;
//   a short read also leaves the reader at the end, so every later read with
//   a fallback gives its fallback.
// - skipBits(n) past the end stops at the end and answers false.
// n above 32 is refused by the graceful forms and clamped to 32 by getBits.
class ABitReader {
public:
    ABitReader(const uint8_t* data, size_t size);
    virtual ~ABitReader();

    bool getBitsGraceful(size_t n, uint32_t* out);
    uint32_t getBitsWithFallback(size_t n, uint32_t fallback);
    uint32_t getBits(size_t n);
    bool skipBits(size_t n);

    virtual size_t numBitsLeft() const;
    virtual bool atLeastNumBitsLeft(size_t n) const;

    // The byte holding the next unread bit (the end of the data when none).
    const uint8_t* data() const;
    bool overRead() const { return mOverRead; }

protected:
    // Loads the next payload byte into mByte; false at the end of the data.
    virtual bool fillReservoir();

    const uint8_t* mData;
    size_t mSize;
    size_t mNext;        // index of the next byte not yet loaded
    size_t mByteIndex;   // index of the byte in mByte
    uint32_t mByte;
    size_t mBitsInByte;  // unread low bits of mByte
    bool mOverRead;

private:
    bool readBits(size_t n, uint32_t* out);

    DISALLOW_EVIL_CONSTRUCTORS(ABitReader);
};

// The same over a NAL unit payload: a 0x03 byte that follows two 0x00 bytes
// (emulation_prevention_three_byte, ITU-T H.264/H.265 clause 7.4.2) is left
// out of the bit stream.
class NALBitReader : public ABitReader {
public:
    NALBitReader(const uint8_t* data, size_t size);

    size_t numBitsLeft() const override;
    bool atLeastNumBitsLeft(size_t n) const override;

protected:
    bool fillReservoir() override;

private:
    // Counts payload bits from mNext on, stopping once `limit` is reached.
    size_t countPayloadBits(size_t limit) const;

    size_t mZeros;  // 0x00 bytes directly before mNext in the input

    DISALLOW_EVIL_CONSTRUCTORS(NALBitReader);
};

}  // namespace android

#endif
