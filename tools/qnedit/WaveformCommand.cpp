#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <unistd.h>

#include <media/stagefright/AudioDecoderSource.h>
#include <media/stagefright/FileSource.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>
#include <media/stagefright/MediaExtractorFactory.h>
#include <media/stagefright/PcmConvert.h>
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
    "usage: qnedit waveform IN [--track N] [-o OUT.json|OUT.png|OUT.bin]\n"
    "\n"
    "The recording's stored waveform when it has one, else one built from the\n"
    "audio of a track, decoded when compressed (AAC, AMR, Vorbis, MP3, FLAC):\n"
    "one 16-bit value per 20 ms. More than two channels count as their mean.\n"
    "  --track N    the track to build it from (default: the first audio track)\n"
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

// The PCM the waveform is built from, as it arrives.
struct PcmSpec {
    int32_t rate = 0;
    int32_t channels = 0;
    PcmSampleType type = PcmSampleType::kS16;
};

bool pcmSpecOf(const sp<AMessage>& format, PcmSpec* spec) {
    int32_t bits = 16, encoding = kAudioEncodingInvalid;
    format->findInt32("bits-per-sample", &bits);
    format->findInt32("pcm-encoding", &encoding);
    if (!format->findInt32("sample-rate", &spec->rate) || !format->findInt32("channel-count", &spec->channels)) return false;
    switch (encoding != kAudioEncodingInvalid ? encoding : bits) {
        case kAudioEncodingPcm8bit: case 8: spec->type = PcmSampleType::kU8; return true;
        case kAudioEncodingPcm16bit: case 16: spec->type = PcmSampleType::kS16; return true;
        case kAudioEncodingPcm24bitPacked: case 24: spec->type = PcmSampleType::kS24; return true;
        case kAudioEncodingPcm32bit: case 32: spec->type = PcmSampleType::kS32; return true;
        case kAudioEncodingPcmFloat: spec->type = PcmSampleType::kFloat; return true;
    }
    return false;
}

// Feeds the waveform builder, which takes one or two channels of 16 or 24
// bits: anything else becomes 16-bit first, and more than two channels their
// mean (a layout-blind downmix keeps every channel's peaks visible).
class WaveformFeed {
public:
    WaveformFeed(const PcmSpec& spec, const std::string& path) : mSpec(spec), mWaveform(new QNMediaAudioWaveForm()) {
        const bool native = spec.type == PcmSampleType::kS16 || spec.type == PcmSampleType::kS24;
        mConvert = spec.channels > 2 || !native;
        sp<AMessage> format = new AMessage;
        format->setInt32("sample-rate", spec.rate);
        format->setInt32("channel-count", spec.channels > 2 ? 1 : spec.channels);
        format->setInt32("bits-per-sample", !mConvert && spec.type == PcmSampleType::kS24 ? 24 : 16);
        mWaveform->init(format);
        if (spec.channels <= 0 || spec.rate <= 0 || !mWaveform->isValid()) {
            inputError(path + ": the audio format cannot give a waveform");
        }
    }

    bool add(const uint8_t* data, size_t size) {
        sp<ABuffer> buffer;
        if (!mConvert) {
            buffer = new ABuffer(const_cast<uint8_t*>(data), size);
            return mWaveform->addSample(buffer) == 0;
        }
        const size_t frameBytes = size_t(mSpec.channels) * BytesPerSample(mSpec.type);
        mPcm.clear();
        AppendPcm16(mSpec.type, false, &data, size / frameBytes, mSpec.channels, &mPcm);
        if (mSpec.channels > 2) {
            const size_t frames = mPcm.size() / mSpec.channels;
            for (size_t i = 0; i < frames; ++i) {
                int32_t sum = 0;
                for (int32_t c = 0; c < mSpec.channels; ++c) sum += mPcm[i * mSpec.channels + c];
                mPcm[i] = static_cast<int16_t>(sum / mSpec.channels);
            }
            mPcm.resize(frames);
        }
        buffer = new ABuffer(mPcm.data(), mPcm.size() * sizeof(int16_t));
        return mWaveform->addSample(buffer) == 0;
    }

    const sp<QNMediaAudioWaveForm>& waveform() const { return mWaveform; }

private:
    static size_t BytesPerSample(PcmSampleType type) {
        switch (type) {
            case PcmSampleType::kU8: return 1;
            case PcmSampleType::kS16: return 2;
            case PcmSampleType::kS24: return 3;
            case PcmSampleType::kS32: case PcmSampleType::kFloat: return 4;
            case PcmSampleType::kDouble: return 8;
        }
        return 1;
    }

    const PcmSpec mSpec;
    bool mConvert = false;
    sp<QNMediaAudioWaveForm> mWaveform;
    std::vector<int16_t> mPcm;
};

