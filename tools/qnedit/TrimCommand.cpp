#include <algorithm>
#include <cmath>
#include <map>
#include <set>

#include <media/MediaTrack.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MetaData.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "Cli.h"
#include "Commands.h"
#include "DeviceItems.h"
#include "Input.h"
#include "MuxerOutput.h"
#include "OutputFile.h"
#include "Progress.h"
#include "TrimWindow.h"
#include "Interrupt.h"
#include "ReadCoverage.h"
#include "QNMediaFlacFrameConverter.h"
#include "QNMediaMuxer.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

const char* const kTrimHelp =
    "usage: qnedit trim IN OUT --start SEC [--end SEC] [--tracks LIST] [--format mp4|m4a|wav|flac|amr]\n"
    "                  [--keyframe] [--salvage]\n"
    "\n"
    "Cuts IN losslessly into OUT. Reading starts at the sync sample at or before\n"
    "--start; in MP4 and M4A output the presentation still starts exactly at\n"
    "--start and ends exactly at --end: every frame shown in between is kept, and\n"
    "the frames they need that lie outside (before --start, or stored after a\n"
    "reordered frame past --end) are kept for decoding and hidden by an edit\n"
    "list. The device's items are kept, the stored waveform cut to the range.\n"
    "  --start SEC    where the result starts\n"
    "  --end SEC      where it ends (default: the end of the file)\n"
    "  --tracks LIST  track indices to keep, e.g. 0,1 (default: all that fit the format)\n"
    "  --format F     output format; by default from OUT's extension\n"
    "  --keyframe     start at the sync sample itself instead of --start\n"
    "  --salvage      keep what can be read of a damaged input (with a warning)\n"
    "                 instead of failing\n"
    "FLAC is trimmed by whole frames, renumbered with a new stream header; 32-bit\n"
    "integer or float WAV comes out as 24-bit.\n"
    "OUT is written beside itself under a temporary name and replaces OUT only\n"
    "when complete; OUT may not be IN. A symbolic link as OUT is followed.\n";

