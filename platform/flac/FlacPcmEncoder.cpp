#define LOG_TAG "FlacPcmEncoder"
#include "flac/FlacPcmEncoder.h"

#include <algorithm>
#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaErrors.h>

namespace android {

namespace {
// libFLAC's default trade-off between size and speed.
constexpr uint32_t kCompressionLevel = 5;
}  // namespace

FlacPcmEncoder::~FlacPcmEncoder() {
    if (mEncoder != nullptr) FLAC__stream_encoder_delete(mEncoder);
}

bool FlacPcmEncoder::supports(const PcmLayout& layout) {
    const bool sampleOk = layout.sample == PcmLayout::Sample::kUnsigned8 ||
                          layout.sample == PcmLayout::Sample::kSigned16 ||
                          layout.sample == PcmLayout::Sample::kSigned24Packed;
    return sampleOk && layout.channels >= 1 && layout.channels <= 8 && layout.sampleRate >= 1 &&
           static_cast<uint32_t>(layout.sampleRate) <= FLAC__MAX_SAMPLE_RATE;
}

status_t FlacPcmEncoder::init(const PcmLayout& layout, ByteSink* sink) {
    if (!supports(layout) || sink == nullptr) return ERROR_UNSUPPORTED;
    mLayout = layout;
    mSink = sink;
    mEncoder = FLAC__stream_encoder_new();
    if (mEncoder == nullptr) return NO_MEMORY;
    bool ok = FLAC__stream_encoder_set_channels(mEncoder, layout.channels) &&
              FLAC__stream_encoder_set_bits_per_sample(mEncoder, layout.bitsPerSample) &&
              FLAC__stream_encoder_set_sample_rate(mEncoder, layout.sampleRate) &&
              FLAC__stream_encoder_set_compression_level(mEncoder, kCompressionLevel) &&
              // Rates that a frame header cannot name are still valid FLAC.
              FLAC__stream_encoder_set_streamable_subset(mEncoder, false);
    if (!ok) return ERROR_UNSUPPORTED;
    const FLAC__StreamEncoderInitStatus status = FLAC__stream_encoder_init_stream(
        mEncoder, &FlacPcmEncoder::writeCallback, nullptr, nullptr, &FlacPcmEncoder::metadataCallback, this);
    if (status != FLAC__STREAM_ENCODER_INIT_STATUS_OK) {
        ALOGE("encoder init failed: %s", FLAC__StreamEncoderInitStatusString[status]);
        return ERROR_UNSUPPORTED;
    }
    return mWriteError;
}

FlacStreamInfo FlacPcmEncoder::initialInfo() const {
    FlacStreamInfo info;
    const uint32_t block = mEncoder ? FLAC__stream_encoder_get_blocksize(mEncoder) : 0;
    info.minBlockSize = info.maxBlockSize = block;
    info.sampleRate = static_cast<uint32_t>(mLayout.sampleRate);
    info.channels = static_cast<uint32_t>(mLayout.channels);
    info.bitsPerSample = static_cast<uint32_t>(mLayout.bitsPerSample);
    return info;
}

FLAC__StreamEncoderWriteStatus FlacPcmEncoder::writeCallback(const FLAC__StreamEncoder*, const FLAC__byte buffer[],
                                                             size_t bytes, uint32_t samples, uint32_t, void* client) {
    auto* self = static_cast<FlacPcmEncoder*>(client);
    // samples == 0: the encoder's own metadata, replaced by the caller's.
    if (samples == 0) return FLAC__STREAM_ENCODER_WRITE_STATUS_OK;
    const status_t err = self->mSink->write(buffer, bytes);
    if (err != OK) {
        if (self->mWriteError == OK) self->mWriteError = err;
        return FLAC__STREAM_ENCODER_WRITE_STATUS_FATAL_ERROR;
    }
    return FLAC__STREAM_ENCODER_WRITE_STATUS_OK;
}

void FlacPcmEncoder::metadataCallback(const FLAC__StreamEncoder*, const FLAC__StreamMetadata* metadata,
                                      void* client) {
    auto* self = static_cast<FlacPcmEncoder*>(client);
    if (metadata->type != FLAC__METADATA_TYPE_STREAMINFO) return;
    const FLAC__StreamMetadata_StreamInfo& s = metadata->data.stream_info;
    FlacStreamInfo& f = self->mFinal;
    f.minBlockSize = s.min_blocksize;
    f.maxBlockSize = s.max_blocksize;
    f.minFrameSize = s.min_framesize;
    f.maxFrameSize = s.max_framesize;
    f.sampleRate = s.sample_rate;
    f.channels = s.channels;
    f.bitsPerSample = s.bits_per_sample;
    f.totalSamples = s.total_samples;
    memcpy(f.md5, s.md5sum, sizeof(f.md5));
    self->mHaveFinal = true;
}

void FlacPcmEncoder::convert(const uint8_t* p, size_t frames) {
    const size_t count = frames * static_cast<size_t>(mLayout.channels);
    mSamples.resize(count);
    int32_t* out = mSamples.data();
    switch (mLayout.sample) {
        case PcmLayout::Sample::kUnsigned8:
            for (size_t i = 0; i < count; ++i) out[i] = int32_t(p[i]) - 128;
            break;
        case PcmLayout::Sample::kSigned16:
            for (size_t i = 0; i < count; ++i) out[i] = int16_t(uint16_t(p[2 * i] | (p[2 * i + 1] << 8)));
            break;
        default:  // 24-bit packed, sign taken from the top byte
            for (size_t i = 0; i < count; ++i) {
                const uint32_t v = uint32_t(p[3 * i]) | (uint32_t(p[3 * i + 1]) << 8) | (uint32_t(p[3 * i + 2]) << 16);
                out[i] = int32_t(v << 8) >> 8;
            }
            break;
    }
}

status_t FlacPcmEncoder::encode(const uint8_t* data, size_t size) {
    if (mEncoder == nullptr) return NO_INIT;
    const size_t frameBytes = mLayout.frameBytes();
    auto run = [this](const uint8_t* p, size_t frames) -> status_t {
        if (frames == 0) return OK;
        convert(p, frames);
        if (!FLAC__stream_encoder_process_interleaved(mEncoder, mSamples.data(), static_cast<uint32_t>(frames))) {
            ALOGE("encoding failed: %s", FLAC__stream_encoder_get_resolved_state_string(mEncoder));
            return mWriteError != OK ? mWriteError : UNKNOWN_ERROR;
        }
        return OK;
    };
    if (!mCarry.empty()) {
        const size_t take = std::min(frameBytes - mCarry.size(), size);
        mCarry.insert(mCarry.end(), data, data + take);
        data += take;
        size -= take;
        if (mCarry.size() < frameBytes) return OK;
        const status_t err = run(mCarry.data(), 1);
        mCarry.clear();
        if (err != OK) return err;
    }
    const size_t frames = size / frameBytes;
    const status_t err = run(data, frames);
    if (err != OK) return err;
    mCarry.assign(data + frames * frameBytes, data + size);
    return OK;
}

status_t FlacPcmEncoder::finish(FlacStreamInfo* info) {
    if (mEncoder == nullptr) return NO_INIT;
    if (!mCarry.empty()) {
        ALOGW("%zu bytes of an incomplete sample frame at the end were left out", mCarry.size());
        mCarry.clear();
    }
    const bool ok = FLAC__stream_encoder_finish(mEncoder);
    if (!ok || !mHaveFinal) {
        ALOGE("finishing the stream failed: %s", FLAC__stream_encoder_get_resolved_state_string(mEncoder));
        return mWriteError != OK ? mWriteError : UNKNOWN_ERROR;
    }
    *info = mFinal;
    return mWriteError;
}

}  // namespace android
