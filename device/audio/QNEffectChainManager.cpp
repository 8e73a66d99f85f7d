#define LOG_TAG "QNEffectChainManager"

#include <effectchain/QNEffectChainManager.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <new>

#include <effectchain/QNAudioFormatConverter.h>
#include <log/log.h>

#include "audio/PcmSamples.h"

namespace {

constexpr int kLayoutInterleaved = 1;
constexpr int64_t kRingBlockFrames = 1024;
constexpr int kMaxRingBlocks = 1024;
constexpr int kMaxGainDb = 60;
constexpr double kDuckGain = 0.25118864315095801;  // -12 dB
constexpr double kFullScale = 2147483648.0;

double dbToGain(int db) {
    db = std::max(-kMaxGainDb, std::min(kMaxGainDb, db));
    return std::pow(10.0, db / 20.0);
}

}  // namespace

QNEffectChainManager::QNEffectChainManager()
    : mChain{}, mChainSet(false), mAuxReady(false), mRingFrames(0), mRingRead(0), mRingCount(0) {}

QNEffectChainManager::~QNEffectChainManager() { ALOGV("~QNEffectChainManager"); }

int QNEffectChainManager::deinit() {
    ALOGV("deinit");
    mMain = Stream();
    mAux = Stream();
    mChain = KVUMixerChainParam{};
    mChainSet = false;
    mAuxConverter.reset();
    mAuxReady = false;
    mRing.clear();
    mRing.shrink_to_fit();
    mRingFrames = mRingRead = mRingCount = 0;
    return 0;
}

int QNEffectChainManager::setStream(Stream* stream, int format, int sampleRate, int layout, int channels) {
    if (qnaudio::bytesPerSample(format) == 0 || sampleRate <= 0 || layout != kLayoutInterleaved || channels < 1 ||
        channels > 8) {
        return kBadValue;
    }
    *stream = Stream{format, sampleRate, channels, true};
    mAuxReady = false;  // the aux path and the ring follow both formats
    return 0;
}

int QNEffectChainManager::setParamAudioInfo(int format, int sampleRate, int layout, int channels) {
    ALOGV("setParamAudioInfo format=%d rate=%d layout=%d channels=%d", format, sampleRate, layout, channels);
    return setStream(&mMain, format, sampleRate, layout, channels);
}

int QNEffectChainManager::setParamAuxInfo(int format, int sampleRate, int layout, int channels) {
    ALOGV("setParamAuxInfo format=%d rate=%d layout=%d channels=%d", format, sampleRate, layout, channels);
    return setStream(&mAux, format, sampleRate, layout, channels);
}

int QNEffectChainManager::setParamChainType(int chainType, void* param) {
    if (param == nullptr) return kBadValue;
    KVUMixerChainParam p;
    memcpy(&p, param, sizeof(p));
    ALOGV("setParamChainType type=%d aux=%d gains=%d,%d,%d ring=%d mixer=%d", chainType, p.auxInputs, p.mainGainDb,
          p.auxGainDb, p.outGainDb, p.ringBlocks, p.mixerType);
    if (chainType != KVU_EFFECTCHAIN_TYPE_MIXER || p.auxInputs != 1 || p.ringBlocks < 1 ||
        p.ringBlocks > kMaxRingBlocks || p.mixerType < KVU_MIXER_MAIN_ONLY || p.mixerType > KVU_MIXER_DUCK) {
        return kBadValue;
    }
    if (!mChainSet || p.ringBlocks != mChain.ringBlocks) mAuxReady = false;
    mChain = p;
    mChainSet = true;
    return 0;
}

bool QNEffectChainManager::ready() const { return mMain.set && mAux.set && mChainSet; }

int QNEffectChainManager::prepareAux() {
    if (!ready()) return kInvalidOperation;
    if (mAuxReady) return 0;
    std::unique_ptr<QNAudioFormatConverter> conv(new (std::nothrow) QNAudioFormatConverter);
    if (!conv) return kNoMemory;
    int err = conv->initAFC(mAux.format, mAux.sampleRate, QNAFC_QUALITY_HIGH, mAux.channels);
    QNAFCParam param{};
    param.format = qnaudio::kFormatS32;
    param.sampleRate = mMain.sampleRate;
    param.channels = mMain.channels;
    for (int kind : {QNAFC_PARAM_CHANNELS, QNAFC_PARAM_SAMPLE_RATE, QNAFC_PARAM_FORMAT}) {
        param.kind = kind;
        if (err == 0) err = conv->setParamAFC(&param);
    }
    if (err != 0) return err;  // e.g. aux of 3 channels into stereo
    try {
        mRingFrames = int64_t{mChain.ringBlocks} * kRingBlockFrames;
        mRing.assign(static_cast<size_t>(mRingFrames * mMain.channels), 0);
    } catch (const std::bad_alloc&) {
        mRingFrames = 0;
        return kNoMemory;
    }
    mRingRead = mRingCount = 0;
    mAuxConverter = std::move(conv);
    mAuxReady = true;
    return 0;
}

int64_t QNEffectChainManager::bufferedAuxFrames() const { return mAuxReady ? mRingCount : 0; }

void QNEffectChainManager::dropOldest(int64_t frames) {
    frames = std::min(frames, mRingCount);
    mRingRead = (mRingRead + frames) % mRingFrames;
    mRingCount -= frames;
}

