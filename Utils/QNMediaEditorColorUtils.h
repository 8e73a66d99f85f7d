#ifndef QN_MEDIA_EDITOR_COLOR_UTILS_H
#define QN_MEDIA_EDITOR_COLOR_UTILS_H

#include <cstdint>

#include <media/stagefright/foundation/AMessage.h>
#include <media/stagefright/foundation/ColorUtils.h>
#include <utils/Errors.h>
#include <utils/RefBase.h>

namespace android {
namespace qnmediaeditor {

// Turns decoded frames into RGB 5:6:5 pictures of the decoder output's crop
// size, through the device's colour frame converter. One thread at a time.
class QNMediaEditorColorUtils : public RefBase {
public:
    QNMediaEditorColorUtils();
    virtual ~QNMediaEditorColorUtils();

    // The format must carry "width", "height", "stride", "slice-height" and
    // "color-format"; a missing one stops the process.
    void setOutputFormat(sp<AMessage> format);
    // The layout from the caller; only the colour keys and "color-format" (required) from the format.
    void setOutputFormat(sp<AMessage> format, int stride, int sliceHeight, int cropLeft, int cropTop, int cropRight,
                         int cropBottom, int cropWidth, int cropHeight);
    // `dst` receives cropWidth x cropHeight pixels of 2 bytes.
    status_t convert(const uint8_t* src, const uint8_t* dst);

private:
    void setColorAspects();

    bool mConfigured;
    int32_t mStride;
    int32_t mSlice_height;
    int32_t mCropLeft;
    int32_t mCropTop;
    int32_t mCropRight;
    int32_t mCropBottom;
    int32_t mSrcFormat;
    int32_t mCropWidth;
    int32_t mCropHeight;
    ColorAspects mSrcColorAspects;
    ColorAspects mDstColorAspects;
    sp<AMessage> mOutputFormat;

    QNMediaEditorColorUtils(const QNMediaEditorColorUtils&) = delete;
    QNMediaEditorColorUtils& operator=(const QNMediaEditorColorUtils&) = delete;
};

}  // namespace qnmediaeditor
}  // namespace android

#endif
