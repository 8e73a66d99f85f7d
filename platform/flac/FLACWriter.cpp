#define LOG_TAG "FLACWriter"
#include <media/stagefright/FLACWriter.h>

#include <algorithm>
#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>
#include <media/stagefright/MediaErrors.h>

#include "extractor/DeviceKeys.h"
#include "flac/FlacFrameHeader.h"
#include "flac/FlacPcmEncoder.h"
#include "flac/FlacStreamHeader.h"
#include "writer/WriterDeviceItems.h"
#include "writer/PcmLayout.h"
#include "writer/SingleSourceWriter.h"

// File layout: "fLaC", STREAMINFO, the source's VORBIS_COMMENT and PICTURE
// blocks, APPLICATION blocks "umsg" (user message text), "rmod" (recording
// meta text) and "bksz" (bookmark size, 8-byte big-endian), then the tail:
// APPLICATION "wafm" (the waveform's big-endian 16-bit values) and PADDING,
// the last metadata block; then the frames.
//
// STREAMINFO has a fixed size and is rewritten in place on stop(). The
// waveform is usually computed while the samples are written, so it may come
// after start(): it then takes the padding's room, and only when that is too
// small are the frames moved further back (which needs a descriptor that can
// also be read).
//
// Compressed input is one whole frame per buffer. Its stream header comes
// from the track format (kKeyFlacMetadata) or from the first codec-config
// buffer; codec-config buffers are never written as frames. The MD5 of such
// a stream cannot be known and is stored as zero ("not computed").

namespace android {

namespace {

constexpr size_t kPaddingBytes = 8192;
constexpr size_t kStreamInfoBodyOffset = 8;  // after "fLaC" and the block header
constexpr size_t kMoveChunk = 64 * 1024;

bool startsWithMarker(const uint8_t* p, size_t size) { return size >= 4 && memcmp(p, "fLaC", 4) == 0; }

// Moves everything from `at` to the end of the sink `n` bytes further back.
status_t insertRoom(ByteSink& sink, int64_t at, size_t n) {
    const int64_t end = sink.position();
    std::vector<uint8_t> chunk(std::min(kMoveChunk, std::max<size_t>(n, 1)));
    // Find out whether the sink reads back before anything is changed.
    status_t err = end > 0 ? sink.readAt(0, chunk.data(), 1) : OK;
    if (err != OK) return err;
    std::fill(chunk.begin(), chunk.end(), 0);
    for (size_t grown = 0; grown < n;) {
        const size_t step = std::min(chunk.size(), n - grown);
        if ((err = sink.write(chunk.data(), step)) != OK) return err;
        grown += step;
    }
    chunk.resize(kMoveChunk);
    for (int64_t pos = end; pos > at;) {
        const size_t step = static_cast<size_t>(std::min<int64_t>(kMoveChunk, pos - at));
        pos -= static_cast<int64_t>(step);
        if ((err = sink.readAt(pos, chunk.data(), step)) != OK) return err;
        if ((err = sink.writeAt(pos + static_cast<int64_t>(n), chunk.data(), step)) != OK) return err;
    }
    return OK;
}

void putBE64(uint8_t out[8], int64_t v) {
    for (int i = 0; i < 8; ++i) out[i] = uint8_t(static_cast<uint64_t>(v) >> (56 - 8 * i));
}

}  // namespace

struct FLACWriter::Impl : public SingleSourceWriter::Format {
    explicit Impl(int fd) : core(fd, "FLACWriter", this) {}
    ~Impl() override { core.stop(); }

    status_t checkSource(const sp<MetaData>& format) override;
    status_t writeHeader(ByteSink& sink, const sp<MetaData>& format) override;
    status_t writeSample(ByteSink& sink, MediaBufferBase& buffer) override;
    status_t finish(ByteSink& sink) override;
    // Copied frames come one per sample: unbuffered, a long cut made one
    // write call per frame.
    size_t writeBuffer() const override { return FdSink::kWriterBuffer; }

    status_t writeStreamHeader(ByteSink& sink, const FlacStreamHeader& header);
    // The waveform block (when there is one) and a PADDING block of
    // `paddingBody` bytes, or no padding when it is negative.
    bool buildTail(const WriterDeviceItems::Snapshot& items, long paddingBody, std::vector<uint8_t>* out) const;
    status_t replaceTail(ByteSink& sink, const WriterDeviceItems::Snapshot& items);
    status_t writeFrame(ByteSink& sink, const uint8_t* data, size_t size);
    bool headerFromTrack(const FlacFrameHeader* frame, FlacStreamHeader* out) const;
    void frameStatistics(FlacStreamInfo* info) const;

