#define LOG_TAG "LibavVideoDecoder"
#include <cstring>
#include <limits>
#include <new>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "codec/CodecConfig.h"
#include "codec/LibavCodecState.h"
#include "codec/LibavLog.h"
#include "codec/PictureConvert.h"
#include "codec/VideoDecoder.h"

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/mem.h>
#include <libavutil/pixdesc.h>
}

namespace android {

namespace {

// The planes of a frame in a layout ToI420 reads: planar YUV or grey, native
// little-endian, 8 to 16 bits, chroma halved or not. RGB (an H.264 4:4:4
// stream coded as GBR) and anything packed is refused.
bool DescribePlanes(const AVFrame& frame, PlanarPicture* picture) {
    const AVPixFmtDescriptor* desc = av_pix_fmt_desc_get(static_cast<AVPixelFormat>(frame.format));
    if (desc == nullptr || (desc->flags & (AV_PIX_FMT_FLAG_RGB | AV_PIX_FMT_FLAG_BE | AV_PIX_FMT_FLAG_PAL |
                                           AV_PIX_FMT_FLAG_BITSTREAM | AV_PIX_FMT_FLAG_HWACCEL)) != 0 ||
        desc->log2_chroma_w > 1 || desc->log2_chroma_h > 1) {
        return false;
    }
    const int planes = desc->nb_components >= 3 ? 3 : 1;
    if (desc->nb_components == 2 || desc->nb_components > 4) return false;
    const int depth = desc->comp[0].depth;
    if (depth < 8 || depth > 16) return false;
    for (int i = 0; i < planes; ++i) {
        const AVComponentDescriptor& c = desc->comp[i];
        if (c.plane != i || c.offset != 0 || c.shift != 0 || c.depth != depth || c.step != (depth > 8 ? 2 : 1) ||
            frame.data[i] == nullptr) {
            return false;
        }
        picture->planes[i] = frame.data[i];
        picture->pitch[i] = frame.linesize[i];
    }
    picture->width = frame.width;
    picture->height = frame.height;
    picture->bitDepth = depth;
    picture->chromaShiftX = desc->log2_chroma_w;
    picture->chromaShiftY = desc->log2_chroma_h;
    return true;
}

int32_t Range(const AVFrame& frame) {
    switch (frame.color_range) {
        case AVCOL_RANGE_JPEG: return 1;
        case AVCOL_RANGE_MPEG: return 0;
        default: break;
    }
    switch (frame.format) {  // the full-range formats the decoders still name
        case AV_PIX_FMT_YUVJ420P: case AV_PIX_FMT_YUVJ422P: case AV_PIX_FMT_YUVJ444P: return 1;
        default: return -1;
    }
}

class LibavVideoDecoder : public VideoDecoder {
public:
    bool open(const VideoCodecConfig& config, int64_t maxPixels, int threads) {
        const AVCodec* codec =
            avcodec_find_decoder(config.codec == VideoCodec::kAvc ? AV_CODEC_ID_H264 : AV_CODEC_ID_HEVC);
        if (!mCodec.allocate(codec) || !mCodec.setExtradata(config.extradata)) return false;
        // The crop is reported, not applied: callers get the coded picture and
        // its visible rectangle, as a hardware decoder would give them.
        mCodec.context->apply_cropping = 0;
        mCodec.context->max_pixels = maxPixels;
        mCodec.context->thread_count = threads;
        mCodec.context->pkt_timebase = AVRational{1, 1000000};
        const int err = avcodec_open2(mCodec.context, codec, nullptr);
        if (err < 0) {
            ALOGW("the %s decoder refuses the track's configuration (%d)", codec->name, err);
            return false;
        }
        mMaxPixels = maxPixels;
        return true;
    }

    status_t decode(const uint8_t* data, size_t size, int64_t timeUs, std::vector<VideoPicture>* out) override {
        // An empty packet would tell the codec the stream has ended.
        if (size == 0 || size > INT32_MAX - AV_INPUT_BUFFER_PADDING_SIZE) return ERROR_MALFORMED;
        av_packet_unref(mCodec.packet);
        if (av_new_packet(mCodec.packet, static_cast<int>(size)) < 0) return NO_MEMORY;
        memcpy(mCodec.packet->data, data, size);
        mCodec.packet->pts = timeUs;
        int err = avcodec_send_packet(mCodec.context, mCodec.packet);
        if (err == AVERROR(EAGAIN)) {
            // Output must be taken before more input goes in.
            status_t result = receiveAll(out);
            if (result != OK && result != ERROR_UNSUPPORTED) return result;
            err = avcodec_send_packet(mCodec.context, mCodec.packet);
        }
        av_packet_unref(mCodec.packet);
        const status_t received = receiveAll(out);
        if (err < 0 && err != AVERROR(EAGAIN)) return err == AVERROR(ENOMEM) ? status_t(NO_MEMORY) : status_t(ERROR_MALFORMED);
        return received;
    }

