#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
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
#include "MixEngine.h"
#include "MixMp4.h"
#include "MixPcm.h"
#include "MixPrefetch.h"
#include "ReadCoverage.h"
#include "QNMediaEditorAdapter.h"
#include "QNMediaMuxer.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

const char* const kMixHelp =
    "usage: qnedit mix MAIN BGM OUT [--main-gain DB] [--bgm-gain DB] [--mixer TYPE] [--offset MS] [--loop]\n"
    "\n"
    "Mixes background audio (BGM) into the main recording. BGM is any audio\n"
    "file (MP3, M4A/AAC, Ogg Vorbis, AMR, FLAC, WAV), converted to MAIN's sample\n"
    "format, rate and channel count first; a long one is cut at MAIN's end.\n"
    "OUT is chosen by its extension: .wav or .flac for the mixed PCM, .m4a or\n"
    ".mp4 for it encoded as AAC. A MAIN with video needs .mp4: its video is\n"
    "copied untouched and the recording's device items are kept.\n"
    "  --main-gain DB  gain of the main audio, -60..60 (default 0)\n"
    "  --bgm-gain DB   gain of the background, -60..60 (default 0)\n"
    "  --mixer TYPE    0 main only, 1 background only, 2 average, 3 background\n"
    "                  over main, 4 sum (default), 5 main ducked under background\n"
    "  --offset MS     when the background starts, relative to the main audio;\n"
    "                  negative skips its beginning (default: the device setting)\n"
    "  --loop          repeat a background shorter than the main audio\n"
    "  --salvage       mix what can be read of a damaged input (with a warning)\n"
    "                  instead of failing\n";

namespace {

bool hasVideo(const Input& in) {
    for (size_t i = 0; i < in.trackCount(); ++i) {
        if (Input::isVideo(in.trackFormat(i))) return true;
    }
    return false;
}

// The mixed PCM into a WAV or FLAC, with the main audio's times.
sp<QNMediaMuxer> writeMixedPcm(PrefetchedPcm& main, MixEngine& mix, const std::string& ext, OutputFile& out) {
    sp<QNMediaMuxer> muxer = new QNMediaMuxer(out.fd(), ext == "wav" ? OUTPUT_FILE_FORMAT_WAVE : OUTPUT_FILE_FORMAT_FLAC);
    const ssize_t track = muxer->addTrack(main.format()->dup());
    if (track < 0) inputError(out.path() + ": the writer refused the audio format");
    if (muxer->start() != OK) inputError(out.path() + ": cannot start writing");
    Progress progress("mix", main.durationUs());
    PcmChunk chunk;
    while (mix.next(&chunk)) {
        checkInterrupted();
        // The writer holds the buffer after the call: it gets its own copy.
        sp<ABuffer> buffer = ABuffer::CreateAsCopy(chunk.bytes.data(), chunk.bytes.size());
        const status_t werr = muxer->writeSampleData(0, buffer, static_cast<size_t>(track), chunk.timeUs, 1);
        if (werr != OK) inputError(out.path() + ": write failed (" + describeWriteStatus(werr) + ")");
        progress.update(chunk.timeUs);
    }
    progress.finish();
    return muxer;
}

}  // namespace

int runMix(const std::vector<std::string>& words) {
    Args args(words, {"--main-gain", "--bgm-gain", "--mixer", "--offset"}, {"--salvage", "--loop"});
    args.expectPositional(3, "qnedit mix MAIN BGM OUT [--main-gain DB] [--bgm-gain DB] [--mixer TYPE] [--offset MS] [--loop]");
    const std::string outPath = args.positional()[2];
    const std::string ext = lowerExtension(outPath);
    if (ext != "wav" && ext != "flac" && ext != "m4a" && ext != "mp4") usageError("OUT must end in .wav, .flac, .m4a or .mp4");
    MixSettings settings;
    settings.mainGain = static_cast<int>(args.getIntIn("--main-gain", 0, -60, 60));
    settings.bgmGain = static_cast<int>(args.getIntIn("--bgm-gain", 0, -60, 60));
    settings.mixer = static_cast<int>(args.getIntIn("--mixer", 4, 0, 5));
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
    settings.offsetMs = static_cast<int>(offset);
    const int offsetMs = settings.offsetMs;
    const std::string offsetName = args.has("--offset") ? "--offset" : "the device's background offset";
    int ditherType = 0;
    const bool haveDither = Adapter::GetUseDitherTypeFromKestro(&ditherType);

    Input mainIn(args.positional()[0]);
    if (hasVideo(mainIn) && ext != "mp4") usageError(mainIn.path() + " has video: OUT must end in .mp4");
    const std::string bgmPath = args.positional()[1];
    PrefetchedPcm main([&] { return openPcmReader(mainIn.path()); }, false);
    PrefetchedPcm bgm([&] { return openPcmReader(bgmPath); }, args.has("--loop"));
    // An offset outside the recordings would mix nothing: say so rather than
    // write the main audio unchanged (or hold minutes of silence).
    if (main.durationUs() > 0 && int64_t(offsetMs) * 1000 >= main.durationUs()) {
        usageError(offsetName + " " + std::to_string(offsetMs) + " ms lies past the end of the main recording");
    }
    if (bgm.durationUs() > 0 && -int64_t(offsetMs) * 1000 >= bgm.durationUs()) {
        usageError(offsetName + " " + std::to_string(offsetMs) + " ms skips all of the background");
    }
    MixEngine mix(main, bgm, settings, bgmPath);

    OutputFile out(outPath, inputs);
    ReadCoverage videoCoverage;
    sp<QNMediaMuxer> muxer =
        ext == "wav" || ext == "flac"
            ? writeMixedPcm(main, mix, ext, out)
            : writeMixedMp4(mainIn, mix, main.durationUs(), ext == "mp4" ? OUTPUT_FILE_FORMAT_MPEG_4 : OUTPUT_FILE_FORMAT_M4A,
                            out, &videoCoverage);
    const bool salvage = args.has("--salvage");
    main.finish().report(mainIn.path(), salvage);
    videoCoverage.report(mainIn.path(), salvage);
    bgm.finish().report(bgmPath, salvage);
    finishOutput(muxer, out);
    fprintf(stderr, "mixed with offset %d ms, mixer %d%s -> %s\n", offsetMs, settings.mixer,
            haveDither ? (", dither type " + std::to_string(ditherType)).c_str() : "", outPath.c_str());
    return kExitOk;
}

}  // namespace qnedit