int64_t QNEffectChainManager::takeAux(int32_t* dst, int64_t frames) {
    const int64_t n = std::min(frames, mRingCount);
    const size_t ch = static_cast<size_t>(mMain.channels);
    const int64_t first = std::min(n, mRingFrames - mRingRead);
    memcpy(dst, mRing.data() + mRingRead * ch, static_cast<size_t>(first) * ch * sizeof(int32_t));
    memcpy(dst + first * ch, mRing.data(), static_cast<size_t>(n - first) * ch * sizeof(int32_t));
    dropOldest(n);
    return n;
}

int QNEffectChainManager::writeAux(unsigned char* buffer, int size, bool overwrite) {
    const int err = prepareAux();
    if (err != 0) return err;
    if (buffer == nullptr || size < 0) return kBadValue;
    if (size == 0) return 0;
    const size_t ch = static_cast<size_t>(mMain.channels);
    const int64_t maxBytes = mAuxConverter->maxOutputBytes(size);
    const int64_t worst = maxBytes / static_cast<int64_t>(ch * sizeof(int32_t));
    if (worst > mRingFrames) return kBadValue;
    const int64_t room = mRingFrames - mRingCount;
    if (worst > room) {
        if (!overwrite) return KVU_EFFECTCHAIN_RING_FULL;
        dropOldest(worst - room);
    }
    try {
        if (mAuxScratch.size() < static_cast<size_t>(maxBytes)) mAuxScratch.resize(static_cast<size_t>(maxBytes));
    } catch (const std::bad_alloc&) {
        return kNoMemory;
    }
    const int made = mAuxConverter->processAFC(buffer, mAuxScratch.data(), size);
    if (made < 0) return made;
    const int64_t frames = made / static_cast<int64_t>(ch * sizeof(int32_t));
    int64_t write = (mRingRead + mRingCount) % mRingFrames;
    const int64_t first = std::min(frames, mRingFrames - write);
    memcpy(mRing.data() + write * ch, mAuxScratch.data(), static_cast<size_t>(first) * ch * sizeof(int32_t));
    memcpy(mRing.data(), mAuxScratch.data() + first * ch * sizeof(int32_t),
           static_cast<size_t>(frames - first) * ch * sizeof(int32_t));
    mRingCount += frames;
    return size;
}

int QNEffectChainManager::processEffectChain(void* in, void* out, int size) {
    const int err = prepareAux();
    if (err != 0) return err;
    if (in == nullptr || out == nullptr || size < 0) return kBadValue;
    const size_t ch = static_cast<size_t>(mMain.channels);
    const int frameBytes = qnaudio::bytesPerSample(mMain.format) * mMain.channels;
    const int64_t frames = size / frameBytes;
    const size_t samples = static_cast<size_t>(frames) * ch;
    try {
        if (mMainScratch.size() < samples) mMainScratch.resize(samples);
        if (mAuxMix.size() < samples) mAuxMix.resize(samples);
    } catch (const std::bad_alloc&) {
        return kNoMemory;
    }
    qnaudio::decodeSamples(static_cast<const uint8_t*>(in), mMain.format, samples, mMainScratch.data());
    const size_t withAux = static_cast<size_t>(takeAux(mAuxMix.data(), frames)) * ch;
    std::fill(mAuxMix.begin() + withAux, mAuxMix.begin() + samples, 0);

    const double gMain = dbToGain(mChain.mainGainDb) / kFullScale;
    const double gAux = dbToGain(mChain.auxGainDb) / kFullScale;
    const double gOut = dbToGain(mChain.outGainDb);
    int32_t* m = mMainScratch.data();
    const int32_t* a = mAuxMix.data();
    for (size_t i = 0; i < samples; ++i) {
        const bool hasAux = i < withAux;
        double v;
        switch (mChain.mixerType) {
            case KVU_MIXER_MAIN_ONLY: v = m[i] * gMain; break;
            case KVU_MIXER_AUX_ONLY: v = a[i] * gAux; break;
            case KVU_MIXER_AVERAGE: v = (m[i] * gMain + a[i] * gAux) * 0.5; break;
            case KVU_MIXER_AUX_OVER_MAIN: v = hasAux ? a[i] * gAux : m[i] * gMain; break;
            case KVU_MIXER_DUCK: v = m[i] * gMain * (hasAux ? kDuckGain : 1.0) + a[i] * gAux; break;
            default: v = m[i] * gMain + a[i] * gAux; break;
        }
        m[i] = qnaudio::saturateToS32(v * gOut);
    }
    qnaudio::encodeSamples(m, mMain.format, samples, static_cast<uint8_t*>(out));
    return static_cast<int>(frames * frameBytes);
}

unsigned char* QNEffectChainManager::allocateBuff(unsigned char* buffer, int bytes, int blocks,
                                                  KVU_EFFECTCHAIN_SPEED_RATE speed) {
    if (bytes <= 0 || speed != KVU_EFFECTCHAIN_SPEED_RATE_NORMAL) return nullptr;
    const int64_t total = int64_t{bytes} * std::max(1, blocks);
    if (total > INT32_MAX) return nullptr;
    return static_cast<unsigned char*>(realloc(buffer, static_cast<size_t>(total)));
}
