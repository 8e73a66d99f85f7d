#ifndef QNEDIT_FRAME_VIDEO_H
#define QNEDIT_FRAME_VIDEO_H

#include <cstdint>
#include <string>

#include <media/stagefright/VideoDecoderSource.h>

#include "Png.h"

namespace qnedit {

// The pictures of a file's video track, decoded by the platform, as the
// viewer sees them (cropped, turned, RGB).
class VideoPictures {
public:
    // track < 0: the first video track.
    VideoPictures(const std::string& path, long track);
    ~VideoPictures();
    VideoPictures(const VideoPictures&) = delete;
    VideoPictures& operator=(const VideoPictures&) = delete;

    int64_t durationUs() const { return mDurationUs; }
    // The first picture presented at or after timeUs; *shownUs is its time.
    RgbImage at(int64_t timeUs, int64_t* shownUs);

private:
    std::string mPath;
    android::sp<android::VideoDecoderSource> mDecoder;
    int32_t mRotation = 0;
    int64_t mDurationUs = 0;
};

}  // namespace qnedit

#endif
