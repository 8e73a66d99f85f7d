#ifndef IMEDIA_EXTRACTOR_BASE_H_
#define IMEDIA_EXTRACTOR_BASE_H_

#include <media/IMediaSource.h>
#include <media/stagefright/MetaData.h>
#include <utils/Errors.h>
#include <utils/RefBase.h>

namespace android {

// A demuxer over one file: its tracks, their metadata and sources.
class IMediaExtractor : public virtual RefBase {
public:
    enum GetTrackMetaDataFlags {
        kIncludeExtensiveMetaData = 1
    };

    enum Flags {
        CAN_SEEK_BACKWARD = 1,
        CAN_SEEK_FORWARD = 2,
        CAN_PAUSE = 4,
        CAN_SEEK = 8,
    };

    virtual size_t countTracks() = 0;
    // Null for an index out of range.
    virtual sp<IMediaSource> getTrack(size_t index) = 0;
    // Null for an index out of range.
    virtual sp<MetaData> getTrackMetaData(size_t index, uint32_t flags = 0) = 0;
    // File-level metadata; always holds kKeyMIMEType.
    virtual sp<MetaData> getMetaData() = 0;
    virtual uint32_t flags() const = 0;
    virtual const char* name() = 0;

    // Device extension: the output form of the samples, as the editor keys'
    // extractor output modes (1 raw audio, 5 raw FLAC frames). Affects the
    // tracks obtained after the call.
    virtual status_t setOutputFormatFlag(uint32_t flag) = 0;

protected:
    ~IMediaExtractor() override = default;
};

}  // namespace android

#endif