    WriterDeviceItems items{"FLACWriter"};
    bool pcmInput = false;
    PcmLayout layout;
    sp<MetaData> trackFormat;
    FlacPcmEncoder encoder;

    bool headerWritten = false;
    FlacStreamInfo info;
    int64_t tailOffset = 0;
    size_t tailBytes = 0;
    std::vector<uint8_t> tailWaveform;
    bool tailHasWaveform = false;

    uint64_t frames = 0, totalSamples = 0;
    uint32_t minBlock = UINT32_MAX, maxBlock = 0, lastBlock = 0;
    size_t minFrame = SIZE_MAX, maxFrame = 0;
    bool variableBlocks = false;
    size_t dropped = 0;

    SingleSourceWriter core;  // last: stopped before the rest goes
};

status_t FLACWriter::Impl::checkSource(const sp<MetaData>& format) {
    const char* mime = nullptr;
    format->findCString(kKeyMIMEType, &mime);
    if (mime != nullptr && strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_RAW) == 0) {
        PcmLayout candidate;
        const status_t err = PcmLayout::fromMetaData(format, "FLACWriter", &candidate);
        if (err != OK) return err;
        if (!FlacPcmEncoder::supports(candidate)) {
            ALOGE("cannot encode %d-bit%s PCM, %d channels, %d Hz", candidate.bitsPerSample,
                  candidate.isFloat() ? " float" : "", candidate.channels, candidate.sampleRate);
            return ERROR_UNSUPPORTED;
        }
        layout = candidate;
        pcmInput = true;
    } else if (mime != nullptr && (strcasecmp(mime, MEDIA_MIMETYPE_AUDIO_FLAC) == 0 ||
                                   // the device's variant is taken as FLAC frames too
                                   strcasecmp(mime, KVU_MEDIA_MIMETYPE_AUDIO_FLAC_QNSW) == 0)) {
        pcmInput = false;
    } else {
        ALOGE("only FLAC frames or raw audio can be written (got %s)", mime ? mime : "no MIME type");
        return ERROR_UNSUPPORTED;
    }
    trackFormat = format;
    return OK;
}

bool FLACWriter::Impl::buildTail(const WriterDeviceItems::Snapshot& s, long paddingBody, std::vector<uint8_t>* out) const {
    out->clear();
    if (s.hasWaveform &&
        !FlacStreamHeader::appendApplicationBlock(out, "wafm", paddingBody < 0, s.waveform.data(), s.waveform.size())) {
        ALOGE("the waveform (%zu bytes) is too large for a metadata block", s.waveform.size());
        return false;
    }
    if (paddingBody >= 0) FlacStreamHeader::appendPaddingBlock(out, true, static_cast<size_t>(paddingBody));
    return true;
}

status_t FLACWriter::Impl::writeStreamHeader(ByteSink& sink, const FlacStreamHeader& header) {
    const WriterDeviceItems::Snapshot s = items.snapshot();
    std::vector<uint8_t> out = {'f', 'L', 'a', 'C'};
    uint8_t body[FlacStreamInfo::kBodyBytes];
    header.info.serialize(body);
    FlacStreamHeader::appendBlock(&out, kFlacStreamInfo, false, body, sizeof(body));
    for (const FlacStreamHeader::Block& block : header.kept) {
        FlacStreamHeader::appendBlock(&out, block.type, false, block.body.data(), block.body.size());
    }
    bool ok = true;
    if (s.hasUserMessage) {
        ok &= FlacStreamHeader::appendApplicationBlock(&out, "umsg", false, s.userMessage.data(), s.userMessage.size());
    }
    if (s.hasRecMode) {
        ok &= FlacStreamHeader::appendApplicationBlock(&out, "rmod", false, s.recMode.data(), s.recMode.size());
    }
    if (s.hasBookmarkSize) {
        uint8_t be[8];
        putBE64(be, s.bookmarkSize);
        ok &= FlacStreamHeader::appendApplicationBlock(&out, "bksz", false, be, sizeof(be));
    }
    std::vector<uint8_t> tail;
    if (!ok || !buildTail(s, static_cast<long>(kPaddingBytes), &tail)) {
        ALOGE("a device item is too large for a metadata block");
        return ERROR_OUT_OF_RANGE;
    }
    tailOffset = static_cast<int64_t>(out.size());
    tailBytes = tail.size();
    tailWaveform = s.waveform;
    tailHasWaveform = s.hasWaveform;
    out.insert(out.end(), tail.begin(), tail.end());
    const status_t err = sink.write(out.data(), out.size());
    if (err != OK) return err;
    info = header.info;
    headerWritten = true;
    return OK;
}