// The track's own PCM, through the wrapper.
void feedRaw(Input& in, size_t track, sp<QNMediaAudioWaveForm>* out) {
    PcmSpec spec;
    if (!pcmSpecOf(in.trackFormat(track), &spec)) inputError(in.path() + ": the PCM format cannot give a waveform");
    WaveformFeed feed(spec, in.path());
    QNMediaExtractorWrapper& w = in.wrapper();
    w.selectTrack(track);
    Progress progress("waveform", in.durationUs());
    sp<ABuffer> buffer;
    int64_t time = 0;
    while (w.getSampleTime(&time) == OK) {
        const status_t err = w.readSampleData(&buffer);
        if (err != OK) inputError(in.path() + ": " + describeStatus(err));
        if (!feed.add(buffer->data(), buffer->size())) inputError(in.path() + ": the waveform could not be built");
        progress.update(time);
        if (w.advance() != OK) break;
    }
    progress.finish();
    *out = feed.waveform();
}

// Compressed audio, decoded by the platform; damaged samples are silence.
void feedDecoded(Input& in, size_t track, sp<QNMediaAudioWaveForm>* out) {
    sp<IMediaExtractor> extractor = MediaExtractorFactory::Create(new FileSource(in.path().c_str()));
    sp<AudioDecoderSource> decoder =
        extractor != nullptr && track < extractor->countTracks() ? AudioDecoderSource::Create(extractor->getTrack(track))
                                                                 : nullptr;
    if (decoder == nullptr) inputError(in.path() + ": track " + std::to_string(track) + " cannot be decoded");
    status_t err = decoder->start();
    if (err != OK) inputError(in.path() + ": " + describeStatus(err));
    PcmSpec spec;  // 16-bit
    const sp<MetaData> format = decoder->getFormat();
    format->findInt32(kKeySampleRate, &spec.rate);
    format->findInt32(kKeyChannelCount, &spec.channels);
    WaveformFeed feed(spec, in.path());
    Progress progress("waveform", in.durationUs());
    MediaBufferBase* buffer = nullptr;
    while ((err = decoder->read(&buffer)) == OK) {
        int64_t time = 0;
        buffer->meta_data().findInt64(kKeyTime, &time);
        const bool ok = feed.add(static_cast<const uint8_t*>(buffer->data()) + buffer->range_offset(),
                                 buffer->range_length());
        buffer->release();
        if (!ok) inputError(in.path() + ": the waveform could not be built");
        progress.update(time);
    }
    progress.finish();
    decoder->stop();
    if (err != ERROR_END_OF_STREAM) inputError(in.path() + ": " + describeStatus(err));
    *out = feed.waveform();
}

// --track N, else the first audio track (the audio of a video too).
size_t chooseTrack(Input& in, long requested) {
    if (requested >= 0) {
        if (size_t(requested) >= in.trackCount() || !Input::isAudio(in.trackFormat(requested))) {
            inputError(in.path() + ": track " + std::to_string(requested) + " is not an audio track");
        }
        return size_t(requested);
    }
    for (size_t i = 0; i < in.trackCount(); ++i) {
        if (Input::isAudio(in.trackFormat(i))) return i;
    }
    inputError(in.path() + ": no stored waveform and no audio track to build one from");
    return 0;
}

std::vector<uint16_t> buildWaveform(Input& in, long requestedTrack, bool* stored) {
    sp<ABuffer> existing;
    if (in.fileFormat()->findBuffer("AM-waveform1", &existing) && existing != nullptr) {
        *stored = true;
        return decodeValues(existing->data(), existing->size() / 2);
    }
    *stored = false;
    const size_t track = chooseTrack(in, requestedTrack);
    sp<QNMediaAudioWaveForm> waveform;
    if (Input::mimeOf(in.trackFormat(track)) == MEDIA_MIMETYPE_AUDIO_RAW) {
        feedRaw(in, track, &waveform);
    } else {
        feedDecoded(in, track, &waveform);
    }
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
    Args args(words, {"-o", "--output", "--track"}, {});
    args.expectPositional(1, "qnedit waveform IN [--track N] [-o OUT.json|OUT.png|OUT.bin]");
    const long track = args.getIntIn("--track", -1, 0, 1 << 20);
    const std::string outPath = args.get("-o", args.get("--output"));
    const std::string ext = lowerExtension(outPath);
    if (!outPath.empty() && ext != "json" && ext != "png" && ext != "bin") usageError("-o must end in .json, .png or .bin");
    if (!outPath.empty()) checkOutputPath(outPath, {args.positional()[0]});
    Input in(args.positional()[0]);
    bool stored = false;
    const std::vector<uint16_t> values = buildWaveform(in, track, &stored);
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
