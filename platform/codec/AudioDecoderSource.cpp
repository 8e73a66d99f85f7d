#define LOG_TAG "AudioDecoderSource"
#include <media/stagefright/AudioDecoderSource.h>

#include <algorithm>
#include <cstring>
#include <new>
#include <vector>

#include <log/log.h>
#include <media/stagefright/MediaBuffer.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "codec/AudioDecoder.h"
#include "codec/CodecConfig.h"

namespace android {

namespace {

// Priming is a few codec frames; more is a damaged header.
constexpr int32_t kMaxEncoderDelay = 1 << 16;
// How far before a seek's time decoding starts, so that the codec's state is
// filled again when the time is reached: AAC overlaps one frame (two with
// SBR), Vorbis one block, MP3 also reaches back into its bit reservoir and
// needs a few frames to agree to the bit. AMR's predictors come close only.
constexpr int64_t kSeekPrerollUs = 200000;

// The priming a track states as a count of samples, as time: its samples'
// times include it, the presentation starts after it.
int64_t EncoderDelayUs(const MetaData& format) {
    int32_t delay = 0, rate = 0;
    if (!format.findInt32(kKeyEncoderDelay, &delay) || delay < 0 || delay > kMaxEncoderDelay ||
        !format.findInt32(kKeySampleRate, &rate) || rate <= 0) {
        return 0;
    }
    return int64_t(delay) * 1000000 / rate;
}

// The audio/raw format of the decoded stream.
sp<MetaData> PcmFormat(const MetaData& track, int32_t rate, int32_t channels) {
    sp<MetaData> format = new MetaData;
    format->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
    format->setInt32(kKeySampleRate, rate);
    format->setInt32(kKeyChannelCount, channels);
    format->setInt32(kKeyPcmEncoding, kAudioEncodingPcm16bit);
    format->setInt32(kKeyBitsPerSample, 16);
    int64_t durationUs;
    if (track.findInt64(kKeyDuration, &durationUs)) format->setInt64(kKeyDuration, durationUs);
    int32_t id;
    if (track.findInt32(kKeyTrackID, &id)) format->setInt32(kKeyTrackID, id);
    return format;
}

}  // namespace

bool AudioDecoderSource::CanDecode(const char* mime) { return AudioCodecForMime(mime) != AudioCodec::kNone; }

sp<AudioDecoderSource> AudioDecoderSource::Create(const sp<IMediaSource>& track) {
    if (track == nullptr) return nullptr;
    const sp<MetaData> format = track->getFormat();
    if (format == nullptr) return nullptr;
    sp<AudioDecoderSource> source = new (std::nothrow) AudioDecoderSource(track, format);
    if (source == nullptr || source->mDecoder == nullptr) return nullptr;
    return source;
}

AudioDecoderSource::AudioDecoderSource(const sp<IMediaSource>& track, const sp<MetaData>& trackFormat)
    : mTrack(track),
      mTrackFormat(trackFormat),
      mDecoder(AudioDecoder::Create(*trackFormat)),
      mStarted(false),
      mDelayUs(EncoderDelayUs(*trackFormat)),
      mStartUs(0),
      mLastFrames(0),
      mPending(nullptr) {
    int32_t rate = 0, channels = 0;
    trackFormat->findInt32(kKeySampleRate, &rate);
    trackFormat->findInt32(kKeyChannelCount, &channels);
    mFormat = PcmFormat(*trackFormat, rate, channels);
}

AudioDecoderSource::~AudioDecoderSource() {
    if (mStarted) stop();
}

status_t AudioDecoderSource::start(MetaData* params) {
    if (mStarted) return INVALID_OPERATION;
    status_t err = mTrack->start(params);
    if (err != OK) return err;
    mStarted = true;
    mStartUs = 0;
    mLastFrames = 0;
    err = decodeNext(nullptr);
    if (err != OK && err != ERROR_END_OF_STREAM) {
        stop();
        return err;
    }
    if (mDecoder->channelCount() > 0) {
        mFormat = PcmFormat(*mTrackFormat, mDecoder->sampleRate(), mDecoder->channelCount());
    }
    return OK;
}

status_t AudioDecoderSource::stop() {
    if (!mStarted) return INVALID_OPERATION;
    if (mPending != nullptr) mPending->release();
    mPending = nullptr;
    mDecoder->flush();
    mStarted = false;
    return mTrack->stop();
}

sp<MetaData> AudioDecoderSource::getFormat() { return new MetaData(*mFormat); }

status_t AudioDecoderSource::read(MediaBufferBase** buffer, const ReadOptions* options) {
    *buffer = nullptr;
    if (!mStarted) return INVALID_OPERATION;
    int64_t seekUs;
    ReadOptions::SeekMode mode;
    ReadOptions preroll;
    if (options != nullptr && options->getSeekTo(&seekUs, &mode)) {
        if (mPending != nullptr) mPending->release();
        mPending = nullptr;
        // A new decoder rather than a flushed one: flushing leaves some of
        // the codecs' state (AMR's predictors) behind.
        std::unique_ptr<AudioDecoder> fresh = AudioDecoder::Create(*mTrackFormat);
        if (fresh == nullptr) return NO_MEMORY;
        mDecoder = std::move(fresh);
        mLastFrames = 0;
        mStartUs = std::max<int64_t>(seekUs, 0);
        if (mStartUs + mDelayUs < kSeekPrerollUs) {
            // A track's seek lands on its first presented sample at best;
            // starting it over brings back the priming before it.
            mTrack->stop();
            const status_t err = mTrack->start();
            if (err != OK) return err;
            options = nullptr;
        } else {
            // Every compressed audio sample is a sync sample: decode from a
            // little before and drop what precedes the time.
            preroll.setSeekTo(mStartUs + mDelayUs - kSeekPrerollUs, ReadOptions::SEEK_PREVIOUS_SYNC);
            options = &preroll;
        }
    } else {
        options = nullptr;
    }
    if (mPending == nullptr) {
        const status_t err = decodeNext(options);
        if (err != OK) return err;
    }
    *buffer = mPending;
    mPending = nullptr;
    return OK;
}

status_t AudioDecoderSource::decodeNext(const ReadOptions* options) {
    std::vector<int16_t> pcm;
    int64_t nextUs = 0;
    for (;;) {
        MediaBufferBase* in = nullptr;
        status_t err = mTrack->read(&in, options);
        options = nullptr;
        if (err != OK) return err;
        int64_t timeUs = nextUs;
        in->meta_data().findInt64(kKeyTime, &timeUs);
        int32_t valid = -1;
        in->meta_data().findInt32(kKeyValidSamples, &valid);
        pcm.clear();
        err = mDecoder->decode(static_cast<const uint8_t*>(in->data()) + in->range_offset(), in->range_length(),
                               &pcm);
        in->release();
        const size_t channels = mDecoder->channelCount();
        if (channels == 0) continue;  // no audio yet (a Vorbis stream's first packet)
        size_t frames = pcm.size() / channels;
        if (err == ERROR_MALFORMED) {
            ALOGW("cannot decode the audio sample at %lld us: %zu frames of silence instead", (long long)timeUs,
                  mLastFrames);
            frames = mLastFrames;
            pcm.assign(frames * channels, 0);
        } else if (err != OK) {
            return err;
        } else if (frames > 0) {
            mLastFrames = frames;
        }
        // The end of a stream may decode to more than it presents.
        if (valid >= 0 && size_t(valid) < frames) frames = valid;

        const int64_t rate = mDecoder->sampleRate();
        nextUs = timeUs + static_cast<int64_t>(frames) * 1000000 / rate;
        // The stated priming comes before the presentation's 0.
        const int64_t presentedUs = timeUs - mDelayUs;
        size_t drop = 0;
        if (presentedUs < mStartUs) {
            drop = std::min(frames, static_cast<size_t>(((mStartUs - presentedUs) * rate + 500000) / 1000000));
        }
        if (drop == frames) continue;
        // What is left of a sample that began before the start is at the start.
        const int64_t outUs = std::max(presentedUs, mStartUs);

        const size_t bytes = (frames - drop) * channels * sizeof(int16_t);
        MediaBuffer* out = new (std::nothrow) MediaBuffer(bytes);
        if (out == nullptr || out->data() == nullptr) {
            if (out != nullptr) out->release();
            return NO_MEMORY;
        }
        out->add_ref();
        memcpy(out->data(), pcm.data() + drop * channels, bytes);
        out->meta_data().setInt64(kKeyTime, outUs);
        out->meta_data().setInt32(kKeyIsSyncFrame, 1);
        mPending = out;
        return OK;
    }
}

}  // namespace android