status_t FLACWriter::Impl::writeHeader(ByteSink& sink, const sp<MetaData>& format) {
    if (pcmInput) {
        status_t err = encoder.init(layout, &sink);
        if (err != OK) return err;
        FlacStreamHeader header;
        header.info = encoder.initialInfo();
        return writeStreamHeader(sink, header);
    }
    uint32_t type;
    const void* data;
    size_t size;
    if (format->findData(kKeyFlacMetadata, &type, &data, &size)) {
        FlacStreamHeader header;
        if (FlacStreamHeader::parse(static_cast<const uint8_t*>(data), size, &header)) {
            return writeStreamHeader(sink, header);
        }
        ALOGW("the track's stream header (%zu bytes) is unreadable; waiting for a codec-config buffer", size);
    }
    return OK;  // written with the first codec-config buffer or frame
}

bool FLACWriter::Impl::headerFromTrack(const FlacFrameHeader* frame, FlacStreamHeader* out) const {
    int32_t rate = 0, channels = 0, bits = 0;
    trackFormat->findInt32(kKeySampleRate, &rate);
    trackFormat->findInt32(kKeyChannelCount, &channels);
    if (!trackFormat->findInt32(kKeyDeviceBitsPerSample, &bits)) trackFormat->findInt32(kKeyBitsPerSample, &bits);
    FlacStreamInfo& s = out->info;
    s.sampleRate = frame && frame->sampleRate ? frame->sampleRate : static_cast<uint32_t>(std::max(rate, 0));
    s.channels = frame ? frame->channels : static_cast<uint32_t>(std::max(channels, 0));
    s.bitsPerSample = frame && frame->bitsPerSample ? frame->bitsPerSample : static_cast<uint32_t>(std::max(bits, 0));
    s.minBlockSize = s.maxBlockSize = frame ? frame->blockSize : 4096;
    return s.sampleRate > 0 && s.sampleRate <= 0xFFFFF && s.channels >= 1 && s.channels <= 8 &&
           s.bitsPerSample >= 4 && s.bitsPerSample <= 32;
}

status_t FLACWriter::Impl::writeFrame(ByteSink& sink, const uint8_t* data, size_t size) {
    FlacFrameHeader frame;
    if (!FlacFrameHeader::parse(data, size, &frame) || frame.headerBytes + 2 > size) {
        ++dropped;
        ALOGW("dropped a buffer of %zu bytes that is not a FLAC frame", size);
        return OK;
    }
    if (!headerWritten) {
        FlacStreamHeader header;
        if (!headerFromTrack(&frame, &header)) {
            ++dropped;
            ALOGW("dropped a frame that came before any stream header");
            return OK;
        }
        ALOGW("no stream header before the first frame; built one from the frame");
        const status_t err = writeStreamHeader(sink, header);
        if (err != OK) return err;
    }
    // A frame of another stream would make the rest undecodable.
    if (frame.channels != info.channels || (frame.sampleRate != 0 && frame.sampleRate != info.sampleRate) ||
        (frame.bitsPerSample != 0 && frame.bitsPerSample != info.bitsPerSample) ||
        (frames > 0 && frame.variableBlockSize != variableBlocks)) {
        ++dropped;
        ALOGW("dropped a frame that does not match the stream (%u ch, %u Hz, %u bits)", frame.channels,
              frame.sampleRate, frame.bitsPerSample);
        return OK;
    }
    const status_t err = sink.write(data, size);
    if (err != OK) return err;
    // The last block may be short, so the minimum leaves it out.
    if (frames > 0) minBlock = std::min(minBlock, lastBlock);
    maxBlock = std::max(maxBlock, frame.blockSize);
    lastBlock = frame.blockSize;
    minFrame = std::min(minFrame, size);
    maxFrame = std::max(maxFrame, size);
    totalSamples += frame.blockSize;
    variableBlocks = frame.variableBlockSize;
    ++frames;
    return OK;
}

