#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <deque>
#include <vector>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "Cli.h"
#include "Commands.h"
#include "Input.h"
#include "MuxerOutput.h"
#include "OutputFile.h"
#include "Progress.h"
#include "Interrupt.h"
#include "ReadCoverage.h"
#include "QNMediaAudioConverter.h"
#include "QNMediaAudioEffect.h"
#include "QNMediaEditorAdapter.h"
#include "QNMediaMuxer.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

const char* const kMixHelp =
    "usage: qnedit mix MAIN BGM OUT [--main-gain DB] [--bgm-gain DB] [--mixer TYPE] [--offset MS]\n"
    "\n"
    "Mixes background audio (BGM) into the main recording. BGM is converted to\n"
    "MAIN's sample format, rate and channel count first. Both must be PCM (WAV\n"
    "or FLAC). OUT is WAV or FLAC, by its extension.\n"
    "  --main-gain DB  gain of the main audio, -60..60 (default 0)\n"
    "  --bgm-gain DB   gain of the background, -60..60 (default 0)\n"
    "  --mixer TYPE    0 main only, 1 background only, 2 average, 3 background\n"
    "                  over main, 4 sum (default), 5 main ducked under background\n"
    "  --offset MS     when the background starts, relative to the main audio;\n"
    "                  negative skips its beginning (default: the device setting)\n"
    "  --salvage       mix what can be read of a damaged input (with a warning)\n"
    "                  instead of failing\n";

namespace {

struct PcmTrack {
    size_t index = 0;
    int32_t channels = 0, sampleRate = 0, bits = 16;
    sp<AMessage> format;

    // How long `bytes` of this PCM last.
    int64_t durationUs(size_t bytes) const {
        return pcmDurationUs(bytes, channels * (bits / 8), sampleRate);
    }
};

PcmTrack findPcm(const Input& in) {
    for (size_t i = 0; i < in.trackCount(); ++i) {
        const sp<AMessage>& f = in.trackFormat(i);
        if (Input::mimeOf(f) != MEDIA_MIMETYPE_AUDIO_RAW) continue;
        PcmTrack t;
        t.index = i;
        t.format = f;
        f->findInt32("channel-count", &t.channels);
        f->findInt32("sample-rate", &t.sampleRate);
        f->findInt32("bits-per-sample", &t.bits);
        if (t.channels < 1 || t.channels > 2 || t.sampleRate <= 0 || (t.bits != 16 && t.bits != 24 && t.bits != 8)) {
            inputError(in.path() + ": PCM must be mono or stereo, 8, 16 or 24 bit");
        }
        return t;
    }
    inputError(in.path() + ": no PCM audio track (use WAV or FLAC)");
}

// Background audio converted to the main format, handed out in the order it
// was read; the start offset is applied here.
class Background {
public:
    Background(Input& in, const PcmTrack& bgm, const PcmTrack& main, int64_t offsetMs)
        : mIn(in), mBgm(bgm), mFrameBytes(main.channels * (main.bits / 8)) {
        mConverter = new QNMediaAudioConverter();
        if (!mConverter->init(bgm.sampleRate, bgm.channels, bgm.bits, main.sampleRate, main.channels, main.bits)) {
            inputError(in.path() + ": the background cannot be converted");
        }
        in.wrapper().selectTrack(bgm.index);
        if (offsetMs > 0) {
            mSilenceBytes = static_cast<int64_t>(offsetMs) * main.sampleRate / 1000 * static_cast<int64_t>(mFrameBytes);
        } else if (offsetMs < 0) {
            mSkipBytes = static_cast<int64_t>(-offsetMs * main.sampleRate / 1000) * mFrameBytes;
        }
    }
    ~Background() {
        if (mOut != nullptr) mConverter->freeBuff(mOut);
    }