namespace {

const char* const kVariableBlockSize = ": this FLAC stream has a variable block size and cannot be trimmed losslessly";

struct Plan {
    std::string format;
    int muxFormat;
    std::vector<size_t> tracks;  // source track indices, in muxer order
};

int muxFormatFor(const std::string& f) {
    if (f == "mp4") return OUTPUT_FILE_FORMAT_MPEG_4;
    if (f == "m4a") return OUTPUT_FILE_FORMAT_M4A;
    if (f == "wav") return OUTPUT_FILE_FORMAT_WAVE;
    if (f == "flac") return OUTPUT_FILE_FORMAT_FLAC;
    if (f == "amr") return OUTPUT_FILE_FORMAT_AMR_A;
    usageError("unknown output format '" + f + "' (mp4, m4a, wav, flac or amr)");
}

bool trackFits(const std::string& format, const sp<AMessage>& trackFormat) {
    const std::string mime = Input::mimeOf(trackFormat);
    if (format == "mp4") {
        return mime == MEDIA_MIMETYPE_VIDEO_AVC || mime == MEDIA_MIMETYPE_VIDEO_HEVC ||
               mime == MEDIA_MIMETYPE_AUDIO_AAC || mime == MEDIA_MIMETYPE_AUDIO_AMR_NB ||
               mime == MEDIA_MIMETYPE_AUDIO_AMR_WB;
    }
    if (format == "m4a") return mime == MEDIA_MIMETYPE_AUDIO_AAC;
    if (format == "wav") return mime == MEDIA_MIMETYPE_AUDIO_RAW;
    if (format == "flac") return mime == MEDIA_MIMETYPE_AUDIO_FLAC || mime == MEDIA_MIMETYPE_AUDIO_RAW;
    if (format == "amr") return mime == MEDIA_MIMETYPE_AUDIO_AMR_NB || mime == MEDIA_MIMETYPE_AUDIO_AMR_WB;
    return false;
}

Plan makePlan(const Args& args, const Input& in, const std::string& outPath) {
    Plan plan;
    plan.format = args.get("--format", lowerExtension(outPath));
    if (plan.format == "3gp" || plan.format == "mov") plan.format = "mp4";
    plan.muxFormat = muxFormatFor(plan.format);
    const bool singleTrack = plan.format == "wav" || plan.format == "flac" || plan.format == "amr";
    if (args.has("--tracks")) {
        for (const std::string& item : splitList(args.get("--tracks"))) {
            const long index = parseInt(item, "--tracks");
            if (index < 0 || static_cast<size_t>(index) >= in.trackCount()) {
                usageError("--tracks: no track " + item + " in " + in.path());
            }
            if (!trackFits(plan.format, in.trackFormat(index))) {
                inputError(in.path() + ": track " + item + " (" + Input::mimeOf(in.trackFormat(index)) +
                           ") cannot go into " + plan.format + " output");
            }
            if (std::find(plan.tracks.begin(), plan.tracks.end(), size_t(index)) == plan.tracks.end()) {
                plan.tracks.push_back(static_cast<size_t>(index));
            }
        }
    } else {
        for (size_t i = 0; i < in.trackCount(); ++i) {
            if (trackFits(plan.format, in.trackFormat(i))) plan.tracks.push_back(i);
        }
    }
    if (plan.tracks.empty()) inputError(in.path() + ": no track can go into " + plan.format + " output");
    if (singleTrack && plan.tracks.size() > 1) plan.tracks.resize(1);
    return plan;
}

// Frame rate in hundredths of a frame per second, from the spacing of the
// first video samples after the cut point.
int estimateFps100(QNMediaExtractorWrapper& w, size_t videoTrack, int64_t startUs) {
    if (w.selectTrack(videoTrack) != OK) return 0;
    std::vector<int64_t> times;
    if (w.seekTo(startUs, MediaTrack::ReadOptions::SEEK_PREVIOUS_SYNC) == OK) {
        int64_t t;
        while (times.size() < 32 && w.getSampleTime(&t) == OK) {
            times.push_back(t);
            if (w.advance() != OK) break;
        }
    }
    w.unselectTrack(videoTrack);
    std::sort(times.begin(), times.end());
    std::vector<int64_t> deltas;
    for (size_t i = 1; i < times.size(); ++i) {
        if (times[i] > times[i - 1]) deltas.push_back(times[i] - times[i - 1]);
    }
    if (deltas.empty()) return 0;
    std::nth_element(deltas.begin(), deltas.begin() + deltas.size() / 2, deltas.end());
    const double period = static_cast<double>(deltas[deltas.size() / 2]);
    return static_cast<int>(std::lround(100e6 / period));
}

struct TrackState {
    size_t muxIndex = 0;
    bool video = false;
    bool pcm = false;
    int frameBytes = 0;   // PCM: bytes per sample frame as delivered
    int sampleRate = 0;   // PCM
    int64_t frameUs = 0;  // FLAC: the one block size, in time
    sp<QNMediaFlacFrameConverter> flac;
    int64_t prerollUs = 0;
    TrimWindow window;
};

// A trimmable FLAC stream has one block size, read from the STREAMINFO in
// "csd-0" (after "fLaC" and the block header); 0 when it cannot be told.
int64_t flacFrameUs(const sp<AMessage>& format) {
    sp<ABuffer> csd;
    int32_t rate = 0;
    if (!format->findBuffer("csd-0", &csd) || csd == nullptr || csd->size() < 10 ||
        !format->findInt32("sample-rate", &rate) || rate <= 0) {
        return 0;
    }
    const int64_t blockSize = csd->data()[8] << 8 | csd->data()[9];
    return blockSize * 1000000 / rate;
}

// PCM is cut to the exact sample frame; the buffer is trimmed in place.
bool cutPcm(const TrackState& t, int64_t timeUs, int64_t startUs, int64_t endUs, sp<ABuffer>& buffer,
            int64_t* outTimeUs) {
    const int64_t frames = static_cast<int64_t>(buffer->size()) / t.frameBytes;
    int64_t first = 0, last = frames;
    if (timeUs < startUs) first = std::min(frames, (startUs - timeUs) * t.sampleRate / 1000000);
    if (endUs >= 0) last = std::min(last, std::max<int64_t>(0, (endUs - timeUs) * t.sampleRate / 1000000));
    if (last <= first) return false;
    buffer->setRange(buffer->offset() + first * t.frameBytes, (last - first) * t.frameBytes);
    *outTimeUs = timeUs + first * 1000000 / t.sampleRate;
    return true;
}

}  // namespace

