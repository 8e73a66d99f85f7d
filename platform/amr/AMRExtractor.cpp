#define LOG_TAG "AMRExtractor"
#include "amr/AMRExtractor.h"

#include <log/log.h>
#include <media/stagefright/MediaDefs.h>

#include "amr/AMRFrames.h"
#include "amr/AMRSource.h"
#include "extractor/Sniffers.h"

namespace android {

sp<AMRExtractor> AMRExtractor::Create(const sp<DataSource>& source) {
    uint8_t head[9];
    const ssize_t n = source->readAt(0, head, sizeof(head));
    bool isWide = false;
    const size_t magic = n > 0 ? AMRMagicLength(head, static_cast<size_t>(n), &isWide) : 0;
    if (magic == 0) return nullptr;
    sp<AMRFrameIndex> index = new AMRFrameIndex(isWide, static_cast<off64_t>(magic));
    const status_t err = index->build(source);
    if (err != OK) {
        ALOGW("cannot read the frames (%d)", err);
        return nullptr;
    }
    return new AMRExtractor(source, index);
}

AMRExtractor::AMRExtractor(const sp<DataSource>& source, const sp<AMRFrameIndex>& index)
    : SingleTrackExtractor(MEDIA_MIMETYPE_CONTAINER_AMR), mSource(source), mIndex(index) {
    const bool wide = index->isWide();
    mTrackMeta->setCString(kKeyMIMEType, wide ? MEDIA_MIMETYPE_AUDIO_AMR_WB : MEDIA_MIMETYPE_AUDIO_AMR_NB);
    mTrackMeta->setInt32(kKeyChannelCount, 1);
    mTrackMeta->setInt32(kKeySampleRate, wide ? 16000 : 8000);
    mTrackMeta->setInt64(kKeyDuration, static_cast<int64_t>(index->frameCount()) * kAMRFrameDurationUs);
    mTrackMeta->setInt32(kKeyMaxInputSize, static_cast<int32_t>(kAMRMaxFrameSize));
    if (index->frameCount() > 0) {
        // Average over the frames: bytes * 8 bits / (frames * 20 ms).
        mTrackMeta->setInt32(kKeyBitRate, static_cast<int32_t>(index->frameBytes() * 400 / index->frameCount()));
    }
}

sp<IMediaSource> AMRExtractor::createTrack() { return new AMRSource(mSource, mIndex, mTrackMeta); }

float SniffAMR(const sp<DataSource>& source) {
    uint8_t head[9];
    const ssize_t n = source->readAt(0, head, sizeof(head));
    bool isWide;
    return n > 0 && AMRMagicLength(head, static_cast<size_t>(n), &isWide) > 0 ? 0.8f : 0.0f;
}

sp<IMediaExtractor> CreateAMRExtractor(const sp<DataSource>& source) {
    return AMRExtractor::Create(source);
}

}  // namespace android
