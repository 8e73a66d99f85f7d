#ifndef PLATFORM_CODEC_VIDEO_DECODER_H_
#define PLATFORM_CODEC_VIDEO_DECODER_H_

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>
#include <utils/Errors.h>

namespace android {

// One decoded picture as 8-bit I420: `stride` x `sliceHeight` luma, then Cb
// and Cr at half size, rows packed.
struct VideoPicture {
    int64_t timeUs = 0;  // presentation time
    int32_t stride = 0, sliceHeight = 0;
    int32_t cropLeft = 0, cropTop = 0, cropRight = -1, cropBottom = -1;  // the visible part, inclusive
    // As the stream says: range 1 full, 0 limited, -1 unsaid; the others are
    // ISO/IEC 23001-8 code points, 2 for unsaid.
    int32_t range = -1, primaries = 2, transfer = 2, matrix = 2;
    sp<ABuffer> yuv;
};

// One compressed video stream's decoder, fed one sample at a time in
// decoding order; pictures come out in presentation order. The library
// behind it stays inside its implementation file.
class VideoDecoder {
public:
    // maxPixels bounds what a stream may make it allocate; threads 0 lets
    // the decoder choose.
    static std::unique_ptr<VideoDecoder> Create(const MetaData& format, int64_t maxPixels, int threads);
    virtual ~VideoDecoder() = default;

    // Appends the pictures now ready. ERROR_MALFORMED for a sample the codec
    // rejects (the decoder stays usable), ERROR_UNSUPPORTED for a picture in
    // a layout that has no 4:2:0 form here (dropped).
    virtual status_t decode(const uint8_t* data, size_t size, int64_t timeUs, std::vector<VideoPicture>* out) = 0;
    // After the last sample: the pictures still held for reordering.
    virtual status_t drain(std::vector<VideoPicture>* out) = 0;
    // Pictures presented before this time are decoded but not handed out.
    virtual void setSkipBefore(int64_t timeUs) = 0;
    // Forgets the stream's history, before a seek.
    virtual void flush() = 0;
};

}  // namespace android

#endif