int runTrim(const std::vector<std::string>& words) {
    Args args(words, {"--start", "--end", "--tracks", "--format"}, {"--keyframe", "--salvage"});
    args.expectPositional(2, "qnedit trim IN OUT --start SEC [--end SEC] [--tracks LIST] [--format F]");
    if (!args.has("--start")) usageError("--start is required");
    const std::string inPath = args.positional()[0], outPath = args.positional()[1];
    const int64_t startUs = parseSeconds(args.get("--start"), "--start");
    const int64_t endUs = args.has("--end") ? parseSeconds(args.get("--end"), "--end") : -1;
    if (endUs >= 0 && endUs <= startUs) usageError("--end must come after --start");
    checkOutputPath(outPath, {inPath});

    const std::string wanted = args.get("--format", lowerExtension(outPath));
    Input in(inPath, wanted == "flac");
    const Plan plan = makePlan(args, in, outPath);
    if (in.durationUs() >= 0 && startUs >= in.durationUs()) {
        inputError(inPath + ": --start lies past the end (" + formatSeconds(in.durationUs()) + ")");
    }
    // A little slack: durations in containers are rounded.
    if (in.durationUs() >= 0 && endUs > in.durationUs() + 1000) {
        inputError(inPath + ": --end lies past the end (" + formatSeconds(in.durationUs()) +
                   "); leave it out to keep everything to the end");
    }

    OutputFile out(outPath, {inPath});
    sp<QNMediaMuxer> muxer = new QNMediaMuxer(out.fd(), static_cast<OutputFileFormat>(plan.muxFormat));
    if (muxer->getMuxerState() != QNMediaMuxer::INITIALIZED) inputError(outPath + ": output format not supported");

    QNMediaExtractorWrapper& w = in.wrapper();
    // The presentation starts at --start, or at the sync sample with --keyframe.
    const int64_t originUs = trimOrigin(w, plan.tracks, startUs, args.has("--keyframe"));
    std::map<size_t, TrackState> states;
    for (size_t source : plan.tracks) {
        sp<AMessage> format = in.trackFormat(source)->dup();
        TrackState t;
        t.video = Input::isVideo(format);
        const std::string mime = Input::mimeOf(format);
        if (mime == MEDIA_MIMETYPE_AUDIO_FLAC) {
            int32_t trim = 0;
            if (!format->findInt32("editor-flactrim", &trim) || !trim) {
                inputError(inPath + kVariableBlockSize);
            }
            t.flac = new QNMediaFlacFrameConverter(format);
            t.frameUs = flacFrameUs(format);
        }
        if (mime == MEDIA_MIMETYPE_AUDIO_RAW) {
            int32_t channels = 0, bits = 16;
            format->findInt32("channel-count", &channels);
            format->findInt32("sample-rate", &t.sampleRate);
            format->findInt32("bits-per-sample", &bits);
            t.pcm = channels > 0 && t.sampleRate > 0;
            t.frameBytes = channels * ((bits + 7) / 8);
            if (t.frameBytes <= 0) t.pcm = false;
        }
        t.prerollUs = trimPrerollUs(format, plan.format);
        setTrimDuration(format, originUs, endUs);
        const ssize_t index = muxer->addTrack(format);
        if (index < 0) inputError(outPath + ": the writer refused track " + std::to_string(source) + " (" + mime + ")");
        t.muxIndex = static_cast<size_t>(index);
        states[source] = t;
    }
    copyDeviceItems(in, *muxer, plan.muxFormat, startUs, endUs);
    for (size_t source : plan.tracks) {
        if (states[source].video) {
            const int fps100 = estimateFps100(w, source, startUs);
            if (fps100 > 0) muxer->setVideoFPS(fps100);
            break;
        }
    }
    if (muxer->start() != OK) inputError(outPath + ": cannot start writing");

    std::vector<TrimTrack> reading;
    for (size_t source : plan.tracks) reading.push_back({source, states[source].prerollUs, &states[source].window});
    if (!seekTrimStart(w, reading, originUs, endUs)) inputError(inPath + ": nothing readable at --start (damaged?)");
    for (auto& entry : states) {
        TrackState& t = entry.second;
        if (!t.flac) continue;
        sp<ABuffer> csd;
        if (!t.flac->getCSDBuffer(&csd, 0)) inputError(inPath + ": no FLAC stream header");
        if (muxer->writeSampleData(0, csd, t.muxIndex, 0, 2) != OK) inputError(outPath + ": write failed");
    }

    Progress progress("trim", (endUs >= 0 ? endUs : in.durationUs()) - startUs);
    std::set<size_t> open(plan.tracks.begin(), plan.tracks.end());
    ReadCoverage coverage;
    const bool salvage = args.has("--salvage");
    size_t written = 0;
    size_t source;
    while (!open.empty() && w.getSampleTrackIndex(&source) == OK) {
        checkInterrupted();
        int64_t timeUs = 0;
        sp<MetaData> meta;
        w.getSampleTime(&timeUs);
        w.getSampleMeta(&meta);
        TrackState& t = states[source];
        if (t.flac != nullptr) coverage.expectEvenSpacing(source);
        coverage.saw(source, timeUs);
        const TrimWindow::Step step = t.window.step(timeUs, meta);
        if (step == TrimWindow::Step::kSkip) {
            if (w.advance() != OK) break;
            continue;
        }
        if (step == TrimWindow::Step::kClose) {
            w.unselectTrack(source);
            open.erase(source);
            continue;
        }
        sp<ABuffer> buffer;
        const status_t err = w.readSampleData(&buffer);
        if (err != OK) {
            coverage.fail(timeUs, describeStatus(err));
            break;
        }
        if (t.pcm) coverage.reached(source, timeUs + pcmDurationUs(buffer->size(), t.frameBytes, t.sampleRate));
        if (t.frameUs > 0) coverage.reached(source, timeUs + t.frameUs);
        uint32_t flags = 0;
        int32_t sync = 0;
        if (meta != nullptr && meta->findInt32(kKeyIsSyncFrame, &sync) && sync) flags |= 1;
        int64_t writeTimeUs = timeUs;
        bool keep = true;
        if (t.pcm && (plan.format == "wav" || plan.format == "flac")) keep = cutPcm(t, timeUs, originUs, endUs, buffer, &writeTimeUs);
        if (t.flac != nullptr) {
            // A stream numbered by samples (blocking bit set) may still have one
            // block size throughout; renumbering its frames would corrupt it.
            if (buffer->size() >= 2 && (buffer->data()[1] & 0x01) != 0) {
                inputError(inPath + kVariableBlockSize);
            }
            buffer->meta()->setInt64("timeUs", timeUs);
            sp<ABuffer> converted;
            if (!t.flac->convert(buffer, &converted)) {
                coverage.fail(timeUs, "unreadable FLAC frame");
                break;
            }
            buffer = converted;
        }
        if (keep) {
            for (const TrimWindow::Sample& s : t.window.take({buffer, writeTimeUs, flags})) {
                const status_t werr = muxer->writeSampleData(t.video ? 1 : 0, s.buffer, t.muxIndex, s.timeUs - originUs, s.flags);
                if (werr != OK) inputError(outPath + ": write failed (" + describeWriteStatus(werr) + ")");
                ++written;
            }
        }
        progress.update(timeUs - startUs);
        if (w.advance() != OK) break;
    }
    progress.finish();
    for (size_t track : plan.tracks) {
        int64_t durationUs = -1;
        in.trackFormat(track)->findInt64("durationUs", &durationUs);
        const int64_t wantUs = endUs >= 0 && (durationUs < 0 || endUs < durationUs) ? endUs : durationUs;
        if (wantUs > 0) coverage.expectReach(track, wantUs);
    }
    coverage.report(inPath, salvage);
    if (written == 0) inputError(inPath + ": no samples in the range; nothing written");
    finishOutput(muxer, out);
    return kExitOk;
}

}  // namespace qnedit