status_t FLACWriter::Impl::writeSample(ByteSink& sink, MediaBufferBase& buffer) {
    const uint8_t* data = static_cast<const uint8_t*>(buffer.data()) + buffer.range_offset();
    const size_t size = buffer.range_length();
    if (pcmInput) return encoder.encode(data, size);

    int32_t config = 0;
    if ((buffer.meta_data().findInt32(kKeyIsCodecConfig, &config) && config != 0) || startsWithMarker(data, size)) {
        if (headerWritten) {
            ALOGD("codec-config buffer after the stream header, not written");
            return OK;
        }
        FlacStreamHeader header;
        if (!FlacStreamHeader::parse(data, size, &header)) {
            ++dropped;
            ALOGW("dropped an unreadable stream header of %zu bytes", size);
            return OK;
        }
        return writeStreamHeader(sink, header);
    }
    return writeFrame(sink, data, size);
}

void FLACWriter::Impl::frameStatistics(FlacStreamInfo* s) const {
    if (frames > 0) {
        s->minBlockSize = frames > 1 ? minBlock : lastBlock;
        s->maxBlockSize = maxBlock;
    }
    // Fields too narrow for the value say "unknown" instead.
    s->minFrameSize = frames > 0 && maxFrame <= 0xFFFFFF ? static_cast<uint32_t>(minFrame) : 0;
    s->maxFrameSize = frames > 0 && maxFrame <= 0xFFFFFF ? static_cast<uint32_t>(maxFrame) : 0;
    s->totalSamples = totalSamples < (1ull << 36) ? totalSamples : 0;
    memset(s->md5, 0, sizeof(s->md5));
}

status_t FLACWriter::Impl::replaceTail(ByteSink& sink, const WriterDeviceItems::Snapshot& s) {
    const size_t waveformBlock = s.hasWaveform ? 8 + s.waveform.size() : 0;
    std::vector<uint8_t> tail;
    bool built;
    if (waveformBlock == tailBytes) {
        built = buildTail(s, -1, &tail);
    } else if (waveformBlock + 4 <= tailBytes) {
        built = buildTail(s, static_cast<long>(tailBytes - waveformBlock - 4), &tail);
    } else {
        built = buildTail(s, static_cast<long>(kPaddingBytes), &tail);
        if (built) {
            const status_t err = insertRoom(sink, tailOffset + static_cast<int64_t>(tailBytes), tail.size() - tailBytes);
            if (err != OK) {
                ALOGE("no room for the waveform before the frames, and the file cannot be read back to move them");
                return err;
            }
        }
    }
    if (!built) return ERROR_OUT_OF_RANGE;
    return sink.writeAt(tailOffset, tail.data(), tail.size());
}

status_t FLACWriter::Impl::finish(ByteSink& sink) {
    items.close();
    status_t err = OK;
    if (pcmInput) {
        err = encoder.finish(&info);
    } else {
        if (!headerWritten) {
            FlacStreamHeader header;
            if (!headerFromTrack(nullptr, &header)) {
                ALOGE("no stream header and no frame: nothing to write");
                return ERROR_MALFORMED;
            }
            if ((err = writeStreamHeader(sink, header)) != OK) return err;
        }
        frameStatistics(&info);
        if (dropped > 0) ALOGW("%zu buffers were not written", dropped);
    }
    uint8_t body[FlacStreamInfo::kBodyBytes];
    info.serialize(body);
    const status_t infoErr = sink.writeAt(kStreamInfoBodyOffset, body, sizeof(body));
    if (err == OK) err = infoErr;
    const WriterDeviceItems::Snapshot s = items.snapshot();
    if (s.hasWaveform != tailHasWaveform || s.waveform != tailWaveform) {
        const status_t tailErr = replaceTail(sink, s);
        if (err == OK) err = tailErr;
    }
    return err;
}

FLACWriter::FLACWriter(int fd) : mImpl(new Impl(fd)) {}
FLACWriter::~FLACWriter() {}

status_t FLACWriter::addSource(const sp<MediaSource>& source) { return mImpl->core.addSource(source); }

status_t FLACWriter::start(MetaData*) {
    mImpl->items.seal();
    return mImpl->core.start();
}

status_t FLACWriter::stop() { return mImpl->core.stop(); }
status_t FLACWriter::pause() { return mImpl->core.pause(); }
bool FLACWriter::reachedEOS() { return mImpl->core.reachedEOS(); }
void FLACWriter::setWaveform(const uint8_t* data, int count) { mImpl->items.setWaveform(data, count); }
status_t FLACWriter::setUserMessage(const uint8_t* message) { return mImpl->items.setUserMessage(message); }

status_t FLACWriter::setAudioRecodingMeta(int kind, const String8& text) {
    return mImpl->items.setRecMode(kind, text);
}

status_t FLACWriter::setRecodingParams(const sp<AMessage>& params) {
    return mImpl->items.setRecordingParams(params);
}

}  // namespace android
