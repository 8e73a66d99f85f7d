#define LOG_TAG "QNWAVEWriter"
#include <media/stagefright/QNWAVEWriter.h>

#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "writer/WriterDeviceItems.h"
#include "writer/PcmLayout.h"
#include "writer/SingleSourceWriter.h"
#include "writers/WaveChunks.h"

// File layout: the RIFF header, "fmt " (and "fact" for float data), "data",
// then the device's items in chunks of their own: "wafm" (the waveform's
// big-endian 16-bit values), "umsg" (user message text), "rmod" (recording
// meta text), "bksz" (bookmark size, 8-byte little-endian). Text carries no
// terminator. The RIFF size is 32-bit: data that would take the file past
// 4 GiB is cut at the last whole frame that fits and stop() answers
// ERROR_OUT_OF_RANGE; the file written is still complete.

namespace android {

namespace {
// Room kept for the items after the data: those set before start are known,
// the waveform may still come (at most a few hundred kilobytes).
constexpr uint64_t kWaveformRoom = 1 << 20;

void putLE32At(std::vector<uint8_t>* v, size_t offset, uint32_t value) {
    for (int i = 0; i < 4; ++i) (*v)[offset + i] = uint8_t(value >> (8 * i));
}
}  // namespace

struct QNWAVEWriter::Impl : public SingleSourceWriter::Format {
    explicit Impl(int fd) : core(fd, "QNWAVEWriter", this) {}
    ~Impl() override { core.stop(); }

    status_t checkSource(const sp<MetaData>& format) override;
    status_t writeHeader(ByteSink& sink, const sp<MetaData>& format) override;
    status_t writeSample(ByteSink& sink, MediaBufferBase& buffer) override;
    status_t finish(ByteSink& sink) override;

    std::vector<uint8_t> trailer(const WriterDeviceItems::Snapshot& items) const;

    WriterDeviceItems items{"QNWAVEWriter"};
    PcmLayout layout;
    WaveChunks::Header header;
    uint64_t dataBytes = 0;
    uint64_t maxDataBytes = 0;
    SingleSourceWriter core;  // last: stopped before the rest goes
};

status_t QNWAVEWriter::Impl::checkSource(const sp<MetaData>& format) {
    const char* mime = nullptr;
    if (!format->findCString(kKeyMIMEType, &mime) || strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_RAW) != 0) {
        ALOGE("only raw audio can be written (got %s)", mime ? mime : "no MIME type");
        return ERROR_UNSUPPORTED;
    }
    PcmLayout candidate;
    const status_t err = PcmLayout::fromMetaData(format, "QNWAVEWriter", &candidate);
    if (err != OK) return err;
    if (candidate.frameBytes() > 0xFFFF || static_cast<uint64_t>(candidate.sampleRate) * candidate.frameBytes() > 0xFFFFFFFFull) {
        ALOGE("%d channels at %d Hz do not fit a WAVE header", candidate.channels, candidate.sampleRate);
        return ERROR_UNSUPPORTED;
    }
    layout = candidate;
    return OK;
}

std::vector<uint8_t> QNWAVEWriter::Impl::trailer(const WriterDeviceItems::Snapshot& s) const {
    std::vector<uint8_t> out;
    if (s.hasWaveform) WaveChunks::appendChunk(&out, "wafm", s.waveform.data(), s.waveform.size());
    if (s.hasUserMessage) WaveChunks::appendChunk(&out, "umsg", s.userMessage.data(), s.userMessage.size());
    if (s.hasRecMode) WaveChunks::appendChunk(&out, "rmod", s.recMode.data(), s.recMode.size());
    if (s.hasBookmarkSize) {
        uint8_t le[8];
        for (int i = 0; i < 8; ++i) le[i] = uint8_t(static_cast<uint64_t>(s.bookmarkSize) >> (8 * i));
        WaveChunks::appendChunk(&out, "bksz", le, sizeof(le));
    }
    return out;
}

