#define LOG_TAG "AacEncoderSource"
#include <media/stagefright/AacEncoderSource.h>

#include <algorithm>
#include <cstring>
#include <strings.h>
#include <new>

#include <log/log.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "codec/AacEncoder.h"
#include "media/CodecSpecificData.h"

namespace android {

namespace {

constexpr int32_t kBitRatePerChannel = 64000;

bool Is16BitPcm(const MetaData& format) {
    const char* mime = nullptr;
    int32_t encoding = kAudioEncodingPcm16bit, bits = 16;
    format.findInt32(kKeyPcmEncoding, &encoding);
    format.findInt32(kKeyBitsPerSample, &bits);
    return format.findCString(kKeyMIMEType, &mime) && strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_RAW) == 0 &&
           encoding == kAudioEncodingPcm16bit && bits == 16;
}

}  // namespace

sp<AacEncoderSource> AacEncoderSource::Create(const sp<IMediaSource>& pcm, int32_t bitRate) {
    const sp<MetaData> in = pcm != nullptr ? pcm->getFormat() : nullptr;
    int32_t rate = 0, channels = 0;
    if (in == nullptr || !Is16BitPcm(*in) || !in->findInt32(kKeySampleRate, &rate) ||
        !in->findInt32(kKeyChannelCount, &channels)) {
        ALOGE("the encoder takes 16-bit PCM with a rate and channel count");
        return nullptr;
    }
    if (bitRate <= 0) bitRate = kBitRatePerChannel * channels;
    std::unique_ptr<AacEncoder> encoder = AacEncoder::Create(rate, channels, bitRate);
    if (encoder == nullptr) return nullptr;
    sp<MetaData> format = new MetaData;
    format->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_AAC);
    format->setInt32(kKeySampleRate, rate);
    format->setInt32(kKeyChannelCount, channels);
    format->setInt32(kKeyBitRate, bitRate);
    format->setInt32(kKeyEncoderDelay, encoder->delay());
    const std::vector<uint8_t>& asc = encoder->config();
    // Audio ISO/IEC 14496-3 (0x40) in an audio stream (5).
    const std::vector<uint8_t> esds = makeEsds(0x40, 0x05, bitRate, bitRate, asc.data(), asc.size());
    format->setData(kKeyESDS, 0, esds.data(), esds.size());
    int64_t durationUs;
    if (in->findInt64(kKeyDuration, &durationUs)) format->setInt64(kKeyDuration, durationUs);
    return new (std::nothrow) AacEncoderSource(pcm, std::move(encoder), format);
}

AacEncoderSource::AacEncoderSource(const sp<IMediaSource>& pcm, std::unique_ptr<AacEncoder> encoder,
                                   const sp<MetaData>& format)
    : mPcm(pcm), mEncoder(std::move(encoder)), mFormat(format), mRate([&] {
          int32_t r = 0;
          format->findInt32(kKeySampleRate, &r);
          return r;
      }()),
      mChannels([&] {
          int32_t c = 0;
          format->findInt32(kKeyChannelCount, &c);
          return c;
      }()) {}

AacEncoderSource::~AacEncoderSource() {
    if (mStarted) stop();
}

status_t AacEncoderSource::start(MetaData* params) {
    // Once only: the encoder cannot be taken back to its first frame.
    if (mStarted || mInputDone || mUnitsOut > 0) return INVALID_OPERATION;
    const status_t err = mPcm->start(params);
    if (err == OK) mStarted = true;
    return err;
}

status_t AacEncoderSource::stop() {
    if (!mStarted) return INVALID_OPERATION;
    mStarted = false;
    mUnits.clear();
    mHeld.clear();
    return mPcm->stop();
}

sp<MetaData> AacEncoderSource::getFormat() { return new MetaData(*mFormat); }

status_t AacEncoderSource::read(MediaBufferBase** buffer, const ReadOptions* options) {
    *buffer = nullptr;
    if (!mStarted) return INVALID_OPERATION;
    int64_t seekUs;
    ReadOptions::SeekMode mode;
    if (options != nullptr && options->getSeekTo(&seekUs, &mode)) return ERROR_UNSUPPORTED;
    const status_t err = fill();
    if (err != OK) return err;
    const std::vector<uint8_t>& unit = mUnits.front();
    MediaBuffer* out = new (std::nothrow) MediaBuffer(unit.size());
    if (out == nullptr || (out->data() == nullptr && !unit.empty())) {
        if (out != nullptr) out->release();
        return NO_MEMORY;
    }
    out->add_ref();
    if (!unit.empty()) memcpy(out->data(), unit.data(), unit.size());
    const int64_t frames = mUnitsOut * static_cast<int64_t>(mEncoder->frameSize());
    out->meta_data().setInt64(kKeyTime, frames * 1000000 / mRate);
    out->meta_data().setInt32(kKeyIsSyncFrame, 1);
    mUnits.pop_front();
    ++mUnitsOut;
    *buffer = out;
    return OK;
}

status_t AacEncoderSource::fill() {
    const size_t frameSize = mEncoder->frameSize();
    const size_t frameSamples = frameSize * mChannels;
    std::vector<std::vector<uint8_t>> units;
    while (mUnits.empty()) {
        if (mInputDone) return ERROR_END_OF_STREAM;
        MediaBufferBase* in = nullptr;
        status_t err = mPcm->read(&in);
        if (err == OK) {
            const int16_t* pcm = reinterpret_cast<const int16_t*>(static_cast<const uint8_t*>(in->data()) +
                                                                  in->range_offset());
            mHeld.insert(mHeld.end(), pcm, pcm + in->range_length() / sizeof(int16_t));
            in->release();
        } else if (err != ERROR_END_OF_STREAM) {
            return err;
        }
        const bool end = err == ERROR_END_OF_STREAM;
        // Whole frames; at the end also the short last one.
        size_t used = 0;
        while (mHeld.size() - used >= frameSamples || (end && mHeld.size() - used >= size_t(mChannels))) {
            const size_t frames = std::min(frameSamples, mHeld.size() - used) / mChannels;
            err = mEncoder->encode(mHeld.data() + used, frames, &units);
            if (err != OK) return err;
            used += frames * mChannels;
        }
        mHeld.erase(mHeld.begin(), mHeld.begin() + used);
        if (end) {
            mHeld.clear();
            mInputDone = true;
            err = mEncoder->finish(&units);
            if (err != OK) return err;
        }
        for (auto& u : units) mUnits.push_back(std::move(u));
        units.clear();
    }
    return OK;
}

}  // namespace android
