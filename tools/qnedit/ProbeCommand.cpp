#include <cinttypes>
#include <cstdio>
#include <map>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "Cli.h"
#include "Commands.h"
#include "Input.h"
#include "Json.h"
#include "Progress.h"
#include "ReadCoverage.h"
#include "QNMediaEditorDefs.h"
#include "QNMediaEditorUtils.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

const char* const kProbeHelp =
    "usage: qnedit probe FILE [--json] [--verify]\n"
    "\n"
    "Shows the container, duration and total bitrate, each track's format (codec,\n"
    "picture size after cropping, sample rate, channels, bits), its sample and\n"
    "sync-sample counts, and the device's items stored in the file.\n"
    "\n"
    "Counts come from the file's index where it has one (MP4, WAVE, FLAC of one\n"
    "block size) without reading the media; other files are read sample by sample.\n"
    "A file cut short (an MP4 whose samples lie past its end, a FLAC whose last\n"
    "frame is missing or incomplete) fails with where it stops. Damage inside the\n"
    "media data is found by reading it: --verify.\n"
    "  --json     a stable machine-readable form\n"
    "  --verify   read (and for FLAC decode) every sample, counting what was read\n";

namespace {

struct TrackFacts {
    std::string mime, codec;
    int64_t durationUs = -1;
    int32_t bitrate = -1, width = 0, height = 0, displayWidth = 0, displayHeight = 0, rotation = 0;
    int32_t sampleRate = 0, channels = 0, bits = 0;
    int64_t samples = -1, syncSamples = -1;
    int64_t truncatedAtUs = -1;  // from the index: where the data stops short
    int32_t bookmarkSize = -1;
};

std::string codecName(const std::string& mime) {
    static const std::map<std::string, std::string> kNames = {
        {"video/avc", "h264"},    {"video/hevc", "hevc"},       {"audio/mp4a-latm", "aac"},
        {"audio/raw", "pcm"},     {"audio/flac", "flac"},       {"audio/3gpp", "amr_nb"},
        {"audio/amr-wb", "amr_wb"}, {"audio/vorbis", "vorbis"}, {"video/mp4v-es", "mpeg4"},
    };
    auto it = kNames.find(mime);
    return it == kNames.end() ? mime : it->second;
}

// The picture size after cropping, from the parameter sets in the codec data.
void readCroppedSize(const sp<AMessage>& format, const std::string& mime, TrackFacts* t) {
    sp<ABuffer> csd;
    if (!format->findBuffer("csd-0", &csd) || csd == nullptr || csd->size() == 0) return;
    int w = 0, h = 0, cw = 0, ch = 0;
    if (mime == MEDIA_MIMETYPE_VIDEO_AVC) {
        QNMediaEditorUtils utils;
        sp<ABuffer> sps = utils.FindNAL(csd->data(), csd->size(), 7);
        if (sps == nullptr || sps->size() < 4) return;
        utils.FindAVCDimensions(sps, &w, &h, &cw, &ch);
    } else if (mime == MEDIA_MIMETYPE_VIDEO_HEVC) {
        if (QNMediaEditorUtils::FindHEVCDimensions(csd, &w, &h, &cw, &ch) != OK) return;
    } else {
        return;
    }
    if (cw > 0 && ch > 0) {
        t->displayWidth = cw;
        t->displayHeight = ch;
    }
}

TrackFacts describeTrack(const sp<AMessage>& f, const sp<MetaData>& index) {
    TrackFacts t;
    if (index != nullptr) {
        index->findInt64(kKeySampleCount, &t.samples);
        index->findInt64(kKeySyncSampleCount, &t.syncSamples);
        index->findInt64(kKeyTruncatedAtUs, &t.truncatedAtUs);
    }
    t.mime = Input::mimeOf(f);
    t.codec = codecName(t.mime);
    f->findInt64("durationUs", &t.durationUs);
    f->findInt32("bitrate", &t.bitrate);
    f->findInt32("width", &t.width);
    f->findInt32("height", &t.height);
    f->findInt32("rotation-degrees", &t.rotation);
    f->findInt32("sample-rate", &t.sampleRate);
    f->findInt32("channel-count", &t.channels);
    f->findInt32("bits-per-sample", &t.bits);
    f->findInt32("AM-bookmarksize", &t.bookmarkSize);
    t.displayWidth = t.width;
    t.displayHeight = t.height;
    readCroppedSize(f, t.mime, &t);
    return t;
}

// One pass over every sample of every track; what it shows of damage (a
// track whose samples stop early) goes into `coverage`.
void countSamples(Input& in, std::vector<TrackFacts>* tracks, ReadCoverage* coverage) {
    QNMediaExtractorWrapper& w = in.wrapper();
    for (TrackFacts& t : *tracks) t.samples = t.syncSamples = 0;
    for (size_t i = 0; i < in.trackCount(); ++i) w.selectTrack(i);
    const int64_t duration = in.durationUs();
    Progress progress("probe", duration > 0 ? duration : 1);
    size_t index;
    while (w.getSampleTrackIndex(&index) == OK) {
        sp<MetaData> meta;
        if (index < tracks->size() && w.getSampleMeta(&meta) == OK && meta != nullptr) {
            TrackFacts& t = (*tracks)[index];
            ++t.samples;
            int32_t sync = 0;
            if (meta->findInt32(kKeyIsSyncFrame, &sync) && sync) ++t.syncSamples;
            int64_t time;
            if (meta->findInt64(kKeyTime, &time)) {
                coverage->saw(index, time);
                progress.update(time);
            }
        }
        if (w.advance() != OK) break;
    }
    for (size_t i = 0; i < in.trackCount(); ++i) {
        int64_t trackUs = -1;
        if (in.trackFormat(i)->findInt64("durationUs", &trackUs) && trackUs > 0) coverage->expectReach(i, trackUs);
    }
}

// True when every track's counts came from the index.
bool indexed(const std::vector<TrackFacts>& tracks) {
    for (const TrackFacts& t : tracks) {
        if (t.samples < 0 || t.syncSamples < 0) return false;
    }
    return true;
}

// What the index shows of damage: the data of a track stopping short.
void indexDamage(const std::vector<TrackFacts>& tracks, ReadCoverage* coverage) {
    for (size_t i = 0; i < tracks.size(); ++i) {
        const TrackFacts& t = tracks[i];
        if (t.truncatedAtUs < 0) continue;
        std::string cause = "the file ends inside track " + std::to_string(i);
        if (t.durationUs > 0) cause += ", " + formatSeconds(t.durationUs) + " expected";
        coverage->fail(t.truncatedAtUs, cause);
    }
}

struct DeviceItems {
    std::string recordingType, location, userMessage, vrMeta;
    int64_t waveformValues = -1, waveform2Values = -1, uuidBytes = -1;
};

DeviceItems describeItems(const Input& in) {
    DeviceItems d;
    const sp<AMessage>& f = in.fileFormat();
    AString s;
    if (f->findString("recording-type", &s)) d.recordingType = s.c_str();
    if (f->findString("qn-usermessage", &s)) d.userMessage = s.c_str();
    if (f->findString("qn-vrmeta", &s)) d.vrMeta = s.c_str();
    sp<ABuffer> b;
    if (f->findBuffer("AM-waveform1", &b) && b != nullptr) d.waveformValues = int64_t(b->size() / 2);
    if (f->findBuffer("AM-waveform2", &b) && b != nullptr) d.waveform2Values = int64_t(b->size() / 2);
    if (f->findBuffer("uuid-data", &b) && b != nullptr) d.uuidBytes = int64_t(b->size());
    const char* location;
    if (in.platformFileMeta() != nullptr && in.platformFileMeta()->findCString(kKeyLocation, &location)) {
        d.location = location;
    }
    return d;
}

void printJson(const Input& in, const std::vector<TrackFacts>& tracks, const DeviceItems& d, int64_t bitrate) {
    Json j;
    j.beginObject();
    j.value("file", in.path());
    j.value("container", Input::mimeOf(in.fileFormat()));
    j.value("size", in.fileSize());
    j.value("durationUs", in.durationUs());
    j.value("bitrate", bitrate);
    j.beginArray("tracks");
    for (size_t i = 0; i < tracks.size(); ++i) {
        const TrackFacts& t = tracks[i];
        j.beginObject();
        j.value("index", static_cast<int64_t>(i));
        j.value("mime", t.mime);
        j.value("codec", t.codec);
        j.value("durationUs", t.durationUs);
        if (t.bitrate >= 0) j.value("bitrate", t.bitrate);
        if (t.width > 0) {
            j.value("width", t.width).value("height", t.height);
            j.value("displayWidth", t.displayWidth).value("displayHeight", t.displayHeight);
            j.value("rotation", t.rotation);
        }
        if (t.sampleRate > 0) j.value("sampleRate", t.sampleRate);
        if (t.channels > 0) j.value("channels", t.channels);
        if (t.bits > 0) j.value("bitsPerSample", t.bits);
        j.value("samples", t.samples).value("syncSamples", t.syncSamples);
        j.endObject();
    }
    j.endArray();
    j.beginObject("device");
    auto optString = [&](const char* key, const std::string& v, bool present) {
        if (present) j.value(key, v); else j.null(key);
    };
    optString("recordingType", d.recordingType, !d.recordingType.empty());
    optString("location", d.location, !d.location.empty());
    int32_t orientation = 0;
    for (const TrackFacts& t : tracks) if (t.rotation) orientation = t.rotation;
    j.value("orientation", orientation);
    optString("userMessage", d.userMessage, !d.userMessage.empty());
    optString("vrMeta", d.vrMeta, !d.vrMeta.empty());
    if (d.waveformValues >= 0) j.value("waveformValues", d.waveformValues); else j.null("waveformValues");
    if (d.uuidBytes >= 0) j.value("uuidDataBytes", d.uuidBytes); else j.null("uuidDataBytes");
    int32_t bookmark = -1;
    for (const TrackFacts& t : tracks) if (t.bookmarkSize >= 0) bookmark = t.bookmarkSize;
    if (bookmark >= 0) j.value("bookmarkSize", bookmark); else j.null("bookmarkSize");
    j.endObject();
    j.endObject();
    fputs(j.str().c_str(), stdout);
}

void printText(const Input& in, const std::vector<TrackFacts>& tracks, const DeviceItems& d, int64_t bitrate) {
    printf("%s\n", in.path().c_str());
    printf("  container  %s, %" PRId64 " bytes\n", Input::mimeOf(in.fileFormat()).c_str(), in.fileSize());
    const int64_t dur = in.durationUs();
    if (dur >= 0) printf("  duration   %.3f s\n", dur / 1e6);
    if (bitrate >= 0) printf("  bitrate    %" PRId64 " bit/s\n", bitrate);
    for (size_t i = 0; i < tracks.size(); ++i) {
        const TrackFacts& t = tracks[i];
        printf("  track %zu    %s (%s)", i, t.codec.c_str(), t.mime.c_str());
        if (t.width > 0) {
            printf(", %dx%d", t.displayWidth, t.displayHeight);
            if (t.displayWidth != t.width || t.displayHeight != t.height) printf(" (coded %dx%d)", t.width, t.height);
            if (t.rotation) printf(", rotated %d", t.rotation);
        }
        if (t.sampleRate > 0) printf(", %d Hz", t.sampleRate);
        if (t.channels > 0) printf(", %d ch", t.channels);
        if (t.bits > 0) printf(", %d bit", t.bits);
        if (t.durationUs >= 0) printf(", %.3f s", t.durationUs / 1e6);
        printf(", %" PRId64 " samples (%" PRId64 " sync)\n", t.samples, t.syncSamples);
    }
    if (!d.recordingType.empty()) printf("  recording type  %s\n", d.recordingType.c_str());
    if (!d.location.empty()) printf("  location        %s\n", d.location.c_str());
    if (!d.userMessage.empty()) printf("  user message    %s\n", d.userMessage.c_str());
    if (!d.vrMeta.empty()) printf("  VR metadata     %s\n", d.vrMeta.c_str());
    if (d.waveformValues >= 0) printf("  waveform        %" PRId64 " values\n", d.waveformValues);
    if (d.uuidBytes >= 0) printf("  UUID data       %" PRId64 " bytes\n", d.uuidBytes);
    for (const TrackFacts& t : tracks) {
        if (t.bookmarkSize >= 0) printf("  bookmark size   %d\n", t.bookmarkSize);
    }
}

}  // namespace

int runProbe(const std::vector<std::string>& words) {
    Args args(words, {}, {"--json", "--verify"});
    args.expectPositional(1, "qnedit probe FILE [--json] [--verify]");
    Input in(args.positional()[0]);
    std::vector<TrackFacts> tracks;
    for (size_t i = 0; i < in.trackCount(); ++i) {
        tracks.push_back(describeTrack(in.trackFormat(i), in.wrapper().getTrackMeta(i, 0)));
    }
    ReadCoverage coverage;
    if (args.has("--verify") || !indexed(tracks)) {
        countSamples(in, &tracks, &coverage);
    } else {
        indexDamage(tracks, &coverage);
    }
    int64_t bitrate = -1;
    if (!in.wrapper().getTotalBitrate(&bitrate)) bitrate = -1;
    const DeviceItems items = describeItems(in);
    if (args.has("--json")) {
        printJson(in, tracks, items, bitrate);
    } else {
        printText(in, tracks, items, bitrate);
    }
    fflush(stdout);
    // What could be read is shown; the damage still fails the probe.
    const std::string damage = coverage.describe(in.path());
    if (!damage.empty()) inputError(damage);
    return kExitOk;
}

}  // namespace qnedit
