#ifndef QN_EFFECT_CHAIN_MANAGER_H
#define QN_EFFECT_CHAIN_MANAGER_H

#include <cstdint>
#include <memory>
#include <vector>

class QNAudioFormatConverter;

// The device's effect chain, built here as a two-input mixer: the main audio
// passes through processEffectChain, and the aux audio, written ahead with
// writeAux, is mixed into it.
//
// Stream descriptions (setParamAudioInfo for the main audio, setParamAuxInfo for
// the aux): sample format (1 unsigned 8-bit, 2 signed 16-bit, 3 signed 24-bit
// packed, 4 signed 32-bit), sample rate in Hz, layout (1 interleaved, the only
// one), channel count. The aux audio is brought to the main audio's rate and
// channel count as it is written, and waits in a bounded ring buffer.

// Speed of the chain; only normal speed is supported.
enum KVU_EFFECTCHAIN_SPEED_RATE {
    KVU_EFFECTCHAIN_SPEED_RATE_NORMAL = 0,
};

// Chain types of setParamChainType.
enum {
    KVU_EFFECTCHAIN_TYPE_MIXER = 3,
};

// Status of writeAux when the ring buffer has no room for the whole write.
enum {
    KVU_EFFECTCHAIN_RING_FULL = -3,
};

// Mixer types; every gain is applied first, then the output gain, then the
// result saturates at the limits of the main format.
enum KVUMixerType {
    KVU_MIXER_MAIN_ONLY = 0,     // the main audio; the aux is consumed and dropped
    KVU_MIXER_AUX_ONLY = 1,      // the aux audio; silence where none is buffered
    KVU_MIXER_AVERAGE = 2,       // half the sum, which cannot clip at 0 dB
    KVU_MIXER_AUX_OVER_MAIN = 3, // the aux where it is buffered, else the main
    KVU_MIXER_SUM = 4,           // main plus aux: the default mix
    KVU_MIXER_DUCK = 5,          // main lowered by 12 dB while aux is buffered, plus aux
};

// Parameter block of chain type 3 (six native-endian 32-bit fields).
struct KVUMixerChainParam {
    int32_t auxInputs;   // number of aux inputs: 1
    int32_t mainGainDb;  // -60 .. 60
    int32_t auxGainDb;   // -60 .. 60
    int32_t outGainDb;   // -60 .. 60
    int32_t ringBlocks;  // ring buffer capacity in blocks of 1024 main-rate frames (1 .. 1024)
    int32_t mixerType;   // KVUMixerType
};

class QNEffectChainManager {
public:
    enum {
        kBadValue = -22,
        kInvalidOperation = -38,
        kNoMemory = -12,
    };

    QNEffectChainManager();
    ~QNEffectChainManager();

    // Drops the configuration and the buffered aux audio.
    int deinit();

    int setParamAudioInfo(int format, int sampleRate, int layout, int channels);
    int setParamAuxInfo(int format, int sampleRate, int layout, int channels);
    // Chain type 3 with a KVUMixerChainParam; the block is copied.
    int setParamChainType(int chainType, void* param);

    // Buffers the whole frames of `size` aux bytes and answers `size`. When they
    // do not fit: KVU_EFFECTCHAIN_RING_FULL and nothing is taken, or, with
    // `overwrite`, the oldest buffered aux audio is dropped to make room. A write
    // larger than the whole ring is refused with kBadValue.
    int writeAux(unsigned char* buffer, int size, bool overwrite);
    // Mixes `size` bytes of main audio with the buffered aux into `out` (the same
    // size, main format; `out` may be `in`) and answers the bytes written.
    int processEffectChain(void* in, void* out, int size);
    // Grows `buffer` (null for a new one) with realloc to hold the output of
    // `blocks` calls of `bytes` main bytes each (blocks below 1 count as 1); the
    // caller frees it with free(). Null on a bad argument or without memory.
    unsigned char* allocateBuff(unsigned char* buffer, int bytes, int blocks, KVU_EFFECTCHAIN_SPEED_RATE speed);

    // Frames of aux audio waiting in the ring.
    int64_t bufferedAuxFrames() const;

private:
    struct Stream {
        int format = 0;
        int sampleRate = 0;
        int channels = 0;
        bool set = false;
    };

    bool ready() const;
    int setStream(Stream* stream, int format, int sampleRate, int layout, int channels);
    int prepareAux();
    void dropOldest(int64_t frames);
    // Copies up to `frames` buffered frames to `dst` and answers how many.
    int64_t takeAux(int32_t* dst, int64_t frames);

    Stream mMain;
    Stream mAux;
    KVUMixerChainParam mChain;
    bool mChainSet;
    std::unique_ptr<QNAudioFormatConverter> mAuxConverter;
    bool mAuxReady;
    std::vector<int32_t> mRing;  // interleaved main-format frames as 32-bit samples
    int64_t mRingFrames;         // capacity
    int64_t mRingRead;           // frame index of the oldest buffered frame
    int64_t mRingCount;          // frames buffered
    std::vector<unsigned char> mAuxScratch;
    std::vector<int32_t> mMainScratch;
    std::vector<int32_t> mAuxMix;

    QNEffectChainManager(const QNEffectChainManager&) = delete;
    QNEffectChainManager& operator=(const QNEffectChainManager&) = delete;
};

#endif