status_t QNWAVEWriter::Impl::writeHeader(ByteSink& sink, const sp<MetaData>&) {
    header = WaveChunks::buildHeader(layout);
    WriterDeviceItems::Snapshot known = items.snapshot();
    known.waveform.clear();
    known.hasWaveform = false;
    maxDataBytes = WaveChunks::maxDataBytes(header.bytes.size(), trailer(known).size() + kWaveformRoom,
                                            layout.frameBytes());
    return sink.write(header.bytes.data(), header.bytes.size());
}

status_t QNWAVEWriter::Impl::writeSample(ByteSink& sink, MediaBufferBase& buffer) {
    const uint8_t* data = static_cast<const uint8_t*>(buffer.data()) + buffer.range_offset();
    size_t size = buffer.range_length();
    bool full = false;
    if (dataBytes + size > maxDataBytes) {
        size = static_cast<size_t>(maxDataBytes - dataBytes);
        full = true;
    }
    if (size > 0) {
        const status_t err = sink.write(data, size);
        if (err != OK) return err;
        dataBytes += size;
    }
    if (full) {
        ALOGE("the data chunk reached the 4 GiB limit of the format; the rest is dropped");
        return ERROR_OUT_OF_RANGE;
    }
    return OK;
}

status_t QNWAVEWriter::Impl::finish(ByteSink& sink) {
    items.close();
    std::vector<uint8_t> tail;
    if (dataBytes & 1) tail.push_back(0);
    const std::vector<uint8_t> itemChunks = trailer(items.snapshot());
    const uint64_t riffSize = (header.bytes.size() - 8) + dataBytes + tail.size() + itemChunks.size();
    if (riffSize <= 0xFFFFFFFFull) {
        tail.insert(tail.end(), itemChunks.begin(), itemChunks.end());
    } else {
        ALOGE("the device's items do not fit in the file any more; left out");
    }
    status_t err = tail.empty() ? OK : sink.write(tail.data(), tail.size());
    if (err != OK) return err;

    std::vector<uint8_t>& h = header.bytes;
    putLE32At(&h, 4, static_cast<uint32_t>(sink.position() - 8));
    putLE32At(&h, header.dataSizeOffset, static_cast<uint32_t>(dataBytes));
    if (header.factFramesOffset != 0) {
        putLE32At(&h, header.factFramesOffset, static_cast<uint32_t>(dataBytes / layout.frameBytes()));
    }
    err = sink.writeAt(0, h.data(), h.size());
    if (err == OK && riffSize > 0xFFFFFFFFull) err = ERROR_OUT_OF_RANGE;
    return err;
}

QNWAVEWriter::QNWAVEWriter(int fd) : mImpl(new Impl(fd)) {}
QNWAVEWriter::~QNWAVEWriter() {}

status_t QNWAVEWriter::addSource(const sp<MediaSource>& source) { return mImpl->core.addSource(source); }

status_t QNWAVEWriter::start(MetaData*) {
    mImpl->items.seal();
    return mImpl->core.start();
}

status_t QNWAVEWriter::stop() { return mImpl->core.stop(); }
status_t QNWAVEWriter::pause() { return mImpl->core.pause(); }
bool QNWAVEWriter::reachedEOS() { return mImpl->core.reachedEOS(); }
void QNWAVEWriter::setWaveform(const uint8_t* data, int count) { mImpl->items.setWaveform(data, count); }
status_t QNWAVEWriter::setUserMessage(const uint8_t* message) { return mImpl->items.setUserMessage(message); }

status_t QNWAVEWriter::setAudioRecodingMeta(int kind, const String8& text) {
    return mImpl->items.setRecMode(kind, text);
}

status_t QNWAVEWriter::setRecodingParams(const sp<AMessage>& params) {
    return mImpl->items.setRecordingParams(params);
}

}  // namespace android
