// HEVC sequence parameter set position and picture size (ITU-T H.265 7.3.2.2).
#define LOG_TAG "QNMediaEditorUtils"
#include "QNMediaEditorUtils.h"

#include <sys/types.h>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/avc_utils.h>

namespace android {
namespace qnmediaeditor {

namespace {

bool isSps(uint8_t header) { return (header & 0x7E) == 0x42; }

bool isFourByteStartCode(const uint8_t* p) { return p[0] == 0 && p[1] == 0 && p[2] == 0 && p[3] == 1; }

}  // namespace

status_t QNMediaEditorUtils::getHEVCSPSPosition(const sp<ABuffer>& csd0, size_t* offset, size_t* length) {
    const size_t n = csd0 != nullptr ? csd0->size() : 0;
    if (n < 4) {
        ALOGE("csd0 too small");
        return ERROR_MALFORMED;
    }
    const uint8_t* p = csd0->data();
    if (!isFourByteStartCode(p)) {
        ALOGE("csd0 doesn't start with a start code");
        return ERROR_MALFORMED;
    }
    // Only 00 00 00 01 separates units here; one ending on the last byte of
    // the data is not looked for.
    size_t prev = 4;
    for (size_t i = 1; i + 5 <= n; ++i) {
        if (!isFourByteStartCode(p + i)) continue;
        const ssize_t len = static_cast<ssize_t>(i) - static_cast<ssize_t>(prev);
        if (len < 1) return ERROR_MALFORMED;
        if (isSps(p[prev])) {
            *offset = prev;
            *length = static_cast<size_t>(len);
            return OK;
        }
        prev = i + 4;
    }
    if (n <= prev || !isSps(p[prev])) return ERROR_MALFORMED;
    *offset = prev;
    *length = n - prev;
    return OK;
}

status_t QNMediaEditorUtils::FindHEVCDimensions(const sp<ABuffer>& csd0, int* width, int* height, int* cropWidth,
                                                int* cropHeight) {
    size_t offset = 0, length = 0;
    const status_t err = getHEVCSPSPosition(csd0, &offset, &length);
    if (err != OK) {
        ALOGE("FindHEVCDimensions error %d", err);
        return err;
    }
    if (length < 2) {
        ALOGE("FindHEVCDimensions size %u, error", static_cast<unsigned>(length));
        return ERROR_MALFORMED;
    }
    HEVCSPSInfo sps;
    parseHEVCSPS(csd0->data() + offset + 2, length - 2, &sps);
    const uint32_t chroma = sps.chromaFormatIdc & 0xFF;
    uint32_t w = sps.width, h = sps.height, cropW = w, cropH = h;
    if (sps.conformanceWindow) {
        const uint32_t subWidthC = (chroma == 1 || chroma == 2) ? 2 : 1;
        const uint32_t subHeightC = chroma == 1 ? 2 : 1;
        cropW -= subWidthC * (sps.confLeft + sps.confRight);
        cropH -= subHeightC * (sps.confTop + sps.confBottom);
    }
    if (width != nullptr) *width = static_cast<int>(w);
    if (height != nullptr) *height = static_cast<int>(h);
    if (cropWidth != nullptr) *cropWidth = static_cast<int>(cropW);
    if (cropHeight != nullptr) *cropHeight = static_cast<int>(cropH);
    return OK;
}

}  // namespace qnmediaeditor
}  // namespace android