    status_t drain(std::vector<VideoPicture>* out) override {
        avcodec_send_packet(mCodec.context, nullptr);
        const status_t err = receiveAll(out);
        // Ready for more input afterwards.
        avcodec_flush_buffers(mCodec.context);
        return err;
    }

    void setSkipBefore(int64_t timeUs) override { mSkipBeforeUs = timeUs; }
    void flush() override { avcodec_flush_buffers(mCodec.context); }

private:
    status_t receiveAll(std::vector<VideoPicture>* out) {
        status_t result = OK;
        int err;
        while ((err = avcodec_receive_frame(mCodec.context, mCodec.frame)) >= 0) {
            const AVFrame& f = *mCodec.frame;
            const int64_t timeUs = f.best_effort_timestamp != AV_NOPTS_VALUE ? f.best_effort_timestamp : f.pts;
            if (timeUs == AV_NOPTS_VALUE || timeUs >= mSkipBeforeUs) {
                VideoPicture picture;
                const status_t converted = convert(timeUs == AV_NOPTS_VALUE ? 0 : timeUs, &picture);
                if (converted == OK) {
                    out->push_back(std::move(picture));
                } else {
                    result = converted;
                }
            }
            av_frame_unref(mCodec.frame);
        }
        if (err != AVERROR(EAGAIN) && err != AVERROR_EOF) result = ERROR_MALFORMED;
        return result;
    }

    status_t convert(int64_t timeUs, VideoPicture* picture) {
        PlanarPicture planes;
        if (!DescribePlanes(*mCodec.frame, &planes)) {
            ALOGW("pictures in %s have no 4:2:0 form here",
                  av_get_pix_fmt_name(static_cast<AVPixelFormat>(mCodec.frame->format)));
            return ERROR_UNSUPPORTED;
        }
        const int64_t w = EvenSize(planes.width), h = EvenSize(planes.height);
        const uint64_t left = mCodec.frame->crop_left, right = mCodec.frame->crop_right;
        const uint64_t top = mCodec.frame->crop_top, bottom = mCodec.frame->crop_bottom;
        if (w <= 0 || h <= 0 || w * h > mMaxPixels || left + right >= uint64_t(planes.width) ||
            top + bottom >= uint64_t(planes.height)) {
            ALOGW("a picture of %dx%d (crop %llu,%llu,%llu,%llu) is refused", planes.width, planes.height,
                  (unsigned long long)left, (unsigned long long)top, (unsigned long long)right,
                  (unsigned long long)bottom);
            return ERROR_MALFORMED;
        }
        picture->yuv = new (std::nothrow) ABuffer(size_t(w * h + 2 * (w / 2) * (h / 2)));
        if (picture->yuv == nullptr || picture->yuv->data() == nullptr) return NO_MEMORY;
        ToI420(planes, picture->yuv->data());
        picture->timeUs = timeUs;
        picture->stride = static_cast<int32_t>(w);
        picture->sliceHeight = static_cast<int32_t>(h);
        picture->cropLeft = static_cast<int32_t>(left);
        picture->cropTop = static_cast<int32_t>(top);
        picture->cropRight = static_cast<int32_t>(planes.width - 1 - right);
        picture->cropBottom = static_cast<int32_t>(planes.height - 1 - bottom);
        picture->range = Range(*mCodec.frame);
        // libavutil numbers these as ISO/IEC 23001-8 does.
        picture->primaries = mCodec.frame->color_primaries;
        picture->transfer = mCodec.frame->color_trc;
        picture->matrix = mCodec.frame->colorspace;
        return OK;
    }

    LibavCodecState mCodec;
    int64_t mMaxPixels = 0;
    int64_t mSkipBeforeUs = std::numeric_limits<int64_t>::min();
};

}  // namespace

std::unique_ptr<VideoDecoder> VideoDecoder::Create(const MetaData& format, int64_t maxPixels, int threads) {
    RouteLibavLog();
    VideoCodecConfig config;
    if (!ReadVideoCodecConfig(format, &config)) return nullptr;
    std::unique_ptr<LibavVideoDecoder> decoder(new (std::nothrow) LibavVideoDecoder);
    if (decoder == nullptr || !decoder->open(config, maxPixels, threads)) return nullptr;
    return decoder;
}

}  // namespace android
