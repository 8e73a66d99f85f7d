#define LOG_TAG "WAVExtractor"
#include "wav/WAVExtractor.h"

#include <cstring>

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>

#include "extractor/DeviceKeys.h"
#include "extractor/Sniffers.h"
#include "wav/WAVSource.h"

namespace android {

sp<WAVExtractor> WAVExtractor::Create(const sp<DataSource>& source) {
    WAVInfo info;
    const status_t err = ParseWAVHeader(source, &info);
    if (err != OK) {
        ALOGW("not a usable WAVE file (%d)", err);
        return nullptr;
    }
    return new WAVExtractor(source, info);
}

WAVExtractor::WAVExtractor(const sp<DataSource>& source, const WAVInfo& info)
    : SingleTrackExtractor(MEDIA_MIMETYPE_CONTAINER_WAV), mSource(source), mInfo(info) {
    info.items.publishFileItems(mFileMeta.get());

    MetaData* t = mTrackMeta.get();
    t->setCString(kKeyMIMEType, MEDIA_MIMETYPE_AUDIO_RAW);
    t->setInt32(kKeyChannelCount, info.channels);
    t->setInt32(kKeySampleRate, static_cast<int32_t>(info.sampleRate));
    if (info.channelMask != 0) t->setInt32(kKeyChannelMask, static_cast<int32_t>(info.channelMask));
    t->setInt64(kKeyDuration, TicksToUs(info.frameCount, info.sampleRate));
    t->setInt32(kKeyBitRate, static_cast<int32_t>(info.sampleRate * info.frameSize * 8));
    t->setInt32(kKeyBitsPerSample, info.bitsPerSample);
    t->setInt32(kKeyDeviceBitsPerSample, info.bitsPerSample);
    t->setInt32(kKeyPcmEncoding, WAVPcmEncoding(info));
    const uint32_t outFrame = info.outputFrameSize();
    const uint32_t perSample = WAVSource::FramesPerSample(outFrame);
    t->setInt32(kKeyMaxInputSize, static_cast<int32_t>(perSample * outFrame));
    // Every buffer is a sync sample; a data chunk cut short was already
    // measured against the file.
    const int64_t samples = static_cast<int64_t>((info.frameCount + perSample - 1) / perSample);
    t->setInt64(kKeySampleCount, samples);
    t->setInt64(kKeySyncSampleCount, samples);
    info.items.publishTrackItems(t);
}

sp<IMediaSource> WAVExtractor::createTrack() { return new WAVSource(mSource, mInfo, mTrackMeta); }

float SniffWAV(const sp<DataSource>& source) {
    uint8_t head[12];
    if (!source->readExactly(0, head, sizeof(head))) return 0.0f;
    const bool riff = memcmp(head, "RIFF", 4) == 0 || memcmp(head, "RF64", 4) == 0 || memcmp(head, "BW64", 4) == 0;
    return riff && memcmp(head + 8, "WAVE", 4) == 0 ? 0.8f : 0.0f;
}

sp<IMediaExtractor> CreateWAVExtractor(const sp<DataSource>& source) {
    return WAVExtractor::Create(source);
}

}  // namespace android
