#include "FramePicture.h"

#include <vector>

#include "Cli.h"
#include "Input.h"
#include "QNMediaEditorColorUtils.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

namespace {

RgbImage turned(const RgbImage& in, int rotation) {
    if (rotation != 90 && rotation != 180 && rotation != 270) return in;
    const bool quarter = rotation != 180;
    RgbImage out(quarter ? in.height : in.width, quarter ? in.width : in.height);
    for (int y = 0; y < in.height; ++y) {
        for (int x = 0; x < in.width; ++x) {
            int ox = x, oy = y;
            if (rotation == 90) ox = in.height - 1 - y, oy = x;
            if (rotation == 180) ox = in.width - 1 - x, oy = in.height - 1 - y;
            if (rotation == 270) ox = y, oy = in.width - 1 - x;
            const uint8_t* p = &in.pixels[(size_t(y) * in.width + x) * 3];
            out.set(ox, oy, p[0], p[1], p[2]);
        }
    }
    return out;
}

}  // namespace

RgbImage framePicture(const sp<AMessage>& format, const uint8_t* yuv, int rotation, const std::string& what) {
    int32_t left = 0, top = 0, right = -1, bottom = -1, width = 0, height = 0;
    if (!format->findRect("crop", &left, &top, &right, &bottom)) {
        format->findInt32("width", &width);
        format->findInt32("height", &height);
        right = width - 1, bottom = height - 1;
    }
    const int64_t outW = int64_t(right) - left + 1, outH = int64_t(bottom) - top + 1;
    if (outW <= 0 || outH <= 0 || outW > 16384 || outH > 16384) inputError(what + ": no visible picture");
    sp<QNMediaEditorColorUtils> colors = new QNMediaEditorColorUtils();
    colors->setOutputFormat(format);
    std::vector<uint8_t> rgb(size_t(outW) * outH * 2);
    const status_t err = colors->convert(yuv, rgb.data());
    if (err != OK) inputError(what + ": the colour converter refused the frame (" + describeStatus(err) + ")");
    return turned(rgb565ToImage(rgb.data(), int(outW), int(outH)), rotation);
}

}  // namespace qnedit
