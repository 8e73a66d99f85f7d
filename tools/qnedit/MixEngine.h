#ifndef QNEDIT_MIX_ENGINE_H
#define QNEDIT_MIX_ENGINE_H

#include <cstdint>
#include <deque>
#include <vector>

#include "MixPrefetch.h"
#include "QNMediaAudioConverter.h"
#include "QNMediaAudioEffect.h"

namespace qnedit {

struct MixSettings {
    int mainGain = 0, bgmGain = 0, mixer = 4;
    int offsetMs = 0;
};

// Background audio converted to the main layout, handed out in the order it
// was read; the start offset is applied here.
class Background {
public:
    Background(PrefetchedPcm& bgm, const PcmLayout& main, int offsetMs, const std::string& path);
    ~Background();
    // Up to `bytes` bytes of converted background; fewer at its end.
    std::vector<uint8_t> take(size_t bytes);

private:
    void append(const uint8_t* data, int size);
    void ensureOutput(int inputBytes);
    void refill();

    PrefetchedPcm& mBgm;
    const std::string mPath;
    const size_t mFrameBytes;
    int64_t mSilenceBytes = 0;
    int64_t mSkipBytes = 0;
    android::sp<android::qnmediaeditor::QNMediaAudioConverter> mConverter;
    unsigned char* mOut = nullptr;
    int mOutCapacityFor = 0;
    std::deque<uint8_t> mPending;
    bool mDone = false;
};

// The main audio with the background mixed in, chunk by chunk, in the main
// audio's layout and with its times.
class MixEngine {
public:
    MixEngine(PrefetchedPcm& main, PrefetchedPcm& bgm, const MixSettings& settings, const std::string& bgmPath);
    // The next mixed chunk; false at the end of the main audio.
    bool next(PcmChunk* chunk);
    const PcmLayout& layout() const { return mMain.layout(); }

private:
    PrefetchedPcm& mMain;
    Background mBackground;
    android::sp<android::qnmediaeditor::QNMediaAudioEffect> mEffect;
};

}  // namespace qnedit

#endif
