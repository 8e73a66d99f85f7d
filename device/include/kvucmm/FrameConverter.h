#ifndef KVUCMM_FRAME_CONVERTER_H
#define KVUCMM_FRAME_CONVERTER_H

#include <cstdint>

#include <media/stagefright/foundation/ColorUtils.h>

// The device's colour frame converter: YUV 4:2:0 pictures to RGB 5:6:5.
namespace KVUCMM {

// Colour-format codes. The first ones are the platform's; NV21 and YV12, which
// it lacks, carry their FourCC.
enum ColorFormat : int32_t {
    kColorFormatRGB565 = 6,                    // 16-bit little-endian, red in the top 5 bits
    kColorFormatYUV420Planar = 19,             // I420: Y, then U, then V
    kColorFormatYUV420PackedPlanar = 20,       // the same layout
    kColorFormatYUV420SemiPlanar = 21,         // NV12: Y, then interleaved U V
    kColorFormatYUV420PackedSemiPlanar = 39,   // the same layout
    kColorFormatNV21 = 0x3132564E,             // 'NV21': Y, then interleaved V U
    kColorFormatYV12 = 0x32315659,             // 'YV12': Y, then V, then U
};

// One picture. For a YUV source, `width` is the row stride of the Y plane in
// bytes and `height` the number of Y rows before the chroma (the slice height).
// Semi-planar chroma follows with the same stride and (height + 1) / 2 rows;
// planar chroma planes have stride (width + 1) / 2 and (height + 1) / 2 rows
// each. For the RGB destination, `width` x `height` are the picture's pixels,
// rows of width * 2 bytes. The crop rectangle (inclusive) is what is read from
// the source and what is written in the destination; a crop of another size
// than the source's is scaled to it.
struct FrameParam {
    const uint8_t* data;
    int32_t width;
    int32_t height;
    int32_t cropLeft;
    int32_t cropTop;
    int32_t cropRight;
    int32_t cropBottom;
    int32_t colorFormat;
    android::ColorAspects colorAspects;
    android::HDRStaticInfo hdrStaticInfo;
    int32_t reserved[4];  // zero
};

class FrameConverter {
public:
    // Answers of examine.
    enum {
        kBadDescription = -1,   // a picture description that is not self-consistent
        kUnsupportedPair = 0,   // no conversion between the two colour formats
        kReserved = 1,          // never answered
        kDirect = 2,            // same size: converted directly
        kScaled = 3,            // different sizes: scaled, then converted
    };
    // Answers of convert besides 0.
    enum {
        kConvertRefused = -22,
        kConvertNoMemory = -12,
    };

    FrameConverter();
    ~FrameConverter();

    // For a source with HDR static metadata: the destination becomes a full-range
    // BT.709 sRGB picture. The picture is converted without tone mapping.
    int getdstParam(FrameParam& src, FrameParam& dst);
    // Whether and how the pair converts. Any description whose crop lies outside
    // its picture, or whose sizes are not positive, is refused, so convert never
    // reads or writes outside the frames so described.
    int examine(FrameParam& src, FrameParam& dst);
    // 0 when the destination's crop holds the picture. The YUV matrix follows the
    // source's matrix coefficients (BT.601, BT.709 or BT.2020; when unspecified,
    // its primaries, else BT.601), its range full or else limited.
    int convert(FrameParam& src, FrameParam& dst);

private:
    FrameConverter(const FrameConverter&) = delete;
    FrameConverter& operator=(const FrameConverter&) = delete;
};

}  // namespace KVUCMM

#endif
