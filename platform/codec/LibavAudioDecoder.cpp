#define LOG_TAG "LibavAudioDecoder"
#include <cstring>
#include <new>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/PcmConvert.h>

#include "codec/AudioDecoder.h"
#include "codec/CodecConfig.h"
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
    ~LibavAudioDecoder() override {
        av_frame_free(&mFrame);
        av_packet_free(&mPacket);
        avcodec_free_context(&mContext);
    }

    bool open(const AudioCodecConfig& config) {
        const AVCodec* codec = avcodec_find_decoder(CodecId(config.codec));
        if (codec == nullptr || (mContext = avcodec_alloc_context3(codec)) == nullptr ||
            (mPacket = av_packet_alloc()) == nullptr || (mFrame = av_frame_alloc()) == nullptr) {
            ALOGE("cannot set up a decoder");
            return false;
        }
        if (!config.extradata.empty()) {
            const size_t size = config.extradata.size();
            mContext->extradata = static_cast<uint8_t*>(av_mallocz(size + AV_INPUT_BUFFER_PADDING_SIZE));
            if (mContext->extradata == nullptr) return false;
            memcpy(mContext->extradata, config.extradata.data(), size);
            mContext->extradata_size = static_cast<int>(size);
        }
        if (config.sampleRate > 0) mContext->sample_rate = config.sampleRate;
        if (config.channels > 0 && config.channels <= kMaxChannels) {
            av_channel_layout_default(&mContext->ch_layout, config.channels);
        }
        const int err = avcodec_open2(mContext, codec, nullptr);
        if (err < 0) {
            ALOGW("the %s decoder refuses the track's configuration (%d)", codec->name, err);
            return false;
        }
        return true;
    }

    status_t decode(const uint8_t* data, size_t size, std::vector<int16_t>* pcm) override {
        // An empty packet would tell the codec the stream has ended.
        if (size == 0 || size > INT32_MAX - AV_INPUT_BUFFER_PADDING_SIZE) return ERROR_MALFORMED;
        av_packet_unref(mPacket);
        if (av_new_packet(mPacket, static_cast<int>(size)) < 0) return NO_MEMORY;
        memcpy(mPacket->data, data, size);
        int err = avcodec_send_packet(mContext, mPacket);
        av_packet_unref(mPacket);
        status_t result = OK;
        if (err < 0 && err != AVERROR(EAGAIN)) result = ERROR_MALFORMED;
        while ((err = avcodec_receive_frame(mContext, mFrame)) >= 0) {
            if (!append(pcm)) result = ERROR_MALFORMED;
            av_frame_unref(mFrame);
        }
        if (err != AVERROR(EAGAIN) && err != AVERROR_EOF) result = ERROR_MALFORMED;
        return result;
    }

    void flush() override { avcodec_flush_buffers(mContext); }
    int32_t sampleRate() const override { return mRate; }
    int32_t channelCount() const override { return mChannels; }

private:
    // The first frame fixes the output's layout; a later change of channel
    // count (implicit parametric stereo turning on) is mapped onto it.
    bool append(std::vector<int16_t>* pcm) {
        const int channels = mFrame->ch_layout.nb_channels;
        PcmSampleType type;
        if (channels <= 0 || channels > kMaxChannels || mFrame->nb_samples < 0 ||
            !SampleType(static_cast<AVSampleFormat>(mFrame->format), &type)) {
            return false;
        }
        if (mChannels == 0) {
            mChannels = channels;
            mRate = mFrame->sample_rate;
        } else if (mFrame->sample_rate != mRate) {
            ALOGW("sample rate changes from %d to %d Hz: frame dropped", mRate, mFrame->sample_rate);
            return false;
        }
        const bool planar = av_sample_fmt_is_planar(static_cast<AVSampleFormat>(mFrame->format)) != 0;
        const uint8_t* planes[kMaxChannels];
        for (int c = 0; c < mChannels; ++c) {
            planes[c] = mFrame->extended_data[planar ? (c < channels ? c : channels - 1) : 0];
        }
        if (channels == mChannels || planar) {
            // Planar output of another width reads the planes picked above.
            AppendPcm16(type, planar, planes, mFrame->nb_samples, mChannels, pcm);
            return true;
        }
        std::vector<int16_t> frame;
        AppendPcm16(type, false, planes, mFrame->nb_samples, channels, &frame);
        for (int i = 0; i < mFrame->nb_samples; ++i) {
            for (int c = 0; c < mChannels; ++c) pcm->push_back(frame[i * channels + (c < channels ? c : channels - 1)]);
        }
        return true;
    }

    AVCodecContext* mContext = nullptr;
    AVPacket* mPacket = nullptr;
    AVFrame* mFrame = nullptr;
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
