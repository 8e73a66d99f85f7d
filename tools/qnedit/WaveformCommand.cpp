#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <unistd.h>

#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/foundation/ABuffer.h>

#include "Cli.h"
#include "Commands.h"
#include "Input.h"
#include "Json.h"
#include "OutputFile.h"
#include "Png.h"
#include "Progress.h"
#include "QNMediaAudioWaveForm.h"

using namespace android;
using namespace android::qnmediaeditor;

namespace qnedit {

const char* const kWaveformHelp =
    "usage: qnedit waveform IN [-o OUT.json|OUT.png|OUT.bin]\n"
    "\n"
    "The recording's stored waveform when it has one, else one built from its\n"
    "PCM (WAV, FLAC): one 16-bit value per 20 ms.\n"
    "  -o OUT.json  the values with their interval (also the default, on stdout)\n"
    "  -o OUT.png   a picture of the waveform\n"
    "  -o OUT.bin   the raw values, 16-bit big-endian, as stored in files\n";

namespace {

constexpr int kIntervalUs = 20000;

std::vector<uint16_t> decodeValues(const uint8_t* data, size_t count) {
    std::vector<uint16_t> values(count);
    for (size_t i = 0; i < count; ++i) values[i] = static_cast<uint16_t>((data[2 * i] << 8) | data[2 * i + 1]);
    return values;
}

std::vector<uint16_t> buildFromPcm(Input& in, bool* stored) {
    sp<ABuffer> existing;
    if (in.fileFormat()->findBuffer("AM-waveform1", &existing) && existing != nullptr) {
        *stored = true;
        return decodeValues(existing->data(), existing->size() / 2);
    }
    *stored = false;
    size_t track = in.trackCount();
    for (size_t i = 0; i < in.trackCount(); ++i) {
        if (Input::mimeOf(in.trackFormat(i)) == MEDIA_MIMETYPE_AUDIO_RAW) {
            track = i;
            break;
        }
    }
    if (track == in.trackCount()) inputError(in.path() + ": no stored waveform and no PCM audio to build one from");
    sp<AMessage> format = in.trackFormat(track)->dup();
    sp<QNMediaAudioWaveForm> waveform = new QNMediaAudioWaveForm();
    waveform->init(format);
    if (!waveform->isValid()) inputError(in.path() + ": the audio format cannot give a waveform (1 or 2 channels, 16 or 24 bits)");
    QNMediaExtractorWrapper& w = in.wrapper();
    w.selectTrack(track);
    Progress progress("waveform", in.durationUs());
    sp<ABuffer> buffer;
    int64_t time = 0;
    while (w.getSampleTime(&time) == OK) {
        const status_t err = w.readSampleData(&buffer);
        if (err != OK) inputError(in.path() + ": " + describeStatus(err));
        if (waveform->addSample(buffer) != 0) inputError(in.path() + ": the waveform could not be built");
        progress.update(time);
        if (w.advance() != OK) break;
    }
    progress.finish();
    sp<ABuffer> values;
    int count = 0;
    if (waveform->getSamples(&values, &count) != 0 || values == nullptr) {
        inputError(in.path() + ": too short or too long for a waveform");
    }
    return decodeValues(values->data(), static_cast<size_t>(count));
}

std::string toJson(const std::vector<uint16_t>& values, bool stored) {
    Json j;
    j.beginObject();
    j.value("intervalUs", kIntervalUs);
    j.value("source", stored ? "stored" : "pcm");
    j.value("count", static_cast<int64_t>(values.size()));
    j.beginArray("values");
    for (uint16_t v : values) j.value(nullptr, static_cast<int64_t>(v));
    j.endArray();
    j.endObject();
    return j.str();
}

// Bars around a centre line, each column the loudest value it covers.
RgbImage render(const std::vector<uint16_t>& values) {
    const int width = 1200, height = 240, mid = height / 2;
    RgbImage image(width, height);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) image.set(x, y, 24, 26, 33);
    const size_t n = values.size();
    for (int x = 0; x < width && n > 0; ++x) {
        const size_t from = size_t(x) * n / width;
        const size_t to = std::max(from + 1, size_t(x + 1) * n / width);
        uint16_t peak = 0;
        for (size_t i = from; i < to && i < n; ++i) peak = std::max<uint16_t>(peak, values[i] & 0x7FFF);
        const int half = peak * (mid - 4) / 32767;
        for (int y = mid - half; y <= mid + half; ++y) image.set(x, y, 64, 200, 190);
    }
    for (int x = 0; x < width; ++x) image.set(x, mid, 90, 110, 120);
    return image;
}

void writeAll(OutputFile& out, const void* data, size_t size) {
    const uint8_t* p = static_cast<const uint8_t*>(data);
    while (size > 0) {
        const ssize_t n = write(out.fd(), p, size);
        if (n < 0 && errno == EINTR) continue;
        if (n <= 0) inputError(out.path() + ": write failed (" + systemCause(n < 0 ? errno : EIO) + ")");
        p += n;
        size -= static_cast<size_t>(n);
    }
}

}  // namespace

int runWaveform(const std::vector<std::string>& words) {
    Args args(words, {"-o", "--output"}, {});
    args.expectPositional(1, "qnedit waveform IN [-o OUT.json|OUT.png|OUT.bin]");
    const std::string outPath = args.get("-o", args.get("--output"));
    const std::string ext = lowerExtension(outPath);
    if (!outPath.empty() && ext != "json" && ext != "png" && ext != "bin") usageError("-o must end in .json, .png or .bin");
    if (!outPath.empty()) checkOutputPath(outPath, {args.positional()[0]});
    Input in(args.positional()[0]);
    bool stored = false;
    const std::vector<uint16_t> values = buildFromPcm(in, &stored);
    if (outPath.empty()) {
        fputs(toJson(values, stored).c_str(), stdout);
        return kExitOk;
    }
    OutputFile out(outPath, {args.positional()[0]});
    if (ext == "json") {
        const std::string text = toJson(values, stored);
        writeAll(out, text.data(), text.size());
    } else if (ext == "bin") {
        std::vector<uint8_t> bytes;
        for (uint16_t v : values) {
            bytes.push_back(static_cast<uint8_t>(v >> 8));
            bytes.push_back(static_cast<uint8_t>(v));
        }
        writeAll(out, bytes.data(), bytes.size());
    } else {
        std::string error;
        if (!writePng(out.fd(), render(values), &error)) inputError(outPath + ": " + error);
    }
    out.commit();
    fprintf(stderr, "%zu values (%s) -> %s\n", values.size(), stored ? "stored" : "built from PCM", outPath.c_str());
    return kExitOk;
}

}  // namespace qnedit
