#define LOG_TAG "SupportResolution"
#include <media/stagefright/SupportResolution.h>

#include <algorithm>
#include <strings.h>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>

// isSupportResolution(mime, component, width, height, encoder):
//   mime      the video MIME type, matched without regard to case;
//   component the codec component the caller means to use; the device's
//             limits do not depend on it (null is allowed);
//   width, height  the picture size in pixels;
//   encoder   true to ask about encoding, false about decoding.
//
// A size is supported when both sides are positive and even and the picture
// fits the limit of its type and direction in landscape or portrait
// orientation (the longer side against the longer limit):
//
//   type            decode       encode
//   AVC             4096x2304    3840x2160
//   HEVC            7680x4320    3840x2160
//   VP9             7680x4320    3840x2160
//   VP8             3840x2160    1920x1088
//   MPEG-4 part 2   1920x1088    1920x1088
//   H.263           1408x1152    1408x1152
//   MPEG-2          1920x1088    (none)
//
// Other types are not supported.

namespace android {

namespace {

struct Limit {
    int longSide;
    int shortSide;
};

struct Rule {
    const char* const* mime;
    Limit decode;
    Limit encode;  // {0, 0}: no encoder
};

const Rule kRules[] = {
    {&MEDIA_MIMETYPE_VIDEO_AVC, {4096, 2304}, {3840, 2160}},
    {&MEDIA_MIMETYPE_VIDEO_HEVC, {7680, 4320}, {3840, 2160}},
    {&MEDIA_MIMETYPE_VIDEO_VP9, {7680, 4320}, {3840, 2160}},
    {&MEDIA_MIMETYPE_VIDEO_VP8, {3840, 2160}, {1920, 1088}},
    {&MEDIA_MIMETYPE_VIDEO_MPEG4, {1920, 1088}, {1920, 1088}},
    {&MEDIA_MIMETYPE_VIDEO_H263, {1408, 1152}, {1408, 1152}},
    {&MEDIA_MIMETYPE_VIDEO_MPEG2, {1920, 1088}, {0, 0}},
};

}  // namespace

bool isSupportResolution(const char* mime, const char* component, int width, int height, bool encoder) {
    if (mime == nullptr) return false;
    if (width <= 0 || height <= 0 || (width & 1) != 0 || (height & 1) != 0) return false;
    for (const Rule& rule : kRules) {
        if (strcasecmp(mime, *rule.mime) != 0) continue;
        const Limit& limit = encoder ? rule.encode : rule.decode;
        const int longSide = std::max(width, height), shortSide = std::min(width, height);
        const bool ok = longSide <= limit.longSide && shortSide <= limit.shortSide;
        ALOGV("%s %s %dx%d (%s): %s", encoder ? "encode" : "decode", mime, width, height,
              component ? component : "any component", ok ? "supported" : "not supported");
        return ok;
    }
    return false;
}

}  // namespace android
