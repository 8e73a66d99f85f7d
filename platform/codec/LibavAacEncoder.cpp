#define LOG_TAG "LibavAacEncoder"
#include <new>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

#include "codec/AacEncoder.h"
#include "codec/LibavCodecState.h"
#include "codec/LibavLog.h"

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/channel_layout.h>
#include <libavutil/frame.h>
}

namespace android {

namespace {

// ISO/IEC 14496-3 sampling frequency table: the rates an ASC can index.
bool AacRate(int32_t rate) {
    static const int32_t kRates[] = {96000, 88200, 64000, 48000, 44100, 32000, 24000, 22050, 16000, 12000, 11025, 8000, 7350};
    for (int32_t r : kRates) {
        if (r == rate) return true;
    }
    return false;
}

class LibavAacEncoder : public AacEncoder {
public:
    bool open(int32_t rate, int32_t channels, int32_t bitRate) {
        const AVCodec* codec = avcodec_find_encoder(AV_CODEC_ID_AAC);
        if (!mCodec.allocate(codec)) return false;
        mChannels = channels;
        mCodec.context->sample_rate = rate;
        av_channel_layout_default(&mCodec.context->ch_layout, channels);
        mCodec.context->sample_fmt = AV_SAMPLE_FMT_FLTP;
        mCodec.context->bit_rate = bitRate;
        mCodec.context->profile = FF_PROFILE_AAC_LOW;
        // The configuration goes into the track's esds, not in-band.
        mCodec.context->flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
        const int err = avcodec_open2(mCodec.context, codec, nullptr);
        if (err < 0 || mCodec.context->extradata_size < 2 || mCodec.context->frame_size <= 0) {
            ALOGE("the AAC encoder refuses %d Hz, %d channels (%d)", rate, channels, err);
            return false;
        }
        mConfig.assign(mCodec.context->extradata, mCodec.context->extradata + mCodec.context->extradata_size);
        mCodec.frame->format = AV_SAMPLE_FMT_FLTP;
        mCodec.frame->sample_rate = rate;
        mCodec.frame->nb_samples = mCodec.context->frame_size;
        if (av_channel_layout_copy(&mCodec.frame->ch_layout, &mCodec.context->ch_layout) < 0 || av_frame_get_buffer(mCodec.frame, 0) < 0) {
            return false;
        }
        return true;
    }

    size_t frameSize() const override { return static_cast<size_t>(mCodec.context->frame_size); }
    int32_t delay() const override { return mCodec.context->initial_padding; }
    const std::vector<uint8_t>& config() const override { return mConfig; }

    status_t encode(const int16_t* pcm, size_t frames, std::vector<std::vector<uint8_t>>* units) override {
        if (frames == 0 || frames > frameSize()) return BAD_VALUE;
        if (av_frame_make_writable(mCodec.frame) < 0) return NO_MEMORY;
        // The encoder takes a short last frame; it is padded so that every
        // frame sent has the size it was opened with.
        for (int c = 0; c < mChannels; ++c) {
            float* plane = reinterpret_cast<float*>(mCodec.frame->extended_data[c]);
            for (size_t i = 0; i < frames; ++i) plane[i] = pcm[i * mChannels + c] * (1.0f / 32768.0f);
            for (size_t i = frames; i < frameSize(); ++i) plane[i] = 0.0f;
        }
        mCodec.frame->pts = mNextPts;
        mNextPts += mCodec.context->frame_size;
        if (avcodec_send_frame(mCodec.context, mCodec.frame) < 0) return UNKNOWN_ERROR;
        return receive(units);
    }

    status_t finish(std::vector<std::vector<uint8_t>>* units) override {
        if (avcodec_send_frame(mCodec.context, nullptr) < 0) return UNKNOWN_ERROR;
        return receive(units);
    }

private:
    status_t receive(std::vector<std::vector<uint8_t>>* units) {
        int err;
        while ((err = avcodec_receive_packet(mCodec.context, mCodec.packet)) >= 0) {
            units->emplace_back(mCodec.packet->data, mCodec.packet->data + mCodec.packet->size);
            av_packet_unref(mCodec.packet);
        }
        return err == AVERROR(EAGAIN) || err == AVERROR_EOF ? OK : UNKNOWN_ERROR;
    }

    LibavCodecState mCodec;
    int mChannels = 0;
    int64_t mNextPts = 0;
    std::vector<uint8_t> mConfig;
};

}  // namespace

std::unique_ptr<AacEncoder> AacEncoder::Create(int32_t sampleRate, int32_t channels, int32_t bitRate) {
    // More than two channels would need a channel configuration the mixer
    // never produces.
    if (!AacRate(sampleRate) || channels < 1 || channels > 2 || bitRate <= 0) {
        ALOGE("AAC cannot carry %d Hz, %d channels", sampleRate, channels);
        return nullptr;
    }
    RouteLibavLog();
    std::unique_ptr<LibavAacEncoder> encoder(new (std::nothrow) LibavAacEncoder);
    if (encoder == nullptr || !encoder->open(sampleRate, channels, bitRate)) return nullptr;
    return encoder;
}

}  // namespace android
