#define LOG_TAG "QNMediaAudioEffect"

#include "QNMediaAudioEffect.h"

#include <cstdlib>
#include <new>

#include <log/log.h>

#include "QNMediaAudioConverter.h"

namespace android {
namespace qnmediaeditor {

int32_t QNMediaAudioEffect::kRingBufferNokFull = -3;

namespace {
constexpr int kMaxGain = 60;
constexpr int kDefaultMixerType = 4;
constexpr int kMixerChainType = 3;
constexpr int kInterleaved = 1;
}  // namespace

QNMediaAudioEffect::QNMediaAudioEffect() : mMixECM(new (std::nothrow) QNEffectChainManager) {}

QNMediaAudioEffect::~QNMediaAudioEffect() {
    if (mMixECM != nullptr) {
        mMixECM->deinit();
        delete mMixECM;
        mMixECM = nullptr;
    }
}

bool QNMediaAudioEffect::isValid() { return mMixECM != nullptr; }

int QNMediaAudioEffect::getAudioFormat(int bitsPerSample) { return audioFormatCodeOf(bitsPerSample); }

void QNMediaAudioEffect::setParamAudioInfo(int bitsPerSample, int value2, int value3) {
    if (mMixECM == nullptr) {
        ALOGD("setParamAudioInfo mMixECM is null");
        return;
    }
    mMixECM->setParamAudioInfo(getAudioFormat(bitsPerSample), value2, kInterleaved, value3);
}

void QNMediaAudioEffect::setParamAuxInfo(int bitsPerSample, int value2, int value3) {
    if (mMixECM == nullptr) {
        ALOGD("setParamAuxInfo mMixECM is null");
        return;
    }
    mMixECM->setParamAuxInfo(getAudioFormat(bitsPerSample), value2, kInterleaved, value3);
}

int QNMediaAudioEffect::getMixerControlType(int type) {
    if (static_cast<unsigned>(type) < 6) return type;
    ALOGD("unsupported mixer type %d", type);
    return kDefaultMixerType;
}

int QNMediaAudioEffect::checkGainRange(int gain) {
    if (gain >= kMaxGain) return kMaxGain;
    if (gain <= -kMaxGain) return -kMaxGain;
    return gain;
}

void QNMediaAudioEffect::setParamChainType(int gain1, int gain2, int gain3, int mixerType) {
    if (mMixECM == nullptr) {
        ALOGD("setParamChainType mMixECM is null");
        return;
    }
    int32_t block[6] = {1, checkGainRange(gain1), checkGainRange(gain2), checkGainRange(gain3), 128,
                        getMixerControlType(mixerType)};
    mMixECM->setParamChainType(kMixerChainType, block);
}

int QNMediaAudioEffect::writeAux(unsigned char* buffer, int size) {
    if (mMixECM == nullptr) {
        ALOGD("writeAux mMixECM is null");
        return 0;
    }
    return mMixECM->writeAux(buffer, size, false);
}

int QNMediaAudioEffect::processEffectChain(unsigned char* in, unsigned char* out, int size) {
    if (mMixECM == nullptr) {
        ALOGD("processEffectChain mMixECM is null");
        return 0;
    }
    return mMixECM->processEffectChain(in, out, size);
}

unsigned char* QNMediaAudioEffect::allocateBuff(unsigned char* buffer, int value2, int value3) {
    if (mMixECM == nullptr) {
        ALOGD("allocateBuff mMixECM is null");
        return nullptr;
    }
    return mMixECM->allocateBuff(buffer, value2, value3, KVU_EFFECTCHAIN_SPEED_RATE_NORMAL);
}

void QNMediaAudioEffect::freeBuff(unsigned char* buffer) {
    if (buffer != nullptr) free(buffer);
}

}  // namespace qnmediaeditor
}  // namespace android
