#define LOG_TAG "FLACExtractor"
#include "flac/FLACExtractor.h"

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

int32_t PcmEncodingFor(uint32_t bits) {
    return bits == 16 ? kAudioEncodingPcm16bit : bits == 24 ? kAudioEncodingPcm24bitPacked : kAudioEncodingPcm32bit;
}

// What both output forms share.
void SetCommonTrackMeta(MetaData* t, const FLACMetadata& meta, off64_t fileSize) {
    const FlacStreamInfo& info = meta.streamInfo;
    t->setInt32(kKeySampleRate, static_cast<int32_t>(info.sampleRate));
    t->setInt32(kKeyChannelCount, static_cast<int32_t>(info.channels));
    t->setData(kKeyFlacStreamInfoRaw, 0, meta.streamInfoBlock, sizeof(meta.streamInfoBlock));
    // "fLaC" and STREAMINFO as the only (so last) metadata block.
    uint8_t header[4 + FLACMetadata::kStreamInfoBlockSize];
    memcpy(header, "fLaC", 4);
    memcpy(header + 4, meta.streamInfoBlock, sizeof(meta.streamInfoBlock));
    header[4] |= 0x80;
    t->setData(kKeyFlacMetadata, 0, header, sizeof(header));
    if (info.totalSamples != 0) {
        const int64_t durationUs = TicksToUs(info.totalSamples, info.sampleRate);
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

    SetCommonTrackMeta(mTrackMeta.get(), meta, fileSize);
    const uint32_t bits = FLACDecoder::OutputBits(info.bitsPerSample);
    mTrackMeta->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
    mTrackMeta->setInt32(kKeyBitsPerSample, static_cast<int32_t>(bits));
    mTrackMeta->setInt32(kKeyDeviceBitsPerSample, static_cast<int32_t>(bits));
    mTrackMeta->setInt32(kKeyPcmEncoding, PcmEncodingFor(bits));
    mTrackMeta->setInt32(kKeyMaxInputSize, static_cast<int32_t>(info.maxBlockSize * info.channels * (bits / 8)));

    SetCommonTrackMeta(mRawMeta.get(), meta, fileSize);
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
