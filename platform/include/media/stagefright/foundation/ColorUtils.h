#ifndef COLOR_UTILS_H_
#define COLOR_UTILS_H_

#include <cstdint>

#include <media/stagefright/foundation/AMessage.h>
#include <utils/Errors.h>

namespace android {

// Colour description of a picture as codecs carry it (ISO/IEC 23091-2 terms).
struct ColorAspects {
    enum Range : uint32_t {
        RangeUnspecified = 0,
        RangeFull = 1,
        RangeLimited = 2,
        RangeOther = 0xff,
    };
    enum Primaries : uint32_t {
        PrimariesUnspecified = 0,
        PrimariesBT709_5 = 1,
        PrimariesBT470_6M = 2,
        PrimariesBT601_6_625 = 3,
        PrimariesBT601_6_525 = 4,
        PrimariesGenericFilm = 5,
        PrimariesBT2020 = 6,
        PrimariesOther = 0xff,
    };
    enum Transfer : uint32_t {
        TransferUnspecified = 0,
        TransferLinear = 1,
        TransferSRGB = 2,
        TransferSMPTE170M = 3,
        TransferGamma22 = 4,
        TransferGamma28 = 5,
        TransferST2084 = 6,
        TransferHLG = 7,
        TransferOther = 0xff,
    };
    enum MatrixCoeffs : uint32_t {
        MatrixUnspecified = 0,
        MatrixBT709_5 = 1,
        MatrixBT470_6M = 2,
        MatrixBT601_6 = 3,
        MatrixSMPTE240M = 4,
        MatrixBT2020 = 5,
        MatrixBT2020Constant = 6,
        MatrixOther = 0xff,
    };

    Range mRange;
    Primaries mPrimaries;
    Transfer mTransfer;
    MatrixCoeffs mMatrixCoeffs;
};

// Static metadata of an HDR picture (CTA-861.3 type 1). Chromaticities in
// units of 0.00002, luminances in cd/m2 (the minimum in 0.0001 cd/m2).
struct HDRStaticInfo {
    enum ID : uint8_t {
        kType1 = 0,
    };
    struct Primaries1 {
        uint16_t x;
        uint16_t y;
    };
    struct Type1 {
        Primaries1 mR;
        Primaries1 mG;
        Primaries1 mB;
        Primaries1 mW;
        uint16_t mMaxDisplayLuminance;
        uint16_t mMinDisplayLuminance;
        uint16_t mMaxContentLightLevel;
        uint16_t mMaxFrameAverageLightLevel;
    };

    ID mID;
    Type1 sType1;
};

struct ColorUtils {
    // The platform's colour codes, as they travel in formats ("color-range",
    // "color-standard", "color-transfer").
    enum ColorRange : int32_t {
        kColorRangeUnspecified = 0,
        kColorRangeFull = 1,
        kColorRangeLimited = 2,
    };
    enum ColorStandard : int32_t {
        kColorStandardUnspecified = 0,
        kColorStandardBT709 = 1,
        kColorStandardBT601_625 = 2,
        kColorStandardBT601_625_Unadjusted = 3,
        kColorStandardBT601_525 = 4,
        kColorStandardBT601_525_Unadjusted = 5,
        kColorStandardBT2020 = 6,
        kColorStandardBT2020Constant = 7,
        kColorStandardBT470M = 8,
        kColorStandardFilm = 9,
    };
    enum ColorTransfer : int32_t {
        kColorTransferUnspecified = 0,
        kColorTransferLinear = 1,
        kColorTransferSRGB = 2,
        kColorTransferSMPTE_170M = 3,
        kColorTransferGamma22 = 4,
        kColorTransferGamma28 = 5,
        kColorTransferST2084 = 6,
        kColorTransferHLG = 7,
    };

    // Fills `aspects` from platform codes. A code it does not know becomes the
    // Unspecified value of its field, and the answer is BAD_VALUE.
    static status_t convertPlatformColorAspectsToCodecAspects(int32_t range, int32_t standard, int32_t transfer,
                                                              ColorAspects& aspects);

    // "hdr-static-info": a buffer of 25 bytes, the ID (0) and then twelve
    // little-endian 16-bit values: R, G, B and white point x/y, maximum and
    // minimum display luminance, maximum content and frame-average light level.
    static bool getHDRStaticInfoFromFormat(const sp<AMessage>& format, HDRStaticInfo* info);
    static void setHDRStaticInfoIntoFormat(const HDRStaticInfo& info, sp<AMessage>& format);
};

}  // namespace android

#endif
