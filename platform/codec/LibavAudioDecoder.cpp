#define LOG_TAG "LibavAudioDecoder"
#include <cstring>
#include <new>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/PcmConvert.h>

#include "codec/AudioDecoder.h"
#include "codec/CodecConfig.h"
#include "codec/LibavCodecState.h"
#include "codec/LibavLog.h"

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/channel_layout.h>
#include <libavutil/mem.h>
#include <libavutil/samplefmt.h>
}

namespace android {

namespace {

// More would be a damaged header: no codec here writes them.
constexpr int kMaxChannels = 8;

AVCodecID CodecId(AudioCodec codec) {
    switch (codec) {
        case AudioCodec::kAac: return AV_CODEC_ID_AAC;
        case AudioCodec::kAmrNb: return AV_CODEC_ID_AMR_NB;
        case AudioCodec::kAmrWb: return AV_CODEC_ID_AMR_WB;
        case AudioCodec::kVorbis: return AV_CODEC_ID_VORBIS;
        case AudioCodec::kMp3: return AV_CODEC_ID_MP3;
        case AudioCodec::kFlac: return AV_CODEC_ID_FLAC;
        case AudioCodec::kNone: break;
    }
    return AV_CODEC_ID_NONE;
}

bool SampleType(AVSampleFormat format, PcmSampleType* type) {
    switch (av_get_packed_sample_fmt(format)) {
        case AV_SAMPLE_FMT_U8: *type = PcmSampleType::kU8; return true;
        case AV_SAMPLE_FMT_S16: *type = PcmSampleType::kS16; return true;
        case AV_SAMPLE_FMT_S32: *type = PcmSampleType::kS32; return true;
        case AV_SAMPLE_FMT_FLT: *type = PcmSampleType::kFloat; return true;
        case AV_SAMPLE_FMT_DBL: *type = PcmSampleType::kDouble; return true;
        default: return false;
    }
}

class LibavAudioDecoder : public AudioDecoder {
public:
    bool open(const AudioCodecConfig& config) {
        const AVCodec* codec = avcodec_find_decoder(CodecId(config.codec));
        if (!mCodec.allocate(codec)) return false;
        if (!config.extradata.empty() && !mCodec.setExtradata(config.extradata)) return false;
        if (config.sampleRate > 0) mCodec.context->sample_rate = config.sampleRate;
        if (config.channels > 0 && config.channels <= kMaxChannels) {
            av_channel_layout_default(&mCodec.context->ch_layout, config.channels);
        }
        const int err = avcodec_open2(mCodec.context, codec, nullptr);
        if (err < 0) {
            ALOGW("the %s decoder refuses the track's configuration (%d)", codec->name, err);
            return false;
        }
        return true;
    }

    status_t decode(const uint8_t* data, size_t size, std::vector<int16_t>* pcm) override {
        // An empty packet would tell the codec the stream has ended.
        if (size == 0 || size > INT32_MAX - AV_INPUT_BUFFER_PADDING_SIZE) return ERROR_MALFORMED;
        av_packet_unref(mCodec.packet);
        if (av_new_packet(mCodec.packet, static_cast<int>(size)) < 0) return NO_MEMORY;
        memcpy(mCodec.packet->data, data, size);
        int err = avcodec_send_packet(mCodec.context, mCodec.packet);
        av_packet_unref(mCodec.packet);
        status_t result = OK;
        if (err < 0 && err != AVERROR(EAGAIN)) result = ERROR_MALFORMED;
        while ((err = avcodec_receive_frame(mCodec.context, mCodec.frame)) >= 0) {
            if (!append(pcm)) result = ERROR_MALFORMED;
            av_frame_unref(mCodec.frame);
        }
        if (err != AVERROR(EAGAIN) && err != AVERROR_EOF) result = ERROR_MALFORMED;
        return result;
    }

    void flush() override { avcodec_flush_buffers(mCodec.context); }
    int32_t sampleRate() const override { return mRate; }
    int32_t channelCount() const override { return mChannels; }

private:
    // The first frame fixes the output's layout; a later change of channel
    // count (implicit parametric stereo turning on) is mapped onto it.
    bool append(std::vector<int16_t>* pcm) {
        const int channels = mCodec.frame->ch_layout.nb_channels;
        PcmSampleType type;
        if (channels <= 0 || channels > kMaxChannels || mCodec.frame->nb_samples < 0 ||
            !SampleType(static_cast<AVSampleFormat>(mCodec.frame->format), &type)) {
            return false;
        }
        if (mChannels == 0) {
            mChannels = channels;
            mRate = mCodec.frame->sample_rate;
        } else if (mCodec.frame->sample_rate != mRate) {
            ALOGW("sample rate changes from %d to %d Hz: frame dropped", mRate, mCodec.frame->sample_rate);
            return false;
        }
        const bool planar = av_sample_fmt_is_planar(static_cast<AVSampleFormat>(mCodec.frame->format)) != 0;
        const uint8_t* planes[kMaxChannels];
        for (int c = 0; c < mChannels; ++c) {
            planes[c] = mCodec.frame->extended_data[planar ? (c < channels ? c : channels - 1) : 0];
        }
        if (channels == mChannels || planar) {
            // Planar output of another width reads the planes picked above.
            AppendPcm16(type, planar, planes, mCodec.frame->nb_samples, mChannels, pcm);
            return true;
        }
        std::vector<int16_t> frame;
        AppendPcm16(type, false, planes, mCodec.frame->nb_samples, channels, &frame);
        for (int i = 0; i < mCodec.frame->nb_samples; ++i) {
            for (int c = 0; c < mChannels; ++c) pcm->push_back(frame[i * channels + (c < channels ? c : channels - 1)]);
        }
        return true;
    }

    LibavCodecState mCodec;
    int32_t mRate = 0;
    int32_t mChannels = 0;
};

}  // namespace

std::unique_ptr<AudioDecoder> AudioDecoder::Create(const MetaData& format) {
    RouteLibavLog();
    AudioCodecConfig config;
    if (!ReadAudioCodecConfig(format, &config)) return nullptr;
    std::unique_ptr<LibavAudioDecoder> decoder(new (std::nothrow) LibavAudioDecoder);
    if (decoder == nullptr || !decoder->open(config)) return nullptr;
    return decoder;
}

}  // namespace android
