#define LOG_TAG "QNAudioFormatConverter"

#include <effectchain/QNAudioFormatConverter.h>

#include <algorithm>
#include <cstdlib>
#include <new>

#include <log/log.h>
#include <soxr.h>

#include "audio/PcmSamples.h"

namespace {

constexpr int kMaxChannels = 8;
constexpr int kMaxSampleRate = 768000;
// Output allowance per call beyond the exact ratio, so held-back audio drains.
constexpr int64_t kSlackFrames = 64;

bool validDescription(int format, int rate, int channels) {
    return qnaudio::bytesPerSample(format) > 0 && rate > 0 && rate <= kMaxSampleRate && channels >= 1 &&
           channels <= kMaxChannels;
}

unsigned long soxrRecipe(int quality) {
    switch (quality) {
        case QNAFC_QUALITY_VERY_HIGH: return SOXR_VHQ;
        case QNAFC_QUALITY_QUICK: return SOXR_QQ;
        default: return SOXR_HQ;
    }
}

}  // namespace

QNAudioFormatConverter::QNAudioFormatConverter()
    : mInitialised(false), mQuality(QNAFC_QUALITY_HIGH), mResampler(nullptr), mResamplerReady(false), mFlushed(false), mPendingStart(0) {}

QNAudioFormatConverter::~QNAudioFormatConverter() {
    ALOGV("~QNAudioFormatConverter");
    releaseResampler();
}

int QNAudioFormatConverter::getVersionAFC() const { return 1; }

int QNAudioFormatConverter::initAFC(int format, int sampleRate, int quality, int channels) {
    ALOGV("initAFC format=%d rate=%d quality=%d channels=%d", format, sampleRate, quality, channels);
    releaseResampler();
    mPending.clear();
    mPendingStart = 0;
    if (!validDescription(format, sampleRate, channels)) {
        mInitialised = false;
        return kBadValue;
    }
    mIn = {format, sampleRate, channels};
    mOut = mIn;
    mQuality = quality;
    mInitialised = true;
    return 0;
}

int QNAudioFormatConverter::setParamAFC(const QNAFCParam* param) {
    if (param == nullptr) return kBadValue;
    ALOGV("setParamAFC kind=%d format=%d rate=%d channels=%d", param->kind, param->format, param->sampleRate,
          param->channels);
    if (!mInitialised) return kInvalidOperation;
    switch (param->kind) {
        case QNAFC_PARAM_CHANNELS:
            if (!qnaudio::canRemap(mIn.channels, param->channels) || param->channels > kMaxChannels) return kBadValue;
            mOut.channels = param->channels;
            break;
        case QNAFC_PARAM_SAMPLE_RATE:
            if (param->sampleRate <= 0 || param->sampleRate > kMaxSampleRate) return kBadValue;
            mOut.sampleRate = param->sampleRate;
            break;
        case QNAFC_PARAM_FORMAT:
            if (qnaudio::bytesPerSample(param->format) == 0) return kBadValue;
            mOut.format = param->format;
            break;
        default:
            return kBadValue;
    }
    // The resampler follows the output rate and channel count: build it anew.
    releaseResampler();
    mPending.clear();
    mPendingStart = 0;
    return 0;
}

int QNAudioFormatConverter::deinitAFC() {
    ALOGV("deinitAFC");
    releaseResampler();
    mPending.clear();
    mPending.shrink_to_fit();
    mWork.clear();
    mWork.shrink_to_fit();
    mPendingStart = 0;
    mInitialised = false;
    return 0;
}

int QNAudioFormatConverter::inputFrameBytes() const {
    return mInitialised ? qnaudio::bytesPerSample(mIn.format) * mIn.channels : 0;
}

int QNAudioFormatConverter::outputFrameBytes() const {
    return mInitialised ? qnaudio::bytesPerSample(mOut.format) * mOut.channels : 0;
}

int64_t QNAudioFormatConverter::maxOutputFrames(int64_t inFrames) const {
    if (mIn.sampleRate == mOut.sampleRate) return inFrames + kSlackFrames;
    return (inFrames * mOut.sampleRate + mIn.sampleRate - 1) / mIn.sampleRate + kSlackFrames;
}

int64_t QNAudioFormatConverter::maxOutputBytes(int size) const {
    if (!mInitialised || size < 0) return -1;
    return maxOutputFrames(size / inputFrameBytes()) * outputFrameBytes();
}

