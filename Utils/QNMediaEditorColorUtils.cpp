#define LOG_TAG "QNMediaEditorColorUtils"

#include "QNMediaEditorColorUtils.h"

#include <cstring>

#include <kvucmm/FrameConverter.h>
#include <log/log.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/ADebug.h>

// The assertion messages name this file as the device's build knows it.
#define COLOR_UTILS_PATH "frameworks/av/services/mediaeditorservice/Utils/QNMediaEditorColorUtils"

namespace android {
namespace qnmediaeditor {

namespace {

constexpr int32_t kDefaultRange = ColorUtils::kColorRangeLimited;
constexpr int32_t kDefaultStandard = ColorUtils::kColorStandardBT601_625;
constexpr int32_t kDefaultTransfer = ColorUtils::kColorTransferSMPTE_170M;

// right + 1 - left, or 0 when that does not fit (a description examine refuses).
int32_t spanOf(int32_t left, int32_t right) {
    const int64_t span = static_cast<int64_t>(right) + 1 - left;
    return (span > INT32_MAX || span < INT32_MIN) ? 0 : static_cast<int32_t>(span);
}

// size - 1, the last inclusive coordinate.
int32_t lastOf(int32_t size) { return size == INT32_MIN ? INT32_MIN : size - 1; }

}  // namespace

QNMediaEditorColorUtils::QNMediaEditorColorUtils()
    : mConfigured(false),
      mStride(0),
      mSlice_height(0),
      mCropLeft(0),
      mCropTop(0),
      mCropRight(0),
      mCropBottom(0),
      mSrcFormat(0),
      mCropWidth(0),
      mCropHeight(0),
      mSrcColorAspects{},
      mDstColorAspects{},
      mOutputFormat(nullptr) {}

QNMediaEditorColorUtils::~QNMediaEditorColorUtils() { mOutputFormat.clear(); }

void QNMediaEditorColorUtils::setColorAspects() {
    int32_t range = kDefaultRange, standard = kDefaultStandard, transfer = kDefaultTransfer;
    if (mOutputFormat != nullptr) {
        mOutputFormat->findInt32("color-range", &range);
        mOutputFormat->findInt32("color-standard", &standard);
        mOutputFormat->findInt32("color-transfer", &transfer);
    }
    ColorUtils::convertPlatformColorAspectsToCodecAspects(range, standard, transfer, mSrcColorAspects);
    ColorUtils::convertPlatformColorAspectsToCodecAspects(ColorUtils::kColorRangeFull, ColorUtils::kColorStandardBT709,
                                                          ColorUtils::kColorTransferSRGB, mDstColorAspects);
}

void QNMediaEditorColorUtils::setOutputFormat(sp<AMessage> format) {
    mOutputFormat = format;
    CHECK(mOutputFormat != nullptr);
    setColorAspects();
    int32_t width = 0, height = 0;
    CHECK_AT(COLOR_UTILS_PATH, 81, mOutputFormat->findInt32("width", &width));
    CHECK_AT(COLOR_UTILS_PATH, 82, mOutputFormat->findInt32("height", &height));
    CHECK_AT(COLOR_UTILS_PATH, 83, mOutputFormat->findInt32("stride", &mStride));
    CHECK_AT(COLOR_UTILS_PATH, 84, mOutputFormat->findInt32("slice-height", &mSlice_height));
    if (!mOutputFormat->findRect("crop", &mCropLeft, &mCropTop, &mCropRight, &mCropBottom)) {
        mCropLeft = 0;
        mCropTop = 0;
        mCropRight = lastOf(width);
        mCropBottom = lastOf(height);
    }
    CHECK_AT(COLOR_UTILS_PATH, 92, mOutputFormat->findInt32("color-format", &mSrcFormat));
    mConfigured = true;
    mCropWidth = spanOf(mCropLeft, mCropRight);
    mCropHeight = spanOf(mCropTop, mCropBottom);
}

void QNMediaEditorColorUtils::setOutputFormat(sp<AMessage> format, int stride, int sliceHeight, int cropLeft,
                                              int cropTop, int cropRight, int cropBottom, int cropWidth,
                                              int cropHeight) {
    mOutputFormat = format;
    CHECK(mOutputFormat != nullptr);
    setColorAspects();
    mStride = stride;
    mSlice_height = sliceHeight;
    mCropLeft = cropLeft;
    mCropTop = cropTop;
    mCropRight = cropRight;
    mCropBottom = cropBottom;
    CHECK_AT(COLOR_UTILS_PATH, 132, mOutputFormat->findInt32("color-format", &mSrcFormat));
    mCropWidth = cropWidth;
    mCropHeight = cropHeight;
    mConfigured = true;
}

status_t QNMediaEditorColorUtils::convert(const uint8_t* src, const uint8_t* dst) {
    if (!mConfigured) {
        ALOGD("invalid");
        return ERROR_UNSUPPORTED;
    }
    KVUCMM::FrameParam source;
    KVUCMM::FrameParam destination;
    memset(&source, 0, sizeof(source));
    memset(&destination, 0, sizeof(destination));
    source.data = src;
    source.width = mStride;
    source.height = mSlice_height;
    source.cropLeft = mCropLeft;
    source.cropTop = mCropTop;
    source.cropRight = mCropRight;
    source.cropBottom = mCropBottom;
    source.colorFormat = mSrcFormat;
    source.colorAspects = mSrcColorAspects;
    destination.data = dst;
    destination.width = mCropWidth;
    destination.height = mCropHeight;
    destination.cropRight = lastOf(mCropWidth);
    destination.cropBottom = lastOf(mCropHeight);
    destination.colorFormat = KVUCMM::kColorFormatRGB565;
    destination.colorAspects = mDstColorAspects;

    KVUCMM::FrameConverter converter;
    if (ColorUtils::getHDRStaticInfoFromFormat(mOutputFormat, &source.hdrStaticInfo)) {
        converter.getdstParam(source, destination);
    }
    const int verdict = converter.examine(source, destination);
    if (verdict == -1 || verdict == 0 || verdict == 1) return ERROR_UNSUPPORTED;
    const int status = converter.convert(source, destination);
    if (status != 0) {
        ALOGE("QNCMMFrameConverter:Unable to convert from format 0x%08x to RGB565", mSrcFormat);
        return status;
    }
    return OK;
}

}  // namespace qnmediaeditor
}  // namespace android
