#define LOG_TAG "FLACExtractor"
#include "flac/FLACExtractor.h"

#include <algorithm>
#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>

#include "extractor/DeviceKeys.h"
#include "extractor/ID3v2Tag.h"
#include "extractor/Sniffers.h"
#include "extractor/SubDataSource.h"
#include "flac/FLACDecoder.h"
#include "flac/FLACFrameScanner.h"
#include "flac/FLACPcmSource.h"
#include "flac/FLACRawSource.h"

namespace android {

namespace {

// The bytes of another source up to `size`: a tag after the last frame is
// then not taken for the start of a frame.
class HeadDataSource : public DataSource {
public:
    HeadDataSource(const sp<DataSource>& source, off64_t size) : mSource(source), mSize(size) {}
    status_t initCheck() const override { return mSource->initCheck(); }
    ssize_t readAt(off64_t offset, void* data, size_t size) override {
        if (offset < 0 || offset >= mSize) return 0;
        return mSource->readAt(offset, data, static_cast<size_t>(std::min<uint64_t>(size, mSize - offset)));
    }
    status_t getSize(off64_t* size) override {
        *size = mSize;
        return OK;
    }

private:
    const sp<DataSource> mSource;
    const off64_t mSize;
};

// Tails wider than this without one whole frame are not a cut-short FLAC
// but something else after the frames: the end is left unknown.
constexpr off64_t kMaxTailBytes = 16 * 1024 * 1024;

// The sample just past the last whole frame near the end of the file (0 when
// there is none). Only the tail is read: it is widened while it holds no
// whole frame, which takes a damaged file. False when the end stays unknown.
bool StreamEndSample(const sp<DataSource>& source, const FLACMetadata& meta, off64_t fileSize, uint64_t* endSample) {
    // An ID3v1 tag (128 bytes starting "TAG") may follow the frames.
    uint8_t tag[3];
    if (fileSize - meta.firstFrameOffset > 128 && source->readExactly(fileSize - 128, tag, sizeof(tag)) &&
        memcmp(tag, "TAG", 3) == 0) {
        fileSize -= 128;
    }
    FLACFrameScanner scanner(new HeadDataSource(source, fileSize), meta.streamInfo, meta.firstFrameOffset);
    const off64_t area = fileSize - meta.firstFrameOffset;
    for (off64_t span = std::max<off64_t>(256 * 1024, 4 * off64_t(scanner.maxFrameSize()));; span *= 4) {
        const bool whole = span >= area;
        off64_t from = whole ? meta.firstFrameOffset : fileSize - span;
        bool found = false;
        uint64_t end = 0;
        FLACFrame frame;
        while (scanner.findFrame(from, &frame) == OK) {
            found = true;
            end = std::max<uint64_t>(end, frame.firstSample + frame.blockSize);
            from = frame.offset + static_cast<off64_t>(frame.size);
        }
        if (found || whole) {
            *endSample = end;
            return true;
        }
        if (span >= kMaxTailBytes) {
            ALOGW("no whole frame in the last %lld bytes; where the stream ends is not known", (long long)span);
            return false;
        }
    }
}

// Samples and sync samples handed out (one per frame, each a sync sample),
// and where the frames stop when the file ends early. Streams of one block
// size are counted from STREAMINFO; others would need every frame read.
void SetIndexFacts(MetaData* t, const FlacStreamInfo& info, uint64_t endSample) {
    const uint64_t total = info.totalSamples != 0 ? info.totalSamples : endSample;
    if (info.minBlockSize == info.maxBlockSize && info.maxBlockSize > 0) {
        const int64_t frames = static_cast<int64_t>((total + info.maxBlockSize - 1) / info.maxBlockSize);
        t->setInt64(kKeySampleCount, frames);
        t->setInt64(kKeySyncSampleCount, frames);
    }
    if (endSample < total) t->setInt64(kKeyTruncatedAtUs, TicksToUs(endSample, info.sampleRate));
}

int32_t PcmEncodingFor(uint32_t bits) {
    return bits == 16 ? kAudioEncodingPcm16bit : bits == 24 ? kAudioEncodingPcm24bitPacked : kAudioEncodingPcm32bit;
}

// What both output forms share.
void SetCommonTrackMeta(MetaData* t, const FLACMetadata& meta, off64_t fileSize, uint64_t endSample) {
    const FlacStreamInfo& info = meta.streamInfo;
    SetIndexFacts(t, info, endSample);
    t->setInt32(kKeySampleRate, static_cast<int32_t>(info.sampleRate));
    t->setInt32(kKeyChannelCount, static_cast<int32_t>(info.channels));
    t->setData(kKeyFlacStreamInfoRaw, 0, meta.streamInfoBlock, sizeof(meta.streamInfoBlock));
    // "fLaC" and STREAMINFO as the only (so last) metadata block.
    uint8_t header[4 + FLACMetadata::kStreamInfoBlockSize];
    memcpy(header, "fLaC", 4);
    memcpy(header + 4, meta.streamInfoBlock, sizeof(meta.streamInfoBlock));
    header[4] |= 0x80;
    t->setData(kKeyFlacMetadata, 0, header, sizeof(header));
    // Without a total in STREAMINFO the last frame gives the length.
    const uint64_t total = info.totalSamples != 0 ? info.totalSamples : endSample;
    if (total != 0) {
        const int64_t durationUs = TicksToUs(total, info.sampleRate);
        t->setInt64(kKeyDuration, durationUs);
        if (durationUs > 0 && fileSize > meta.firstFrameOffset) {
            const int64_t bits = (fileSize - meta.firstFrameOffset) * 8;
            const int64_t bitrate = static_cast<int64_t>(static_cast<__int128>(bits) * 1000000 / durationUs);
            if (bitrate > 0 && bitrate <= INT32_MAX) t->setInt32(kKeyBitRate, static_cast<int32_t>(bitrate));
        }
    }
    meta.items.publishTrackItems(t);
}

}  // namespace

sp<FLACExtractor> FLACExtractor::Create(const sp<DataSource>& source) {
    FLACMetadata meta;
    const status_t err = ParseFLACMetadata(source, &meta);
    if (err != OK) {
        ALOGW("not a usable FLAC stream (%d)", err);
        return nullptr;
    }
    return new FLACExtractor(source, meta);
}

FLACExtractor::FLACExtractor(const sp<DataSource>& source, const FLACMetadata& meta)
    : SingleTrackExtractor(MEDIA_MIMETYPE_CONTAINER_FLAC), mSource(source), mMeta(meta), mRawMeta(new MetaData) {
    meta.items.publishFileItems(mFileMeta.get());

    off64_t fileSize;
    if (source->getSize(&fileSize) != OK) fileSize = -1;
    const FlacStreamInfo& info = meta.streamInfo;
    uint64_t endSample = info.totalSamples;  // taken as whole when its end is not known
    if (fileSize > 0) StreamEndSample(source, meta, fileSize, &endSample);

    SetCommonTrackMeta(mTrackMeta.get(), meta, fileSize, endSample);
    const uint32_t bits = FLACDecoder::OutputBits(info.bitsPerSample);
    mTrackMeta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
    mTrackMeta->setInt32(kKeyBitsPerSample, static_cast<int32_t>(bits));
    mTrackMeta->setInt32(kKeyDeviceBitsPerSample, static_cast<int32_t>(bits));
    mTrackMeta->setInt32(kKeyPcmEncoding, PcmEncodingFor(bits));
    mTrackMeta->setInt32(kKeyMaxInputSize, static_cast<int32_t>(info.maxBlockSize * info.channels * (bits / 8)));

    SetCommonTrackMeta(mRawMeta.get(), meta, fileSize, endSample);
    mRawMeta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_FLAC);
    mRawMeta->setInt32(kKeyBitsPerSample, static_cast<int32_t>(info.bitsPerSample));
    FLACFrameScanner scanner(source, info, meta.firstFrameOffset);
    mRawMeta->setInt32(kKeyMaxInputSize, static_cast<int32_t>(scanner.maxFrameSize()));
}

sp<IMediaSource> FLACExtractor::createTrack() {
    if (rawOutput()) return new FLACRawSource(mSource, mMeta, mRawMeta);
    // libFLAC skips a plain ID3v2 tag but not every form (a footer); it is
    // given the stream from "fLaC" on.
    const sp<DataSource> stream =
        mMeta.streamOffset > 0 ? sp<DataSource>(new SubDataSource(mSource, mMeta.streamOffset)) : mSource;
    return new FLACPcmSource(stream, mMeta.streamInfo, mTrackMeta);
}

float SniffFLAC(const sp<DataSource>& source) {
    uint8_t head[5];
    if (!source->readExactly(SkipID3v2Tags(source, 0), head, sizeof(head))) return 0.0f;
    // "fLaC" followed by a STREAMINFO block header.
    return memcmp(head, "fLaC", 4) == 0 && (head[4] & 0x7F) == 0 ? 0.8f : 0.0f;
}

sp<IMediaExtractor> CreateFLACExtractor(const sp<DataSource>& source) {
    return FLACExtractor::Create(source);
}

}  // namespace android