unsigned char* QNAudioFormatConverter::allocateBuffAFC(unsigned char* buffer, int size, float margin) {
    const int64_t need = maxOutputBytes(size);
    if (need < 0) return nullptr;
    const double factor = margin > 1.0f ? margin : 1.0;
    const double bytes = static_cast<double>(need) * factor;
    if (bytes > static_cast<double>(INT32_MAX)) return nullptr;
    return static_cast<unsigned char*>(realloc(buffer, static_cast<size_t>(bytes) + 1));
}

bool QNAudioFormatConverter::prepareResampler() {
    if (mResamplerReady) return true;
    soxr_error_t error = nullptr;
    const soxr_io_spec_t io = soxr_io_spec(SOXR_INT32_I, SOXR_INT32_I);
    const soxr_quality_spec_t quality = soxr_quality_spec(soxrRecipe(mQuality), 0);
    soxr_t s = soxr_create(mIn.sampleRate, mOut.sampleRate, mOut.channels, &error, &io, &quality, nullptr);
    if (error != nullptr || s == nullptr) {
        ALOGE("resampler not created: %s", error ? error : "?");
        return false;
    }
    mResampler = s;
    mResamplerReady = true;
    return true;
}

void QNAudioFormatConverter::releaseResampler() {
    if (mResampler != nullptr) soxr_delete(static_cast<soxr_t>(mResampler));
    mResampler = nullptr;
    mResamplerReady = false;
    mFlushed = false;
}

int64_t QNAudioFormatConverter::emitPending(unsigned char* out, int64_t maxFrames) {
    const size_t channels = static_cast<size_t>(mOut.channels);
    const int64_t held = static_cast<int64_t>((mPending.size() - mPendingStart * channels) / channels);
    const int64_t n = std::min(held, maxFrames);
    qnaudio::encodeSamples(mPending.data() + mPendingStart * channels, mOut.format, static_cast<size_t>(n) * channels,
                           out);
    mPendingStart += static_cast<size_t>(n);
    if (mPendingStart * channels == mPending.size()) {
        mPending.clear();
        mPendingStart = 0;
    }
    return n * outputFrameBytes();
}

int QNAudioFormatConverter::processAFC(unsigned char* in, unsigned char* out, int size) {
    if (!mInitialised) return kInvalidOperation;
    if (size < 0 || out == nullptr) return kBadValue;
    const bool flush = in == nullptr || size == 0;
    const int64_t inFrames = flush ? 0 : size / inputFrameBytes();
    const int64_t allowance = maxOutputFrames(inFrames);
    const bool resample = mIn.sampleRate != mOut.sampleRate;

    try {
        const size_t workSamples = static_cast<size_t>(inFrames) * std::max(mIn.channels, mOut.channels);
        if (mWork.size() < workSamples) mWork.resize(workSamples);
        if (inFrames > 0) {
            qnaudio::decodeSamples(in, mIn.format, static_cast<size_t>(inFrames) * mIn.channels, mWork.data());
            qnaudio::remapChannels(mWork.data(), mIn.channels, mWork.data(), mOut.channels,
                                   static_cast<size_t>(inFrames));
        }
        if (!resample) {
            // Nothing is held back: the frames go straight out.
            if (!mPending.empty()) return static_cast<int>(emitPending(out, allowance));
            qnaudio::encodeSamples(mWork.data(), mOut.format, static_cast<size_t>(inFrames) * mOut.channels, out);
            return static_cast<int>(inFrames * outputFrameBytes());
        }
        if (!prepareResampler()) return kNoMemory;
        soxr_t s = static_cast<soxr_t>(mResampler);
        if (mFlushed && !flush) soxr_clear(s);  // a new stream after the end of the last
        mFlushed = flush;
        const size_t channels = static_cast<size_t>(mOut.channels);
        const int32_t* src = mWork.data();
        size_t left = static_cast<size_t>(inFrames);
        // Run the resampler until it has taken all the input (or all it holds, when flushing).
        for (int guard = 0; guard < 1 << 20; ++guard) {
            const size_t room = static_cast<size_t>(allowance) + 256;
            const size_t base = mPending.size();
            mPending.resize(base + room * channels);
            size_t used = 0, made = 0;
            soxr_error_t error = soxr_process(s, flush ? nullptr : src, left, &used, mPending.data() + base, room, &made);
            mPending.resize(base + made * channels);
            if (error != nullptr) {
                ALOGE("resampler failed: %s", error);
                return kBadValue;
            }
            src += used * channels;
            left -= used;
            if (flush ? made < room : (left == 0)) break;
            if (used == 0 && made == 0) break;
        }
        return static_cast<int>(emitPending(out, allowance));
    } catch (const std::bad_alloc&) {
        return kNoMemory;
    }
}
