#include "MixEngine.h"

#include <algorithm>

#include "Cli.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

Background::Background(PrefetchedPcm& bgm, const PcmLayout& main, int offsetMs, const std::string& path)
    : mBgm(bgm), mPath(path), mFrameBytes(main.frameBytes()) {
    const PcmLayout& from = bgm.layout();
    mConverter = new QNMediaAudioConverter();
    if (!mConverter->init(from.rate, from.channels, from.bits, main.rate, main.channels, main.bits)) {
        inputError(path + ": the background cannot be converted");
    }
    if (offsetMs > 0) {
        mSilenceBytes = static_cast<int64_t>(offsetMs) * main.rate / 1000 * static_cast<int64_t>(mFrameBytes);
    } else if (offsetMs < 0) {
        mSkipBytes = static_cast<int64_t>(-offsetMs * main.rate / 1000) * mFrameBytes;
    }
}

Background::~Background() {
    if (mOut != nullptr) mConverter->freeBuff(mOut);
}

std::vector<uint8_t> Background::take(size_t bytes) {
    // The silence before a late start is made as it is needed, not held.
    if (mSilenceBytes > 0) {
        const size_t n = static_cast<size_t>(std::min<int64_t>(mSilenceBytes, static_cast<int64_t>(bytes)));
        mSilenceBytes -= static_cast<int64_t>(n);
        return std::vector<uint8_t>(n / mFrameBytes * mFrameBytes, 0);
    }
    while (mPending.size() < bytes && !mDone) refill();
    const size_t n = std::min(bytes, mPending.size()) / mFrameBytes * mFrameBytes;
    std::vector<uint8_t> chunk(mPending.begin(), mPending.begin() + n);
    mPending.erase(mPending.begin(), mPending.begin() + n);
    return chunk;
}

void Background::append(const uint8_t* data, int size) {
    if (size <= 0) return;
    const int64_t skip = std::min<int64_t>(mSkipBytes, size);
    mSkipBytes -= skip;
    mPending.insert(mPending.end(), data + skip, data + size);
}

void Background::ensureOutput(int inputBytes) {
    if (inputBytes <= mOutCapacityFor) return;
    unsigned char* grown = mConverter->allocateBuff(mOut, inputBytes, 1.0f);
    if (grown == nullptr) inputError(mPath + ": out of memory");
    mOut = grown;
    mOutCapacityFor = inputBytes;
}

void Background::refill() {
    PcmChunk chunk;
    if (!mBgm.next(&chunk)) {
        // End of the background: drain what the resampler holds.
        ensureOutput(65536);
        for (int guard = 0; guard < 1 << 16; ++guard) {
            const int made = mConverter->process(nullptr, mOut, 0);
            if (made <= 0) break;
            append(mOut, made);
        }
        mDone = true;
        return;
    }
    if (chunk.bytes.empty()) return;
    const int size = static_cast<int>(chunk.bytes.size());
    ensureOutput(std::max<int>(size, 65536));
    const int made = mConverter->process(chunk.bytes.data(), mOut, size);
    if (made < 0) inputError(mPath + ": background conversion failed");
    append(mOut, made);
}

MixEngine::MixEngine(PrefetchedPcm& main, PrefetchedPcm& bgm, const MixSettings& s, const std::string& bgmPath)
    : mMain(main), mBackground(bgm, main.layout(), s.offsetMs, bgmPath), mEffect(new QNMediaAudioEffect()) {
    const PcmLayout& l = main.layout();
    mEffect->setParamAudioInfo(l.bits, l.rate, l.channels);
    mEffect->setParamAuxInfo(l.bits, l.rate, l.channels);
    mEffect->setParamChainType(s.mainGain, s.bgmGain, 0, s.mixer);
}

bool MixEngine::next(PcmChunk* chunk) {
    if (!mMain.next(chunk)) return false;
    std::vector<uint8_t> aux = mBackground.take(chunk->bytes.size());
    if (!aux.empty() && mEffect->writeAux(aux.data(), static_cast<int>(aux.size())) < 0) {
        inputError("the mixer could not take the background audio");
    }
    const int size = static_cast<int>(chunk->bytes.size());
    const int mixed = mEffect->processEffectChain(chunk->bytes.data(), chunk->bytes.data(), size);
    if (mixed < 0) inputError("the mixer failed");
    chunk->bytes.resize(std::min<size_t>(chunk->bytes.size(), static_cast<size_t>(mixed)));
    return true;
}

}  // namespace qnedit