    // Up to `bytes` bytes of converted background; fewer at its end.
    std::vector<uint8_t> take(size_t bytes) {
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

private:
    void append(const uint8_t* data, int size) {
        if (size <= 0) return;
        int64_t skip = std::min<int64_t>(mSkipBytes, size);
        mSkipBytes -= skip;
        mPending.insert(mPending.end(), data + skip, data + size);
    }

    void ensureOutput(int inputBytes) {
        if (inputBytes <= mOutCapacityFor) return;
        unsigned char* grown = mConverter->allocateBuff(mOut, inputBytes, 1.0f);
        if (grown == nullptr) inputError(mIn.path() + ": out of memory");
        mOut = grown;
        mOutCapacityFor = inputBytes;
    }

    void refill() {
        QNMediaExtractorWrapper& w = mIn.wrapper();
        sp<ABuffer> buffer;
        int64_t timeUs = 0;
        if (w.getSampleTime(&timeUs) == OK) mCoverage.saw(0, timeUs);
        const status_t err = w.readSampleData(&buffer);
        if (err != OK && err != ERROR_END_OF_STREAM) mCoverage.fail(timeUs, describeStatus(err));
        if (err != OK) {
            // End of the background: drain what the resampler holds.
            ensureOutput(65536);
            for (int guard = 0; guard < 1 << 16; ++guard) {
                const int made = mConverter->process(nullptr, mOut, 0);
                if (made <= 0) break;
                append(mOut, made);
            }
            mDone = true;
            if (mDurationUs > 0) mCoverage.expectReach(0, mDurationUs);
            return;
        }
        mCoverage.reached(0, timeUs + mBgm.durationUs(buffer->size()));
        w.advance();
        ensureOutput(std::max<int>(static_cast<int>(buffer->size()), 65536));
        const int made = mConverter->process(buffer->data(), mOut, static_cast<int>(buffer->size()));
        if (made < 0) inputError(mIn.path() + ": background conversion failed");
        append(mOut, made);
    }

public:
    // What reading the background showed; complete once it was read to its end.
    const ReadCoverage& coverage() const { return mCoverage; }

private:
    Input& mIn;
    const PcmTrack mBgm;
    const size_t mFrameBytes;
    const int64_t mDurationUs = mIn.durationUs();
    ReadCoverage mCoverage;
    int64_t mSilenceBytes = 0;
    sp<QNMediaAudioConverter> mConverter;
    unsigned char* mOut = nullptr;
    int mOutCapacityFor = 0;
    std::deque<uint8_t> mPending;
    int64_t mSkipBytes = 0;
    bool mDone = false;
};

}  // namespace

int runMix(const std::vector<std::string>& words) {
    Args args(words, {"--main-gain", "--bgm-gain", "--mixer", "--offset"}, {"--salvage"});
    args.expectPositional(3, "qnedit mix MAIN BGM OUT [--main-gain DB] [--bgm-gain DB] [--mixer TYPE] [--offset MS]");
    const std::string outPath = args.positional()[2];
    const std::string ext = lowerExtension(outPath);
    if (ext != "wav" && ext != "flac") usageError("OUT must end in .wav or .flac");
    const long mainGain = args.getIntIn("--main-gain", 0, -60, 60), bgmGain = args.getIntIn("--bgm-gain", 0, -60, 60);
    const long mixer = args.getIntIn("--mixer", 4, 0, 5);
    const std::vector<std::string> inputs = {args.positional()[0], args.positional()[1]};
    checkOutputPath(outPath, inputs);
    long offset = 0;
    if (args.has("--offset")) {
        offset = args.getIntIn("--offset", 0, INT32_MIN, INT32_MAX);
    } else {
        int fromSettings = 0;
        Adapter::GetBGMSyncFromKestro(&fromSettings);
        offset = fromSettings;
    }
    const int offsetMs = static_cast<int>(offset);
    const std::string offsetName = args.has("--offset") ? "--offset" : "the device's background offset";
    int ditherType = 0;
    const bool haveDither = Adapter::GetUseDitherTypeFromKestro(&ditherType);

    Input mainIn(args.positional()[0]);
    Input bgmIn(args.positional()[1]);
    const PcmTrack main = findPcm(mainIn);
    const PcmTrack bgm = findPcm(bgmIn);
    // An offset outside the recordings would mix nothing: say so rather than
    // write the main audio unchanged (or hold minutes of silence).
    if (mainIn.durationUs() > 0 && int64_t(offsetMs) * 1000 >= mainIn.durationUs()) {
        usageError(offsetName + " " + std::to_string(offsetMs) + " ms lies past the end of the main recording");
    }
    if (bgmIn.durationUs() > 0 && -int64_t(offsetMs) * 1000 >= bgmIn.durationUs()) {
        usageError(offsetName + " " + std::to_string(offsetMs) + " ms skips all of the background");
    }

    sp<QNMediaAudioEffect> effect = new QNMediaAudioEffect();
    effect->setParamAudioInfo(main.bits, main.sampleRate, main.channels);
    effect->setParamAuxInfo(main.bits, main.sampleRate, main.channels);
    effect->setParamChainType(static_cast<int>(mainGain), static_cast<int>(bgmGain), 0, static_cast<int>(mixer));
    Background background(bgmIn, bgm, main, offsetMs);

    OutputFile out(outPath, inputs);
    sp<QNMediaMuxer> muxer = new QNMediaMuxer(out.fd(), ext == "wav" ? OUTPUT_FILE_FORMAT_WAVE : OUTPUT_FILE_FORMAT_FLAC);
    const ssize_t track = muxer->addTrack(main.format->dup());
    if (track < 0) inputError(outPath + ": the writer refused the audio format");
    if (muxer->start() != OK) inputError(outPath + ": cannot start writing");

    QNMediaExtractorWrapper& w = mainIn.wrapper();
    w.selectTrack(main.index);
    Progress progress("mix", mainIn.durationUs());
    int64_t time = 0;
    ReadCoverage coverage;
    while (w.getSampleTime(&time) == OK) {
        checkInterrupted();
        coverage.saw(main.index, time);
        sp<ABuffer> buffer;
        const status_t err = w.readSampleData(&buffer);
        if (err != OK) {
            coverage.fail(time, describeStatus(err));
            break;
        }
        coverage.reached(main.index, time + main.durationUs(buffer->size()));
        std::vector<uint8_t> aux = background.take(buffer->size());
        if (!aux.empty() && effect->writeAux(aux.data(), static_cast<int>(aux.size())) < 0) {
            inputError("the mixer could not take the background audio");
        }
        const int mixed = effect->processEffectChain(buffer->data(), buffer->data(), static_cast<int>(buffer->size()));
        if (mixed < 0) inputError("the mixer failed");
        buffer->setRange(buffer->offset(), std::min<size_t>(buffer->size(), static_cast<size_t>(mixed)));
        const status_t werr = muxer->writeSampleData(0, buffer, static_cast<size_t>(track), time, 1);
        if (werr != OK) inputError(outPath + ": write failed (" + describeWriteStatus(werr) + ")");
        progress.update(time);
        if (w.advance() != OK) break;
    }
    progress.finish();
    if (mainIn.durationUs() > 0) coverage.expectReach(main.index, mainIn.durationUs());
    const bool salvage = args.has("--salvage");
    coverage.report(mainIn.path(), salvage);
    background.coverage().report(bgmIn.path(), salvage);
    finishOutput(muxer, out);
    fprintf(stderr, "mixed with offset %d ms, mixer %ld%s -> %s\n", offsetMs, mixer,
            haveDither ? (", dither type " + std::to_string(ditherType)).c_str() : "", outPath.c_str());
    return kExitOk;
}

}  // namespace qnedit
