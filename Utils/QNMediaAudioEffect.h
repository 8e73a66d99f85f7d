#ifndef QN_MEDIA_AUDIO_EFFECT_H
#define QN_MEDIA_AUDIO_EFFECT_H

#include <cstdint>

#include <effectchain/QNEffectChainManager.h>
#include <utils/RefBase.h>

namespace android {
namespace qnmediaeditor {

// A reference-counted handle on the device's effect chain, used as a mixer of
// the main audio and an aux audio. value2 is a sample rate and value3 a
// channel count in the stream descriptions.
class QNMediaAudioEffect : public RefBase {
public:
    // writeAux's answer when the aux ring buffer is full.
    static int32_t kRingBufferNokFull;

    QNMediaAudioEffect();
    virtual ~QNMediaAudioEffect();

    bool isValid();
    int getAudioFormat(int bitsPerSample);
    void setParamAudioInfo(int bitsPerSample, int value2, int value3);
    void setParamAuxInfo(int bitsPerSample, int value2, int value3);
    int getMixerControlType(int type);
    int checkGainRange(int gain);
    // Gains in dB for the main, aux and output; mixer types 0 to 5.
    void setParamChainType(int gain1, int gain2, int gain3, int mixerType);
    int writeAux(unsigned char* buffer, int size);
    int processEffectChain(unsigned char* in, unsigned char* out, int size);
    unsigned char* allocateBuff(unsigned char* buffer, int value2, int value3);
    void freeBuff(unsigned char* buffer);

private:
    QNEffectChainManager* mMixECM;

    QNMediaAudioEffect(const QNMediaAudioEffect&) = delete;
    QNMediaAudioEffect& operator=(const QNMediaAudioEffect&) = delete;
};

}  // namespace qnmediaeditor
}  // namespace android

#endif
