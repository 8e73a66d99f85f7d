#include "extractor/SingleTrackExtractor.h"

namespace android {

SingleTrackExtractor::SingleTrackExtractor(const char* containerMime)
    : mFileMeta(new MetaData), mTrackMeta(new MetaData) {
    mFileMeta->setCString(kKeyMIMEType, containerMime);
}

sp<IMediaSource> SingleTrackExtractor::getTrack(size_t index) { return index == 0 ? createTrack() : nullptr; }

sp<MetaData> SingleTrackExtractor::getTrackMetaData(size_t index, uint32_t /*flags*/) {
    return index == 0 ? new MetaData(*trackMeta()) : nullptr;
}

sp<MetaData> SingleTrackExtractor::getMetaData() { return new MetaData(*mFileMeta); }

}  // namespace android
