#ifndef PLATFORM_CODEC_PICTURE_CONVERT_H_
#define PLATFORM_CODEC_PICTURE_CONVERT_H_

#include <cstdint>

namespace android {

// A decoded picture's planes as a codec hands them over: Y, Cb, Cr, each with
// its own row pitch. Chroma is subsampled by 2 or not in each direction.
struct PlanarPicture {
    const uint8_t* planes[3] = {nullptr, nullptr, nullptr};  // no chroma: monochrome
    int pitch[3] = {0, 0, 0};                                 // bytes per row
    int width = 0, height = 0;                                // luma samples
    int bitDepth = 8;          // 8..16; above 8 each sample is a little-endian 16-bit word
    int chromaShiftX = 1, chromaShiftY = 1;  // 0 or 1
};

// The even size an 8-bit 4:2:0 copy of the picture takes (the odd last
// column or row is repeated).
inline int EvenSize(int n) { return n + (n & 1); }

// Writes the picture as 8-bit I420 of EvenSize(width) x EvenSize(height):
// the luma plane, then Cb and Cr at half size each, rows packed. Deeper
// samples are rounded to 8 bits; 4:2:2 and 4:4:4 chroma is averaged down.
void ToI420(const PlanarPicture& in, uint8_t* out);

}  // namespace android

#endif
