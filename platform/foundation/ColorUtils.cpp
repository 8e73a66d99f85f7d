#include <media/stagefright/foundation/ColorUtils.h>

#include <media/stagefright/foundation/ABuffer.h>

namespace android {

namespace {

constexpr size_t kHdrStaticInfoSize = 25;

bool rangeOf(int32_t code, ColorAspects::Range* r) {
    switch (code) {
        case ColorUtils::kColorRangeUnspecified: *r = ColorAspects::RangeUnspecified; return true;
        case ColorUtils::kColorRangeFull: *r = ColorAspects::RangeFull; return true;
        case ColorUtils::kColorRangeLimited: *r = ColorAspects::RangeLimited; return true;
        default: *r = ColorAspects::RangeUnspecified; return false;
    }
}

bool standardOf(int32_t code, ColorAspects::Primaries* p, ColorAspects::MatrixCoeffs* m) {
    using A = ColorAspects;
    switch (code) {
        case ColorUtils::kColorStandardUnspecified: *p = A::PrimariesUnspecified; *m = A::MatrixUnspecified; return true;
        case ColorUtils::kColorStandardBT709: *p = A::PrimariesBT709_5; *m = A::MatrixBT709_5; return true;
        case ColorUtils::kColorStandardBT601_625: *p = A::PrimariesBT601_6_625; *m = A::MatrixBT601_6; return true;
        // Unadjusted: 601 primaries with the 709 matrix.
        case ColorUtils::kColorStandardBT601_625_Unadjusted: *p = A::PrimariesBT601_6_625; *m = A::MatrixBT709_5; return true;
        case ColorUtils::kColorStandardBT601_525: *p = A::PrimariesBT601_6_525; *m = A::MatrixBT601_6; return true;
        case ColorUtils::kColorStandardBT601_525_Unadjusted: *p = A::PrimariesBT601_6_525; *m = A::MatrixSMPTE240M; return true;
        case ColorUtils::kColorStandardBT2020: *p = A::PrimariesBT2020; *m = A::MatrixBT2020; return true;
        case ColorUtils::kColorStandardBT2020Constant: *p = A::PrimariesBT2020; *m = A::MatrixBT2020Constant; return true;
        case ColorUtils::kColorStandardBT470M: *p = A::PrimariesBT470_6M; *m = A::MatrixBT470_6M; return true;
        case ColorUtils::kColorStandardFilm: *p = A::PrimariesGenericFilm; *m = A::MatrixBT2020; return true;
        default: *p = A::PrimariesUnspecified; *m = A::MatrixUnspecified; return false;
    }
}

bool transferOf(int32_t code, ColorAspects::Transfer* t) {
    if (code < ColorUtils::kColorTransferUnspecified || code > ColorUtils::kColorTransferHLG) {
        *t = ColorAspects::TransferUnspecified;
        return false;
    }
    // The platform's transfer codes and the codec's coincide.
    *t = static_cast<ColorAspects::Transfer>(code);
    return true;
}

}  // namespace

status_t ColorUtils::convertPlatformColorAspectsToCodecAspects(int32_t range, int32_t standard, int32_t transfer,
                                                               ColorAspects& aspects) {
    const bool okRange = rangeOf(range, &aspects.mRange);
    const bool okStandard = standardOf(standard, &aspects.mPrimaries, &aspects.mMatrixCoeffs);
    const bool okTransfer = transferOf(transfer, &aspects.mTransfer);
    return okRange && okStandard && okTransfer ? OK : BAD_VALUE;
}

bool ColorUtils::getHDRStaticInfoFromFormat(const sp<AMessage>& format, HDRStaticInfo* info) {
    sp<ABuffer> buf;
    if (format == nullptr || info == nullptr || !format->findBuffer("hdr-static-info", &buf) || buf == nullptr ||
        buf->size() != kHdrStaticInfoSize || buf->data()[0] != HDRStaticInfo::kType1) {
        return false;
    }
    const uint8_t* p = buf->data() + 1;
    uint16_t v[12];
    for (int i = 0; i < 12; ++i) v[i] = static_cast<uint16_t>(p[2 * i] | (p[2 * i + 1] << 8));
    info->mID = HDRStaticInfo::kType1;
    info->sType1 = {{v[0], v[1]}, {v[2], v[3]}, {v[4], v[5]}, {v[6], v[7]}, v[8], v[9], v[10], v[11]};
    return true;
}

void ColorUtils::setHDRStaticInfoIntoFormat(const HDRStaticInfo& info, sp<AMessage>& format) {
    const HDRStaticInfo::Type1& t = info.sType1;
    const uint16_t v[12] = {t.mR.x, t.mR.y, t.mG.x, t.mG.y, t.mB.x, t.mB.y, t.mW.x, t.mW.y,
                            t.mMaxDisplayLuminance, t.mMinDisplayLuminance, t.mMaxContentLightLevel,
                            t.mMaxFrameAverageLightLevel};
    sp<ABuffer> buf = new ABuffer(kHdrStaticInfoSize);
    uint8_t* p = buf->data();
    p[0] = info.mID;
    for (int i = 0; i < 12; ++i) {
        p[1 + 2 * i] = v[i] & 0xFF;
        p[2 + 2 * i] = v[i] >> 8;
    }
    format->setBuffer("hdr-static-info", buf);
}

}  // namespace android
